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

// Adds one line to the transcript of the running test, unless `muted`; line ends and bytes that do
// not print are shown as escapes. Then does what the test has planned for lines that begin so: this
// is how it plays the host's functions, the engine and the script.
void Log(const std::string& line);
inline bool muted = false;
inline std::map<std::string, std::function<void()>> on;

// The field at a byte offset of a record, such as the context.
template <class T>
T& At(void* object, int offset) {
  return *reinterpret_cast<T*>(static_cast<char*>(object) + offset);
}

// A table of operations, for an object that begins with its address. Unused logs its call.
template <class... Functions>
std::vector<void*> Table(Functions*... functions) {
  return {reinterpret_cast<void*>(functions)...};
}
inline void THISCALL Unused() { Log("an unused slot was called"); }

// Its address is the host interface's: the table comes first. It knows two macro functions, f and
// g, by the numbers 7 and 0, and the write of keyboard macros, 9. What it logs ends in its name.
struct RawHost {
  explicit RawHost(const std::string& name = "");
  ~RawHost();
  void*& Engine() { return At<void*>(context, 18); }
  // Leaves text results as the host does, whose deletion is counted.
  void AnswerTexts(const std::vector<std::string>& texts, unsigned resultKind = 1);
  // Appends an element of one of the two lists, at these offsets of the record.
  static constexpr int kTexts = 31, kArguments = 51;
  void Append(int list, void* element);
  // Whether the record is as `execute` must leave it, and nothing after it was written.
  bool IsClean();
  // What is left of a run: the engine and how many elements.
  std::string State();

  void** table;
  std::string name;
  bool noContext = false;
  unsigned char context[128] = {};
};
inline int liveTexts = 0;

// Calls an operation of a table of the Microsoft ABI, such as the running engine's.
template <class Result, class... Arguments>
Result CallSlot(void* object, int slot, Arguments... arguments) {
  void* function = (*static_cast<void***>(object))[slot];
  return reinterpret_cast<Result THISCALL (*)(void*, Arguments...)>(function)(object, arguments...);
}
inline void Stop(void* engine) { CallSlot<void>(engine, 1); }
