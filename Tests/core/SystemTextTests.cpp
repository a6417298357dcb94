// SPDX-License-Identifier: MIT
// The text operations that ask the system.
#define WIN32_LEAN_AND_MEAN
#define NOMINMAX
#include <windows.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>

#include "../module/Imports.h"
#include "TestSupport.h"
#include "cLib/cFilo.h"
#include "cLib/cReport.h"
#include "cLib/cStop.h"
#include "iLib/iClipboard.h"
#include "iLib/iCodePage.h"
#include "iLib/iModule.h"
#include "iLib/iProfile.h"
#include "iLib/iProfileSection.h"
#include "xLib/xApp.h"
#include "xLib/xScriptInfo.h"

using SystemText = CoreTest;

static int breaks = 0;

TEST_F(SystemText, LoadsResources) {
  const Text missing = "Unexpected error loading '77' string resource";
  String text("old");
  KeepModuleHandle(nullptr);
  EXPECT_FALSE(IsInModule(&breaks));
  KeepModuleHandle(GetModuleHandleA(nullptr));
  EXPECT_TRUE(IsInModule(&breaks) && !IsInModule(&text));
  EXPECT_EQ(Bytes(String(1u, "file", 3)), "file has 3 lines");
  EXPECT_TRUE(String(2u).Length() == 1023 && String(77u).IsEmpty() && Bytes(String(3u)) == "x");
  EXPECT_EQ(String(77u).Capacity(), 5u) << "nothing to format";
  String loaded;
  EXPECT_TRUE(loaded.LoadResource(3) && loaded.Capacity() == 1030) << "room for the longest";
  EXPECT_STREQ(text.FormatResource(1, "file", 4), "file has 4 lines");
  EXPECT_STREQ(text.FormatResource(3), "x");
  EXPECT_TRUE(text.LoadResource(3) && text.Length() == 1 && Text(text.Text()) == "x");
  EXPECT_EQ(strlen(text.FormatResource(2)), 1024u);
  EXPECT_TRUE(text.LoadResource(2) && text.Length() == 1024 && TakeReports() == 0);
  EXPECT_TRUE(!text.LoadResource(77) && text.IsEmpty() && TakeReports(missing) == 1);
  text = "old";
  EXPECT_TRUE(!*text.FormatResource(77) && text.IsEmpty() && TakeReports(missing) == 1);
}

TEST_F(SystemText, NamesErrors) {
  String missing, last;
  u32 code = ERROR_FILE_NOT_FOUND, none = 0, unknown = 0x2FFFFFFF;
  SetLastError(ERROR_ACCESS_DENIED);
  EXPECT_FALSE(missing.FromError(code) || last.FromError(none));
  EXPECT_TRUE(none == ERROR_ACCESS_DENIED && !last.Equals(missing.Text(), true));
  EXPECT_EQ(Bytes(last).substr(0, 6), "Access") << "in English";
  SetLastError(ERROR_FILE_NOT_FOUND);
  EXPECT_TRUE(!last.FromLastError() && last.Equals(missing.Text(), true) && last.Length() > 5);
  EXPECT_TRUE(!last.FromError(unknown) && last.EndsWith("performing the operation request!", true));
  String cut;
  FailAllocation(2);  // the one for the longer text
  EXPECT_TRUE(!cut.FromError(unknown) && FailAllocation(0));
  EXPECT_STREQ(cut.Text(), "Unexpected, unknown error message!");
  SetLastError(0);
  EXPECT_TRUE(!last.FromLastError() && last.IsEmpty());
}

