# SPDX-License-Identifier: Apache-2.0
"""The budget fails on what grows or cannot be measured, and names it."""

import pathlib
import sys
import unittest

sys.dont_write_bytecode = True
sys.path.insert(0, str(pathlib.Path(__file__).parent))

import module_file
import page
import stack
from module_file import Failure

BYTES, COUNTS, LINKING = "Bytes by component", "Instructions", "Dynamic linking"
TABLES = [page.Table(BYTES, ["Component", "Code"], [["app", 10_000], ["proto", 100]]),
          page.Table(COUNTS, ["What", "Now", "Limit"], [["frame", 1_000, 900]]),
          page.Table(LINKING, ["What", "Number"], [["Imported", 12]])]
COMMITTED = page.read(page.render(TABLES))


class Comparison(unittest.TestCase):
    def faults(self, key, value):
        return list(page.compare(COMMITTED, {**COMMITTED, key: value}))

    def test_growth(self):
        self.assertEqual(len(COMMITTED), 4)
        self.assertEqual(self.faults((BYTES, "app", "Code"), 10_200), [])
        self.assertEqual(self.faults((BYTES, "app", "Code"), 10_300),
                         ["Bytes by component, app, Code: 10,300, committed as 10,000, expected at "
                          "most 10,200"])
        self.assertEqual(self.faults((BYTES, "proto", "Code"), 116), [])
        for key, value in [((BYTES, "proto", "Code"), 117), ((COUNTS, "frame", "Now"), 1_021),
                            ((LINKING, "Imported", "Number"), 13), ((BYTES, "new", "Code"), 1)]:
            self.assertEqual(len(self.faults(key, value)), 1, key)

    def test_missing_measurement(self):
        measured = dict(list(COMMITTED.items())[1:])
        self.assertRegex(list(page.compare(COMMITTED, measured))[0], "app, Code: .*not measured")

    def test_copy_of_the_short_table(self):
        committed = {(page.HEADLINE, "Code", "Now"): 100}
        table = f"{page.BEGIN}\n| Value | Now |\n|---|---|\n%s\n{page.END}"
        for text, faults in [(table % "| Code | 100 |", 0), (table % "| Code | 99 |", 1),
                             (table % "| Core | 100 |", 2), (table % "", 1), (page.BEGIN, 1),
                             ("no copy", 1)]:
            found = list(page.check_copy(text, committed, "README.md"))
            self.assertEqual(len(found), faults, text)


class Stack(unittest.TestCase):
    def test_frames_and_depths(self):
        text = ("a.cc:1:1:void ns::Class::Method(int, std::vector<int>)\t24\t%s\n"
                "a.cc:9:6:uint32_t kernel(size_t)\t200\tstatic\n")
        for kind in ("static", "dynamic,bounded"):
            self.assertEqual(stack.read_frames(text % kind), [(24, "Method"), (200, "kernel")])
        with self.assertRaisesRegex(Failure, "a.cc:1:1:.*frame without a bound"):
            stack.read_frames(text % "dynamic")
        self.assertEqual(stack.read_depths("f: x, y\t8\ng\t0\n"), {"f: x, y": 8, "g": 0})


class Sizes(unittest.TestCase):
    def test_map(self):
        text = ("Linker script and memory map\n\n.text           0x00002900       0x60\n"
                " .text.long\n                0x00002900       0x18 lib/libapp.a(nanoapp.cc.o)\n"
                " *fill*         0x00002918        0x8 \n .text          0x00002920       0x40 %s\n")
        pieces = list(module_file.pieces(text % "lib/libsignal_kernels.a(peak.cc.o)"))
        self.assertEqual([(piece.bytes, piece.component) for piece in pieces],
                         [(0x18, "app"), (8, module_file.FILLING), (0x40, "kernels/signal")])
        with self.assertRaisesRegex(Failure, "libnew.a"):
            list(module_file.pieces(text % "lib/libnew.a(peak.cc.o)"))


if __name__ == "__main__":
    unittest.main()
