// SPDX-License-Identifier: MIT
// macrorun: runs one macro over a text outside the editor. It hosts the scripting module as the
// editor does and offers the macro a small document.
//
// Reader's path: main -> MacroRun (the host) -> HostLink (its Microsoft-ABI side) -> ScriptModule
// (the exports) -> MacroFunctions (what a macro can call) -> Document.
#include <fcntl.h>
#include <io.h>
#include <windows.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <exception>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>

#include "Document.h"
#include "Encoding.h"
#include "ExitCode.h"
#include "MacroRun.h"
#include "Options.h"
#include "ScriptModule.h"

namespace fs = std::filesystem;

namespace {

using File = std::unique_ptr<std::FILE, int (*)(std::FILE*)>;

File Open(const fs::path& path, const char* what) {
  File file(_wfopen(path.c_str(), L"rb"), std::fclose);
  if (!file) {
    const std::string reason = std::strerror(errno);
    throw UsageError(std::string("cannot read the ") + what + " " + ToUtf8(path) + ": " + reason);
  }
  return file;
}

std::string ReadAll(std::FILE* file, const std::string& name) {
  std::string bytes;
  char block[16384];
  while (const std::size_t count = std::fread(block, 1, sizeof block, file))
    bytes.append(block, count);
  if (std::ferror(file)) throw UsageError("cannot read " + name);
  return bytes;
}

std::string ReadInput(const fs::path& path) {
  if (path.empty()) return {};
  if (path == "-") {
    _setmode(_fileno(stdin), _O_BINARY);
    return ReadAll(stdin, "standard input");
  }
  return ReadAll(Open(path, "file").get(), ToUtf8(path));
}

void WriteOutput(const std::string& bytes) {
  _setmode(_fileno(stdout), _O_BINARY);
  if (std::fwrite(bytes.data(), 1, bytes.size(), stdout) != bytes.size() || std::fflush(stdout))
    throw UsageError("cannot write to standard output");
}

// The description file to give to the module; empty for none: a Ruby macro needs none, and without
// a macro there is only the module's own.
fs::path ChooseDescription(const Options& options) {
  if (!options.description.empty()) {
    Open(options.description, "language description (--description)");
    return options.description;
  }
  const std::wstring extension = options.macro.extension().wstring();
  if (options.macro.empty() || _wcsicmp(extension.c_str(), L".rbs") == 0) return {};
  const std::wstring language = extension.empty() ? extension : extension.substr(1);
  const fs::path file = ProgramFolder() / "languages" / (language + L".qwsh");
  std::error_code error;
  if (!language.empty() && fs::is_regular_file(file, error)) return file;
  throw UsageError("no language description for " + ToUtf8(options.macro) + " (" + ToUtf8(file) +
                   "); name one with --description");
}

void PrintVersions(const Options& options) {
  ScriptModule module(options.module, ChooseDescription(options));
  std::printf("macrorun %s\n%s\n", MACRORUN_VERSION, module.Description().c_str());
}

int Run(const Options& options) {
  if (options.version) {
    PrintVersions(options);
    return kSuccess;
  }
  Open(options.macro, "macro");
  const fs::path description = ChooseDescription(options);
  Document document(ReadInput(options.input));
  ScriptModule module(options.module, description);
  const ExitCode result = RunMacro(module, options.macro, document, options.trace);
  if (result == kSuccess) WriteOutput(document.Bytes());
  return result;
}

}  // namespace

int main() {
  try {
    // A file that is no library is an error message, not a system dialog.
    SetErrorMode(SEM_FAILCRITICALERRORS | SEM_NOOPENFILEERRORBOX);
    Options options;
    if (const std::optional<int> finished = ParseOptions(options)) return *finished;
    return Run(options);
  } catch (const UsageError& error) {
    std::fprintf(stderr, "macrorun: %s\n", error.what());
    return kWrongUsage;
  } catch (const std::exception& error) {
    std::fprintf(stderr, "macrorun: %s\n", error.what());
    return kFault;
  }
}
