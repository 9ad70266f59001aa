#!/usr/bin/env python3
"""Gives a header to Doxygen with the comment at its top as the description of the file, its example as code."""

import re
import sys

text = open(sys.argv[1], encoding="utf-8").read()
found = re.match(r"#pragma once\n\n((?://[^\n]*\n)+)", text)
described = ["/// @file"]
for line in found[1].splitlines() if found else []:
    described.append("///" + line[2:])
begin, end = found.span(1) if found else (0, 0)
# As many lines as before, so that Doxygen counts as the header does.
sys.stdout.write(text[:begin].rstrip("\n") + "\n" + "\n".join(described) + "\n" + text[end:] if found else text)
