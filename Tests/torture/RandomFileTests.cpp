// SPDX-License-Identifier: MIT
// Random description files and random records for `version`: only the record is written, each of its
// texts ends inside of its field, and the next run is right.
#include "TortureTest.h"

class RandomFileTest : public TortureTest {
 protected:
  // A description of known and unknown keys, or bytes of any kind.
  std::string Description() {
    static const char* const keys[] = {
        "Language",        "NoCase", "Extension", "MacroBegin",  "MacroEnd", "FunctionPrint",
        "FunctionPrefix",  "CRLF",   "LineFeed",  "Tick",        "Quote",    "FixCRLF",
        "FunctionPostfix", "Enter",  "Options",   "FixDelimiter"};
    static const char* const starts[] = {
        "[Options]\r\n",    "[options]\n", "", "[Other]\r\n", "\xEF\xBB\xBF[Options]\r\n",
        "\xFF\xFE[\0O\0p\0"};
    std::string text = starts[OneIn(3) ? Below(6) : 0];
    for (unsigned lines = OneIn(50) ? Below(2000) : Below(20); lines > 0; --lines)
      text += (OneIn(8) ? Bytes(40) : keys[Below(16)]) + (OneIn(16) ? Bytes(3) : "="s) +
              (OneIn(4) ? "JScript" : Bytes(700)) + (OneIn(16) ? "\\n\0"s : "\r\n"s);
    return text;
  }

  std::string Folder() {
    switch (Below(4)) {
      case 0:
        return testFolder + "\\host" + std::to_string(Below(20)) + (OneIn(2) ? "/" : " ");
      case 1:
        return "?:\\" + Bytes(300);
      case 2:
        return testFolder;
      default:
        return "";
    }
  }

  // Calls `version` with a record whose memory ends after `bytes`.
  void Fill(unsigned size, unsigned layout, unsigned bytes) {
    static void* const pages = VirtualAlloc(nullptr, 8192, MEM_RESERVE, PAGE_NOACCESS);
    char* const page = static_cast<char*>(VirtualAlloc(pages, 4096, MEM_COMMIT, PAGE_READWRITE));
    char* const record = page + 4096 - bytes;
    memset(page, 0xA5, 4096);
    for (unsigned i = 0; i < bytes; ++i) record[i] = static_cast<char>(random());
    memcpy(record, &size, 4);
    if (bytes >= 8) memcpy(record + 4, &layout, 4);
    const std::string before(record, bytes), folder = Folder();
    boxes = 0;
    const bool filled =
        CallExport<bool>(dll, "version", record, OneIn(8) ? nullptr : folder.c_str());
    EXPECT_EQ(size == 392, filled);
    EXPECT_EQ(std::string(4096 - bytes, '\xA5'), std::string(page, 4096 - bytes)) << "in front";
    EXPECT_EQ(!filled || (layout != 0 && layout != 77), boxes);
    if (!filled) {
      EXPECT_EQ(before, std::string(record, bytes)) << "untouched";
      return;
    }
    int offset = 8;
    for (int width : {56, 21, 76, 51, 41, 41, 41, 11, 11, 11, 11, 11}) {
      EXPECT_LT(strnlen(record + offset, width), static_cast<size_t>(width)) << "at " << offset;
      offset += width;
    }
    EXPECT_EQ("()", std::string(record + offset, 2));
  }
};

TEST_F(RandomFileTest, Descriptions) {
  Repeat("random description files", Rounds(100000, 500), 100, [&](int) {
    WriteBytes(testFolder + "\\xMacroWSH.qwsh", Description());
    Fill(392, OneIn(2) ? 0 : 77, 392);
    if (OneIn(10)) Run();
  });
}

TEST_F(RandomFileTest, Records) {
  Repeat("random records", Rounds(100000, 700), 100, [&](int) {
    const unsigned size = OneIn(4) ? OneIn(2) ? random() : Below(1000) : 392;
    const unsigned bytes = size == 392 ? 392 : 4 + Below(389);
    Fill(size, OneIn(2) ? 77 * Below(2) : random(), bytes);
  });
}
