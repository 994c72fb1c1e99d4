"""The deepest stack of each entry point. What neither the machine code nor the compiler tells is
stated in stated_calls.py; what is in none of them is a failure, never a guess."""

import bisect
import pathlib
import re

import stated_calls
from call_graph import Node, deepest, read_code, read_compiler_files
from module_file import Failure, sections, tool, words_of


class Functions:
    """The module's functions by name and by address."""

    def __init__(self, module, code):
        plain = tool("c++filt", "-p", text="\n".join(c.name for c in code.values())).split("\n")
        self.names = {address: re.sub(r".*\{lambda.*", "lambda", name)
                      for address, name in zip(code, plain)}
        self.starts = sorted(code)
        self.module = module
        self.stubs = sections(module)[".plt"]
        self.text = sections(module)[".text"]

    def named(self, name):
        """Addresses of the functions whose plain name ends so: AppManager::Stop."""
        found = [address for address, plain in self.names.items()
                 if plain == name or plain.endswith("::" + name)]
        if not found:
            raise Failure(f"no function {name} in the module, but it is stated to be called")
        return found

    def holding(self, target):
        """The start of the function that a branch leads into (libraries branch into the middle of
        one, too); None for the stubs through which the runtime is called."""
        if self.stubs.address <= target < self.stubs.address + self.stubs.bytes:
            return None
        if not self.text.address <= target < self.text.address + self.text.bytes:
            raise Failure(f"a call of {target:#x}, which is no code of the module")
        return self.starts[bisect.bisect_right(self.starts, target) - 1]

    def in_table(self, table):
        """The functions of a constant table. Their addresses are odd, being of Thumb code, and no
        other odd word of the table may follow a function's start."""
        found = {word - 1 for word in words_of(self.module, table) if word & 1} & set(self.starts)
        if not found:
            raise Failure(f"no functions in the table {table}")
        return found


def stated_in_sources(places, functions, used):
    """What the indirect calls at these places of our sources reach."""
    reached = set()
    for place in places:
        path, line, _ = place.rsplit(":", 2)
        text = pathlib.Path(path).read_text().splitlines()[int(line) - 1]
        rows = [row for row in stated_calls.INDIRECT_IN_SOURCES
                if path.endswith("/" + row[0]) and row[1] in text]
        if len(rows) != 1:
            raise Failure(f"{path}:{line}: where does this indirect call go? It needs a row "
                          f"in INDIRECT_IN_SOURCES: {text.strip()}")
        used.setdefault(rows[0][:2], set()).add(place)
        for name in rows[0][3]:
            table = name.removeprefix("table ")
            reached.update(functions.named(name) if table == name else functions.in_table(table))
    return reached


def stated_in_libraries(function, used):
    """Names of what the indirect calls of a function without sources reach."""
    if function.indirect == 0:
        return []
    rows = [row for row in stated_calls.INDIRECT_IN_LIBRARIES
            if row[:2] == (function.name, function.indirect)]
    if len(rows) != 1:
        raise Failure(f"{function.name}: {function.indirect} indirect calls; where do they go? "
                      "They need a row in INDIRECT_IN_LIBRARIES")
    used[rows[0][:2]] = set()
    return rows[0][2]


def nesting(proto_text, messages):
    """Levels of the deepest of the messages; 1 where none stands within another."""
    bodies = dict(re.findall(r"^message (\w+) \{(.*?)^\}", proto_text, re.M | re.S))

    def levels(message, above):
        if message in above:
            raise Failure(f"the message {message} can stand within itself: no bound of its depth")
        if message not in bodies:
            raise Failure(f"no message {message} in the .proto")
        types = re.findall(r"^\s*(?:optional|required|repeated) (\w+) ", bodies[message], re.M)
        return 1 + max((levels(t, above | {message}) for t in types if t in bodies), default=0)

    return max(levels(message, frozenset()) for message in messages)


def limits_of_recursion(proto_text, functions):
    """{function: how often it can be entered along one way down}"""
    messages = set(re.findall(r"^message (\w+)", proto_text, re.M))
    inner = {m for m in messages if re.search(rf"^\s*\w+ {m} \w+ =", proto_text, re.M)}
    if unknown := messages - inner - {*stated_calls.ENCODED, *stated_calls.DECODED}:
        raise Failure(f"messages stated neither as encoded nor as decoded: {sorted(unknown)}")
    counts = [(name, nesting(proto_text, stated)) for name, stated in stated_calls.DESCENTS]
    return {address: count for name, count in counts + stated_calls.SELF_CALLS
            for address in functions.named(name)}


def call_graph(build, module, map_text):
    """{address: Node} of every function of the module, and Functions. Under the negative address the
    function stands alone: when nothing that it could call is called."""
    code = read_code(module)
    compiled = read_compiler_files(build, module, map_text)
    functions = Functions(module, code)
    nodes, used = {}, {}  # used: {row: its places}
    for address, function in code.items():
        calls = {functions.holding(target) for target in function.targets} - {None, address}
        calls |= {address} & function.returning
        if address in compiled:
            frame, places = compiled[address]
            # Two readers of one function, who must not contradict each other.
            if function.frame < frame or function.indirect != len(places):
                raise Failure(f"{function.name}: the compiler tells of {frame} bytes of stack and "
                              f"{len(places)} indirect calls, its code of {function.frame} and "
                              f"{function.indirect}")
            calls |= stated_in_sources(places, functions, used)
        else:
            frame = function.frame
            for name in stated_in_libraries(function, used):
                alone = name.startswith("alone ")
                calls.update(-callee if alone else callee
                             for callee in functions.named(name.removeprefix("alone ")))
        name = functions.names[address].split("::")[-1]
        nodes[address] = Node(name, frame, calls)
        nodes[-address] = Node(name, frame, set())
    stated = {row[:2] for row in
              stated_calls.INDIRECT_IN_SOURCES + stated_calls.INDIRECT_IN_LIBRARIES}
    if stale := stated - used.keys():
        raise Failure(f"stated indirect calls that the module does not have: {sorted(stale)}")
    for *row, places, _ in stated_calls.INDIRECT_IN_SOURCES:
        if len(used[tuple(row)]) != places:
            raise Failure(f"{row[0]}: {row[1]}: {len(used[tuple(row)])} indirect calls, stated: {places}")
    return nodes, functions


def measure(build, source_root, module, map_text):
    """{entry point: (bytes, [names along the deepest way down])}"""
    nodes, functions = call_graph(build, module, map_text)
    proto = pathlib.Path(source_root, "proto/sound_detection.proto").read_text()
    limits = limits_of_recursion(proto, functions)
    return {entry: deepest(nodes, functions.named(entry)[0], limits)
            for entry in stated_calls.ENTRY_POINTS}
