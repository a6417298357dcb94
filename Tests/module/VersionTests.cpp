// SPDX-License-Identifier: MIT
// `version`: the record's checks, its content, the description file behind it, and the folders.
// sddl.h must come after windows.h.
#include <windows.h>
// clang-format off
#include <sddl.h>
// clang-format on

#include <filesystem>
#include <random>

#include "ModuleTest.h"

class VersionTest : public ModuleTest {
 protected:
  // A record of `size` bytes that ends where readable memory ends.
  VersionTest() {
    pages = static_cast<unsigned char*>(VirtualAlloc(nullptr, 8192, MEM_RESERVE, PAGE_NOACCESS));
    VirtualAlloc(pages, 4096, MEM_COMMIT, PAGE_READWRITE);
  }
  ~VersionTest() override { VirtualFree(pages, 0, MEM_RELEASE); }
  unsigned char* Record(unsigned size, unsigned layout = 77, unsigned bytes = 392) {
    memset(pages, 'x', 4096);
    unsigned char* record = pages + 4096 - bytes;
    memcpy(record, &size, 4);
    memcpy(record + 4, &layout, bytes < 8 ? 0 : 4);
    return record;
  }
  // The record's content as offset -> text, and that everything else is zero.
  static std::map<int, std::string> Content(unsigned char* record) {
    std::map<int, std::string> content;
    for (int i = 0; i < 392; ++i) {
      if (!record[i]) continue;
      const size_t length = i >= 390 ? 1 : strnlen(reinterpret_cast<char*>(record + i), 390 - i);
      content[i] = std::string(reinterpret_cast<char*>(record + i), length);
      i += static_cast<int>(length) - 1;
    }
    return content;
  }
  std::map<int, std::string> Fill() {
    unsigned char* record = Record(392);
    EXPECT_TRUE(Module().version(record, nullptr));
    return Content(record);
  }

  BoxWatcher boxes;
  unsigned char* pages;
};

static const std::map<int, std::string> kRuby = {{8, "RubyScript WSH Version 1.50"},
                                                 {64, "rbs"},
                                                 {85, "def key_macro()\n"},
                                                 {161, "end\n\nkey_macro() # run the macro"},
                                                 {212, "\t@tarn.write(\"%s\");"},
                                                 {253, "@tarn."},
                                                 {294, ";"},
                                                 {335, "\\n"},
                                                 {346, "\\\\n"},
                                                 {357, "\\\\r"},
                                                 {368, "'"},
                                                 {379, "\\\""},
                                                 {390, "("},
                                                 {391, ")"}};

TEST_F(VersionTest, WithoutADescriptionFile) {
  std::filesystem::remove(Module().DescriptionFile());
  EXPECT_EQ(kRuby, Fill());
  EXPECT_EQ(Strings{}, boxes.shown);
}

TEST_F(VersionTest, TheHeader) {
  const std::string failure = "\n\nUnexpected internal macro version error!\n|icon";
  for (unsigned size = 0; size <= 1024; ++size) {
    if (size == 392) continue;
    // The record ends right behind its header and a name without terminator.
    unsigned char* record = Record(size, 77, 12);
    boxes.shown.clear();
    ASSERT_FALSE(Module().version(record, nullptr)) << size;
    ASSERT_EQ(Strings{"Exception|Module: xxxx" + failure}, boxes.shown) << size;
  }
  boxes.shown.clear();
  EXPECT_FALSE(Module().version(Record(391), nullptr));
  EXPECT_FALSE(Module().version(Record(391, 77, 4), nullptr));
  EXPECT_FALSE(Module().version(nullptr, nullptr));
  EXPECT_EQ((Strings{"Exception|Module: " + std::string(55, 'x') + failure, "Exception|Module: " + failure,
                     "Exception|Module: <Unknown>" + failure}),
            boxes.shown);

  boxes.shown.clear();
  EXPECT_TRUE(Module().version(Record(392, 0), ""));
  EXPECT_EQ(Strings{}, boxes.shown);
  unsigned char* record = Record(392, 5);
  EXPECT_TRUE(Module().version(record, nullptr));
  EXPECT_EQ(Strings{"Exception|Scripting size problems. This may cause problems!|icon"}, boxes.shown);
  EXPECT_EQ("FakeEngine WSH Version 1.50", Content(record)[8]);
}

