"""Writes w19, the network's logistic function as a table over int8.

Usage: make_logistic_table.py OUTPUT

The table's input has the scale 0.256 and the zero point 82, its output the scale 1/256 and the zero
point -128; the entry of input q stands at q mod 256, the value of q's byte.
"""

import math
import os
import sys

INPUT_SCALE = 0.256
INPUT_ZERO_POINT = 82


def entry(q):
    exact = 256 / (1 + math.exp(-INPUT_SCALE * (q - INPUT_ZERO_POINT)))
    nearest = math.floor(exact + 0.5)
    # So far from a tie that no library's exp can round it the other way.
    assert abs(exact - nearest) < 0.4999, q
    return min(max(nearest - 128, -128), 127)


def main():
    table = [entry(index if index < 128 else index - 256) for index in range(256)]
    lines = [
        "// Made by network/make_logistic_table.py: do not edit.",
        "#pragma once",
        "",
        "#include <cstdint>",
        "",
        "alignas(16) constexpr int8_t w19[256] = {",
    ]
    for start in range(0, 256, 16):
        lines.append("    " + " ".join(f"{value}," for value in table[start:start + 16]))
    lines.append("};")
    os.makedirs(os.path.dirname(sys.argv[1]), exist_ok=True)
    with open(sys.argv[1], "w", encoding="ascii", newline="\n") as output:
        output.write("\n".join(lines) + "\n")


if __name__ == "__main__":
    main()
