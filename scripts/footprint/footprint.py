#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Measures what the module takes of the device and compares it with the committed page.

Usage: footprint.py [--update] [--build FOLDER] [--counter FILE] [--page FILE]
Exit code: 0 nothing grew, 1 something did or could not be measured."""

import argparse
import pathlib
import subprocess
import sys
import tempfile

sys.dont_write_bytecode = True

import goals
import page
import stack
from module_file import (CHANGING, CODE, CONSTANTS, Failure, ZERO, bytes_by_component, dynamic_symbols)

ROOT = pathlib.Path(__file__).resolve().parents[2]
PASS_S = 2
FRAMES_A_PASS = 200
RUNS_A_PASS = 25 / 8


def instructions(build, counter):
    """{what: instructions on average}, the marks' own taken off."""
    counts = {}
    with tempfile.TemporaryDirectory() as folder:
        marks = pathlib.Path(folder, "marks")
        program = ["qemu-arm", "-plugin", f"{counter},out={marks}", str(build / "bin/counts_window")]
        printed = subprocess.run(program, check=True, text=True, stdout=subprocess.PIPE).stdout
        counted = [int(line) for line in marks.read_text().split()]
    spans = [b - a for a, b in zip(counted[2::2], counted[3::2])]
    for line in printed.splitlines():
        name, times = line.split()
        own, spans = spans[:int(times)], spans[int(times):]
        if len(own) != int(times):
            raise Failure(f"{name}: {len(own)} spans between marks, expected {times}")
        counts[name] = round(sum(own) / len(own) - counts.get("nothing", 0))
    if spans or counts.keys() != {"nothing", "frame", "network_run", "network_frame", "pass", "event"}:
        raise Failure(f"counts measured {sorted(counts)} and {len(spans)} spans more")
    return counts


def short_table(total, counts, depths):
    def against(name, value, limit):
        if value <= limit:
            return [name, value, limit, "yes"]
        if name not in goals.MISSED:
            raise Failure(f"{name}: {value:,}, expected at most {limit:,}, or its reason in goals.MISSED")
        return [name, value, limit, f"no: {goals.MISSED[name]}"]

    clock_khz = round(counts["event"] / PASS_S / 1000)
    data = total[CHANGING] + total[ZERO]
    stack_of_events = max(size for call, size in depths.items() if call.startswith("nanoappHandleEvent"))
    return page.Table(page.HEADLINE, ["Value", "Now", "Limit", "Met"], [
        against("Instructions a run of the network", counts["network_run"], goals.RUN_INSTRUCTIONS),
        against("Instructions a frame of the front end", counts["frame"], goals.FRAME_INSTRUCTIONS),
        ["Instructions a pass (2 s of sound)", counts["pass"], "", ""],
        against("Clock for always-on use, kHz", clock_khz, goals.CLOCK_KHZ),
        against("Code, bytes", total[CODE], goals.CODE_BYTES),
        against("Constants, bytes", total[CONSTANTS], goals.CONSTANTS_BYTES),
        against("Changing and zero data, bytes", data, goals.DATA_BYTES),
        against("Stack of nanoappHandleEvent, bytes", stack_of_events, goals.STACK_BYTES),
    ], "The clock is that of a processor that executes one instruction a cycle, whole audio events. A "
       "run of the\nnetwork would take 930,000 instructions if each were 4 multiply-accumulates and "
       "nothing else were to do.")


def component_table(by_component, total):
    rows = [[component, *sizes.values()] for component, sizes in by_component.items()]
    return page.Table(
        "Bytes by component", ["Component", *total], [*rows, ["**All**", *total.values()]],
        "Changing data has values at load, zero data has none. nanopb and the compiler's library come "
        "without\nsources; the stubs are those through which the runtime is called.")


def linking_table(linking, imports, exports):
    return page.Table("Dynamic linking", ["What", "Bytes", "Number"], [
        ["Tables for the loader", linking, ""],
        ["Imported functions", "", len(imports)],
        ["Exported symbols", "", len(exports)],
    ], "Loaded besides what the components add.")


def stack_table(depths):
    return page.Table(
        "Stack by call", ["Call", "Bytes"], [[call, size] for call, size in depths.items()],
        "Measured: each call runs on a stack filled with a pattern, and the deepest byte that changed "
        "counts\n(`bench/stack_depth.cc`). The calls are the deepest of each kind that are known; what "
        "they don't reach is not\nmeasured. The runtime's functions are replaced by nearly empty ones.")


def frame_table(frames):
    return page.Table(
        "Largest stack frame by component", ["Component", "Bytes", "Function"],
        [[component, size, f"`{name}`"] for component, (size, name) in frames.items()],
        "Of one function, as the compiler reports it. A frame without a bound fails.")


def instruction_table(counts):
    rest = counts["pass"] - FRAMES_A_PASS * counts["frame"] - RUNS_A_PASS * counts["network_run"]
    return page.Table("Instructions", ["What", "Executed"], [
        ["A frame of the front end", counts["frame"]],
        ["A run of the network", counts["network_run"]],
        ["A classification pass", counts["pass"]],
        ["Of it, besides frames and runs", round(rest)],
        ["A whole audio event, with the report to one client", counts["event"]],
    ], "Averages over 200 frames, 8 runs, 8 passes (25 runs) and 8 events, after some to warm up, with "
       "what the\nC library executes for them.")


def measure(build, counter):
    module = build / "lib/qz.so"
    map_text = (build / "lib/qz.map").read_text()
    by_component, linking = bytes_by_component(module, map_text)
    total = {kind: sum(sizes[kind] for sizes in by_component.values())
             for kind in (CODE, CONSTANTS, CHANGING, ZERO)}
    depths = stack.measured(build)
    counts = instructions(build, counter)
    return [short_table(total, counts, depths), component_table(by_component, total),
            linking_table(linking, *dynamic_symbols(module)), stack_table(depths),
            frame_table(stack.largest_frames(build, map_text)), instruction_table(counts)]


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("--update", action="store_true", help="rewrite the page")
    parser.add_argument("--build", type=pathlib.Path, default=ROOT / "build/target")
    parser.add_argument("--counter", type=pathlib.Path,
                        default=ROOT / "build/host/lib/instruction_counter.so")
    parser.add_argument("--page", type=pathlib.Path, default=ROOT / "docs/footprint.md")
    options = parser.parse_args()
    try:
        tables = measure(options.build.resolve(), options.counter.resolve())
    except (Failure, OSError, subprocess.CalledProcessError) as failure:
        sys.exit(f"footprint: {failure}")
    text = page.render(tables)
    print(text.removeprefix(page.INTRODUCTION).strip())
    readme = ROOT / "README.md"
    if options.update:
        options.page.write_text(text)
        readme.write_text(page.renew_copy(readme.read_text(), tables[0]))
    committed = page.read(options.page.read_text()) if options.page.exists() else {}
    faults = [*page.compare(committed, page.read(text)),
              *page.check_copy(readme.read_text(), committed, readme.name)]
    for fault in faults:
        print(f"footprint: {fault}", file=sys.stderr)
    if faults:
        sys.exit(1)


if __name__ == "__main__":
    main()
