// SPDX-License-Identifier: MIT
// RunSample ENGINE FILE...: runs Ruby programs through the script engine in the DLL ENGINE, each in
// an engine object of its own and all in this process. Nothing is published to them, so what they
// print goes to standard output, between the lines that tell their names. Errors go to standard
// error as `NAME: LINE: DESCRIPTION`, and the exit code is then 1.
//
// A host of its own: it shares no code with the project, and has the DLL make the engine, without a
// registration.
#include <windows.h>
// They need windows.h before them, and this order.
#include <oaidl.h>

#include <activscp.h>

#include <cstdio>
#include <fstream>
#include <iterator>
#include <string>

namespace {

constexpr CLSID kEngine = {
    0x5C0B6E2C, 0x4F0D, 0x4B6B, {0x9E, 0x0F, 0x7B, 0x1C, 0x3A, 0x9D, 0x52, 0xE4}};

// The parser's 32-bit form; libraries do not carry its identifier.
constexpr IID kActiveScriptParse = {
    0xBB1A2AE2, 0xA4F9, 0x11CF, {0x8F, 0x20, 0x00, 0x80, 0x5F, 0x2C, 0xD0, 0x64}};

// Lives in a frame of Run, longer than the engine.
class Site final : public IActiveScriptSite {
 public:
  explicit Site(const std::string& program) : name(program) {}
  bool Failed() const { return failed; }

  // `line` counts from 1; 0 for an error of no line.
  void Fail(unsigned long line, const wchar_t* description) {
    failed = true;
    std::fprintf(stderr, "%s: %lu: %ls\n", name.c_str(), line, description ? description : L"");
  }

  HRESULT STDMETHODCALLTYPE QueryInterface(REFIID id, void** object) override {
    const bool known = id == IID_IUnknown || id == IID_IActiveScriptSite;
    *object = known ? this : nullptr;
    return known ? S_OK : E_NOINTERFACE;
  }
  ULONG STDMETHODCALLTYPE AddRef() override { return 2; }
  ULONG STDMETHODCALLTYPE Release() override { return 1; }

  HRESULT STDMETHODCALLTYPE GetLCID(LCID*) override { return E_NOTIMPL; }
  HRESULT STDMETHODCALLTYPE GetItemInfo(LPCOLESTR, DWORD, IUnknown**, ITypeInfo**) override {
    return TYPE_E_ELEMENTNOTFOUND;
  }
  HRESULT STDMETHODCALLTYPE GetDocVersionString(BSTR*) override { return E_NOTIMPL; }
  HRESULT STDMETHODCALLTYPE OnScriptTerminate(const VARIANT*, const EXCEPINFO*) override {
    return S_OK;
  }
  HRESULT STDMETHODCALLTYPE OnStateChange(SCRIPTSTATE) override { return S_OK; }
  HRESULT STDMETHODCALLTYPE OnScriptError(IActiveScriptError* error) override {
    DWORD context = 0;
    ULONG line = 0;
    LONG column = 0;
    EXCEPINFO exception = {};
    error->GetSourcePosition(&context, &line, &column);
    error->GetExceptionInfo(&exception);
    Fail(line + 1, exception.bstrDescription);
    SysFreeString(exception.bstrSource);
    SysFreeString(exception.bstrDescription);
    SysFreeString(exception.bstrHelpFile);
    return S_OK;
  }
  HRESULT STDMETHODCALLTYPE OnEnterScript() override { return S_OK; }
  HRESULT STDMETHODCALLTYPE OnLeaveScript() override { return S_OK; }

 private:
  const std::string name;
  bool failed = false;
};

std::wstring ReadUtf8(const char* file) {
  std::ifstream stream(file, std::ios::binary);
  const std::string bytes((std::istreambuf_iterator<char>(stream)), {});
  const int length = static_cast<int>(bytes.size());
  std::wstring text(bytes.size(), L'\0');
  text.resize(static_cast<std::size_t>(MultiByteToWideChar(
      CP_UTF8, MB_ERR_INVALID_CHARS, bytes.data(), length, text.data(), length)));
  return text;
}

IClassFactory* LoadEngine(const char* dll) {
  // The engine's own DLLs are looked for beside it only if its path is a full one.
  char path[MAX_PATH];
  GetFullPathNameA(dll, MAX_PATH, path, nullptr);
  const HMODULE library = LoadLibraryExA(path, nullptr, LOAD_WITH_ALTERED_SEARCH_PATH);
  using GetClassObject = HRESULT(WINAPI*)(REFCLSID, REFIID, void**);
  const auto getClassObject = reinterpret_cast<GetClassObject>(
      reinterpret_cast<void*>(GetProcAddress(library, "DllGetClassObject")));
  void* factory = nullptr;
  if (getClassObject) getClassObject(kEngine, IID_IClassFactory, &factory);
  return static_cast<IClassFactory*>(factory);
}

HRESULT RunText(IActiveScript* engine, IActiveScriptSite* site, const std::wstring& text) {
  IActiveScriptParse* parser = nullptr;
  HRESULT result = engine->QueryInterface(kActiveScriptParse, reinterpret_cast<void**>(&parser));
  if (FAILED(result)) return result;
  result = parser->InitNew();
  if (SUCCEEDED(result)) result = engine->SetScriptSite(site);
  if (SUCCEEDED(result))
    result =
        parser->ParseScriptText(text.c_str(), nullptr, nullptr, nullptr, 0, 0, 0, nullptr, nullptr);
  if (SUCCEEDED(result)) result = engine->SetScriptState(SCRIPTSTATE_CONNECTED);
  engine->Close();
  parser->Release();
  return result;
}

bool Run(IClassFactory* factory, const char* file) {
  const std::string path(file);
  const std::string name = path.substr(path.rfind('/') + 1);
  std::printf("==== %s\n", name.c_str());
  std::fflush(stdout);
  Site site(name);
  const std::wstring text = ReadUtf8(file);
  if (text.empty()) {
    site.Fail(0, L"no text in UTF-8");
    return false;
  }
  IActiveScript* engine = nullptr;
  HRESULT result =
      factory->CreateInstance(nullptr, IID_IActiveScript, reinterpret_cast<void**>(&engine));
  if (SUCCEEDED(result)) {
    result = RunText(engine, &site, text);
    engine->Release();
  }
  if (FAILED(result)) site.Fail(0, (L"result " + std::to_wstring(result)).c_str());
  return !site.Failed();
}

}  // namespace

int main(int count, char** arguments) {
  if (FAILED(CoInitialize(nullptr))) return 2;
  IClassFactory* const factory = count > 1 ? LoadEngine(arguments[1]) : nullptr;
  if (!factory) {
    std::fprintf(stderr, "RunSample: no engine\n");
    return 2;
  }
  bool succeeded = true;
  for (int i = 2; i < count; ++i) succeeded = Run(factory, arguments[i]) && succeeded;
  factory->Release();
  CoUninitialize();
  return succeeded ? 0 : 1;
}
