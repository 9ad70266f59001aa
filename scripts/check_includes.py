"""Reads the includes of every source file and reports those that Docs/architecture.md does not allow.

Usage: check_includes.py [FOLDER]; FOLDER is the project's folder, by default the one that this script belongs to.
"""

import os
import pathlib
import re
import sys

STANDARD_ONLY = ["SharedDependencies", "ZULMetaData", "ZULMetaDataBridge", "ZULMetaDataSession"]
ONE_FOLDER_ONLY = {  # headers of other libraries, and the only folder that may include them
    r"png|tiff": "Platform",
    r"Python\.h|pybind11/|numpy/": "Bindings/Python",
    r"emscripten": "Bindings/JavaScript",
}
INCLUDE = re.compile(r'^\s*#\s*include\s*([<"])([^>"]+)[>"]', re.MULTILINE)
SYSTEM = re.compile(r"^\s*#\s*(?:el)?if.*(?:__APPLE__|__linux__|_WIN32|__unix__)", re.MULTILINE)


def layers(root):
    """Returns which folders each folder may include, as the table of the page says."""
    page = (root / "Docs" / "architecture.md").read_text(encoding="utf-8")
    table = page.partition("<!-- layers begin -->")[2].partition("<!-- layers end -->")[0]
    rows = re.findall(r"^\| *(\d+) *\| `(\w+)` \|[^|]*\|([^|]*)\|$", table, re.MULTILINE)
    below = {folder: re.findall(r"`(\w+)`", folders) for _, folder, folders in rows}
    height = {folder: int(layer) for layer, folder, _ in rows}
    for folder, folders in below.items():
        for lower in folders:
            if height[lower] >= height[folder]:
                sys.exit(f"Docs/architecture.md: {lower} is not below {folder}")
    if len(below) < 7:
        sys.exit("Docs/architecture.md: has no table of the layers")
    return below


def installed_headers(root):
    headers = set()
    for folder in ("SharedDependencies", "ZULMetaData", "Platform", "ZULMetaDataBridge", "ZULMetaDataSession"):
        text = (root / folder / "CMakeLists.txt").read_text(encoding="utf-8")
        headers.update(f"{folder}/{name}" for name in re.findall(r"^\s+([\w/]+\.h)\b", text, re.MULTILINE))
    return headers


def quoted_file(root, file, name, installed):
    """Returns the file of this project that an include in quotes names, or None.

    Installed headers name each other by relative paths. A compiler looks next to the including file first, so an
    application's own folder `Platform` is never searched for them. Other files use paths from the project's folder.
    """
    is_installed = str(file.relative_to(root)) in installed
    found = pathlib.Path(os.path.normpath((file.parent if is_installed else root) / name))
    return str(found.relative_to(root)) if found.is_file() and found.is_relative_to(root) else None


def complaints_about(root, file, folder, below, installed):
    text = file.read_text(encoding="utf-8")
    path = str(file.relative_to(root))
    for kind, name in INCLUDE.findall(text):
        if kind == "<":
            if folder in STANDARD_ONLY and not re.fullmatch(r"[a-z_]+", name):
                yield f"<{name}> is not a header of the C++ standard library"
            for pattern, user in ONE_FOLDER_ONLY.items():
                if re.match(pattern, name) and not path.startswith(user + "/"):
                    yield f"<{name}> may be included in {user} only"
            continue
        included = quoted_file(root, file, name, installed)
        if included is None and path in installed:
            yield f'"{name}" is not a path from this installed header to another header of this project'
        elif included is None:
            yield f'"{name}" is not a file of this project'
        elif included.split("/")[0] not in [folder, *below]:
            yield f'"{name}" is not below {folder}'
        elif path in installed and included not in installed:
            yield f'"{name}" is not installed, but this header is'
    if folder in STANDARD_ONLY and SYSTEM.search(text):
        yield "it has a condition on the operating system; move that to Platform"


def circles(included):
    """Finds headers that include themselves through others, and yields each with the headers on the way."""
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
    below = layers(root)
    installed = installed_headers(root)
    complaints = []
    included = {}
    for folder in below:
        for file in sorted((root / folder).rglob("*")):
            if file.suffix not in (".h", ".cpp") or "node_modules" in file.parts:
                continue
            path = str(file.relative_to(root))
            names = INCLUDE.findall(file.read_text(encoding="utf-8"))
            included[path] = [quoted_file(root, file, name, installed) for kind, name in names if kind == '"']
            complaints += [f"{path}: {text}" for text in complaints_about(root, file, folder, below[folder], installed)]
    complaints += [f"{way[0]}: includes itself through {', '.join(way[1:-1])}" for way in circles(included)]
    print(*complaints, sep="\n", end="\n" if complaints else "")
    if not included:
        print(f"{root}: no sources", file=sys.stderr)
    sys.exit(1 if complaints or not included else 0)


main()
