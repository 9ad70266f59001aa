"""Kills the recorder at random moments, and looks for everything that is promised to be there then."""

import json
import os
import random
import signal
import statistics
import subprocess
import time

from check import Result
from Checks.screen_sync import use_desk

PROMISED = {"picture": 1.0, "clicks": 0.5, "motions": 0.5, "keys": 0.75}  # seconds before the end that may be missing
SHARED = 2  # the quick form shares its machine with others, and allows as many times the promise


class Run:
    """One recording, killed at a random moment. What happened is what the window was told by the server, whose clock is
    that of the system."""

    def __init__(self, screen, window, number):
        earlier = {kind: len(window.lines(kind)) for kind in ("button", "key", "motion")}
        self.recording = screen.record("--keys", "all", "--without-accessibility", name=f"run{number}.mp4")
        self.begun = time.monotonic()
        end = self.begun + random.uniform(0.3, 3.0)
        place = 300
        while time.monotonic() < end:
            screen.xdotool("click", 1)
            screen.xdotool("key", "a")
            place += 1
            screen.xdotool("mousemove", place, 400)
        self.killed = time.monotonic()
        self.recording.process.send_signal(signal.SIGKILL)
        self.recording.process.wait()
        self.told = {kind: window.lines(kind)[count:] for kind, count in earlier.items()}
        done = subprocess.run([os.environ["ZULM_RECORD"], "--recover", self.recording.folder], capture_output=True,
                              check=False, text=True)
        self.code, self.message = done.returncode, done.stderr.strip()

    def seconds(self):
        return self.killed - self.begun

    def moments(self, kind):
        return [int(words[-1]) / 1000 for words in self.told[kind]]

    def ages(self, desk, streams):
        """How long before the end the oldest thing happened that is missing, for each kind; 0 if nothing is."""
        kinds = streams.streams_of_movie(self.recording.output)
        clicks = [entry.time for entry in kinds.get("cursorAction", []) if entry.value == 1]
        keys = [entry.time for entry in kinds.get("keyboardAction", [])]
        places = {entry.value for entry in kinds["cursorLocation"]}
        motions = [(int(x), int(y)) in places for x, y, _ in self.told["motion"]]
        if clicks:
            zero = self.moments("button")[0] - clicks[0]
        else:
            zero = self.begun
        missing = {"clicks": self.moments("button")[len(clicks):], "keys": self.moments("key")[len(keys):],
                   "motions": [when for when, known in zip(self.moments("motion"), motions) if not known],
                   "picture": [zero + desk.frame_times(self.recording.output)[-1]]}
        return {name: max([self.killed - when for when in missing[name]], default=0) for name in PROMISED}


def one_run(desk, streams, run, number, factor, result):
    """Returns the ages of what is missing."""
    where = f"run {number}, killed after {run.seconds():.2f} s"
    if run.code == 1 and run.seconds() < factor * PROMISED["picture"]:
        return None  # nothing had to be there yet
    if run.code not in (0, 3):
        result.failures.append(f"{where}: recovery ends with {run.code}: {run.message}")
        result.lost += 1
        return None
    ages = run.ages(desk, streams)
    lost = [f"{name} {age:.2f} s" for name, age in ages.items() if age > factor * PROMISED[name]]
    if lost:
        result.lost += 1
        result.failures.append(f"{where}: missing is what was older than promised: {', '.join(lost)}")
    elif run.code == 3:
        result.failures.append(f"{where}: recovery tells of a loss that there is not: {run.message}")
    if subprocess.run([os.environ["ZULM"], "verify", run.recording.output], capture_output=True, check=False).returncode:
        result.failures.append(f"{where}: zulm verify finds damage")
    return ages


def table(ages):
    lines = ["| missing before the end | promised at most | median | largest |"]
    for name, promise in PROMISED.items():
        values = [age[name] for age in ages]
        lines.append(f"| {name} | {promise:.2f} s | {statistics.median(values):.2f} s | {max(values):.2f} s |")
    return lines


def fill(file):
    """Takes all that is free on a file system."""
    with open(file, "ab", buffering=0) as filler:
        try:
            while True:
                filler.write(bytes(1 << 16))
        except OSError:
            pass


def refuse_full_disk(place, screen, result):
    """Nothing is created on a file system that is full at the start."""
    fill(place / "filler")
    before = sorted(path.name for path in place.iterdir())
    recording = screen.record(name=str(place / "late.mp4"), wait=False)
    code = recording.process.wait(60)
    after = sorted(path.name for path in place.iterdir())
    if code != 1 or after != before:
        result.failures.append(f"a full disk at the start: ends with {code}, leaves {after} of {before}")


def full_disks(context, desk, screen, result):
    """Another program takes all that is free while something is recorded. Needs the right to mount."""
    place = context.folder / "small"
    place.mkdir()
    missing = []
    for number in range(20 if context.full else 1):
        mounted = subprocess.run(["mount", "-t", "tmpfs", "-o", "size=24m", "tmpfs", place], check=False,
                                 capture_output=True).returncode == 0
        if not mounted:
            result.notes.append("full disks were left out: no file system may be mounted here")
            return
        try:
            recording = screen.record(name=str(place / "full.mp4"))
            time.sleep(random.uniform(1, 3))
            fill(place / "filler")
            full = time.monotonic()
            code = recording.process.wait(60)
            seconds = time.monotonic() - full
            result.cases += 1
            verified = subprocess.run([os.environ["ZULM"], "verify", recording.output], check=False,
                                      capture_output=True).returncode
            report = json.loads(recording.json.read_text())
            duration = report["duration"]
            last = desk.frame_times(recording.output)[-1] if recording.output.exists() else 0
            missing.append(duration - last)
            if code != 3 or verified != 0 or last < duration - 1 or seconds > 20:
                result.lost += 1
                result.failures.append(f"full disk {number}: ends with {code} after {seconds:.1f} s, verify {verified}, "
                                       f"{last} of {duration}: {recording.errors()}")
            if report["stopped_by"] != "disk":
                result.failures.append(f"full disk {number}: stopped by {report['stopped_by']}")
            refuse_full_disk(place, screen, result)
        finally:
            subprocess.run(["umount", "-l", place], check=False)
    result.notes.append(f"{len(missing)} full disks: the picture ends at most {max(missing):.2f} s before the recording")


def run(context):
    desk, streams = use_desk(context)
    result = Result()
    ages = []
    with desk.Desk() as screen:
        window = screen.show(0, 0, 1280, 700)
        for number in range(100 if context.full else 5):
            result.cases += 1
            screen.xdotool("mousemove", 299, 400)
            run = Run(screen, window, number)
            found = one_run(desk, streams, run, number, 1 if context.full else SHARED, result)
            ages += [found] if found else []
            run.recording.output.unlink(missing_ok=True)
        full_disks(context, desk, screen, result)
    if ages:
        result.notes += table(ages)
    return result
