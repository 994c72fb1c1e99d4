"""Holds the ledger to what it is for: what grows, or cannot be measured, fails with its name."""

import pathlib
import sys
import tempfile
import unittest

sys.dont_write_bytecode = True
sys.path.insert(0, str(pathlib.Path(__file__).parent))

import call_graph
import module_file
import page
import stack
from call_graph import Node
from module_file import Failure

BYTES, COUNTS, LINKING = "Bytes by room", "Instructions", "Dynamic linking"
TABLES = [page.Table(BYTES, ["Room", "Code"], [["app", 10_000], ["proto", 100]]),
          page.Table(COUNTS, ["What", "Now", "At most"], [["frame", 1_000, 900]]),
          page.Table(LINKING, ["What", "Number"], [["Imported", 12]])]
COMMITTED = page.read(page.render(TABLES))


class Comparison(unittest.TestCase):
    def faults(self, key, figure):
        return list(page.compare(COMMITTED, {**COMMITTED, key: figure}))

    def test_growth(self):
        self.assertEqual(len(COMMITTED), 4)
        self.assertEqual(self.faults((BYTES, "app", "Code"), 10_200), [])
        self.assertEqual(self.faults((BYTES, "app", "Code"), 10_300),
                         ["Bytes by room, app, Code: 10,300, committed as 10,000, should be at "
                          "most 10,200"])
        self.assertEqual(self.faults((BYTES, "proto", "Code"), 116), [])
        for key, figure in [((BYTES, "proto", "Code"), 117), ((COUNTS, "frame", "Now"), 1_021),
                            ((LINKING, "Imported", "Number"), 13), ((BYTES, "new", "Code"), 1)]:
            self.assertEqual(len(self.faults(key, figure)), 1, key)

    def test_missing_measurement(self):
        measured = dict(list(COMMITTED.items())[1:])
        self.assertRegex(list(page.compare(COMMITTED, measured))[0], "app, Code: .*not measured")

    def test_copy_of_the_short_table(self):
        committed = {(page.HEADLINE, "Code", "Now"): 100}
        table = f"{page.BEGIN}\n| Figure | Now |\n|---|---|\n%s\n{page.END}"
        for text, faults in [(table % "| Code | 100 |", 0), (table % "| Code | 99 |", 1),
                             (table % "| Core | 100 |", 2), (table % "", 1), (page.BEGIN, 1),
                             ("no copy", 1)]:
            found = list(page.check_copy(text, committed, "README.md"))
            self.assertEqual(len(found), faults, text)


class Stack(unittest.TestCase):
    def test_machine_code(self):
        code = call_graph.Code("function")
        for line in ["push\t{r4, r5, r6, lr}", "vpush\t{d8-d11}", "sub.w\tsp, sp, #1024\t@ 0x400",
                     "stmdb\tsp!, {r4, r5, fp, lr}", "str.w\tlr, [sp, #-8]!", "blx\tr3",
                     "bl\t2b0 <f>", "bls.n\t2b2 <f+0x2>", "bic.w\tr3, r1, #7", "bx\tlr",
                     "ldr.w\tpc, [sp], #4", "mov\tpc, r3"]:
            code.read(line)
        self.assertEqual((code.frame, code.indirect), (16 + 32 + 1024 + 16 + 8, 2))
        self.assertEqual((code.targets, code.returning), ({0x2b0, 0x2b2}, {0x2b0}))
        with self.assertRaisesRegex(Failure, "function: frame without a bound"):
            code.read("sub.w\tsp, sp, r3")

    def test_compilers_file(self):
        text = ('node: { title: "a.cc:f" label: "f()\\na.cc:1:1\\n24 bytes (%s)" }\n'
                'edge: { sourcename: "a.cc:f" targetname: "__indirect_call" label: "a.cc:2:3" }\n')
        self.assertEqual(call_graph.read_compiler_file(text % "static"), {"f": (24, ["a.cc:2:3"])})
        with self.assertRaisesRegex(Failure, "f: frame without a bound"):
            call_graph.read_compiler_file(text % "dynamic")

    def test_deepest_way(self):
        nodes = {1: Node("a", 10, {2, 3}), 2: Node("b", 20, set()), 3: Node("c", 5, {4}),
                 4: Node("d", 16, set())}
        self.assertEqual(call_graph.deepest(nodes, 1, {}), (31, ["a", "c", "d"]))
        nodes[4] = Node("d", 16, {3})
        with self.assertRaisesRegex(Failure, "recursion without a bound: c -> d -> c"):
            call_graph.deepest(nodes, 1, {})
        self.assertEqual(call_graph.deepest(nodes, 1, {4: 2}), (57, list("acdcdc")))

    def test_unstated_calls(self):
        function = call_graph.Code("unheard_of")
        function.indirect = 1
        with self.assertRaisesRegex(Failure, "unheard_of: 1 indirect calls"):
            stack.stated_in_libraries(function, {})
        with tempfile.TemporaryDirectory() as folder:
            source = pathlib.Path(folder, "new.cc")
            source.write_text("\n  handler(event);\n")
            with self.assertRaisesRegex(Failure, r"new.cc:2: .*handler\(event\)"):
                stack.stated_in_sources([f"{source}:2:3"], None, {})

    def test_depth_of_messages(self):
        proto = "message A {\n  repeated B b = 1;\n}\nmessage B {\n  optional %s x = 1;\n}\n"
        self.assertEqual(stack.nesting(proto % "uint32", ["A", "B"]), 2)
        with self.assertRaisesRegex(Failure, "A can stand within itself"):
            stack.nesting(proto % "A", ["A"])


class Sizes(unittest.TestCase):
    def test_map(self):
        text = ("Linker script and memory map\n\n.text           0x00002900       0x60\n"
                " .text.long\n                0x00002900       0x18 lib/libapp.a(nanoapp.cc.o)\n"
                " *fill*         0x00002918        0x8 \n .text          0x00002920       0x40 %s\n")
        pieces = list(module_file.pieces(text % "lib/libsignal_kernels.a(peak.cc.o)"))
        self.assertEqual([(piece.bytes, piece.room) for piece in pieces],
                         [(0x18, "app"), (8, module_file.FILLING), (0x40, "kernels/signal")])
        with self.assertRaisesRegex(Failure, "libnew.a"):
            list(module_file.pieces(text % "lib/libnew.a(peak.cc.o)"))


if __name__ == "__main__":
    unittest.main()
