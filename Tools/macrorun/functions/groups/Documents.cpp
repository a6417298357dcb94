// SPDX-License-Identifier: MIT
// Several documents. Paths are relative to the current directory. The run decides where document 1
// is written: macros need a path to save it and cannot close it.
#include "functions/MacroCall.h"
#include "functions/groups/FunctionGroups.h"
#include "platform/Encoding.h"
#include "platform/ExitCode.h"
#include "platform/Files.h"

namespace fs = std::filesystem;

namespace {

using Kind = ParameterKind;

MacroResult CurrentNumber(const MacroCall& call) { return Answer(call.editor.CurrentNumber()); }

MacroResult OpenDocument(MacroCall& call) try {
  std::error_code error;
  const fs::path path = fs::absolute(PathFromUtf8(call.Text(0)), error);
  for (std::size_t number = 1; number <= call.editor.DocumentCount(); ++number) {
    if (!fs::equivalent(call.editor.Name(number), path, error)) continue;
    call.editor.Switch(number);
    return CurrentNumber(call);
  }
  call.editor.Open(Document(ReadInput(path)), path);
  return CurrentNumber(call);
} catch (const UsageError& error) {
  call.Fail(0, std::string("a file that can be read (") + error.what() + ")");
}

MacroResult SaveDocument(MacroCall& call) try {
  const std::size_t number = call.editor.CurrentNumber();
  fs::path path = call.editor.Name(number);
  std::error_code error;
  if (call.Has(0))
    path = fs::absolute(PathFromUtf8(call.Text(0)), error);
  else if (number == 1 || path.empty())
    call.Fail(0, "a path, because this document has no file to save to");
  RequireReplaceable(path, false);
  ReplaceFileBytes(path, call.document().Bytes());
  if (number != 1) call.editor.SetName(number, path);
  return 0;
} catch (const UsageError& error) {
  call.Fail(0, std::string("a file that can be written (") + error.what() + ")");
}

MacroResult CloseDocument(MacroCall& call) {
  const std::size_t number = call.Number(0, call.editor.CurrentNumber());
  if (number == 1) call.Fail(0, "a document other than 1, which cannot be closed");
  call.editor.Close(number);
  return 0;
}

constexpr ResultKind kNone = ResultKind::kNone, kNumber = ResultKind::kNumber;
const MacroParameter kDocument = {"document", Kind::kDocument};
const MacroParameter kOptionalDocument = {"document", Kind::kDocument, "the current one"};

const std::vector<MacroFunction> kFunctions = {
    {"new_document",
     {},
     kNumber,
     "opens an empty document and makes it the current one; returns its number",
     [](MacroCall& call) {
       call.editor.Open(Document(""), {});
       return CurrentNumber(call);
     }},
    {"open_document",
     {{"path", Kind::kName}},
     kNumber,
     "opens a file, if it is not open, and makes it the current document; returns its number",
     OpenDocument},
    {"save_document",
     {{"path", Kind::kName, "the document's file"}},
     kNone,
     "writes the current document to a file; document 1 needs a path",
     SaveDocument},
    {"switch_document",
     {kDocument},
     kNone,
     "makes a document the current one, which the other functions work on",
     [](MacroCall& call) -> MacroResult {
       call.editor.Switch(call.Number(0));
       return 0;
     }},
    {"current_document",
     {},
     kNumber,
     "returns the number of the current document",
     [](MacroCall& call) { return CurrentNumber(call); }},
    {"document_count",
     {},
     kNumber,
     "returns the number of documents",
     [](MacroCall& call) { return Answer(call.editor.DocumentCount()); }},
    {"document_name",
     {kOptionalDocument},
     ResultKind::kText,
     "returns the path of a document's file, or an empty text",
     [](MacroCall& call) -> MacroResult {
       return ToUtf8(call.editor.Name(call.Number(0, call.editor.CurrentNumber())));
     }},
    {"close_document",
     {kOptionalDocument},
     kNone,
     "closes a document, but not the first; unsaved changes are lost",
     CloseDocument},
};

}  // namespace

FunctionGroup DocumentGroup() { return {"Documents", kFunctions}; }
