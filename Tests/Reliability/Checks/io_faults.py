"""Lets every system call of every command, and of a program that records, fail in every way that it can."""

import dataclasses
import os
import pathlib
import re
import shutil

from check import Result
from datasets import has_temporary_files, problem_between, shown_rows
from faults import (OPEN_MOVIE, WHOLE_MOVIE, Fault, count_calls, files_in, is_crash, recording, run_with, small_streams,
                    write_files)
from recordings import HEADER, entry_ends, fast_folder, sized_atom

# What fails, and at every how many calls behind the first it fails again.
FAULTS = (("eio", 0), ("eio", 1), ("enospc", 0), ("enospc", 1), ("full", 0), ("eintr", 0), ("eintr", 2), ("short", 0),
          ("short", 1))
INVISIBLE = {"eintr", "short"}
OUTPUTS = ("Out.mp4", "Out.srt", "Out.html", "out")
REASONS = ("Input/output error", "No space left on device")

MESSAGES = ("Couldn't open output file for appending meta data: ", "Couldn't open meta data file: ",
            "Found a non DATA atom mixed in the ZUL meta data", "Can't parse metadata. Unable to open file: ", "MetaDataReader<T>::parseFile - Version is larger ")


@dataclasses.dataclass
class Case:
    name: str
    arguments: list[str]  # run in the folder of the files
    files: dict[str, bytes]
    changed: str = ""     # the file that is changed in place
    before: list[str] = dataclasses.field(default_factory=list)  # run first, without faults
    goes_on: bool = False  # run once more at the end, without faults


def cases(streams):
    files = {f"{kind}.dat": stream for kind, stream in streams.items()}
    whole = {"Recording.mp4": recording(streams)}
    damaged = {"Broken.mp4": recording(streams)[:-10]}
    interrupted = {"Movie.mp4": WHOLE_MOVIE + sized_atom(b"ZULM", 0, recording(streams)[len(WHOLE_MOVIE) + 16:-10])}
    movie = {"Movie.mp4": OPEN_MOVIE}
    page = {"Page.html": b"<head></head>"}
    stamp = ["stamp", "Movie.mp4", "--creator", "Recorder", "--creator-version", "1.0"]
    return [
        Case("info", ["info", "Recording.mp4"], whole),
        Case("atoms", ["atoms", "Recording.mp4"], whole),
        Case("dump", ["dump", "Recording.mp4"], whole),
        Case("grep", ["grep", "e", "Recording.mp4"], whole),
        Case("state", ["state", "Recording.mp4", "--at", "1"], whole),
        Case("insights", ["insights", "Recording.mp4"], whole),
        Case("retime", ["retime", "Recording.mp4", "--movie", "Movie.mp4", "--keep", "0-1", "-o", "Out.mp4"],
             whole | movie),
        Case("diff", ["diff", "Recording.mp4", "Broken.mp4"], whole | damaged),
        Case("verify", ["verify", "Recording.mp4"], whole),
        Case("extract", ["extract", "Recording.mp4", "-o", "out"], whole),
        Case("attach a copy", ["attach", "Movie.mp4", *files, "-o", "Out.mp4"], movie | files),
        Case("attach", ["attach", "Movie.mp4", *files, "--in-place"], movie | files, "Movie.mp4"),
        Case("repair a copy", ["repair", "Movie.mp4", "-o", "Out.mp4"], interrupted),
        Case("repair", ["repair", "Movie.mp4", "--in-place"], interrupted, "Movie.mp4"),
        Case("stamp a copy", [*stamp, "-o", "Out.mp4"], movie),
        Case("stamp", [*stamp, "--in-place"], movie, "Movie.mp4"),
        Case("salvage", ["salvage", "Broken.mp4", "-o", "out"], damaged),
        Case("redact", ["redact", "Recording.mp4", "--keys", "-o", "Out.mp4"], whole),
        Case("convert", ["convert", "--to", "srt", "Recording.mp4", "-o", "Out.srt"], whole),
        Case("view", ["view", "Recording.mp4", "-o", "Out.html", "--page", "Page.html"], whole | page),
    ]


@dataclasses.dataclass
class Outcome:
    code: int
    output: bytes
    errors: str
    files: dict[str, bytes]
    next: "Outcome | None" = None  # of the run at the end


def outcome(ended, folder):
    return Outcome(ended.returncode, ended.stdout, ended.stderr.decode(errors="replace"), files_in(folder))


def begin(context, folder, case, program):
    write_files(folder, case.files)
    if case.before:
        run_with(context, Fault("none"), [program, *case.before], folder=folder).check_returncode()


def perform(context, root, case, program, fault):
    """Runs a case in a new folder. None where it crashes or hangs."""
    folder = root / "work"
    begin(context, folder, case, program)
    ended = run_with(context, fault, [program, *case.arguments], folder=folder)
    got = None if is_crash(ended) else outcome(ended, folder)
    if got and case.goes_on:
        ended = run_with(context, Fault("none"), [program, *case.arguments], folder=folder)
        got.next = None if is_crash(ended) else outcome(ended, folder)
    shutil.rmtree(folder)
    return got


def calls_of(context, root, case, program, kind):
    folder = root / "count"
    begin(context, folder, case, program)
    calls = count_calls(context, kind, [program, *case.arguments], folder=folder)
    shutil.rmtree(folder)
    return calls


def without_temporaries(files):
    return {name: contents for name, contents in files.items() if not os.path.basename(name).startswith(".")}


def says_which_file_and_why(errors, usual, names, reasons):
    """A line that a run without faults does not have, with a file in front and the reason behind it."""
    lines = [line for line in errors.splitlines() if line not in usual]
    return any(line.startswith("zulm: " + name) and line.partition("; ")[0].endswith(reasons)
               for line in lines for name in names)


