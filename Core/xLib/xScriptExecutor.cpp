// SPDX-License-Identifier: MIT
#include "xLib/xScriptExecutor.h"

#include <objbase.h>
#include <stdio.h>
#include <string.h>

#include "iLib/iComText.h"
#include "iLib/iFile.h"
#include "xLib/xProduct.h"
#include "xLib/xTexts.h"

// The 32-bit form of the parser; libraries do not carry its identifier under the header's name.
static constexpr IID kActiveScriptParse = {
    0xBB1A2AE2, 0xA4F9, 0x11CF, {0x8F, 0x20, 0x00, 0x80, 0x5F, 0x2C, 0xD0, 0x64}};

static constexpr char kItemName[] = "tarn";
static constexpr char kRubyEngine[] = "RubyScript";

// --- Creation and destruction --------------------------------------------------------------------

xScriptExecutor::xScriptExecutor(const char* progId, bool fixCRLF, bool fixDelimiter, u8 siteFlag)
    : dispatch(fixCRLF, fixDelimiter), host(CurrentHost()) {
  // A run that the host nests into this creation may change the caller's text.
  const String name(progId);
  // Whatever it answers, the destructor undoes one initialisation.
  CoInitialize(nullptr);
  host->Context()->siteFlag = siteFlag;
  if (name.IsEmpty()) {
    host->ReportMessage("No scripting module provided.");
    return;
  }
  const HRESULT result = CreateEngine(name.Text());
  ready = SUCCEEDED(result);
  if (!ready) ReportCreation(result, name.Text());
}

HRESULT xScriptExecutor::CreateEngine(const char* progId) {
  CLSID classId;
  HRESULT result = CLSIDFromProgID(WideFromNarrow(progId), &classId);
  if (SUCCEEDED(result))
    result = CoCreateInstance(classId, nullptr, CLSCTX_INPROC_SERVER, IID_IActiveScript,
                              reinterpret_cast<void**>(&engine));
  if (SUCCEEDED(result))
    result = engine->QueryInterface(kActiveScriptParse, reinterpret_cast<void**>(&parser));
  if (SUCCEEDED(result)) result = engine->SetScriptSite(this);
  if (SUCCEEDED(result)) result = parser->InitNew();
  // Visible, but no source of events and no global members: scripts reach the editor only through
  // the object's own name.
  if (SUCCEEDED(result))
    result = engine->AddNamedItem(WideFromNarrow(kItemName), SCRIPTITEM_ISVISIBLE);
  return result;
}

void xScriptExecutor::ReportCreation(HRESULT result, const char* progId) {
  String advice("Unexpected error creating '");
  advice.Append(progId);
  advice.Append("' COM object.\n\nMake sure the ");
  advice.Append(progId);
  advice.Append(" Windows Scripting Host has been correctly installed.\n");
  if (strcmp(progId, kRubyEngine) == 0)
    advice.Append("\n               RubyScript: " SCRIPTRUBY_RUBY_ENGINE_PAGE);
  advice.Append("\n   Windows Scripting Host: " SCRIPTRUBY_SCRIPT_HOST_PAGE "\n");
  SendReport(result, "Error creating '%s' scripting module.", progId, advice.Text());
}

xScriptExecutor::~xScriptExecutor() {
  if (parser) parser->Release();
  if (engine) {
    engine->SetScriptState(SCRIPTSTATE_CLOSED);
    engine->Release();
  }
  CoUninitialize();
}

void xScriptExecutor::CheckLayout() {
#if CORE_MICROSOFT_ABI
  static_assert(offsetof(xScriptExecutor, ready) == 8, "fields follow two tables");
  static_assert(offsetof(xScriptExecutor, fileName) == 12, "fields follow two tables");
  static_assert(offsetof(xScriptExecutor, dispatch) == 36, "fields follow two tables");
  static_assert(offsetof(xScriptExecutor, host) == 52, "fields follow two tables");
  static_assert(offsetof(xScriptExecutor, engine) == 56, "fields follow two tables");
  static_assert(offsetof(xScriptExecutor, parser) == 60, "fields follow two tables");
  static_assert(sizeof(xScriptExecutor) == 64, "fields follow two tables");
#endif
}

// --- Running -------------------------------------------------------------------------------------

bool xScriptExecutor::Execute(const char* file) {
  if (!ready || !Parse(file)) return false;
  const HRESULT result = engine->SetScriptState(SCRIPTSTATE_CONNECTED);
  SendReport(result, "Error executing '%s' macro script.", fileName.Text(), nullptr);
  return result == S_OK;
}

bool xScriptExecutor::Parse(const char* file) {
  fileName.Assign(file);
  if (!ready) return false;
  wchar_t* text = LoadFileAsWideText(file);
  if (!text) {
    fprintf(stderr, "Error: Could not find the '%s' script file\n", fileName.Text());
    return false;
  }
  EXCEPINFO exception = {};
  const HRESULT result =
      parser->ParseScriptText(text, nullptr, nullptr, nullptr, 0, 0, 0, nullptr, &exception);
  SendReport(result, "Error parsing '%s' macro script.", fileName.Text(), nullptr);
  CoTaskMemFree(text);
  SysFreeString(exception.bstrSource);
  SysFreeString(exception.bstrDescription);
  SysFreeString(exception.bstrHelpFile);
  return result == S_OK;
}

