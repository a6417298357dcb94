# SPDX-License-Identifier: MIT
"""Where the module's sources can be mutated, found in the compiler's own syntax tree.

A site is one small change to one file that a programmer could have made by mistake. Every site of a
tree has a number, the same one as long as the sources stay as they are.
"""

import json
import re
import shlex
import subprocess
from dataclasses import dataclass
from pathlib import Path

from clang.cindex import Cursor, CursorKind, Index, TypeKind

FOLDERS = ("Core/cLib/", "Core/iLib/", "Core/xLib/", "Scripting/scriptruby/")
# Targets whose sources are parsed: the module's, and tests for the headers that only they include.
TARGETS = ("scriptruby_core", "scriptruby_module", "core_tests")

# Operators, what takes their place, and the name of the change.
OPERATORS = {
    "==": ("!=", "equality"), "!=": ("==", "equality"),
    "<": ("<=", "bound"), "<=": ("<", "bound"), ">": (">=", "bound"), ">=": (">", "bound"),
    "&&": ("||", "logic"), "||": ("&&", "logic"),
    "+": ("-", "arithmetic"), "-": ("+", "arithmetic"), "*": ("/", "arithmetic"),
    "/": ("*", "arithmetic"), "%": ("/", "arithmetic"),
    "+=": ("-=", "arithmetic"), "-=": ("+=", "arithmetic"), "*=": ("/=", "arithmetic"),
    "<<": (">>", "bits"), ">>": ("<<", "bits"), "&": ("|", "bits"), "|": ("&", "bits"),
    "^": ("|", "bits"), "|=": ("&=", "bits"),
}
# What makes room: its numbers are only made smaller, since more room changes nothing.
ROOM = (
    "AddSizes",
    "AllocateBlock",
    "AllocateZeroedBlock",
    "CoTaskMemAlloc",
    "EmptyReserve",
    "MultiplySizes",
    "Reserve",
)
STEPS = {"++": "--", "--": "++"}
NOTHING = "(void)0"  # an empty statement that the compiler does not warn about

FUNCTIONS = (
    CursorKind.FUNCTION_DECL, CursorKind.FUNCTION_TEMPLATE, CursorKind.CXX_METHOD,
    CursorKind.CONSTRUCTOR, CursorKind.DESTRUCTOR,
)
VARIABLES = (
    CursorKind.VAR_DECL, CursorKind.FIELD_DECL, CursorKind.ENUM_CONSTANT_DECL,
    CursorKind.TYPE_ALIAS_DECL,
)
CLASSES = (CursorKind.CLASS_DECL, CursorKind.STRUCT_DECL, CursorKind.CLASS_TEMPLATE)
CONDITIONAL = (CursorKind.IF_STMT, CursorKind.WHILE_STMT, CursorKind.CONDITIONAL_OPERATOR)
# Statements and how many of their children come before the statements that they hold.
HOLDERS = {
    CursorKind.COMPOUND_STMT: 0, CursorKind.DEFAULT_STMT: 0, CursorKind.IF_STMT: 1,
    CursorKind.WHILE_STMT: 1, CursorKind.CASE_STMT: 1,
}


@dataclass(frozen=True, order=True)
class Site:
    file: str  # relative to the tree
    start: int  # bytes [start, end) ...
    end: int
    replacement: str  # ... become this
    kind: str
    line: int
    place: str  # the function, or the variable outside of functions
    before: str  # the source lines, on one line
    after: str

    def key(self) -> tuple[str, str, str, str]:
        """What stays the same when lines are added above."""
        return self.file, self.place, self.before, self.after

    def apply(self, source: bytes) -> bytes:
        """Line numbers stay as they are: they are part of what the module reports."""
        lost = source[self.start : self.end].count(b"\n") - self.replacement.count("\n")
        return (
            source[: self.start]
            + self.replacement.encode()
            + b"\n" * lost
            + source[self.end :]
        )


