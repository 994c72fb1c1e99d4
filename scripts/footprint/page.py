"""The page of committed figures: written here, read back here, compared here."""

import re

# Of figures in bytes: growth that is not worth a word, say by another alignment.
SLACK_BYTES = 16
GROWTH_PERCENT = 2

HEADLINE = "In short"

INTRODUCTION = """# Footprint

What the module takes of the device: bytes, stack and instructions, of the build for the hub's own
processor. `make footprint` measures all of it anew and fails when a figure is more than 2 % (and,
of bytes, more than 16) above the one that stands here; `make footprint UPDATE=1` rewrites this page,
which scripts/footprint made, and the copy of its first table in the README. Instructions are counted
under emulation, the same on every machine.
"""


class Table:
    """Rows of cells under column heads. Whole numbers in the cells are figures, but for those in a
    column of limits."""

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
    """{(table, row, column): figure} of a page."""
    figures, title, columns = {}, "", None
    for line in text.splitlines():
        if line.startswith("## "):
            title, columns = line[3:], None
        if not line.startswith("|"):
            continue
        cells = [cell.strip() for cell in line.strip("|").split("|")]
        if columns is None:
            columns = cells
        for column, cell in zip(columns[1:], cells[1:]):
            if column != "At most" and re.fullmatch(r"[\d,]+", cell):
                figures[title, cells[0], column] = int(cell.replace(",", ""))
    return figures


def allowed(key, committed):
    """The most that a figure may be without its page changing."""
    table, row, column = key
    if column == "Number":
        return committed
    slack = 0 if "nstructions" in table + row + column or "clock" in row.lower() else SLACK_BYTES
    return max(committed + committed * GROWTH_PERCENT // 100, committed + slack)


def compare(committed, measured):
    """What is wrong with the measured figures, one sentence each."""
    for key in sorted(committed.keys() | measured.keys()):
        name = ", ".join(part for part in key if part)
        if key not in measured:
            yield f"{name}: committed as {committed[key]:,}, not measured"
        elif key not in committed:
            yield f"{name}: measured as {measured[key]:,}, not on the page"
        elif measured[key] > allowed(key, committed[key]):
            yield (f"{name}: {measured[key]:,}, committed as {committed[key]:,}, should be at most "
                   f"{allowed(key, committed[key]):,}")


BEGIN, END = "<!-- footprint -->", "<!-- end of footprint -->"


def renew_copy(text, table):
    """Another page with the short table as it is now between its two marks, if it has them."""
    before, begin, rest = text.partition(BEGIN)
    _, end, after = rest.partition(END)
    return before + "\n".join([begin, *table.lines(), end]) + after if end else text


def check_copy(text, committed, name):
    """What is wrong with the copy of the short table between the two marks of another page."""
    inside = text.partition(BEGIN)[2].partition(END)
    if not inside[1]:
        yield f"{name}: '{BEGIN}' and '{END}' should stand around the table, in this order"
        return
    copied = read(f"## {HEADLINE}\n{inside[0]}")
    headline = {key: figure for key, figure in committed.items() if key[0] == HEADLINE}
    for key in sorted(copied.keys() | headline.keys()):
        if copied.get(key) != headline.get(key):
            yield f"{name}: {key[1]}: {copied.get(key)}, should be as committed: {headline.get(key)}"
