// SPDX-License-Identifier: MIT
#include "host/HostLink.h"

#include <stdarg.h>
#include <string.h>

#include "cLib/cHost.h"
#include "xLib/xArgument.h"
#include "xLib/xMacro.h"

static_assert(kUnknownId == kUnknownFunction, "the answer passes unchanged");
static_assert(kTextArgument == static_cast<u32>(xArgument::kText) &&
                  kIntegerArgument == static_cast<u32>(xArgument::kInteger) &&
                  kRealArgument == static_cast<u32>(xArgument::kReal),
              "the kind passes unchanged");

// Placement new, because the record's lists are at fixed offsets.
inline void* operator new(size_t, void* place) noexcept { return place; }

struct HostLink final : HostInterface {
  explicit HostLink(const HostCallbacks& functions);
  ~HostLink();

  void Unused0() override {}
  HostContext* Context() override { return &record; }
  void ReportMessage(const char* text) override { callbacks.report(callbacks.context, text); }
  void __cdecl DebugOutput(const char* format, ...) override;
  // Each editor defines what these flags mean. This host does not change texts.
  void SetFixCRLF(u8) override {}
  void SetFixDelimiter(u8) override {}
  void Unused6() override {}
  u32 FunctionId(const char* name) override {
    return callbacks.functionId(callbacks.context, name);
  }
  void Unused8() override {}
  void* WindowHandle() override { return nullptr; }
  void Unused10() override {}
  void Unused11() override {}
  void CallFunction(u32 id) override;

  HostCallbacks callbacks;
  HostContext record;
  HostStopCause stopCause = kNotStopped;
};

HostLink::HostLink(const HostCallbacks& functions) : callbacks(functions) {
  memset(&record, 0, sizeof record);
  new (record.resultTexts) Array<String>;
  new (record.argumentList) Array<xArgument>;
}

HostLink::~HostLink() {
  record.ArgumentList().~Array();
  record.ResultTexts().~Array();
}

void __cdecl HostLink::DebugOutput(const char* format, ...) {
  String line;
  va_list arguments;
  va_start(arguments, format);
  line.FormatV(format, arguments);
  va_end(arguments);
  callbacks.trace(callbacks.context, line.Text());
}

// No object with a destructor may live in this function, because Stop() does not return. Another
// thread can request a stop at any time; a request after the last check takes effect at the next
// call.
void HostLink::CallFunction(u32 id) {
  HostLinkSetInteger(this, 0);
  if (!record.stopRequested) {
    const bool goOn = callbacks.call(callbacks.context, id);
    if (goOn && !record.stopRequested) return;
  }
  stopCause = record.stopRequested ? kStoppedByUser : kStoppedByCall;
  if (record.stopRequested) callbacks.stopping(callbacks.context);
  if (record.engine) record.engine->Stop();
}

HostLink* CreateHostLink(const HostCallbacks* callbacks) { return new HostLink(*callbacks); }

void DestroyHostLink(HostLink* link) { delete link; }

void* HostLinkInterface(HostLink* link) { return static_cast<HostInterface*>(link); }

uint32_t HostLinkArgumentCount(HostLink* link) {
  const i32 count = link->record.ArgumentList().Count();
  return count < 0 ? 0 : static_cast<uint32_t>(count);
}

HostArgument HostLinkArgument(HostLink* link, uint32_t index) {
  const xArgument* argument = link->record.ArgumentList().At(static_cast<i32>(index));
  if (!argument) return {0, "", 0, kTextArgument};
  return {argument->real, argument->text.Text(), argument->integer,
          static_cast<HostArgumentKind>(argument->kind)};
}

void HostLinkSetInteger(HostLink* link, int32_t value) {
  link->record.ResultTexts().Clear();
  link->record.resultKind = 0;
  link->record.integerResult = value;
}

bool HostLinkSetText(HostLink* link, const char* text) {
  HostLinkSetInteger(link, 0);
  String* result = new String(text);
  if (!result) return false;
  if (link->record.ResultTexts().SetAt(result, 0) != 0) {
    delete result;
    return false;
  }
  link->record.resultKind = kTextResult;
  return true;
}

HostStopCause HostLinkStopCause(HostLink* link) { return link->stopCause; }

HostNesting HostLinkBeginNested(HostLink* link) {
  const HostNesting nesting = {link->record.engine, link->stopCause};
  link->stopCause = kNotStopped;
  return nesting;
}

void HostLinkEndNested(HostLink* link, const HostNesting* nesting) {
  link->record.engine = static_cast<xMacro*>(nesting->engine);
  link->stopCause = nesting->stopCause;
}
