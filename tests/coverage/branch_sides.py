#!/usr/bin/python3
# SPDX-License-Identifier: MIT
"""Names the branch sides of a folder that nothing reaches, but those that explained.txt explains.

    llvm-cov export ... | branch_sides.py FOLDER EXPLAINED LEAST

A branch of a template counts once, whichever of its instances reaches it. EXPLAINED has a line for each side that is
not reached: file, side, text of the line, reason, with tabs between them. Fails below LEAST of a hundred sides that are
reached or explained, and where a line explains a side that is reached.
"""
import collections
import json
import pathlib
import sys


def main():
    folder, explained, least = pathlib.Path(sys.argv[1]).resolve(), pathlib.Path(sys.argv[2]), float(sys.argv[3])
    known = {tuple(line.split("\t")[:3]) for line in explained.read_text().splitlines() if not line.startswith("#")}
    counts = collections.Counter()  # of file, line, column and side
    for file in json.load(sys.stdin)["data"][0]["files"]:
        path = pathlib.Path(file["filename"]).resolve()
        if path.is_relative_to(folder):
            for line, column, _, _, if_true, if_false, *_ in file["branches"]:
                counts[path, line, column, "true"] += if_true
                counts[path, line, column, "false"] += if_false

    # Neither side counts where the compiler decides, or where nothing comes: the side that leads there is named.
    for branch in {key[:3] for key in counts}:
        if counts[*branch, "true"] + counts[*branch, "false"] == 0:
            del counts[*branch, "true"], counts[*branch, "false"]
    used = set()
    opened = []
    for (path, line, column, side), count in sorted(counts.items()):
        if count == 0:
            text = path.read_text().splitlines()[line - 1].strip()
            key = (str(path.relative_to(folder)), side, text)
            if key in known:
                used.add(key)
            else:
                opened.append("\t".join([f"{key[0]}:{line}:{column}", side, text]))
    for line in opened:
        print("not reached\t" + line)
    for key in sorted(known - used):
        print("explained, but reached or no such line\t" + "\t".join(key))
    missed = sum(count == 0 for count in counts.values())
    share = 100 * (len(counts) - len(opened)) / len(counts)
    print(f"{len(counts) - missed} of {len(counts)} branch sides are reached "
          f"({100 * (len(counts) - missed) / len(counts):.1f} %), {missed - len(opened)} explained: "
          f"{share:.1f} % reached or explained, {least:g} wanted")
    return share < least or len(used) < len(known)


if __name__ == "__main__":
    sys.exit(main())
