// SPDX-License-Identifier: MIT
// The documents that macros work on, and what they share: the clipboard and the last match.
//
// Documents count from 1 in the order in which they were opened. The first one is the run's, never
// closes and has the name that it was given; the others are the macros' own and go with the editor.
//
// Steps: everything between BeginStep and EndStep, in every document, is one step of its undo
// history. A run of a macro is one, a nested run one inside it, and so is each call of a function.
#pragma once

#include <cstddef>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "document/Document.h"

class Editor {
 public:
  explicit Editor(Document first, std::filesystem::path name = {});

  Document& First() { return documents.front()->document; }
  Document& Current() { return documents[current]->document; }
  const Document& Current() const { return documents[current]->document; }
  std::size_t DocumentCount() const { return documents.size(); }
  std::size_t CurrentNumber() const { return current + 1; }

  // `number` is from 1 to DocumentCount(). The name is empty for a document without a file.
  const std::filesystem::path& Name(std::size_t number) const {
    return documents[number - 1]->name;
  }
  void SetName(std::size_t number, std::filesystem::path name);
  Document& At(std::size_t number) { return documents[number - 1]->document; }
  void Switch(std::size_t number) { current = number - 1; }
  // Adds a document behind the others and makes it the current one.
  void Open(Document document, std::filesystem::path name);
  // `number` is not 1. The one before the closed one becomes the current one if that was it.
  void Close(std::size_t number);

  void BeginStep();
  void EndStep();

  std::string clipboard;
  // The texts of the last match, the whole and its groups; of a group without a part nothing.
  std::vector<std::optional<std::string>> lastMatch;

 private:
  struct OpenDocument {
    Document document;
    std::filesystem::path name;
  };
  std::vector<std::unique_ptr<OpenDocument>> documents;
  std::size_t current = 0;
  std::size_t steps = 0;  // open
};

// One step, from here to the end of the block.
class EditorStep {
 public:
  explicit EditorStep(Editor& owner) : editor(owner) { editor.BeginStep(); }
  ~EditorStep() { editor.EndStep(); }
  EditorStep(const EditorStep&) = delete;
  EditorStep& operator=(const EditorStep&) = delete;

 private:
  Editor& editor;
};
