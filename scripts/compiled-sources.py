#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Lists the sources that builds compile, and writes their compile commands for clang-tidy.

Usage: compiled-sources.py OUT BUILD...     writes OUT/compile_commands.json, prints the sources' absolute paths

Generated sources are left out, and flags that only g++ has. Each file counts once, as the first build compiles it.
The variable DIFFERENCE holds the files to list, a line each, or `all`: of a header the compiled file of the
same name, or else the first that includes it.
"""

import json
import os
import pathlib
import re
import sys

ROOT = pathlib.Path(__file__).resolve().parent.parent


def commands(builds):
    """{path from the root: compile command}"""
    entries = {}
    for build in builds:
        for entry in json.loads(pathlib.Path(build, "compile_commands.json").read_text()):
            file = pathlib.Path(os.path.normpath(os.path.join(entry["directory"], entry["file"])))
            if file.is_relative_to(ROOT) and not file.is_relative_to(ROOT / "build"):
                entry["command"] = re.sub(r" -fcallgraph-info\S*", "", entry["command"])
                entries.setdefault(file.relative_to(ROOT).as_posix(), entry)
    return entries


def for_header(header, files):
    own = re.sub(r"\.h$", ".cc", header)
    including = (file for file in files if f'#include "{header}"' in (ROOT / file).read_text())
    return own if own in files else next(including, None)


def main():
    out, *builds = sys.argv[1:]
    entries = commands(builds)
    pathlib.Path(out, "compile_commands.json").write_text(json.dumps(list(entries.values())))
    difference = os.environ.get("DIFFERENCE", "all")
    chosen = set(entries)
    if difference != "all":
        names = difference.split("\n")
        chosen = {for_header(name, entries) if name.endswith(".h") else name for name in names} & set(entries)
    for file in sorted(chosen):
        print(ROOT / file)


main()
