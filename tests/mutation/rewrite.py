#!/usr/bin/python3
# SPDX-License-Identifier: MIT
"""Rewrites a copy of the plug-in so that it holds many changed plug-ins, of which one is chosen at run time.

    rewrite.py PLUGIN INCLUDE COPY

COPY gets the files of PLUGIN with each expression in calls of mutant.h, and two lists. `mutants.txt`: number, place,
change, and the text that is changed. `functions.txt`: number, and the function that the place is in. What is a constant
for the compiler stays as it is: mutant.h sees to that.
"""
import pathlib
import re
import shutil
import sys

import clang.cindex
from clang.cindex import CursorKind as Kind
from clang.cindex import TypeKind

# The plug-in is templates over the pass; one pass and the formatter of dates include all of it.
UNITS = ["entries/xtr.cpp", "entries/md.cpp", "entries/date_conv.cpp"]
# Tables are worked out by the compiler. The known answers hold their contents, octet by octet.
LEFT_OUT = {"tables", "windows", "names"}

OPERATORS = {
    "<": [("LessEqual", "<="), ("GreaterEqual", ">=")],
    "<=": [("Less", "<"), ("Greater", ">")],
    ">": [("GreaterEqual", ">="), ("LessEqual", "<=")],
    ">=": [("Greater", ">"), ("Less", "<")],
    "==": [("NotEqual", "!=")],
    "!=": [("Equal", "==")],
    "+": [("Minus", "-")],
    "-": [("Plus", "+")],
    "*": [("Plus", "+")],
    "/": [("Times", "*")],
    "%": [("Times", "*")],
    "<<": [("ShiftRight", ">>")],
    ">>": [("ShiftLeft", "<<")],
    "&": [("BitOr", "|")],
    "|": [("BitAnd", "&")],
    "^": [("BitOr", "|")],
}
NAMES = {text: name for changes in OPERATORS.values() for name, text in changes} | {"/": "Divide", "%": "Modulo", "*": "Times", "^": "BitXor"}

STATEMENTS = {Kind.CALL_EXPR, Kind.COMPOUND_ASSIGNMENT_OPERATOR, Kind.BINARY_OPERATOR, Kind.UNARY_OPERATOR,
              Kind.UNEXPOSED_EXPR, Kind.CXX_UNARY_EXPR}
FUNCTIONS = {Kind.FUNCTION_DECL, Kind.FUNCTION_TEMPLATE, Kind.CXX_METHOD, Kind.CONSTRUCTOR, Kind.DESTRUCTOR}
NUMBERS = {TypeKind.INT, TypeKind.UINT, TypeKind.UCHAR, TypeKind.USHORT, TypeKind.ULONG, TypeKind.LONG,
           TypeKind.SHORT, TypeKind.SCHAR}


