"""Reads the includes of every room and says which of them do not keep to Docs/architecture.md.

Usage: check_includes.py [FOLDER], the project's folder where it is another than this one's.
"""

import pathlib
import re
import sys

STANDARD_ONLY = ["SharedDependencies", "ZULMetaData", "ZULMetaDataBridge"]
ONE_ROOM_ONLY = {  # headers of others, and the only folder that may know them
    r"png|tiff": "Platform",
    r"Python\.h|pybind11/|numpy/": "Bindings/Python",
    r"emscripten": "Bindings/JavaScript",
}
INCLUDE = re.compile(r'^\s*#\s*include\s*([<"])([^>"]+)[>"]', re.MULTILINE)
SYSTEM = re.compile(r"^\s*#\s*(?:el)?if.*(?:__APPLE__|__linux__|_WIN32|__unix__)", re.MULTILINE)


def floors(root):
    """Which rooms each room may include, by the table of the page."""
    page = (root / "Docs" / "architecture.md").read_text(encoding="utf-8")
    table = page.partition("<!-- floors begin -->")[2].partition("<!-- floors end -->")[0]
    rows = re.findall(r"^\| *(\d+) *\| `(\w+)` \|[^|]*\|([^|]*)\|$", table, re.MULTILINE)
    below = {room: re.findall(r"`(\w+)`", rooms) for _, room, rooms in rows}
    height = {room: int(floor) for floor, room, _ in rows}
    for room, rooms in below.items():
        for lower in rooms:
            # Bindings are made of the reports of the tool, beside which they stand.
            if height[lower] >= height[room] and (room, lower) != ("Bindings", "Tools"):
                sys.exit(f"Docs/architecture.md: {lower} is not below {room}")
    if len(below) < 7:
        sys.exit("Docs/architecture.md: has no table of the floors")
    return below


def installed_headers(root):
    headers = set()
    for room in ("SharedDependencies", "ZULMetaData", "Platform", "ZULMetaDataBridge"):
        text = (root / room / "CMakeLists.txt").read_text(encoding="utf-8")
        headers.update(f"{room}/{name}" for name in re.findall(r"^\s+([\w/]+\.h)\b", text, re.MULTILINE))
    return headers


def complaints_about(root, file, room, below, installed):
    text = file.read_text(encoding="utf-8")
    path = str(file.relative_to(root))
    for kind, name in INCLUDE.findall(text):
        if kind == "<":
            if room in STANDARD_ONLY and not re.fullmatch(r"[a-z_]+", name):
                yield f"<{name}> is not of the C++ standard library"
            for pattern, folder in ONE_ROOM_ONLY.items():
                if re.match(pattern, name) and not path.startswith(folder + "/"):
                    yield f"<{name}> is for {folder} alone"
        elif not (root / name).is_file():
            yield f'"{name}" is no file of this project'
        elif name.split("/")[0] not in [room, *below]:
            yield f'"{name}" is not below {room}'
        elif path in installed and name not in installed:
            yield f'"{name}" is not installed, but this header is'
    if room in STANDARD_ONLY and SYSTEM.search(text):
        yield "it asks which operating system this is; Platform knows"


def circles(included):
    """Headers that include themselves by way of others, each as the way there."""
    done = set()

    def walk(header, way):
        if header in way:
            yield [*way[way.index(header):], header]
            return
        if header in done:
            return
        for name in included.get(header, []):
            yield from walk(name, [*way, header])
        done.add(header)

    for header in included:
        yield from walk(header, [])


def main():
    root = pathlib.Path(sys.argv[1] if len(sys.argv) > 1 else pathlib.Path(__file__).parent.parent)
    below = floors(root)
    installed = installed_headers(root)
    complaints = []
    included = {}
    for room in below:
        for file in sorted((root / room).rglob("*")):
            if file.suffix not in (".h", ".cpp") or "node_modules" in file.parts:
                continue
            path = str(file.relative_to(root))
            names = INCLUDE.findall(file.read_text(encoding="utf-8"))
            included[path] = [name for kind, name in names if kind == '"']
            complaints += [f"{path}: {text}" for text in complaints_about(root, file, room, below[room], installed)]
    complaints += [f"{way[0]}: includes itself by way of {', '.join(way[1:-1])}" for way in circles(included)]
    print(*complaints, sep="\n", end="\n" if complaints else "")
    if not included:
        print(f"{root}: no sources", file=sys.stderr)
    sys.exit(1 if complaints or not included else 0)


main()
