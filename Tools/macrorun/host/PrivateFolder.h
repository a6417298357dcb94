// SPDX-License-Identifier: MIT
// A folder under the user's temporary folder for a copy of the module and of its language
// description. It is removed with the object. A process that is killed leaves its folder to the
// next run.
//
// Errors: UsageError. Threading: one thread.
#pragma once

#include <filesystem>

class PrivateFolder {
 public:
  static constexpr wchar_t kModuleName[] = L"scriptruby.dll";

  PrivateFolder();
  ~PrivateFolder();
  PrivateFolder(const PrivateFolder&) = delete;
  PrivateFolder& operator=(const PrivateFolder&) = delete;

  std::filesystem::path Module() const { return path / kModuleName; }
  std::filesystem::path Description() const;
  const std::filesystem::path& Path() const { return path; }

 private:
  std::filesystem::path path;
};