TEST_F(SystemText, Converts) {
  const std::wstring wide = L"a\u00E9\u20AC\U0001F600";
  String text;
  text.FromUtf16ToUtf8(wide.c_str(), 5);
  for (int round = 0; round < 3; ++round) {  // from the string's own buffer
    EXPECT_EQ(Text(text.Text(), text.Length() + 2), "a\u00E9\u20AC\U0001F600\0\0"s);
    text.FromUtf8ToUtf16(text.Text());
    const auto* units = reinterpret_cast<const wchar_t*>(text.Text());
    EXPECT_TRUE(text.Length() == wide.size() * 2 && units == wide);
    text.FromUtf16ToUtf8(units);
  }
  String own("abc");
  own = "1234567", own.FromUtf8ToUtf16(own.Text() + 1, 1000);
  EXPECT_EQ(own.Length(), 14u) << "up to the end of its block";
  String utf8, narrow, utf16;
  utf8.FromUtf16ToUtf8(L"ab"), narrow.FromWide(L"ab"), utf16.FromUtf8ToUtf16("ab");
  EXPECT_TRUE(utf8.Capacity() == 29 && narrow.Capacity() == 18 && utf16.Capacity() == 211);
  EXPECT_TRUE((utf16.FromUtf8ToUtf16("a"), utf16.Length() == 2));
  text.FromUtf8ToUtf16("\xFFzzz");
  EXPECT_TRUE(text.Length() == 104 && text.Text()[0] == 0 && text.Text()[1] == 0);
  for (const auto& [none, n] : {std::pair("abc", 0), {"abc", -2}, {nullptr, 5}})
    EXPECT_TRUE((text = "old", text.FromUtf8ToUtf16(none, n), text.IsEmpty()));
  EXPECT_TRUE((text = "old", text.FromWide(L"abc", -2), text.IsEmpty()));
  for (const u32 n : {4095u, 4096u})
    EXPECT_EQ(String(std::wstring(n, 'x').c_str(), 1252).Length(), n == 4095 ? n : 0);
  EXPECT_EQ(ActiveCodePage(), kUtf8CodePage);
  SetActiveCodePageFromKeyboard();
  EXPECT_EQ(ActiveCodePage(), GetACP());  // Wine takes both from the user's locale
  text = "hELLO wORLD-foo 3D x", text.CapitalizeWords();
  EXPECT_EQ(Bytes(text), "Hello World-Foo 3d X");
  for (const int size : {1, 2})
    for (const int room : {1, 2, 3, 8}) {
      const int count = room < size ? 0 : size;
      Text bytes(8, '#');
      std::wstring units(8, '#');
      EXPECT_EQ(Utf16ToMultiByte(L"ab", size, bytes.data(), room, 1252), count);
      EXPECT_EQ(MultiByteToUtf16("ab", size, units.data(), room, 1252), count);
      EXPECT_EQ(std::count(bytes.begin(), bytes.end(), 0), count ? std::min(room - size, 2) : 1);
      EXPECT_EQ(std::count(units.begin(), units.end(), 0), count ? std::min(room - size, 4) : 0);
    }
}

TEST_F(SystemText, StaysAsItWasWithoutMemory) {
  static const std::wstring wide(100, L'x');
  static const Text narrow(100, 'x');
  using Change = void (*)(String&);
  for (const Change change : std::initializer_list<Change>{
           [](String& s) { s.FromWide(wide.c_str()); },
           [](String& s) { s.FromUtf16ToUtf8(wide.c_str()); },
           [](String& s) { s.FromUtf8ToUtf16(narrow.c_str()); },
           [](String& s) { s.FromUtf8ToUtf16(s.Text()); },
           [](String& s) { s.FromUtf16ToUtf8(reinterpret_cast<const wchar_t*>(s.Text()), 1); },
           [](String& s) { s.FormatResource(2); },
           [](String& s) { EXPECT_FALSE(s.LoadResource(2)); },
       }) {
    String text("abc");
    FailAllocation(1), change(text);
    EXPECT_TRUE(FailAllocation(0) && Bytes(text) == "abc");
  }
  for (const int n : {1, 2}) {
    FailAllocation(n);
    EXPECT_STREQ(String(wide.c_str(), 1252).Text(), "");
  }
  FailAllocation(1);
  EXPECT_STREQ(String(1u, "file", 3).Text(), "");
}

TEST_F(SystemText, ReadsTheClipboard) {
  String text("old");
  ASSERT_TRUE(OpenClipboard(nullptr) && EmptyClipboard() && CloseClipboard());
  EXPECT_TRUE(!GetClipboardText(text) && text.IsEmpty());
  const HGLOBAL block = GlobalAlloc(GMEM_MOVEABLE, 8);
  memcpy(GlobalLock(block), "abc\0def", 8), GlobalUnlock(block);
  ASSERT_TRUE(OpenClipboard(nullptr) && SetClipboardData(CF_TEXT, block) && CloseClipboard());
  EXPECT_TRUE(GetClipboardText(text) && Bytes(text) == "abc");
  EXPECT_FALSE(CloseClipboard()) << "still open";
  EXPECT_EQ(GlobalFlags(block) & GMEM_LOCKCOUNT, 0u) << "still locked";
}