def is_sane(text):
    """No number in it is one below 0 that lost its sign."""
    return all(int(number) < 2**63 for number in re.findall(r"\d+", text))


def is_undone(case, got):
    """The inputs are what they were, as far as the message does not say otherwise."""
    return all(got.files.get(name) == contents for name, contents in case.files.items()
               if name != case.changed or "could not be made what it was" not in got.errors)


def problem_of(case, fault, got, usual):
    """What is wrong with how a faulted run ended, or nothing."""
    is_usual = (got.code, got.output, got.files) == (usual.code, usual.output, usual.files)
    if fault.kind in INVISIBLE:
        return "" if is_usual and got.errors == usual.errors else "shows"
    files, wanted = without_temporaries(got.files), without_temporaries(usual.files)
    is_right = (got.code, got.output, files) == (usual.code, usual.output, wanted)
    if is_right:
        return "" if is_usual or case.name == "redact" or fault.again else "leaves a temporary file"
    if got.code != 1 and not (got.code == usual.code == 3):
        return "gives another result"
    names = (*case.files, *OUTPUTS, "standard output", ".:", "./.")
    if not says_which_file_and_why(got.errors, usual.errors, names, REASONS):
        return "does not say which file and why"
    if not is_sane(got.errors):
        return "tells a number that cannot be"
    if not is_undone(case, got) and files != wanted:
        return "leaves a changed input"
    if any(wanted.get(name) != contents for name, contents in files.items() if name not in case.files):
        return "leaves an output that is not whole"
    return "leaves a temporary file" if got.files != files and not fault.again else ""


def damage_of(case, fault, got, usual):
    """The same for the program that records: its streams hold a beginning of what they should, its movie is kept."""
    lines = got.output.decode().splitlines()
    rows = {row[0]: row[1:] for line in lines if len(row := line.split()) == 5 and row[0].endswith(".dat")}
    if fault.kind in INVISIBLE:
        return "" if (got.code, got.output, got.files) == (usual.code, usual.output, usual.files) else "shows"
    if got.code != 0 or len(rows) != 17:
        return "does not come to its end"
    if unknown := [line for line in (*lines, *got.errors.splitlines())
                   if line.split()[0] not in rows and not line.startswith(MESSAGES)]:
        return f"says {unknown[0]!r}"
    for name, (healthy, written, right, _) in rows.items():
        stream, whole = got.files.get(name, b""), usual.files[name]
        if not whole.startswith(stream):
            return f"writes something else into {name}"
        entries = len(entry_ends(stream)) - 1 if len(stream) >= HEADER else 0
        if healthy == "1" and (stream != whole or int(written) != entries):
            return f"calls {name} healthy, which has {entries} entries"
        if int(right) > len(entry_ends(whole)) - 1:
            return f"reads more from {name} than there is"
    (before,) = case.files.values()
    movie = got.files["Movie.mp4"][:len(before)]
    return "" if movie in (before, usual.files["Movie.mp4"][:len(before)]) else "changes the movie"


def export_case(streams):
    """The second recording is added to a data set that has the first one."""
    export = ["export", "--format", "ndjson", "-o", "out"]
    return Case("export", [*export, "First.mp4", "Second.mp4"],
                {name: recording(streams) for name in ("First.mp4", "Second.mp4")},
                before=[*export, "First.mp4"], goes_on=True)


def damage_of_data_set(case, fault, got, usual):
    """The same for an export: entries are there once or not at all, and the next run adds those that are missing."""
    if found := problem_between(got.files, got.next and got.next.files, usual.files):
        return found
    if has_temporary_files(got.next.files) and not fault.again:
        return "leaves a temporary file"
    if got.next.code != 0:
        return f"lets the next run end with {got.next.code}: {got.next.errors!r}"
    is_usual = (got.code, got.output, shown_rows(got.files)) == (usual.code, usual.output, shown_rows(usual.files))
    if fault.kind in INVISIBLE:
        return "" if is_usual and got.errors == usual.errors else "shows"
    if is_usual:
        return ""
    if got.code != 1:
        return "has another result"
    names = (*case.files, *OUTPUTS, "standard output")
    reasons = (*REASONS, "another program writes to this data set")  # nobody can tell if the lock cannot be examined
    return "" if says_which_file_and_why(got.errors, usual.errors, names, reasons) else "does not say which file and why"


def check_case(context, root, case, program, problem, result):
    usual = perform(context, root, case, program, Fault("none"))
    for kind, again in FAULTS:
        step = 1 if context.full or not again else 4
        for at in range(1, calls_of(context, root, case, program, kind) + 1, step):
            fault = Fault(kind, at, again)
            got = perform(context, root, case, program, fault)
            result.cases += 1
            if got is None:
                result.crashed += 1
                result.failures.append(f"{case.name}: {fault}: crashes or hangs")
            elif found := problem(case, fault, got, usual):
                result.lost += "input" in found or "movie" in found
                result.failures.append(f"{case.name}: {fault}: {found}; ended {got.code}: {got.errors!r}")


def run(context):
    result = Result()
    with fast_folder() as name:
        root = pathlib.Path(name)
        streams = small_streams(context)
        for case in cases(streams):
            check_case(context, root, case, context.zulm, problem_of, result)
        check_case(context, root, export_case(streams), context.zulm, damage_of_data_set, result)
        entries = "20" if context.full else "2"
        for name in ("session", "one-session"):
            session = Case(f"recording a {name}", [name, ".", entries], {"Movie.mp4": OPEN_MOVIE})
            check_case(context, root, session, context.program("recorder"), damage_of, result)
    return result
