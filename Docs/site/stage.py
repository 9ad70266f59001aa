"""Copies the pages of the site, and the pictures and schemas that they show, into a folder: stage.py FOLDER

A link to a page of the site stays a link. A link to any other file of the project becomes plain text.
"""

import os
import pathlib
import re
import shutil
import sys

ROOT = pathlib.Path(__file__).resolve().parents[2]
LINK = re.compile(r"(!?)\[([^\]]*)\]\(([^)\s]+)\)")
RENAMED = {
    "README.md": "index.md",
    "CHANGELOG.md": "changelog.md",
    "CONTRIBUTING.md": "contributing.md",
    "SECURITY.md": "security-policy.md",
    "Bindings/JavaScript/README.md": "javascript.md",
    "Bindings/Python/README.md": "python.md",
}
SHOWN = (".png", ".json")


def pages():
    """Returns the source of each page and its place in the site."""
    found = {ROOT / source: pathlib.PurePosixPath(place) for source, place in RENAMED.items()}
    found.update({page: pathlib.PurePosixPath(page.name) for page in sorted((ROOT / "Docs").glob("*.md"))})
    return found


def staged(text, source, places, folder):
    def link(match):
        image, words, target = match.groups()
        path, mark, anchor = target.partition("#")
        if not path or "://" in path:
            return match[0]
        file = pathlib.Path(os.path.normpath(source.parent / path))
        if file in places:
            return f"[{words}]({places[file]}{mark}{anchor})"
        if file.is_dir() and file.is_relative_to(ROOT / "Docs"):
            return ", ".join(f"[{name.removesuffix('.schema.json').removeprefix('zulm.')}]({file.name}/{name})" for name in show(file, folder))
        if file.suffix in SHOWN and file.is_relative_to(ROOT / "Docs"):
            copy(file, folder)
            return f"{image}[{words}]({file.relative_to(ROOT / 'Docs')})"
        if not file.exists():
            sys.exit(f"{source}: there is no {target}")
        return words
    return LINK.sub(link, text)


def shown_at(source, image, folder):
    file = pathlib.Path(os.path.normpath(source.parent / image))
    copy(file, folder)
    return file.relative_to(ROOT / "Docs")


def copy(file, folder):
    place = folder / file.relative_to(ROOT / "Docs")
    place.parent.mkdir(parents=True, exist_ok=True)
    shutil.copy(file, place)


def show(shown, folder):
    for file in sorted(shown.iterdir()):
        copy(file, folder)
        yield file.name


def main():
    folder = pathlib.Path(sys.argv[1])
    shutil.rmtree(folder, ignore_errors=True)
    folder.mkdir(parents=True)
    places = pages()
    for source, place in places.items():
        text = staged(source.read_text(encoding="utf-8"), source, places, folder)
        text = re.sub(r'(<img src=")([^"]+)"', lambda found: f'{found[1]}{shown_at(source, found[2], folder)}"', text)
        (folder / place).write_text(text, encoding="utf-8")


main()
