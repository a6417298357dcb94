// SPDX-License-Identifier: MIT
// The effect, the result and the refused arguments of each macro function.
#include <gtest/gtest.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <set>

#include "FunctionTable.h"

namespace {

struct Case {
  const char* before;
  std::vector<Call> calls;
  const char* after;
  const char* result = "0";  // of the last call
};

void Check(const std::vector<Case>& cases) {
  for (const Case& row : cases) {
    SCOPED_TRACE(std::string(row.before) + " " + row.calls.back().function);
    FakeServices services;
    Editor editor(FromPicture(row.before));
    std::string result;
    for (const Call& call : row.calls) result = Do(editor, services, call);
    EXPECT_EQ(Picture(editor.Current()), row.after);
    EXPECT_EQ(result, row.result);
  }
}

TEST(FunctionTest, CursorAndWords) {
  Check({
      {"ä\xffx|y\n", {{"cursor_column"}}, "ä\xffx|y\n", "4"},
      {"a\nb\n|", {{"cursor_line"}}, "a\nb\n|", "3"},
      {"|äöü\n", {{"goto", {"1", "3"}}}, "äö|ü\n"},
      {"|a\n", {{"goto", {"2", "1"}}}, "a\n|"},
      {"a|b\ncd", {{"line_end"}}, "ab|\ncd"},
      {"ab\nc|d", {{"line_start"}}, "ab\n|cd"},
      {"a|b\nc", {{"document_end"}}, "ab\nc|"},
      {"a|b\nc\n", {{"document_end"}}, "ab\nc\n|"},
      {"ab\nc|", {{"document_start"}}, "|ab\nc"},
      {"[a😀|\nb", {{"cursor_right", {"2"}}}, "a😀\nb|", "2"},
      {"a|b", {{"cursor_right", {"9"}}}, "ab|", "1"},
      {"a\n\xf0\x9f|", {{"cursor_left", {"3"}}}, "a|\n\xf0\x9f", "3"},
      {"abc|\nä\n", {{"cursor_down"}}, "abc\nä|\n", "1"},
      {"abc\nd|", {{"cursor_down", {"2"}}}, "abc\nd|", "0"},
      {"abc\ndef\n|", {{"cursor_up", {"5"}}}, "|abc\ndef\n", "2"},
      {"|", {{"cursor_down"}}, "|", "0"},
      {"a|b_1, über\n", {{"word_right"}}, "ab_1, |über\n", "1"},
      {"ab, |\n(c\n", {{"word_right", {"5"}}}, "ab, \n(c\n|", "2"},
      {"ab, é\n (|c", {{"word_left"}}, "ab, |é\n (c", "1"},
      {"ab cd|", {{"word_left", {"7"}}}, "|ab cd", "2"},
  });
}

TEST(FunctionTest, Selection) {
  Check({
      {"|ab\ncd\n", {{"select", {"1", "2", "2", "2"}}}, "a[b\nc|d\n"},
      {"|ab\ncd\n", {{"select_all"}}, "[ab\ncd\n|"},
      {"ab\nc|d", {{"select_line"}, {"delete_selection"}}, "ab\n|"},
      {"|ab\ncd\n", {{"select_line", {"2"}}, {"selection"}}, "ab\n[cd\n|", "cd\n"},
      {"x süß|!", {{"select_word"}}, "x [süß|!", "1"},
      {"x (|)", {{"select_word"}}, "x (|)", "0"},
      {"a[b\nc|d", {{"selection_line"}}, "a[b\nc|d", "1"},
      {"ä[b\nc|d", {{"selection_column"}}, "ä[b\nc|d", "2"},
      {"a[b|c", {{"replace_selection", {"x\ny"}}}, "a[x\ny|c"},
      {"a[b|c", {{"clear_selection"}, {"has_selection"}}, "ab|c", "0"},
      {"a[b|c", {{"write", {"xy"}}}, "axy|c"},
      {"a[b|c", {{"insert_line", {"1", "new"}}, {"has_selection"}}, "new\na[b|c", "1"},
      {"a[b|c", {{"goto", {"1", "1"}}, {"has_selection"}}, "|abc", "0"},
  });
}

TEST(FunctionTest, LinesAndText) {
  Check({
      {"ab|c", {{"set_line", {"1", "xü"}}}, "x|ü"},  // not inside a character
      {"a\nb|\nc\n", {{"delete_lines", {"1", "2"}}}, "|c\n"},
      {"a\nb\nc|", {{"replace_lines", {"1", "2", "x\ny\nz\n"}}}, "x\ny\nz\nc|"},
      {"a\nb\nc|", {{"replace_lines", {"2", "3", ""}}}, "a|"},
      {"a|b\n  c\nd\n", {{"join_lines", {"1", "3"}}}, "a|b   c d\n"},
      {"a|b\nc\n", {{"join_lines", {"1", "2", ""}}}, "a|bc\n"},
      {"äö|ü\n", {{"split_line", {"1", "2"}}}, "ä\nö|ü\n"},
      {"a\nb|\n", {{"duplicate_line"}}, "a\nb|\nb\n"},
      {"a\nb|", {{"duplicate_line", {"2"}}}, "a\nb|\nb"},
      {"a\nb|c\nd", {{"move_line_up"}}, "b|c\na\nd", "1"},
      {"a\nb|c\nd", {{"move_line_down"}}, "a\nd\nb|c", "1"},
      {"a|\nb", {{"move_line_up"}}, "a|\nb", "0"},
      {"c|\nB\na\nb", {{"sort_lines", {"1", "4"}}}, "B\na\nb\nc|", "4"},
      {"|b\nB\na", {{"sort_lines", {"1", "3", "ignore_case descending"}}}, "|b\nB\na", "3"},
      {"|b\nB\na\nb", {{"sort_lines", {"1", "4", "unique ignore_case"}}}, "a\n|b", "2"},
      {"|äb\n", {{"line_length", {"1"}}}, "|äb\n", "2"},
      {"|äb\nc", {{"text_length"}}, "|äb\nc", "4"},
      {"|äb\ncd\n", {{"get_text"}}, "|äb\ncd\n", "äb\ncd\n"},
      {"|äb\ncd\n", {{"get_text", {"1", "2", "3"}}}, "|äb\ncd\n", "b\nc"},
      {"|äb\ncd", {{"get_text", {"2", "2"}}}, "|äb\ncd", "d"},
      {"|äb\ncd\n", {{"get_text", {"3", "1", "9"}}}, "|äb\ncd\n", ""},
      {"a|b\ncd\n", {{"set_text", {"x\ny"}}}, "|x\ny"},
      {"|a", {{"append_text", {"b\n"}}}, "|ab\n"},
      {"|a\n", {{"append_text", {"b"}}}, "|a\nb"},
  });
}

TEST(FunctionTest, DeletingCaseAndIndent) {
  Check({
      {"a|ö\nb", {{"delete_char", {"2"}}}, "a|b"},
      {"aö\n|b", {{"backspace", {"2"}}}, "a|b"},
      {"a[ö|b", {{"backspace", {"2"}}}, "a|b"},
      {"a\n|", {{"delete_char"}}, "a\n|"},
      {"a\n|", {{"backspace"}}, "a|"},
      {"a b|c, d", {{"delete_word"}}, "a b|d"},
      {"ä|b c", {{"upper"}}, "ÄB| c", "1"},
      {"[STRASSE Ω\xc4|x", {{"lower"}}, "[strasse ω\xc4|x", "1"},
      {"[élan VITAL|x", {{"title"}}, "[Élan Vital|x", "1"},
      {" |", {{"upper"}}, " |", "0"},
      {"[a\n\nb\n|c", {{"indent", {"2"}}}, "  [a\n\n  b\n|c"},
      {"a|b", {{"indent"}}, "\ta|b"},
      {"[   a\n\tb\nc|", {{"unindent", {"2"}}}, "[ a\nb\nc|"},
      {"         a|", {{"unindent"}}, " a|"},
  });
}

TEST(FunctionTest, FindAndReplace) {
  Check({
      {"a|b.b\nb", {{"find", {".b"}}}, "ab[.b|\nb", "1"},
      {"x|x\nüx", {{"find", {"x"}}, {"find", {"x"}}}, "xx\nü[x|", "1"},
      {"x|a", {{"find", {"x"}}}, "x|a", "0"},
      {"x|a", {{"find", {"x", "wrap"}}}, "[x|a", "1"},
      {"x x [x| x", {{"find", {"x", "backward"}}}, "x [x| x x", "1"},
      {"|x x", {{"find", {"x", "backward wrap"}}}, "x [x|", "1"},
      {"|Ärger", {{"find", {"äRG", "ignore_case"}}}, "[Ärg|er", "1"},
      {"|über über_ über",
       {{"find", {"über", "whole_word"}}, {"find", {"über", "whole_word"}}},
       "über über_ [über|",
       "1"},
      {"|a\nb\n", {{"find", {"a\nb\n"}}}, "[a\nb\n|", "1"},
      {"|ü\xbc\xbc", {{"find", {"\xbc"}}}, "ü[\xbc|\xbc", "1"},  // not a part of a character
      {"|a\xffx1", {{"find_regex", {"\\w\\d"}}}, "a\xff[x1|", "1"},
      {"|ab\ncd", {{"find_regex", {"^\\wx+d"}}}, "|ab\ncd", "0"},
      {"|ab\ncd", {{"find_regex", {"^(c)(x)?d$"}}, {"match_group", {"1"}}}, "ab\n[cd|", "c"},
      {"|ab\ncd", {{"find_regex", {"^(c)(x)?d$"}}, {"match_group", {"2"}}}, "ab\n[cd|", ""},
      {"a|\nb\nc", {{"find_regex", {"^"}}, {"find_regex", {"^"}}}, "a\nb\n|c", "1"},
      {"|a b b", {{"replace", {"b", "x\ny"}}}, "a x\ny| b", "1"},
      {"|ab", {{"replace_regex", {"(a)", "x"}}, {"match_group", {"1"}}}, "x|b", "a"},
      {"a [b| b",
       {{"replace", {"b", "x", "wrap"}}, {"replace", {"b", "y", "wrap"}}},
       "a y| x",
       "1"},
      {"|2024-05",
       {{"replace_regex", {"(?<y>\\d+)-(\\d+)", "$2.\\1${y}$$\\\\\\t$0"}}},
       "05.20242024$\\\t2024-05|",
       "1"},
      {"aa|a b\na\n", {{"replace_all", {"a", "ää"}}}, "ääää|ää b\nää\n", "4"},
      {"a[a|a", {{"replace_all", {"a", "", "selection"}}}, "a|a", "1"},
      {"|a.b\n", {{"replace_all_regex", {".", "$0\\n"}}}, "|a\n.\nb\n\n", "3"},
      {"|a\nb\n", {{"replace_all_regex", {"$", ";"}}}, "|a;\nb;\n", "2"},
      {"|a\n\nb", {{"replace_all_regex", {"\\n+", "\\n"}}}, "|a\nb", "1"},
      {"|\xff"
       "a\xfe"
       "a",
       {{"replace_all_regex", {"a", "é"}}},
       "|\xffé\xfeé",
       "2"},
      {"|b", {{"replace_all_regex", {"a*", "x"}}}, "x|bx", "2"},
  });
}

TEST(FunctionTest, MarksClipboardAndUndo) {
  Check({
      {"a|b",
       {{"set_mark", {"m"}}, {"insert_line", {"1", "x"}}, {"goto_mark", {"m"}}},
       "x\na|b",
       "1"},
      {"a|b",
       {{"set_mark", {"m"}},
        {"replace_all", {"a", "xyz"}},
        {"goto", {"1", "1"}},
        {"goto_mark", {"m"}}},
       "xyz|b",
       "1"},
      {"b\n|a\n",
       {{"set_mark", {"m"}},
        {"sort_lines", {"1", "2"}},
        {"undo"},
        {"redo"},
        {"document_end"},
        {"goto_mark", {"m"}}},
       "|a\nb\n",
       "1"},
      {"a|", {{"set_mark", {"m"}}, {"delete_mark", {"m"}}, {"goto_mark", {"m"}}}, "a|", "0"},
      {"a[b\nc|", {{"copy"}, {"document_start"}, {"paste"}}, "b\nc|ab\nc"},
      {"a[b|c", {{"cut"}, {"paste"}, {"paste"}}, "abb|c"},
      {"a|", {{"copy"}}, "a|", "0"},
      {"a[b|c", {{"cut"}, {"new_document"}, {"clipboard"}}, "|", "b"},
      {"|a", {{"write", {"1"}}, {"write", {"2"}}, {"undo"}}, "1|a", "1"},
      {"|a", {{"undo"}}, "|a", "0"},
      {"|a", {{"write", {"1"}}, {"undo"}, {"write", {"2"}}, {"redo"}}, "2|a", "0"},
  });
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
  struct Row {
    Call call;
    std::size_t argument;
    const char* text;
  };
  const Row rows[] = {
      {{"goto", {"1"}}, 0, "goto: expected 2 arguments (line, column), got 1"},
      {{"find", {}}, 0, "find: expected 1 to 2 arguments (text[, options]), got 0"},
      {{"get_text", {"1", "1", "1", "1"}}, 0, "0 to 3 arguments ([line[, column[, count]]])"},
      {{"goto", {"1", "4"}}, 2, "expected a column of line 1 from 1 to 3, got \"4\""},
      {{"goto", {"3", "2"}}, 2, "a column of line 3 from 1 to 1"},
      {{"cursor_left", {"-1"}}, 1, "expected a number from 0 to 2147483647, got \"-1\""},
      {{"select", {"2", "1", "1", "1"}}, 3, "a position that is not before the first"},
      {{"delete_lines", {"2", "1"}}, 2, "a line number from 2 to 2"},
      {{"sort_lines", {"1", "2", "unique up"}},
       3,
       "only words of this list: descending, ignore_case, unique"},
      {{"find", {""}}, 1, "a text that is not empty"},
      {{"find", {"x", "selection"}}, 2, "backward, wrap, got \"selection\""},
      {{"replace_all_regex", {"a(b", ""}}, 1, "missing closing parenthesis at character 4"},
      {{"find_regex", {"\xff"}}, 1, "UTF-8"},
      {{"match_group", {"0"}}, 1, "an earlier match"},
      {{"indent", {"1001"}}, 1, "at most 1000 spaces"},
      {{"insert_line", {"1", "a\nb"}}, 2, "one line without a line end"},
      {{"set_mark", {""}}, 1, "a text that is not empty"},
      {{"write", {std::string(512, 'x')}}, 1, "may have been cut"},
      {{"write", {std::string(511, 'x') + "yä"}}, 1, "cut"},
      {{"prompt", {"nobody?"}}, 0, "prompt: expected an answer, got none (use --answer"},
      {{"argument", {"none"}}, 1, "the name of an argument of the macro"},
  };
  for (const Row& row : rows) {
    SCOPED_TRACE(row.call.function + " " + row.text);
    FakeServices services;
    Editor editor(FromPicture("ä[b\nc|d\n"));
    try {
      Do(editor, services, row.call);
      ADD_FAILURE() << "accepted";
    } catch (const WrongCall& error) {
      EXPECT_NE(std::string(error.what()).find(row.text), std::string::npos) << error.what();
      EXPECT_EQ(error.function, row.call.function);
      EXPECT_EQ(error.argument, row.argument);
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
