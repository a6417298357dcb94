// SPDX-License-Identifier: MIT
#include "Registration.h"

#include <objbase.h>
#include <stdlib.h>
#include <wchar.h>

#include "Server.h"

#define CLASS_KEY L"CLSID\\" SCRIPT_ENGINE_CLASS
#define DESCRIPTION L"Ruby script engine (CRuby)"
#define NAME L"Tarn.RubyScript"
#define VERSIONED_NAME L"Tarn.RubyScript.1"
#define COMMON_NAME L"RubyScript"
#define CATEGORIES CLASS_KEY L"\\Implemented Categories"

static constexpr wchar_t kClassesKey[] = L"Software\\Classes";

// --- What is written -----------------------------------------------------------------------------

namespace {
// Keys come before what is below them. Without a text there is only the key.
struct Entry {
  const wchar_t* key;    // below kClassesKey
  const wchar_t* value;  // null: the default value
  const wchar_t* text;
};

struct Entries {
  const Entry* first;
  int count;
};
}  // namespace

static constexpr wchar_t kModulePath[] = L"";  // placeholder for the path of the module

// Belongs to the system: not removed.
static constexpr Entry kSharedEntries[] = {{L"CLSID", nullptr, nullptr}};

static constexpr Entry kClassEntries[] = {
    {CLASS_KEY, nullptr, DESCRIPTION},
    {CLASS_KEY L"\\InprocServer32", nullptr, kModulePath},
    {CLASS_KEY L"\\InprocServer32", L"ThreadingModel", L"Both"},
    {CLASS_KEY L"\\ProgID", nullptr, VERSIONED_NAME},
    {CLASS_KEY L"\\VersionIndependentProgID", nullptr, NAME},
    {CLASS_KEY L"\\OLEScript", nullptr, nullptr},
    {CATEGORIES, nullptr, nullptr},  // below it the two of a script engine: it runs and it parses
    {CATEGORIES L"\\{F0B7A1A1-9847-11CF-8F20-00805F2CD064}", nullptr, nullptr},
    {CATEGORIES L"\\{F0B7A1A2-9847-11CF-8F20-00805F2CD064}", nullptr, nullptr},
};

// A ProgID's second entry names the class.
static constexpr int kClassOfName = 1;

static constexpr Entry kNameEntries[] = {
    {NAME, nullptr, DESCRIPTION},
    {NAME L"\\CLSID", nullptr, SCRIPT_ENGINE_CLASS},
    {NAME L"\\CurVer", nullptr, VERSIONED_NAME},
    {NAME L"\\OLEScript", nullptr, nullptr},
};

static constexpr Entry kVersionedNameEntries[] = {
    {VERSIONED_NAME, nullptr, DESCRIPTION},
    {VERSIONED_NAME L"\\CLSID", nullptr, SCRIPT_ENGINE_CLASS},
    {VERSIONED_NAME L"\\OLEScript", nullptr, nullptr},
};

static constexpr Entry kCommonNameEntries[] = {
    {COMMON_NAME, nullptr, DESCRIPTION},
    {COMMON_NAME L"\\CLSID", nullptr, SCRIPT_ENGINE_CLASS},
    {COMMON_NAME L"\\OLEScript", nullptr, nullptr},
};

template <int count>
static constexpr Entries All(const Entry (&entries)[count]) {
  return {entries, count};
}

static constexpr int kMostEntries = 32;
static_assert(All(kSharedEntries).count + All(kClassEntries).count + All(kNameEntries).count +
                  All(kVersionedNameEntries).count + All(kCommonNameEntries).count <=
              kMostEntries);

// --- Who holds a name ----------------------------------------------------------------------------

static bool Exists(HKEY root, const wchar_t* path) {
  HKEY key;
  if (RegOpenKeyExW(root, path, 0, KEY_QUERY_VALUE, &key) != ERROR_SUCCESS) return false;
  RegCloseKey(key);
  return true;
}

// The class that a ProgID's subkey names there.
static bool NamedClass(HKEY classes, const wchar_t* subkey, CLSID* classId) {
  wchar_t text[64];  // of 39; what is longer is no class
  DWORD bytes = sizeof text;
  return RegGetValueW(classes, subkey, nullptr, RRF_RT_REG_SZ, nullptr, text, &bytes) ==
             ERROR_SUCCESS &&
         SUCCEEDED(CLSIDFromString(text, classId));
}

static bool HasServer(HKEY classes, const CLSID& classId) {
  static constexpr const wchar_t* kKinds[] = {L"\\InprocServer32", L"\\LocalServer32"};
  for (const wchar_t* kind : kKinds) {
    wchar_t path[64] = L"CLSID\\";
    StringFromGUID2(classId, path + wcslen(path), 39);
    if (Exists(classes, wcscat(path, kind))) return true;
  }
  return false;
}

