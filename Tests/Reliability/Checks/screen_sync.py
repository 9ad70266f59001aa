"""Records clicks, keys and motions, and compares the instants of their entries with the frames that show them."""

import json
import os
import random
import statistics
import sys
import time

from check import Result

ONE_FRAME = 1 / 60
SHARED = 3  # times as late the median may be in the quick form, which shares its machine with others


def use_desk(context):
    """The programs of the build, and the modules of the recorder's own tests."""
    os.environ["ZULM_RECORD"] = str(context.build / "Tools/record/zulm-record")
    os.environ["SHOWN_WINDOW"] = str(context.build / "Tests/ShownWindow")
    os.environ["ZULM"] = str(context.zulm)
    sys.path.insert(0, str(context.source / "Tests/Tools/record"))
    import desk
    import streams
    return desk, streams


def act(screen, events, pause):
    """A person who clicks, presses keys, and moves the pointer in both ways, at no steady pace."""
    for index in range(events):
        if index % 2:
            screen.xdotool("key", "a")
        else:
            screen.xdotool("click", 1)
        time.sleep(pause * random.uniform(0.3, 0.7))
        if index % 4 < 2:
            screen.xdotool("mousemove", 200 + 37 * index % 800, 300 + 23 * index % 200)
        else:
            screen.xdotool("mousemove_relative", "--", 3, -2)
        time.sleep(pause * random.uniform(0.3, 0.7))


def drawing_delays(window):
    """How long after each click and key the server had drawn its colour, in seconds and in order."""
    events = [(int(words[-1]), kind) for kind in ("button", "key") for words in window.lines(kind)]
    drawn = {int(count): float(moment) for count, moment in window.lines("drawn")}
    delays = []
    for count, (moment, _) in enumerate(sorted(events), start=1):
        later = [drawn[number] for number in sorted(drawn) if number >= count]
        delays.append((later[0] - moment % 2**32) / 1000 if later else 0)
    return delays


def latenesses(desk, streams, recording):
    """When each click and key happened, and how much later the first frame shows its colour."""
    kinds = streams.streams_of_movie(recording.output)
    x, y = kinds["topmostWindow"][0].value[:2]
    colours = [desk.colour_index(frame[:3]) for frame in desk.pixels(recording.output, (x + 600, y + 50, 2, 2))]
    times = desk.frame_times(recording.output)
    events = sorted([entry.time for entry in kinds["cursorAction"] if entry.value == 1] +
                    [entry.time for entry in kinds["keyboardAction"]])
    found = []
    frame = 0
    for count, event in enumerate(events, start=1):
        while frame < len(times) and (times[frame] < event - 3 * ONE_FRAME or colours[frame] != count % 8):
            frame += 1
        if frame == len(times):
            break
        found.append((event, times[frame] - event))
    return events, found


def moves(kinds):
    """When the pointer came to each place, with the place and the one before."""
    entries = kinds["cursorLocation"]
    return [(entry.time, before.value, entry.value) for before, entry in zip(entries, entries[1:])
            if entry.value != before.value]


def shown_moves(desk, recording, told):
    """How much later than its entry the first frame shows the marker at each place. A place that the pointer left before
    the next frame is in none."""
    left, top, width, height = area = (150, 250, 1000, 350)  # all places of `act`
    until = [when for when, _, _ in told[1:]] + [float("inf")]
    found = {}
    first = 0
    for shown, frame in zip(desk.frame_times(recording.output), desk.grey_frames(recording.output, area)):
        while first < len(told) and until[first] < shown - 3 * ONE_FRAME:
            first += 1
        for index in range(first, len(told)):
            when, (old_x, old_y), (x, y) = told[index]
            if when > shown + 3 * ONE_FRAME:
                break
            # A corner of the marker that the one at the place before does not cover.
            column = x - left + (7 if x >= old_x else -7)
            row = y - top + (7 if y >= old_y else -7)
            is_inside = 0 <= column < width and 0 <= row < height
            if index not in found and is_inside and frame[row * width + column] > 160:
                found[index] = (when, shown - when)
    return list(found.values())


def slope(points):
    """Seconds of lateness that each second adds: the median of all pairs, which single late frames do not turn."""
    slopes = [(late - earlier) / (when - before) for index, (before, earlier) in enumerate(points)
              for when, late in points[index + 1:] if when > before]
    return statistics.median(slopes) if slopes else 0


def figures(points):
    """The median, the 99th percentile, the largest, and the drift in a minute, all in milliseconds."""
    late = sorted(1000 * lateness for _, lateness in points)
    return statistics.median(late), late[int(0.99 * (len(late) - 1))], late[-1], 60000 * slope(points)


def run(context):
    desk, streams = use_desk(context)
    result = Result()
    events, pause = (600, 1.0) if context.full else (60, 0.12)
    with desk.Desk() as screen:
        window = screen.show(0, 0, 1280, 700)
        screen.xdotool("mousemove", 600, 400)
        recording = screen.record("--fps", "60", "--keys", "all", "--without-accessibility")
        act(screen, events, pause)
        if recording.stop() != 0:
            result.failures.append(recording.errors())
            return result
        told, found = latenesses(desk, streams, recording)
        moved = moves(streams.streams_of_movie(recording.output))
        shown = shown_moves(desk, recording, moved)
        delays = drawing_delays(window)
        report = json.loads(recording.json.read_text())
    result.cases = events
    result.lost = events - min(len(told), len(found))
    own = [(when, late - delay) for (when, late), delay in zip(found, delays)]
    result.notes.append(f"{report['frames']} frames in {report['duration']:.0f} s, {report['dropped']} dropped")
    result.notes.append("| picture after its entry | median | 99th percentile | largest | drift in a minute |")
    for name, points in (("as recorded", found), ("less what the window took to draw it", own),
                         (f"the marker at {len(shown)} of {len(moved)} places of the pointer", shown)):
        result.notes.append(f"| {name} | " + " | ".join(f"{value:.2f} ms" for value in figures(points)) + " |")
    if len(shown) < (0.9 if context.full else 0.5) * len(moved):
        result.failures.append(f"the marker is seen at {len(shown)} of {len(moved)} places alone")
    elif abs(figures(shown)[0]) >= 1000 * ONE_FRAME * (1 if context.full else SHARED):
        result.failures.append(f"the median of the marker is {figures(shown)[0]:.1f} ms")
    median, most, _, drift = figures(own)
    if abs(median) >= 1000 * ONE_FRAME * (1 if context.full else SHARED):
        result.failures.append(f"the median is {median:.1f} ms")
    if context.full and (most >= 2000 * ONE_FRAME or abs(drift) >= 1):
        result.failures.append(f"99th percentile {most:.1f} ms, drift {drift:.2f} ms a minute")
    return result
