// SPDX-License-Identifier: MIT
// run_ruby [--times=N] [OPTION...] [FILE|-] [ARGUMENT...]: ruby.exe's command line for the script
// engine in ruby\bin beside this program. Knows the options -e, -I, -r, -w, -W and -C and ignores
// --disable and --enable; any other option starts ruby.exe with the same command line. With --times
// the program runs N times in one process, each time in a new engine object.
//
// The host publishes no object, so the program prints to the process's own streams. The host
// reports errors as `NAME:LINE: DESCRIPTION`, and its exit code is then 1. It shares no code with
// the project and needs no registration of the engine.
#include <windows.h>
// They need windows.h before them, and this order.
#include <oaidl.h>

#include <activscp.h>
#include <fcntl.h>
#include <io.h>
#include <shellapi.h>

#include <cstdio>
#include <string>

namespace {

constexpr CLSID kEngine = {
    0x5C0B6E2C, 0x4F0D, 0x4B6B, {0x9E, 0x0F, 0x7B, 0x1C, 0x3A, 0x9D, 0x52, 0xE4}};

// The parser's 32-bit form; libraries do not carry its identifier.
constexpr IID kActiveScriptParse = {
    0xBB1A2AE2, 0xA4F9, 0x11CF, {0x8F, 0x20, 0x00, 0x80, 0x5F, 0x2C, 0xD0, 0x64}};

struct CommandLine {
  std::wstring setup;  // Ruby code for the options, run before the program
  std::wstring program, name;
  int times = 1;
  bool forRubyExe = false;
};

// Lives in a frame of Run, longer than the engine.
class Site final : public IActiveScriptSite {
 public:
  explicit Site(const std::wstring& program) : name(program) {}

  bool failed = false;

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
    std::fprintf(stderr, "%ls:%lu: %ls\n", name.c_str(), line + 1, exception.bstrDescription);
    SysFreeString(exception.bstrSource);
    SysFreeString(exception.bstrDescription);
    SysFreeString(exception.bstrHelpFile);
    failed = true;
    return S_OK;
  }
  HRESULT STDMETHODCALLTYPE OnEnterScript() override { return S_OK; }
  HRESULT STDMETHODCALLTYPE OnLeaveScript() override { return S_OK; }

 private:
  const std::wstring name;
};

std::wstring ReadUtf8(int file) {
  std::string bytes;
  char block[4096];
  for (int length; (length = _read(file, block, sizeof block)) > 0;)
    bytes.append(block, static_cast<std::size_t>(length));
  std::wstring text(bytes.size(), L'\0');
  text.resize(static_cast<std::size_t>(
      MultiByteToWideChar(CP_UTF8, MB_ERR_INVALID_CHARS, bytes.data(),
                          static_cast<int>(bytes.size()), text.data(),
                          static_cast<int>(text.size()))));
  return text;
}

std::wstring Quoted(const std::wstring& text) {
  std::wstring quoted = L"'";
  for (const wchar_t unit : text) {
    if (unit == L'\'' || unit == L'\\') quoted += L'\\';
    quoted += unit;
  }
  return quoted + L"'";
}

// Ruby code for -w and -W.
std::wstring WarningLevel(const std::wstring& level) {
  if (level == L"0") return L"$VERBOSE = nil\n";
  if (level == L"1") return L"$VERBOSE = false\n";
  if (level.rfind(L":no-", 0) == 0) return L"Warning[:" + level.substr(4) + L"] = false\n";
  if (level.rfind(L":", 0) == 0) return L"Warning" + level + L"] = true\n";
  return L"$VERBOSE = true\n";
}

bool IsAbout(const std::wstring& argument, const wchar_t* option) {
  return argument.rfind(option, 0) == 0;
}

// Takes the options and returns the index of the first other argument.
int TakeOptions(wchar_t** arguments, int count, CommandLine& line) {
  std::wstring folders, libraries;
  int i = 1;
  for (; i < count && arguments[i][0] == L'-' && arguments[i][1]; ++i) {
    const std::wstring argument = arguments[i];
    if (argument == L"--") return i + 1;
    if (IsAbout(argument, L"--times=")) {
      line.times = static_cast<int>(wcstol(argument.c_str() + 8, nullptr, 10));
    } else if (argument == L"-w" || IsAbout(argument, L"-W")) {
      line.setup += WarningLevel(argument.substr(2));
    } else if (argument == L"--disable" || argument == L"--enable") {
      ++i;
    } else if (wcschr(L"eIrC", argument[1])) {
      if (argument.size() == 2 && i + 1 == count) line.forRubyExe = true;
      const std::wstring value =
          argument.size() > 2 ? argument.substr(2) : std::wstring(arguments[++i]);
      if (argument[1] == L'e') line.program += value + L"\n", line.name = L"-e";
      if (argument[1] == L'I') folders += L"File.expand_path(" + Quoted(value) + L"),";
      if (argument[1] == L'r') libraries += L"require " + Quoted(value) + L"\n";
      if (argument[1] == L'C') SetCurrentDirectoryW(value.c_str());
    } else if (!IsAbout(argument, L"--disable") && !IsAbout(argument, L"--enable")) {
      line.forRubyExe = true;
      return count;
    }
  }
  if (!folders.empty()) line.setup += L"$LOAD_PATH.unshift(" + folders + L")\n";
  line.setup += libraries;
  return i;
}

