"""Reads the includes of every room and says which of them do not keep to its floor.

Usage: check_includes.py [FOLDER], the project's folder where it is another than this one's.
"""

import pathlib
import re
import sys

BELOW = {
    "SharedDependencies": [],
    "ZULMetaData": ["SharedDependencies"],
    "Platform": ["SharedDependencies"],
    "ZULMetaDataBridge": ["SharedDependencies", "ZULMetaData", "Platform"],
    "Bindings": ["SharedDependencies", "ZULMetaData", "Platform", "ZULMetaDataBridge", "Tools"],
    "Tools": ["SharedDependencies", "ZULMetaData", "Platform", "ZULMetaDataBridge"],
}
STANDARD_ONLY = ["SharedDependencies", "ZULMetaData", "ZULMetaDataBridge"]
INCLUDE = re.compile(r'^\s*#\s*include\s*([<"])([^>"]+)[>"]', re.MULTILINE)
SYSTEM = re.compile(r"^\s*#\s*(?:el)?if.*(?:__APPLE__|__linux__|_WIN32|__unix__)", re.MULTILINE)


def complaints_about(root, file, room):
    text = file.read_text(encoding="utf-8")
    for kind, name in INCLUDE.findall(text):
        if kind == "<":
            if room in STANDARD_ONLY and not re.fullmatch(r"[a-z_]+", name):
                yield f"<{name}> is not of the C++ standard library"
        elif not (root / name).is_file():
            yield f'"{name}" is no file of this project'
        elif name.split("/")[0] not in [room, *BELOW[room]]:
            yield f'"{name}" is not below {room}'
    if room in STANDARD_ONLY and SYSTEM.search(text):
        yield "it asks which operating system this is; Platform knows"


def main():
    root = pathlib.Path(sys.argv[1] if len(sys.argv) > 1 else pathlib.Path(__file__).parent.parent)
    found = 0
    files = 0
    for room in BELOW:
        for file in sorted((root / room).rglob("*")):
            if file.suffix not in (".h", ".cpp") or "node_modules" in file.parts:
                continue
            files += 1
            for complaint in complaints_about(root, file, room):
                print(f"{file.relative_to(root)}: {complaint}")
                found += 1
    if files == 0:
        print(f"{root}: no sources", file=sys.stderr)
    sys.exit(1 if found or files == 0 else 0)


main()
