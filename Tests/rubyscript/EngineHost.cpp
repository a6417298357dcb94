// SPDX-License-Identifier: MIT
#include "EngineHost.h"

#include <algorithm>
#include <fstream>

static std::string transcript;

void Log(const std::string& line) { transcript += (transcript.empty() ? "" : "; ") + line; }

std::string TakeLog() {
  std::string taken;
  taken.swap(transcript);
  return taken;
}

// One line for each, in the files.
static std::string OnOneLine(const std::string& text) {
  std::string line;
  for (const char c : text) c == '\n' ? line += "\\n" : c == '\t' ? line += "\\t" : line += c;
  return line;
}

void CheckTranscript(const std::string& file,
                     const std::function<std::string(const std::string& macro)>& run) {
  const std::string path = TRANSCRIPTS "/" + file;
  std::ifstream expected(path, std::ios::binary);
  std::string written, macro;
  for (std::string line; std::getline(expected, line);) {
    if (line[0] != '>') {
      macro += line + "\n";
      continue;
    }
    const std::string outcome = "> " + OnOneLine(run(macro));
    if (!std::getenv("SCRIPTRUBY_PROMOTE")) EXPECT_EQ(line, outcome) << macro;
    written += macro + outcome + "\n";
    macro.clear();
  }
  EXPECT_NE("", written) << path;
  EXPECT_EQ("", macro) << path << ": no outcome after the last macro";
  if (std::getenv("SCRIPTRUBY_PROMOTE")) std::ofstream(path, std::ios::binary) << written;
}

void* EngineExport(const char* name) {
  static const HMODULE dll = [] {
    std::string path = RUBYSCRIPT_DLL;
    std::replace(path.begin(), path.end(), '/', '\\');  // else its own folder is not searched
    return LoadLibraryExA(path.c_str(), nullptr, LOAD_WITH_ALTERED_SEARCH_PATH);
  }();
  void* const address = reinterpret_cast<void*>(GetProcAddress(dll, name));
  if (!address) throw std::runtime_error("no "s + name + " in " RUBYSCRIPT_DLL);
  return address;
}

extern "C" unsigned long CallGuarded(void (*body)(void* context), void* context);

unsigned long Guarded(const std::function<void()>& body) {
  return CallGuarded([](void* context) { (*static_cast<const std::function<void()>*>(context))(); },
                     const_cast<std::function<void()>*>(&body));
}

// --- Values --------------------------------------------------------------------------------------

static std::string Escaped(const wchar_t* text, UINT units) {
  std::string shown;
  char escape[32];
  for (UINT i = 0, run; i < units; i += run) {
    for (run = 1; i + run < units && text[i + run] == text[i];) ++run;
    if (run < 20) run = 1;
    const bool plain = text[i] >= ' ' && text[i] < 0x7F && text[i] != '\\';
    snprintf(escape, sizeof escape, plain ? "%c" : text[i] < 256 ? "\\x%02X" : "\\u%04X", text[i]);
    shown += escape + (run > 1 ? "{" + std::to_string(run) + "}" : "");
  }
  return shown;
}

static std::string ShowArray(SAFEARRAY* array) {
  std::string shown = "[";
  LONG low = 0, high = -1;
  SafeArrayGetLBound(array, 1, &low), SafeArrayGetUBound(array, 1, &high);
  for (LONG i = low; i <= high; ++i) {
    VARIANT element = {};
    SafeArrayGetElement(array, &i, &element);
    shown += (i > low ? ", " : "") + Show(element);
    VariantClear(&element);
  }
  return shown + "]";
}

std::string Show(const VARIANT& value) {
  char text[64];
  switch (value.vt) {
    case VT_EMPTY:
      return "EMPTY";
    case VT_I4:
      snprintf(text, sizeof text, "I4 %ld", value.lVal);
      return text;
    case VT_R8:
    case VT_DATE:
      snprintf(text, sizeof text, "%s %.17g", value.vt == VT_R8 ? "R8" : "DATE", value.dblVal);
      return text;
    case VT_BOOL:
      return value.boolVal == VARIANT_TRUE ? "BOOL true" : value.boolVal ? "BOOL ?" : "BOOL false";
    case VT_BSTR:
      return "'" + Escaped(value.bstrVal, SysStringLen(value.bstrVal)) + "'";
    case VT_DISPATCH:
      return value.pdispVal ? "DISPATCH" : "DISPATCH null";
    case VT_ARRAY | VT_VARIANT:
      return ShowArray(value.parray);
  }
  return "type " + Hex(value.vt);
}

