// SPDX-License-Identifier: MIT
// What the module asks the system for, and with which flags: its imports are replaced by functions
// that log.
#include <memory>
#include <thread>

#include "Imports.h"
#include "ModuleTest.h"

using SystemTest = ModuleTest;

static std::string Flags(DWORD flags) { return Hex(static_cast<HRESULT>(flags)); }

namespace {
UINT WINAPI GetMode() {
  const UINT mode = GetErrorMode();
  return Log("GetErrorMode: " + Flags(mode)), mode;
}
UINT WINAPI SetMode(UINT mode) { return Log("SetErrorMode " + Flags(mode)), SetErrorMode(mode); }
HRESULT WINAPI InitialiseEx(LPVOID, DWORD flags) {
  Log("CoInitializeEx " + Flags(flags));
  return results["CoInitializeEx"];
}
HRESULT WINAPI Initialise(LPVOID) {
  const HRESULT answer = CoInitialize(nullptr);
  return Log("CoInitialize: " + Hex(answer)), answer;
}
void WINAPI Uninitialise() { Log("CoUninitialize"), CoUninitialize(); }
void WINAPI UninitialiseNothing() { Log("CoUninitialize"); }
HRESULT WINAPI Create(REFCLSID, IUnknown* outer, DWORD context, REFIID riid, void** object) {
  Log("CoCreateInstance " + Flags(context) + (outer ? " inside of another" : ""));
  return CreateFakeEngine(nullptr, nullptr, riid, object);
}
}  // namespace

// The same steps for each reason, from DLL_PROCESS_DETACH (0) to DLL_THREAD_DETACH (3).
TEST_F(SystemTest, EachNotification) {
  const std::unique_ptr<std::remove_pointer_t<HMODULE>, decltype(&FreeLibrary)> copy(
      LoadModule(testFolder + "\\other"), FreeLibrary);
  const HMODULE other = copy.get();
  const Replacement getMode(other, "GetErrorMode", GetMode),
      setMode(other, "SetErrorMode", SetMode), initialise(other, "CoInitializeEx", InitialiseEx),
      uninitialise(other, "CoUninitialize", UninitialiseNothing);
  char* const image = reinterpret_cast<char*>(other);
  const auto& headers =
      At<IMAGE_NT_HEADERS>(image, reinterpret_cast<IMAGE_DOS_HEADER*>(image)->e_lfanew);
  const auto notify = reinterpret_cast<BOOL(WINAPI*)(HMODULE, DWORD, LPVOID)>(
      image + headers.OptionalHeader.AddressOfEntryPoint);
  const UINT hostMode = GetErrorMode();
  const std::pair<UINT, HRESULT> states[] = {
      {0, S_OK}, {0x8002, S_FALSE}, {0x8001, RPC_E_CHANGED_MODE}, {0x8003, S_OK}};
  for (DWORD reason : {2, 3, 0, 1})
    for (const auto& [mode, answer] : states) {
      if (reason < 2 && mode != 0) continue;
      Log("--- reason " + std::to_string(reason) + ", CoInitializeEx answers " + Hex(answer));
      SetErrorMode(mode), results["CoInitializeEx"] = answer;
      Log("answer " + std::to_string(notify(other, reason, nullptr)));
    }
  Log("--- a thread");
  std::thread([] { Log("runs"); }).join();
  SetErrorMode(hostMode);
}

// COM on the thread of a run: what is initialised there, and what the host finds afterwards.
TEST_F(SystemTest, ApartmentsOfARun) {
  const Replacement initialise(dll, "CoInitialize", Initialise),
      uninitialise(dll, "CoUninitialize", Uninitialise), create(dll, "CoCreateInstance", Create);
  for (const char* thread : {"the host's", "a plain", "a multithreaded"})
    std::thread([&] {
      Log("--- on "s + thread + " thread");
      if (*thread == 't') CoInitialize(nullptr);
      if (thread[2] == 'm') CoInitializeEx(nullptr, COINIT_MULTITHREADED);
      Run();
      Log("then CoInitializeEx: " + Hex(CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED)));
    }).join();
}