class Finder:
    """Collects the sites of one source tree."""

    def __init__(self, tree: Path):
        self.tree = tree
        self.sites: set[Site] = set()
        self.sources: dict[str, bytes] = {}

    def find(self, commands: Path) -> list[Site]:
        parsed = set()
        for entry in json.loads(commands.read_text()):
            file, command = entry["file"], shlex.split(entry["command"])
            wanted = any(f"/{target}.dir/" in entry["command"] for target in TARGETS)
            if wanted and file.endswith(".cpp") and file not in parsed:
                parsed.add(file)
                self._parse(file, command[: command.index("-o")])
        return sorted(self.sites)

    def _parse(self, file: str, command: list[str]) -> None:
        # The library looks for the compiler's own headers beside itself, where they are not.
        print_folder = [command[0], "-print-resource-dir"]
        folder = subprocess.run(print_folder, check=True, capture_output=True, text=True).stdout
        arguments = [*command[1:], "-resource-dir", folder.strip()]
        unit = Index.create().parse(file, arguments)
        broken = [str(d) for d in unit.diagnostics if d.severity >= d.Error]
        if broken:
            raise RuntimeError(f"{file} cannot be parsed: {broken[0]}")
        for cursor in unit.cursor.get_children():
            if self._name_of(cursor):
                self._visit(cursor, None, "", False)

    def _name_of(self, cursor: Cursor) -> str | None:
        """The file it stands in, when that is one of the module's."""
        file = cursor.location.file
        if not file or not file.name.startswith(f"{self.tree}/"):
            return None
        name = str(Path(file.name).resolve().relative_to(self.tree))
        return name if name.startswith(FOLDERS) else None

    def _visit(self, cursor: Cursor, parent: Cursor | None, place: str, room: bool) -> None:
        if cursor.kind == CursorKind.STATIC_ASSERT:
            return
        if cursor.kind in FUNCTIONS:
            owner = cursor.semantic_parent
            place = f"{owner.spelling}::" if owner and owner.kind in CLASSES else ""
            place += cursor.spelling
        elif cursor.kind in VARIABLES and not place:
            place = cursor.spelling
        room = room or (cursor.kind == CursorKind.CALL_EXPR and cursor.spelling in ROOM)
        self._mutate(cursor, parent, place)
        if cursor.kind == CursorKind.INTEGER_LITERAL:
            self._mutate_number(cursor, parent, place, room or self._is_array(parent))
        for child in cursor.get_children():
            self._visit(child, cursor, place, room)

    def _mutate(self, cursor: Cursor, parent: Cursor | None, place: str) -> None:
        kind = cursor.kind
        children = list(cursor.get_children())
        if kind in (CursorKind.BINARY_OPERATOR, CursorKind.COMPOUND_ASSIGNMENT_OPERATOR):
            self._mutate_operator(*children, place)
        elif kind == CursorKind.UNARY_OPERATOR:
            self._mutate_unary(cursor, place)
        elif kind == CursorKind.CXX_BOOL_LITERAL_EXPR:
            swapped = {"true": "false", "false": "true"}.get(self._text(cursor))
            if swapped:
                self._replace(cursor, swapped, "boolean", place)
        elif kind == CursorKind.RETURN_STMT and children:
            self._mutate_result(children[0], place)
        if kind in CONDITIONAL:
            self._negate(children[0], place)
        if kind == CursorKind.FOR_STMT:
            self._drop(children[-1:], place)
        elif kind in HOLDERS:
            self._drop(children[HOLDERS[kind] :], place)

    def _mutate_operator(self, left: Cursor, right: Cursor, place: str) -> None:
        start, end = left.extent.end.offset, right.extent.start.offset
        if not self._name_of(left) or start >= end:
            return
        between = self._bytes(left)[start:end].decode()
        operator = between.strip()
        if operator not in OPERATORS:
            return
        replacement, kind = OPERATORS[operator]
        self._add(left, start, end, between.replace(operator, replacement), kind, place)
        if operator in ("+", "-") and right.kind == CursorKind.INTEGER_LITERAL:
            self._add(left, start, right.extent.end.offset, "", "term", place)

    def _mutate_unary(self, cursor: Cursor, place: str) -> None:
        text = self._text(cursor)
        if text[:1] in ("!", "-") and text[:2] not in STEPS:
            self._replace(cursor, text[1:], "not" if text[0] == "!" else "sign", place)
        elif text[:2] in STEPS:
            self._replace(cursor, STEPS[text[:2]] + text[2:], "step", place)
        elif text[-2:] in STEPS:
            self._replace(cursor, text[:-2] + STEPS[text[-2:]], "step", place)

    def _mutate_number(self, cursor: Cursor, parent: Cursor, place: str, room: bool) -> None:
        match = re.fullmatch(r"(0x[0-9A-Fa-f]+|\d+)(u?)", self._text(cursor))
        if not match:
            return
        value = int(match[1], 0)
        number = hex if match[1].startswith("0x") else str
        if not room:
            self._replace(cursor, number(value + 1) + match[2], "constant", place)
        # Without its 1, `x + 1` has lost a term already.
        if value > 1 or (value == 1 and not self._is_sum(parent)):
            self._replace(cursor, number(value - 1) + match[2], "constant", place)

    def _is_array(self, cursor: Cursor | None) -> bool:
        if not cursor or cursor.kind != CursorKind.VAR_DECL:
            return False
        return cursor.type.kind == TypeKind.CONSTANTARRAY

    def _is_sum(self, cursor: Cursor | None) -> bool:
        if not cursor or cursor.kind != CursorKind.BINARY_OPERATOR:
            return False
        left, right = cursor.get_children()
        end, start = left.extent.end.offset, right.extent.start.offset
        return self._bytes(cursor)[end:start].strip() in (b"+", b"-")

    def _mutate_result(self, value: Cursor, place: str) -> None:
        literal = self._text(value) in ("true", "false")
        if value.type.get_canonical().kind == TypeKind.BOOL and not literal:
            self._replace(value, f"!({self._text(value)})", "result", place)

    def _negate(self, condition: Cursor, place: str) -> None:
        """Comparisons for equality and negations are changed where they stand."""
        text = self._text(condition)
        if condition.kind.is_expression() and not re.match(r"!|[^&|]*[!=]=[^&|]*$", text):
            self._replace(condition, f"!({text})", "condition", place)

    def _drop(self, statements: list[Cursor], place: str) -> None:
        for statement in statements:
            jump = statement.kind in (CursorKind.BREAK_STMT, CursorKind.CONTINUE_STMT)
            bare = statement.kind == CursorKind.RETURN_STMT and self._text(statement) == "return"
            if jump or bare or statement.kind.is_expression():
                self._replace(statement, NOTHING, "dropped", place)

    def _replace(self, cursor: Cursor, text: str, kind: str, place: str) -> None:
        extent = cursor.extent
        if self._name_of(cursor) and self._text(cursor):
            self._add(cursor, extent.start.offset, extent.end.offset, text, kind, place)

    def _add(self, at: Cursor, start: int, end: int, text: str, kind: str, place: str) -> None:
        file = self._name_of(at)
        source = self._bytes(at)
        first = source.rfind(b"\n", 0, start) + 1
        last = source.find(b"\n", end)
        line = source.count(b"\n", 0, start) + 1
        before = source[first:last].decode()
        after = (source[first:start] + text.encode() + source[end:last]).decode()
        one_line = lambda lines: " ".join(lines.split())  # noqa: E731
        self.sites.add(
            Site(file, start, end, text, kind, line, place, one_line(before), one_line(after))
        )

    def _bytes(self, cursor: Cursor) -> bytes:
        file = cursor.location.file.name
        if file not in self.sources:
            self.sources[file] = Path(file).read_bytes()
        return self.sources[file]

    def _text(self, cursor: Cursor) -> str:
        return self._bytes(cursor)[cursor.extent.start.offset : cursor.extent.end.offset].decode()
