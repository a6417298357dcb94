// SPDX-License-Identifier: MIT
// The process-wide state that belongs to the host and that CRuby or a script may change: a snapshot
// of it is taken before a run and put back after it. It covers the locale, the signal handlers, the
// modes of the standard streams and the file mask of msvcrt, the error mode, the current directory
// and the environment. The floating-point control words are switched elsewhere, with the fibers.
//
// The variables that CRuby adds to the environment when it starts (HOME and the like) are for
// scripts only. The order of calls is therefore, where CRuby is started,
//     Save, start CRuby, KeepAdditions, Restore
// and in each run
//     Save, ApplyAdditions, run, Restore,
// where ApplyAdditions goes to the object that has kept them and the others to any.
//
// Ownership: the object owns its copies. It is plain memory, free to live on any stack or fiber.
// Errors: none are reported. Restore skips what could not be saved, because memory or the thing
// itself was missing (a closed stream), and what cannot be put back (a deleted directory).
// Threading: the thread of the run; Save and Restore on the same fiber, as msvcrt may keep the
// handlers of hardware faults by fiber. Other threads may see the intermediate states.
#pragma once

#include <signal.h>

class ProcessStateSnapshot {
 public:
  ProcessStateSnapshot() = default;
  ProcessStateSnapshot(const ProcessStateSnapshot&) = delete;
  ProcessStateSnapshot& operator=(const ProcessStateSnapshot&) = delete;
  ~ProcessStateSnapshot();

  // Replaces the snapshot by the present state.
  void Save();

  // Puts the state back as the snapshot has it. The snapshot stays. Nothing without one.
  //
  // The environment block of the process is compared; differences are also written to msvcrt's
  // copy. Two differences cannot be found or fixed this way: one in msvcrt's copy alone, and a
  // variable with an empty value, which msvcrt regards as missing afterwards.
  void Restore() const;

  // Remembers the environment's variables that the snapshot does not have, instead of those
  // remembered before.
  void KeepAdditions();
  // Sets what KeepAdditions has remembered, except variables that the environment has by now.
  void ApplyAdditions() const;

 private:
  static constexpr int kSignals[] = {SIGINT, SIGILL, SIGFPE, SIGSEGV, SIGTERM, SIGBREAK, SIGABRT};
  static constexpr int kSignalCount = sizeof kSignals / sizeof *kSignals;
  static constexpr int kStreams = 3;  // standard input, output and error: descriptors 0 to 2

  void Forget();
  void RestoreDirectory() const;
  void RestoreEnvironment() const;

  bool saved = false;
  unsigned errorMode = 0;
  int fileMask = 0;
  char* locale = nullptr;
  __p_sig_fn_t handlers[kSignalCount] = {};  // SIG_ERR: unknown
  int modes[kStreams] = {};                  // -1: closed
  wchar_t* directory = nullptr;
  // Lines NAME=value, each terminated, and an empty one. A line is written to for the moment in which
  // its name alone is needed.
  wchar_t* environment = nullptr;
  wchar_t* additions = nullptr;
};