namespace {
BOOL WINAPI CheckAccess(PSECURITY_DESCRIPTOR descriptor, HANDLE token, DWORD access,
                        PGENERIC_MAPPING mapping, PPRIVILEGE_SET privileges, LPDWORD size,
                        LPDWORD granted, LPBOOL status) {
  Log("AccessCheck for " + Flags(access));
  return AccessCheck(descriptor, token, access, mapping, privileges, size, granted, status);
}
BOOL WINAPI ThreadToken(HANDLE thread, DWORD access, BOOL asSelf, PHANDLE token) {
  const BOOL answer = OpenThreadToken(thread, access, asSelf, token);
  Log("OpenThreadToken for " + Flags(access) + (asSelf ? " as the process: " : ": ") +
      (answer ? "there" : "none"));
  return answer;
}
BOOL WINAPI ProcessToken(HANDLE process, DWORD access, PHANDLE token) {
  return Log("OpenProcessToken for " + Flags(access)), OpenProcessToken(process, access, token);
}
}  // namespace

TEST_F(SystemTest, AccessToAFolder) {
  char record[392] = {'\x88', 1};  // its size
  const std::string header(record, sizeof record);
  // The first call in a process also chooses the path of the description.
  EXPECT_TRUE(CallExport<bool>(dll, "version", &record[0], testFolder.c_str()));
  const Replacement check(dll, "AccessCheck", CheckAccess),
      thread(dll, "OpenThreadToken", ThreadToken), process(dll, "OpenProcessToken", ProcessToken);
  for (bool impersonates : {false, true}) {
    Log(impersonates ? "--- impersonating" : "--- as the process");
    if (impersonates) EXPECT_TRUE(ImpersonateSelf(SecurityImpersonation));
    header.copy(record, sizeof record);
    EXPECT_TRUE(CallExport<bool>(dll, "version", &record[0], testFolder.c_str()));
    RevertToSelf();
  }
}

namespace {
DWORD WINAPI ReadText(LPCSTR section, LPCSTR key, LPCSTR text, LPSTR out, DWORD size, LPCSTR file) {
  return Log("  reads "s + key), GetPrivateProfileStringA(section, key, text, out, size, file);
}
UINT WINAPI ReadNumber(LPCSTR section, LPCSTR key, INT number, LPCSTR file) {
  return Log("  reads "s + key), GetPrivateProfileIntA(section, key, number, file);
}
DWORD WINAPI TwoParts(LPCWSTR, LPWSTR out, DWORD, LPCWSTR) {
  static constexpr wchar_t entries[] = L"Tick=a\0\0Quote=b\0";
  return memcpy(out, entries, sizeof entries), std::size(entries) - 1;
}
}  // namespace

// The description is read in one pass; the system's functions open the file for each key.
TEST_F(SystemTest, KeysReadOneByOne) {
  const Replacement text(dll, "GetPrivateProfileStringA", ReadText),
      number(dll, "GetPrivateProfileIntA", ReadNumber);
  char record[392] = {};
  const auto fill = [&] {
    record[0] = '\x88', record[1] = 1;
    EXPECT_TRUE(CallExport<bool>(dll, "version", &record[0], ""));
    Log("  tick "s + (record + 368) + ", quote " + (record + 379));
  };
  for (const char* lines : {"", "Tick='\r\nQuote=\"\r\nFixCRLF=1", "Tick='a'",
                            "Tick='a\r\nQuote=a'", "FixCRLF=yes", "Tick= \r\nQuote=?"})
    Describe(lines), fill();
  const Replacement parts(dll, "GetPrivateProfileSectionW", TwoParts);
  Log("--- a section with an empty entry"), fill();
}

namespace {
__time64_t __cdecl SomeTime(__time64_t*) { return 2224000000; }  // in June 2040
}  // namespace

TEST_F(SystemTest, LogAfter2038) {
  const Replacement time(dll, "_time64", SomeTime);
  EXPECT_FALSE(CallExport<bool>(dll, "version", nullptr, nullptr));
  EXPECT_NE(std::string::npos, ModuleLog().find(" 2040] VERIFY")) << ModuleLog();
}