// --- The application and the description file ----------------------------------------------------

static LONG CALLBACK SkipBreak(EXCEPTION_POINTERS* fault) {
  if (fault->ExceptionRecord->ExceptionCode != EXCEPTION_BREAKPOINT)
    return EXCEPTION_CONTINUE_SEARCH;
  ++breaks, ++fault->ContextRecord->Eip;
  return EXCEPTION_CONTINUE_EXECUTION;
}

static Text shown;  // boxes and written keys
static int WINAPI Box(HWND owner, LPCSTR text, LPCSTR caption, UINT flags) {
  shown += Text(owner ? "owned " : "") + caption + " " + std::to_string(flags) + ": " + text + "\n";
  if (flags & MB_YESNO) EXPECT_FALSE(AskBreakIntoDebugger("again", 1));
  return IDYES;
}

TEST_F(SystemText, AsksAboutFailedChecks) {
  const Replacement box(GetModuleHandleA(nullptr), "MessageBoxA", Box);
  for (const bool runs : {true, false})
    EXPECT_EQ((SetRunsInApplication(runs), RunsInApplication()), runs);
  PostQuitMessage(42);
  EXPECT_TRUE(AskBreakIntoDebugger("a.cpp", 7));
  MSG quit = {};
  EXPECT_TRUE(PeekMessageA(&quit, nullptr, WM_QUIT, WM_QUIT, PM_REMOVE) && quit.wParam == 42);
  VerifyMainApplication(&quit, "b.cpp", 8);
  SetMainWindow(GetDesktopWindow());
  void* const debugger = AddVectoredExceptionHandler(1, SkipBreak);
  VerifyMainApplication(nullptr, "b.cpp", 8);
  RemoveVectoredExceptionHandler(debugger);
  SetMainWindow(nullptr);
  EXPECT_EQ(breaks, 1);
  const Text flags = std::to_string(MB_YESNO | MB_ICONWARNING | MB_TASKMODAL | MB_SETFOREGROUND);
  const Text question = "\nDo you wish to attempt to break into the debugger?\n";
  const Text failure = "No main application object has been defined!";
  EXPECT_EQ(std::exchange(shown, ""), "Assertion Failed " + flags + ": ASSERT: File a.cpp, Line 7" +
                                          question + "owned Assertion Failed " + flags +
                                          ": ASSERT: File b.cpp, Line 8" + question +
                                          "Exception 16: " + failure + "\n");
  EXPECT_EQ(TakeReports("\"b.cpp\" (8)      " + failure), 1);
}

static Text failing;  // the key that cannot be written
static BOOL WINAPI WriteKey(LPCSTR section, LPCSTR key, LPCSTR text, LPCSTR) {
  shown += section + Text(".") + key + "=" + text + "|";
  return key != failing;
}

TEST_F(SystemText, WritesTheDescription) {
  const Replacement write(GetModuleHandleA(nullptr), "WritePrivateProfileStringA", WriteKey);
  Profile profile("?:\\no\\x.ini");
  xScriptInfo info(true);
  info.UnescapeTemplates(), info.NoCase = info.FixDelimiter = true;
  for (const char* key : {"", "FixCRLF", "FixDelimiter"}) {
    shown.clear(), failing = key;
    EXPECT_EQ(info.Write(profile), failing != "FixDelimiter") << "the last write's result";
    EXPECT_EQ(shown, R"(Options.Language=Object Rexx|Options.Extension=rex|)"
                     "Options.MacroBegin=function key_macro()\n{|"
                     "Options.MacroEnd=}\n\nkey_macro()   // run the macro|"
                     "Options.FunctionPrint=\twrite(\"%s\")|Options.FunctionPrefix=|"
                     R"(Options.FunctionPostfix=;|Options.Enter=\n|Options.CRLF=\\n|)"
                     R"(Options.LineFeed=\\r|Options.Tick='|Options.Quote=\"|)"
                     "Options.FixCRLF=0|Options.FixDelimiter=1|");
  }
  shown.clear();
}

