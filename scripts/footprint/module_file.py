# SPDX-License-Identifier: Apache-2.0
"""The linked module as the binary tools and the linker's map show it: sections, and how many bytes
each component adds."""

import collections
import re
import subprocess

TOOLS = "arm-linux-gnueabihf-"


class Failure(Exception):
    """Something that could not be measured, or is not allowed."""


def tool(name, *arguments, text=None):
    return subprocess.run([TOOLS + name, *map(str, arguments)], input=text, check=True, text=True,
                          stdout=subprocess.PIPE).stdout


# What the loaded sections count as. Tables for dynamic linking serve the loader, not the detector.
CODE, CONSTANTS, CHANGING, ZERO, LINKING = "Code", "Constants", "Changing", "Zero", "Linking"
KIND_OF_SECTION = {
    ".text": CODE, ".plt": CODE, ".iplt": CODE,
    ".rodata": CONSTANTS, ".unstable_id": CONSTANTS,
    ".data.rel.ro": CONSTANTS,  # written by the loader alone, then read-only
    ".data": CHANGING,
    ".bss": ZERO,
    **dict.fromkeys([".note.gnu.build-id", ".gnu.hash", ".dynsym", ".dynstr", ".gnu.version",
                     ".gnu.version_r", ".rel.dyn", ".rel.plt", ".dynamic", ".got"], LINKING),
}

# Components by what the map calls the source of a piece: library, or folder of objects.
COMPONENT_OF_SOURCE = {
    "signal_kernels": "kernels/signal",
    "quantised_kernels": "kernels/quantised",
    "audio_frontend": "frontend",
    "mobilenet_backend": "network",
    "module_weights": "network",
    "network": "network",
    "detector": "detector",
    "audio_classifier": "classifier",
    "classifier_window": "classifier",
    "classifier_stream": "classifier",
    "stream_backend": "network",
    "sound_detection_proto": "proto",
    "app": "app",
    "audio_binding": "app",
    "qz_module": "app",
    "qz_module_other": "app",
    "protobuf-nanopb": "nanopb",
    "gcc": "compiler's library",
}
WITHOUT_SOURCES = ("nanopb", "compiler's library")
FILLING = "alignment, stubs"
COMPONENTS = [*dict.fromkeys(COMPONENT_OF_SOURCE.values()), FILLING]

Section = collections.namedtuple("Section", "name bytes loaded")
Piece = collections.namedtuple("Piece", "section bytes component object")


def sections(module):
    found = {}
    row = re.compile(r"\s*\[ *\d+\] (\S+)\s+\S+\s+\w{8} \w{6} (\w{6}) \w\w\s+"
                     r"([A-Zxlop]*)\s+\d+ ")
    for line in tool("readelf", "-SW", module).splitlines():
        if match := row.match(line):
            name, size, flags = match.groups()
            found[name] = Section(name, int(size, 16), "A" in flags)
    if ".text" not in found:
        raise Failure(f"{module}: no section .text, expected a linked module")
    return found


def dynamic_symbols(module):
    """Names that the module imports, and those that it exports."""
    imports, exports = [], []
    for line in tool("readelf", "-W", "--dyn-syms", module).splitlines():
        fields = line.split()
        if len(fields) >= 8 and fields[0] != "Num:" and fields[4] in ("GLOBAL", "WEAK"):
            (imports if fields[6] == "UND" else exports).append(fields[7].split("@")[0])
    return imports, exports


def component_and_object(source):
    """'lib/libapp.a(nanoapp.cc.o)' gives ('app', ('app', 'nanoapp.cc.o'))."""
    match = (re.search(r"lib([\w-]+)\.a\((.+)\)$", source) or
             re.search(r"CMakeFiles/(\w+)\.dir/(?:.*/)?(.+)$", source))
    if source == "linker stubs":
        return FILLING, None
    if not match or match.group(1) not in COMPONENT_OF_SOURCE:
        raise Failure(f"the module holds a piece of '{source}', which is of no known component; "
                      "name it in COMPONENT_OF_SOURCE")
    return COMPONENT_OF_SOURCE[match.group(1)], match.groups()


def pieces(map_text):
    """What each object file adds to each section, from the linker's map."""
    text = map_text.split("Linker script and memory map", 1)[-1]
    section = None
    # A long name is a line of its own.
    text = re.sub(r"^( ?\S+)\n\s+0x", r"\1 0x", text, flags=re.M)
    piece = re.compile(r"^ (\S+)\s+0x\w+\s+0x(\w+)(?: (.*))?$")
    for line in text.splitlines():
        if line.startswith("."):
            section = line.split()[0]
        match = piece.match(line)
        if not match or section not in KIND_OF_SECTION or KIND_OF_SECTION[section] == LINKING:
            continue
        name, size, source = match.groups()
        # Calls of the runtime go through stubs that the map counts to the first object.
        if name == "*fill*" or section in (".plt", ".iplt"):
            component, source_object = FILLING, None
        else:
            component, source_object = component_and_object(source.strip())
        yield Piece(section, int(size, 16), component, source_object)


def bytes_by_component(module, map_text):
    """{component: {kind: bytes}}, and the bytes of the tables for dynamic linking. Every loaded byte
    counts once: the map's pieces of a section must add up to the section."""
    loaded = [section for section in sections(module).values() if section.loaded]
    by_section = collections.Counter()
    by_component = {component: dict.fromkeys((CODE, CONSTANTS, CHANGING, ZERO), 0) for component in COMPONENTS}
    for piece in pieces(map_text):
        by_section[piece.section] += piece.bytes
        by_component[piece.component][KIND_OF_SECTION[piece.section]] += piece.bytes
    linking = 0
    for section in loaded:
        kind = KIND_OF_SECTION.get(section.name)
        if kind is None:
            raise Failure(f"{module}: unknown section {section.name} of {section.bytes} bytes; "
                          "name it in KIND_OF_SECTION")
        if kind == LINKING:
            linking += section.bytes
        elif by_section[section.name] != section.bytes:
            raise Failure(f"{module}: the map accounts for {by_section[section.name]} bytes of "
                          f"{section.name}, expected {section.bytes}")
    return by_component, linking
