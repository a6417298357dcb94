// SPDX-License-Identifier: MIT
// Macro files as other disks and another C runtime than this system's would give them.
#include <algorithm>

#include "Imports.h"
#include "TortureTest.h"

class MacroFileTest : public TortureTest {
 protected:
  // What the engine gets of a macro while the module has `replacement` for one of its imports.
  template <class Function>
  std::wstring SourceWith(const char* function, Function* replacement, const std::string& macro) {
    source.clear();
    WriteBytes(macroPath, macro);
    void* const original = ReplaceImport(dll, function, reinterpret_cast<void*>(replacement));
    EXPECT_TRUE(original) << function << " is not what the module calls";
    Run();
    ReplaceImport(dll, function, original);
    return source;
  }

  static inline DWORD left;  // of the file
  static BOOL WINAPI ReadPart(HANDLE file, LPVOID bytes, DWORD size, LPDWORD got, LPOVERLAPPED) {
    EXPECT_EQ(left, size);
    const BOOL read = ReadFile(file, bytes, std::min<DWORD>(size, 3), got, nullptr);
    left -= *got;
    return read;
  }
  static BOOL WINAPI ReadNothing(HANDLE, LPVOID, DWORD, LPDWORD got, LPOVERLAPPED) {
    return *got = 0, TRUE;
  }
  static inline int textsFreed;
  static void WINAPI FreeText(BSTR text) {
    textsFreed += text != nullptr;
    SysFreeString(text);
  }
  static size_t ConvertPart(wchar_t* units, const char* bytes, size_t) {
    return std::copy_n(bytes, 3, units), static_cast<size_t>(-1);
  }
};

TEST_F(MacroFileTest, ComesInPartsOrEndsEarly) {
  WatchMemory(dll);
  const int before = LiveBlocks();
  left = 10;
  EXPECT_TRUE(SourceWith("ReadFile", ReadPart, "0123456789") == L"0123456789");
  EXPECT_TRUE(SourceWith("ReadFile", ReadNothing, "0123456789").empty());
  EXPECT_EQ(before, LiveBlocks());
}

// The bytes before the one that cannot be converted are there, and no terminator.
TEST_F(MacroFileTest, IsConvertedHalfWay) {
  WatchMemory(dll);  // which fills new blocks
  EXPECT_TRUE(SourceWith("mbstowcs", ConvertPart, "abc\xFF and more") == L"abc");
}

TEST_F(MacroFileTest, ThatIsWrongHasTextsToFree) {
  textsFreed = 0;
  results = {{"ParseScriptText", E_FAIL}};
  EXPECT_TRUE(SourceWith("SysFreeString", FreeText, "x = = 1") == L"x = = 1");
  results.clear();
  EXPECT_EQ(3, textsFreed) << "source, description and help file";
}
