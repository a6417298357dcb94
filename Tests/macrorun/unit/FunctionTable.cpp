// SPDX-License-Identifier: MIT
#include "FunctionTable.h"

// The macro "nest" writes twice, as one step.
bool FakeServices::RunMacro(const std::filesystem::path& macro) {
  if (macro != "nest") return false;
  const EditorStep step(*editor);
  for (const char* text : {"1", "2"}) Do(*editor, *this, {"write", {text}});
  return true;
}

Document FromPicture(std::string_view picture) {
  std::string text(picture);
  const std::size_t anchor = text.find('[');
  if (anchor != text.npos) text.erase(anchor, 1);
  const std::size_t cursor = text.find('|');
  if (cursor != text.npos) text.erase(cursor, 1);
  Document document(text);
  const auto place = [&](std::size_t offset) {
    std::string before = text.substr(0, offset);
    Position result;
    for (const char character : before)
      result = character == '\n' ? Position{result.line + 1, 0}
                                 : Position{result.line, result.offset + (character != '\r')};
    return result;
  };
  if (cursor != text.npos) document.MoveCursor(place(cursor));
  if (anchor != text.npos) document.Select({place(anchor), place(cursor)});
  return document;
}

std::string Picture(const Document& document) {
  const Range selection = document.Selection();
  std::string text = document.Text({{}, selection.from});
  if (document.HasSelection()) text += "[" + document.Text(selection);
  return text + "|" + document.Text({selection.to, document.End()});
}

std::string Do(Editor& editor, EditorServices& services, const Call& call) {
  std::vector<HostArgument> arguments;
  for (const std::string& text : call.arguments)
    arguments.push_back({0, text.c_str(), 0, kTextArgument});
  const MacroResult result = CallMacroFunction(MacroFunctionId(call.function), editor, services,
                                               arguments, ResultEncoding::kBytes);
  if (const auto* number = std::get_if<std::int32_t>(&result)) return std::to_string(*number);
  return std::get<std::string>(result);
}
