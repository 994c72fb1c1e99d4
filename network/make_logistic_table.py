# SPDX-License-Identifier: Apache-2.0
"""Writes w19, the network's logistic function as a table over int8.

Usage: make_logistic_table.py DESCRIPTION OUTPUT

DESCRIPTION is the JSON of `qz-model-tool describe`, which has the scale and the zero point of the table's
input. Its output has the scale 1/256 and the zero point -128; the entry of input q has the index q mod 256,
the value of q's byte.
"""

import json
import math
import os
import sys


def entry(q, scale, zero_point):
    exact = 256 / (1 + math.exp(-scale * (q - zero_point)))
    nearest = math.floor(exact + 0.5)
    # So far from a tie that no library's exp can round it the other way.
    assert abs(exact - nearest) < 0.4999, q
    return min(max(nearest - 128, -128), 127)


def main():
    with open(sys.argv[1], encoding="ascii") as description:
        operators = json.load(description)["operators"]
    index = [operator["kind"] for operator in operators].index("logistic")
    scale, zero_point = operators[index]["scale"], operators[index - 1]["zero_point"]
    table = [entry(q, scale, zero_point) for q in (*range(128), *range(-128, 0))]
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
    os.makedirs(os.path.dirname(sys.argv[2]), exist_ok=True)
    with open(sys.argv[2], "w", encoding="ascii", newline="\n") as output:
        output.write("\n".join(lines) + "\n")


if __name__ == "__main__":
    main()
