#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""vector_symbols_test.py NM KERNEL_TABLE ARCHIVE...: what libraries for larger instruction sets define.

A function that several files share may be defined in each; the linker keeps any one of them. If that is the one
compiled for AVX2, a processor without it stops at an illegal instruction. So these libraries may define kernels under
their own names, NAME__SET, and nothing else that another file can see.
"""

import pathlib
import re
import subprocess
import sys


def faults(nm, kernels, archive):
    instruction_set = re.search(r"kernels_(\w+)\.a$", archive).group(1)
    lines = subprocess.run([nm, "--defined-only", "--extern-only", "--format=posix", archive], check=True, text=True,
                           stdout=subprocess.PIPE).stdout.splitlines()
    symbols = [line.split()[0] for line in lines if line and not line.endswith(":")]
    allowed = {f"{kernel}__{instruction_set}" for kernel in kernels}
    if not allowed & set(symbols):
        yield f"{archive}: defines no kernel"
    for symbol in sorted(set(symbols) - allowed):
        yield f"{archive}: defines {symbol}, which others could be linked to"


def main():
    nm, kernel_table, *archives = sys.argv[1:]
    kernels = re.findall(r"^ROW\(.* (orra_\w+)\)", pathlib.Path(kernel_table).read_text(), re.MULTILINE)
    found = [fault for archive in archives for fault in faults(nm, kernels, archive)]
    print("\n".join(found) or f"{len(archives)} libraries define kernels only")
    sys.exit(1 if found or not archives or not kernels else 0)


main()