// In the merged view, an entry of the user hides one of the machine, so both are also read
// separately.
static bool IsHeldByAnother(const wchar_t* subkey) {
  HKEY roots[] = {HKEY_CLASSES_ROOT, nullptr, nullptr};
  RegOpenKeyExW(HKEY_CURRENT_USER, kClassesKey, 0, KEY_READ, &roots[1]);
  RegOpenKeyExW(HKEY_LOCAL_MACHINE, kClassesKey, 0, KEY_READ, &roots[2]);
  bool held = false;
  for (HKEY naming : roots) {
    CLSID classId;
    if (!naming || !NamedClass(naming, subkey, &classId)) continue;
    if (IsEqualCLSID(classId, kScriptEngineClass)) continue;
    for (HKEY serving : roots) held = held || (serving && HasServer(serving, classId));
  }
  if (roots[1]) RegCloseKey(roots[1]);
  if (roots[2]) RegCloseKey(roots[2]);
  return held;
}

// --- Writing -------------------------------------------------------------------------------------

namespace {
// Writes entries and can take them all back.
class Writer {
 public:
  Writer(HKEY classesKey, const wchar_t* path) : classes(classesKey), modulePath(path) {}
  Writer(const Writer&) = delete;
  Writer& operator=(const Writer&) = delete;
  ~Writer();

  LSTATUS Write(Entries entries);
  void TakeBack();

 private:
  struct Step {
    const Entry* entry;
    bool newKey;
    DWORD oldType;
    DWORD oldBytes;
    BYTE* old;  // null: there was no such value
  };

  LSTATUS Write(const Entry& entry);
  static LSTATUS KeepOld(HKEY key, Step* step);
  void TakeBack(const Step& step);

  HKEY const classes;
  const wchar_t* const modulePath;
  Step steps[kMostEntries] = {};
  int count = 0;
};
}  // namespace

Writer::~Writer() {
  for (int i = 0; i < count; ++i) free(steps[i].old);
}

// Another process may change the value between the two questions; then the registration fails.
LSTATUS Writer::KeepOld(HKEY key, Step* step) {
  const wchar_t* const value = step->entry->value;
  const LSTATUS status =
      RegQueryValueExW(key, value, nullptr, &step->oldType, nullptr, &step->oldBytes);
  if (status != ERROR_SUCCESS) return status == ERROR_FILE_NOT_FOUND ? ERROR_SUCCESS : status;
  step->old = static_cast<BYTE*>(malloc(step->oldBytes + 1));  // never nothing: that means no value
  if (!step->old) return ERROR_NOT_ENOUGH_MEMORY;
  return RegQueryValueExW(key, value, nullptr, &step->oldType, step->old, &step->oldBytes);
}

LSTATUS Writer::Write(const Entry& entry) {
  HKEY key;
  DWORD disposition;
  LSTATUS status = RegCreateKeyExW(classes, entry.key, 0, nullptr, REG_OPTION_NON_VOLATILE,
                                   KEY_QUERY_VALUE | KEY_SET_VALUE, nullptr, &key, &disposition);
  if (status != ERROR_SUCCESS) return status;
  Step step = {&entry, disposition == REG_CREATED_NEW_KEY, REG_NONE, 0, nullptr};
  if (entry.text) {
    status = KeepOld(key, &step);
    const wchar_t* const text = entry.text == kModulePath ? modulePath : entry.text;
    const size_t bytes = (wcslen(text) + 1) * sizeof *text;
    if (status == ERROR_SUCCESS)
      status = RegSetValueExW(key, entry.value, 0, REG_SZ, reinterpret_cast<const BYTE*>(text),
                              static_cast<DWORD>(bytes));
  }
  RegCloseKey(key);
  if (status == ERROR_SUCCESS || step.newKey)
    steps[count++] = step;
  else
    free(step.old);
  return status;
}

LSTATUS Writer::Write(Entries entries) {
  LSTATUS status = ERROR_SUCCESS;
  for (int i = 0; i < entries.count && status == ERROR_SUCCESS; ++i)
    status = Write(entries.first[i]);
  return status;
}

void Writer::TakeBack(const Step& step) {
  if (step.newKey) {
    RegDeleteKeyW(classes, step.entry->key);
  } else if (step.old) {
    HKEY key;
    if (RegOpenKeyExW(classes, step.entry->key, 0, KEY_SET_VALUE, &key) != ERROR_SUCCESS) return;
    RegSetValueExW(key, step.entry->value, 0, step.oldType, step.old, step.oldBytes);
    RegCloseKey(key);
  } else if (step.entry->text) {
    RegDeleteKeyValueW(classes, step.entry->key, step.entry->value);
  }
}

void Writer::TakeBack() {
  for (int i = count; i-- > 0;) TakeBack(steps[i]);
}

