// SPDX-License-Identifier: MIT
// The escapes of a description, one after the other, and its texts in the record of `version`.
#include "Fuzz.h"
#include "iLib/iProfile.h"
#include "xLib/ScriptInfoRecord.h"
#include "xLib/xScriptInfo.h"

static std::string Unescaped(std::string text) {
  const std::pair<std::string, char> escapes[] = {{"\\n", '\n'}, {"\\r", '\r'}, {"\\t", '\t'}};
  for (const auto& [escape, control] : escapes)
    for (size_t at; (at = text.find(escape)) != std::string::npos;) text.replace(at, 2, 1, control);
  return text;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
  Input input(bytes, size);
  const std::string text = AnyText(input, 600), other = AnyText(input, 100);
  xScriptInfo defaults(false), info(false);
  defaults.MacroBegin = text.c_str();
  defaults.Enter = other.c_str();
  defaults.Language = other.c_str();
  Profile none("");
  info.Read(none, defaults);
  CHECK(BytesOf(info.MacroBegin) == Unescaped(text));
  CHECK(BytesOf(info.Enter) == other);
  CHECK(BytesOf(info.Language) == other.substr(0, 18));

  struct {
    ScriptInfoRecord record;
    char behind;
  } filled = {{}, 'x'};
  CHECK(info.CopyToRecord(&filled.record) && filled.behind == 'x');
  CHECK(filled.record.macroBegin == Unescaped(text).substr(0, sizeof filled.record.macroBegin - 1));
  CHECK(filled.record.enter == other.substr(0, sizeof filled.record.enter - 1));
  return 0;
}
