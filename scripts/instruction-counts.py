#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Counts the instructions of a frame, a network run and a pass on a PC and compares them with the committed ones.

Usage: instruction-counts.py [--update] [BUILD]     (default build/host)

Under callgrind, with the variants that every x86-64 processor runs and with those for AVX2: the same on every machine,
however busy. Exit code: 0 nothing grew or shrank by more than 2 %, 1 something did or could not be counted.
"""

import argparse
import pathlib
import re
import subprocess
import sys
import tempfile

ROOT = pathlib.Path(__file__).resolve().parent.parent
COUNTS = ROOT / "bench/instruction_counts.txt"
TOLERANCE = 0.02
VARIANTS = ("Baseline", "Avx2")
WORK = {"frame": "audio_frontend_invoke", "network run": "mobilenet_backend_invoke",
        "pass": "tarn::contexthub::sound::AudioClassifier::Classify("}


def calls_in(profile, function):
    """(number of calls, instructions in them) of a function, all it calls included."""
    times = cost = 0
    lines = iter(profile)
    for line in lines:
        if line.startswith("cfn=" + function):
            calls = next(line for line in lines if line.startswith("calls="))
            times += int(calls.split("=")[1].split()[0])
            cost += int(next(lines).split()[1])
    return times, cost


def count(program):
    if not program.exists():
        sys.exit(f"instruction-counts.py: no {program}, should be in a build with QZ_KERNELS=x86_64")
    with tempfile.TemporaryDirectory() as folder:
        profile = pathlib.Path(folder, "profile")
        subprocess.run(["valgrind", "--tool=callgrind", "--compress-strings=no", "--compress-pos=no",
                        f"--callgrind-out-file={profile}", program], check=True, stdout=subprocess.DEVNULL,
                       stderr=subprocess.DEVNULL)
        lines = profile.read_text().splitlines()
    counts = {}
    for name, function in WORK.items():
        times, cost = calls_in(lines, function)
        if times == 0:
            sys.exit(f"instruction-counts.py: {program} never calls {function}")
        counts[name] = round(cost / times)
    return counts


def committed():
    """{(variant, work): instructions}"""
    lines = COUNTS.read_text().splitlines() if COUNTS.exists() else []
    rows = []
    for line in lines:
        if line.startswith("#"):
            continue
        rows.append(re.fullmatch(r"(\w+) +(.+?) +([\d,]+)", line))
        if not rows[-1]:
            sys.exit(f"{COUNTS}: '{line}' should be a variant, what it does and a number")
    return {(row[1], row[2]): int(row[3].replace(",", "")) for row in rows}


def main():
    arguments = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    arguments.add_argument("--update", action="store_true", help="write what is counted as the committed counts")
    arguments.add_argument("build", nargs="?", type=pathlib.Path, default=ROOT / "build/host")
    options = arguments.parse_args()

    has_avx2 = re.search(r"^flags\b.* avx2\b", pathlib.Path("/proc/cpuinfo").read_text(), re.MULTILINE)
    before, now, faults = committed(), {}, 0
    for variant in VARIANTS:
        if variant == "Avx2" and not has_avx2:
            print("Avx2: not counted, since this processor has no AVX2 and callgrind can't do without")
            continue
        for work, instructions in count(options.build / "bin" / f"counts_{variant}").items():
            now[variant, work] = instructions
            old = before.get((variant, work), 0)
            moved = abs(instructions - old) > TOLERANCE * old
            faults += moved
            print(f"{variant:9} {work:12} {instructions:12,}  committed {old:12,}{'  MOVED' if moved else ''}")
    if options.update:
        if not has_avx2:
            sys.exit("instruction-counts.py: all counts are written together, which needs AVX2")
        COUNTS.write_text("# Instructions on average, as scripts/instruction-counts.py counts and compares them.\n" +
                           "".join(f"{variant:9} {work:12} {instructions:12,}\n"
                                   for (variant, work), instructions in now.items()))
    elif faults:
        sys.exit(f"instruction-counts.py: {faults} counts moved by more than {TOLERANCE:.0%}: find out why; "
                 "`make counts UPDATE=1` commits to them")


main()
