// SPDX-License-Identifier: MIT
#include "RawHost.h"

#include <cstdlib>
#include <ostream>

int RawHost::liveTexts = 0;

static constexpr unsigned char kGuard = 0xA5;  // what stands behind the record's 71 bytes

bool operator==(const RawArgument& a, const RawArgument& b) {
  return a.kind == b.kind && a.text == b.text &&
         (a.kind == 1 || (a.integer == b.integer && std::memcmp(&a.real, &b.real, 8) == 0));
}

std::ostream& operator<<(std::ostream& out, const RawArgument& a) {
  return out << "{kind " << a.kind << ", " << a.integer << ", " << a.real << ", \"" << a.text << "\"}";
}

namespace {
// A text element as the host's compiler lays it out: 24 bytes, the deleting destructor in slot 0.
struct RawText {
  void** table;
  unsigned growBy;
  char* text;
  unsigned length;
  unsigned capacity;
  char pad[4];
};
static_assert(sizeof(RawText) == 24);

void* THISCALL DeleteText(RawText* text, unsigned flags) {
  --RawHost::liveTexts;
  std::free(text->text);
  if (flags & 1) std::free(text);
  return text;
}
void* textTable[] = {reinterpret_cast<void*>(&DeleteText)};

struct RawList {
  void** table;
  unsigned capacity;
  int count;
  unsigned owns;
  void** items;
};
static_assert(sizeof(RawList) == 20);
}  // namespace

RawHost::RawHost() {
  static void* table[13];
  for (void*& slot : table) slot = reinterpret_cast<void*>(&Unused);
  table[1] = reinterpret_cast<void*>(&Context);
  table[2] = reinterpret_cast<void*>(&ReportMessage);
  table[3] = reinterpret_cast<void*>(&DebugOutput);
  table[4] = reinterpret_cast<void*>(&SetFirstFlag);
  table[5] = reinterpret_cast<void*>(&SetSecondFlag);
  table[7] = reinterpret_cast<void*>(&FunctionId);
  table[9] = reinterpret_cast<void*>(&WindowHandle);
  table[12] = reinterpret_cast<void*>(&CallFunction);
  object = {table, this};
  std::memset(context, 0, sizeof context);
  for (int list : {31, 51}) {
    Field<unsigned>(list + 4) = 2;  // small, so that the module has to grow it
    Field<unsigned>(list + 12) = 1;
    Field<void*>(list + 16) = std::calloc(2, sizeof(void*));
  }
  Reset();
}

RawHost::~RawHost() {
  for (int list : {31, 51}) std::free(Field<void*>(list + 16));
}

void RawHost::Reset() {
  std::memset(context + 71, kGuard, sizeof context - 71);
  std::memset(context, 0, 31);
  context[8] = 0xEE;
  functions = {{"f", 7}, {"g", 0}};
  onCall = nullptr;
  reports.clear();
  traces.clear();
  calls.clear();
  noContext = false;
}

bool RawHost::IsClean() {
  bool clean = Engine() == nullptr && ArgumentCount() == 0 && Field<int>(31 + 8) == 0;
  for (unsigned i = 71; i < sizeof context; ++i) clean = clean && context[i] == kGuard;
  return clean && liveTexts == 0;
}

std::vector<RawArgument> RawHost::Arguments() {
  std::vector<RawArgument> arguments;
  char** items = Field<char**>(51 + 16);
  for (int i = 0; i < ArgumentCount(); ++i)
    arguments.push_back({*reinterpret_cast<int*>(items[i] + 8), *reinterpret_cast<int*>(items[i] + 12),
                         *reinterpret_cast<double*>(items[i] + 16),
                         *reinterpret_cast<char**>(items[i] + 24 + 8)});
  return arguments;
}

void RawHost::AnswerTexts(const std::vector<std::string>& texts, unsigned resultKind) {
  RawList& list = Field<RawList>(31);
  for (const std::string& text : texts) {
    RawText* element = static_cast<RawText*>(std::calloc(1, sizeof(RawText)));
    element->table = textTable;
    element->text = strdup(text.c_str());
    element->length = static_cast<unsigned>(text.size());
    element->capacity = element->length + 1;
    ++liveTexts;
    if (list.count == static_cast<int>(list.capacity)) {
      list.capacity *= 2;
      list.items = static_cast<void**>(std::realloc(list.items, list.capacity * sizeof(void*)));
    }
    list.items[list.count++] = element;
  }
  Field<unsigned>(23) = resultKind;
}

void RawHost::Unused(Object* self) { self->self->calls.push_back("an unused slot"); }

void* RawHost::Context(Object* self) {
  return self->self->noContext ? nullptr : self->self->context;
}

void RawHost::ReportMessage(Object* self, const char* text) { self->self->reports.push_back(text); }

void RawHost::DebugOutput(Object* self, const char* format, const char* text) {
  self->self->traces.push_back(std::strcmp(format, "Debug: %s\n") == 0 ? text : format);
}

void RawHost::SetFirstFlag(Object* self, unsigned char flag) {
  self->self->calls.push_back("crlf " + std::to_string(flag));
}

void RawHost::SetSecondFlag(Object* self, unsigned char flag) {
  self->self->calls.push_back("delimiter " + std::to_string(flag));
}

unsigned RawHost::FunctionId(Object* self, const char* name) {
  const auto found = self->self->functions.find(name);
  return found == self->self->functions.end() ? 2000 : found->second;
}

void* RawHost::WindowHandle(Object* self) { return self->self->window; }

void RawHost::CallFunction(Object* self, unsigned id) {
  self->self->calls.push_back("call " + std::to_string(id));
  if (self->self->onCall) self->self->onCall(id);
}
