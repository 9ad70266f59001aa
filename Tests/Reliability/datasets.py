"""Data sets that an export of NDJSON into the folder out left: what must hold after a run that failed, and after the
next run."""

import collections
import json
import pathlib

FOLDER = "out"
MANIFEST = "out/manifest.ndjson"
COMMIT = "out/.commit.json"  # while there is one, the manifest may end in the middle of a line


def shown_rows(files):
    """Returns the rows that a reader finds, by kind, each with how often it is there."""
    rows = collections.Counter()
    for name, contents in files.items():
        path = pathlib.PurePosixPath(name)
        if len(path.parts) == 3 and path.parts[0] == FOLDER and not path.name.startswith("."):
            rows.update((path.parts[1], line) for line in contents.splitlines(keepends=True))
    return rows


def recordings_in(files):
    """Returns the names in the manifest. Raises a ValueError if a line is not whole."""
    return sorted(json.loads(line)["name"] for line in files[MANIFEST].splitlines()[1:])


def problem_between(failed, after, wanted):
    """Returns what is wrong with the files that a failed run left, or with those of the next run, or nothing."""
    if shown_rows(failed) - shown_rows(wanted):
        return "leaves rows that are not whole, or twice"
    if MANIFEST in failed and COMMIT not in failed:
        try:
            recordings_in(failed)
        except ValueError:
            return "leaves a manifest that is not whole"
    if not after or shown_rows(after) != shown_rows(wanted):
        return "leaves what the next run cannot end"
    if recordings_in(after) != recordings_in(wanted):
        return "lists other recordings after the next run"
    return ""


def has_temporary_files(files):
    return any(pathlib.PurePosixPath(name).name.startswith(".") for name in files)
