# SPDX-License-Identifier: Apache-2.0
"""What the module uses of the stack: measured under emulation by bench/stack_depth.cc, and the largest
frame of each component as the compiler reports it (-fstack-usage)."""

import subprocess

from module_file import COMPONENT_OF_SOURCE, Failure, WITHOUT_SOURCES, pieces


def measured(build, engine):
    """{call: bytes}, from the program's output."""
    program = ["qemu-arm", str(build / f"bin/stack_depth_{engine}")]
    printed = subprocess.run(program, check=True, text=True, stdout=subprocess.PIPE).stdout
    depths = read_depths(printed)
    if len(depths) < 2:
        raise Failure(f"stack_depth measured {len(depths)} calls, expected at least 2")
    return depths


def read_depths(printed):
    return {name: int(size) for name, size in (line.split("\t") for line in printed.splitlines())}


def read_frames(text):
    """[(bytes, function)] of one file of the compiler; fails on a frame without a bound."""
    frames = []
    for line in text.splitlines():
        where, size, kind = line.split("\t")
        declaration = where.split(":", 3)[3].replace("<lambda(", "lambda(")
        name = declaration.split("(")[0].split("::")[-1].split(" ")[-1]
        if kind == "dynamic":
            raise Failure(f"{where}: frame without a bound ({size} bytes and more)")
        frames.append((int(size), name))
    return frames


def largest_frames(build, map_text):
    """{component: (bytes, function)} of all that was compiled here and is part of the module."""
    largest = {}
    objects = {piece.object for piece in pieces(map_text)
               if piece.object and piece.section == ".text"}
    for target, name in sorted(objects):
        component = COMPONENT_OF_SOURCE[target]
        if component in WITHOUT_SOURCES:
            continue
        files = list(build.glob(f"**/CMakeFiles/{target}.dir/**/{name.removesuffix('.o')}.su"))
        if len(files) != 1:
            raise Failure(f"{len(files)} files of stack frames for {target}/{name}, expected one: "
                          "compile it with -fstack-usage")
        frames = read_frames(files[0].read_text())
        largest[component] = max(frames + [largest.get(component, (0, ""))])
    return largest