TEST_F(SystemText, ReadsTheDescriptionWithAnyDefaults) {
  const Text path = testing::TempDir() + "core-description.ini";
  Profile profile(path.c_str());
  DeleteFileA(path.c_str());
  xScriptInfo defaults(false), info(true);
  EXPECT_FALSE(defaults.NoCase || defaults.FixCRLF || defaults.FixDelimiter);
  EXPECT_TRUE(!defaults.OpenBracket && !defaults.CloseBracket && defaults.Tick.IsEmpty());
  defaults.NoCase = defaults.FixCRLF = defaults.FixDelimiter = true;
  defaults.OpenBracket = '<', defaults.CloseBracket = '>', defaults.Description = "any";
  for (const char* value : {"", "'", "\"q\"", "d ", " d\t", "line\n", "\\t\xE9", "?"}) {
    defaults.MacroEnd = defaults.Tick = value;
    info.Read(profile, defaults);
    String expected;
    profile.ReadString(expected, "Options", "Tick", value, false);
    EXPECT_EQ(Bytes(info.Tick), Bytes(expected));
    info.Unescape(expected);
    EXPECT_EQ(Bytes(info.MacroEnd), Bytes(expected));
    EXPECT_TRUE(info.NoCase && info.FixCRLF && info.FixDelimiter && info.Language.IsEmpty());
    EXPECT_EQ(Bytes(info.Description) + info.OpenBracket + info.CloseBracket, "any<>");
  }
  info.NoCase = true, info.FunctionPrefix = "x", info.SetDefaults();
  EXPECT_FALSE(info.NoCase || info.FixCRLF || info.FixDelimiter);
  EXPECT_EQ(
      Bytes(info.Description) + info.OpenBracket + info.CloseBracket + Bytes(info.FunctionPrefix),
      "Object Rexx WSH Version 1.40()");
  String value;
  profile.WriteString("old", "Options", "Key");
  for (const char* expected : {"old", "none"}) {
    EXPECT_TRUE(profile.ReadString(value, "Options", "Key", "none", true));
    EXPECT_EQ(Bytes(value), expected) << "the first one removes the key";
  }
  EXPECT_FALSE(profile.ReadString(value, "Options", "Nothing", "", false));
  for (const u32 n : {511u, 512u}) {
    profile.WriteString(Text(n, 'x').c_str(), "Options", "Tick");
    ProfileSection(profile, "Options").ReadString(value, "Tick", "");
    EXPECT_EQ(value.Length(), 511u);
  }
  for (int i = 0; i < 9; ++i)
    profile.WriteString(Text(500, 'x').c_str(), "Long", ("Key" + std::to_string(i)).c_str());
  profile.WriteString("last", "Long", "Tick");
  EXPECT_TRUE(ProfileSection(profile, "Long").ReadString(value, "Tick", "")) << "a long section";
  std::ofstream(path) << "[Options]\na=\nT\nT=x\n";
  EXPECT_FALSE(ProfileSection(profile, "Options").ReadString(value, "T", "")) << "T has no sign";
  EXPECT_FALSE(ProfileSection(profile, "Options").ReadString(value, "None", nullptr));
  DeleteFileA(path.c_str());
}

// What each unit reports: level and source; the line is the real one but for one.
TEST_F(SystemText, ReportsWithLevelSourceAndLine) {
  const Text path = testing::TempDir() + "core-levels-" + std::to_string(GetCurrentProcessId());
  Array<Element> array;
  SetLogFile(path.c_str());
  array.Grow(0), String("a").Reserve(0), String().LoadResource(77), FIFO<Element>(0);
  StopMacro();
  SetLogFile(nullptr);
  Text log, line;
  for (std::ifstream file(path); std::getline(file, line);) {
    const size_t number = line.find(" (") + 2;
    EXPECT_GT(atoi(line.c_str() + number), 20) << line;
    log += line.substr(27, number - 29) + "|";
  }
  EXPECT_EQ(log,
            "ASSERT    \"cArray\"|ASSERT    \"cString\"|TRACE     \"cString\"|"
            "ASSERT    \"cFilo\"|ASSERT    \"cScript\"|");
  DeleteFileA(path.c_str());
}

