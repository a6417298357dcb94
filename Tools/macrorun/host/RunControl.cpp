// SPDX-License-Identifier: MIT
#include "host/RunControl.h"

#include <windows.h>

#include "host/RunningEngines.h"
#include "host/ScriptModule.h"
#include "platform/ExitCode.h"
#include "report/Reporter.h"

using namespace std::chrono_literals;

namespace {

// The time for the macro's next call, and the time for an interrupted engine to end.
constexpr auto kTimeToCall = 100ms;
constexpr auto kTimeToEnd = 1000ms;
constexpr int kAttempts = 3;

// The run that Ctrl+C stops. The lock is held during RequestStop.
std::mutex currentLock;
RunControl* current = nullptr;

[[noreturn]] void EndProgram() {
  TerminateProcess(GetCurrentProcess(), kStopped);
  std::abort();  // not reached
}

BOOL WINAPI OnConsoleEvent(DWORD event) {
  if (event != CTRL_C_EVENT && event != CTRL_BREAK_EVENT) return FALSE;
  const std::lock_guard guard(currentLock);
  if (!current || !current->RequestStop()) EndProgram();
  return TRUE;
}

void SetCurrent(RunControl* control) {
  const std::lock_guard guard(currentLock);
  current = control;
}

}  // namespace

void RunControl::CatchInterrupts() { SetConsoleCtrlHandler(OnConsoleEvent, TRUE); }

RunControl::RunControl(ScriptModule& runModule, RunningEngines& runEngines, Reporter& runReporter,
                       double runTimeout)
    : module(runModule),
      engines(runEngines),
      reporter(runReporter),
      timeout(runTimeout),
      deadline(Clock::now() + std::chrono::duration_cast<Clock::duration>(
                                  std::chrono::duration<double>(runTimeout))),
      watcher([this] { Watch(); }) {
  SetCurrent(this);
}

RunControl::~RunControl() {
  SetCurrent(nullptr);
  {
    const std::lock_guard guard(lock);
    ended = true;
  }
  changed.notify_all();
  watcher.join();
}

void RunControl::Pause() {
  const std::lock_guard guard(lock);
  paused = true;
  pausedAt = Clock::now();
  changed.notify_all();
}

void RunControl::Resume() {
  const std::lock_guard guard(lock);
  paused = false;
  deadline += Clock::now() - pausedAt;
  changed.notify_all();
}

RunControl::Cause RunControl::StopCause() {
  const std::lock_guard guard(lock);
  return cause;
}

bool RunControl::RequestStop() {
  {
    const std::lock_guard guard(lock);
    if (cause == Cause::kUser) return false;
    cause = Cause::kUser;
  }
  changed.notify_all();
  reporter.Note("stopping the macro; press Ctrl+C again to end the program");
  return true;
}

void RunControl::Watch() {
  std::unique_lock hold(lock);
  AwaitCause(hold);
  if (!ended) Stop(hold);
}

void RunControl::AwaitCause(std::unique_lock<std::mutex>& hold) {
  while (!ended && cause == Cause::kNone) {
    if (timeout == 0 || paused)
      changed.wait(hold);
    else if (Clock::now() < deadline)
      changed.wait_until(hold, deadline);
    else
      cause = Cause::kTimeout;
  }
}

// Releases the lock for calls of other objects.
void RunControl::Stop(std::unique_lock<std::mutex>& hold) {
  hold.unlock();
  module.Kill();
  hold.lock();
  const auto isEnded = [this] { return ended; };
  if (changed.wait_for(hold, kTimeToCall, isEnded)) return;
  for (int attempt = 1; !ended; ++attempt) {
    hold.unlock();
    module.Kill();  // again, for a nested run or one that had just started
    engines.Interrupt();
    hold.lock();
    changed.wait_for(hold, kTimeToEnd, isEnded);
    if (ended || cause != Cause::kTimeout || paused || attempt < kAttempts) continue;
    reporter.Note("timed out; the engine cannot interrupt the macro, so the program ends");
    EndProgram();
  }
}
