// SPDX-License-Identifier: MIT
// The fixed record in which `version` hands the language description to the host editor, which
// composes recorded keyboard macros from its templates. Texts are zero-terminated 8-bit characters,
// so a field of width N holds at most N - 1.
//
// Ownership: the caller's. The layout is layout version 77 of the host's record.
#pragma once

#include <stddef.h>

#include "cLib/cTypes.h"

constexpr u32 kScriptInfoRecordVersion = 77;

#pragma pack(push, 1)
struct ScriptInfoRecord {
  u32 size;           // in bytes; set by the host, zero after a successful call
  u32 layoutVersion;  // set by the host, zero after a successful call
  char description[56];
  char extension[21];  // of macro files, without the dot
  char macroBegin[76];
  char macroEnd[51];
  char functionPrint[41];  // printf format with one %s for typed text
  char functionPrefix[41];
  char functionPostfix[41];
  char enter[11];
  char crlf[11];
  char lineFeed[11];
  char tick[11];
  char quote[11];
  char openBracket;
  char closeBracket;
};
#pragma pack(pop)

static_assert(offsetof(ScriptInfoRecord, description) == 8, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, extension) == 64, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, macroBegin) == 85, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, macroEnd) == 161, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, functionPrint) == 212, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, functionPrefix) == 253, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, functionPostfix) == 294, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, enter) == 335, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, crlf) == 346, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, lineFeed) == 357, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, tick) == 368, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, quote) == 379, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, openBracket) == 390, "the host reads it here");
static_assert(offsetof(ScriptInfoRecord, closeBracket) == 391, "the host reads it here");
static_assert(sizeof(ScriptInfoRecord) == 392, "the host's size field");
