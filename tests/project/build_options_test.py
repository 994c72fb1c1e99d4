#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Builds with every option of CMake that a user may set, inside another project.

Usage: build_options_test.py SOURCE BUILD      BUILD: a build with the defaults, which the other must equal
"""

import pathlib
import random
import shutil
import struct
import subprocess
import sys
import tempfile
import unittest
import wave

SOURCE, BUILD = (pathlib.Path(argument).resolve() for argument in sys.argv[1:3])


def run(*command):
    done = subprocess.run([str(word) for word in command], text=True, stdout=subprocess.PIPE, stderr=subprocess.STDOUT)
    return done.returncode, done.stdout


def configure(folder, source, *options):
    # Debug information and optimisation change nothing here but the time that it takes.
    return run("cmake", "-G", "Ninja", "-S", source, "-B", folder, "-DCMAKE_BUILD_TYPE=None", "-DCMAKE_CXX_FLAGS=-O1",
               "-DBUILD_TESTING=OFF", *options)


class BuildOptions(unittest.TestCase):
    def setUp(self):
        folder = tempfile.TemporaryDirectory()
        self.addCleanup(folder.cleanup)
        self.folder = pathlib.Path(folder.name)

    def test_invalid_values_are_refused(self):
        for option, expected in (("QZ_KERNELS=nosuch", "expected plain, x86_64"),
                                 ("QZ_NETWORK=nosuch", "expected window or stream"),
                                 ("QZ_WEIGHTS=/nosuch.bin", "which does not exist")):
            code, output = configure(self.folder / "refused", SOURCE, "-D" + option)
            self.assertEqual((code, expected in " ".join(output.split())), (1, True), output)
            shutil.rmtree(self.folder / "refused")

    def test_files_of_the_users_own_in_a_project_of_the_users_own(self):
        own = self.folder / "own"
        shutil.copytree(SOURCE / "platform", own / "platform")
        for option, name in (("weights.bin", "model/demonstration.bin"), ("labels.tsv", "model/labels.tsv"),
                             ("detection_tables.cc", "classifier/detection_tables.cc")):
            shutil.copy(SOURCE / name, own / option)
        build = self.folder / "build"
        code, output = configure(build, SOURCE / "tests/project/consumer", f"-DQZ_SOURCE={SOURCE}",
                                 f"-DQZ_PLATFORM_DIR={own}/platform", f"-DQZ_WEIGHTS={own}/weights.bin",
                                 f"-DQZ_LABELS={own}/labels.tsv", f"-DQZ_DETECTION_TABLES={own}/detection_tables.cc",
                                 "-DQZ_KERNELS=plain", "-DQZ_NETWORK=stream")
        self.assertEqual(code, 0, output)
        code, output = run("cmake", "--build", build, "--target", "consumer", "qz_module", "qz_trace")
        self.assertEqual(code, 0, output[-3000:])
        self.assertEqual(run(build / "consumer"), (0, "0\n"))

        # What was named is what was compiled.
        code, output = run("ninja", "-C", build, "-t", "commands", "qz_module", "qz_trace")
        for name in ("platform", "detection_tables.cc"):
            self.assertIn(str(own / name), output)
        self.assertNotIn(str(SOURCE / "platform") + " ", output)

        noise = random.Random(1)
        with wave.open(str(self.folder / "noise.wav"), "wb") as recording:
            recording.setparams((1, 2, 16000, 0, "NONE", ""))
            recording.writeframes(b"".join(struct.pack("<h", noise.randint(-9000, 9000)) for _ in range(8 * 16000)))
        code, output = run(BUILD / "bin/qz", "prove", self.folder / "noise.wav", BUILD, build / "qz")
        self.assertEqual(code, 0, output)


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1])
