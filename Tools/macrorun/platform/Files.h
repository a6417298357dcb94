// SPDX-License-Identifier: MIT
// The texts that a macro works on, from and to files and from standard input, byte for byte.
//
// Errors: UsageError, which names the file and the system's reason.
// Threading: any thread; two processes that replace the same file at a time get in each other's way,
// and one of them fails.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

// The files that a name with * or ? in its last part stands for, by name: the system's shell leaves them
// to the program. Any other name stands for itself.
std::vector<std::filesystem::path> FilesMatching(const std::filesystem::path& pattern);

// "-" is standard input, an empty path an empty text.
std::string ReadInput(const std::filesystem::path& path);

// Fails unless the file can be read. `what` says what it is for.
void RequireReadable(const std::filesystem::path& path, const char* what);

// Fails unless it is a macro that can be read, and that the module can: it takes each byte for a
// character, which makes nonsense of UTF-16.
void RequireMacro(const std::filesystem::path& path);

// Fails unless ReplaceFileBytes could begin: an existing file has to be there (or may be, without
// `mustExist`) and must not be write-protected.
void RequireReplaceable(const std::filesystem::path& path, bool mustExist);

// Writes the bytes beside the file, as NAME.macrorun~, and renames. At each moment the file is the
// old or the complete new one; when anything fails it is the old one, and nothing else stays behind.
// A process that is killed may leave NAME.macrorun~, which the next call replaces. The new file has
// the attributes and the access list of the old one (under Wine: the mode of any new file).
void ReplaceFileBytes(const std::filesystem::path& path, const std::string& bytes);
