"""Records clicks, keys and motions, and compares the instants of their entries with the frames that show them."""

import os
import statistics
import sys
import time

from check import Result

ONE_FRAME = 1 / 60


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
    """A person who clicks, presses keys, and moves the pointer in both ways."""
    for index in range(events):
        if index % 2:
            screen.xdotool("key", "a")
        else:
            screen.xdotool("click", 1)
        time.sleep(pause / 2)
        if index % 4 < 2:
            screen.xdotool("mousemove", 200 + index % 800, 300 + index % 200)
        else:
            screen.xdotool("mousemove_relative", "--", 3, -2)
        time.sleep(pause / 2)


def colour_index(pixel):
    if all(90 < channel < 170 for channel in pixel):
        return 7
    red, green, blue = (channel > 170 for channel in pixel)
    return red << 2 | green << 1 | blue


def latenesses(desk, streams, recording):
    """When each click and key happened, and how much later the first frame shows its colour."""
    kinds = streams.streams_of_movie(recording.output)
    x, y = kinds["topmostWindow"][0].value[:2]
    colours = [colour_index(frame[:3]) for frame in desk.pixels(recording.output, (x + 600, y + 50, 2, 2))]
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


def slope(points):
    """Seconds of lateness that each second adds."""
    middle = statistics.fmean(when for when, _ in points)
    mean = statistics.fmean(late for _, late in points)
    spread = sum((when - middle) ** 2 for when, _ in points)
    return sum((when - middle) * (late - mean) for when, late in points) / spread if spread else 0


def run(context):
    desk, streams = use_desk(context)
    result = Result()
    events, pause = (600, 1.0) if context.full else (60, 0.12)
    with desk.Desk() as screen:
        screen.show(0, 0, 1280, 700)
        screen.xdotool("mousemove", 600, 400)
        recording = screen.record("--fps", "60", "--keys", "all", "--without-accessibility")
        act(screen, events, pause)
        if recording.stop() != 0:
            result.failures.append(recording.errors())
        told, found = latenesses(desk, streams, recording)
    result.cases = events
    result.lost = events - min(len(told), len(found))
    late = sorted(lateness for _, lateness in found)
    median = statistics.median(late)
    most = late[int(0.99 * (len(late) - 1))]
    drift = 60 * slope(found)
    result.notes.append(f"picture after its entry: median {1000 * median:.1f} ms, 99th percentile {1000 * most:.1f} ms, "
                        f"drift {1000 * drift:.2f} ms a minute")
    if abs(median) >= ONE_FRAME:
        result.failures.append(f"the median, {1000 * median:.1f} ms, is not below one frame at 60 fps")
    if context.full and (most >= 2 * ONE_FRAME or abs(drift) >= 0.001):  # the quick form shares its machine
        result.failures.append(f"99th percentile {1000 * most:.1f} ms, drift {1000 * drift:.2f} ms a minute")
    return result