// --- Removing ------------------------------------------------------------------------------------

// Takes what there is: a missing key or value is no failure, and a key with other content stays.
static LSTATUS Remove(HKEY classes, const Entry& entry) {
  HKEY key;
  LSTATUS status = RegOpenKeyExW(classes, entry.key, 0, KEY_QUERY_VALUE | KEY_SET_VALUE, &key);
  if (status != ERROR_SUCCESS) return status == ERROR_FILE_NOT_FOUND ? ERROR_SUCCESS : status;
  if (entry.text) status = RegDeleteValueW(key, entry.value);
  if (status == ERROR_FILE_NOT_FOUND) status = ERROR_SUCCESS;
  DWORD keys = 1;
  DWORD values = 1;
  if (status == ERROR_SUCCESS)
    status = RegQueryInfoKeyW(key, nullptr, nullptr, nullptr, &keys, nullptr, nullptr, &values,
                              nullptr, nullptr, nullptr, nullptr);
  RegCloseKey(key);
  if (status == ERROR_SUCCESS && keys == 0 && values == 0)
    status = RegDeleteKeyW(classes, entry.key);
  return status;
}

static LSTATUS Remove(HKEY classes, Entries entries) {
  LSTATUS first = ERROR_SUCCESS;
  for (int i = entries.count; i-- > 0;) {
    const LSTATUS status = Remove(classes, entries.first[i]);
    if (first == ERROR_SUCCESS) first = status;
  }
  return first;
}

static LSTATUS RemoveName(HKEY classes, Entries entries) {
  CLSID classId;
  const bool ours = NamedClass(classes, entries.first[kClassOfName].key, &classId) &&
                    IsEqualCLSID(classId, kScriptEngineClass);
  return ours ? Remove(classes, entries) : ERROR_SUCCESS;
}

// --- Registration --------------------------------------------------------------------------------

// The module's full path, of any length; null on failure, with the reason as the last error.
static wchar_t* ModulePath(HMODULE module) {
  constexpr DWORD kMostRoom = 0x10000;  // twice what the longest path takes
  for (DWORD room = MAX_PATH; room < kMostRoom; room *= 2) {
    wchar_t* const path = static_cast<wchar_t*>(malloc(room * sizeof *path));
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    const DWORD length = path ? GetModuleFileNameW(module, path, room) : 0;
    if (length > 0 && length < room) return path;
    free(path);
    if (length == 0) return nullptr;
  }
  SetLastError(ERROR_FILENAME_EXCED_RANGE);
  return nullptr;
}

static LSTATUS WriteAll(HKEY classes, const wchar_t* modulePath) {
  static constexpr Entries kAlways[] = {All(kSharedEntries), All(kClassEntries), All(kNameEntries),
                                        All(kVersionedNameEntries)};
  const bool common = !IsHeldByAnother(kCommonNameEntries[kClassOfName].key);
  Writer writer(classes, modulePath);
  LSTATUS status = ERROR_SUCCESS;
  for (const Entries& entries : kAlways)
    if (status == ERROR_SUCCESS) status = writer.Write(entries);
  if (status == ERROR_SUCCESS && common) status = writer.Write(All(kCommonNameEntries));
  if (status != ERROR_SUCCESS) writer.TakeBack();
  return status;
}

HRESULT RegisterEngine(HMODULE module) {
  wchar_t* const path = ModulePath(module);
  if (!path) return HRESULT_FROM_WIN32(GetLastError());
  HKEY classes;
  LSTATUS status =
      RegCreateKeyExW(HKEY_CURRENT_USER, kClassesKey, 0, nullptr, REG_OPTION_NON_VOLATILE,
                      KEY_READ | KEY_WRITE, nullptr, &classes, nullptr);
  if (status == ERROR_SUCCESS) {
    status = WriteAll(classes, path);
    RegCloseKey(classes);
  }
  free(path);
  return HRESULT_FROM_WIN32(status);
}

HRESULT UnregisterEngine() {
  HKEY classes;
  LSTATUS status = RegOpenKeyExW(HKEY_CURRENT_USER, kClassesKey, 0, KEY_READ | KEY_WRITE, &classes);
  if (status != ERROR_SUCCESS)
    return status == ERROR_FILE_NOT_FOUND ? S_OK : HRESULT_FROM_WIN32(status);
  const LSTATUS removals[] = {
      RemoveName(classes, All(kCommonNameEntries)),
      RemoveName(classes, All(kVersionedNameEntries)),
      RemoveName(classes, All(kNameEntries)),
      Remove(classes, All(kClassEntries)),
  };
  RegCloseKey(classes);
  for (const LSTATUS removal : removals)
    if (status == ERROR_SUCCESS) status = removal;
  return HRESULT_FROM_WIN32(status);
}