TEST_F(VersionTest, TheDescriptionFile) {
  const auto with = [](std::map<int, std::string> changes) {
    for (const auto& field : kRuby) changes.insert(field);
    return changes;
  };
  const std::string x75(75, 'x');
  const struct {
    std::string text;
    std::map<int, std::string> expected;
  } kCases[] = {
      {"", kRuby},
      {"Extension=other section", with({{64, "other section"}})},
      {"Language=Object Rexx", with({{8, "Object Rexx WSH Version 1.50"}})},
      {"Language=1234567890123456789012345", with({{8, "123456789012345678 WSH Version 1.50"}})},
      {"Language=", with({{8, "Ruby Script Macro Engine Version 1.00"}})},
      {"MacroBegin=a\\n\\tb\\r\\\\n", with({{85, "a\n\tb\r\\\n"}})},
      {"CRLF=\\\\n\r\nEnter=\\t\r\nTick=\\n", with({{346, "\\\\n"}, {335, "\\t"}, {368, "\\n"}})},
      {"MacroBegin=" + x75, with({{85, x75}})},
      {"MacroBegin=" + x75 + "yz\r\nExtension=" + x75 + "\r\nQuote=" + x75,
       with({{85, x75}, {64, x75.substr(0, 20)}, {379, x75.substr(0, 10)}})},
      {"MacroEnd=" + std::string(600, 'x') + "\r\nFunctionPrint=" + x75 + "\r\nFunctionPrefix=" + x75,
       with({{161, x75.substr(0, 50)}, {212, x75.substr(0, 40)}, {253, x75.substr(0, 40)}})},
  };
  for (const auto& given : kCases) {
    Describe("[Options]\r\n" + given.text + "\r\n[Other]\r\nExtension=no\r\n");
    EXPECT_EQ(given.expected, Fill()) << given.text;
  }
  Describe("[Options]\r\nFunctionPrefix=\r\nLineFeed=\r\n");
  auto content = kRuby;
  content.erase(253);
  content.erase(357);
  EXPECT_EQ(content, Fill());

  std::mt19937 random(20);
  for (int i = 0; i < 200; ++i) {
    std::string bytes = i % 2 ? "[Options]\r\nLanguage=" : "";
    for (int n = random() % 3000; n-- > 0;) bytes += static_cast<char>(random());
    Describe(bytes);
    EXPECT_TRUE(Module().version(Record(392), nullptr));
  }
}

TEST_F(VersionTest, FlagsAreNonZeroIntegers) {
  plan.onConnect = [&](FakeEngine& engine) { engine.Call(L"f"); };
  Describe("[Options]\r\nLanguage=FakeEngine\r\nFixCRLF=yes\r\nFixDelimiter=-1\r\n");
  EXPECT_EQ(1, Run());
  EXPECT_EQ((Strings{"crlf 0", "delimiter 1", "call 7"}), host.calls);
}

TEST_F(VersionTest, DuringARunTheRunningEngineAnswers) {
  plan.onConnect = [&](FakeEngine&) {
    Describe("[Options]\r\nLanguage=Changed\r\n");
    host.traces.clear();
    EXPECT_EQ("FakeEngine WSH Version 1.50", Fill()[8]) << "as it was read for the run";
    EXPECT_EQ(Strings{}, host.traces);
    // A host that is current but names no engine gets a new one.
    void* engine = host.Engine();
    host.Field<void*>(18) = nullptr;
    EXPECT_EQ("Changed WSH Version 1.50", Fill()[8]);
    EXPECT_EQ(Strings{"Destroying macro interface"}, host.traces);
    host.Field<void*>(18) = engine;
  };
  EXPECT_EQ(1, Run());
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
  char localAppData[MAX_PATH] = "";
  ASSERT_TRUE(GetEnvironmentVariableA("LOCALAPPDATA", localAppData, sizeof localAppData));
  const std::string product = std::string(localAppData) + "\\Programs\\Tarn";
  std::filesystem::remove_all(product);

  const std::string folder = TestFolder() + "\\readonly";
  std::filesystem::create_directories(folder);
  std::filesystem::copy_file(SCRIPTRUBY_DLL, folder + "\\scriptruby.dll");
  WriteBytes(folder + "\\xMacroWSH.qwsh", "[Options]\r\nLanguage=Ignored\r\n");
  Permit(folder, "FRFX");
  {
    LoadedModule other(folder, false);
    ASSERT_NE(nullptr, other.handle);
    EXPECT_TRUE(other.version(Record(392), folder.c_str()));
    EXPECT_TRUE(std::filesystem::is_directory(product)) << "made for the description file";
    WriteBytes(product + "\\xMacroWSH.qwsh", "[Options]\r\nLanguage=PerUser\r\n");
    unsigned char* record = Record(392);
    EXPECT_TRUE(other.version(record, nullptr));
    EXPECT_EQ("PerUser WSH Version 1.50", Content(record)[8]);
  }
  Permit(folder, "FA");
  std::filesystem::remove_all(product);
}

TEST_F(VersionTest, HostFolders) {
  // A host folder that is missing is made; one that cannot be is passed over.
  const std::string folder = TestFolder() + "\\host";
  EXPECT_TRUE(Module().version(Record(392), ("  " + folder + "/data ").c_str()));
  EXPECT_TRUE(std::filesystem::is_directory(folder + "\\data"));
  for (const std::string& path : {std::string(), std::string("?:\\no"), std::string("\\\\"),
                                  TestFolder(), std::string(40000, 'x')})
    EXPECT_TRUE(Module().version(Record(392), path.c_str())) << path;
}