class Rewriter:
    def __init__(self, plugin, include, copy):
        self.plugin, self.include, self.copy = plugin, include, copy
        self.texts = {}
        self.insertions = {}  # file -> [(offset, order, text)]
        self.done = set()
        self.mutants = []
        self.function = ""  # of the cursor
        self.functions = []  # of the mutants

    def text(self, name):
        if name not in self.texts:
            self.texts[name] = (self.plugin / name).read_bytes()
        return self.texts[name]

    def parse(self, unit):
        index = clang.cindex.Index.create()
        found = index.parse(str(self.plugin / unit), args=[
            "-std=c++20", f"-I{self.plugin}", f"-I{self.include}", "-fno-exceptions", "-fbracket-depth=1024",
            "-DNETFLOOR_SANITIZED"])
        errors = [d for d in found.diagnostics if d.severity >= clang.cindex.Diagnostic.Error]
        if errors:
            sys.exit(f"rewrite: {errors[0]}")
        for cursor in found.cursor.get_children():
            self.visit(cursor, None)

    # The file of a cursor if it is one that is rewritten.
    def file(self, cursor):
        name = cursor.location.file and cursor.location.file.name
        if name is None or not name.startswith(str(self.plugin)):
            return None
        relative = str(pathlib.Path(name).relative_to(self.plugin))
        return None if relative.split("/")[0] in LEFT_OUT else relative

    def visit(self, cursor, parent):
        if parent is None or parent.kind == Kind.TRANSLATION_UNIT:
            if cursor.location.file is not None and not cursor.location.file.name.startswith(str(self.plugin)):
                return
        if cursor.kind == Kind.STATIC_ASSERT:
            return
        file = self.file(cursor)
        if file and re.match(rb"(concept|requires|assert)\b", self.text(file)[cursor.extent.start.offset:][:10]):
            return
        children = list(cursor.get_children())
        if cursor.kind == Kind.VAR_DECL and file and self.is_constant(file, cursor):
            # Of a constant only the bodies of functions in it can run.
            return
        if cursor.kind == Kind.CASE_STMT:
            children = children[1:]
        outer = self.function
        if cursor.kind in FUNCTIONS:
            self.function = cursor.spelling
        if file:
            children = self.change(file, cursor, parent, children)
        for child in children:
            self.visit(child, cursor)
        self.function = outer

    def is_constant(self, file, cursor):
        start, end = self.range(cursor)
        head = self.text(file)[start:end].split(b"=")[0].split(b"{")[0]
        return re.search(rb"\bconst(expr|init|eval)\b", head) is not None

    @staticmethod
    def range(cursor):
        return cursor.extent.start.offset, cursor.extent.end.offset

    # Makes the changes at a cursor. Gives the children to go on with.
    def change(self, file, cursor, parent, children):
        start, end = self.range(cursor)
        key = (file, start, end, cursor.kind)
        if key in self.done or end <= start:
            return children
        text = self.text(file)
        if cursor.kind in (Kind.BINARY_OPERATOR, Kind.UNEXPOSED_EXPR, Kind.CALL_EXPR) and len(children) >= 2:
            left, right = children[0], children[-1]
            between = self.operator(text, left, right)
            if cursor.kind == Kind.BINARY_OPERATOR and between in ("&&", "||"):
                self.done.add(key)
                self.logical(file, between, left, right)
            elif cursor.kind == Kind.BINARY_OPERATOR and between in OPERATORS:
                self.done.add(key)
                self.operation(file, between, left, right, start, end)
        elif cursor.kind == Kind.UNARY_OPERATOR and re.match(rb"![^=]", text[start:start + 2]):
            self.done.add(key)
            self.wrap(file, start, end, "(mutants::on<{0}>() != static_cast<bool>(", "))", "negated")
        elif cursor.kind in (Kind.IF_STMT, Kind.WHILE_STMT, Kind.CONDITIONAL_OPERATOR):
            self.done.add(key)
            return self.condition(file, cursor, children)
        elif cursor.kind == Kind.INTEGER_LITERAL and parent is not None and parent.kind in (
                Kind.BINARY_OPERATOR, Kind.COMPOUND_ASSIGNMENT_OPERATOR, Kind.RETURN_STMT, Kind.CALL_EXPR,
                Kind.CONDITIONAL_OPERATOR, Kind.ARRAY_SUBSCRIPT_EXPR):
            self.done.add(key)
            self.wrap(file, start, end, "mutants::number<{0}>(", ")", "+ 1")
        elif cursor.kind == Kind.DECL_REF_EXPR and parent is not None and parent.kind in (
                Kind.BINARY_OPERATOR, Kind.UNEXPOSED_EXPR, Kind.CALL_EXPR, Kind.RETURN_STMT) and self.names_number(cursor):
            self.done.add(key)
            self.wrap(file, start, end, "mutants::number<{0}>(", ")", "+ 1")
        if cursor.kind == Kind.COMPOUND_STMT:
            for child in children:
                self.leave_out(file, child)
        return children

    @staticmethod
    def operator(text, left, right):
        between = text[left.extent.end.offset:right.extent.start.offset].decode()
        return re.sub(r"/\*.*?\*/|//[^\n]*|\s", "", between)

    # A constant of the plug-in, such as a type, a width or a limit.
    @staticmethod
    def names_number(cursor):
        to = cursor.referenced
        if to is None or to.kind != Kind.VAR_DECL:
            return False
        kind = to.type.get_canonical()
        tokens = [token.spelling for token in to.get_tokens()][:6]
        return kind.kind in NUMBERS and kind.is_const_qualified() and "constexpr" in tokens

    def operation(self, file, operator, left, right, start, end):
        first = len(self.mutants)
        for _, text in OPERATORS[operator]:
            self.add(file, start, end, f"{operator} becomes {text}")
        changed = ", ".join(f"mutants::{name}" for name, _ in OPERATORS[operator])
        self.insert(file, start, f"mutants::apply<{first}, mutants::{NAMES[operator]}, {changed}>(", opens=True, end=end)
        self.replace_operator(file, left.extent.end.offset, right.extent.start.offset, operator)
        self.insert(file, end, ")", opens=False, end=start)

    def replace_operator(self, file, start, end, operator):
        at = start + self.text(file)[start:end].decode().index(operator)
        self.insertions.setdefault(file, []).append((at, 1, 0, ",", len(operator)))

    def logical(self, file, operator, left, right):
        for side, what in ((left, "left"), (right, "right")):
            start, end = self.range(side)
            rest = f"{what} side of {operator} left out"
            if operator == "&&":
                self.wrap(file, start, end, "(mutants::on<{0}>() || static_cast<bool>(", "))", rest)
            else:
                self.wrap(file, start, end, "(!mutants::on<{0}>() && static_cast<bool>(", "))", rest)

    # Conditions that are comparisons, logical or negated are changed as such.
    def condition(self, file, cursor, children):
        start, _ = self.range(cursor)
        text = self.text(file)
        if cursor.kind == Kind.IF_STMT and re.match(rb"if\s+constexpr\b", text[start:start + 20]):
            return children[1:]
        condition = next((c for c in children if c.kind.is_expression()), None)
        declared = any(c.kind in (Kind.VAR_DECL, Kind.DECL_STMT) for c in children[:2])
        if condition is None or (declared and b";" not in text[start:condition.extent.start.offset]):
            return children
        first, last = self.range(condition)
        inner = list(condition.get_children())
        plain = condition.kind not in (Kind.BINARY_OPERATOR, Kind.UNARY_OPERATOR)
        if plain and text[first:first + 1] != b"!":
            self.wrap(file, first, last, "(mutants::on<{0}>() != static_cast<bool>(", "))", "negated")
        return children

    def leave_out(self, file, statement):
        start, end = self.range(statement)
        text = self.text(file)
        if statement.kind not in STATEMENTS or (file, start, "out") in self.done or end <= start:
            return
        if not re.match(rb"\s*;", text[end:end + 20]):
            return
        self.done.add((file, start, "out"))
        number = self.add(file, start, end, "left out")
        self.insert(file, start, f"if (!mutants::on<{number}>()) ", opens=True, end=end + 1)

    def wrap(self, file, start, end, before, after, change):
        number = self.add(file, start, end, change)
        self.insert(file, start, before.format(number), opens=True, end=end)
        self.insert(file, end, after, opens=False, end=start)

    def add(self, file, start, end, change):
        text = self.text(file)
        line = text[:start].count(b"\n") + 1
        what = " ".join(text[start:end].decode().split())
        self.functions.append(f"{len(self.mutants)}\t{self.function}")
        self.mutants.append(f"{len(self.mutants)}\t{file}:{line}\t{change}\t{what}")
        return len(self.mutants) - 1

    # At one place: what closes comes first, the innermost of it first; then what opens, the outermost first.
    def insert(self, file, at, text, opens, end):
        order = -end
        rank = 2 if opens else 0
        entries = self.insertions.setdefault(file, [])
        entries.append((at, rank, order if opens else -end, text, 0))

    def write(self):
        if self.copy != self.plugin:
            shutil.copytree(self.plugin, self.copy, dirs_exist_ok=True)
        for file, insertions in self.insertions.items():
            text = self.text(file).decode("latin-1")
            pieces, at = [], 0
            for place, _, _, new, removed in sorted(insertions, key=lambda e: (e[0], e[1], e[2])):
                pieces += [text[at:place], new]
                at = place + removed
            pieces.append(text[at:])
            joined = "".join(pieces)
            joined = re.sub(r"(#pragma once\n|\A(?:[^\n]*SPDX[^\n]*\n))", r'\1#include "mutant.h"\n', joined, count=1)
            (self.copy / file).write_text(joined, encoding="latin-1")
        (self.copy / "mutants.txt").write_text("\n".join(self.mutants) + "\n")


def main():
    plugin, include, copy = (pathlib.Path(name).resolve() for name in sys.argv[1:4])
    clang.cindex.Config.set_library_file("/usr/lib/llvm-14/lib/libclang.so.1")
    rewriter = Rewriter(plugin, include, copy)
    for unit in UNITS:
        rewriter.parse(unit)
    rewriter.write()
    (copy / "functions.txt").write_text("\n".join(rewriter.functions) + "\n")
    print(f"{len(rewriter.mutants)} mutants in {len(rewriter.insertions)} files")


if __name__ == "__main__":
    main()
