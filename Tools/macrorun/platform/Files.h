// SPDX-License-Identifier: MIT
// Reads texts from files and standard input and writes them to files, byte for byte.
//
// Errors: UsageError, which names the file and the system's reason.
// Threading: any thread. When two processes replace the same file at a time, one of them fails.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

// Expands * and ? in the last part of a path, sorted by name; the Windows shell leaves that to the
// program. Any other path is returned unchanged.
std::vector<std::filesystem::path> FilesMatching(const std::filesystem::path& pattern);

// "-" is standard input, an empty path an empty text.
std::string ReadInput(const std::filesystem::path& path);

// Fails unless the file can be read. `what` is its purpose, for the message.
void RequireReadable(const std::filesystem::path& path, const char* what);

// Fails unless the macro can be read and is not UTF-16. The module takes each byte for a character.
void RequireMacro(const std::filesystem::path& path);

// Fails when ReplaceFileBytes cannot start: the file is missing although it `mustExist`, its folder
// is missing, or it is write-protected.
void RequireReplaceable(const std::filesystem::path& path, bool mustExist);

// Writes the bytes to NAME.macrorun~ beside the file and renames that. At each moment the file is
// the old or the complete new one. On failure it is the old one, and the temporary file is removed;
// a killed process can leave it, and the next call replaces it. The new file gets the attributes
// and the access list of the old one (under Wine: the mode of any new file).
void ReplaceFileBytes(const std::filesystem::path& path, const std::string& bytes);
