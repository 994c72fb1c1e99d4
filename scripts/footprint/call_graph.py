"""Functions, their frames and calls, and the deepest way down from one. Frames of our functions are
the compiler's figures; those of what comes without sources, and all direct calls, are read from the
module's machine code."""

import collections
import json
import pathlib
import re

from module_file import Failure, ROOM_OF_SOURCE, WITHOUT_SOURCES, pieces, symbols, tool

Node = collections.namedtuple("Node", "name frame calls")


class Code:
    """One function's machine code."""

    REGISTERS = re.compile(r"\{(.*)\}")
    CONDITION = "(eq|ne|cs|cc|mi|pl|vs|vc|hi|ls|ge|lt|gt|le)?$"
    BRANCH = re.compile("(b|bl|bx|blx|cbz|cbnz)" + CONDITION)
    JUMP = re.compile("(mov|ldr|add|sub)" + CONDITION)

    def __init__(self, name):
        self.name = name
        self.frame = 0  # bytes, at most: all that it pushes anywhere
        self.targets = set()  # of branches, loops included
        self.returning = set()  # those of them that come back
        self.indirect = 0

    def read(self, line):
        """Takes in one instruction of the disassembly."""
        mnemonic, _, operands = line.partition("\t")
        operands = operands.split("@")[0].strip()
        base = mnemonic.split(".")[0]
        if base in ("push", "vpush") or (base == "stmdb" and operands.startswith("sp!")):
            names = self.REGISTERS.search(operands).group(1)
            width = 8 if re.match(r"d\d", names) else 4
            self.frame += width * sum(map(self.range_length, names.split(",")))
        elif re.match(r"subw?s?$", base) and operands.startswith("sp,"):
            amount = re.match(r"sp, (?:sp, )?#(\d+)$", operands)
            if not amount:
                raise Failure(f"{self.name}: frame without a bound: {mnemonic} {operands}")
            self.frame += int(amount.group(1))
        elif moved := re.search(r"\[sp, #-(\d+)\]!", operands):
            self.frame += int(moved.group(1))
        elif self.BRANCH.match(base):
            self.read_branch(operands, base in ("bl", "blx") or len(base) == 4)
        elif self.JUMP.match(base) and operands.startswith("pc,") and "[sp]" not in operands:
            self.indirect += 1

    @staticmethod
    def range_length(names):
        numbers = re.findall(r"\d+", names)
        return int(numbers[1]) - int(numbers[0]) + 1 if "-" in names else 1

    def read_branch(self, operands, returns):
        place = operands.split(",")[-1].strip()
        if target := re.match(r"([0-9a-f]+) <", place):
            self.targets.add(int(target.group(1), 16))
            if returns:
                self.returning.add(int(target.group(1), 16))
        elif place != "lr":
            self.indirect += 1


def read_code(module):
    """{address: Code} of every function of the module."""
    # Of several names of one place the one that tells its size.
    functions = {f.address: f for f in sorted(symbols(module, "FUNC"), key=lambda f: f.bytes)}
    code = {}
    current, end = None, 0
    for line in tool("objdump", "-d", "--no-show-raw-insn", "-j", ".text", module).splitlines():
        match = re.match(r"\s*([0-9a-f]+):\t(\S.*)", line)
        if not match:
            continue
        address, instruction = int(match.group(1), 16), match.group(2)
        if address in functions:
            current = code[address] = Code(functions[address].name)
            end = address + functions[address].bytes
        filling = instruction.startswith(("nop", ".", "movs\tr0, r0"))
        if current is None or (address >= end and not filling):
            raise Failure(f"{module}: code at {address:#x} belongs to no function")
        current.read(instruction)
    return code


def compiler_files(build):
    """{(target, object file): [the compiler's files beside it]}"""
    files = collections.defaultdict(list)
    for entry in json.loads((build / "compile_commands.json").read_text()):
        path = pathlib.PurePath(re.search(r" -o (\S+)", entry["command"]).group(1))
        target = re.search(r"CMakeFiles/(\w+)\.dir/", str(path)).group(1)
        files[target, path.name].append(build / path.with_suffix(".ci"))
    return files


def read_compiler_files(build, module, map_text):
    """{address: (frame, [places of indirect calls])} of every function compiled here."""
    files = compiler_files(build)
    functions = list(symbols(module, "FUNC"))
    found = {}
    for piece in pieces(map_text):
        if (piece.section != ".text" or not piece.bytes or piece.object is None
                or ROOM_OF_SOURCE[piece.object[0]] in WITHOUT_SOURCES):
            continue
        paths = [path for path in files[piece.object] if path.exists()]
        if len(paths) != 1:
            raise Failure(f"{len(paths)} files of stack figures for {' '.join(piece.object)}, "
                          "should be one: compile it anew, with -fcallgraph-info=su")
        figures = read_compiler_file(paths[0].read_text())
        here = [f for f in functions if piece.address <= f.address < piece.address + piece.bytes]
        found.update((f.address, figures[f.name]) for f in here if f.name in figures)
        for function in here:
            if function.address not in found:
                raise Failure(f"{function.name}: no figures of its stack in {paths[0].name}")
    return found


def read_compiler_file(text):
    """{function: (frame, [places of indirect calls])} of one file of the compiler's."""
    frames, places = {}, collections.defaultdict(list)
    # The name of a function of one file alone stands behind the file's.
    for title, label in re.findall(r'^node: \{ title: "([^"]*)" label: "([^"]*)"', text, re.M):
        name = title.rsplit(":", 1)[-1]
        if frame := re.search(r"\\n(\d+) bytes \(([a-z,]+)\)", label):
            if frame.group(2) == "dynamic":
                raise Failure(f"{name}: frame without a bound ({frame.group(1)} bytes and more)")
            frames[name] = int(frame.group(1))
    for title, place in re.findall(r'^edge: \{ sourcename: "([^"]*)" targetname: "__indirect_call" '
                                   r'label: "([^"]*)"', text, re.M):
        places[title.rsplit(":", 1)[-1]].append(place)
    return {name: (frame, places[name]) for name, frame in frames.items()}


def deepest(nodes, start, limits):
    """(bytes, names) of the deepest way down from `start`, along which a function of `limits` is
    entered at most that often. Fails on any other cycle."""
    known, open_states = {}, []

    def visit(address, left):
        if address in left:
            if left[address] == 0:
                return None
            left = {**left, address: left[address] - 1}
        state = address, tuple(left.values())
        if state in open_states:
            names = [nodes[a].name for a, _ in open_states[open_states.index(state):]]
            raise Failure("recursion without a bound: " + " -> ".join([*names, names[0]]))
        if state not in known:
            open_states.append(state)
            ways = [visit(call, left) for call in sorted(nodes[address].calls)]
            open_states.pop()
            depth, path = max((way for way in ways if way), default=(0, []), key=lambda way: way[0])
            known[state] = nodes[address].frame + depth, [nodes[address].name, *path]
        return known[state]

    return visit(start, dict(limits))
