// SPDX-License-Identifier: MIT
#include "Module.h"

#include <chrono>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iterator>
#include <stdexcept>

namespace fs = std::filesystem;

// The raw host and the empty engine log their calls here. A benchmark can act on each line, in
// place of an engine's script.
void Log(const std::string& line) {
  for (const auto& [beginning, act] : on)
    if (line.starts_with(beginning)) return act();
}

namespace {

constexpr int kTexts = 31;
constexpr int kArguments = 51;
constexpr int kCount = 8;
constexpr int kItems = 16;
constexpr int kTextKind = 23;
constexpr int kInteger = 27;

// A text result as the host lays it out, for all calls: deleting it changes nothing.
struct HostText {
  void** table;
  unsigned growBy = 4;
  const char* text;
  unsigned length;
  unsigned capacity;
  char padChar = ' ';
};
void* THISCALL KeepText(void* text, unsigned) { return text; }
std::vector<void*> textTable = Table(KeepText);

void Answer(QuietHost& host, const char* text) {
  static HostText answer = {textTable.data(), 4, nullptr, 0, 0, ' '};
  answer.text = text;
  answer.length = static_cast<unsigned>(std::strlen(text));
  answer.capacity = answer.length + 1;
  At<unsigned>(host.context, kTextKind) = 1;
  At<void**>(host.context, kTexts + kItems)[0] = &answer;
  At<int>(host.context, kTexts + kCount) = 1;
}

double Real(QuietHost& host, int index) {
  return At<double>(At<void**>(host.context, kArguments + kItems)[index], 16);
}

void* THISCALL Context(QuietHost* host) { return host->context; }
void THISCALL Report(QuietHost*, const char* text) { std::fprintf(stderr, "%s\n", text); }
void Trace(QuietHost*, const char*, const char*) {}
void THISCALL SetFlag(QuietHost*, char) {}
unsigned THISCALL FunctionId(QuietHost*, const char* name) {
  return name[0] == 'f' && name[1] == 0 ? kF : FunctionNamed(std::string(name));
}
void* THISCALL WindowHandle(QuietHost*) { return nullptr; }

void THISCALL CallFunction(QuietHost* host, unsigned id) {
  At<int>(host->context, kInteger) = 42;
  switch (id) {
    case kStart:
      return host->clock.Start();
    case kFinish:
      return host->clock.Finish();
    case kText:
      return Answer(*host, "text");
    case kClassId:
      return Answer(*host, BareObject::kClassText);
    case kTake: {
      const int index = static_cast<int>(Real(*host, 0));
      return host->comparisons[index].Add(Real(*host, 1), Real(*host, 2));
    }
  }
}

std::vector<void*> hostTable =
    Table(Unused, Context, Report, Trace, SetFlag, SetFlag, Unused, FunctionId, Unused,
          WindowHandle, Unused, Unused, CallFunction);

fs::path NewFolder() {
  static int count = 0;
  const std::string name =
      "scriptruby-bench-" + std::to_string(GetCurrentProcessId()) + "-" + std::to_string(++count);
  const fs::path folder = fs::temp_directory_path() / name;
  fs::create_directories(folder);
  return folder;
}

template <class Function>
Function Export(HMODULE dll, const char* name) {
  void* const function = reinterpret_cast<void*>(GetProcAddress(dll, name));
  if (!function) throw std::runtime_error(std::string("the module has no ") + name);
  return reinterpret_cast<Function>(function);
}

}  // namespace

fs::path ProgramFolder() {
  wchar_t path[MAX_PATH] = L"";
  GetModuleFileNameW(nullptr, path, MAX_PATH);
  return fs::path(path).parent_path();
}

void WriteFile(const fs::path& path, const std::string& bytes) {
  std::ofstream file;
  file.exceptions(std::ofstream::failbit | std::ofstream::badbit);
  file.open(path, std::ios::binary);
  file << bytes;
}

QuietHost::QuietHost() { table = hostTable.data(); }

Module::Module(const std::string& description) : folder(NewFolder()) {
  const fs::path copy = folder / "scriptruby.dll";
  fs::copy_file(ProgramFolder() / "scriptruby.dll", copy);
  if (!description.empty()) {
    WriteFile(DescriptionFile(), description);
    // As any that is not being edited: the system reads a file of the last seconds more often.
    fs::last_write_time(DescriptionFile(),
                        fs::file_time_type::clock::now() - std::chrono::hours(1));
  }
  dll = LoadLibraryW(copy.c_str());
  execute = Export<Execute>(dll, "execute");
  version = Export<Version>(dll, "version");
}

Module::~Module() {
  FreeLibrary(dll);
  std::error_code ignored;
  fs::remove_all(folder, ignored);
}

std::string Module::Macro(const std::string& name, const std::string& text) {
  const fs::path path = folder / name;
  WriteFile(path, text);
  return path.string();
}

double Module::TimeRun(const std::string& macro) {
  const double start = Now();
  if (execute(macro.c_str(), &host) == 1) return Now() - start;
  std::fprintf(stderr, "the macro %s failed\n", macro.c_str());
  return -1;
}

double Module::TimeVersion() {
  alignas(4) char record[392] = {};
  const unsigned header[] = {sizeof record, 77};
  std::memcpy(record, header, sizeof header);
  const double start = Now();
  if (version(record, "")) return Now() - start;
  std::fprintf(stderr, "version failed\n");
  return -1;
}

std::string JScriptDescription() {
  std::ifstream file;
  file.exceptions(std::ifstream::failbit | std::ifstream::badbit);
  file.open(ProgramFolder() / "languages" / "js.qwsh", std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(file), {});
}
