// SPDX-License-Identifier: MIT
#include "FileBenchmark.h"

#include <windows.h>
// Needs windows.h before it.
#include <objbase.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>

#include "Description.h"
#include "Module.h"
#include "Section.h"
#include "iLib/iFile.h"

namespace fs = std::filesystem;

namespace {

// --- Macro files ---------------------------------------------------------------------------------

constexpr int kMegabytes[] = {1, 10, 50};

// The module's own steps: the file's bytes, then those as UTF-16. Negative when there is no text.
double TimeLoad(const std::string& file) {
  const double start = Now();
  wchar_t* const text = LoadFileAsWideText(file.c_str());
  const double seconds = Now() - start;
  CoTaskMemFree(text);
  return text ? seconds : -1;
}

double TimeBareLoad(const std::string& file, std::size_t size) {
  const double start = Now();
  const HANDLE handle = CreateFileA(file.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr,
                                    OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr);
  char* const bytes = static_cast<char*>(CoTaskMemAlloc(size + 1));
  wchar_t* const units = static_cast<wchar_t*>(CoTaskMemAlloc(2 * size + 2));
  DWORD read = 0;
  const bool whole = bytes && units &&
                     ReadFile(handle, bytes, static_cast<DWORD>(size), &read, nullptr) &&
                     read == size;
  if (whole) {
    bytes[size] = 0;
    std::mbstowcs(units, bytes, size + 1);
  }
  CoTaskMemFree(bytes);
  CloseHandle(handle);
  const double seconds = Now() - start;
  CoTaskMemFree(units);
  return whole ? seconds : -1;
}

std::string MacroText(std::size_t size) {
  const std::string line = "# a line of a macro that does nothing but take its time to be read\n";
  std::string text;
  while (text.size() + line.size() <= size) text += line;
  return text + std::string(size - text.size(), '#');
}

// What a megabyte takes, from the smallest size on.
struct Growth {
  void Add(double seconds, int megabytes) {
    const double each = seconds / megabytes;
    if (first == 0) first = each;
    char times[32];
    std::snprintf(times, sizeof times, " (%.2fx)", each / first);
    text += (text.empty() ? "" : ", ") + TimeText(each) + times;
  }
  std::string text;
  double first = 0;
};

// --- The DLL -------------------------------------------------------------------------------------

// Loading and unloading, the libraries that it needs being there.
double TimeLibrary(const fs::path& file) {
  const double start = Now();
  const HMODULE library = LoadLibraryW(file.c_str());
  if (!library) return -1;
  FreeLibrary(library);
  return Now() - start;
}

// Relocations of the file, from its headers and its table of blocks.
int CountRelocations(const std::string& file) {
  const auto at = [&](std::size_t place, auto value) {
    if (place + sizeof value <= file.size()) std::memcpy(&value, file.data() + place, sizeof value);
    return value;
  };
  const std::size_t header = at(offsetof(IMAGE_DOS_HEADER, e_lfanew), 0u);
  const auto head = at(header, IMAGE_NT_HEADERS32());
  const auto table = head.OptionalHeader.DataDirectory[IMAGE_DIRECTORY_ENTRY_BASERELOC];
  const std::size_t sections =
      header + offsetof(IMAGE_NT_HEADERS32, OptionalHeader) + head.FileHeader.SizeOfOptionalHeader;
  for (int i = 0; i < head.FileHeader.NumberOfSections; ++i) {
    const auto part = at(sections + i * sizeof(IMAGE_SECTION_HEADER), IMAGE_SECTION_HEADER());
    if (table.VirtualAddress != part.VirtualAddress) continue;
    int count = 0;
    for (DWORD offset = 0; offset < table.Size;) {
      const std::size_t place = part.PointerToRawData + offset;
      const auto block = at(place, IMAGE_BASE_RELOCATION());
      if (block.SizeOfBlock < sizeof block) break;
      for (DWORD entry = sizeof block; entry < block.SizeOfBlock; entry += sizeof(WORD))
        count += at(place + entry, WORD()) >> 12 == IMAGE_REL_BASED_HIGHLOW;
      offset += block.SizeOfBlock;
    }
    return count;
  }
  return 0;
}

}  // namespace

bool CompareMacroFiles(Section& section) {
  section.Begin("Reading a macro file",
                "The file's bytes and the same text in UTF-16, against one read into a block and "
                "`mbstowcs` into another. The time for each megabyte shows how it grows.");
  section.Head();
  Module module(kShortDescription);
  Growth own;
  Growth peer;
  for (const int megabytes : kMegabytes) {
    const std::size_t size = static_cast<std::size_t>(megabytes) << 20;
    const std::string file = module.Macro("large-" + std::to_string(megabytes), MacroText(size));
    Comparison comparison(std::to_string(megabytes) + " MB : one read and conversion",
                          Comparison::Measure::kRatio, 1.2);
    if (!comparison.Measured([&] { return TimeLoad(file); },
                             [&] { return TimeBareLoad(file, size); }, megabytes < 10 ? 15 : 3)) {
      std::fprintf(stderr, "%s cannot be read\n", file.c_str());
      return false;
    }
    section.Add(comparison);
    own.Add(comparison.Time(), megabytes);
    peer.Add(comparison.PeerTime(), megabytes);
  }
  section.Print("\nFor each megabyte of 1, 10 and 50 MB: " + own.text + "; the peer: " + peer.text +
                ".\n");
  return true;
}

bool CompareModuleFile(Section& section) {
  const fs::path folder = ProgramFolder();
  std::ifstream file(folder / "scriptruby.dll", std::ios::binary);
  const std::string bytes(std::istreambuf_iterator<char>(file), {});
  section.Begin("The module's file",
                "`scriptruby.dll` has " + std::to_string(bytes.size()) + " bytes and " +
                    std::to_string(CountRelocations(bytes)) +
                    " relocations. Loading includes unloading; its peer is a DLL that does nothing "
                    "and needs the C runtime alone.");
  section.Head();
  Module module(JScriptDescription());
  const fs::path copy = module.Folder() / "other.dll";
  fs::copy_file(folder / "scriptruby.dll", copy);
  Comparison load("loading : an empty DLL");
  Comparison version("`version` : fifteen profile reads", Comparison::Measure::kRatio, 1);
  const auto reads = [&] { return TimeReads(module.DescriptionFile()); };
  if (!load.Measured([&] { return TimeLibrary(copy); },
                     [&] { return TimeLibrary(folder / "benchmark-empty.dll"); }, 9) ||
      !version.Measured([&] { return module.TimeVersion(); }, reads, 15)) {
    std::fprintf(stderr, "loading or version failed\n");
    return false;
  }
  section.Add(load);
  section.Add(version);
  return true;
}
