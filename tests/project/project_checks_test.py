#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Planted faults that the checks of the tree must find."""

import pathlib
import subprocess
import tempfile
import unittest

SCRIPTS = pathlib.Path(__file__).resolve().parents[2] / "scripts"
PAGE = """# Page

## Dependencies between components

| Component | Responsibility | May include |
|---|---|---|
| `low/`, `other/` | x | nothing |
| `platform/` | x | nothing |
| `high/` | x | `low/`, `platform/` |

## Next
| `ghost/` | is in another section | nothing |
"""


class Dependencies(unittest.TestCase):
    def check(self, page, files):
        with tempfile.TemporaryDirectory() as folder:
            root = pathlib.Path(folder)
            (root / "ARCHITECTURE.md").write_text(page)
            # Above the check's minimum of files and includes.
            many = {f"low/{i}.cc": '#include "low/a.h"\n' * 3 for i in range(100)}
            for name, content in {**many, "low/a.h": "", "other/a.h": "", "platform/chre.h": "", **files}.items():
                (root / name).parent.mkdir(parents=True, exist_ok=True)
                (root / name).write_text(content)
            (root / "high").mkdir(exist_ok=True)
            done = subprocess.run([SCRIPTS / "check-dependencies.py", "--root", root], text=True,
                                  stdout=subprocess.PIPE, stderr=subprocess.PIPE)
        return done.returncode, done.stderr

    def test_planted_faults(self):
        self.assertEqual(self.check(PAGE, {"high/b.cc": '#include "low/a.h"\n  # include "chre.h"\n'}), (0, ""))
        for name, include, message in (("low/b.cc", "high/b.h", "low/b.cc:1: low/ may not include high/b.h"),
                                       ("low/b.h", "other/a.h", "may not include other/a.h"),
                                       ("high/b.cc", "other/a.h", "may not include other/a.h"),
                                       ("high/b.cc", "a.h", "a.h is no file"),
                                       ("strange/b.cc", "low/a.h", "has no row")):
            code, errors = self.check(PAGE, {"high/b.h": "", name: f'#include "{include}"\n'})
            self.assertEqual((code, message in errors), (1, True), errors)

    def test_faulty_tables(self):
        for old, new, message in (("`low/`, `platform/`", "`ghost/`", "no row above it"),
                                  ("`low/`, `platform/`", "all", "expected `folder/`"),
                                  ("| `low/`, `other/`", "| `ghost/`, `low/`, `other/`", "no such folder"),
                                  ("## Dependencies between", "## Between", "has no section")):
            code, errors = self.check(PAGE.replace(old, new), {})
            self.assertEqual((code, message in errors), (1, True), errors)

    def test_an_empty_tree_is_a_fault(self):
        with tempfile.TemporaryDirectory() as folder:
            (pathlib.Path(folder) / "ARCHITECTURE.md").write_text(PAGE)
            done = subprocess.run([SCRIPTS / "check-dependencies.py", "--root", folder], stderr=subprocess.DEVNULL)
        self.assertEqual(done.returncode, 1)


if __name__ == "__main__":
    unittest.main()