std::wstring Wide(const std::string& utf8) {
  std::wstring wide(utf8.size(), 0);
  const int size = static_cast<int>(utf8.size());
  wide.resize(MultiByteToWideChar(CP_UTF8, 0, utf8.data(), size, wide.data(), size));
  return wide;
}

static std::string Narrow(BSTR text) {
  const int units = static_cast<int>(SysStringLen(text));
  std::string narrow(units * 3, 0);
  narrow.resize(WideCharToMultiByte(CP_UTF8, 0, text, units, narrow.data(),
                                    static_cast<int>(narrow.size()), nullptr, nullptr));
  return narrow;
}

// --- Item ----------------------------------------------------------------------------------------

HRESULT Item::QueryInterface(REFIID riid, void** object) {
  if (extension && (*object = extension(riid))) return S_OK;
  *object = riid == IID_IUnknown || riid == IID_IDispatch ? this : nullptr;
  return *object ? (AddRef(), S_OK) : E_NOINTERFACE;
}

void Item::Add(const std::string& function, Function body) {
  for (auto& each : functions)
    if (each.first == function) return each.second.swap(body);
  functions.emplace_back(function, std::move(body));
}

HRESULT Item::GetIDsOfNames(REFIID riid, LPOLESTR* names, UINT count, LCID, DISPID* ids) {
  EXPECT_TRUE(riid == IID_NULL && count == 1);
  const std::string wanted = Escaped(*names, static_cast<UINT>(wcslen(*names)));
  for (size_t i = 0; i < functions.size(); ++i)
    if (functions[i].first == wanted) return *ids = static_cast<DISPID>(i + 1), S_OK;
  Log(name + "." + wanted + "?");
  *ids = DISPID_UNKNOWN;
  return DISP_E_UNKNOWNNAME;
}

// Holds no memory while the function runs: it may not return.
HRESULT Item::Invoke(DISPID id, REFIID riid, LCID, WORD flags, DISPPARAMS* parameters,
                     VARIANT* result, EXCEPINFO* exception, UINT*) {
  size_t index = static_cast<size_t>(id) - 1;
  if (id == DISPID_VALUE)
    for (index = 0; index < functions.size() && functions[index].first != "[]";) ++index;
  if (index >= functions.size()) return DISP_E_MEMBERNOTFOUND;
  const bool put = flags == DISPATCH_PROPERTYPUT;
  const DISPID putId = DISPID_PROPERTYPUT;
  EXPECT_TRUE(riid == IID_NULL && parameters->cNamedArgs == UINT{put});
  EXPECT_TRUE(put ? *parameters->rgdispidNamedArgs == putId
                  : flags == (DISPATCH_METHOD | DISPATCH_PROPERTYGET));
  EXPECT_EQ(put, result == nullptr);
  for (UINT i = 0; i < parameters->cArgs; ++i)
    EXPECT_TRUE(byReference || !(parameters->rgvarg[i].vt & VT_BYREF));
  if (!quiet) {
    std::string line = name + "." + functions[index].first + (put ? "=(" : "(");
    for (UINT i = parameters->cArgs; i-- > 0;)
      line += Show(parameters->rgvarg[i]) + (i ? ", " : "");
    Log(line + ")");
  }
  return functions[index].second({parameters, result, exception});
}

// --- Host ----------------------------------------------------------------------------------------

void Host::Create(decltype(&DllGetClassObject) getClassObject) {
  void* factory = nullptr;
  ASSERT_EQ(S_OK, getClassObject(kEngineClass, IID_IClassFactory, &factory));
  void* made = nullptr;
  const HRESULT result =
      static_cast<IClassFactory*>(factory)->CreateInstance(nullptr, __uuidof(IActiveScript), &made);
  static_cast<IClassFactory*>(factory)->Release();
  ASSERT_EQ(S_OK, result);
  script = static_cast<IActiveScript*>(made);
  ASSERT_EQ(S_OK, script->QueryInterface(kParseId, &made));
  parse = static_cast<IActiveScriptParse*>(made);
}

