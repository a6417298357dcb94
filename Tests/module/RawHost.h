// SPDX-License-Identifier: MIT
// The host editor as the module meets it, written from the published byte layout alone: a table of
// raw functions, a context record of bytes, lists and strings built by hand. It includes nothing of
// the module, so a layout that drifts fails here. Every call that it receives is logged.
#pragma once

#include <functional>
#include <map>
#include <string>
#include <vector>

#define THISCALL __attribute__((thiscall))

// Adds one line to the transcript of the running test; line ends and bytes that do not print are
// shown as escapes. Nothing while `muted`.
void Log(const std::string& text);
extern bool muted;

class RawHost {
 public:
  RawHost();
  ~RawHost();
  RawHost(const RawHost&) = delete;

  void* Interface() { return &object; }
  // The field at a byte offset of the context record.
  template <class T>
  T& Field(int offset) {
    return *reinterpret_cast<T*>(context + offset);
  }
  void* Engine() { return Field<void*>(18); }
  // Leaves text results as the host does: elements whose deletion the host counts.
  void AnswerTexts(const std::vector<std::string>& texts, unsigned resultKind = 1);
  // Whether the record is as `execute` must leave it, and nothing behind it was written.
  bool IsClean();

  std::map<std::string, unsigned> functions = {{"f", 7}, {"g", 0}};  // others are unknown: 2000
  std::function<void()> onCall;
  std::function<void(const std::string& text)> onText;  // reports and traces
  bool noContext = false;
  unsigned char context[128];
  static int liveTexts;

 private:
  struct {
    void** table;
    RawHost* self;
  } object;
};

// Calls an operation of a table of the Microsoft ABI, such as the running engine's.
template <class Result, class... Arguments>
Result CallSlot(void* object, int slot, Arguments... arguments) {
  void* function = (*static_cast<void***>(object))[slot];
  return reinterpret_cast<Result THISCALL (*)(void*, Arguments...)>(function)(object, arguments...);
}
inline void Stop(void* engine) { CallSlot<void>(engine, 1); }
