"""Kills `zulm attach`, `repair` and `stamp` at every system call, and in the middle of every write, then goes on."""

import pathlib

from check import Result
from check import run as run_program
from faults import OPEN_MOVIE, SIZE_FIELD, Fault, count_calls, run_with, small_streams, was_killed, write_files
from recordings import extended_atom, fast_folder, sized_atom

MENDED_FIELD = (len(OPEN_MOVIE) - SIZE_FIELD.start).to_bytes(4, "big")


def commands(context, folder, streams):
    movie = folder / "Movie.mp4"
    files = [folder / f"{kind}.dat" for kind in streams]
    return {
        "attach": [context.zulm, "attach", movie, *files, "--in-place"],
        "repair": [context.zulm, "repair", movie, "--in-place"],
        "stamp": [context.zulm, "stamp", movie, "--creator", "Recorder", "--creator-version", "1.0", "--in-place"],
    }


def prepare(folder, movie, streams):
    write_files(folder, {"Movie.mp4": movie, **{f"{kind}.dat": stream for kind, stream in streams.items()}})


def is_untouched(before, after):
    """The media and all in front of it are there, but for a size field that may hold what a repair writes."""
    if after[SIZE_FIELD] not in (before[SIZE_FIELD], MENDED_FIELD):
        return False
    media = before[:len(OPEN_MOVIE)]
    return after.startswith(media[:SIZE_FIELD.start], 0) and after[SIZE_FIELD.stop:].startswith(media[SIZE_FIELD.stop:])


def check_afterwards(context, folder, streams, name, result):
    """Repairing and attaching again gives a movie whose streams all read."""
    steps = commands(context, folder, streams)
    for step in (steps["repair"], [*steps["attach"], "--replace"]):
        done = run_program(step)
        if done.returncode not in (0, 3):
            result.failures.append(f"{name}: {step[1]} afterwards ended {done.returncode}: {done.stderr.decode()}")
    out = folder / "out"
    run_program([context.zulm, "extract", folder / "Movie.mp4", "-o", out])
    for kind, stream in streams.items():
        file = out / f"{kind}.dat"
        if not file.exists() or file.read_bytes() != stream:
            result.lost += 1
            result.failures.append(f"{name}: {kind} does not come back")


def kill_at(context, root, movie, streams, command, fault, name, result):
    folder = root / name.replace(" ", "-")
    prepare(folder, movie, streams)
    ended = run_with(context, fault, commands(context, folder, streams)[command])
    result.cases += 1
    if not was_killed(ended):
        result.crashed += ended is None
        result.failures.append(f"{name}: was not killed: {ended}")
    if not is_untouched(movie, (folder / "Movie.mp4").read_bytes()):
        result.lost += 1
        result.failures.append(f"{name}: bytes of the movie have changed")
    check_afterwards(context, folder, streams, name, result)


def check_command(context, root, title, movie, streams, command, result):
    for kind in ("kill", "tear"):
        folder = root / f"{title}-{command}-{kind}"
        prepare(folder, movie, streams)
        calls = count_calls(context, kind, commands(context, folder, streams)[command])
        for at in range(1, calls + 1):
            name = f"{title} {command} {kind} {at}"
            kill_at(context, root, movie, streams, command, Fault(kind, at), name, result)


def run(context):
    result = Result()
    streams = small_streams(context)
    data = b"".join(extended_atom(b"DATA", stream) for stream in streams.values())
    movies = {"open": OPEN_MOVIE,
              "interrupted": OPEN_MOVIE.replace(bytes(4), MENDED_FIELD, 1) + sized_atom(b"ZULM", 0, data[:-40])}
    if not context.full:
        streams = dict(list(streams.items())[:2])
    with fast_folder() as name:
        for title, movie in movies.items():
            for command in ("attach", "repair", "stamp"):
                chosen = streams if command == "attach" and title == "open" else dict(list(streams.items())[:1])
                check_command(context, pathlib.Path(name), title, movie, chosen, command, result)
    return result
