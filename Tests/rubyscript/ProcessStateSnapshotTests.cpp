// SPDX-License-Identifier: MIT
// The host's process-wide state through a run: everything that a script can change of it comes back.
#include "../../Scripting/rubyscript/ProcessStateSnapshot.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <io.h>
#include <locale.h>
#include <stdlib.h>
#include <windows.h>

#include <algorithm>
#include <initializer_list>
#include <string>
#include <vector>

using Lines = std::vector<std::wstring>;

static std::wstring Line(const wchar_t* what, intptr_t value) {
  return what + std::to_wstring(value);
}

static Lines EnvironmentLines() {
  Lines lines;
  wchar_t* const block = GetEnvironmentStringsW();
  for (const wchar_t* line = block; *line; line += wcslen(line) + 1) lines.push_back(line);
  FreeEnvironmentStringsW(block);
  std::sort(lines.begin(), lines.end());
  return lines;
}

// msvcrt's two answers, which have to be the same.
static std::wstring CrtValue(const wchar_t* name) {
  const wchar_t* const wide = _wgetenv(name);
  const char* const narrow = getenv(std::string(name, name + wcslen(name)).c_str());
  if (!wide && !narrow) return L"(none)";
  if (!wide || !narrow || std::wstring(narrow, narrow + strlen(narrow)) != wide) return L"(two)";
  return wide;
}

static void SetDirect(const wchar_t* name, const wchar_t* value) {
  EXPECT_TRUE(SetEnvironmentVariableW(name, value));
}

static const int kSignals[] = {SIGINT, SIGILL, SIGFPE, SIGSEGV, SIGTERM, SIGBREAK, SIGABRT};

static void HostHandler(int) {}
static void ScriptHandler(int) {}

// All but the environment. Asking takes the handlers away.
static Lines TakeState() {
  wchar_t directory[MAX_PATH];
  GetCurrentDirectoryW(MAX_PATH, directory);
  const std::string locale = setlocale(LC_ALL, nullptr);
  Lines state = {directory, std::wstring(locale.begin(), locale.end()),
                 Line(L"error mode ", GetErrorMode())};
  for (const int number : kSignals)
    state.push_back(Line(L"handler ", reinterpret_cast<intptr_t>(signal(number, SIG_DFL))));
  for (const int descriptor : {0, 1, 2}) {
    const int mode = _setmode(descriptor, _O_TEXT);
    if (mode != -1) _setmode(descriptor, mode);
    state.push_back(Line(L"mode ", mode));
  }
  return state;
}

static void SetState(const wchar_t* directory, const char* locale, UINT errorMode,
                     std::initializer_list<__p_sig_fn_t> handlers,
                     std::initializer_list<int> modes) {
  SetCurrentDirectoryW(directory);
  EXPECT_TRUE(setlocale(LC_ALL, "C") && setlocale(LC_NUMERIC, locale));
  SetErrorMode(errorMode);
  int count = 0;
  for (const int number : kSignals) signal(number, handlers.begin()[count++ % handlers.size()]);
  count = 0;
  for (const int mode : modes) _setmode(count++, mode);
}

static void SetHostState() {
  SetState(L"C:\\windows", "English_United States.1252", SEM_FAILCRITICALERRORS,
           {SIG_DFL, HostHandler, SIG_IGN}, {_O_BINARY, _O_TEXT, _O_BINARY});
}

static void SetScriptState() {
  SetState(L"C:\\", "C", SEM_NOOPENFILEERRORBOX, {ScriptHandler}, {_O_TEXT, _O_BINARY, _O_TEXT});
}

TEST(ProcessStateSnapshot, PutsTheStateBack) {
  SetHostState();
  const Lines host = TakeState();
  SetScriptState();
  const Lines script = TakeState();
  for (size_t i = 0; i < host.size(); ++i) EXPECT_NE(host[i], script[i]);

  ProcessStateSnapshot process;
  SetHostState(), process.Restore();  // without a snapshot
  EXPECT_EQ(TakeState(), host);
  SetHostState(), process.Save();
  EXPECT_EQ(TakeState(), host);  // saving changes nothing
  for (int round = 0; round < 2; ++round) {
    SetScriptState(), process.Restore();
    EXPECT_EQ(TakeState(), host);
  }
  SetScriptState(), process.Save();
  SetHostState(), process.Restore();
  EXPECT_EQ(TakeState(), script);
}

