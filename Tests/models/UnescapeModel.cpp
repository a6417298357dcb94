// SPDX-License-Identifier: MIT
// The escapes of a description, one after the other, and its texts in the record of `version`.
#include "Model.h"
#include "iLib/iProfile.h"
#include "xLib/ScriptInfoRecord.h"
#include "xLib/xScriptInfo.h"

static std::string Unescaped(std::string text) {
  const std::pair<std::string, char> escapes[] = {{"\\n", '\n'}, {"\\r", '\r'}, {"\\t", '\t'}};
  for (const auto& [escape, control] : escapes)
    for (size_t at; (at = text.find(escape)) != std::string::npos;) text.replace(at, 2, 1, control);
  return text;
}

size_t UnescapeModel(Input& input) {
  const std::string text = AnyBytes(input, 600), other = AnyBytes(input, 100);
  xScriptInfo defaults(false), info(false);
  defaults.MacroBegin = text.c_str();
  defaults.Enter = other.c_str();
  defaults.Language = other.c_str();
  Profile none("");
  info.Read(none, defaults);
  CHECK(Bytes(info.MacroBegin) == Unescaped(text));
  CHECK(Bytes(info.Enter) == other);
  CHECK(Bytes(info.Language) == other.substr(0, 18));

  struct {
    ScriptInfoRecord record;
    char behind;
  } filled = {{}, 'x'};
  CHECK(info.CopyToRecord(&filled.record) && filled.behind == 'x');
  CHECK(filled.record.macroBegin == Unescaped(text).substr(0, sizeof filled.record.macroBegin - 1));
  CHECK(filled.record.enter == other.substr(0, sizeof filled.record.enter - 1));
  return 1;
}
