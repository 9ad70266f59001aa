"""Compares the generated parts of Docs/format.md with their sources: made_parts.py ZULM [update]

With `update` it writes them.
"""

import pathlib
import re
import subprocess
import sys
import tempfile

ROOT = pathlib.Path(__file__).resolve().parents[2]
PAGE = ROOT / "Docs" / "format.md"
PLAIN_MOVIE = b"\0\0\0\x10ftypmp42\0\0\0\0"
STREAMS = ("cursorLocation", "slideTitles", "cursorImage")


def kinds():
    """Yields the table of the kinds, with the value of each kind that is recorded."""
    registry = (ROOT / "ZULMetaData" / "ZULMMetaDataUUIDs.h").read_text()
    recorded = (ROOT / "ZULMetaDataBridge" / "Source" / "MetaDataKinds.h").read_text()
    groups = dict(re.findall(r"uuid (s_\w+UUID) = detail::kindUUID\(0x(\w{8})\)", registry))
    values = dict((constant, value) for value, constant in re.findall(
        r"StreamKind<(.+), (s_\w+UUID)[,>]", recorded))
    names = {"std::int32_t": "int", "std::string": "text", "std::list<std::string>": "list of texts",
             "CursorImage": "cursor image"}
    yield "| kind | first group | version | value |"
    yield "|---|---|---:|---|"
    for name, constant, version in re.findall(r'\{"(\w+)", (s_\w+), (\d+)\}', registry):
        value = values.get(constant)
        yield f"| `{name}` | `{groups[constant]}` | {version} | {names.get(value, value) or 'never recorded here'} |"


def dump(zulm):
    with tempfile.TemporaryDirectory() as folder:
        folder = pathlib.Path(folder)
        run = lambda *arguments: subprocess.run([zulm, *arguments], check=True, cwd=folder, stdout=subprocess.DEVNULL)
        run("demo", "demo")
        (folder / "Small.mp4").write_bytes(PLAIN_MOVIE)
        run("attach", "Small.mp4", *(f"demo/streams/{stream}.dat" for stream in STREAMS), "--in-place")
        printed = subprocess.run([sys.executable, ROOT / "Tests/Docs/hex_dump.py", folder / "Small.mp4"], check=True,
                                 capture_output=True, text=True).stdout
    return ["```text", printed.rstrip(), "```"]


def replaced(page, mark, lines):
    pattern = re.compile(rf"(<!-- {mark} begins? -->\n).*?(<!-- {mark} ends? -->)", re.DOTALL)
    changed, count = pattern.subn(lambda match: match[1] + "\n".join(lines) + "\n" + match[2], page)
    if count != 1:
        sys.exit(f"{PAGE}: has no markers for {mark}")
    return changed


def main():
    page = PAGE.read_text()
    made = replaced(replaced(page, "kinds", list(kinds())), "dump", dump(sys.argv[1]))
    if made == page:
        return
    if sys.argv[2:] != ["update"]:
        sys.exit(f"{PAGE.name} is out of date: run {pathlib.Path(__file__).name} ZULM update")
    PAGE.write_text(made)


main()
