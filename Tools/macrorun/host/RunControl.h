// SPDX-License-Identifier: MIT
// Stops a run that is under way: at Ctrl+C, and when its time is over. It first asks the host through
// the module's `kill`, so that the macro's next call stops it; a macro that makes none within a
// tenth of a second is interrupted through its engine. A second Ctrl+C, and one outside a run, ends
// the program. So does a timeout when no engine can be interrupted.
//
// Ownership: module, engines and reporter are the caller's and outlive the object.
// Units: seconds. Threading: made and destroyed on the run's thread, one object at a time; it has a
// thread of its own, and Ctrl+C arrives on one of the console's.
#pragma once

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <thread>

class RunningEngines;
class Reporter;
class ScriptModule;

class RunControl {
 public:
  enum class Cause { kNone, kUser, kTimeout };

  // For the whole program, once: Ctrl+C comes here.
  static void CatchInterrupts();

  // `timeout` 0: none.
  RunControl(ScriptModule& module, RunningEngines& engines, Reporter& reporter, double timeout);
  ~RunControl();
  RunControl(const RunControl&) = delete;
  RunControl& operator=(const RunControl&) = delete;

  // Time that does not count, while a prompt waits for the user.
  void Pause();
  void Resume();

  Cause StopCause();

  // On the console's thread; false: it had been asked before.
  bool Ask();

 private:
  using Clock = std::chrono::steady_clock;

  void Watch();
  void AwaitCause(std::unique_lock<std::mutex>& hold);
  void Stop(std::unique_lock<std::mutex>& hold);

  ScriptModule& module;
  RunningEngines& engines;
  Reporter& reporter;
  const double timeout;
  std::mutex lock;
  std::condition_variable changed;
  Clock::time_point deadline;
  Clock::time_point pausedAt;
  bool paused = false;
  bool ended = false;
  Cause cause = Cause::kNone;
  std::thread watcher;  // the last member: it uses the others
};
