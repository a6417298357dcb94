// SPDX-License-Identifier: MIT
// Stops a run at Ctrl+C or after its timeout. It first calls the module's `kill`, so that the
// macro's next call stops it. If the macro makes no call within a tenth of a second, its engine is
// interrupted. A second Ctrl+C, or one outside of a run, ends the program. So does a timeout when
// no engine can be interrupted.
//
// Ownership: module, engines and reporter belong to the caller and outlive the object.
// Units: seconds. Threading: the run's thread creates and destroys it, one object at a time. It
// watches on a second thread, and the console reports Ctrl+C on a third.
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

  // Handles Ctrl+C for the program. Call it once.
  static void CatchInterrupts();

  // `timeout` 0: none.
  RunControl(ScriptModule& module, RunningEngines& engines, Reporter& reporter, double timeout);
  ~RunControl();
  RunControl(const RunControl&) = delete;
  RunControl& operator=(const RunControl&) = delete;

  // Exclude the time of a prompt from the timeout.
  void Pause();
  void Resume();

  Cause StopCause();

  // Requests a stop, on the console's thread. False: a stop was requested before.
  bool RequestStop();

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
