"""The linked module as the binary tools and the linker's map show it: sections, functions, and how
many bytes each room brings in."""

import collections
import re
import struct
import subprocess

TOOLS = "arm-linux-gnueabihf-"


class Failure(Exception):
    """Something that could not be measured, or is not allowed to be."""


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

# Rooms by what the map calls the source of a piece: library, or folder of objects.
ROOM_OF_SOURCE = {
    "signal_kernels": "kernels/signal",
    "quantised_kernels": "kernels/quantised",
    "audio_frontend": "frontend",
    "mobilenet_backend": "network",
    "audio_classifier": "classifier",
    "sound_detection_proto": "proto",
    "app": "app",
    "audio_binding": "app",
    "qz_module": "app",
    "protobuf-nanopb": "nanopb",
    "gcc": "compiler's library",
}
WITHOUT_SOURCES = ("nanopb", "compiler's library")
FILLING = "alignment, stubs"
ROOMS = [*dict.fromkeys(ROOM_OF_SOURCE.values()), FILLING]

Section = collections.namedtuple("Section", "name address offset bytes loaded")
Function = collections.namedtuple("Function", "name address bytes")
Piece = collections.namedtuple("Piece", "section address bytes room object")


def sections(module):
    found = {}
    row = re.compile(r"\s*\[ *\d+\] (\S+)\s+\S+\s+(\w{8}) (\w{6}) (\w{6}) \w\w\s+"
                     r"([A-Zxlop]*)\s+\d+ ")
    for line in tool("readelf", "-SW", module).splitlines():
        if match := row.match(line):
            name, address, offset, size, flags = match.groups()
            found[name] = Section(name, int(address, 16), int(offset, 16), int(size, 16),
                                  "A" in flags)
    if ".text" not in found:
        raise Failure(f"{module}: no section .text, should be a linked module")
    return found


def symbols(module, kind):
    """Defined symbols of FUNC or OBJECT as the symbol table has them, aliases included. Bit 0 of a
    function's address, which tells its instruction set, is taken off."""
    for line in tool("readelf", "-sW", module).split("'.symtab'")[-1].splitlines():
        fields = line.split()
        if len(fields) == 8 and fields[3] == kind and fields[6] not in ("UND", "ABS"):
            address = int(fields[1], 16)
            yield Function(fields[7], address & ~1 if kind == "FUNC" else address,
                           int(fields[2], 0))


def dynamic_symbols(module):
    """Names that the module imports, and those that it exports."""
    imports, exports = [], []
    for line in tool("readelf", "-W", "--dyn-syms", module).splitlines():
        fields = line.split()
        if len(fields) >= 8 and fields[0] != "Num:" and fields[4] in ("GLOBAL", "WEAK"):
            (imports if fields[6] == "UND" else exports).append(fields[7].split("@")[0])
    return imports, exports


def words_of(module, name):
    """The 32-bit words of a constant table, as linked."""
    names = {symbol.name: symbol for symbol in symbols(module, "OBJECT")}
    demangled = dict(zip(tool("c++filt", text="\n".join(names)).split("\n"), names.values()))
    tables = [symbol for plain, symbol in demangled.items() if plain.split("::")[-1] == name]
    if len(tables) != 1:
        raise Failure(f"{module}: {len(tables)} tables named {name}, should be one")
    table = tables[0]
    for section in sections(module).values():
        if section.address <= table.address < section.address + section.bytes:
            with open(module, "rb") as file:
                file.seek(section.offset + table.address - section.address)
                return struct.unpack(f"<{table.bytes // 4}I", file.read(table.bytes // 4 * 4))
    raise Failure(f"{module}: the table {name} lies in no section")


def room_and_object(source):
    """'lib/libapp.a(nanoapp.cc.o)' gives ('app', ('app', 'nanoapp.cc.o'))."""
    match = (re.search(r"lib([\w-]+)\.a\((.+)\)$", source) or
             re.search(r"CMakeFiles/(\w+)\.dir/(?:.*/)?(.+)$", source))
    if source == "linker stubs":
        return FILLING, None
    if not match or match.group(1) not in ROOM_OF_SOURCE:
        raise Failure(f"the module holds a piece of '{source}', which is of no known room; "
                      "name it in ROOM_OF_SOURCE")
    return ROOM_OF_SOURCE[match.group(1)], match.groups()


def pieces(map_text):
    """What each object file brings into each section, from the linker's map."""
    text = map_text.split("Linker script and memory map", 1)[-1]
    section = None
    # A long name stands in a line of its own.
    text = re.sub(r"^( ?\S+)\n\s+0x", r"\1 0x", text, flags=re.M)
    piece = re.compile(r"^ (\S+)\s+0x(\w+)\s+0x(\w+)(?: (.*))?$")
    for line in text.splitlines():
        if line.startswith("."):
            section = line.split()[0]
        match = piece.match(line)
        if not match or section not in KIND_OF_SECTION or KIND_OF_SECTION[section] == LINKING:
            continue
        name, address, size, source = match.groups()
        # Calls of the runtime go through stubs that the map counts to the first object.
        if name == "*fill*" or section in (".plt", ".iplt"):
            room, where = FILLING, None
        else:
            room, where = room_and_object(source.strip())
        yield Piece(section, int(address, 16), int(size, 16), room, where)


def bytes_by_room(module, map_text):
    """{room: {kind: bytes}}, and the bytes of the tables for dynamic linking. Every loaded byte is
    in it once: what the map says of a section must add up to the section."""
    loaded = [section for section in sections(module).values() if section.loaded]
    by_section = collections.Counter()
    by_room = {room: dict.fromkeys((CODE, CONSTANTS, CHANGING, ZERO), 0) for room in ROOMS}
    for piece in pieces(map_text):
        by_section[piece.section] += piece.bytes
        by_room[piece.room][KIND_OF_SECTION[piece.section]] += piece.bytes
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
                          f"{section.name}, should be {section.bytes}")
    return by_room, linking
