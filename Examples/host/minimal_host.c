/* SPDX-License-Identifier: MIT */
/*
 * The smallest host of scriptruby.dll that is worth the name: it runs one macro, which calls
 * functions of ours, and Ctrl+C stops it at the next one. Plain C, one file, no header of the
 * module's.
 *
 *   minimal_host.exe FULL-PATH-OF-scriptruby.dll MACRO
 *
 * Build it for 32-bit Windows with any compiler:
 *   i686-w64-mingw32-gcc minimal_host.c -o minimal_host.exe
 *   clang-19 --target=i686-w64-mingw32 minimal_host.c -o minimal_host.exe
 *   cl /std:c11 minimal_host.c
 *
 * The module calls C++ member functions of the Microsoft ABI: the object in ecx, the arguments on
 * the stack, which the callee clears. In C that is __fastcall with a second argument that is not
 * used (fastcall passes it in edx). The offsets are those of Docs/abi.md.
 */
#include <stddef.h>
#include <stdint.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <windows.h>

typedef struct Host Host;

/* --- What the module and the host share ------------------------------------------------------ */

typedef struct {
  const void* table;
  uint32_t capacity;
  int32_t count;
  uint32_t ownsElements; /* 1, or the module deletes nothing */
  void** items;
} List;

/* An element of the argument list: the module's. */
typedef struct {
  const void* table;
  uint32_t padding;
  uint32_t kind; /* 1 text, 2 integer, 3 real */
  int32_t integer;
  double real;
  struct {
    const void* table;
    uint32_t growBy;
    const char* characters; /* of every kind: numbers are written out */
    uint32_t length, capacity;
    uint8_t padCharacter, padding[3];
  } text;
} Argument;

/* An element of the result texts: ours. The module calls slot 0 of its table when it is done, and
   reads nothing else than the characters. */
typedef struct Text {
  const struct TextTable* table;
  uint32_t growBy;
  char* characters;
  uint32_t length, capacity;
  uint8_t padCharacter, padding[3];
} Text;

struct TextTable {
  Text*(__fastcall* destroy)(Text* self, void* unused, uint32_t andFree);
};

/* The running macro: the module's. */
typedef struct Engine {
  const struct {
    void* functionId;
    void(__fastcall* stop)(struct Engine* self, void* unused);
  } * table;
} Engine;

#pragma pack(push, 1)
typedef struct {
  uint8_t reserved0[8];
  uint8_t siteFlag;
  uint8_t stopRequested; /* set by the module's `kill`; only we clear it */
  int32_t stopValue;
  uint8_t reserved14[4];
  Engine* engine; /* null between runs */
  uint8_t reserved22;
  uint32_t resultKind; /* 1: the first of the result texts; else the integer */
  int32_t integerResult;
  List resultTexts;
  List arguments;
} Context;
#pragma pack(pop)

_Static_assert(offsetof(Argument, text) == 24 && sizeof(Argument) == 48, "as the module has it");
_Static_assert(offsetof(Context, engine) == 18 && sizeof(Context) == 71, "as the module has it");

/* The host macro interface. Slots that the module does not call may hold anything. */
typedef struct {
  void* slot0;
  Context*(__fastcall* context)(Host* self);
  void(__fastcall* reportMessage)(Host* self, void* unused, const char* text);
  void(__cdecl* debugOutput)(Host* self, const char* format, ...); /* variadic, so __cdecl */
  void(__fastcall* setFixCrLf)(Host* self, void* unused, uint8_t flag);
  void(__fastcall* setFixDelimiter)(Host* self, void* unused, uint8_t flag);
  void* slot6;
  uint32_t(__fastcall* functionId)(Host* self, void* unused, const char* name);
  void* slot8;
  void*(__fastcall* windowHandle)(Host* self);
  void* slot10;
  void* slot11;
  void(__fastcall* callFunction)(Host* self, void* unused, uint32_t id);
} HostTable;

struct Host {
  const HostTable* table; /* the first word */
  Context record;
  void* resultSlot[1]; /* what the record's result texts point to */
};

/* --- Results --------------------------------------------------------------------------------- */

static Text* __fastcall DestroyText(Text* self, void* unused, uint32_t andFree) {
  (void)unused;
  (void)andFree; /* always 1 from the module */
  free(self->characters);
  free(self);
  return NULL;
}

static const struct TextTable kTextTable = {DestroyText};

static void AnswerText(Host* host, const char* characters) {
  Text* text = calloc(1, sizeof *text);
  char* copy = _strdup(characters);
  if (!text || !copy) {
    free(text);
    free(copy);
    return;
  }
  text->table = &kTextTable;
  text->characters = copy;
  text->length = (uint32_t)strlen(copy);
  text->capacity = text->length + 1;
  host->resultSlot[0] = text;
  host->record.resultTexts.items = host->resultSlot;
  host->record.resultTexts.capacity = 1;
  host->record.resultTexts.count = 1;
  host->record.resultKind = 1;
}

static void AnswerNumber(Host* host, double value) {
  const double fitting = value > INT32_MAX ? INT32_MAX : value < INT32_MIN ? INT32_MIN : value;
  host->record.integerResult = (int32_t)fitting;
}

/* --- The macro functions: a number for each, not 0 ------------------------------------------- */

static const Argument* ArgumentAt(const Host* host, int32_t index) {
  return index < host->record.arguments.count ? host->record.arguments.items[index] : NULL;
}

/* print(texts...) */
static void Print(Host* host) {
  const Argument* argument;
  for (int32_t i = 0; (argument = ArgumentAt(host, i)) != NULL; ++i)
    fputs(argument->text.characters, stdout);
  putchar('\n');
  fflush(stdout);
}

