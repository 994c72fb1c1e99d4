#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Compares every #include "..." of the tree with the table of dependencies in ARCHITECTURE.md.

Usage: check-dependencies.py [--root FOLDER]

A row of the table names one or more components (folders) and the components that they may include, all of
which must have rows further up. A file belongs to the component with the longest matching folder, and may
always include its own component. Exits with 1 where an include is not allowed or names no file, where a
row names a folder that does not exist, and where nothing was checked.
"""

import argparse
import pathlib
import re
import sys

TABLE_HEADING = "## Dependencies between components"
# Headers that the build generates or that it may replace: included by their bare names, and the components
# that they belong to.
GENERATED = {
    "detector_description.h": "config",
    "logistic_table.h": "network",
    "model_weights.h": "network",
    "sound_detection.nanopb.h": "proto",
    "sound_detection.pb.h": "hub",
}
# The runtime's headers keep the runtime's names: a vendor's own can replace them.
PLATFORM = "platform"
ANYTHING = "anything"
# With fewer, the check was given something else than the whole tree.
MIN_FILES = 100
MIN_INCLUDES = 300


def read_table(page):
    """Returns {component: set of components it may include, or ANYTHING}, in the table's order."""
    section = page.split(TABLE_HEADING + "\n", 1)
    if len(section) < 2:
        raise ValueError(f"has no section '{TABLE_HEADING}'")
    allowed = {}
    for line in section[1].split("\n## ", 1)[0].splitlines():
        cells = [cell.strip() for cell in line.strip().strip("|").split("|")]
        names = re.findall(r"`([a-z0-9_/]+)/`", cells[0])
        if not line.startswith("|") or not names:
            continue
        if len(cells) != 3:
            raise ValueError(f"a row of the table has {len(cells)} cells, expected 3: {line}")
        included = re.findall(r"`([a-z0-9_/]+)/`", cells[2])
        if not included and cells[2] not in ("nothing", ANYTHING):
            raise ValueError(f"'{cells[2]}' names no component; expected `folder/`, nothing or anything")
        for name in included:
            if name not in allowed:
                raise ValueError(f"{names[0]}/ may include {name}/, which has no row above it")
        for name in names:
            if name in allowed:
                raise ValueError(f"{name}/ has two rows")
        for name in names:
            allowed[name] = ANYTHING if cells[2] == ANYTHING else set(included)
    if not allowed:
        raise ValueError(f"the section '{TABLE_HEADING}' has no table")
    return allowed


def component_of(path, allowed):
    """The component that a file, named from the root, belongs to; None where no row names its folder."""
    for folder in path.parents:
        if folder.as_posix() in allowed:
            return folder.as_posix()
    return None


def sources(root):
    for folder in sorted(root.iterdir()):
        if folder.is_dir() and folder.name != "build" and not folder.name.startswith("."):
            for file in sorted(folder.rglob("*")):
                if file.suffix in (".h", ".cc", ".c", ".inc"):
                    yield file.relative_to(root)


def target_of(name, root, allowed):
    """The component of an included header; None where there is no such header."""
    if name in GENERATED:
        return GENERATED[name]
    if (root / name).is_file():
        return component_of(pathlib.PurePosixPath(name), allowed) or name
    if (root / PLATFORM / name).is_file():
        return PLATFORM
    return None


def check(root):
    """Returns (findings, files, includes)."""
    allowed = read_table((root / "ARCHITECTURE.md").read_text())
    findings = [f"ARCHITECTURE.md: {name}/ has a row but no such folder exists"
                for name in allowed if not (root / name).is_dir()]
    files = includes = 0
    for file in sources(root):
        files += 1
        own = component_of(file, allowed)
        if own is None:
            findings.append(f"{file}: its folder has no row in the table of ARCHITECTURE.md")
            continue
        lines = (root / file).read_text().splitlines()
        for number, line in enumerate(lines, 1):
            match = re.match(r'\s*#\s*include\s*"([^"]+)"', line)
            if not match:
                continue
            includes += 1
            name = match.group(1)
            target = target_of(name, root, allowed)
            if target is None:
                findings.append(f"{file}:{number}: {name} is no file of the tree, of {PLATFORM}/ or known as "
                                "generated; expected a path from the root")
            elif target != own and allowed[own] != ANYTHING and target not in allowed[own]:
                findings.append(f"{file}:{number}: {own}/ may not include {name}: ARCHITECTURE.md does not "
                                f"list {target}/ in its row")
    return findings, files, includes


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("--root", type=pathlib.Path, default=pathlib.Path(__file__).resolve().parent.parent)
    root = parser.parse_args().root
    try:
        findings, files, includes = check(root)
    except (OSError, ValueError) as error:
        sys.exit(f"check-dependencies.py: {root}/ARCHITECTURE.md: {error}")
    if files < MIN_FILES or includes < MIN_INCLUDES:
        findings.append(f"{files} files with {includes} includes: expected at least {MIN_FILES} and {MIN_INCLUDES}")
    if findings:
        print("\n".join(findings), file=sys.stderr)
        sys.exit(1)
    print(f"{includes} includes in {files} files keep to the table of dependencies")


if __name__ == "__main__":
    main()
