// SPDX-License-Identifier: MIT
// `version`: the record's checks, its content, its description file, and the folders.

#include "ModuleTest.h"
// sddl.h must come after windows.h.
#include <sddl.h>

namespace fs = std::filesystem;

using VersionTest = ModuleTest;

// Calls `version` with a record of this header whose memory ends after `bytes`, and logs what it
// then holds besides zeros: offset and text.
static bool Fill(unsigned size = 392, unsigned layout = 77, unsigned bytes = 392,
                 const std::string& path = "", HMODULE module = dll) {
  static void* const pages = VirtualAlloc(nullptr, 8192, MEM_RESERVE, PAGE_NOACCESS);
  VirtualAlloc(pages, 4096, MEM_COMMIT, PAGE_READWRITE);
  char* const page = static_cast<char*>(pages);
  char* const record = page + 4096 - bytes;
  memset(page, 'x', 4096);
  memcpy(record, &size, 4);
  if (bytes >= 8) memcpy(record + 4, &layout, 4);
  const bool filled = CallExport<bool>(module, "version", record, path.c_str());
  Log(filled ? "version filled the record" : "version failed");
  EXPECT_EQ(std::string(4096 - bytes, 'x'), std::string(page, record)) << "written before it";
  for (unsigned i = 0; filled && i < bytes; ++i)
    if (record[i] && (i == 0 || !record[i - 1]))
      Log("  " + std::to_string(i) + ": " +
          std::string(record + i, strnlen(record + i, bytes - i)));
  return filled;
}

// With the DLL in a file whose full name is that long.
static void FillByFileOf(size_t length) {
  const size_t rest = length - testFolder.size() - strlen("\\\\scriptruby.dll");
  const HMODULE other = LoadModule(testFolder + "\\" + std::string(rest, 'd'));
  Fill(392, 77, 392, "", other);
  FreeLibrary(other);
}

TEST_F(VersionTest, HeadersAndHostFolders) {
  // The record ends right after its header and a name without terminator.
  for (unsigned size = 0; size <= 1024; size += size < 390 || size > 394 ? 13 : 1) {
    muted = size % 391 != 0;
    if (size != 392) EXPECT_FALSE(Fill(size, 77, 12)) << size;
  }
  muted = false;
  Fill(393);
  Fill(0, 77, 4);
  Fill(392, 77, 100);  // ends early
  EXPECT_FALSE(CallExport<bool>(dll, "version", nullptr, nullptr));
  Fill(392, 0);
  Fill(392, 5);
  // A host folder that is missing is made; one that cannot be is passed over.
  const std::string folder = testFolder + "\\host";
  for (const std::string& path :
       {"  " + folder + "/data ", ""s, "?:\\no"s, "\\\\"s, testFolder, std::string(40000, 'x')})
    Fill(392, 77, 392, path);
  EXPECT_TRUE(fs::is_directory(folder + "\\data"));
  muted = true;
  for (int i = 0; i < 20; ++i) Fill(392, 77, 392, testFolder);
}

TEST_F(VersionTest, DescriptionFiles) {
  const std::string x600(600, 'x'), x75(75, 'x');
  FillByFileOf(254);  // 255 are too many, and reported
  fs::remove(testFolder + "\\xMacroWSH.qwsh");
  Fill();
  for (const std::string& lines :
       {""s, "Language=Object Rexx\r\n[Other]\r\nExtension=no"s,
        "Language=1234567890123456789012345"s, "Language="s,
        "MacroBegin=a\\n\\tb\\r\\\\n\r\nFunctionPrint=\\n\\n%s\r\nFunctionPrefix=\r\n"
        "FunctionPostfix=\\t;\r\nMacroEnd=\\r\\nend"s,
        "CRLF=\\\\n\r\nEnter=\\t\r\nTick=\\n\r\nLineFeed=\r\nQuote=\"q\"\r\n"
        "FunctionPrefix=\\tq.\\n"s,
        "MacroBegin=" + x75 + "y\r\nQuote=" + x75 + "\r\nFunctionPrint=" + x75,
        "MacroBegin=" + x75 + "\r\nExtension=" + x75 + "\r\nMacroEnd=" + x600 +
            "\r\nFunctionPrefix=" + x75 + "\r\nFunctionPostfix=" + x600,
        "MacroEnd=" + std::string(511, 'y')})
    Describe(lines), Fill();
}

TEST_F(VersionTest, DuringARunTheRunningEngineAnswers) {
  FillByFileOf(255);
  Script([&] {
    Describe("Language=Changed");
    Fill();  // as the description was read for the run
    // A host that is current but names no engine gets a new one.
    void* engine = std::exchange(host.Engine(), nullptr);
    Fill();
    host.Engine() = engine;
  });
}

// Gives everybody these rights to the folder and nothing else, by its security descriptor.
static void Permit(const std::string& folder, const std::string& rights) {
  PSECURITY_DESCRIPTOR descriptor = nullptr;
  ASSERT_TRUE(ConvertStringSecurityDescriptorToSecurityDescriptorA(
      ("D:P(A;;" + rights + ";;;WD)").c_str(), SDDL_REVISION_1, &descriptor, nullptr));
  EXPECT_TRUE(SetFileSecurityA(folder.c_str(), DACL_SECURITY_INFORMATION, descriptor));
  LocalFree(descriptor);
}

TEST_F(VersionTest, AFolderThatMayNotBeWritten) {
  const fs::path product = fs::path(std::getenv("LOCALAPPDATA")) / "Programs" / "Tarn";
  const std::string folder = testFolder + "\\readonly";
  // The user's folder is for one process at a time.
  const HANDLE turn = CreateMutexA(nullptr, FALSE, "scriptruby-tests");
  WaitForSingleObject(turn, 60000);
  fs::remove_all(product);
  SetErrorMode(0);
  const HMODULE other = LoadModule(folder);
  EXPECT_EQ(SEM_FAILCRITICALERRORS | SEM_NOOPENFILEERRORBOX, GetErrorMode()) << "no system boxes";
  WriteBytes(folder + "\\xMacroWSH.qwsh", "[Options]\r\nLanguage=Ignored\r\n");
  Permit(folder, "FRFX");
  Fill(392, 77, 392, folder, other);
  EXPECT_TRUE(fs::is_directory(product)) << "made for the description file";
  WriteBytes((product / "xMacroWSH.qwsh").string(), "[Options]\r\nLanguage=PerUser\r\n");
  Fill(392, 77, 392, "", other);
  // Reading and writing are both needed.
  for (const char* rights : {"FR", "FW", "FRFW"}) {
    Permit(folder, "FA");
    const HMODULE another = LoadModule(folder + "\\" + rights);
    WriteBytes(folder + "\\" + rights + "\\xMacroWSH.qwsh", "[Options]\r\nLanguage=Own\r\n");
    Permit(folder + "\\" + rights, rights);
    Fill(392, 77, 392, "", another);
    FreeLibrary(another);
    Permit(folder + "\\" + rights, "FA");
  }
  // A folder that may be written is replaced by the user's own, which is made.
  std::error_code ignored;
  fs::remove_all(product), fs::remove(product.parent_path(), ignored);
  Fill(392, 77, 392, testFolder);
  EXPECT_TRUE(fs::is_directory(product.parent_path()));
  EXPECT_TRUE(CallExport<bool>(dll, "version",
                               std::string(392, '\0').replace(0, 2, "\x88\1").data(), nullptr))
      << "no folder at all";
  Permit(folder, "FA");
  FreeLibrary(other);
  fs::remove_all(product);
  ReleaseMutex(turn), CloseHandle(turn);
}
