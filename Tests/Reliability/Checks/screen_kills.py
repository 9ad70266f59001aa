"""Kills the recorder at random moments, and looks for everything that is promised to be there then."""

import json
import os
import random
import signal
import subprocess
import time

from check import Result
from Checks.screen_sync import use_desk

PICTURE, STREAMS, KEYS = 1.0, 0.5, 0.75  # seconds before the end that may be missing
MARGIN = 0.05                            # for xdotool, whose time is taken here


def one_run(desk, streams, screen, number, result):
    """What was done before it was killed, by the clock of this script, must be in the recovered movie."""
    recording = screen.record("--keys", "all", "--without-accessibility", name=f"run{number}.mp4")
    begun = time.monotonic()
    end = begun + random.uniform(0.3, 3.0)
    clicks, keys, places = [], [], []
    while time.monotonic() < end:
        screen.xdotool("click", 1)
        clicks.append(time.monotonic())
        screen.xdotool("key", "a")
        keys.append(time.monotonic())
        screen.xdotool("mousemove", 300 + len(places), 400)
        places.append(time.monotonic())
    recording.process.send_signal(signal.SIGKILL)
    recording.process.wait()
    killed = time.monotonic()
    code = subprocess.run([os.environ["ZULM_RECORD"], "--recover", recording.folder], capture_output=True,
                          check=False).returncode
    if code == 1 and killed - begun < PICTURE:
        return  # nothing had to be there yet
    if code != 0:
        result.failures.append(f"run {number}: killed after {killed - begun:.2f} s: recovery ends with {code}")
        result.lost += 1
        return
    kinds = streams.streams_of_movie(recording.output)
    found = {"clicks": (sum(entry.value == 1 for entry in kinds.get("cursorAction", [])), clicks, STREAMS),
             "keys": (len(kinds.get("keyboardAction", [])), keys, KEYS),
             "places": (len({entry.value for entry in kinds["cursorLocation"]}) - 1, places, STREAMS)}
    for name, (count, done, late) in found.items():
        needed = sum(moment < killed - late - MARGIN for moment in done)
        if count < needed:
            result.lost += 1
            result.failures.append(f"run {number}: {count} of {needed} {name} after {killed - begun:.2f} s")
    last = desk.frame_times(recording.output)[-1]
    if last < killed - begun - PICTURE - MARGIN:
        result.lost += 1
        result.failures.append(f"run {number}: the picture ends at {last:.2f} of {killed - begun:.2f} s")
    if subprocess.run([os.environ["ZULM"], "verify", recording.output], capture_output=True, check=False).returncode:
        result.failures.append(f"run {number}: zulm verify finds damage")


def full_disks(context, desk, screen, result):
    """Another program takes all that is free while something is recorded. Needs the right to mount."""
    place = context.folder / "small"
    place.mkdir()
    for number in range(20 if context.full else 1):
        mounted = subprocess.run(["mount", "-t", "tmpfs", "-o", "size=24m", "tmpfs", place], check=False,
                                 capture_output=True).returncode == 0
        if not mounted:
            result.notes.append("full disks were left out: no file system may be mounted here")
            return
        try:
            recording = screen.record(name=str(place / "full.mp4"))
            time.sleep(random.uniform(1, 3))
            with open(place / "filler", "wb", buffering=0) as filler:
                try:
                    while True:
                        filler.write(bytes(1 << 16))
                except OSError:
                    pass
            full = time.monotonic()
            code = recording.process.wait(30)
            result.cases += 1
            verified = subprocess.run([os.environ["ZULM"], "verify", recording.output], check=False,
                                      capture_output=True).returncode
            duration = json.loads(recording.json.read_text())["duration"]
            last = desk.frame_times(recording.output)[-1]
            if code != 3 or verified != 0 or last < duration - 1 or time.monotonic() - full > 10:
                result.lost += 1
                result.failures.append(f"full disk {number}: ends with {code}, verify {verified}, {last} of {duration}")
        finally:
            subprocess.run(["umount", "-l", place], check=False)


def run(context):
    desk, streams = use_desk(context)
    result = Result()
    with desk.Desk() as screen:
        screen.show(0, 0, 1280, 700)
        screen.xdotool("mousemove", 299, 400)
        for number in range(100 if context.full else 12):
            result.cases += 1
            screen.xdotool("mousemove", 299, 400)
            one_run(desk, streams, screen, number, result)
        full_disks(context, desk, screen, result)
    return result
