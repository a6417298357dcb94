// SPDX-License-Identifier: MIT
// What the long tests share: their length, random numbers that can be repeated, and the right run
// that has to be possible after whatever was done to the module.
//
// Environment: SCRIPTRUBY_TORTURE=1 for the whole length; SCRIPTRUBY_TORTURE_SEED, as the test has
// printed it, to repeat a test.
#pragma once

#include <random>

#include "ModuleTest.h"
#include "Resources.h"

// The system opens some handles late, for itself.
constexpr unsigned kOwnHandles = 4;

// The figures of a long test: one line each, collected by scripts/torture.sh.
void Figure(const char* format, ...) __attribute__((format(printf, 1, 2)));

class TortureTest : public ModuleTest {
 protected:
  // Plans that each fault fails the test. A right run is one of `macro` in the language that is described.
  explicit TortureTest(const std::string& description = "Language=JScript\r\n",
                       const std::string& macro = "\n");
  // Checks that nothing is left; there is no transcript to compare.
  void TearDown() override;

  // How often to do something: `whole`, or `part` of it under ctest.
  static int Rounds(int whole, int part);

  // A run by the plain host, macro and description goes as the first one of this test did.
  void ExpectRightRun();

  // Does `round` for 0 to `rounds`, each followed by a right run every `often` rounds, and prints what
  // the process holds after a tenth and at the end, which has to be the same within 1 %.
  void Repeat(const char* what, int rounds, int often, const std::function<void(int)>& round);

  unsigned Below(size_t n) { return static_cast<unsigned>(random() % n); }
  bool OneIn(size_t n) { return Below(n) == 0; }
  std::string Bytes(size_t longest);  // of any value but 0
  std::mt19937 random;

 private:
  std::string RightRun();
  const std::string rightDescription, rightMacro;
  std::string right;  // its transcript
};
