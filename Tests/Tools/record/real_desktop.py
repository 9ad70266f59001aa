"""Records somebody who works with an editor and a terminal, on an X server without a screen, and checks that everything
that she did is in the streams. Usage: real_desktop.py [MOVIE]. The movie must not exist; without a name it is removed.
Ends with 77 if programs are missing or no X server can be started. The variable ZULM_RECORD names the recorder.
"""

import os
import pathlib
import re
import shutil
import struct
import sys
import textwrap

sys.path.insert(0, os.path.dirname(__file__))
from desk import PROGRAMS, Desk, probe  # noqa: E402
from streams import streams_of_folder, streams_of_movie  # noqa: E402

SCREEN = (1280, 720)
TEXT = pathlib.Path(__file__).parents[3] / "Docs/recorder.md"
NOTES = "Notes.md"
COMMAND = f"wc -w {NOTES}"
SHELL = r"""PS1='\[\e[1;32m\]desk\[\e[0m\]:\[\e[1;34m\]\w\[\e[0m\]\$ '
trap 'printf "\e]2;%s\a" "$BASH_COMMAND"' DEBUG
"""
IS_VIRTUAL, CONTROL = 0x40000000, 0x40000
LEFT_DOWN, LEFT_UP, NO_BUTTON_YET = 1, 2, 256
NOTCH = 120
LATE = 0.2  # seconds, since the server does not tell of warps. She rests for longer before and after each press
END_KEY = (35, IS_VIRTUAL)


def kept(recording):
    """The streams of a recording that still runs, as far as they are on the disk."""
    return streams_of_folder(recording.folder)


