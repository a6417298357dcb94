// SPDX-License-Identifier: MIT
#include "MacroRuby.h"

#include "xLib/xScriptInfo.h"

xMacro* CreateMacroEngine() {
  MacroRuby* engine = new MacroRuby;
  if (!engine) return nullptr;
  SetRubyDefaults(DefaultScriptInfo());
  CurrentScriptInfo().Read(engine->DescriptionFile(), DefaultScriptInfo());
  return engine;
}

void SetRubyDefaults(xScriptInfo& target) {
  target.Language = "RubyScript";
  target.Description = "Ruby Script Macro Engine Version 1.00";
  target.Extension = "rbs";
  target.MacroBegin = "def key_macro()\n";
  target.MacroEnd = "end\n\nkey_macro() # run the macro";
  target.FunctionPrint = "\t@tarn.write(\"%s\");";
  target.FunctionPrefix = "@tarn.";
  target.FunctionPostfix = ";";
  target.Enter = "\\n";
  target.CRLF = "\\\\n";
  target.LineFeed = "\\\\r";
  target.Tick = "'";
  target.Quote = "\\\"";
  target.OpenBracket = '(';
  target.CloseBracket = ')';
  target.FixCRLF = false;
  target.FixDelimiter = false;
}
