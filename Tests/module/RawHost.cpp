// SPDX-License-Identifier: MIT
#include "RawHost.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>

using namespace std::string_literals;

namespace {
constexpr unsigned char kGuard = 0xA5;  // fills what follows the record's 71 bytes
constexpr int kSize = 71, kSlots = 600;
constexpr int kArguments = RawHost::kArguments;
// Of a list, and of a string.
constexpr int kCapacity = 4, kCount = 8, kOwns = 12, kItems = 16, kText = 8;

void* THISCALL Context(RawHost* host) { return host->noContext ? nullptr : host->context; }
void THISCALL Report(RawHost* host, const char* text) { Log("report: "s + text + host->name); }
void Trace(RawHost* host, const char* format, const char* text) {
  Log("trace: "s + (format == "Debug: %s\n"s ? text : format) + host->name);
}
void THISCALL SetFixCRLF(RawHost* host, char on) {
  Log("fix CRLF " + std::to_string(on) + host->name);
}
void THISCALL SetFixDelimiter(RawHost* host, char on) {
  Log("fix delimiter " + std::to_string(on) + host->name);
}
unsigned THISCALL FunctionId(RawHost* host, const char* name) {
  if (!host->name.empty()) Log("function id of "s + name + host->name);
  return name == "f"s ? 7 : name == "g"s ? 0 : name == "write"s ? 9 : 2000;
}
void* THISCALL WindowHandle(RawHost*) { return reinterpret_cast<void*>(0x1234); }
void THISCALL CallFunction(RawHost* host, unsigned id) {
  std::string line = "call " + std::to_string(id);
  for (int i = 0; i < At<int>(host->context, kArguments + kCount); ++i) {
    void* argument = At<void**>(host->context, kArguments + kItems)[i];
    char numbers[64];
    std::snprintf(numbers, sizeof numbers, " %d:%d:%.17g:", At<int>(argument, 8),
                  At<int>(argument, 12), At<double>(argument, 16));
    line += numbers + ("\""s + At<char*>(argument, 24 + kText) + "\"");
  }
  Log(line + host->name);
}

void* THISCALL DeleteText(char* text, unsigned flags) {
  --liveTexts;
  std::free(At<char*>(text, kText));
  if (flags & 1) std::free(text);
  return text;
}

std::vector<void*> textTable = Table(DeleteText);
std::vector<void*> hostTable =
    Table(Unused, Context, Report, Trace, SetFixCRLF, SetFixDelimiter, Unused, FunctionId, Unused,
          WindowHandle, Unused, Unused, CallFunction);
}  // namespace

RawHost::RawHost(const std::string& hostName) : table(hostTable.data()), name(hostName) {
  std::memset(context + kSize, kGuard, sizeof context - kSize);
  context[8] = 0xEE;
  for (int list : {kTexts, kArguments}) {
    // The module sees one slot, so that it has to make the list of arguments grow.
    At<unsigned>(context, list + kCapacity) = At<unsigned>(context, list + kOwns) = 1;
    At<void*>(context, list + kItems) = std::calloc(kSlots, sizeof(void*));
  }
}

RawHost::~RawHost() {
  for (int list : {kTexts, kArguments}) std::free(At<void*>(context, list + kItems));
}

bool RawHost::IsClean() {
  return !Engine() && !At<int>(context, kTexts + kCount) &&
         !At<int>(context, kArguments + kCount) &&
         std::all_of(context + kSize, std::end(context), [](int byte) { return byte == kGuard; }) &&
         liveTexts == 0;
}

void RawHost::AnswerTexts(const std::vector<std::string>& texts, unsigned resultKind) {
  At<unsigned>(context, 23) = resultKind;
  for (const std::string& text : texts) {
    void* element = std::calloc(1, 24);
    At<void**>(element, 0) = textTable.data();
    At<char*>(element, kText) = strdup(text.c_str());
    Append(kTexts, element);
    ++liveTexts;
  }
}

void RawHost::Append(int list, void* element) {
  const int place = At<int>(context, list + kCount)++;
  At<void**>(context, list + kItems)[place] = element;
  if (At<int>(context, list + kCapacity) <= place) At<int>(context, list + kCapacity) = place + 1;
}

std::string RawHost::State() {
  return (Engine() ? "engine, " : "no engine, ") +
         std::to_string(At<int>(context, kArguments + kCount)) + " arguments, " +
         std::to_string(At<int>(context, kTexts + kCount)) + " texts" + name;
}
