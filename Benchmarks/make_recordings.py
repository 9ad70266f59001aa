#!/usr/bin/env python3
"""Makes a folder of recordings that are like real ones, for measurements with very many of them.

Usage: Benchmarks/make_recordings.py FOLDER [--count N] [--seed N] [--damaged SHARE]

Lengths are spread as those of real recordings are: most last a few minutes, a few last hours. A recording has the kinds
that a recorder writes, with their usual rates. One in a thousand is damaged: it ends too early, or its bytes are wrong.
The same seed makes the same recordings, whatever the count, so a smaller corpus is the beginning of a larger one.
The folder gets subfolders of a thousand recordings each.
"""

import argparse
import pathlib
import random
import tempfile

import numpy as np
import zulmetadata

# An empty movie: what the metadata is appended to.
MOVIE = b"\0\0\0\x10ftypmp42\0\0\0\0" + b"\0\0\0\x10mdatpictures"
APPLICATIONS = ["Editor", "Terminal", "Browser", "Slides", "Mail", "Spreadsheet", "Player", "Chat"]
TYPICAL_SECONDS = 240
SPREAD = 1.0
PRESS_SECONDS = 0.08
LONGEST_SECONDS = 4 * 3600
FOLDER_SIZE = 1000


def at_times(kind, times, *columns):
    entries = np.zeros(len(times), zulmetadata.dtype_of(kind))
    names = entries.dtype.names
    entries[names[0]] = times
    for name, values in zip(names[1:], columns):
        entries[name] = values
    return entries


def times_of(numbers, seconds, rate):
    """Times of events that come at `rate` a second on average."""
    return np.sort(numbers.uniform(0, seconds, numbers.poisson(seconds * rate)))


def entries_of(numbers, seconds):
    """Returns the entries of one recording by their kinds."""
    moves = times_of(numbers, seconds, 12)
    paths = np.clip(np.cumsum(numbers.normal(0, 25, (2, len(moves))), axis=1) + [[960], [540]], 0, [[1919], [1079]])
    presses = times_of(numbers, seconds, 0.15)
    presses = presses[np.diff(presses, append=np.inf) > 2 * PRESS_SECONDS]
    clicks = np.repeat(presses, 2)
    clicks[1::2] += PRESS_SECONDS
    keys = times_of(numbers, seconds, 0.8)
    windows = np.concatenate([[0.0], times_of(numbers, seconds, 1 / 40)])
    applications = numbers.choice(APPLICATIONS, len(windows))
    machine = np.arange(0, seconds, 1.0)
    corners = numbers.integers(0, 400, (2, len(windows)))
    return {
        "cursorLocation": at_times("cursorLocation", moves, *paths.astype(np.int32)),
        "cursorAction": at_times("cursorAction", clicks, np.resize([1, 2], len(clicks))),
        "keyboardAction": at_times("keyboardAction", keys, numbers.integers(97, 123, len(keys)), 0),
        "cpuUsage": at_times("cpuUsage", machine, numbers.uniform(0, 1, len(machine))),
        "topmostAppName": at_times("topmostAppName", windows, applications),
        "topmostWindowTitle": at_times(
            "topmostWindowTitle", windows, [f"{name} — {numbers.integers(1000)}" for name in applications]),
        "topmostWindow": at_times("topmostWindow", windows, *corners, np.full(len(windows), 1280), 720),
    }


def damage(path, numbers):
    """Cuts the end off, or writes over the beginning of a stream."""
    content = bytearray(path.read_bytes())
    if numbers.random() < 0.5:
        del content[int(numbers.integers(len(MOVIE), len(content))):]
    else:
        begin = content.index(b"DATA") - 4
        content[begin:begin + 64] = numbers.bytes(64)
    path.write_bytes(content)


def make(path, number, seed, damaged_share):
    """Makes one recording, and returns whether it is damaged."""
    numbers = np.random.default_rng([seed, number])
    seconds = min(LONGEST_SECONDS, TYPICAL_SECONDS * numbers.lognormal(0, SPREAD))
    path.write_bytes(MOVIE)
    with tempfile.TemporaryDirectory() as folder:
        streams = []
        for kind, entries in entries_of(numbers, seconds).items():
            streams.append(pathlib.Path(folder) / f"{kind}.dat")
            zulmetadata.write_stream(streams[-1], kind, entries)
        zulmetadata.attach(path, streams)
    is_damaged = number in damaged_numbers(number, seed, damaged_share)
    if is_damaged:
        damage(path, numbers)
    return is_damaged


def damaged_numbers(number, seed, share):
    """Returns which recordings of the group of this one are damaged: one in 1/share."""
    if share <= 0:
        return set()
    group = round(1 / share)
    begin = number - number % group
    return {begin + random.Random(f"{seed}:{begin}").randrange(group)}


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("folder", type=pathlib.Path)
    parser.add_argument("--count", type=int, default=20000)
    parser.add_argument("--seed", type=int, default=1)
    parser.add_argument("--damaged", type=float, default=0.001, metavar="SHARE")
    options = parser.parse_args()
    damaged, size = 0, 0
    for number in range(options.count):
        path = options.folder / f"{number // FOLDER_SIZE:03}" / f"recording-{number:06}.mp4"
        path.parent.mkdir(parents=True, exist_ok=True)
        if not path.exists():
            part = path.with_suffix(".part.mp4")
            make(part, number, options.seed, options.damaged)
            part.rename(path)
        damaged += number in damaged_numbers(number, options.seed, options.damaged)
        size += path.stat().st_size
    print(f"{options.count} recordings, {damaged} of them damaged, {size / 1e6:.1f} MB")


if __name__ == "__main__":
    main()
