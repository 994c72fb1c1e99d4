#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Lists recordings, with their classes and folds, for qz eval, qz features and qz-train.

Usage: make-manifest.py DATA [--extra DIR]... [-o FILE]     (without -o: to standard output)

DATA holds a folder for each class, and each folder sound files whose name begins with their fold: 3-142005-A.ogg.
The files of DIR become the class "other" in fold 0, which is trained with and never measured. Each folder's files
are sorted by the bytes of their names. Exit code: 0 fine, 3 a folder or a name that is not so.
"""

import argparse
import contextlib
import os
import pathlib
import re
import sys

FOLD = re.compile(r"([1-9])-")


def fail(path, fault):
    print(f"make-manifest.py: {path}: {fault}", file=sys.stderr)
    sys.exit(3)


def entries(folder):
    """The entries of a folder, hidden files aside."""
    try:
        names = sorted(filter(lambda name: not name.startswith("."), os.listdir(folder)), key=os.fsencode)
    except OSError as error:
        fail(folder, f"can't be read: {error.strerror}")
    for name in names:
        if re.search(r"[\t\r\n]", name):
            fail(folder, f"a list can't hold the name {name!r}, should have no tab and no line end")
    return [folder / name for name in names]


def recordings(data):
    for folder in filter(pathlib.Path.is_dir, entries(data)):
        for file in entries(folder):
            fold = FOLD.match(file.name)
            if not fold:
                fail(file, "the name should begin with a fold, 1 to 9, and -")
            yield file, folder.name, fold[1]


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("data", metavar="DATA", type=os.path.abspath)
    parser.add_argument("--extra", metavar="DIR", type=os.path.abspath, action="append", default=[])
    parser.add_argument("-o", metavar="FILE", dest="output")
    arguments = parser.parse_args()

    found = list(recordings(pathlib.Path(arguments.data)))
    if not found:
        fail(arguments.data, "no recording, should hold a folder of sound files for each class")
    for extra in arguments.extra:
        found += [(file, "other", 0) for file in entries(pathlib.Path(extra)) if file.is_file()]
    lines = ["file\tclass\tfold"] + ["\t".join(map(str, line)) for line in found]
    content = os.fsencode("\n".join(lines) + "\n")
    if not arguments.output:
        sys.stdout.buffer.write(content)
        return
    temporary = pathlib.Path(arguments.output + ".new")
    try:
        temporary.write_bytes(content)
        temporary.replace(arguments.output)
    except OSError as error:
        with contextlib.suppress(OSError):
            temporary.unlink()
        fail(arguments.output, f"can't be written: {error.strerror}")


main()
