// SPDX-License-Identifier: MIT
// Captures what this process writes to standard error, such as warnings of a library. Captures
// nothing when there is no temporary file for it.
//
// Threading: one object at a time.
#pragma once

#include <string>

class ErrorCapture {
 public:
  ErrorCapture();
  ~ErrorCapture() { Take(); }
  ErrorCapture(const ErrorCapture&) = delete;
  ErrorCapture& operator=(const ErrorCapture&) = delete;

  // Ends the capture and returns its text.
  std::string Take();

 private:
  int file;   // -1: none
  int saved;  // standard error itself
};
