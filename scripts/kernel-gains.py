#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Prints how many instructions one call of each kernel takes, by the reference and by its variants.

kernel-gains.py [BUILD [HOST_BUILD]], by default build/target and build/host: the former holds kernel_comparison_test,
the latter the emulator's instruction counter.
"""

import pathlib
import subprocess
import sys
import tempfile

ROOT = pathlib.Path(__file__).resolve().parent.parent
# By the processor that a program is for, in its file's header.
EMULATORS = {40: ["qemu-arm", "-L", ROOT / "build/sysroot-armhf"], 62: ["qemu-x86_64", "-cpu", "max"]}


def count(program, counter):
    """Of each kernel (source, name, implementations), in order; and the instruction counts at the marks."""
    emulator = EMULATORS[int.from_bytes(program.read_bytes()[18:20], "little")]
    with tempfile.TemporaryDirectory() as folder:
        marks = pathlib.Path(folder) / "marks"
        command = [*emulator, "-plugin", f"{counter},out={marks}", program, "--count"]
        lines = subprocess.run(command, check=True, text=True, stdout=subprocess.PIPE).stdout.splitlines()
        kernels = [(source, name, sides) for source, name, *sides in map(str.split, lines)]
        return kernels, list(map(int, marks.read_text().split()))


def main():
    builds = [pathlib.Path(path) for path in sys.argv[1:]]
    build, host = builds + [ROOT / "build/target", ROOT / "build/host"][len(builds):]
    kernels, marks = count(build / "bin/kernel_comparison_test", host / "lib/instruction_counter.so")
    expected = 2 + sum(1 + len(sides) for _, _, sides in kernels)
    if not kernels or len(marks) != expected:
        sys.exit(f"kernel-gains.py: {len(marks)} marks for {len(kernels)} kernels, expected {expected} "
                 "for one kernel or more")
    mark_cost = marks[1] - marks[0]
    print(f"{'calls':>8} {'ratio':>6}  implementation, source, kernel")
    at = 2
    for source, name, sides in kernels:
        costs = [after - before - mark_cost for before, after in zip(marks[at:], marks[at + 1:at + 1 + len(sides)])]
        at += 1 + len(sides)
        for side, cost in zip(sides, costs):
            print(f"{cost:8} {costs[0] / cost:6.2f}  {side}, {source}, {name}")


main()