/* add(numbers...) -> their sum */
static void Add(Host* host) {
  double sum = 0;
  const Argument* argument;
  for (int32_t i = 0; (argument = ArgumentAt(host, i)) != NULL; ++i)
    if (argument->kind != 1) sum += argument->real;
  AnswerNumber(host, sum);
}

/* user_name() -> text */
static void UserName(Host* host) {
  const char* name = getenv("USERNAME");
  AnswerText(host, name ? name : "nobody");
}

/* pause(milliseconds) */
static void Pause(Host* host) {
  const Argument* argument = ArgumentAt(host, 0);
  if (argument && argument->integer > 0) Sleep((DWORD)argument->integer);
}

static const struct {
  const char* name;
  void (*run)(Host* host);
} kFunctions[] = {{"print", Print}, {"add", Add}, {"user_name", UserName}, {"pause", Pause}};

enum { kFunctionCount = sizeof kFunctions / sizeof kFunctions[0], kUnknownFunction = 2000 };

/* --- The slots ------------------------------------------------------------------------------- */

static Context* __fastcall GetContext(Host* self) { return &self->record; }

static void __fastcall ReportMessage(Host* self, void* unused, const char* text) {
  (void)self;
  (void)unused;
  fprintf(stderr, "%s\n", text);
}

/* An editor would write the trace into a log. The format is always "Debug: %s\n". */
static void __cdecl DebugOutput(Host* self, const char* format, ...) {
  (void)self;
  (void)format;
}

/* What the description's two flags mean is the editor's affair. */
static void __fastcall SetFlag(Host* self, void* unused, uint8_t flag) {
  (void)self;
  (void)unused;
  (void)flag;
}

static uint32_t __fastcall FunctionId(Host* self, void* unused, const char* name) {
  (void)self;
  (void)unused;
  for (uint32_t i = 0; i < kFunctionCount; ++i)
    if (strcmp(name, kFunctions[i].name) == 0) return i + 1;
  return kUnknownFunction;
}

static void* __fastcall WindowHandle(Host* self) {
  (void)self;
  return NULL;
}

static void __fastcall CallFunction(Host* self, void* unused, uint32_t id) {
  Context* record = &self->record;
  (void)unused;
  /* Does not return: it jumps back to `execute`. Hold nothing here that somebody has to free. */
  if (record->stopRequested) record->engine->table->stop(record->engine, NULL);
  record->resultKind = 0; /* the last call's are still there */
  record->integerResult = 0;
  if (id >= 1 && id <= kFunctionCount) kFunctions[id - 1].run(self);
}

/* --- The program ----------------------------------------------------------------------------- */

static int(__stdcall* execute)(const char* file, Host* host);
static unsigned char(__stdcall* kill)(int32_t value); /* a bool: one byte */

static BOOL WINAPI OnInterrupt(DWORD event) {
  return event == CTRL_C_EVENT && kill(1); /* from any thread; the next call of a function stops */
}

/* Finds the Ruby engine beside the module when it is not registered: COM looks into the manifests
   that are active on the thread. */
static void ActivateEngine(const char* module) {
  char manifest[MAX_PATH];
  ACTCTXA source = {sizeof source, 0, manifest, 0, 0, NULL, NULL, NULL, NULL};
  const char* name = strrchr(module, '\\');
  ULONG_PTR cookie;
  HANDLE context;
  if (!name) return;
  snprintf(manifest, sizeof manifest, "%.*s\\ruby\\bin\\rubyscript.manifest", (int)(name - module),
           module);
  context = CreateActCtxA(&source);
  if (context != INVALID_HANDLE_VALUE) ActivateActCtx(context, &cookie); /* to the end */
}

int main(int count, char** arguments) {
  static const HostTable kTable = {
      NULL,       GetContext, ReportMessage, DebugOutput, SetFlag, SetFlag,     NULL,
      FunctionId, NULL,       WindowHandle,  NULL,        NULL,    CallFunction};
  static Host host = {&kTable, {{0}, 0, 0, 0, {0}, NULL, 0, 0, 0, {0}, {0}}, {NULL}};
  HMODULE module;
  if (count != 3) {
    fprintf(stderr, "usage: minimal_host FULL-PATH-OF-scriptruby.dll MACRO\n");
    return 2;
  }
  if (!strchr(arguments[1], ':') && strncmp(arguments[1], "\\\\", 2) != 0) {
    fprintf(stderr, "%s is not a full path\n", arguments[1]); /* the engine would not be found */
    return 2;
  }
  ActivateEngine(arguments[1]);
  module = LoadLibraryA(arguments[1]);
  if (!module) {
    fprintf(stderr, "cannot load %s: error %lu\n", arguments[1], GetLastError());
    return 2;
  }
  execute = (int(__stdcall*)(const char*, Host*))(void*)GetProcAddress(module, "execute");
  kill = (unsigned char(__stdcall*)(int32_t))(void*)GetProcAddress(module, "kill");
  if (!execute || !kill) {
    fprintf(stderr, "%s is not the module\n", arguments[1]);
    return 2;
  }
  host.record.resultTexts.ownsElements = host.record.arguments.ownsElements = 1;
  SetConsoleCtrlHandler(OnInterrupt, TRUE);
  switch (execute(arguments[2], &host)) {
    case 1:
      return 0;
    case 0:
      fprintf(stderr, "the macro could not be read, or failed\n");
      return 1;
    default:
      fprintf(stderr, host.record.stopRequested ? "stopped\n" : "the macro could not be run\n");
      return 3;
  }
}
