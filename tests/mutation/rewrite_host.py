#!/usr/bin/python3
# SPDX-License-Identifier: MIT
"""Rewrites the host, the capture library and the command in a copy of the project, as rewrite.py does the plug-in.

    rewrite_host.py COPY

The copy is changed in place. It gets a list `mutants.txt`: number, place, change, and the text that is changed.
"""
import pathlib
import re
import sys

import clang.cindex
from clang.cindex import CursorKind as Kind
from clang.cindex import TypeKind

from rewrite import Rewriter

FOLDERS = ("host", "analysis", "capture", "columns", "cli")
TOGETHER = 12  # sources that one parse reads, as the build joins them
INCLUDES = ["include", "tests/mutation", *(f"{folder}/include" for folder in FOLDERS), "host/standins", "host/src",
            "analysis/src", "capture/src", "columns/src", "cli", "build/host/include"]
LEFT_OUT = {"host/src/module_windows.cpp"}
USED = (Kind.BINARY_OPERATOR, Kind.CALL_EXPR, Kind.RETURN_STMT, Kind.CONDITIONAL_OPERATOR, Kind.UNEXPOSED_EXPR)


class HostRewriter(Rewriter):
    def __init__(self, copy):
        super().__init__(copy, copy / "include", copy)
        self.negated = set()

    def file(self, cursor):
        name = cursor.location.file and cursor.location.file.name
        if name is None or not name.startswith(str(self.copy)):
            return None
        relative = str(pathlib.Path(name).relative_to(self.copy))
        return relative if relative.split("/")[0] in FOLDERS else None

    def parse_together(self, sources):
        joined = str(self.copy / "joined.cpp")
        text = "".join(f'#include "{source}"\n' for source in sources)
        found = clang.cindex.Index.create().parse(joined, unsaved_files=[(joined, text)], args=[
            "-std=c++20", "-DNETFLOOR_HAS_CRC32C", '-DNETFLOOR_VERSION=""', '-DNETFLOOR_OWN_PLUGIN=""',
            *(f"-I{self.copy / folder}" for folder in INCLUDES)])
        errors = [d for d in found.diagnostics if d.severity >= clang.cindex.Diagnostic.Error]
        if errors:
            sys.exit(f"rewrite_host: {errors[0]}")
        for cursor in found.cursor.get_children():
            self.visit(cursor, None)

    # What the plug-in has not: booleans and enumerators as values, and comparisons of classes.
    def change(self, file, cursor, parent, children):
        start, end = self.range(cursor)
        used = parent is not None and parent.kind in USED
        key = (file, start, end, cursor.kind)
        if key not in self.done and end > start:
            if used and cursor.kind == Kind.CXX_BOOL_LITERAL_EXPR:
                self.done.add(key)
                self.wrap(file, start, end, "(mutants::on<{0}>() != ", ")", "negated")
            elif used and cursor.kind == Kind.DECL_REF_EXPR and self.names_enumerator(cursor):
                self.done.add(key)
                name = self.text(file)[start:end].decode()
                self.wrap(file, start, end, f"static_cast<decltype({name})>(mutants::number<{{0}}>(static_cast<int>(",
                          ")))", "+ 1")
            elif cursor.kind == Kind.CALL_EXPR and len(children) >= 2 and self.operator(
                    self.text(file), children[0], children[-1]) in ("==", "!=", "<"):
                self.done.add(key)
                if (file, start, end) not in self.negated:
                    self.wrap(file, start, end, "(mutants::on<{0}>() != static_cast<bool>(", "))", "negated")
        return super().change(file, cursor, parent, children)

    # mutant.h takes copies, and an atomic has none; and it has no vectors.
    def operation(self, file, operator, left, right, start, end):
        if not any(self.is_special(part.type) for side in (left, right) for part in side.walk_preorder()):
            super().operation(file, operator, left, right, start, end)

    @staticmethod
    def is_special(of):
        return "atomic" in of.spelling or of.get_canonical().kind == TypeKind.VECTOR

    @staticmethod
    def names_enumerator(cursor):
        return cursor.referenced is not None and cursor.referenced.kind == Kind.ENUM_CONSTANT_DECL

    def wrap(self, file, start, end, before, after, change):
        if change == "negated":
            self.negated.add((file, start, end))
        super().wrap(file, start, end, before, after, change)

    # Tables inside functions become variables too, so that they can be changed as those outside are.
    def keep_tables(self):
        for folder in FOLDERS:
            for path in (self.copy / folder).rglob("*.cpp"):
                lines = path.read_text().splitlines(keepends=True)
                head = ""
                for i, line in enumerate(lines):
                    if re.match(r"( {4})?\S.*\{$", line) and not re.match(r"\s*(constexpr|const) .*= *\{", line):
                        head = line
                    if "constexpr" not in head:
                        lines[i] = re.sub(r"^( {4,})constexpr std::array\b", r"\1static constexpr std::array", line)
                path.write_text("".join(lines))


def main():
    copy = pathlib.Path(sys.argv[1]).resolve()
    clang.cindex.Config.set_library_file("/usr/lib/llvm-14/lib/libclang.so.1")
    rewriter = HostRewriter(copy)
    rewriter.keep_tables()
    for folder in FOLDERS:
        sources = [path for path in sorted((copy / folder).rglob("*.cpp")) if str(path.relative_to(copy)) not in LEFT_OUT]
        for first in range(0, len(sources), TOGETHER):
            rewriter.parse_together(sources[first:first + TOGETHER])
    rewriter.write()
    print(f"{len(rewriter.mutants)} mutants in {len(rewriter.insertions)} files")


main()
