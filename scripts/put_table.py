"""Writes the table from standard input between the markers of a page: put_table.py PAGE"""

import pathlib
import sys

BEGIN, END = "<!-- table begins -->", "<!-- table ends -->"

page = pathlib.Path(sys.argv[1])
before, begin, rest = page.read_text(encoding="utf-8").partition(BEGIN)
_, end, after = rest.partition(END)
if not (begin and end):
    sys.exit(f"{page}: has no markers for a table")
page.write_text(f"{before}{BEGIN}\n{sys.stdin.read().strip()}\n{END}{after}", encoding="utf-8")