void xScriptExecutor::Interrupt() {
  if (engine) engine->InterruptScriptThread(SCRIPTTHREADID_ALL, nullptr, 0);
}

bool xScriptExecutor::IsRunning() {
  SCRIPTSTATE state = SCRIPTSTATE_UNINITIALIZED;
  return engine && SUCCEEDED(engine->GetScriptState(&state)) && state == SCRIPTSTATE_CONNECTED;
}

// `format` with `name` in place of its %s. Long names are appended, not formatted: a report never
// shows a raw format.
static String FormatName(const char* format, const char* name) {
  if (!format) format = "Unknown";
  const char* mark = strstr(format, "%s");
  if (!mark) return String(format);
  String text(format, static_cast<u32>(mark - format));
  text.Append(name ? name : "Unknown");
  text.Append(mark + 2);
  return text;
}

// Sends the system's reason for `result` with the text; any value but S_OK is reported.
void xScriptExecutor::SendReport(HRESULT result, const char* format, const char* name,
                                 const char* extra) {
  if (result == S_OK) return;
  String text = FormatName(format, name);
  // A message that wants inserts has none to show: it counts as no message.
  char reason[2048] = "";
  FormatMessageA(FORMAT_MESSAGE_FROM_SYSTEM, nullptr, static_cast<DWORD>(result),
                 MAKELANGID(LANG_NEUTRAL, SUBLANG_DEFAULT), reason, sizeof reason, nullptr);
  if (*reason) {
    text.Append("\nReason: ");
    text.Append(reason);
  }
  text.Insert("\n", 0);
  if (extra && *extra) {
    text.Append(extra);
    text.Insert("\n", 0);
  }
  if (host) host->ReportMessage(text.Text());
}

// --- Site methods --------------------------------------------------------------------------------

HRESULT xScriptExecutor::QueryInterface(REFIID riid, void** object) {
  const bool window = riid == IID_IActiveScriptSiteWindow;
  // Deliberately without touching the caller's pointer.
  if (!window && riid != IID_IUnknown && riid != IID_IActiveScriptSite) return E_NOINTERFACE;
  if (!object) return E_POINTER;
  if (window)
    *object = static_cast<IActiveScriptSiteWindow*>(this);
  else
    *object = static_cast<IActiveScriptSite*>(this);
  AddRef();
  return S_OK;
}

HRESULT xScriptExecutor::GetItemInfo(LPCOLESTR name, DWORD mask, IUnknown** item,
                                     ITypeInfo** type) {
  const bool wantsType = (mask & SCRIPTINFO_ITYPEINFO) != 0;
  const bool wantsItem = (mask & SCRIPTINFO_IUNKNOWN) != 0;
  if ((wantsType && !type) || (wantsItem && !item)) return E_POINTER;
  if (wantsType) *type = nullptr;
  if (wantsItem) *item = nullptr;
  if (!wantsItem || strcmp(NarrowFromWide(name), kItemName) != 0) return E_NOTIMPL;
  TraceTo(host, "The Tarn object was requested and returned.");
  dispatch.AddRef();
  *item = &dispatch;
  return S_OK;
}

static void AppendNumber(String& text, long number) {
  String digits;
  digits.Format("%ld", number);
  text.Append(digits.Text());
}

// Reads the position and the reason of the error. The engine's results are ignored: defaults apply
// where it gives nothing. The strings of the exception are deliberately not freed: the engine still
// uses them.
HRESULT xScriptExecutor::OnScriptError(IActiveScriptError* error) {
  if (!error) return E_POINTER;
  BSTR lineText = nullptr;
  error->GetSourceLineText(&lineText);
  DWORD sourceContext = 0;
  ULONG line = 0;
  LONG column = -1;
  error->GetSourcePosition(&sourceContext, &line, &column);

  String text(kScriptErrorReport);
  text.Append(" File: ");
  text.Append(fileName.Text());
  text.Append(" (");
  AppendNumber(text, static_cast<long>(line + 1));
  text.Append(":");
  AppendNumber(text, column);
  text.Append(") >> ");
  text.Append(NarrowFromWide(lineText));

  EXCEPINFO exception = {};
  error->GetExceptionInfo(&exception);
  const char* description = NarrowFromWide(exception.bstrDescription);
  if (*description) {
    text.Append("\nReason: ");
    text.Append(description);
    text.Append("\n");
  }
  if (host) host->ReportMessage(text.Text());
  SysFreeString(lineText);
  return S_OK;
}

HRESULT xScriptExecutor::GetWindow(HWND* window) {
  if (window) *window = host ? static_cast<HWND>(host->WindowHandle()) : nullptr;
  return S_OK;
}
