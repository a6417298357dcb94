// SPDX-License-Identifier: MIT
#include "Process.h"

#include "Comparison.h"

ProcessTime TimeProcess(std::wstring commandLine, const std::filesystem::path& output) {
  STARTUPINFOW start = {};
  start.cb = sizeof start;
  HANDLE file = INVALID_HANDLE_VALUE;
  if (!output.empty()) {
    SECURITY_ATTRIBUTES inherited = {sizeof inherited, nullptr, TRUE};
    file = CreateFileW(output.c_str(), GENERIC_WRITE, FILE_SHARE_READ, &inherited, CREATE_ALWAYS,
                       FILE_ATTRIBUTE_NORMAL, nullptr);
    if (file == INVALID_HANDLE_VALUE) return {0, STILL_ACTIVE};
    start.dwFlags = STARTF_USESTDHANDLES;
    start.hStdOutput = file;
    start.hStdError = GetStdHandle(STD_ERROR_HANDLE);
  }
  PROCESS_INFORMATION process = {};
  const double begin = Now();
  const bool started = CreateProcessW(nullptr, commandLine.data(), nullptr, nullptr, TRUE, 0,
                                      nullptr, nullptr, &start, &process);
  ProcessTime result = {0, STILL_ACTIVE};
  if (started) {
    WaitForSingleObject(process.hProcess, INFINITE);
    result.seconds = Now() - begin;
    GetExitCodeProcess(process.hProcess, &result.exitCode);
    CloseHandle(process.hThread);
    CloseHandle(process.hProcess);
  }
  if (file != INVALID_HANDLE_VALUE) CloseHandle(file);
  return result;
}

std::wstring CommandLine(const std::filesystem::path& program, const std::wstring& arguments) {
  return L"\"" + program.wstring() + L"\" " + arguments;
}