class Person:
    """Works with her mouse and keys, and notes what she does."""

    def __init__(self, desk):
        self.desk = desk
        self.place = (SCREEN[0] // 2, SCREEN[1] // 2)
        self.buttons = []  # what and where
        self.keys = []
        self.notches = []
        desk.xdotool("mousemove", *self.place)

    def move(self, x, y, steps=24):
        """Goes there smoothly. xdotool waits between the steps."""
        words = []
        begin = self.place
        for step in range(1, steps + 1):
            part = step / steps
            part = part * part * (3 - 2 * part)
            words += ["mousemove", round(begin[0] + (x - begin[0]) * part), round(begin[1] + (y - begin[1]) * part),
                      "sleep", "0.015"]
        self.desk.xdotool(*words)
        self.place = (x, y)
        self.rest()

    def rest(self):
        self.desk.xdotool("sleep", "0.25")

    def press(self):
        self.desk.xdotool("mousedown", 1)
        self.buttons.append((LEFT_DOWN, self.place))

    def release(self):
        self.desk.xdotool("mouseup", 1)
        self.buttons.append((LEFT_UP, self.place))

    def click(self, x, y):
        self.move(x, y)
        self.press()
        self.release()
        self.rest()

    def drag(self, start, end):
        self.move(*start)
        self.press()
        self.rest()
        self.move(*end)
        self.release()
        self.rest()

    def scroll(self, down, up):
        for button, count, delta in ((5, down, -NOTCH), (4, up, NOTCH)):
            self.desk.xdotool("click", "--repeat", count, "--delay", 90, button)
            self.notches += [(0, delta)] * count

    def type(self, text):
        self.desk.xdotool("type", "--delay", 120, text)
        self.keys += [(ord(character), 0) for character in text]

    def type_unseen(self, text):
        """Types into a program that tells the accessibility bus nothing."""
        self.desk.xdotool("type", "--delay", 120, text)

    def shortcut(self, letter):
        self.desk.xdotool("key", f"ctrl+{letter}")
        self.keys.append((ord(letter.upper()), IS_VIRTUAL | CONTROL))
        self.rest()


class Scene:
    """The windows on the desk."""

    def __init__(self, desk):
        self.desk = desk
        desk.start_bus()
        desk.environment.update(XCURSOR_THEME="Adwaita", GTK_OVERLAY_SCROLLING="0")
        paragraphs = [paragraph for paragraph in TEXT.read_text(encoding="utf-8").split("\n\n") if paragraph[0] != "|"]
        lines = "\n\n".join(textwrap.fill(paragraph, 60) for paragraph in paragraphs)
        (desk.folder / NOTES).write_text(lines + "\n", encoding="utf-8")
        (desk.folder / "shell.rc").write_text(SHELL, encoding="utf-8")
        desk.run("xset", "r", "off")  # on a busy machine a key seems to be held
        desk.run("xsetroot", "-solid", "#2d4a6b", "-cursor_name", "left_ptr")
        self.terminal = self.open(["xterm", "-T", "Terminal", "-fa", "DejaVu Sans Mono", "-fs", "11", "-bg", "#10151f",
                                   "-fg", "#d5dbe6", "-e", "bash", "--rcfile", "shell.rc"], "XTerm")
        self.arrange(self.terminal, 660, 400, 560, 260)
        self.editor = self.open(["l3afpad", NOTES], "L3afpad")
        self.arrange(self.editor, 60, 50, 800, 560)
        self.wait_active(self.editor)

    def open(self, command, name):
        self.desk.start(command)
        found = self.desk.xdotool("search", "--sync", "--onlyvisible", "--class", f"^{name}$").split()
        return int(found[-1])

    def arrange(self, window, x, y, width, height):
        """The manager may still be placing a new window, so this asks again until it is there."""
        self.desk.wait_for(lambda: self.title(window))

        def is_there():
            self.desk.xdotool("windowmove", window, x, y, "windowsize", window, width, height)
            place = self.place(window)
            return abs(place[0] - x) + abs(place[1] - y) < 80 and abs(place[2] - width) + abs(place[3] - height) < 40
        self.desk.wait_for(is_there)

    def place(self, window):
        """The window without its frame."""
        text = self.desk.run("xwininfo", "-id", str(window))
        names = ("Absolute upper-left X", "Absolute upper-left Y", "Width", "Height")
        found = [re.search(rf"{name}: +(-?\d+)", text) for name in names]
        return tuple(int(match.group(1)) if match else 0 for match in found)

    def title(self, window):
        return self.desk.xdotool("getwindowname", window).strip()

    def active(self):
        return self.desk.xdotool("getactivewindow").strip()

    def wait_active(self, window):
        self.desk.wait_for(lambda: self.active() == str(window))

    def wait_title(self, window, holds):
        self.desk.wait_for(lambda: holds(self.title(window)))


def wait_until_keys_are_recorded(desk, recording):
    """Presses End until it is in the stream. What is typed while the focus is unknown is left out."""
    def count():
        return sum(entry.value == END_KEY for entry in kept(recording).get("keyboardAction", []))
    before = count()

    def is_recorded():
        desk.xdotool("key", "End", "sleep", "0.6")
        return count() > before
    desk.wait_for(is_recorded)


def wait_until_hover_is_recorded(desk, person, recording):
    """Rests until the last rectangle is a small one with the pointer in it."""
    def is_recorded():
        areas = kept(recording).get("hoverRect", [])
        x, y, width, height = areas[-1].value if areas else (0, 0, 0, 0)
        return x <= person.place[0] < x + width and y <= person.place[1] < y + height and height < 50
    desk.wait_for(is_recorded)


def work(desk, scene, person, recording):
    """About 15 seconds on a machine with nothing else to do."""
    x, y, width, height = scene.place(scene.editor)
    for menu in (20, 110, 170):
        person.move(x + menu, y + 12)
    wait_until_hover_is_recorded(desk, person, recording)
    person.click(x + 120, y + 92)  # into the text
    wait_until_keys_are_recorded(desk, recording)
    person.type(" on a real desktop")
    scene.wait_title(scene.editor, lambda title: title.startswith("*"))
    person.shortcut("s")
    scene.wait_title(scene.editor, lambda title: not title.startswith("*"))
    person.move(x + 330, y + 210)
    person.scroll(7, 7)
    person.drag((x + 60, y + 110), (x + 420, y + 150))
    person.shortcut("c")

    place = scene.place(scene.terminal)
    person.click(place[0] + place[2] - 60, place[1] + place[3] - 30)
    scene.wait_active(scene.terminal)
    person.type_unseen(COMMAND + "\n")
    scene.wait_title(scene.terminal, lambda title: title == COMMAND)
    person.drag((place[0] + 200, place[1] - 8), (place[0] + 160, place[1] - 128))  # by its title
    desk.wait_for(lambda: scene.place(scene.terminal) != place)

    person.click(x + 250, y + height - 40)
    scene.wait_active(scene.editor)
    wait_until_keys_are_recorded(desk, recording)
    person.type("Done.")
    person.shortcut("s")
    scene.wait_title(scene.editor, lambda title: not title.startswith("*"))
    person.move(x + width - 200, y + 40)


class Check:
    """Compares the streams with what was done, and says what differs."""

    def __init__(self, streams):
        self.streams = streams
        self.failures = []

    def expect(self, holds, kind, text):
        if not holds:
            self.failures.append(f"{kind}: {text}")

    def values(self, kind):
        return [entry.value for entry in self.streams.get(kind, [])]

    def at(self, kind, time):
        """What holds at a time."""
        return [entry.value for entry in self.streams[kind] if entry.time <= time][-1]

    def in_order(self, kind, expected):
        rest = iter(self.values(kind))
        for value in expected:
            self.expect(any(value == other for other in rest), kind,
                        f"'{value}' is not in its place in {self.values(kind)}")

    def person(self, person):
        actions = [entry for entry in self.streams["cursorAction"] if entry.value != NO_BUTTON_YET]
        seen = [(entry.value, self.at("cursorLocation", entry.time + LATE)) for entry in actions]
        self.expect(seen == person.buttons, "cursorAction", f"{seen} is not {person.buttons}")
        self.expect(self.values("scrollAction") == person.notches, "scrollAction", f"{self.values('scrollAction')}")
        keys = [value for value in self.values("keyboardAction") if value != END_KEY]
        self.expect(keys == person.keys, "keyboardAction", f"{keys} is not {person.keys}")

    def windows(self):
        self.in_order("topmostAppName", ["L3afpad", "XTerm", "L3afpad"])
        titles = [value for value in self.values("topmostWindowTitle") if NOTES in value]
        self.in_order("topmostWindowTitle", [titles[0], "*" + titles[0], titles[0], "Terminal", COMMAND, titles[0]])
        # No window is active between two, and both changes may be of the same millisecond.
        areas = [self.at("topmostWindow", entry.time) for entry in self.streams["topmostWindow"]
                 if self.at("topmostAppName", entry.time) == "XTerm"]
        self.expect(len(areas) > 1 and areas[-1][:2] == (areas[0][0] - 40, areas[0][1] - 120), "topmostWindow", areas)

    def cursors(self):
        images = self.values("cursorImage")
        numbers = {struct.unpack_from("<q", image, 8)[0] for image in images}
        pictures = [image for image in images if b"\x89PNG" in image]
        self.expect(len(numbers) > 1 and len(pictures) >= len(numbers) - 1, "cursorImage",
                    f"{len(numbers)} cursors, {len(pictures)} pictures")
        opacities = self.values("cursorOpacity")
        self.expect(opacities[:3] == [1, 0, 1], "cursorOpacity", f"typing does not hide the cursor: {opacities}")

    def machine(self, duration):
        self.expect(self.values("recordingRegion") == [(0, 0, *SCREEN)], "recordingRegion", "is not the screen")
        self.expect(self.values("recordingScaleFactor") == [1], "recordingScaleFactor", "is not 1")
        self.expect(len(self.values("systemData")) == 1, "systemData", "is not there once")
        usage = self.values("cpuUsage")
        self.expect(duration / 2 <= len(usage) <= duration + 1 and all(0 <= value <= 100 for value in usage) and
                    any(usage), "cpuUsage", f"{usage}")

    def hovering(self):
        """The rectangles that the editor told are parts of its window."""
        areas = [entry for entry in self.streams["hoverRect"] if any(entry.value)]
        screen = SCREEN[0] * SCREEN[1]
        self.expect(len({area.value for area in areas}) > 2, "hoverRect", f"{areas}")
        self.expect(any(area.value[2] * area.value[3] < screen / 50 for area in areas), "hoverRect",
                    f"no small part of a window in {areas}")

    def times(self, duration):
        for kind, entries in self.streams.items():
            times = [struct.unpack_from("<d", entry.value)[0] if kind == "cursorImage" else entry.time
                     for entry in entries]
            self.expect(times == sorted(times) and 0 <= times[0] and times[-1] <= duration, kind,
                        f"its times {times} are not those of the movie")


def failures_of(movie, person):
    streams = streams_of_movie(movie)
    check = Check(streams)
    duration = float(probe(movie, "-show_entries", "format=duration")[0])
    expected = {"cursorAction", "cursorImage", "cursorLocation", "cursorOpacity", "keyboardAction", "recordingRegion",
                "topmostWindow", "recordingScaleFactor", "systemData", "scrollAction", "topmostAppName",
                "topmostWindowTitle", "cpuUsage", "hoverRect"}
    if set(streams) != expected:  # slides are what the host of a presentation knows
        return [f"the kinds are not {sorted(expected)} but {sorted(streams)}"]
    check.times(duration)
    check.person(person)
    check.windows()
    check.cursors()
    check.hovering()
    check.machine(duration)
    return check.failures


def missing_programs():
    missing = [] if PROGRAMS["recorder"] else ["zulm-record, whose libraries 'scripts/install.sh record' installs"]
    programs = ("Xvfb", "openbox", "xdotool", "xprop", "xwininfo", "xset", "xsetroot", "xterm", "l3afpad",
                "dbus-daemon", "ffprobe")
    return missing + [name for name in programs if not shutil.which(name)]


def record(desk, name):
    scene = Scene(desk)
    person = Person(desk)
    recording = desk.record_with_bus("all", name)
    work(desk, scene, person, recording)
    code = recording.stop()
    if code != 0:
        sys.exit(f"the recorder ended with {code}: {recording.errors()}")
    failures = failures_of(recording.output, person)
    if failures:
        sys.exit("\n".join(failures))
    print(f"In the streams, in order and in their places: {len(person.buttons)} presses and releases of a button, "
          f"{len(person.notches)} notches of the wheel, {len(person.keys)} keys, the titles and applications of "
          "both windows, and no key of the terminal.")


def main():
    if missing_programs():
        print("there is no " + ", no ".join(missing_programs()))
        sys.exit(77)
    movie = pathlib.Path(sys.argv[1]).absolute() if len(sys.argv) > 1 else None
    try:
        opened = Desk(size=f"{SCREEN[0]}x{SCREEN[1]}x24")
    except (OSError, RuntimeError) as error:
        print(f"no X server can be started: {error}")
        sys.exit(77)
    with opened as desk:
        record(desk, movie or "out.mp4")


if __name__ == "__main__":
    main()
