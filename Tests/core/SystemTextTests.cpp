// SPDX-License-Identifier: MIT
// The text operations that ask the system.
#define WIN32_LEAN_AND_MEAN
#define NOMINMAX
#include <windows.h>

#include "TestSupport.h"
#include "iLib/iClipboard.h"
#include "iLib/iCodePage.h"
#include "iLib/iModule.h"

using SystemText = CoreTest;

TEST_F(SystemText, LoadsResources) {
  const Text missing = "Unexpected error loading '77' string resource";
  String text("old");
  KeepModuleHandle(GetModuleHandleA(nullptr));
  EXPECT_EQ(Bytes(String(1u, "file", 3)), "file has 3 lines");
  EXPECT_TRUE(String(2u).Length() == 1023 && String(77u).IsEmpty());
  EXPECT_STREQ(text.FormatResource(1, "file", 4), "file has 4 lines");
  EXPECT_EQ(strlen(text.FormatResource(2)), 1024u);
  EXPECT_TRUE(text.LoadResource(2) && text.Length() == 1024 && TakeReports() == 0);
  EXPECT_TRUE(!text.LoadResource(77) && text.IsEmpty() && TakeReports(missing) == 1);
  EXPECT_TRUE(!*text.FormatResource(77) && text.IsEmpty() && TakeReports(missing) == 1);
}

TEST_F(SystemText, NamesErrors) {
  String missing, last;
  u32 code = ERROR_FILE_NOT_FOUND, none = 0, unknown = 0x2FFFFFFF;
  SetLastError(ERROR_ACCESS_DENIED);
  EXPECT_FALSE(missing.FromError(code) || last.FromError(none));
  EXPECT_TRUE(none == ERROR_ACCESS_DENIED && !last.Equals(missing.Text(), true));
  SetLastError(ERROR_FILE_NOT_FOUND);
  EXPECT_TRUE(!last.FromLastError() && last.Equals(missing.Text(), true) && last.Length() > 5);
  last.FromError(unknown);
  EXPECT_EQ(Bytes(last), "Unexpected error performing the operation request!");
  SetLastError(0);
  EXPECT_TRUE(!last.FromLastError() && last.IsEmpty());
}

TEST_F(SystemText, ConvertsToUtf8AndBack) {
  const std::wstring wide = L"a\u00E9\u20AC\U0001F600";
  const Text utf8 = "a\u00E9\u20AC\U0001F600";
  String text;
  text.FromUtf16ToUtf8(wide.c_str(), 5);
  for (int round = 0; round < 3; ++round) {  // from the string's own buffer
    EXPECT_EQ(Text(text.Text(), text.Length() + 2), utf8 + "\0\0"s);
    text.FromUtf8ToUtf16(text.Text());
    EXPECT_EQ(text.Length(), wide.size() * 2);
    EXPECT_EQ(reinterpret_cast<const wchar_t*>(text.Text()), wide);
    text.FromUtf16ToUtf8(reinterpret_cast<const wchar_t*>(text.Text()));
  }
  text.FromUtf8ToUtf16("\xFFzzz");
  EXPECT_TRUE(text.Length() == 104 && text.Text()[0] == 0 && text.Text()[1] == 0);
  text.FromUtf8ToUtf16("abc", 0);
  EXPECT_TRUE(text.IsEmpty());
}

TEST_F(SystemText, ConvertsToCodePages) {
  const wchar_t* const wide = L"hELLO W\u00D6RLD-foo 3D";
  EXPECT_EQ(String(std::wstring(4095, 'x').c_str(), 1252).Length(), 4095u);
  EXPECT_TRUE(String(std::wstring(4096, 'x').c_str(), 1252).IsEmpty());
  EXPECT_EQ(ActiveCodePage(), kUtf8CodePage);
  String text;
  text.FromWide(wide);
  EXPECT_EQ(Bytes(text), Bytes(String(wide, CP_ACP)));
  SetActiveCodePageFromKeyboard();
  EXPECT_EQ(ActiveCodePage(), GetACP());  // Wine takes both from the user's locale
  text.FromWide(wide, 11);
  EXPECT_EQ(Bytes(text), Bytes(String(wide, ActiveCodePage())).substr(0, 11));
  text = "hELLO wORLD-foo 3D x", text.CapitalizeWords();
  EXPECT_EQ(Bytes(text), "Hello World-Foo 3d X");
}

TEST_F(SystemText, TerminatesConversionsWhileRoomLasts) {
  for (const int room : {1, 2, 3, 8}) {
    const int count = room > 1 ? 2 : 0;
    Text bytes(8, '#');
    std::wstring wide(8, '#');
    EXPECT_EQ(Utf16ToMultiByte(L"ab", 2, bytes.data(), room, 1252), count);
    EXPECT_EQ(MultiByteToUtf16("ab", 2, wide.data(), room, 1252), count);
    EXPECT_EQ(std::count(bytes.begin(), bytes.end(), 0), count ? std::min(room - 2, 2) : 1);
    EXPECT_EQ(std::count(wide.begin(), wide.end(), 0), count ? std::min(room - 2, 4) : 0);
  }
}

TEST_F(SystemText, ReadsTheClipboard) {
  String text("old");
  ASSERT_TRUE(OpenClipboard(nullptr) && EmptyClipboard() && CloseClipboard());
  EXPECT_TRUE(!GetClipboardText(text) && text.IsEmpty());
  const HGLOBAL block = GlobalAlloc(GMEM_MOVEABLE, 8);
  memcpy(GlobalLock(block), "abc\0def", 8);
  GlobalUnlock(block);
  ASSERT_TRUE(OpenClipboard(nullptr) && SetClipboardData(CF_TEXT, block) && CloseClipboard());
  EXPECT_TRUE(GetClipboardText(text) && Bytes(text) == "abc");
}
