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


ENGINES = {"window": "qz", "stream": "qz-stream"}  # and the names of their modules


def instructions(build, counter, engine):
    """{what: instructions, on average; (what, "worst"): at most}, the marks' own taken off."""
    counts = {}
    with tempfile.TemporaryDirectory() as folder:
        marks = pathlib.Path(folder, "marks")
        program = ["qemu-arm", "-plugin", f"{counter},out={marks}", str(build / f"bin/counts_{engine}")]
        printed = subprocess.run(program, check=True, text=True, stdout=subprocess.PIPE).stdout
        counted = [int(line) for line in marks.read_text().split()]
    spans = [b - a for a, b in zip(counted[2::2], counted[3::2])]
    names = []
    for line in printed.splitlines():
        name, times = line.split()
        own, spans = spans[:int(times)], spans[int(times):]
        if len(own) != int(times):
            raise Failure(f"{name}: {len(own)} spans between marks, expected {times}")
        names.append(name)
        marks_own = counts.get("nothing", 0)
        counts[name] = round(sum(own) / len(own) - marks_own)
        counts[name, "worst"] = max(own) - marks_own
    if spans or set(names) != {"nothing", "frame", "network_run", "network_frame", "pass", "event"}:
        raise Failure(f"counts measured {sorted(names)} and {len(spans)} spans more")
    return counts


class Module:
    """What one of the two modules takes."""

    def __init__(self, build, counter, engine):
        self.engine = engine
        path, map_text = build / f"lib/{ENGINES[engine]}.so", (build / f"lib/{ENGINES[engine]}.map").read_text()
        self.by_component, self.linking = bytes_by_component(path, map_text)
        self.total = {kind: sum(sizes[kind] for sizes in self.by_component.values())
                      for kind in (CODE, CONSTANTS, CHANGING, ZERO)}
        self.imports, self.exports = dynamic_symbols(path)
        self.depths = stack.measured(build, engine)
        self.frames = stack.largest_frames(build, map_text)
        self.counts = instructions(build, counter, engine)

    def headline(self):
        counts = self.counts
        return {
            "Instructions a run of the network": counts["network_run"],
            "Instructions of the network with one frame, at most": counts["network_frame", "worst"],
            "Instructions a frame of the front end": counts["frame"],
            "Instructions a pass (2 s of sound)": counts["pass"],
            "Instructions of an audio event, at most": counts["event", "worst"],
            "Clock for always-on use, kHz": round(counts["event"] / PASS_S / 1000),
            "Code, bytes": self.total[CODE],
            "Constants, bytes": self.total[CONSTANTS],
            "Changing and zero data, bytes": self.total[CHANGING] + self.total[ZERO],
            "Tables for the loader, bytes": self.linking,
            "Stack of nanoappHandleEvent, bytes": max(
                size for call, size in self.depths.items() if call.startswith("nanoappHandleEvent")),
        }


def short_table(modules):
    rows = []
    headlines = {module.engine: module.headline() for module in modules}
    for name in headlines["window"]:
        row, missed = [name], []
        for engine, values in headlines.items():
            limit = goals.LIMITS[engine].get(name, "")
            row += [values[name], limit]
            if limit != "" and values[name] > limit:
                if (engine, name) not in goals.MISSED:
                    raise Failure(f"{engine}, {name}: {values[name]:,}, expected at most {limit:,}, or its "
                                  "reason in goals.MISSED")
                missed.append(f"no ({engine}): {goals.MISSED[engine, name]}")
        limited = any(name in limits for limits in goals.LIMITS.values())
        rows.append([*row, "; ".join(missed) or ("yes" if limited else "")])
    return page.Table(
        page.HEADLINE, ["Value", "Window", "Limit", "Stream", "Limit", "Met"], rows,
        "Two modules that give the same: `lib/qz.so` runs the network over whole windows, `lib/qz-stream.so` "
        "over a\nstream of frames. The clock is that of a processor that executes one instruction a cycle, whole "
        "audio events. A run\nover a whole window would take 930,000 instructions if each were 4 "
        "multiply-accumulates and nothing else were to do;\nthat of a stream is spread over the frames since the "
        "run before.")


def component_table(module):
    rows = [[component, *sizes.values()] for component, sizes in module.by_component.items()]
    return page.Table(
        f"Bytes by component, {module.engine}", ["Component", *module.total],
        [*rows, ["**All**", *module.total.values()]],
        "Changing data has values at load, zero data has none. nanopb and the compiler's library come "
        "without\nsources; the stubs are those through which the runtime is called.")


def linking_table(modules):
    rows = []
    for module in modules:
        rows += [[f"Tables for the loader, {module.engine}", module.linking, ""],
                 [f"Imported functions, {module.engine}", "", len(module.imports)],
                 [f"Exported symbols, {module.engine}", "", len(module.exports)]]
    return page.Table("Dynamic linking", ["What", "Bytes", "Number"], rows,
                      "Loaded besides what the components add.")


def stack_table(modules):
    return page.Table(
        "Stack by call", ["Call", *(f"Bytes, {module.engine}" for module in modules)],
        [[call, *(module.depths[call] for module in modules)] for call in modules[0].depths],
        "Measured: each call runs on a stack filled with a pattern, and the deepest byte that changed "
        "counts\n(`bench/stack_depth.cc`). The calls are the deepest of each kind that are known; what "
        "they don't reach is not\nmeasured. The runtime's functions are replaced by nearly empty ones.")


def frame_table(module):
    return page.Table(
        f"Largest stack frame by component, {module.engine}", ["Component", "Bytes", "Function"],
        [[component, size, f"`{name}`"] for component, (size, name) in module.frames.items()],
        "Of one function, as the compiler reports it. A frame without a bound fails.")


def instruction_table(modules):
    def rest(counts):
        return round(counts["pass"] - FRAMES_A_PASS * counts["frame"] - RUNS_A_PASS * counts["network_run"])

    rows = {
        "A frame of the front end": lambda counts: counts["frame"],
        "A run of the network; of a stream, since the run before": lambda counts: counts["network_run"],
        "A classification pass": lambda counts: counts["pass"],
        "Of it, besides frames and runs": rest,
        "A whole audio event, with the report to one client": lambda counts: counts["event"],
    }
    return page.Table(
        "Instructions", ["What", *(module.engine.capitalize() for module in modules)],
        [[name, *(value(module.counts) for module in modules)] for name, value in rows.items()],
        "Averages over 200 frames, 8 runs, 8 passes (25 runs) and 8 events, after some to warm up, with "
        "what the\nC library executes for them.")


def measure(build, counter):
    modules = [Module(build, counter, engine) for engine in ENGINES]
    return [short_table(modules), *map(component_table, modules), linking_table(modules),
            stack_table(modules), *map(frame_table, modules), instruction_table(modules)]


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
