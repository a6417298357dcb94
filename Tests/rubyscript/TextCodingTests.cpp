// SPDX-License-Identifier: MIT
// What an 8-bit host answers comes back as its bytes, whatever the system's code page.
#include "../../Scripting/rubyscript/TextCoding.h"

#include <gtest/gtest.h>

#include <string>

static std::wstring Widen(UINT codePage, const std::string& bytes) {
  std::wstring wide(bytes.size(), L'\0');
  const int length = static_cast<int>(bytes.size());
  wide.resize(MultiByteToWideChar(codePage, 0, bytes.data(), length, wide.data(), length));
  return wide;
}

static std::string BytesOf(UINT codePage, const std::wstring& text) {
  std::string bytes(text.size() * kMostBytesPerUnit, '\0');
  bytes.resize(BytesFromAnsi(codePage, text.data(), text.size(), bytes.data()));
  return bytes;
}

TEST(TextCodingTest, EveryByteOfEveryCodePageComesBack) {
  std::string all;
  for (int byte = 1; byte < 256; ++byte) all += static_cast<char>(byte);
  for (UINT page : {1250, 1251, 1252, 1253, 1254, 1255, 1256, 1257, 1258, 874, 437, 850, 28591}) {
    ASSERT_TRUE(IsValidCodePage(page)) << page;
    EXPECT_EQ(all, BytesOf(page, Widen(page, all))) << page;
  }
  // Of several bytes a character: what was a whole character before it was widened.
  const std::string utf8 = "\xC3\xA4 \xE2\x82\xAC \xE6\x97\xA5 \xF0\x9F\x98\x80";
  EXPECT_EQ(utf8, BytesOf(CP_UTF8, Widen(CP_UTF8, utf8)));
  const std::string shiftJis = "\x93\xFA\x96\x7B a";
  EXPECT_EQ(shiftJis, BytesOf(932, Widen(932, shiftJis)));
  // A unit that the page cannot have made: none that only looks alike.
  EXPECT_EQ("?", BytesOf(1252, L"\x0100"));
}
