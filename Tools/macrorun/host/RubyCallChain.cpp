// SPDX-License-Identifier: MIT
#include "host/RubyCallChain.h"

#include <oleauto.h>

#include "platform/Encoding.h"
#include "report/Diagnostic.h"

// Active Scripting has no call for this, so the engine evaluates an expression. The frames after
// the macro's top level belong to the macros that wait for it.
std::string RubyCallChain(IActiveScriptParse& engine) {
  const std::wstring macro = PathFromUtf8(kRubyMacroName).wstring();
  const std::wstring expression =
      L"caller.grep(/\\A" + macro +
      L":/).grep_v(/in `method_missing'\\z/).slice_after(/in `<main>'\\z/)"
      L".first.to_a.first(20).join(\"\\n\")";
  VARIANT chain;
  VariantInit(&chain);
  const HRESULT result = engine.ParseScriptText(expression.c_str(), nullptr, nullptr, nullptr, 0, 0,
                                                SCRIPTTEXT_ISEXPRESSION, &chain, nullptr);
  std::string text;
  if (SUCCEEDED(result) && chain.vt == VT_BSTR)
    text = BytesOf(chain.bstrVal, SysStringLen(chain.bstrVal));
  VariantClear(&chain);
  return text;
}
