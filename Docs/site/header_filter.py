#!/usr/bin/env python3
"""Gives a header to Doxygen with the comment at its top as the description of the file, its example as code.

Where a header lists kinds, what it says of a member of the first one is said of that member of all the others. Words
behind a member begin with a capital, as they stand among sentences there.
"""

import re
import sys

TOP = re.compile(r"#pragma once\n\n((?://[^\n]*\n)+)")
BEHIND_MEMBER = re.compile(r"(\S.* ///< )([a-z])")
OF_KIND = re.compile(r"^( +)((?:using|static constexpr [\w:]+) (\w+) ?[={][^\n]*?)(?: +///< ([^\n]*))?$", re.MULTILINE)


def with_description(text):
    """As many lines as before, so that Doxygen counts as the header does."""
    found = TOP.match(text)
    if not found:
        return text
    described = "".join(f"///{line[2:]}\n" for line in found[1].splitlines())
    return text[: found.start(1)].rstrip("\n") + f"\n/// @file\n{described}" + text[found.end() :]


def with_families(text):
    said = {name: words for _, _, name, words in reversed(OF_KIND.findall(text)) if words}

    def documented(member):
        indent, code, name, words = member.groups()
        return f"{indent}/** {words or said[name]} */ {code}" if name in said else member[0]

    return OF_KIND.sub(documented, text)


text = with_description(open(sys.argv[1], encoding="utf-8").read())
text = BEHIND_MEMBER.sub(lambda found: found[1] + found[2].upper(), text)
if sys.argv[1].endswith("/MetaDataKinds.h"):
    text = with_families(text)
sys.stdout.write(text)
