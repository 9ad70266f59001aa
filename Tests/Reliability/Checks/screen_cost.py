"""What it costs to observe: processor time without taking and encoding pictures, and memory over a long recording."""

import os
import pathlib
import statistics
import time

from check import Result
from Checks.screen_sync import use_desk

MOST = 2.0  # percent of a core, at 1280x720 and 30 frames a second
SHARED = 2  # times as much in the quick form, which shares its machine with others
PICTURE = 1280 * 720 * 3 // 2 // 1024  # KiB
GROWTH = 1024 + 10 * PICTURE  # KiB: pictures wait for a busy encoder, whose memory is kept for the next ones
MOTIONS = [word for index in range(50) for word in ("mousemove", 300 + 7 * index, 200 + 3 * index, "sleep", 0.02)]


def processor_seconds(task):
    fields = (task / "stat").read_text().rpartition(")")[2].split()
    return (int(fields[11]) + int(fields[12])) / os.sysconf("SC_CLK_TCK")


def observing_seconds(process):
    """The first thread observes; the others take pictures and encode them. A child asks the accessibility bus."""
    main = pathlib.Path(f"/proc/{process}/task/{process}")
    children = (main / "children").read_text().split()
    return processor_seconds(main) + sum(processor_seconds(pathlib.Path(f"/proc/{child}")) for child in children)


def memory(process):
    for line in pathlib.Path(f"/proc/{process}/status").read_text().splitlines():
        if line.startswith("VmRSS:"):
            return int(line.split()[1])
    return 0


def run(context):
    desk, _ = use_desk(context)
    result = Result(cases=1)
    duration = 600 if context.full else 10
    samples = []
    with desk.Desk() as screen:
        screen.start_bus()
        screen.show(0, 0, 1280, 700)
        recording = screen.record("--keys", "all", name="cost.mp4")
        process = recording.process.pid
        begun, used = time.monotonic(), observing_seconds(process)
        while time.monotonic() < begun + duration:
            screen.xdotool("click", 1, "key", "a", *MOTIONS)  # a second
            samples.append(memory(process))
        share = 100 * (observing_seconds(process) - used) / (time.monotonic() - begun)
        code = recording.stop()
        if code != 0:
            result.failures.append(f"the recorder ends with {code}: {recording.errors()}")
    tenth = max(1, len(samples) // 10)
    early, late = statistics.median(samples[tenth:2 * tenth] or samples), statistics.median(samples[-tenth:])
    result.notes += ["| cost at 1280x720, 30 frames a second | measured | at most |",
                     f"| observing, of a core | {share:.2f} % | {MOST:.0f} % |",
                     f"| memory after {duration / 5:.0f} s | {early / 1024:.1f} MiB | |",
                     f"| memory after {duration} s | {late / 1024:.1f} MiB | {(early + GROWTH) / 1024:.1f} MiB |"]
    if share > MOST * (1 if context.full else SHARED):
        result.failures.append(f"observing takes {share:.2f} % of a core")
    if late > early + GROWTH:
        result.failures.append(f"the memory grows from {early} to {late} KiB")
    return result
