# SPDX-License-Identifier: Apache-2.0
"""The page of committed values: written, read back and compared here."""

import re

# Growth in bytes that is not worth reporting, for example of alignment.
SLACK_BYTES = 16
GROWTH_PERCENT = 2

HEADLINE = "In short"

INTRODUCTION = """# Footprint

What the module uses on the device: bytes, stack and instructions, of the build for the hub's processor.
`make footprint` measures all of it and fails when a value is more than 2 % (and, of bytes, more than 16)
above the one on this page. `make footprint UPDATE=1` rewrites this page, which scripts/footprint generates,
and the copy of its first table in the README. Instructions are counted under emulation; the count is the same
on every machine.
"""


class Table:
    """Rows of cells under column heads. Whole numbers in the cells are values to compare, except those
    in the column of limits."""

    def __init__(self, title, columns, rows, note=""):
        self.title, self.columns, self.rows, self.note = title, columns, rows, note

    def lines(self):
        yield "| " + " | ".join(self.columns) + " |"
        yield "|---" + "|---" * (len(self.columns) - 1) + "|"
        for row in self.rows:
            yield "| " + " | ".join(f"{c:,}" if isinstance(c, int) else c for c in row) + " |"


def render(tables):
    parts = [INTRODUCTION]
    for table in tables:
        parts.append("\n".join([f"## {table.title}", ""] + ([table.note, ""] if table.note else [])
                               + list(table.lines()) + [""]))
    return "\n".join(parts)


def read(text):
    """{(table, row, column): value} of a page."""
    values, title, columns = {}, "", None
    for line in text.splitlines():
        if line.startswith("## "):
            title, columns = line[3:], None
        if not line.startswith("|"):
            continue
        cells = [cell.strip() for cell in line.strip("|").split("|")]
        if columns is None:
            columns = cells
        for column, cell in zip(columns[1:], cells[1:]):
            if column != "Limit" and re.fullmatch(r"[\d,]+", cell):
                values[title, cells[0], column] = int(cell.replace(",", ""))
    return values


def allowed(key, committed):
    """The largest value that needs no change of the page."""
    table, row, column = key
    if column == "Number":
        return committed
    slack = 0 if "nstructions" in table + row + column or "clock" in row.lower() else SLACK_BYTES
    return max(committed + committed * GROWTH_PERCENT // 100, committed + slack)


def compare(committed, measured):
    """One error message for each value that grew, is missing or is new."""
    for key in sorted(committed.keys() | measured.keys()):
        name = ", ".join(part for part in key if part)
        if key not in measured:
            yield f"{name}: committed as {committed[key]:,}, not measured"
        elif key not in committed:
            yield f"{name}: measured as {measured[key]:,}, not on the page"
        elif measured[key] > allowed(key, committed[key]):
            yield (f"{name}: {measured[key]:,}, committed as {committed[key]:,}, expected at most "
                   f"{allowed(key, committed[key]):,}")


BEGIN, END = "<!-- footprint -->", "<!-- end of footprint -->"


def renew_copy(text, table):
    """Another page with the short table as it is now between its two marks, if it has them."""
    before, begin, rest = text.partition(BEGIN)
    _, end, after = rest.partition(END)
    return before + "\n".join([begin, *table.lines(), end]) + after if end else text


def check_copy(text, committed, name):
    """Error messages about the copy of the short table between the two marks of another page."""
    inside = text.partition(BEGIN)[2].partition(END)
    if not inside[1]:
        yield f"{name}: '{BEGIN}' and '{END}' are expected around the table, in this order"
        return
    copied = read(f"## {HEADLINE}\n{inside[0]}")
    headline = {key: value for key, value in committed.items() if key[0] == HEADLINE}
    for key in sorted(copied.keys() | headline.keys()):
        if copied.get(key) != headline.get(key):
            yield f"{name}: {key[1]}: {copied.get(key)}, expected as committed: {headline.get(key)}"
