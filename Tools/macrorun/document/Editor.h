// SPDX-License-Identifier: MIT
// The documents that macros work on, and what they share: the clipboard and the last match.
//
// Documents count from 1 in the order in which they were opened. Document 1 belongs to the run and
// cannot be closed. Macros open the others, which are closed with the editor.
//
// In every document, the changes between BeginStep and EndStep are one undo step. A macro run is a
// step; in it each nested run and each function call is one.
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

  // `number` is from 1 to DocumentCount(). The name of a document without a file is empty.
  const std::filesystem::path& Name(std::size_t number) const {
    return documents[number - 1]->name;
  }
  void SetName(std::size_t number, std::filesystem::path name);
  Document& At(std::size_t number) { return documents[number - 1]->document; }
  void Switch(std::size_t number) { current = number - 1; }
  // Appends a document and makes it the current one.
  void Open(Document document, std::filesystem::path name);
  // `number` is not 1. If the current document is closed, the one before it becomes the current
  // one.
  void Close(std::size_t number);

  void BeginStep();
  void EndStep();

  std::string clipboard;
  // The texts of the last match: the match and its groups. A group that did not take part has none.
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

// One step until the end of the scope.
class EditorStep {
 public:
  explicit EditorStep(Editor& owner) : editor(owner) { editor.BeginStep(); }
  ~EditorStep() { editor.EndStep(); }
  EditorStep(const EditorStep&) = delete;
  EditorStep& operator=(const EditorStep&) = delete;

 private:
  Editor& editor;
};
