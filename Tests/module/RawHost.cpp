// SPDX-License-Identifier: MIT
#include "RawHost.h"

#include <cstdlib>
#include <cstring>

int RawHost::liveTexts = 0;

namespace {
constexpr unsigned char kGuard = 0xA5;  // what stands behind the record's 71 bytes
constexpr int kTexts = 31, kArguments = 51;
constexpr int kCapacity = 4, kCount = 8, kOwns = 12, kItems = 16;  // of a list
constexpr int kTextField = 8;                                      // of a string

struct Object {
  void** table;
  RawHost* self;
};

std::string Argument(char* record) {
  const std::string text =
      "\"" + std::string(*reinterpret_cast<char**>(record + 24 + kTextField)) + "\"";
  const int kind = *reinterpret_cast<int*>(record + 8);
  if (kind == 1) return text;
  char numbers[64];
  std::snprintf(numbers, sizeof numbers, "%d:%d:%.17g:", kind, *reinterpret_cast<int*>(record + 12),
                *reinterpret_cast<double*>(record + 16));
  return numbers + text;
}

void THISCALL Unused(Object*) { Log("an unused slot was called"); }
void* THISCALL Context(Object* host) {
  return host->self->noContext ? nullptr : host->self->context;
}
void THISCALL Report(Object* host, const char* text) {
  Log("report: " + std::string(text));
  if (host->self->onText) host->self->onText(text);
}
void Trace(Object* host, const char* format, const char* text) {
  Log("trace: " + std::string(std::strcmp(format, "Debug: %s\n") ? format : text));
  if (host->self->onText) host->self->onText(text);
}
void THISCALL SetFixCRLF(Object*, unsigned char flag) { Log("fix CRLF " + std::to_string(flag)); }
void THISCALL SetFixDelimiter(Object*, unsigned char flag) {
  Log("fix delimiter " + std::to_string(flag));
}
unsigned THISCALL FunctionId(Object* host, const char* name) {
  const auto found = host->self->functions.find(name);
  return found == host->self->functions.end() ? 2000 : found->second;
}
void* THISCALL WindowHandle(Object*) { return reinterpret_cast<void*>(0x1234); }
void THISCALL CallFunction(Object* host, unsigned id) {
  RawHost& self = *host->self;
  std::string line = "call " + std::to_string(id);
  char** items = self.Field<char**>(kArguments + kItems);
  for (int i = 0; i < self.Field<int>(kArguments + kCount); ++i) line += " " + Argument(items[i]);
  Log(line);
  if (self.onCall) self.onCall();
}

void* THISCALL DeleteText(char* text, unsigned flags) {
  --RawHost::liveTexts;
  std::free(*reinterpret_cast<char**>(text + kTextField));
  if (flags & 1) std::free(text);
  return text;
}
template <class F>
void* Address(F* function) {
  return reinterpret_cast<void*>(function);
}
void* textTable[] = {Address(DeleteText)};
}  // namespace

RawHost::RawHost() {
  static void* table[13] = {Address(Unused),       Address(Context),    Address(Report),
                            Address(Trace),        Address(SetFixCRLF), Address(SetFixDelimiter),
                            Address(Unused),       Address(FunctionId), Address(Unused),
                            Address(WindowHandle), Address(Unused),     Address(Unused),
                            Address(CallFunction)};
  object = {table, this};
  std::memset(context, 0, sizeof context);
  std::memset(context + 71, kGuard, sizeof context - 71);
  context[8] = 0xEE;
  for (int list : {kTexts, kArguments}) {
    Field<unsigned>(list + kCapacity) = 1;  // small, so that the module has to grow it
    Field<unsigned>(list + kOwns) = 1;
    Field<void*>(list + kItems) = std::calloc(1, sizeof(void*));
  }
}

RawHost::~RawHost() {
  for (int list : {kTexts, kArguments}) std::free(Field<void*>(list + kItems));
}

bool RawHost::IsClean() {
  bool clean = !Engine() && !Field<int>(kTexts + kCount) && !Field<int>(kArguments + kCount);
  for (unsigned i = 71; i < sizeof context; ++i) clean = clean && context[i] == kGuard;
  return clean && liveTexts == 0;
}

void RawHost::AnswerTexts(const std::vector<std::string>& texts, unsigned resultKind) {
  Field<unsigned>(23) = resultKind;
  for (const std::string& text : texts) {
    char* element = static_cast<char*>(std::calloc(1, 24));
    *reinterpret_cast<void***>(element) = textTable;
    *reinterpret_cast<char**>(element + kTextField) = strdup(text.c_str());
    ++liveTexts;
    const int index = Field<int>(kTexts + kCount)++;
    void**& items = Field<void**>(kTexts + kItems);
    items = static_cast<void**>(std::realloc(items, (index + 1) * sizeof(void*)));
    items[index] = element;
    Field<int>(kTexts + kCapacity) = index + 1;
  }
}
