// SPDX-License-Identifier: MIT
#include "platform/Console.h"

#include <fcntl.h>
#include <io.h>
#include <windows.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <memory>
#include <thread>
#include <utility>

#include "platform/Encoding.h"
#include "platform/ExitCode.h"

namespace {

HANDLE HandleOf(std::FILE* stream) {
  return reinterpret_cast<HANDLE>(_get_osfhandle(_fileno(stream)));
}

bool ColourWanted() {
  wchar_t value[2];
  return GetEnvironmentVariableW(L"NO_COLOR", value, 2) == 0;
}

WORD Attributes(Colour colour, WORD plain) {
  switch (colour) {
    case Colour::kError:
      return FOREGROUND_RED | FOREGROUND_INTENSITY;
    case Colour::kHighlight:
      return FOREGROUND_GREEN | FOREGROUND_INTENSITY;
    case Colour::kFaint:
      return FOREGROUND_GREEN | FOREGROUND_BLUE;
    case Colour::kPlain:
      break;
  }
  return plain;
}

// Uses console attributes and not escape sequences, because every console supports them.
void WriteTerminal(std::FILE* terminal, std::string_view text, Colour colour) {
  const HANDLE console = HandleOf(terminal);
  CONSOLE_SCREEN_BUFFER_INFO before = {};
  const bool coloured =
      colour != Colour::kPlain && ColourWanted() && GetConsoleScreenBufferInfo(console, &before);
  if (coloured) SetConsoleTextAttribute(console, Attributes(colour, before.wAttributes));
  const std::wstring wide = PathFromUtf8(text).wstring();
  DWORD written = 0;
  for (std::size_t from = 0; from < wide.size(); from += written) {
    const DWORD length = static_cast<DWORD>(std::min<std::size_t>(wide.size() - from, 8192));
    if (!WriteConsoleW(console, wide.data() + from, length, &written, nullptr) || !written) break;
  }
  if (coloured) SetConsoleTextAttribute(console, before.wAttributes);
}

// End of input at the start of a line. Wine drops Ctrl+Z, so Ctrl+D counts as well.
constexpr wchar_t kControlZ = L'\x1A', kControlD = L'\x04';

using Line = std::optional<std::string>;

Line ReadLine() {
  std::wstring line;
  wchar_t block[256];
  DWORD count = 0;
  while (ReadConsoleW(HandleOf(stdin), block, 256, &count, nullptr) && count > 0) {
    line.append(block, count);
    if (line.back() != L'\n') continue;
    line.erase(line.find_last_not_of(L"\r\n") + 1);
    if (!line.empty() && (line.front() == kControlZ || line.front() == kControlD)) return {};
    return WideToUtf8(line);
  }
  return {};
}

}  // namespace

void PrepareStandardError() { _setmode(_fileno(stderr), _O_BINARY); }

bool IsTerminal(std::FILE* stream) {
  DWORD mode = 0;
  return GetConsoleMode(HandleOf(stream), &mode);
}

bool InputIsLeft() {
  const HANDLE input = HandleOf(stdin);
  DWORD waiting = 0;
  if (GetFileType(input) == FILE_TYPE_PIPE)
    return PeekNamedPipe(input, nullptr, 0, nullptr, &waiting, nullptr)
               ? waiting > 0
               : GetLastError() == ERROR_NOT_SUPPORTED;
  LARGE_INTEGER size, place;
  return GetFileType(input) == FILE_TYPE_DISK && GetFileSizeEx(input, &size) &&
         SetFilePointerEx(input, {}, &place, FILE_CURRENT) && place.QuadPart < size.QuadPart;
}

// Writes UTF-16 to a terminal, so that its code page does not matter.
void WriteStandardOutput(std::string_view bytes) {
  if (IsTerminal(stdout)) return WriteTerminal(stdout, bytes, Colour::kPlain);
  _setmode(_fileno(stdout), _O_BINARY);
  if (std::fwrite(bytes.data(), 1, bytes.size(), stdout) != bytes.size() || std::fflush(stdout))
    throw UsageError("cannot write to standard output");
}

void WriteError(std::string_view text, Colour colour) {
  if (IsTerminal(stderr)) {
    WriteTerminal(stderr, text, colour);
    return;
  }
  std::fwrite(text.data(), 1, text.size(), stderr);
  std::fflush(stderr);
}

std::string ReadTerminalText() {
  std::string text;
  while (const Line line = ReadLine()) text += *line + "\n";
  return text;
}

// Reads on a separate thread, because no call ends a read of the terminal on every system. Ctrl+C
// ends it on Windows, but not under Wine.
std::optional<std::string> ReadTerminalLine(const std::function<bool()>& isGivenUp) {
  struct Reading {
    Line line;
    std::atomic<bool> done = false;
  };
  const auto reading = std::make_shared<Reading>();  // the thread can outlive the call
  std::thread([reading] {
    reading->line = ReadLine();
    reading->done = true;
  }).detach();
  while (!reading->done) {
    if (isGivenUp()) return {};
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
  }
  return reading->line;
}
