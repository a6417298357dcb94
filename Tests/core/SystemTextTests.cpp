// SPDX-License-Identifier: MIT
// The text operations that ask the system.
#define WIN32_LEAN_AND_MEAN
#define NOMINMAX
#include <gtest/gtest.h>
#include <windows.h>

#include "TestSupport.h"
#include "iLib/iClipboard.h"
#include "iLib/iCodePage.h"
#include "iLib/iModule.h"

using namespace std::string_literals;

TEST(SystemText, LoadsResources) {
  Reports reports;
  const std::string missing = "Unexpected error loading '77' string resource";
  String text("old");
  KeepModuleHandle(GetModuleHandleA(nullptr));
  EXPECT_EQ(Bytes(String(1u, "file", 3)), "file has 3 lines");
  EXPECT_EQ(String(2u).Length(), 1023u);
  EXPECT_TRUE(String(77u).IsEmpty());
  EXPECT_STREQ(text.FormatResource(1, "file", 4), "file has 4 lines");
  EXPECT_EQ(strlen(text.FormatResource(2)), 1024u);
  EXPECT_EQ(reports.Take(), 0);
  EXPECT_STREQ(text.FormatResource(77), "");
  EXPECT_EQ(reports.Take(missing), 1);
  EXPECT_TRUE(text.LoadResource(2));
  EXPECT_EQ(text.Length(), 1024u);
  EXPECT_FALSE(text.LoadResource(77));
  EXPECT_TRUE(text.IsEmpty());
  EXPECT_EQ(reports.Take(missing), 1);
}

TEST(SystemText, NamesErrors) {
  String text;
  u32 code = ERROR_FILE_NOT_FOUND;
  SetLastError(ERROR_ACCESS_DENIED);
  EXPECT_FALSE(text.FromError(code));
  String again;
  SetLastError(ERROR_FILE_NOT_FOUND);
  EXPECT_FALSE(again.FromLastError());
  EXPECT_EQ(Bytes(text), Bytes(again));
  EXPECT_GT(text.Length(), 5u);
  SetLastError(ERROR_ACCESS_DENIED);
  code = 0;
  text.FromError(code);
  EXPECT_EQ(code, u32{ERROR_ACCESS_DENIED});
  EXPECT_NE(Bytes(text), Bytes(again));
  code = 0x2FFFFFFF;
  text.FromError(code);
  EXPECT_EQ(Bytes(text), "Unexpected error performing the operation request!");
  SetLastError(0);
  EXPECT_FALSE(text.FromLastError());
  EXPECT_TRUE(text.IsEmpty());
}

TEST(SystemText, CapitalizesWords) {
  String text("hELLO wORLD-foo 3D x");
  text.CapitalizeWords();
  EXPECT_EQ(Bytes(text), "Hello World-Foo 3d X");
}

TEST(SystemText, ConvertsToUtf8AndBack) {
  const std::wstring wide = L"a\u00E9\u20AC\U0001F600";
  const std::string utf8 = "a\u00E9\u20AC\U0001F600";
  String text;
  text.FromUtf16ToUtf8(wide.c_str());
  EXPECT_EQ(Bytes(text), utf8);
  EXPECT_EQ(text.Text()[text.Length() + 1], 0);
  for (int round = 0; round < 3; ++round) {  // each from the string's own buffer
    text.FromUtf8ToUtf16(text.Text());
    ASSERT_EQ(text.Length(), wide.size() * 2);
    EXPECT_EQ(reinterpret_cast<const wchar_t*>(text.Text()), wide);
    text.FromUtf16ToUtf8(reinterpret_cast<const wchar_t*>(text.Text()));
    EXPECT_EQ(Bytes(text), utf8);
  }
  text.FromUtf16ToUtf8(wide.c_str(), 2);
  EXPECT_EQ(Bytes(text), "a\u00E9");
  text.FromUtf8ToUtf16(
      "\xFF"
      "abc");
  EXPECT_EQ(text.Length(), 104u);
  EXPECT_EQ(std::string(text.Text(), 2), "\0\0"s);
  text.FromUtf8ToUtf16("abc", 0);
  EXPECT_TRUE(text.IsEmpty());
}

TEST(SystemText, ConvertsToCodePages) {
  const std::wstring wide = L"a\u00E9";
  EXPECT_EQ(Bytes(String(wide.c_str(), 1252)), "a\xE9");
  EXPECT_EQ(Bytes(String(wide.c_str(), CP_UTF8)), "a\u00E9");
  EXPECT_TRUE(String(std::wstring(4096, 'x').c_str(), 1252).IsEmpty());
  EXPECT_EQ(String(std::wstring(4095, 'x').c_str(), 1252).Length(), 4095u);
  EXPECT_TRUE(String(static_cast<const wchar_t*>(nullptr), 1252).IsEmpty());
  String text;
  EXPECT_EQ(ActiveCodePage(), kUtf8CodePage);
  text.FromWide(wide.c_str());
  EXPECT_EQ(Bytes(text), Bytes(String(wide.c_str(), CP_ACP)));
  SetActiveCodePageFromKeyboard();
  EXPECT_EQ(ActiveCodePage(), GetACP());  // Wine takes both from the user's locale
  text.FromWide(wide.c_str(), 2);
  EXPECT_EQ(Bytes(text), Bytes(String(wide.c_str(), ActiveCodePage())));
  EXPECT_EQ(text.Text()[text.Length() + 1], 0);
  text.FromWide(wide.c_str(), 0);
  EXPECT_TRUE(text.IsEmpty());
}

TEST(SystemText, TerminatesConversionsWhileRoomLasts) {
  for (const int room : {2, 3, 8}) {
    std::string bytes(8, '#');
    EXPECT_EQ(Utf16ToMultiByte(L"ab", 2, bytes.data(), room, 1252), 2);
    EXPECT_EQ(bytes, ("ab" + std::string(std::min(room - 2, 2), 0) + "######").substr(0, 8));
    std::wstring wide(8, '#');
    EXPECT_EQ(MultiByteToUtf16("ab", 2, wide.data(), room, 1252), 2);
    EXPECT_EQ(wide, (L"ab" + std::wstring(std::min(room - 2, 4), 0) + L"######").substr(0, 8));
  }
  std::string bytes(8, '#');
  std::wstring wide(8, '#');
  EXPECT_EQ(Utf16ToMultiByte(L"abc", 3, bytes.data(), 2, 1252), 0);
  EXPECT_EQ(bytes.substr(0, 2), "\0\0"s);
  EXPECT_EQ(MultiByteToUtf16("abc", 3, wide.data(), 2), 0);
  EXPECT_EQ(wide.substr(2), L"######");
  EXPECT_EQ(MultiByteToUtf16("abc", -1, nullptr, 0), 4);
}

TEST(SystemText, ReadsTheClipboard) {
  String text("old");
  ASSERT_TRUE(OpenClipboard(nullptr));
  EmptyClipboard();
  CloseClipboard();
  EXPECT_FALSE(GetClipboardText(text));
  EXPECT_TRUE(text.IsEmpty());
  ASSERT_TRUE(OpenClipboard(nullptr));
  const HGLOBAL block = GlobalAlloc(GMEM_MOVEABLE, 8);
  memcpy(GlobalLock(block), "abc\0def", 8);
  GlobalUnlock(block);
  SetClipboardData(CF_TEXT, block);
  CloseClipboard();
  EXPECT_TRUE(GetClipboardText(text));
  EXPECT_EQ(Bytes(text), "abc");
}
