# SPDX-License-Identifier: Apache-2.0
"""The picture of docs/performance.md: which part of the processor's limit each kernel reaches, and where a pass goes."""

from xml.sax.saxutils import escape

WIDTH, LEFT, BAR, ROW = 900, 215, 440, 22
COLOURS = ["#4269d0", "#efb118", "#ff725c", "#6cc5b0", "#3ca951", "#ff8ab7", "#a463f2", "#97bbf5", "#9c6b4e"]


class Drawing:
    def __init__(self):
        self.parts, self.y = [], 24

    def text(self, x, y, words, anchor="start", weight="normal"):
        self.parts.append(f'<text x="{x:.1f}" y="{y:.1f}" text-anchor="{anchor}" font-weight="{weight}">'
                          f'{escape(words)}</text>')

    def rect(self, x, y, width, height, colour):
        self.parts.append(f'<rect x="{x:.1f}" y="{y:.1f}" width="{max(width, 0.5):.1f}" height="{height}" '
                          f'fill="{colour}"/>')

    def heading(self, words):
        self.text(16, self.y, words, weight="bold")
        self.y += 14

    def limit_bars(self, rows):
        """rows: (name, part of the limit, note). A line marks the limit."""
        top = self.y
        for name, part, note in rows:
            self.text(LEFT - 8, self.y + 15, name, anchor="end")
            self.rect(LEFT, self.y + 4, BAR, 14, "#eeeeee")
            self.rect(LEFT, self.y + 4, BAR * min(part, 1), 14, COLOURS[0])
            self.text(LEFT + BAR + 8, self.y + 15, f"{part:.0%}: {note}")
            self.y += ROW
        self.parts.append(f'<line x1="{LEFT + BAR}" x2="{LEFT + BAR}" y1="{top}" y2="{self.y}" '
                          'stroke="#333333" stroke-width="1.5"/>')
        self.y += 26

    def stack(self, rows):
        """rows: (name, microseconds), side by side in one bar, largest named."""
        total, x = sum(time for _, time in rows), 16
        whole = WIDTH - 32
        for i, (name, time) in enumerate(rows):
            colour = COLOURS[i % len(COLOURS)]
            self.rect(x, self.y, whole * time / total, 26, colour)
            x += whole * time / total
            column, line = i % 3, i // 3
            self.rect(16 + column * 290, self.y + 40 + line * 20, 12, 12, colour)
            self.text(34 + column * 290, self.y + 50 + line * 20, f"{name}: {time:.1f} µs, {time / total:.0%}")
        self.y += 40 + (len(rows) + 2) // 3 * 20 + 16

    def svg(self):
        return (f'<svg xmlns="http://www.w3.org/2000/svg" width="{WIDTH}" height="{self.y}" '
                f'viewBox="0 0 {WIDTH} {self.y}" font-family="sans-serif" font-size="13" fill="#222222">'
                f'<rect width="{WIDTH}" height="{self.y}" fill="white"/>' + "\n".join(self.parts) + "</svg>\n")
