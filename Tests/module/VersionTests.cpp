// SPDX-License-Identifier: MIT
// `version`: the record's checks, its content, the description file behind it, and the folders.
#include <filesystem>
#include <random>

#include "ModuleTest.h"
// sddl.h must come after windows.h.
#include <sddl.h>

class VersionTest : public ModuleTest {
 protected:
  VersionTest() {
    pages = static_cast<unsigned char*>(VirtualAlloc(nullptr, 8192, MEM_RESERVE, PAGE_NOACCESS));
    VirtualAlloc(pages, 4096, MEM_COMMIT, PAGE_READWRITE);
  }
  ~VersionTest() override { VirtualFree(pages, 0, MEM_RELEASE); }
  // Calls `version` with a record of this header whose memory ends after `bytes`, and logs what it
  // then holds besides zeros: offset and text.
  bool Fill(LoadedModule& module, unsigned size = 392, unsigned layout = 77, unsigned bytes = 392,
            const char* path = nullptr) {
    memset(pages, 'x', 4096);
    unsigned char* record = pages + 4096 - bytes;
    memcpy(record, &size, 4);
    if (bytes >= 8) memcpy(record + 4, &layout, 4);
    const bool filled = module.version(record, path);
    Log(filled ? "version filled the record" : "version failed");
    for (unsigned i = 0; filled && i < bytes; ++i) {
      const unsigned first = i;
      while (i < bytes && record[i] && i != first + 390) ++i;
      if (i > first)
        Log("  " + std::to_string(first) + ": " + std::string(record + first, record + i));
    }
    return filled;
  }

  unsigned char* pages;
};

TEST_F(VersionTest, WithoutADescriptionFile) {
  std::filesystem::remove(TestFolder() + "\\xMacroWSH.qwsh");
  Fill(Module());
}

TEST_F(VersionTest, Headers) {
  muted = true;
  // The record ends right behind its header and a name without terminator.
  for (unsigned size = 0; size <= 1024; ++size)
    if (size != 392) EXPECT_FALSE(Fill(Module(), size, 77, 12)) << size;
  muted = false;
  Fill(Module(), 391, 77, 12);
  Fill(Module(), 393);
  Fill(Module(), 0, 77, 4);
  EXPECT_FALSE(Module().version(nullptr, nullptr));
  Fill(Module(), 392, 0);
  Fill(Module(), 392, 5);
}

TEST_F(VersionTest, DescriptionFiles) {
  const std::string x600(600, 'x'), x75(75, 'x');
  for (const std::string& lines :
       {std::string(), std::string("Language=Object Rexx\r\n[Other]\r\nExtension=no"),
        std::string("Language=1234567890123456789012345"), std::string("Language="),
        std::string("MacroBegin=a\\n\\tb\\r\\\\n\r\nFunctionPrint=\\n\\n%s\r\nFunctionPrefix=\r\n"
                    "FunctionPostfix=\\t;\r\nMacroEnd=\\r\\nend"),
        std::string("CRLF=\\\\n\r\nEnter=\\t\r\nTick=\\n\r\nLineFeed=\r\nQuote=\"q\""),
        "MacroBegin=" + x75 + "\r\nExtension=" + x75 + "\r\nQuote=" + x75,
        "MacroBegin=" + x75 + "y\r\nMacroEnd=" + x600 + "\r\nFunctionPrint=" + x75 +
            "\r\nFunctionPrefix=" + x75 + "\r\nFunctionPostfix=" + x600}) {
    Log("--- " + lines);
    Describe(lines);
    Fill(Module());
  }
  muted = true;
  std::mt19937 random(20);
  for (int i = 0; i < 200; ++i) {
    std::string bytes = i % 2 ? "Language=" : "";
    for (int n = random() % 3000; n-- > 0;) bytes += static_cast<char>(random());
    Describe(bytes);
    EXPECT_TRUE(Fill(Module()));
  }
}

TEST_F(VersionTest, Flags) {
  plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f"); };
  for (const char* flags :
       {"FixCRLF=yes\r\nFixDelimiter=-1", "FixCRLF=1\r\nFixDelimiter=0", "NoCase=1"}) {
    Describe(std::string("Language=FakeEngine\r\n") + flags);
    Run();
  }
}

TEST_F(VersionTest, DuringARunTheRunningEngineAnswers) {
  plan.onConnect = [&](FakeEngine&) {
    Describe("Language=Changed");
    Fill(Module());  // as the description was read for the run
    // A host that is current but names no engine gets a new one.
    void* engine = host.Engine();
    host.Field<void*>(18) = nullptr;
    Fill(Module());
    host.Field<void*>(18) = engine;
  };
  Run();
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
  namespace fs = std::filesystem;
  const fs::path product = fs::path(std::getenv("LOCALAPPDATA")) / "Programs" / "Tarn";
  fs::remove_all(product);
  const std::string folder = TestFolder() + "\\readonly";
  fs::create_directories(folder);
  fs::copy_file(SCRIPTRUBY_DLL, folder + "\\scriptruby.dll");
  WriteBytes(folder + "\\xMacroWSH.qwsh", "[Options]\r\nLanguage=Ignored\r\n");
  Permit(folder, "FRFX");
  {
    LoadedModule other(folder);
    Fill(other, 392, 77, 392, folder.c_str());
    EXPECT_TRUE(fs::is_directory(product)) << "made for the description file";
    WriteBytes((product / "xMacroWSH.qwsh").string(), "[Options]\r\nLanguage=PerUser\r\n");
    Fill(other);
  }
  Permit(folder, "FA");
  fs::remove_all(product);
}

TEST_F(VersionTest, HostFolders) {
  // A host folder that is missing is made; one that cannot be is passed over.
  const std::string folder = TestFolder() + "\\host";
  muted = true;
  for (const std::string& path : {"  " + folder + "/data ", std::string(), std::string("?:\\no"),
                                  std::string("\\\\"), TestFolder(), std::string(40000, 'x')})
    EXPECT_TRUE(Fill(Module(), 392, 77, 392, path.c_str())) << path;
  EXPECT_TRUE(std::filesystem::is_directory(folder + "\\data"));
}