CommandLine Parse(wchar_t** arguments, int count) {
  CommandLine line;
  int i = TakeOptions(arguments, count, line);
  if (line.forRubyExe) return line;
  if (line.name.empty()) {
    line.name = i < count ? arguments[i++] : L"-";
    const int file = line.name == L"-" ? 0 : _wopen(line.name.c_str(), _O_RDONLY);
    _setmode(file, _O_BINARY);
    line.program = ReadUtf8(file);
    if (file > 0) _close(file);
  }
  if (i < count) line.setup += L"ARGV.replace([";
  for (int j = i; j < count; ++j) line.setup += Quoted(arguments[j]) + L",";
  if (i < count) line.setup += L"])\n";
  return line;
}

std::wstring RubyFolder() {
  wchar_t path[MAX_PATH];
  GetModuleFileNameW(nullptr, path, MAX_PATH);
  const std::wstring program = path;
  return program.substr(0, program.rfind(L'\\')) + L"\\ruby\\bin\\";
}

// Hands on all descriptors that this process has inherited.
int RunRubyExe() {
  const std::wstring own = GetCommandLineW();
  const std::size_t end = own[0] == L'"' ? own.find(L'"', 1) + 1 : own.find(L' ');
  std::wstring line = L"ruby.exe" + (end < own.size() ? own.substr(end) : L"");
  STARTUPINFOW startup;
  GetStartupInfoW(&startup);
  PROCESS_INFORMATION process;
  if (!CreateProcessW((RubyFolder() + L"ruby.exe").c_str(), line.data(), nullptr, nullptr, TRUE, 0,
                      nullptr, nullptr, &startup, &process))
    return 2;
  WaitForSingleObject(process.hProcess, INFINITE);
  DWORD code = 2;
  GetExitCodeProcess(process.hProcess, &code);
  return static_cast<int>(code);
}

IClassFactory* LoadEngine() {
  const HMODULE library = LoadLibraryExW((RubyFolder() + L"rubyscript.dll").c_str(), nullptr,
                                         LOAD_WITH_ALTERED_SEARCH_PATH);
  using GetClassObject = HRESULT(WINAPI*)(REFCLSID, REFIID, void**);
  const auto getClassObject = reinterpret_cast<GetClassObject>(
      reinterpret_cast<void*>(GetProcAddress(library, "DllGetClassObject")));
  void* factory = nullptr;
  if (getClassObject) getClassObject(kEngine, IID_IClassFactory, &factory);
  return static_cast<IClassFactory*>(factory);
}

HRESULT RunText(IActiveScriptParse* parser, const std::wstring& text) {
  if (text.empty()) return S_OK;
  return parser->ParseScriptText(text.c_str(), nullptr, nullptr, nullptr, 0, 0, 0, nullptr,
                                 nullptr);
}

HRESULT RunIn(IActiveScript* engine, IActiveScriptSite* site, const CommandLine& line) {
  IActiveScriptParse* parser = nullptr;
  HRESULT result = engine->QueryInterface(kActiveScriptParse, reinterpret_cast<void**>(&parser));
  if (FAILED(result)) return result;
  result = parser->InitNew();
  if (SUCCEEDED(result)) result = engine->SetScriptSite(site);
  if (SUCCEEDED(result)) result = engine->SetScriptState(SCRIPTSTATE_CONNECTED);
  // A connected engine runs a text at once, so the program is compiled after the options are set.
  if (SUCCEEDED(result)) result = RunText(parser, line.setup);
  if (SUCCEEDED(result)) result = RunText(parser, line.program);
  engine->Close();
  parser->Release();
  return result;
}

bool Run(IClassFactory* factory, const CommandLine& line) {
  Site site(line.name);
  IActiveScript* engine = nullptr;
  HRESULT result =
      factory->CreateInstance(nullptr, IID_IActiveScript, reinterpret_cast<void**>(&engine));
  if (SUCCEEDED(result)) {
    result = RunIn(engine, &site, line);
    engine->Release();
  }
  if (FAILED(result) && !site.failed)
    std::fprintf(stderr, "%ls: result 0x%08lX\n", line.name.c_str(), result);
  return SUCCEEDED(result) && !site.failed;
}

}  // namespace

int main() {
  int count = 0;
  wchar_t** const arguments = CommandLineToArgvW(GetCommandLineW(), &count);
  const CommandLine line = Parse(arguments, count);
  if (line.forRubyExe) return RunRubyExe();
  if (FAILED(CoInitialize(nullptr))) return 2;
  IClassFactory* const factory = LoadEngine();
  if (!factory) {
    std::fprintf(stderr, "run_ruby: no engine\n");
    return 2;
  }
  bool succeeded = true;
  for (int i = 0; i < line.times; ++i) succeeded = Run(factory, line) && succeeded;
  factory->Release();
  CoUninitialize();
  return succeeded ? 0 : 1;
}
