#!/usr/bin/env python3
"""Prints how many instructions one call of each kernel takes, plain and as it runs on the hub's processor.

kernel-gains.py [TARGET_BUILD [HOST_BUILD]], by default build/target and build/host: the former holds
kernel_comparison_test, the latter the emulator's instruction counter.
"""

import pathlib
import subprocess
import sys
import tempfile

ROOT = pathlib.Path(__file__).resolve().parent.parent


def count(program, counter):
    """The kernels' (text, name) in order, and the instruction counts at the marks."""
    with tempfile.TemporaryDirectory() as folder:
        marks = pathlib.Path(folder) / "marks"
        command = ["qemu-arm", "-plugin", f"{counter},out={marks}",
                   "-L", ROOT / "build/sysroot-armhf", program, "--count"]
        lines = subprocess.run(command, check=True, text=True, stdout=subprocess.PIPE).stdout
        return [line.split() for line in lines.splitlines()], list(map(int, marks.read_text().split()))


def main():
    builds = [pathlib.Path(path) for path in sys.argv[1:]]
    target, host = builds + [ROOT / "build/target", ROOT / "build/host"][len(builds):]
    kernels, marks = count(target / "bin/kernel_comparison_test", host / "lib/instruction_counter.so")
    if not kernels or len(marks) != 2 + 3 * len(kernels):
        sys.exit(f"kernel-gains.py: {len(marks)} marks for {len(kernels)} kernels, "
                 f"should be {2 + 3 * len(kernels)} for one kernel or more")
    mark_cost = marks[1] - marks[0]
    print(f"{'plain':>8} {'running':>8} {'ratio':>6}  text, kernel")
    for (text, name), *at in zip(kernels, marks[2::3], marks[3::3], marks[4::3]):
        plain, running = (after - before - mark_cost for before, after in zip(at, at[1:]))
        print(f"{plain:8} {running:8} {plain / running:6.2f}  {text}, {name}")


main()