TEST(ProcessStateSnapshot, LeavesWhatIsMissing) {
  ProcessStateSnapshot process;
  const int kept = _dup(0);
  for (const int mode : {_O_TEXT, _O_BINARY}) {
    _close(0), process.Save();
    _dup2(kept, 0), _setmode(0, mode), process.Restore();
    EXPECT_EQ(_setmode(0, mode), mode);  // was closed: has no mode to go back to
  }
  process.Save(), _close(0), process.Restore();
  EXPECT_EQ(_get_osfhandle(0), -1);
  _dup2(kept, 0), _close(kept);
}

TEST(ProcessStateSnapshot, PutsTheEnvironmentBack) {
  const std::wstring large(20000, 'v');
  for (const wchar_t* line : {L"HP_changed=host", L"HP_removed=host=1;=2", L"HP_direct=host",
                              L"HP_direct_removed=host", L"HP_Case=host", L"HP_kept=host"})
    _wputenv(line);
  _wputenv((L"HP_large=" + large).c_str());
  SetDirect(L"HP_empty", L""), SetDirect(L"=Q:", L"Q:\\host"), SetDirect(L"=R:", L"R:\\host");
  const Lines host = EnvironmentLines();

  ProcessStateSnapshot process;
  process.Save();
  EXPECT_EQ(EnvironmentLines(), host);
  for (int round = 0; round < 2; ++round) {
    for (const wchar_t* line :
         {L"HP_changed=script", L"HP_removed=", L"HP_Case=", L"HP_CASE=host", L"HP_added=script",
          L"HP_changed_more=script", L"HP=script", L"HP_large=v", L"HP_\u00E9=\u20AC"})
      _wputenv(line);
    SetDirect(L"HP_direct", L"script"), SetDirect(L"HP_direct_removed", nullptr);
    SetDirect(L"HP_empty", L"script"), SetDirect(L"HP_added_empty", L"");
    SetDirect(L"=Q:", nullptr), SetDirect(L"=R:", L"R:\\script"), SetDirect(L"=S:", L"S:\\script");
    EXPECT_NE(EnvironmentLines(), host);

    process.Restore();
    EXPECT_EQ(EnvironmentLines(), host);
    EXPECT_EQ(CrtValue(L"HP_changed") + CrtValue(L"HP_direct") + CrtValue(L"HP_kept"),
              L"hosthosthost");
    EXPECT_EQ(CrtValue(L"HP_removed") + CrtValue(L"HP_direct_removed"), L"host=1;=2host");
    EXPECT_EQ(CrtValue(L"HP_large"), large);
    for (const wchar_t* name : {L"HP_added", L"HP_changed_more", L"HP", L"HP_added_empty"})
      EXPECT_EQ(CrtValue(name), L"(none)") << name;
  }
}

TEST(ProcessStateSnapshot, WritesOnlyWhatChanged) {
  CrtValue(L"HP_unknown");            // makes msvcrt's wide copy
  SetDirect(L"HP_unknown", L"host");  // msvcrt hears of it only when it sets another one
  ASSERT_EQ(CrtValue(L"HP_unknown"), L"(none)");
  ProcessStateSnapshot process;
  process.Save(), process.Restore();
  SetDirect(L"=U:", L"U:\\script"), process.Restore();
  EXPECT_EQ(CrtValue(L"HP_unknown"), L"(none)");
}

TEST(ProcessStateSnapshot, ShowsAdditionsToScriptsOnly) {
  ProcessStateSnapshot process;
  process.KeepAdditions(), process.ApplyAdditions();  // nothing to compare with, nothing to set
  _wputenv(L"HP_own=host"), _wputenv(L"HP_gone=host");
  process.Save();
  const Lines host = EnvironmentLines();
  for (const wchar_t* line : {L"HP_home=ruby", L"HP_own=ruby", L"HP_user=ruby", L"HP_temp=ruby"})
    _wputenv(line);
  SetDirect(L"=T:", L"T:\\ruby");
  process.KeepAdditions();
  process.Restore();
  EXPECT_EQ(EnvironmentLines(), host);

  _wputenv(L"HP_USER=host"), _wputenv(L"HP_gone=");
  for (int round = 0; round < 2; ++round) {
    const Lines later = EnvironmentLines();
    process.Save(), process.ApplyAdditions();
    EXPECT_EQ(CrtValue(L"HP_home") + CrtValue(L"HP_temp"), L"rubyruby");
    EXPECT_EQ(CrtValue(L"HP_own") + CrtValue(L"HP_USER"), L"hosthost");
    EXPECT_EQ(EnvironmentLines().size(), later.size() + 2);
    _wputenv(L"HP_home=script"), _wputenv(L"HP_temp=");
    process.Restore();
    EXPECT_EQ(EnvironmentLines(), later);
    EXPECT_EQ(CrtValue(L"HP_home") + CrtValue(L"HP_temp"), L"(none)(none)");
  }
}