// Sections of entries that are put together at random, in each encoding: read in one pass they have
// what the profile functions read key by key. With SCRIPTRUBY_TORTURE=1 many of them.
TEST_F(SystemText, ReadsASectionAsTheProfileFunctionsDo) {
  const std::vector<Text> keys = {"Tick", "tICK", "Tic", "Ticks", "Fix",
                                  "T",    "AZ",   "az",  "\xC4",  "T\xC9k"};
  const std::vector<Text> pieces = {"\"", "'",     "\"a\"",       " ",    "  ",         "\t",
                                    "=",  ";",     "x",           "0",    "1",          "-1",
                                    "7",  "\\n",   "00",          "\x80", "\xE9",       "]",
                                    "[",  "Tick=", "12345678901", "yes",  "4294967296", "?"};
  const std::vector<Text> tame = {"x", "'", "\"", "0", "12", " ", "=", ";", "a b"};
  const std::vector<Text> ends = {"\r\n", "\n", "\r\n\r\n", " \r\n"};
  const std::vector<Text> defaults = {"",       "d",    "d ",    " d\t",        "'",
                                      "line\n", "\xE9", "\"q\"", Text(600, 'x')};
  const auto any = [&](const std::vector<Text>& list) { return list[Below(list.size())]; };
  bool wild = false;
  const auto entry = [&] {
    Text line = !wild || Below(8) ? "" : any(pieces);
    line += (wild ? any(keys) : keys[Below(5)]) + (!wild || Below(6) ? "" : any(pieces)) +
            (!wild || Below(9) ? "=" : "");
    for (u32 i = Below(5); i-- > 0;) line += any(wild ? pieces : tame);
    return line + (Below(40) ? "" : Text(490 + Below(40), 'y')) + any(ends);
  };
  const int sections = std::getenv("SCRIPTRUBY_TORTURE") ? 100000 : 600;
  int kept = 0;
  for (int i = 0; i < sections && !HasFailure(); ++i) {
    wild = Below(2);
    Text text = Below(5) ? "" : entry() + "[Other]\r\n" + entry();
    text += Below(9) ? "[Options]\r\n" : "[oPTIONS ]\r\n";
    for (u32 lines = Below(i % 100 ? 6 : 400); lines-- > 0;) text += entry();
    if (Below(4) == 0) text += "[Options]\r\n" + entry() + entry();
    if (Below(7) == 0) {
      // The Kelvin sign, which is a small k to whom ignores case, and a wide letter.
      std::wstring wide = L"\xFEFF";
      for (char ch : text)
        wide += ch == 'k' && Below(2) ? L'\x212A'
                : ch == 'x'           ? L'\xFF34'
                                      : static_cast<wchar_t>(ch & 0xFF);
      text.assign(reinterpret_cast<const char*>(wide.data()), wide.size() * 2);
    } else if (Below(7) == 0) {
      text = "\xEF\xBB\xBF" + text;
    }
    const Text path = testing::TempDir() + "core-section-" + std::to_string(GetCurrentProcessId()) +
                      "-" + std::to_string(i) + ".ini";
    if (i % 50) std::ofstream(path, std::ios::binary) << text;
    const Profile profile(i % 51 ? path.c_str() : "");
    const ProfileSection section(profile, "Options");
    std::vector<Text> read;
    for (const Text& key : keys) {
      const Text other = any(defaults);
      String expected, value;
      const bool some = profile.ReadString(expected, "Options", key.c_str(), other.c_str(), false);
      EXPECT_EQ(section.ReadString(value, key.c_str(), other.c_str()), some);
      EXPECT_EQ(Bytes(value), Bytes(expected)) << key << " in\n" << text;
      read.push_back(Bytes(expected));
      for (bool flag : {false, true})
        EXPECT_EQ(section.ReadBool(key.c_str(), flag),
                  profile.ReadBool("Options", key.c_str(), flag))
            << key << " in\n"
            << text;
    }
    DeleteFileA(path.c_str());
    for (size_t k = 0; k < keys.size(); ++k) {
      String value;
      kept += section.ReadString(value, keys[k].c_str(), "") && Bytes(value) == read[k];
    }
  }
  EXPECT_GT(kept, sections / 6) << "values that came from the one pass";
  std::printf("figure: %d sections, %d values beyond doubt in the one pass, no difference\n",
              sections, kept);
}
