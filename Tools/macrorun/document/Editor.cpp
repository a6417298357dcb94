// SPDX-License-Identifier: MIT
#include "document/Editor.h"

#include <utility>

Editor::Editor(Document first, std::filesystem::path name) {
  Open(std::move(first), std::move(name));
}

void Editor::SetName(std::size_t number, std::filesystem::path name) {
  documents[number - 1]->name = std::move(name);
}

void Editor::Open(Document document, std::filesystem::path name) {
  documents.push_back(
      std::make_unique<OpenDocument>(OpenDocument{std::move(document), std::move(name)}));
  current = documents.size() - 1;
  for (std::size_t i = 0; i < steps; ++i) Current().BeginStep();
}

void Editor::Close(std::size_t number) {
  documents.erase(documents.begin() + static_cast<std::ptrdiff_t>(number - 1));
  if (current >= number - 1) --current;
}

void Editor::BeginStep() {
  ++steps;
  for (const auto& open : documents) open->document.BeginStep();
}

void Editor::EndStep() {
  --steps;
  for (const auto& open : documents) open->document.EndStep();
}
