// SPDX-License-Identifier: MIT
// The effect, the result and the refused arguments of each macro function.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iomanip>
#include <set>
#include <sstream>

#include "FunctionTable.h"

namespace {

using Cells = std::vector<std::string>;

std::string Unescaped(const std::string& cell) {
  std::string text;
  for (std::size_t i = 0; i < cell.size(); ++i) {
    if (cell[i] != '\\') {
      text += cell[i];
    } else if (const char kind = cell[++i]; kind == 'x') {
      text += static_cast<char>(std::stoi(cell.substr(i + 1, 2), nullptr, 16));
      i += 2;
    } else {
      text += kind == 'n' ? '\n' : kind == 't' ? '\t' : kind;
    }
  }
  return text;
}

// The rows of a data file in this folder; functions.txt describes the format.
std::vector<Cells> ReadRows(const std::string& name) {
  std::vector<Cells> rows;
  std::ifstream file(DATA_FOLDER "/" + name, std::ios::binary);
  for (std::string line, cell; std::getline(file, line);) {
    if (line.empty() || line[0] == '#') continue;
    std::istringstream cells(line);
    rows.emplace_back();
    while (std::getline(cells, cell, '\t')) rows.back().push_back(Unescaped(cell));
  }
  EXPECT_FALSE(rows.empty()) << name;
  return rows;
}

std::vector<Call> ReadCalls(const std::string& cell) {
  std::vector<Call> calls;
  std::istringstream words(cell);
  for (std::string word; (words >> std::ws).peek() != EOF;) {
    const bool isArgument = words.peek() == '"';
    words >> std::quoted(word, '"', '\0');
    if (isArgument)
      calls.back().arguments.push_back(word);
    else
      calls.push_back({word});
  }
  return calls;
}

TEST(FunctionTest, EffectsAndResults) {
  for (const Cells& row : ReadRows("functions.txt")) {
    SCOPED_TRACE(row[0] + " " + row[1]);
    FakeServices services;
    Editor editor(FromPicture(row[0]));
    std::string result;
    for (const Call& call : ReadCalls(row[1])) result = Do(editor, services, call);
    EXPECT_EQ(Picture(editor.Current()), row[2]);
    const std::string expected = row.size() > 3 ? row[3] : "0";
    EXPECT_EQ(expected[0] == '"' ? '"' + result + '"' : result, expected);
  }
}

// A macro is one undo step. While it runs, each call and each nested macro is a step.
TEST(FunctionTest, StepsOfMacros) {
  FakeServices services;
  Editor editor(FromPicture("|"));
  services.editor = &editor;
  const auto run = [&](const std::vector<Call>& calls) {
    const EditorStep step(editor);
    for (const Call& call : calls) Do(editor, services, call);
  };
  run({{"write", {"a"}}, {"write", {"b"}}});
  run({{"write", {"c"}}, {"run_macro", {"nest"}}, {"write", {"d"}}});
  EXPECT_EQ(Picture(editor.First()), "abc12d|");
  run({{"undo"}});
  EXPECT_EQ(Picture(editor.First()), "ab|");
  run({{"redo"}, {"write", {"e"}}});
  EXPECT_EQ(Picture(editor.First()), "abc12de|");
  run({{"undo"}, {"undo"}});
  EXPECT_EQ(Picture(editor.First()), "|");
  run({{"write", {"p"}}});
  run({{"undo"}, {"write", {"q"}}, {"write", {"r"}}});
  run({{"undo"}});
  EXPECT_EQ(Picture(editor.First()), "|");
  run({{"write", {"c"}}, {"run_macro", {"nest"}}, {"undo"}, {"new_document"}, {"write", {"x"}}});
  EXPECT_EQ(Picture(editor.First()), "c|");
  run({{"undo"}, {"undo"}});
  EXPECT_EQ(Picture(editor.Current()), "|");
  EXPECT_EQ(Picture(editor.First()), "c|");
}

TEST(FunctionTest, Documents) {
  namespace fs = std::filesystem;
  FakeServices services;
  Editor editor(FromPicture("one"), "one.txt");
  const auto call = [&](const std::string& name, std::vector<std::string> arguments = {}) {
    return Do(editor, services, {name, std::move(arguments)});
  };
  const fs::path folder = fs::temp_directory_path() / "macrorun-tests \u00e4\u65e5";
  fs::create_directory(folder);
  const fs::path file = folder / "t.txt";
  std::ofstream(file, std::ios::binary) << "a\r\nb";
  const std::string name = reinterpret_cast<const char*>(file.u8string().c_str());

  EXPECT_EQ(call("open_document", {name}), "2");
  call("append_text", {"\nc"});
  EXPECT_EQ(call("new_document"), "3");
  EXPECT_EQ(call("document_name"), "");
  EXPECT_THROW(call("save_document"), WrongCall);
  EXPECT_THROW(call("save_document", {"no such folder/x"}), WrongCall);
  call("save_document", {name + ".new"});
  EXPECT_EQ(call("document_name"), name + ".new");
  fs::remove(folder / "t.txt.new");
  EXPECT_EQ(call("open_document", {name}), "2");
  EXPECT_EQ(call("get_line", {"3"}), "c");
  call("save_document");
  std::ifstream saved(file, std::ios::binary);
  EXPECT_EQ(std::string(std::istreambuf_iterator<char>(saved), {}), "a\r\nb\r\nc");
  saved.close();
  fs::permissions(file, fs::perms::owner_read);
  EXPECT_THROW(call("save_document"), WrongCall) << "write-protected";
  fs::permissions(file, fs::perms::owner_write, fs::perm_options::add);
  EXPECT_EQ(std::distance(fs::directory_iterator(folder), {}), 1);

  call("close_document", {"3"});
  EXPECT_EQ(call("document_name"), name);
  call("close_document");
  EXPECT_EQ(call("current_document"), "1");
  EXPECT_EQ(call("document_name", {"1"}), "one.txt");
  EXPECT_EQ(call("document_count"), "1");
  for (const char* refused : {"close_document", "save_document"})
    EXPECT_THROW(call(refused), WrongCall) << refused;
  EXPECT_THROW(call("open_document", {name + "x"}), WrongCall);
  EXPECT_THROW(call("switch_document", {"2"}), WrongCall);
  fs::remove_all(folder);
}

TEST(FunctionTest, UserArgumentsAndMacros) {
  FakeServices services;
  Editor editor(FromPicture("|"));
  services.editor = &editor;
  services.arguments["width"] = "72";
  const auto call = [&](const Call& what) { return Do(editor, services, what); };
  call({"message", {"a", "", "b"}});
  call({"message"});
  EXPECT_EQ(services.messages, "a  b\n\n");
  EXPECT_EQ(call({"prompt", {"who?", "me"}}), "who?=me");
  EXPECT_EQ(call({"argument", {"width", "80"}}), "72");
  EXPECT_EQ(call({"argument", {"height", ""}}), "");
  EXPECT_EQ(call({"run_macro", {"missing"}}), "0");
  EXPECT_EQ(call({"run_macro", {"nest"}}), "1");
  EXPECT_EQ(Picture(editor.First()), "12|");
}

TEST(FunctionTest, WrongCallsChangeNothingAndSayWhatIsRight) {
  std::vector<Cells> rows = ReadRows("wrong-calls.txt");
  rows.push_back({"write \"" + std::string(512, 'x') + '"', "1", "may have been cut"});
  rows.push_back({"write \"" + std::string(511, 'x') + "yä\"", "1", "cut"});
  for (const Cells& row : rows) {
    const Call call = ReadCalls(row[0]).front();
    SCOPED_TRACE(call.function + " " + row[2]);
    FakeServices services;
    Editor editor(FromPicture("ä[b\nc|d\n"));
    try {
      Do(editor, services, call);
      ADD_FAILURE() << "accepted";
    } catch (const WrongCall& error) {
      EXPECT_NE(std::string(error.what()).find(row[2]), std::string::npos) << error.what();
      EXPECT_EQ(error.function, call.function);
      EXPECT_EQ(std::to_string(error.argument), row[1]);
      EXPECT_NE(std::string(error.what()).find(error.expected), std::string::npos);
    }
    EXPECT_EQ(Picture(editor.First()), "ä[b\nc|d\n");
    EXPECT_FALSE(editor.First().Undo());
  }
}

// A search that takes too long is a wrong call.
TEST(FunctionTest, ARegularExpressionThatTakesTooLong) {
  FakeServices services;
  Editor editor(Document(std::string(200, 'a') + "b"));
  EXPECT_THROW(Do(editor, services, {"find_regex", {"(a|aa)+$"}}), WrongCall);
}

// A text that would reach the macro changed is refused.
TEST(FunctionTest, ResultsThatCannotPass) {
  const std::string longest(1023, 'x');
  FakeServices services;
  Editor editor(Document(longest + "\n" + longest + "x\na" + std::string(1, '\0')));
  EXPECT_EQ(Do(editor, services, {"get_line", {"1"}}), longest);
  EXPECT_EQ(Do(editor, services, {"get_text", {"1", "1", "1023"}}), longest);
  for (const Call& call : {Call{"get_line", {"2"}}, Call{"get_line", {"3"}}, Call{"get_text"}})
    EXPECT_THROW(Do(editor, services, call), WrongCall) << call.function;
  const HostArgument line = {0, "1", 0, kTextArgument};
  Editor umlaut(Document("\xc3\x84"));
  EXPECT_THROW(CallMacroFunction(MacroFunctionId("get_line"), umlaut, services, {&line, 1},
                                 ResultEncoding::kCharacters),
               WrongCall);
}

TEST(FunctionTest, TheTable) {
  std::set<std::string> names;
  for (const MacroFunction& function : MacroFunctions()) {
    SCOPED_TRACE(function.name);
    EXPECT_TRUE(names.insert(function.name).second);
    EXPECT_STRNE(function.group, "");
    bool optional = false;
    for (const MacroParameter& parameter : function.parameters) {
      EXPECT_TRUE(parameter.Optional() || !optional) << parameter.name;
      optional = parameter.Optional();
    }
  }
  EXPECT_EQ(MacroFunctionId("WRITE"), MacroFunctionId("write"));
  EXPECT_EQ(MacroFunctionId("writ"), kUnknownId);
  FakeServices services;
  Editor editor(FromPicture(""));
  for (const std::uint32_t id : {0u, kUnknownId})
    EXPECT_THROW(CallMacroFunction(id, editor, services, {}, ResultEncoding::kBytes), WrongCall);
}

}  // namespace
