"""Fills a real disk of 64 KiB to every level, and records, attaches, stamps, extracts and redacts on it.

The disk is a tmpfs in a mount namespace of this check alone: the check runs itself again in there.
"""

import dataclasses
import json
import os
import pathlib
import shutil
import subprocess
import sys

if __name__ == "__main__":
    sys.path.insert(0, os.fspath(pathlib.Path(__file__).resolve().parents[1]))

from check import Context, Result
from check import run as run_program
from Checks.io_faults import Case, Outcome, damage_of, says_which_file_and_why
from faults import TYPE, Fault, files_in, is_crash
from recordings import atom, demo_streams, extended_atom, shortened

DISK = 64 * 1024
PAGE = 4096
FULL = "No space left on device"
ENTRIES = 8
SESSIONS = ("session", "one-session")  # what the recorder is told to do
KINDS = ("cursorLocation", "keyboardAction", "slideTitles", "cursorImage")


def movie_ending_at(place):
    """A movie without an end that reaches so far into a page; and the same with its size."""
    media = bytes(range(1, 256)) * 17
    media = media[:place - len(TYPE) - 8 if place >= len(TYPE) + 8 else place + PAGE - len(TYPE) - 8]
    whole = TYPE + atom(b"mdat", media)
    return TYPE + bytes(4) + whole[len(TYPE) + 4:], whole


def cases(streams, place):
    """What is done, and the files that must be there afterwards where it ends well, but for what is appended."""
    movie, whole = movie_ending_at(place)
    files = {f"{kind}.dat": stream for kind, stream in streams.items()}
    metadata = extended_atom(b"ZULM", b"".join(extended_atom(b"DATA", stream) for stream in streams.values()))
    stamp = ["stamp", "disk/Movie.mp4", "--creator", "Recorder", "--creator-version", "1.0", "--in-place"]
    return [
        (Case("attach a copy", ["attach", "Movie.mp4", *files, "-o", "disk/Out.mp4"], {"Movie.mp4": movie} | files),
         {"disk/Out.mp4": whole + metadata}),
        (Case("attach", ["attach", "disk/Movie.mp4", *files, "--in-place"], {"disk/Movie.mp4": movie} | files,
              "disk/Movie.mp4"), {"disk/Movie.mp4": whole + metadata}),
        (Case("stamp", stamp, {"disk/Movie.mp4": movie}, "disk/Movie.mp4"), {"disk/Movie.mp4": whole}),
        (Case("extract", ["extract", "Recording.mp4", "-o", "disk"], {"Recording.mp4": whole + metadata}),
         {f"disk/{name}": contents for name, contents in files.items()}),
        (Case("redact", ["redact", "Recording.mp4", "--stream", "cpuUsage", "-o", "disk/Out.mp4"],
              {"Recording.mp4": whole + metadata}), {"disk/Out.mp4": whole + metadata}),
    ]


def fill(disk, pages):
    """Leaves less room where there is less."""
    try:
        with open(disk / "filler", "wb", buffering=0) as filler:
            for _ in range(pages):
                filler.write(bytes(PAGE))
    except OSError:
        pass


def perform(folder, case, program, level):
    disk = folder / "disk"
    for old in [*disk.iterdir(), *folder.glob("*.*")]:
        shutil.rmtree(old) if old.is_dir() else old.unlink()
    for name, contents in case.files.items():
        (folder / name).write_bytes(contents)
    fill(disk, level // PAGE)
    try:
        ended = run_program([program, *case.arguments], timeout=20, cwd=folder)
    except subprocess.TimeoutExpired:
        return None
    (disk / "filler").unlink(missing_ok=True)
    if is_crash(ended):
        return None
    return Outcome(ended.returncode, ended.stdout, ended.stderr.decode(errors="replace"), files_in(folder))


def problem_of(case, got, wanted):
    new = {name: contents for name, contents in got.files.items() if case.files.get(name) != contents}
    if got.code == 0:
        is_right = new.keys() == wanted.keys() and all(new[name].startswith(wanted[name]) for name in wanted)
        return "" if is_right else "does not write what it should"
    if got.code != 1 or not says_which_file_and_why(got.errors, "", ("disk/",), FULL):
        return "does not say which file, and why"
    if case.files.keys() - got.files.keys() or case.changed in new:
        return "leaves a changed input"
    if case.name == "extract":  # the streams in front of the one that failed are whole
        new = {name: contents for name, contents in new.items() if wanted.get(name) != contents}
    return f"leaves {sorted(new)}" if new else ""


def check_level(context, folder, streams, level, sessions, result, ends):
    def note(name, got, problem):
        result.cases += 1
        result.crashed += got is None
        result.lost += "input" in problem or "movie" in problem
        if got is None or problem:
            ended = f"ended {got.code}: {got.errors!r}" if got else ""
            result.failures.append(f"{name} at {level} bytes: {problem or 'crashes or hangs'}; {ended}")
        elif name in SESSIONS:
            ends.add((name, b" 0 " in got.output))
        else:
            ends.add((name, got.code != 0))

    for case, wanted in cases(streams, level % PAGE):
        got = perform(folder, case, context.zulm, level)
        note(case.name, got, problem_of(case, got, wanted) if got else "")
    for session, usual in sessions:
        got = perform(folder, session, context.program("recorder"), level)
        if got:
            got = dataclasses.replace(got, files={pathlib.Path(n).name: contents for n, contents in got.files.items()})
        note(session.name, got, damage_of(session, Fault("enospc"), got, usual) if got else "")


def run_inside(context):
    """In the mount namespace."""
    folder = context.folder
    disk = folder / "disk"
    disk.mkdir()
    sessions = []
    for name in SESSIONS:
        session = Case(name, [name, "disk", str(ENTRIES)], {"disk/Movie.mp4": movie_ending_at(0)[0]})
        usual = perform(folder, session, context.program("recorder"), 0)
        usual.files = {pathlib.Path(path).name: contents for path, contents in usual.files.items()}
        sessions.append((session, usual))
    streams = {kind: shortened(stream, 5000) for kind, stream in demo_streams(context).items() if kind in KINDS}
    shutil.rmtree(folder / "demo")
    subprocess.run(["mount", "-t", "tmpfs", "-o", f"size={DISK}", "tmpfs", disk], check=True)
    result, ends = Result(), set()
    levels = 4096 if context.full else 16
    for number in range(levels):
        level = DISK * number // levels + (0 if context.full else number * 273 % PAGE)
        check_level(context, folder, streams, level, sessions, result, ends)
    for name in ("attach a copy", "attach", "stamp", "extract", "redact"):
        if {(name, False), (name, True)} - ends:
            result.failures.append(f"{name}: not both with and without room")
    for name in SESSIONS:
        if (name, True) not in ends:  # 17 files need a page each, and there are 16
            result.failures.append(f"{name}: always finds room")
    return result


def run(context):
    as_root = [] if os.geteuid() == 0 else ["--user", "--map-root-user"]
    inside = ["unshare", "--mount", *as_root, sys.executable, "-B", __file__, str(int(context.full)), context.build,
              context.folder, context.source]
    ended = run_program(inside, timeout=3600)
    if ended.returncode != 0:
        return Result(failures=[f"no disk of its own can be mounted here: {ended.stderr.decode()}"])
    return Result(**json.loads(ended.stdout))


if __name__ == "__main__":
    full, *paths = sys.argv[1:]
    print(json.dumps(dataclasses.asdict(run_inside(Context(full == "1", *map(pathlib.Path, paths))))))
