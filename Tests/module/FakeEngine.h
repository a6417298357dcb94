// SPDX-License-Identifier: MIT
// A recording Active Scripting engine, which takes the place of the system's JScript in this
// process. It logs every call of the script site, in order and with arguments, answers what the
// test says, and lets it play the script.
#pragma once

#include <windows.h>
// clang-format off
#include <oleauto.h>
#include <activscp.h>
// clang-format on

#include <map>
#include <string>
#include <vector>

#include "../support/Values.h"

inline std::map<std::string, HRESULT> results;  // by step as it is logged; S_OK for others
inline std::wstring source;                     // what ParseScriptText got
inline IActiveScriptSite* site = nullptr;       // of the engine whose script is running
inline int engineReferences = 0;                // to all engines

void RegisterFakeEngine();  // needs an initialised apartment
HRESULT __stdcall CreateFakeEngine(void*, IUnknown*, REFIID riid, void** object);

// The `tarn` object as an engine gets it from the site.
IDispatch* Item();
// The script's call `tarn.name(arguments)`: logs its outcome and result, frees the arguments.
HRESULT Call(const wchar_t* name, std::vector<VARIANT> arguments = {});
