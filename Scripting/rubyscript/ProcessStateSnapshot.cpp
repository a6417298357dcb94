// SPDX-License-Identifier: MIT
#include "ProcessStateSnapshot.h"

#include <fcntl.h>
#include <io.h>
#include <locale.h>
#include <stdlib.h>
#include <string.h>
#include <wchar.h>
#include <windows.h>

// --- Signals, streams, directory -----------------------------------------------------------------

// msvcrt returns a handler only when another one replaces it. SIG_IGN in between means that a
// Ctrl+C at that moment is lost rather than fatal.
static __p_sig_fn_t SignalHandler(int number) {
  const __p_sig_fn_t handler = signal(number, SIG_IGN);
  if (handler != SIG_ERR) signal(number, handler);
  return handler;
}

// msvcrt returns the mode in the same way, possibly even for a closed descriptor.
static int StreamMode(int descriptor) {
  if (_get_osfhandle(descriptor) == -1) return -1;
  const int mode = _setmode(descriptor, _O_BINARY);
  if (mode != -1) _setmode(descriptor, mode);
  return mode;
}

static wchar_t* CurrentDirectory() {
  wchar_t* path = nullptr;
  DWORD room = MAX_PATH;
  for (;;) {
    wchar_t* const larger = static_cast<wchar_t*>(realloc(path, room * sizeof *path));
    const DWORD length = larger ? GetCurrentDirectoryW(room, larger) : 0;
    if (larger) path = larger;
    if (length > 0 && length < room) return path;
    if (length == 0) break;
    room = length;  // what it needs, or more if another thread has changed it
  }
  free(path);
  return nullptr;
}

// --- Environment ---------------------------------------------------------------------------------

static wchar_t* Next(wchar_t* line) { return line + wcslen(line) + 1; }

static size_t BlockBytes(wchar_t* block) {
  wchar_t* line = block;
  while (*line) line = Next(line);
  return (line + 1 - block) * sizeof *block;
}

static wchar_t* CopyEnvironment() {
  wchar_t* const block = GetEnvironmentStringsW();
  if (!block) return nullptr;
  const size_t bytes = BlockBytes(block);
  void* const copy = malloc(bytes);
  if (copy) memcpy(copy, block, bytes);
  FreeEnvironmentStringsW(block);
  return static_cast<wchar_t*>(copy);
}

// A name may begin with '=': those of the current directories of the drives do.
static size_t NameLength(const wchar_t* line) { return 1 + wcscspn(line + 1, L"="); }

// The block's line of the same name, in the same case, as `line`.
static wchar_t* FindName(wchar_t* block, const wchar_t* line) {
  const size_t length = NameLength(line) + 1;
  while (*block && wcsncmp(block, line, length) != 0) block = Next(block);
  return *block ? block : nullptr;
}

// The same for the lines of such a block, one after the other. Each line most likely follows the
// previous one, at `place`.
static wchar_t* FindName(wchar_t* block, const wchar_t* line, wchar_t*& place) {
  const bool isThere = wcsncmp(place, line, NameLength(line) + 1) == 0;
  wchar_t* const found = isThere ? place : FindName(block, line);
  if (found) place = Next(found);
  return found;
}

// Ends a text early while this lives.
class Cut {
 public:
  explicit Cut(wchar_t* textEnd) : end(textEnd), unit(*textEnd) { *end = 0; }
  Cut(const Cut&) = delete;
  Cut& operator=(const Cut&) = delete;
  ~Cut() { *end = unit; }

 private:
  wchar_t* const end;
  const wchar_t unit;
};

// msvcrt does not pass on a variable whose name begins with '=', and removes one that has no value.
// So each variable is also set for the process directly.
static void SetVariable(wchar_t* line) {
  if (*line != '=') _wputenv(line);
  wchar_t* const sign = line + NameLength(line);
  const Cut name(sign);
  SetEnvironmentVariableW(line, sign + 1);
}

static void RemoveVariable(wchar_t* line) {
  wchar_t* const sign = line + NameLength(line);
  if (*line != '=') {
    const Cut nameAndSign(sign + 1);
    _wputenv(line);
  }
  const Cut name(sign);
  SetEnvironmentVariableW(line, nullptr);
}

static bool IsSet(wchar_t* line) {
  const Cut name(line + NameLength(line));
  return GetEnvironmentVariableW(line, nullptr, 0) || GetLastError() != ERROR_ENVVAR_NOT_FOUND;
}

// First what is to go, as the same name may come back in another case. A variable that only changes
// its value is never missing: other threads of the host may look for it.
void ProcessStateSnapshot::RestoreEnvironment() const {
  wchar_t* const current = CopyEnvironment();
  if (!current) return;
  const size_t bytes = BlockBytes(environment);
  if (bytes != BlockBytes(current) || memcmp(current, environment, bytes) != 0) {
    wchar_t* place = environment;
    for (wchar_t* line = current; *line; line = Next(line))
      if (!FindName(environment, line, place)) RemoveVariable(line);
    place = current;
    for (wchar_t* line = environment; *line; line = Next(line)) {
      const wchar_t* const present = FindName(current, line, place);
      if (!present || wcscmp(present, line) != 0) SetVariable(line);
    }
  }
  free(current);
}

// The block's own memory takes the remaining lines. Current directories of drives are no addition.
void ProcessStateSnapshot::KeepAdditions() {
  if (!environment) return;
  free(additions);
  additions = CopyEnvironment();
  if (!additions) return;
  wchar_t* end = additions;
  for (wchar_t *line = additions, *next; *line; line = next) {
    next = Next(line);
    if (*line == '=' || FindName(environment, line)) continue;
    const size_t units = next - line;
    wmemmove(end, line, units);
    end += units;
  }
  *end = 0;
}

void ProcessStateSnapshot::ApplyAdditions() const {
  if (!additions) return;
  for (wchar_t* line = additions; *line; line = Next(line))
    if (!IsSet(line)) SetVariable(line);
}

// The system reopens the directory, which takes longer than the rest of a restoration.
void ProcessStateSnapshot::RestoreDirectory() const {
  wchar_t* const current = CurrentDirectory();
  if (!current || wcscmp(current, directory) != 0) SetCurrentDirectoryW(directory);
  free(current);
}

// --- The whole -----------------------------------------------------------------------------------

void ProcessStateSnapshot::Save() {
  Forget();
  errorMode = GetErrorMode();
  fileMask = _umask(0);
  _umask(fileMask);
  const char* const name = setlocale(LC_ALL, nullptr);
  locale = name ? _strdup(name) : nullptr;
  for (int i = 0; i < kSignalCount; ++i) handlers[i] = SignalHandler(kSignals[i]);
  for (int i = 0; i < kStreams; ++i) modes[i] = StreamMode(i);
  directory = CurrentDirectory();
  environment = CopyEnvironment();
  saved = true;
}

void ProcessStateSnapshot::Restore() const {
  if (!saved) return;
  SetErrorMode(errorMode);
  _umask(fileMask);
  if (locale) setlocale(LC_ALL, locale);
  for (int i = 0; i < kSignalCount; ++i)
    if (handlers[i] != SIG_ERR) signal(kSignals[i], handlers[i]);
  for (int i = 0; i < kStreams; ++i)
    if (modes[i] != -1) _setmode(i, modes[i]);
  if (directory) RestoreDirectory();
  if (environment) RestoreEnvironment();
}

void ProcessStateSnapshot::Forget() {
  free(locale);
  free(directory);
  free(environment);
  locale = nullptr;
  directory = environment = nullptr;
}

ProcessStateSnapshot::~ProcessStateSnapshot() {
  Forget();
  free(additions);
}
