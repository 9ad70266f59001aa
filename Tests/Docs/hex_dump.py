"""Prints a recording byte by byte, and what the bytes mean: hex_dump.py MOVIE

Knows the format from Docs/format.md alone, and does not use the library. Shows only the first two entries of a stream.
"""

import pathlib
import struct
import sys

SHOWN_ENTRIES = 2
KINDS = {  # first four bytes of the identifier: name, and the layout of a value of fixed size
    "2b7b6af2": ("cursorLocation", "ii"),
    "2b7b6af8": ("slideTitles", None),
    "2b7b6af1": ("cursorImage", None),
    "2b7b6af5": ("keyboardAction", "II"),
}


class Dump:
    def __init__(self, data):
        self.data = data
        self.position = 0

    def take(self, size, meaning, limit=16):
        """Prints `size` bytes in lines of eight, at most `limit` of them, and returns all of them."""
        taken = self.data[self.position:self.position + size]
        if len(taken) < size:
            sys.exit(f"the file ends at {len(self.data)}, inside {meaning}")
        shown = taken[:limit]
        for start in range(0, len(shown), 8):
            self.line(self.position + start, shown[start:start + 8].hex(" "), meaning if start == 0 else "")
        if size > limit:
            self.line("", f"… {size - limit} more", "")
        self.position += size
        return taken

    @staticmethod
    def line(offset, octets, meaning):
        print(f"{offset:>6}  {octets:<23}  {meaning}".rstrip())

    def number(self, form, meaning):
        size = struct.calcsize(form)
        (value,) = struct.unpack_from(form, self.data, self.position)
        self.take(size, meaning.format(value))
        return value

    def atom(self, indent=""):
        """Prints the header of an atom, and returns its type and where the atom ends."""
        start = self.position
        size = self.number(">I", f"{indent}size of the atom, " + "{}")
        kind = self.take(4, f"{indent}type, {self.data[start + 4:start + 8].decode()}").decode()
        if size == 1:
            size = self.number(">Q", f"{indent}size in 64 bits, " + "{}")
        return kind, start + size

    def entry(self, kind, layout, number):
        start = self.position
        if layout:
            self.number("<d", f"    entry {number}: time, {{}} s")
            for name in ("x", "y") if layout == "ii" else ("character code", "modifier flags"):
                self.number("<" + layout[0], f"      {name}, {{}}")
        else:
            size = self.number("<I", f"    entry {number}: {{}} bytes follow")
            self.number("<d", "      time, {} s")
            if kind == "slideTitles":
                text = self.data[self.position:start + 4 + size].decode()
                self.take(size - 8, f'      text, "{text}"')
            else:
                self.image()
        print()

    def image(self):
        self.number("<Q", "      identifier of the image, {}")
        self.number("<I", "      {} bytes of data follow")
        size = self.number("<I", "      size of the image, {}")
        if size:
            self.number("<i", "      hot spot, x, {}")
            self.number("<i", "      hot spot, y, {}")
            self.take(size, "      the image, PNG")
            self.number("<i", "      which cursor, {}")
        self.number("<I", "      flags, {}")

    def stream(self, end):
        identifier = self.data[self.position:self.position + 4].hex()
        kind, layout = KINDS[identifier]
        self.take(16, f"    kind, {kind}")
        self.number("<i", "    version, {}")
        self.number("<I", "    size of every entry, {}" if layout else "    size of every entry, {}: each has its own")
        print()
        number = 0
        while self.position < end:
            number += 1
            if number <= SHOWN_ENTRIES:
                self.entry(kind, layout, number)
            elif layout:
                left = (end - self.position) // (8 + struct.calcsize("<" + layout))
                number += left - 1
                self.position = end
            else:
                (size,) = struct.unpack_from("<I", self.data, self.position)
                self.position += 4 + size
        if number > SHOWN_ENTRIES:
            more = number - SHOWN_ENTRIES
            self.line("", f"… {more} more {'entry' if more == 1 else 'entries'}", "")
            print()

    def movie(self):
        while self.position < len(self.data):
            kind, end = self.atom()
            if kind != "ZULM":
                self.take(end - self.position, "  what is in it")
                print()
                continue
            print()
            while self.position < end:
                _, child_end = self.atom("  ")
                self.stream(child_end)


Dump(pathlib.Path(sys.argv[1]).read_bytes()).movie()
