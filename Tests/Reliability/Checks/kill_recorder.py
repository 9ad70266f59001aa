"""Kills a recorder that writes all 17 kinds as fast as it can, and looks for every entry that it had flushed."""

import json
import os
import random
import select
import signal
import struct
import subprocess
import time

from check import Result
from check import run as run_program
from faults import OPEN_MOVIE
from recordings import HEADER, entry_ends, fast_folder

LONGEST = 0.06  # seconds from the first flush on; in every 10th run from the start on


def record_and_kill(context, folder, mode, seconds, waits):
    """How the recorder ended, and how many entries of each stream had been flushed, as it said. It is killed so many
    seconds behind its first flush, or behind its start."""
    reader, writer = os.pipe()
    recorder = subprocess.Popen([context.program("recorder"), "record", folder, str(writer), mode], pass_fds=[writer])
    os.close(writer)
    told = bytearray()
    if waits:
        select.select([reader], [], [], 30)
    end = time.monotonic() + seconds
    while (left := end - time.monotonic()) > 0:
        if select.select([reader], [], [], left)[0]:
            told += os.read(reader, 1 << 16)
    recorder.kill()
    while piece := os.read(reader, 1 << 16):
        told += piece
    os.close(reader)
    ended = recorder.wait()
    flushed = {}
    for stream, entries in struct.iter_unpack("<II", told[: len(told) // 8 * 8]):
        flushed[stream] = entries
    return ended, flushed


def right_entries(context, path):
    lines = run_program([context.program("recorder"), "count", path]).stdout.decode().splitlines()
    return {name: int(number) for name, number in map(str.split, lines)}


def check_entries(number, name, stream, flushed, right, result):
    whole = len(entry_ends(stream)) - 1 if len(stream) >= HEADER else 0
    if whole < flushed or right < flushed:
        result.lost += 1
        result.failures.append(f"run {number}: {name}: {flushed} entries flushed, {whole} whole, {right} right")
    elif right < whole:
        result.failures.append(f"run {number}: {name}: {whole} whole entries, only the first {right} of them right")


def check_findings(number, name, stream, report, result):
    """What `zulm verify` says about a stream file: nothing, or the place and size of the one torn entry."""
    end = entry_ends(stream)[-1]
    torn = len(stream) - end
    damages = [f for f in report["findings"] + report["streams"][0]["findings"] if f["severity"] == "damage"]
    expected = [end] if torn else []
    sizes = {str(torn), str(torn - 4)}  # an entry of varying size is said to have what is behind its 4 bytes of size
    is_right = ([f["offset"] for f in damages] == expected and report["streams"][0]["readable_bytes"] == end
                and all(sizes & set(f["message"].split()) for f in damages))
    if not is_right:
        result.failures.append(f"run {number}: {name}: {torn} bytes torn at {end}; verify says {damages}")


def check_attached(context, number, folder, streams, result):
    """The safe save leaves the torn entries out, says so, and the movie has all others."""
    movie = folder / "Movie.mp4"
    movie.write_bytes(OPEN_MOVIE)
    attached = run_program([context.zulm, "attach", movie, *(folder / name for name in streams), "--in-place"])
    torn = {name: len(stream) - entry_ends(stream)[-1] for name, stream in streams.items()}
    said = attached.stderr.decode()
    is_said = all((f"{name}: " in said and f"left out {count} byte" in said) or count == 0
                  for name, count in torn.items())
    if attached.returncode != (3 if any(torn.values()) else 0) or not is_said:
        result.failures.append(f"run {number}: attach ended {attached.returncode} and said {said!r}; torn: {torn}")
        return
    if run_program([context.zulm, "verify", movie]).returncode != 0:
        result.failures.append(f"run {number}: the saved movie is damaged")
    right = right_entries(context, movie)
    for name, stream in streams.items():
        if right[name] != len(entry_ends(stream)) - 1:
            result.lost += 1
            result.failures.append(f"run {number}: {name}: {right[name]} entries right in the movie")


def check_abandoned(context, number, folder, streams, result):
    """A session that was killed is found, with what each of its streams holds."""
    found = run_program([context.program("recorder"), "abandoned", folder]).stdout.decode().split("\n")[:-1]
    ends = {name: entry_ends(stream) if len(stream) >= HEADER else [0] for name, stream in streams.items()}
    expected = [f"{name} {len(ends[name]) - 1} {len(stream) - ends[name][-1]}" for name, stream in streams.items()
                if (folder / name).exists()]
    if found != expected:
        result.lost += 1
        result.failures.append(f"run {number}: the session holds {expected}, and {found} was found")


def check_run(context, number, folder, flushed, result):
    right = right_entries(context, folder)
    streams = {name: (folder / name).read_bytes() if (folder / name).exists() else b"" for name in right}
    for place, (name, stream) in enumerate(streams.items()):
        check_entries(number, name, stream, flushed.get(place, 0), right[name], result)
    if (folder / "session.lock").exists():
        check_abandoned(context, number, folder, streams, result)
    begun = {name: stream for name, stream in streams.items() if len(stream) >= HEADER}
    if not begun:
        return 0
    verified = run_program([context.zulm, "verify", "--json", *(folder / name for name in begun)])
    reports = json.loads(verified.stdout)["files"]
    for (name, stream), report in zip(begun.items(), reports):
        check_findings(number, name, stream, report, result)
    check_attached(context, number, folder, begun, result)
    return sum(len(stream) > entry_ends(stream)[-1] for stream in begun.values())


def run_once(context, number, chance, result):
    with fast_folder() as name:
        folder = type(context.folder)(name)
        waits = number % 10 != 0
        ended, flushed = record_and_kill(context, folder, chance.choice(("flushed", "buffered", "session")),
                                         chance.uniform(0, LONGEST), waits)
        if ended != -signal.SIGKILL or (waits and not flushed):
            result.crashed += 1
            result.failures.append(f"run {number}: the recorder ended with {ended}, {len(flushed)} streams flushed")
        return check_run(context, number, folder, flushed, result)


def run(context):
    result = Result(cases=2000 if context.full else 100)
    chance = random.Random(20260401)
    torn = sum(run_once(context, number, chance, result) for number in range(result.cases))
    if torn == 0:
        result.failures.append("no stream was ever torn, so that nothing was shown about those")
    return result