void Host::Open() {
  Create();
  EXPECT_EQ(S_OK, script->SetScriptSite(this));
  EXPECT_EQ(S_OK, parse->InitNew());
  EXPECT_EQ(S_OK, script->AddNamedItem(Wide(itemName).c_str(), SCRIPTITEM_ISVISIBLE));
}

HRESULT Host::Parse(const std::string& text, DWORD flags, VARIANT* result, EXCEPINFO* exception,
                    DWORD cookie, ULONG firstLine) {
  std::wstring wide = Wide(text);
  if (itemName == "tarn") {
    wide.clear();
    for (const unsigned char byte : text) wide += byte;
  }
  return parse->ParseScriptText(wide.c_str(), nullptr, nullptr, nullptr, cookie, firstLine, flags,
                                result, exception);
}

void Host::Close() {
  script->Close();
  parse->Release();
  const ULONG left = script->Release();
  script = nullptr;
  if (left || references != 1 || item.references != 1)
    Log("left over: " + std::to_string(left) + " of the engine, " + std::to_string(references - 1) +
        " of the site, " + std::to_string(item.references - 1) + " of the item");
}

std::string Host::Run(const std::string& macro) {
  Open();
  HRESULT result = Parse(macro);
  if (SUCCEEDED(result)) result = Start();
  if (result != S_OK && result != kReported) Log(Hex(result));
  Close();
  return TakeLog();
}

std::string Host::Inspect(const std::string& expression) {
  std::string shown;
  item.Add("shown", [&](Item::Call call) {
    shown = Narrow(call.arguments->rgvarg[0].bstrVal);
    return S_OK;
  });
  const bool wasQuiet = item.quiet;
  item.quiet = true;
  const std::string logged = Run("@" + itemName + ".shown((" + expression + ").inspect)");
  item.quiet = wasQuiet;
  return logged.empty() ? shown : logged;
}

HRESULT Host::QueryInterface(REFIID riid, void** object) {
  *object = riid == IID_IUnknown || riid == __uuidof(IActiveScriptSite) ? this : nullptr;
  return *object ? (AddRef(), S_OK) : E_NOINTERFACE;
}

HRESULT Host::GetItemInfo(LPCOLESTR name, DWORD mask, IUnknown** object, ITypeInfo**) {
  EXPECT_EQ(name, Wide(itemName));
  EXPECT_EQ(mask, DWORD{SCRIPTINFO_IUNKNOWN});
  return *object = &item, item.AddRef(), S_OK;
}

HRESULT Host::OnStateChange(SCRIPTSTATE state) {
  if (verbose) Log("state " + std::to_string(state));
  return S_OK;
}

HRESULT Host::OnScriptError(IActiveScriptError* scriptError) {
  EXCEPINFO exception = {};
  BSTR lineText = nullptr;
  EXPECT_EQ(S_OK, scriptError->GetExceptionInfo(&exception));
  EXPECT_EQ(S_OK, scriptError->GetSourcePosition(&error.cookie, &error.line, &error.column));
  EXPECT_EQ(S_OK, scriptError->GetSourceLineText(&lineText));
  error.text = Narrow(exception.bstrDescription);
  error.lineText = Narrow(lineText);
  error.code = exception.scode;
  error.wCode = exception.wCode;
  error.help = Narrow(exception.bstrHelpFile) + ":" + std::to_string(exception.dwHelpContext);
  for (BSTR text :
       {exception.bstrDescription, exception.bstrSource, exception.bstrHelpFile, lineText})
    SysFreeString(text);
  Log("error: " + error.text.substr(0, error.text.find('\n')));
  return errorAnswer;
}

HRESULT Host::OnEnterScript() {
  if (verbose) Log("enter");
  return S_OK;
}

HRESULT Host::OnLeaveScript() {
  if (verbose) Log("leave");
  return S_OK;
}
