// SPDX-License-Identifier: MIT
// The host editor as the module meets it, written from the published byte layout alone: a table of
// raw functions, a context record of bytes, lists and strings built by hand. It includes nothing of
// the module, so a layout that drifts fails here.
#pragma once

#include <windows.h>

#include <cstring>
#include <functional>
#include <map>
#include <string>
#include <vector>

#define THISCALL __attribute__((thiscall))

struct RawArgument {
  int kind = 0;
  int integer = 0;
  double real = 0;
  std::string text;
};
bool operator==(const RawArgument& a, const RawArgument& b);
std::ostream& operator<<(std::ostream& out, const RawArgument& a);

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
  int ArgumentCount() { return Field<int>(51 + 8); }
  std::vector<RawArgument> Arguments();
  // Leaves text results as the host does: elements whose deletion the host notices.
  void AnswerTexts(const std::vector<std::string>& texts, unsigned resultKind = 1);
  // Whether the record is as `execute` must leave it, and nothing behind it was written.
  bool IsClean();
  void Reset();

  std::map<std::string, unsigned> functions;  // the function table; others are unknown (2000)
  std::function<void(unsigned id)> onCall;
  std::vector<std::string> reports;  // slot 2
  std::vector<std::string> traces;   // slot 3, the text behind the format
  std::vector<std::string> calls;    // slots 4, 5, 12 and any slot that must not be called
  bool noContext = false;
  void* window = reinterpret_cast<void*>(0x1234);
  static int liveTexts;

 private:
  struct Object {
    void** table;
    RawHost* self;
  };
  static void THISCALL Unused(Object* self);
  static void* THISCALL Context(Object* self);
  static void THISCALL ReportMessage(Object* self, const char* text);
  static void DebugOutput(Object* self, const char* format, const char* text);
  static void THISCALL SetFirstFlag(Object* self, unsigned char flag);
  static void THISCALL SetSecondFlag(Object* self, unsigned char flag);
  static unsigned THISCALL FunctionId(Object* self, const char* name);
  static void* THISCALL WindowHandle(Object* self);
  static void THISCALL CallFunction(Object* self, unsigned id);

  Object object;
  unsigned char context[128];
};

// The engine's operations, called as the host does: through the table that the record points to.
struct RawEngine {
  static void** Table(void* engine) { return *static_cast<void***>(engine); }
  static unsigned FunctionId(void* e, const char* n) {
    return reinterpret_cast<unsigned THISCALL (*)(void*, const char*)>(Table(e)[0])(e, n);
  }
  static void Stop(void* e) { reinterpret_cast<void THISCALL (*)(void*)>(Table(e)[1])(e); }
  static void Initialise(void* e) { reinterpret_cast<void THISCALL (*)(void*)>(Table(e)[2])(e); }
  static void Destroy(void* e) { reinterpret_cast<void THISCALL (*)(void*)>(Table(e)[3])(e); }
  static int Run(void* e, const char* file) {
    return reinterpret_cast<int THISCALL (*)(void*, const char*)>(Table(e)[4])(e, file);
  }
  static bool FillVersion(void* e, void* record, const char* path) {
    return reinterpret_cast<bool THISCALL (*)(void*, void*, const char*)>(Table(e)[5])(e, record,
                                                                                       path);
  }
  static void Delete(void* e, unsigned flags) {
    reinterpret_cast<void* THISCALL (*)(void*, unsigned)>(Table(e)[6])(e, flags);
  }
};
