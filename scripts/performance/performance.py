#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Rewrites the sections of docs/performance.md about one `make bench-baselines`, and its picture.

Usage: performance.py FOLDER, which holds what bench-baselines.sh left there:
  table.md   the table of baselines       raw.txt    its raw lines
  parts.txt  our operators one by one    gains.txt  our kernels' variants side by side
"""

import json
import pathlib
import re
import subprocess
import sys

sys.dont_write_bytecode = True

from picture import Drawing

ROOT = pathlib.Path(__file__).resolve().parents[2]
PAGE, PICTURE = ROOT / "docs/performance.md", ROOT / "docs/performance.svg"
MARKS = ("<!-- measured -->\n", "<!-- end of what is measured -->\n")
PRODUCTS_A_CYCLE = 32  # two instructions of 16 exact products
DETECTOR = json.loads((ROOT / "build/host/model/description.json").read_text())
FRAMES_A_PASS = DETECTOR["buffer_samples"] // DETECTOR["hop_samples"]
RUNS_A_PASS = FRAMES_A_PASS / DETECTOR["frames_between_runs"]

# What each operator of the network multiplies; the others only compare, look up or convert.
OPERATORS = {number: (operator["kind"], operator["products"])
             for number, operator in enumerate(DETECTOR["operators"]) if operator["products"]}
NETWORK_PRODUCTS = sum(products for _, products in OPERATORS.values())


def fields(path, kind):
    return [line.split("|") for line in path.read_text().splitlines() if line.startswith(kind + "|")]


def quiet(raw, group, name):
    times = [float(line[6]) for line in raw if line[1] == group and line[2] == name]
    if not times:
        sys.exit(f"performance.py: no line of '{name}' in group {group}")
    return min(times)


def machine(ghz):
    cpu = re.search(r"model name\s*: (.*)", pathlib.Path("/proc/cpuinfo").read_text()).group(1)
    family = [re.search(rf"^{key}\s*: (\d+)", pathlib.Path("/proc/cpuinfo").read_text(), re.MULTILINE).group(1)
              for key in ("cpu family", "model")]
    compiler = subprocess.run(["g++", "--version"], check=True, text=True, stdout=subprocess.PIPE).stdout
    date = subprocess.run(["date", "+%-d %B %Y"], check=True, text=True, stdout=subprocess.PIPE,
                          env={"LC_ALL": "C"}).stdout.strip()
    return (f"{cpu}, family {family[0]}, model {family[1]}, {ghz:.3f} GHz as measured, a virtual machine; "
            f"{compiler.splitlines()[0]}; {date}.")


def gains(path):
    """[(implementation, kernel, ns of the reference, of the reference compiled for AVX2, of AVX2, of AVX512-VNNI)],
    0 for what there is not.

    The file holds several runs, one after another: the shortest time of each counts."""
    rows = {}
    for name, kernel, *times in map(str.split, path.read_text().splitlines()):
        rows.setdefault((name, kernel), []).append(list(map(float, times)))
    return [(*names, *map(min, zip(*runs))) for names, runs in rows.items()]


def operators(path):
    """{operator: quiet microseconds}, the shortest of several runs."""
    times = {}
    for _, _, number, time in fields(path, "PART"):
        times.setdefault(int(number), []).append(float(time))
    return {number: min(runs) for number, runs in times.items()}


def in_short(raw):
    def best(group, *marks):
        return min(quiet(raw, group, line[2]) for line in raw
                   if line[1] == group and all(mark in line[2] for mark in marks))

    rows = [("a run of the network, AVX2", "A", ("QZ, exact, AVX2",), "oneDNN, AVX2 only, channels padded by hand",
             ("oneDNN", "AVX2 only", "pad64")),
            ("a run of the network, all of this processor", "A", ("QZ, exact, AVX512-VNNI",), "oneDNN, the best of four",
             ("oneDNN",)),
            ("512-point real FFT", "B-fft", ("QZ, exact, AVX2",), "FFTW, float", ("FFTW",)),
            ("a frame of the front end", "B", ("QZ, exact, AVX2",), "a float chain around FFTW", ("FFTW",))]
    lines = ["| | QZ µs | µs | beside it | ratio |", "|---|---|---|---|---|"]
    names = {line[2] for line in raw}
    if "QZ, exact, AVX512-VNNI" not in names:  # then the baseline has only AVX2 too
        rows[0] = (*rows[0][:4], ("oneDNN", "pad64"))
        del rows[1]
    for what, group, ours, name, theirs in rows:
        own, other = best(group, *ours), best(group, *theirs)
        lines.append(f"| {what} | {own:.3g} | {other:.3g} | {name} | **{own / other:.2f}** |")
    return lines


def gains_table(rows):
    lines = ["| Source | Kernel | reference, SSE2 ns | reference, AVX2 ns | AVX2 ns | gain | AVX512-VNNI ns | gain | over AVX2 |",
             "|---|---|---|---|---|---|---|---|---|"]
    for name, kernel, reference, compiled, avx2, vnni in rows:
        kernel = re.sub(r"^orra_|_ukernel.*", "", kernel)
        lines.append(f"| {name} | {kernel} | {reference:.0f} | {compiled:.0f} | " +
                     (f"{avx2:.0f} | {compiled / avx2:.2f} | " if avx2 else " | | ") +
                     (f"{vnni:.0f} | {compiled / vnni:.2f} | {avx2 / vnni:.2f} |" if vnni else " | | |"))
    return lines


def picture(raw, parts, kernels, limits, ghz):
    drawing = Drawing()
    drawing.heading("Part of the limit that is reached, AVX2, quiet time "
                    "(limit: 32 products a cycle; *: its instructions alone)")
    rows = []
    for number, (kind, products) in OPERATORS.items():
        reached = products / (parts[number] * ghz * 1e3)
        rows.append((f"operator {number}, {kind}", reached / PRODUCTS_A_CYCLE,
                     f"{parts[number]:5.2f} µs, {reached:.1f} MAC a cycle"))
    network = quiet(raw, "A", "QZ, exact, AVX2")
    reached = NETWORK_PRODUCTS / (network * ghz * 1e3)
    rows.append(("the whole network", reached / PRODUCTS_A_CYCLE, f"{network:5.1f} µs, {reached:.1f} MAC a cycle"))
    fft, frame = quiet(raw, "B-fft", "QZ, exact, AVX2"), quiet(raw, "B", "QZ, exact, AVX2")
    rows.append(("512-point real FFT (*)", limits["wide products"] / fft, f"{fft:.3f} µs"))
    drawing.limit_bars(rows)

    drawing.heading("Where the time of a pass goes (2 s of sound: 200 frames, 25/8 runs of the network)")
    groups = {}
    for number, time in parts.items():
        kind = OPERATORS.get(number, ("max pools and the rest", 0))[0]
        groups[kind] = groups.get(kind, 0) + time * RUNS_A_PASS
    steps = {name: avx2 / 1e3 for name, _, _, _, avx2, _ in kernels
             if name in ("filterbank", "logarithm", "square_root")}
    frame_parts = {"FFT": fft, **steps, "rest of the front end": frame - fft - sum(steps.values())}
    drawing.stack([(name, time * FRAMES_A_PASS) for name, time in frame_parts.items()] +
                  sorted(groups.items(), key=lambda item: -item[1]))
    PICTURE.write_text(drawing.svg())


def main():
    if len(sys.argv) != 2:
        sys.exit(__doc__)
    folder = pathlib.Path(sys.argv[1])
    raw = fields(folder / "raw.txt", "PEER")
    parts, kernels = operators(folder / "parts.txt"), gains(folder / "gains.txt")
    ghz = max(float(line[1]) for line in fields(folder / "raw.txt", "CLOCK"))
    limits = {name: min(float(line[6].split()[0]) for line in fields(folder / "raw.txt", "LIMIT") if name in line[1])
              for name in ("wide products",)}
    picture(raw, parts, kernels, limits, ghz)

    lines = [machine(ghz), "", *in_short(raw), "",
             "## The table", "", (folder / "table.md").read_text().strip(), "",
             "## What each variant gains", "",
             "One call as the graphs make it, quiet nanoseconds; the gain is against the reference compiled for AVX2.",
             "", *gains_table(kernels), ""]
    before, after = PAGE.read_text().split(MARKS[0])[0], PAGE.read_text().split(MARKS[1])[1]
    PAGE.write_text(before + MARKS[0] + "\n".join(lines) + MARKS[1] + after)


main()
