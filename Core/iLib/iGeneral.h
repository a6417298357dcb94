// SPDX-License-Identifier: MIT
// Folders: the module's own, the user's, whether they may be written, and making them.
//
// Paths are narrow text in the system's ANSI code page. Threading: none; one thread at a time.
#pragma once

#include "cLib/cString.h"

// Full folder of the loaded module with its trailing backslash; empty when the system does not
// report it. A name of 255 characters or more, or none, is reported (source "iGeneral").
String ModuleFolder();

// Whether the current user, as the thread's token has it when it impersonates, else the process's,
// may read and write the folder by its security descriptor. Nothing is written to find out. False
// for a folder that is missing, and for null.
bool MayReadAndWrite(const char* folder);

// Makes the folder and its missing parents. Whether it is there afterwards; false for empty.
bool EnsureFolder(const char* folder);

// <local application data>\Programs\, made when missing. Empty when the system names no such
// folder.
String ProgramsFolder();

// <local application data>\Programs\Tarn\, made when missing, cached.
const String& ProductFolder();

// Adds a backslash unless the text already ends in one.
void EndWithBackslash(String& path);
