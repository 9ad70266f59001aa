"""What the recorder promises, seen from outside: an X server without a screen, a person made of xdotool, and a window
that shows what happens to it. Streams are read by streams.py, pictures by ffmpeg."""

import contextlib
import fcntl
import json
import os
import pathlib
import pty
import shutil
import signal
import socket
import statistics
import struct
import subprocess
import sys
import tempfile
import termios
import time
import unittest

sys.path.insert(0, os.path.dirname(__file__))
from desk import PROGRAMS, Desk, colour_index, end, frame_times, pixels, probe, processes_of  # noqa: E402
from streams import atoms_of, streams_of_folder, streams_of_movie  # noqa: E402

IS_VIRTUAL = 0x40000000
SHIFT, CONTROL, ALT, SUPER, CAPS = 0x20000, 0x40000, 0x80000, 0x80000000, 0x10000
ALL_KEYS = ("--keys", "all", "--without-accessibility")


class Test(unittest.TestCase):
    def recorded(self, recording, code=0):
        """Ends a recording that ends well, and returns its streams."""
        self.assertEqual(recording.stop(), code, recording.errors())
        self.assertFalse(recording.folder.exists())
        return streams_of_movie(recording.output)

    def assert_near(self, value, expected, tolerance):
        self.assertLessEqual(abs(value - expected), tolerance, f"{value} is not {expected}")


class Files(Test):
    def test_duration_makes_an_ordinary_movie_with_every_tick(self):
        with Desk() as desk:
            desk.show()
            recording = desk.record("--duration", "2")
            self.assertEqual(os.stat(recording.folder).st_mode & 0o777, 0o700)
            self.assertTrue((recording.folder / "movie.mp4").exists())
            self.assertEqual(recording.process.wait(30), 0)
            document = json.loads(recording.json.read_text())
            times = frame_times(recording.output)
            schema = pathlib.Path(__file__).parents[3] / "Docs/schemas/zulm.record.schema.json"
            self.assertEqual(list(document), json.loads(schema.read_text())["required"])
            self.assertEqual(document["schema"], "zulm.record")
            self.assertEqual(document["stopped_by"], "duration")
            self.assertEqual(document["movie"], str(recording.output))
            self.assertIsNone(document["folder"])
            self.assertEqual(document["frames"], len(times))
            self.assertEqual(document["frames"] + document["dropped"], 60)
            self.assertEqual(times[0], 0)
            self.assertEqual(times, sorted(set(times)))
            self.assert_near(document["duration"], 2, 0.001)
            self.assert_near(float(probe(recording.output, "-show_entries", "format=duration")[0]), 2, 0.001)
            self.assertEqual(probe(recording.output, "-show_entries", "stream=time_base")[0], "1/90000")
            data = recording.output.read_bytes()
            names = [name for name, _, _ in atoms_of(data)]
            self.assertEqual(names.count("moov"), 1)
            self.assertNotIn("moof", names)
            self.assertEqual(names[-2:], ["ZULM", "ZULR"])
            for name, start, _ in atoms_of(data):
                if name == "moov":
                    scale = struct.unpack_from(">I", data, start + 8 + 12)[0]
                    self.assertGreaterEqual(scale, 90000)
            self.assertFalse(recording.folder.exists())
            self.assertEqual(os.listdir(desk.folder).count("out.mp4"), 1)
            if PROGRAMS["zulm"]:
                self.assertEqual(subprocess.run([PROGRAMS["zulm"], "verify", recording.output], check=False,
                                                capture_output=True).returncode, 0)

    def test_what_holds_at_the_start_is_written_at_0(self):
        with Desk() as desk:
            window = desk.show()
            desk.xdotool("mousemove", 640, 400)
            streams = self.recorded(desk.record("--region", "11,13,801x601"))
            self.assertEqual(streams["recordingRegion"][0].value, (11, 13, 800, 600))
            self.assertEqual(streams["cursorLocation"][0].value, (640, 400))
            self.assertEqual(streams["topmostWindowTitle"][0].value, "Shown Window")
            self.assertEqual(streams["topmostAppName"][0].value, "ShownWindow")
            self.assertEqual(streams["cursorOpacity"][0].value, 1)
            self.assertEqual(streams["recordingScaleFactor"][0].value, 1)
            self.assertEqual(streams["cursorAction"][0].value, 256)
            for kind in ("cursorLocation", "cursorImage", "cursorAction", "cursorOpacity", "recordingRegion",
                         "recordingScaleFactor", "systemData", "topmostWindow", "topmostWindowTitle", "topmostAppName",
                         "hoverRect"):
                self.assertEqual(struct.unpack_from("<d", streams[kind][0].value)[0]
                                 if kind == "cursorImage" else streams[kind][0].time, 0, kind)
            outer = streams["topmostWindow"][0].value
            self.assertTrue(outer[2] > 800 and outer[3] > 500, f"{outer} has no frame of window {window.id}")

    def test_only_the_user_may_read_it(self):
        with Desk(manager=None) as desk:
            recording = desk.record(*ALL_KEYS)
            modes = {path.name: os.stat(path).st_mode & 0o777 for path in recording.folder.iterdir()}
            self.assertIn("cursorLocation.dat", modes)
            self.assertEqual(set(modes.values()), {0o600}, modes)
            limits = pathlib.Path(f"/proc/{recording.process.pid}/limits").read_text(encoding="utf-8")
            self.assertRegex(limits, r"Max core file size +1 +1 ")  # with 0, programs that collect crashes get them
            self.recorded(recording)
            self.assertEqual(os.stat(recording.output).st_mode & 0o777, 0o600)

    def test_another_codec(self):
        with Desk(manager=None) as desk:
            self.recorded(desk.record("--codec", "libx265", "--region", "0,0,160x120"))
            self.assertEqual(probe(desk.folder / "out.mp4", "-select_streams", "v", "-show_entries",
                                   "stream=codec_name"), ["hevc"])

    def test_the_scale_is_that_of_texts(self):
        with Desk(manager=None) as desk:
            resources = desk.folder / "resources"
            for dots, scale in (("192", 2), ("nan", 1), ("1e300", 100)):
                resources.write_text(f"Xft.dpi: {dots}\n", encoding="utf-8")
                desk.run("xrdb", "-nocpp", "-load", resources)
                streams = self.recorded(desk.record(name=f"{dots}.mp4"))
                self.assertEqual([entry.value for entry in streams["recordingScaleFactor"]], [scale], dots)

    def test_what_exists_is_never_replaced(self):
        with Desk(manager=None) as desk:
            output = desk.folder / "out.mp4"
            output.write_text("mine")
            recording = desk.record(wait=False)
            self.assertEqual(recording.process.wait(20), 2)
            self.assertEqual(output.read_text(), "mine")
            self.assertFalse(recording.folder.exists())
            output.unlink()
            recording.folder.mkdir()
            self.assertEqual(desk.record(wait=False).process.wait(20), 2)
            self.assertEqual(list(recording.folder.iterdir()), [])

    def test_a_movie_that_appears_meanwhile_is_never_replaced(self):
        with Desk(manager=None) as desk:
            recording = desk.record()
            recording.output.write_text("mine", encoding="utf-8")
            self.assertEqual(recording.stop(), 3)
            self.assertEqual(recording.output.read_text(encoding="utf-8"), "mine")
            self.assertEqual(recording.errors().splitlines()[-1], str(recording.folder))
            document = json.loads(recording.json.read_text())
            self.assertEqual((document["movie"], document["folder"]), (None, str(recording.folder)))
            other = desk.folder / "other.mp4"
            result = subprocess.run([PROGRAMS["recorder"], "--recover", recording.folder, "-o", other], check=False,
                                    capture_output=True)
            self.assertEqual(result.returncode, 0, result.stderr)
            self.assertEqual(len(frame_times(other)), document["frames"])

    def test_nothing_is_written_elsewhere(self):
        """The desk's folder is the home, the runtime and the working folder."""
        with Desk(manager=None) as desk:
            temporary = desk.folder / "temporary"
            temporary.mkdir()
            desk.environment["TMPDIR"] = str(temporary)
            before = set(os.listdir(desk.folder))
            recording = desk.record(*ALL_KEYS)
            own = {recording.log.name, recording.json.name}
            self.assertEqual(set(os.listdir(desk.folder)) - before - own,
                             {recording.folder.name, recording.socket().name})
            self.recorded(recording)
            self.assertEqual(set(os.listdir(desk.folder)) - before - own, {recording.output.name})
            self.assertEqual(os.listdir(temporary), [])

    def test_refusals_create_nothing(self):
        with Desk(manager=None) as desk:
            before = set(os.listdir(desk.folder))
            for options in (["--fps", "0"], ["--fps", "61"], ["--region", "0,0,9999x10"], ["--region", "x"],
                            ["--keys", "some"], ["--display", ":987"], ["--monitor", "none"], ["--window", "none"],
                            ["--codec", "none"], ["--deny-title", "("], ["--stop-on-close"], ["--nonsense"],
                            ["--duration", "-1"], ["--keys", "all"], ["--codec", "mpeg4"],  # whose times are coarser
                            ["--region", "2147483640,0,10x10"]):
                result = subprocess.run([PROGRAMS["recorder"], "-o", desk.folder / "no.mp4", *options], check=False,
                                        env=desk.environment, capture_output=True, timeout=30)
                self.assertEqual(result.returncode, 2, (options, result.stderr))
                self.assertNotEqual(result.stderr, b"", options)
            self.assertEqual(set(os.listdir(desk.folder)), before)

    def test_a_second_signal_ends_at_once_and_keeps_the_folder(self):
        with Desk(manager=None) as desk:
            recording = desk.record("--fps", "60")
            time.sleep(1)
            recording.process.send_signal(signal.SIGSTOP)
            recording.process.send_signal(signal.SIGINT)
            recording.process.send_signal(signal.SIGTERM)
            recording.process.send_signal(signal.SIGCONT)
            self.assertEqual(recording.process.wait(30), 128 + signal.SIGTERM)  # SIGINT has the lower number
            self.assertEqual(recording.errors().splitlines()[-1], str(recording.folder))
            self.assertTrue(recording.folder.exists())
            self.assertFalse(recording.output.exists())


    def test_a_second_signal_ends_it_though_the_display_hangs(self):
        """The first one ends the recording, which waits for the picture that it has asked for. It has several attempts,
        since it may not have asked for one yet."""
        with Desk(manager=None) as desk:
            for attempt in range(5):
                recording = desk.record(name=f"{attempt}.mp4")
                desk.server.send_signal(signal.SIGSTOP)
                time.sleep(0.5)
                recording.process.send_signal(signal.SIGTERM)
                time.sleep(0.5)
                if recording.process.poll() is None:
                    break
                desk.server.send_signal(signal.SIGCONT)
            recording.process.send_signal(signal.SIGINT)
            self.assertEqual(recording.process.wait(30), 128 + signal.SIGINT)
            desk.server.send_signal(signal.SIGCONT)
            self.assertEqual(recording.errors().splitlines()[-1], str(recording.folder))
            self.assertTrue(recording.folder.exists())
            self.assertFalse(recording.output.exists())


class Picture(Test):
    def test_picture_and_streams_are_of_one_time(self):
        """Clicks and keys change the colour of the window. No frame shows one before its entry; how soon one does is
        measured on a machine at rest, by the reliability checks."""
        with Desk() as desk:
            window = desk.show(0, 0, 1280, 700)
            desk.xdotool("mousemove", 600, 400)
            recording = desk.record("--fps", "60", *ALL_KEYS, "--quality", "23")
            for index in range(30):
                desk.xdotool("key", "a") if index % 2 else desk.xdotool("click", 1)
                time.sleep(0.03)
                desk.xdotool("mousemove", 200 + 30 * index, 300 + 5 * index)
                time.sleep(0.06)
            streams = self.recorded(recording)
            times = frame_times(recording.output)
            top = streams["topmostWindow"][0].value
            strip = pixels(recording.output, (top[0] + 600, top[1] + 50, 2, 2))
            events = sorted([entry.time for entry in streams["cursorAction"] if entry.value == 1] +
                            [entry.time for entry in streams["keyboardAction"]])
            self.assertEqual(len(events), 30)
            colours = [colour_index(frame[:3]) for frame in strip]
            late = []
            for count, event in enumerate(events, start=1):
                shown = [time for time, colour in zip(times, colours) if colour == count % 8 and time >= event - 0.05]
                self.assertTrue(shown, f"event {count} is in no frame")
                late.append(min(shown) - event)
            print(f"picture after events: median {1000 * statistics.median(late):.1f} ms, "
                  f"largest {1000 * max(late):.1f} ms")
            self.assertGreater(min(late), -0.017)
            self.assertEqual(len(window.lines("button")) + len(window.lines("key")), 30)


    def colour_of_strip(self, recording, place):
        return [colour_index(frame[:3]) for frame in pixels(recording.output, (*place, 2, 2))]

    def test_a_window_is_recorded_though_others_cover_it(self):
        with Desk() as desk:
            window = desk.show(200, 100, 400, 300)
            desk.xdotool("mousemove", 400, 300, "click", 1)
            recording = desk.record("--window", str(window.id))
            desk.show(0, 0, 1280, 720, managed=False)
            desk.xdotool("mousemove", 800, 600, "click", 1, "click", 1)
            time.sleep(0.5)
            streams = self.recorded(recording)
            region = streams["recordingRegion"][0].value
            self.assertTrue(region[0] <= 200 and region[2] in range(400, 500), region)
            strip = (200 - region[0] + 200, region[3] - 300 + 20)
            colours = self.colour_of_strip(recording, strip)
            self.assertEqual(set(colours), {1}, "what covers the window is in its picture")

    def test_a_window_that_was_hidden_is_recorded_on(self):
        with Desk(manager=None) as desk:
            window = desk.show(100, 100, 400, 300, managed=False)
            desk.xdotool("mousemove", 200, 250)
            recording = desk.record("--window", str(window.id))
            for line, seconds in (("unmap", 0.5), ("map", 2)):
                time.sleep(seconds)
                window.tell(line)
            time.sleep(0.5)
            desk.xdotool("click", 1)
            desk.wait_for(lambda: window.lines("button"))
            time.sleep(0.5)
            self.recorded(recording)
            colours = self.colour_of_strip(recording, (100, 20))
            self.assertEqual((colours[0], colours[-1]), (0, 1))
            times = frame_times(recording.output)
            gaps = [after - before for before, after in zip(times, times[1:])]
            self.assertLess(max(gaps), 1.5)  # it was hidden for 2 s

    def test_the_window_that_is_clicked(self):
        """A click that comes before the recorder waits for one goes to the window, so there are several attempts."""
        with Desk() as desk:
            desk.show(200, 100, 400, 300)
            desk.show(700, 100, 300, 200)
            desk.xdotool("mousemove", 400, 300)
            recording = desk.record("--window", "click", "--without-accessibility", wait=False)

            def is_recording():
                desk.xdotool("click", 1)
                time.sleep(0.5)
                return "recording " in recording.errors()

            desk.wait_for(is_recording)
            streams = self.recorded(recording)
            x, y, width, height = streams["recordingRegion"][0].value
            self.assertTrue(x <= 200 and y <= 100 and x + width in range(600, 640) and y + height in range(400, 440),
                            streams["recordingRegion"])

    def test_a_screen_that_becomes_smaller_is_recorded_on(self):
        if not shutil.which("xrandr"):
            self.skipTest("there is no xrandr")
        with Desk(manager=None) as desk:
            window = desk.show(0, 0, 300, 200, managed=False)
            recording = desk.record()
            time.sleep(0.5)
            sides = [number for side in (640, 480) for number in 4 * [str(side)]]
            desk.run("xrandr", "--newmode", "small", "25", *sides)
            desk.run("xrandr", "--addmode", "screen", "small")
            desk.run("xrandr", "--output", "screen", "--mode", "small")
            if "current 640 x 480" not in desk.run("xrandr"):
                self.skipTest("this server has a screen of one size")
            time.sleep(0.5)
            desk.xdotool("mousemove", 100, 150, "click", 1)
            desk.wait_for(lambda: window.lines("button"))
            time.sleep(1)
            streams = self.recorded(recording)
            self.assertEqual(streams["recordingRegion"][-1].value, (0, 0, 1280, 720))
            colours = self.colour_of_strip(recording, (200, 20))
            self.assertEqual((colours[0], colours[-1]), (0, 1))
            self.assertLess(max(pixels(recording.output, (1000, 600, 2, 2))[-1]), 16)

    def test_one_monitor(self):
        if not shutil.which("xrandr"):
            self.skipTest("there is no xrandr")
        with Desk(manager=None) as desk:
            desk.run("xrandr", "--setmonitor", "left", "641/300x480/200+100+50", "none")
            streams = self.recorded(desk.record("--monitor", "left"))
            self.assertEqual(streams["recordingRegion"][0].value, (100, 50, 640, 480))
            self.assertEqual(probe(desk.folder / "out.mp4", "-select_streams", "v", "-show_entries",
                                   "stream=width,height"), ["640,480"])

    def test_a_window_that_becomes_smaller_is_recorded_on(self):
        for server in ([], ["-extension", "MIT-SHM"]):
            with Desk(manager=None, server=server) as desk:
                window = desk.show(100, 100, 400, 300, managed=False)
                desk.xdotool("mousemove", 200, 250, "click", 1)
                recording = desk.record("--window", str(window.id))
                window.tell("resize 203 151")
                time.sleep(0.5)
                desk.xdotool("click", 1)
                time.sleep(0.5)
                self.recorded(recording)
                document = json.loads(recording.json.read_text())
                self.assertLess(document["dropped"], document["frames"])
                self.assertEqual(self.colour_of_strip(recording, (100, 20))[-1], 2)
                self.assertEqual(pixels(recording.output, (100, 100, 2, 2))[-1][0] // 16, 4)  # its background
                self.assertLess(max(pixels(recording.output, (300, 200, 2, 2))[-1]), 16)

    def test_pictures_come_without_shared_memory_too(self):
        with Desk(server=["-extension", "MIT-SHM"]) as desk:
            desk.show(0, 0, 1280, 700)
            desk.xdotool("mousemove", 600, 400)
            recording = desk.record()
            time.sleep(0.5)
            desk.xdotool("click", 1)
            time.sleep(0.5)
            streams = self.recorded(recording)
            x, y = streams["topmostWindow"][0].value[:2]
            colours = self.colour_of_strip(recording, (x + 600, y + 50))
            self.assertEqual((colours[0], colours[-1]), (0, 1))
            self.assertEqual(streams["cursorLocation"][0].value, (600, 400))


class Sound(Test):
    def test_what_is_heard_is_in_the_movie_at_its_time(self):
        if missing := [name for name in ("pulseaudio", "pactl") if not shutil.which(name)]:
            self.skipTest(f"there is no {missing[0]}")
        with Desk() as desk:
            window = desk.show(0, 0, 1280, 700)
            desk.start_sound()
            desk.xdotool("mousemove", 600, 400)
            recording = desk.record("--audio", "desk.monitor")
            desk.xdotool("click", 1)
            tone = pathlib.Path(__file__).with_name("tone.py")
            heard = float(desk.run(sys.executable, str(tone), "2"))
            streams = self.recorded(recording)
            click = [entry.time for entry in streams["cursorAction"] if entry.value == 1][0]
            zero = int(window.lines("button")[0][1]) / 1000 - click
            sound = subprocess.run(["ffmpeg", "-v", "error", "-i", recording.output, "-map", "a", "-f", "f32le", "-ac",
                                    "1", "-ar", "48000", "-"], capture_output=True, check=True, timeout=60).stdout
            samples = struct.unpack(f"<{len(sound) // 4}f", sound)
            loud = [index for index, sample in enumerate(samples) if abs(sample) > 0.1]
            self.assertTrue(loud, "the movie is silent")
            late = loud[0] / 48000 - (heard - zero)
            print(f"sound after its time: {1000 * late:.1f} ms")
            self.assert_near((loud[-1] - loud[0]) / 48000, 1, 0.5)  # who plays it may come too late
            self.assert_near(late, 0, 0.1)
            length = json.loads(recording.json.read_text())["duration"]
            self.assert_near(len(samples) / 48000, length, 0.25)

    def test_a_source_that_is_not_there_is_refused(self):
        with Desk(manager=None) as desk:
            recording = desk.record("--audio", "nothing", wait=False)
            self.assertEqual(recording.process.wait(30), 2)
            self.assertFalse(recording.folder.exists())


class Pointer(Test):
    def test_positions_are_those_of_the_server(self):
        with Desk() as desk:
            desk.show()
            desk.xdotool("mousemove", 300, 300)
            recording = desk.record()
            time.sleep(0.3)
            path = [(320 + 20 * index, 300 + 7 * index) for index in range(20)]
            for x, y in path:  # these warp
                desk.xdotool("mousemove", x, y)
                time.sleep(0.06)
            for _ in range(20):  # these are motions
                desk.xdotool("mousemove_relative", "--", -5, 3)
                time.sleep(0.03)
                path.append((path[-1][0] - 5, path[-1][1] + 3))
            positions = self.recorded(recording)["cursorLocation"]
            seen = [entry.value for index, entry in enumerate(positions)
                    if index == 0 or entry.value != positions[index - 1].value]
            self.assertEqual(seen, [(300, 300), *path])
            for before, entry in zip(positions, positions[1:]):  # nobody interpolates across a rest
                if entry.value != before.value:
                    self.assertLess(entry.time - before.time, 0.034)

    def test_buttons_and_modifiers(self):
        with Desk() as desk:
            desk.show()
            desk.xdotool("mousemove", 600, 400)
            recording = desk.record()
            desk.xdotool("click", 1)
            desk.xdotool("keydown", "shift", "keydown", "ctrl", "click", 3, "keyup", "ctrl", "keyup", "shift")
            desk.xdotool("keydown", "alt", "click", 2, "keyup", "alt")
            desk.xdotool("keydown", "super", "mousedown", 1, "keyup", "super", "mouseup", 1)
            desk.xdotool("click", 8)
            actions = [entry.value for entry in self.recorded(recording)["cursorAction"]]
            self.assertEqual(actions, [256, 1, 2, 4 + 16 + 32, 8 + 16 + 32, 16, 32, 1 + 128, 2])

    def test_a_notch_of_the_wheel_is_120(self):
        with Desk() as desk:
            desk.show()
            desk.xdotool("mousemove", 600, 400)
            recording = desk.record()
            for button in (4, 4, 5, 6, 7):
                desk.xdotool("click", button)
            streams = self.recorded(recording)
            self.assertEqual([entry.value for entry in streams["scrollAction"]],
                             [(0, 120), (0, 120), (0, -120), (120, 0), (-120, 0)])
            self.assertEqual([entry.value for entry in streams["cursorAction"]], [256])

    def test_cursors_are_told_apart_by_their_look(self):
        with Desk() as desk:
            window = desk.show()
            desk.xdotool("mousemove", 600, 400)
            window.tell("cursor 34")
            time.sleep(0.2)
            recording = desk.record()
            for line in ("cursor 60", "cursor 34", "blank", "cursor 60"):
                window.tell(line)
                time.sleep(0.3)
            streams = self.recorded(recording)
            entries = [entry.value for entry in streams["cursorImage"]]
            numbers = [struct.unpack_from("<Q", entry, 8)[0] for entry in entries]
            sizes = [struct.unpack_from("<I", entry, 20)[0] for entry in entries]
            self.assertEqual(numbers, [numbers[0], numbers[1], numbers[0], numbers[3], numbers[1]])
            self.assertEqual(len(set(numbers)), 3)
            self.assertEqual([size > 0 for size in sizes], [True, True, False, True, False])
            self.assertEqual(struct.unpack_from("<2i", entries[3], 24), (3, 4))
            self.assertEqual([entry.value for entry in streams["cursorOpacity"]], [1, 0, 1])


    def test_a_cursor_that_another_program_hides_has_no_opacity(self):
        with Desk() as desk:
            window = desk.show()
            desk.xdotool("mousemove", 600, 400)
            recording = desk.record()
            for line in ("hide", "hide", "show", "show"):  # it is hidden as long as it was hidden more often than shown
                window.tell(line)
                time.sleep(0.2)
            window.tell("hide")
            time.sleep(0.2)
            window.tell("close")  # whoever hides it and ends shows it again
            time.sleep(0.2)
            opacities = self.recorded(recording)["cursorOpacity"]
            self.assertEqual([entry.value for entry in opacities], [1, 0, 1, 0, 1])
            self.assertGreater(opacities[2].time - opacities[1].time, 0.35)


class Keys(Test):
    def keys(self, desk, options, press, window=True):
        if window:
            desk.show()
        recording = desk.record(*options)
        press()
        return [entry.value for entry in self.recorded(recording)["keyboardAction"]]

    def test_all_keys_are_what_they_type(self):
        with Desk() as desk:
            def press():
                desk.xdotool("key", "a", "A", "1", "exclam", "space", "Return", "F8", "shift+F8", "Left")
                desk.xdotool("key", "ctrl+a", "ctrl+shift+a", "ctrl+1", "ctrl+minus", "alt+Tab", "super+x")
                desk.xdotool("key", "Caps_Lock", "b", "1", "Caps_Lock")
                desk.xdotool("key", "shift", "ctrl")
            self.assertEqual(self.keys(desk, ALL_KEYS, press), [
                (ord("a"), 0), (ord("A"), 0), (ord("1"), 0), (ord("!"), 0), (32, 0), (13, IS_VIRTUAL),
                (119, IS_VIRTUAL), (119, IS_VIRTUAL | SHIFT), (37, IS_VIRTUAL),
                (ord("A"), IS_VIRTUAL | CONTROL), (ord("A"), IS_VIRTUAL | CONTROL | SHIFT),
                (ord("1"), IS_VIRTUAL | CONTROL), (ord("-"), CONTROL), (9, IS_VIRTUAL | ALT),
                (ord("X"), IS_VIRTUAL | SUPER), (ord("B"), 0), (ord("1"), CAPS)])

    def test_dead_keys_and_groups(self):
        with Desk(layout=["-layout", "de"]) as desk:
            desk.show()
            recording = desk.record(*ALL_KEYS)
            codes = {"dead_acute": 21, "e": 26, "q": 24, "ssharp": 20}
            desk.xdotool("key", codes["dead_acute"])
            desk.xdotool("key", codes["e"])
            desk.xdotool("key", "ISO_Level3_Shift+" + str(codes["q"]))
            desk.xdotool("key", codes["ssharp"])
            desk.run("setxkbmap", "ru")
            time.sleep(0.3)
            desk.xdotool("key", codes["q"], "ctrl+" + str(codes["q"]))
            keys = [entry.value for entry in self.recorded(recording)["keyboardAction"]]
            self.assertEqual(keys, [(ord("é"), 0), (ord("@"), 0), (ord("ß"), 0), (ord("й"), 0),
                                    (ord("й"), CONTROL)])

    def test_a_composed_key_has_the_time_of_the_key_that_completes_it(self):
        with Desk(layout=["-layout", "de"]) as desk:
            desk.run("xset", "r", "off")
            desk.show()
            recording = desk.record(*ALL_KEYS)
            desk.xdotool("key", 38, "key", 21, "sleep", "0.7", "key", 26)  # a, a dead accent, e
            a, composed = self.recorded(recording)["keyboardAction"]
            self.assertEqual([a.value, composed.value], [(ord("a"), 0), (ord("é"), 0)])
            self.assertGreaterEqual(composed.time - a.time, 0.7)

    def test_texts_of_two_layouts(self):
        texts = {"us": "The quick brown fox jumps over 13 lazy dogs, {twice}! It's 7 + 5 = 12; #4 & 'x' [is] ~99%? "
                       "abc-xyz/QWERTY.",
                 "de": "Zwölf Boxkämpfer jagen Viktor quer über den großen Sylter Deich: äöüÄÖÜß? Ja, 3 + 4 = 7! "
                       "Q#y;z-Übung (2)."}
        self.assertTrue(all(len(text) >= 100 for text in texts.values()))
        for layout, text in texts.items():
            with Desk(layout=["-layout", layout]) as desk:
                typed = self.keys(desk, ALL_KEYS, lambda: desk.xdotool("type", "--delay", "20", text))
                self.assertEqual("".join(chr(code) for code, _ in typed), text)

    def test_shortcuts_hold_no_text(self):
        with Desk() as desk:
            def press():
                desk.xdotool("type", "secret 123")
                desk.xdotool("key", "KP_5", "ctrl+c", "F5", "BackSpace", "shift+a", "super+1")
            self.assertEqual(self.keys(desk, ["--without-accessibility"], press),
                             [(ord("C"), IS_VIRTUAL | CONTROL), (116, IS_VIRTUAL), (8, IS_VIRTUAL),
                              (ord("1"), IS_VIRTUAL | SUPER)])

    def test_keys_that_a_program_has_grabbed_are_those_of_no_window(self):
        """A prompt for a password that is no window of the manager takes all keys: which window is on top then says
        nothing about them."""
        for options, kept in (((*ALL_KEYS, "--deny-title", "Vault"), "ac"), (ALL_KEYS, "abc")):
            with Desk() as desk:
                desk.show()
                prompt = desk.show(0, 0, 100, 100, managed=False)
                recording = desk.record(*options)
                desk.xdotool("key", "a")
                desk.wait_for(lambda: recording.entries("keyboardAction"))
                prompt.grab_keyboard()
                desk.xdotool("keydown", "b", "sleep", "1", "keyup", "b")
                prompt.ungrab_keyboard()
                time.sleep(0.3)
                desk.xdotool("key", "c")
                keys = [chr(entry.value[0]) for entry in self.recorded(recording)["keyboardAction"]]
                self.assertEqual("".join(sorted(set(keys))), kept)

    def test_chords_that_a_window_manager_has_grabbed_are_recorded(self):
        """From the press of a grabbed key until its release, the grab takes all keys. Text may be for a prompt then."""
        super_left = 133
        with Desk() as desk:
            desk.run("xset", "r", "off")
            desk.show()
            desk.show(100, 50, 400, 300)
            manager = desk.show(0, 0, 100, 100, managed=False)
            manager.tell_and_wait(f"grabkey {super_left}", "grabbed")
            recording = desk.record(*ALL_KEYS, "--deny-title", "Vault")
            desk.xdotool("keydown", super_left, "key", "x", "key", "Left", "keyup", super_left)
            desk.xdotool("keydown", "alt", "key", "Tab", "key", "Tab", "keyup", "alt")  # openbox takes these
            time.sleep(0.5)
            manager.tell_and_wait("grabkey 75", "grabbed")  # F9
            desk.xdotool("keydown", "F9", "key", "b", "keyup", "F9", "key", "c")
            keys = [entry.value for entry in self.recorded(recording)["keyboardAction"]
                    if entry.value[0] != 120]  # F9 itself may come before or after its grab
            self.assertEqual(keys, [(ord("X"), IS_VIRTUAL | SUPER), (37, IS_VIRTUAL | SUPER), (9, IS_VIRTUAL | ALT),
                                    (9, IS_VIRTUAL | ALT), (ord("c"), 0)])

    def test_a_key_that_closes_its_window_is_recorded(self):
        """The recorder hears of the key when another window has the focus already."""
        with Desk() as desk:
            desk.show()
            window = desk.show(100, 50, 400, 300)
            window.tell("mortal")
            recording = desk.record(*ALL_KEYS, "--deny-title", "Vault")
            recording.process.send_signal(signal.SIGSTOP)
            desk.xdotool("key", "Return")
            window.process.wait(10)
            time.sleep(0.2)
            recording.process.send_signal(signal.SIGCONT)
            keys = [entry.value for entry in self.recorded(recording)["keyboardAction"]]
            self.assertEqual(keys, [(13, IS_VIRTUAL)])

    def test_shortcuts_are_not_what_the_layout_makes_of_a_key(self):
        with Desk(layout=["-layout", "de"]) as desk:
            desk.show()
            recording = desk.record("--without-accessibility")
            desk.xdotool("key", "ISO_Level3_Shift+24")  # the character @
            desk.xdotool("key", "Caps_Lock", "b", "Caps_Lock", "Num_Lock", "n", "Num_Lock", "F5")
            keys = [entry.value for entry in self.recorded(recording)["keyboardAction"]]
            self.assertEqual(keys, [(116, IS_VIRTUAL)])

    def test_none_holds_nothing(self):
        with Desk() as desk:
            desk.show()
            recording = desk.record("--keys", "none")
            desk.xdotool("key", "ctrl+c", "F5", "a")
            self.assertNotIn("keyboardAction", self.recorded(recording))

    def test_repeats_are_recorded(self):
        with Desk() as desk:
            desk.run("xset", "r", "rate", "200", "25")
            def press():
                desk.xdotool("keydown", "Down")
                time.sleep(0.8)
                desk.xdotool("keyup", "Down")
            keys = self.keys(desk, ["--without-accessibility"], press)
            self.assertGreater(len(keys), 5)
            self.assertEqual(set(keys), {(40, IS_VIRTUAL)})


class Windows(Test):
    def test_titles_and_places_follow_the_window(self):
        with Desk() as desk:
            window = desk.show(200, 100, 400, 300)
            recording = desk.record()
            for line in ("title Zweites Fenster ü", "move 300 200", "resize 500 350", "class Other"):
                window.tell(line)
                time.sleep(0.3)
            end(window.process)
            streams = self.recorded(recording)
            self.assertEqual([entry.value for entry in streams["topmostWindowTitle"]],
                             ["Shown Window", "Zweites Fenster ü", ""])
            self.assertEqual([entry.value for entry in streams["topmostAppName"]], ["ShownWindow", "Other", ""])
            areas = [entry.value for entry in streams["topmostWindow"]]
            self.assertEqual(areas[-1], (0, 0, 0, 0))
            self.assertTrue(any(area[2] >= 500 and area[3] >= 350 for area in areas), areas)

    def test_texts_are_utf_8_whatever_a_program_writes(self):
        with Desk() as desk:
            window = desk.show()
            window.tell(b"class Caf\xe9")  # as it is written there, in ISO 8859-1
            window.tell(b"title Wrong \xff\xc3 byte")
            time.sleep(0.3)
            recording = desk.record()
            self.assertEqual(recording.stop(), 0, recording.errors())
            self.assertIn(": ok (", desk.run(PROGRAMS["zulm"], "verify", recording.output))
            streams = streams_of_movie(recording.output)
            self.assertEqual(streams["topmostAppName"][0].value, "Café")
            self.assertEqual(streams["topmostWindowTitle"][0].value, "Wrong \ufffd\ufffd byte")

    def test_a_title_has_the_time_of_its_property(self):
        """However late the recorder reads it."""
        with Desk() as desk:
            window = desk.show()
            recording = desk.record(*ALL_KEYS)
            recording.process.send_signal(signal.SIGSTOP)
            window.tell("title Second")
            desk.wait_for(lambda: "Second" in desk.run("xprop", "-id", str(window.id), "_NET_WM_NAME"))
            time.sleep(1)
            desk.xdotool("key", "a")
            recording.process.send_signal(signal.SIGCONT)
            streams = self.recorded(recording)
            self.assertEqual([entry.value for entry in streams["topmostWindowTitle"]], ["Shown Window", "Second"])
            self.assertGreaterEqual(streams["keyboardAction"][0].time - streams["topmostWindowTitle"][1].time, 1)

    def test_the_old_name_of_a_window_counts_too(self):
        with Desk() as desk:
            window = desk.show()
            desk.run("xprop", "-id", str(window.id), "-remove", "_NET_WM_NAME")
            desk.run("xprop", "-id", str(window.id), "-f", "WM_NAME", "8s", "-set", "WM_NAME", "Old Name")
            streams = self.recorded(desk.record())
            self.assertEqual(streams["topmostWindowTitle"][0].value, "Old Name")

    def test_without_a_manager_the_focus_counts(self):
        with Desk(manager=None) as desk:
            window = desk.show(200, 100, 400, 300, managed=False)
            desk.xdotool("mousemove", 300, 200)
            streams = self.recorded(desk.record())
            self.assertEqual(streams["topmostWindowTitle"][-1].value, "Shown Window")
            self.assertEqual(streams["topmostWindow"][-1].value, (200, 100, 400, 300))
            self.assertEqual(streams["hoverRect"][-1].value, (200, 100, 400, 300), window.id)

    def test_when_the_manager_has_gone_the_focus_counts(self):
        """What it has said about the active window stays on the root window."""
        with Desk(manager=None) as desk:
            manager = desk.start(["openbox"])
            desk.wait_for(lambda: "window id" in desk.run("xprop", "-root", "_NET_SUPPORTING_WM_CHECK"))
            desk.show(500, 300, 400, 300)
            recording = desk.record()
            end(manager, signal.SIGKILL)
            window = desk.show(100, 100, 300, 200, managed=False)
            window.tell("title Focused")
            desk.xdotool("mousemove", 200, 150, "windowfocus", window.id)
            desk.wait_for(lambda: [entry.value for entry in recording.entries("topmostWindowTitle")][-1] == "Focused",
                          20)
            streams = self.recorded(recording)
            self.assertEqual(streams["topmostWindow"][-1].value, (100, 100, 300, 200))

    def test_each_pattern_counts(self):
        with Desk() as desk:
            window = desk.show()
            recording = desk.record("--deny-title", "first", "--deny-title", "second")
            for line in ("title First", "title Other", "title Second"):
                window.tell(line)
                time.sleep(0.3)
            titles = [entry.value for entry in self.recorded(recording)["topmostWindowTitle"]]
            self.assertEqual(titles, ["Shown Window", "", "Other", ""])

    def test_denied_windows_leave_no_title_and_no_key(self):
        with Desk() as desk:
            window = desk.show()
            recording = desk.record(*ALL_KEYS, "--deny-title", "secret")
            desk.xdotool("key", "a")
            time.sleep(0.3)
            window.tell("title Top Secret")
            time.sleep(0.3)
            desk.xdotool("key", "b")
            time.sleep(0.3)
            window.tell("title Open")
            time.sleep(0.3)
            desk.xdotool("key", "c")
            streams = self.recorded(recording)
            self.assertEqual([entry.value for entry in streams["topmostWindowTitle"]], ["Shown Window", "", "Open"])
            self.assertEqual([chr(entry.value[0]) for entry in streams["keyboardAction"]], ["a", "c"])


    def test_denied_applications_leave_no_title_key_or_rectangle(self):
        with Desk() as desk:
            window = desk.show()
            desk.xdotool("mousemove", 600, 300)
            recording = desk.record(*ALL_KEYS, "--deny-app", "^vault$")
            desk.xdotool("key", "a")
            time.sleep(0.3)
            window.tell("class Vault")
            time.sleep(0.3)
            desk.xdotool("key", "b")
            desk.xdotool("mousemove", 20, 20)  # out of the window
            time.sleep(0.3)
            desk.xdotool("mousemove", 600, 300)
            time.sleep(0.3)
            window.tell("class Editor")
            time.sleep(0.3)
            desk.xdotool("key", "c")
            streams = self.recorded(recording)
            self.assertEqual([entry.value for entry in streams["topmostWindowTitle"]],
                             ["Shown Window", "", "Shown Window"])
            self.assertEqual([chr(entry.value[0]) for entry in streams["keyboardAction"]], ["a", "c"])
            self.assertEqual(len({entry.value for entry in streams["hoverRect"]}), 1)


class Control(Test):
    def test_a_pause_is_not_in_the_recording(self):
        with Desk() as desk:
            window = desk.show()
            desk.xdotool("mousemove", 600, 400)
            begun = time.monotonic()
            recording = desk.record(*ALL_KEYS)
            control = recording.socket()
            self.assertEqual(os.stat(control).st_mode & 0o777, 0o600)
            desk.xdotool("key", "a")
            time.sleep(0.5)
            recording.control("--pause")
            desk.xdotool("key", "b")
            window.tell("title Changed")
            desk.xdotool("mousemove", 300, 300)
            time.sleep(1.5)
            recording.control("--resume")
            time.sleep(0.5)
            desk.xdotool("key", "c")
            time.sleep(0.5)
            self.assertEqual(desk.run(PROGRAMS["recorder"], "--stop"), "")
            ended = time.monotonic()
            self.assertEqual(recording.process.wait(20), 0)
            document = json.loads(recording.json.read_text())
            self.assertEqual(document["stopped_by"], "stop")
            streams = streams_of_movie(recording.output)
            self.assertEqual([chr(entry.value[0]) for entry in streams["keyboardAction"]], ["a", "c"])
            titles = streams["topmostWindowTitle"]
            self.assertEqual([entry.value for entry in titles], ["Shown Window", "Changed"])
            self.assertLess(document["duration"], ended - begun - 1.5)
            times = frame_times(recording.output)
            gaps = [after - before for before, after in zip(times, times[1:])]
            self.assertLess(max(gaps), 0.5)
            before, after = streams["cursorLocation"][-2:]
            self.assertEqual((before.value, after.value), ((600, 400), (300, 300)))
            self.assertLess(after.time - before.time, 0.034)  # nobody interpolates across the rest
            self.assertFalse(control.exists())

    def test_the_click_that_stops_is_not_in_it(self):
        with Desk() as desk:
            desk.show()
            desk.xdotool("mousemove", 600, 400)
            recording = desk.record("--without-accessibility")
            desk.xdotool("click", 1)
            time.sleep(0.5)
            with socket.socket(socket.AF_UNIX) as control:  # a program would take its time to start
                control.connect(str(recording.socket()))
                desk.xdotool("mousedown", 1)
                control.sendall(b"stop\n")
                self.assertEqual(recording.process.wait(20), 0)
            self.assertEqual([entry.value for entry in streams_of_movie(recording.output)["cursorAction"]], [256, 1, 2])

    def test_the_click_that_stops_by_the_program_is_not_in_it(self):
        """A machine with other work to do may take too long to start the program, so it has several attempts."""
        with Desk() as desk:
            desk.show()
            desk.xdotool("mousemove", 600, 400)
            for attempt in range(5):
                recording = desk.record("--without-accessibility", name=f"{attempt}.mp4")
                desk.xdotool("click", 1)
                time.sleep(0.5)
                desk.xdotool("mousedown", 1)
                self.assertEqual(recording.control("--stop"), "")
                self.assertEqual(recording.process.wait(20), 0)
                desk.xdotool("mouseup", 1)
                actions = [entry.value for entry in streams_of_movie(recording.output)["cursorAction"]]
                if actions == [256, 1, 2]:
                    break
            self.assertEqual(actions, [256, 1, 2])

    def test_the_click_that_pauses_is_in_it(self):
        with Desk() as desk:
            desk.show()
            desk.xdotool("mousemove", 600, 400)
            recording = desk.record("--without-accessibility")
            desk.xdotool("mousedown", 1)
            for word, answer in ((b"pause\n", b"paused\n"), (b"resume\n", b"resumed\n")):
                with socket.socket(socket.AF_UNIX) as control:
                    control.connect(str(recording.socket()))
                    control.sendall(word)
                    self.assertEqual(control.recv(64), answer)
                time.sleep(0.5)
            streams = self.recorded(recording)
            self.assertEqual([entry.value for entry in streams["cursorAction"]], [256, 1])

    def test_a_runtime_folder_that_is_missing_is_not_made(self):
        with Desk(manager=None) as desk:
            desk.environment.update(XDG_RUNTIME_DIR=str(desk.folder / "absent"), TMPDIR=str(desk.folder))
            recording = desk.record("--without-accessibility")
            self.assertFalse((desk.folder / "absent").exists())
            self.recorded(recording)

    def test_only_a_socket_that_was_left_is_replaced(self):
        with Desk(manager=None) as desk:
            path = desk.folder / "control"
            with socket.socket(socket.AF_UNIX) as left:
                left.bind(str(path))
            link = desk.folder / "link"
            link.symlink_to(path)
            self.assertEqual(desk.record("--socket", str(link), wait=False).process.wait(20), 2)
            self.assertTrue(link.is_symlink())
            self.recorded(desk.record("--socket", str(path)))

    def test_the_key_that_interrupts_is_not_in_it(self):
        """The terminal says so after the key has gone through the X server."""
        with Desk() as desk:
            desk.show()
            ours, theirs = pty.openpty()
            process = desk.start([PROGRAMS["recorder"], "-o", str(desk.folder / "out.mp4"), "--without-accessibility"],
                                 stdin=theirs, stderr=theirs, start_new_session=True,
                                 preexec_fn=lambda: fcntl.ioctl(0, termios.TIOCSCTTY, 0))
            os.close(theirs)
            text = b""
            while b"recording " not in text:
                text += os.read(ours, 4096)
            desk.xdotool("key", "ctrl+s")
            time.sleep(0.5)
            desk.xdotool("keydown", "ctrl", "keydown", "c")
            os.write(ours, b"\x03")
            desk.xdotool("keyup", "c", "keyup", "ctrl")
            with contextlib.suppress(OSError):  # the end of a terminal
                while os.read(ours, 4096):
                    pass
            os.close(ours)
            self.assertEqual(process.wait(30), 0)
            keys = streams_of_movie(desk.folder / "out.mp4")["keyboardAction"]
            self.assertEqual([entry.value for entry in keys], [(ord("S"), IS_VIRTUAL | CONTROL)])

    def test_nothing_is_later_than_the_end(self):
        with Desk() as desk:
            desk.show()
            desk.xdotool("mousemove", 300, 300)
            recording = desk.record("--duration", "1.5")
            while recording.process.poll() is None:
                desk.xdotool("mousemove_relative", "--sync", 1, 0)
            for kind, entries in streams_of_movie(recording.output).items():
                self.assertLessEqual(max(entry.time for entry in entries), 1.5, kind)

    def test_signals_pause_and_end_it(self):
        with Desk(manager=None) as desk:
            recording = desk.record()
            instants = [time.monotonic()]
            for number, seconds in ((signal.SIGUSR1, 0.5), (signal.SIGUSR1, 1.5), (signal.SIGINT, 0.9)):
                time.sleep(seconds)
                recording.process.send_signal(number)
                instants.append(time.monotonic())
            self.assertEqual(recording.process.wait(60), 0, recording.errors())
            document = json.loads(recording.json.read_text())
            self.assertEqual(document["stopped_by"], "signal")
            begun, paused, resumed, ended = instants
            self.assert_near(document["duration"], paused - begun + ended - resumed, 0.6)

    def test_every_tick_beside_a_pause_is_counted(self):
        with Desk(manager=None) as desk:
            recording = desk.record("--without-accessibility")
            for seconds in (0.5, 0.3):
                time.sleep(seconds)
                recording.process.send_signal(signal.SIGUSR1)
            self.recorded(recording)
            document = json.loads(recording.json.read_text())
            ticks = document["frames"] + document["dropped"]
            self.assertGreaterEqual(ticks, document["duration"] * 30 - 0.01)
            self.assertLess(ticks, document["duration"] * 30 + 2)  # each part ends inside of a tick

    def test_one_of_several_recorders(self):
        with Desk(manager=None) as desk:
            sockets = [desk.folder / "one", desk.folder / "two"]
            recordings = [desk.record("--socket", str(path), name=path.name + ".mp4") for path in sockets]
            self.assertEqual([os.stat(path).st_mode & 0o777 for path in sockets], [0o600, 0o600])
            self.assertEqual(desk.run(PROGRAMS["recorder"], "--stop", "--socket", sockets[1]), "")
            self.assertEqual(recordings[1].process.wait(20), 0)
            self.assertIsNone(recordings[0].process.poll())
            self.recorded(recordings[0])

    def test_off_a_terminal_there_is_no_status(self):
        with Desk(manager=None) as desk:
            recording = desk.record("--duration", "1.2", "--without-accessibility")
            self.assertEqual(recording.process.wait(30), 0)
            lines = [line for line in recording.errors().splitlines() if "frames were dropped" not in line]
            self.assertEqual(lines, [f"recording {recording.output}"])

    def test_the_window_that_closes_ends_it_when_another_was_on_top(self):
        with Desk() as desk:
            window = desk.show(100, 100, 401, 301)
            recording = desk.record("--window", str(window.id), "--stop-on-close")
            desk.show(600, 100, 300, 300)
            time.sleep(0.5)
            window.tell("close")
            self.assertEqual(recording.process.wait(20), 0, recording.errors())
            self.assertEqual(json.loads(recording.json.read_text())["stopped_by"], "window")

    def test_the_window_that_closes_ends_it(self):
        with Desk() as desk:
            window = desk.show(100, 100, 401, 301)
            recording = desk.record("--window", "Shown", "--stop-on-close")
            time.sleep(0.5)
            window.tell("close")
            self.assertEqual(recording.process.wait(20), 0, recording.errors())
            self.assertEqual(json.loads(recording.json.read_text())["stopped_by"], "window")

    def test_a_terminal_shows_how_it_goes(self):
        with Desk() as desk:
            desk.show()
            ours, theirs = pty.openpty()
            process = desk.start([PROGRAMS["recorder"], "-o", str(desk.folder / "out.mp4"), "--duration", "2"],
                                 stderr=theirs)
            os.close(theirs)
            text = b""
            with contextlib.suppress(OSError):  # the end of a terminal
                while part := os.read(ours, 4096):
                    text += part
            os.close(ours)
            self.assertEqual(process.wait(30), 0)
            lines = text.decode().replace("\n", "\r").split("\r")
            self.assertIn(f"recording {desk.folder / 'out.mp4'}", lines)
            status = [line for line in lines if line.startswith("recording 00:00:01")]
            self.assertTrue(status, lines)
            self.assertTrue(text.endswith(b"\n"), text)
            self.assertRegex(status[0], r"^recording 00:00:01  \d+ frames, \d+ dropped  \d+ entries  "
                                        r"movie \d+\.\d MiB, streams \d+\.\d MiB  $")

    def test_a_display_that_goes_away_ends_it(self):
        with Desk() as desk:
            desk.show()
            recording = desk.record()
            time.sleep(1)
            desk.server.kill()
            self.assertEqual(recording.process.wait(20), 3)
            self.assertIn("the X display is gone", recording.errors())
            self.assertEqual(json.loads(recording.json.read_text())["stopped_by"], "error")
            self.assertFalse(recording.folder.exists())
            self.assertGreater(frame_times(recording.output)[-1], 0.5)

    def test_nobody_to_control(self):
        with Desk(manager=None) as desk:
            self.assertIn("no recorder is running", desk.run(PROGRAMS["recorder"], "--stop"))


class Loss(Test):
    def test_a_killed_recording_is_recovered(self):
        with Desk() as desk:
            desk.show()
            recording = desk.record(*ALL_KEYS)
            begun = time.monotonic()
            for index in range(12):
                desk.xdotool("key", "abcdefghijkl"[index])
                desk.xdotool("mousemove", 300 + 10 * index, 300)
                time.sleep(0.2)
            pressed = time.monotonic() - begun
            end(recording.process, signal.SIGKILL)
            killed = time.monotonic() - begun
            self.assertFalse(recording.output.exists())
            command = [PROGRAMS["recorder"], "--recover", recording.folder]
            result = subprocess.run(command, capture_output=True, check=False)
            self.assertEqual(result.returncode, 0, result.stderr)
            self.assertTrue(recording.folder.exists())
            before = recording.output.read_bytes()
            self.assertEqual(subprocess.run(command, check=False, capture_output=True).returncode, 0)
            self.assertEqual(recording.output.read_bytes(), before)
            elsewhere = desk.folder / "elsewhere.mp4"
            self.assertEqual(self.recover(recording.folder, "-o", elsewhere), 0)
            self.assertEqual(elsewhere.read_bytes(), before)
            self.assertGreater(frame_times(recording.output)[-1], 0)  # the reliability checks hold it to a second
            streams = streams_of_movie(recording.output)
            typed = "".join(chr(entry.value[0]) for entry in streams["keyboardAction"])
            self.assertTrue("abcdefghijkl".startswith(typed))
            self.assertGreaterEqual(len(typed), sum(1 for index in range(12)
                                                    if index * pressed / 12 < killed - 0.75 - 0.2))
            self.assertEqual(subprocess.run([*command, "--delete"], check=False, capture_output=True).returncode, 0)
            self.assertFalse(recording.folder.exists())
            self.assertEqual(subprocess.run(command, check=False, capture_output=True).returncode, 0)

    def test_what_every_recording_begins_with_is_there_at_once(self):
        with Desk(manager=None) as desk:
            recording = desk.record()
            self.assertEqual([entry.value for entry in recording.entries("cursorAction")], [256])
            self.recorded(recording)

    def test_a_disk_that_is_full_at_the_start(self):
        with tempfile.TemporaryDirectory() as place, Desk(manager=None) as desk:
            if "permission" in desk.run("mount", "-t", "tmpfs", "-o", "size=3m", "tmpfs", place):
                self.skipTest("no file system may be mounted here")
            try:
                result = subprocess.run([PROGRAMS["recorder"], "-o", place + "/out.mp4"], check=False,
                                        env=desk.environment, capture_output=True, text=True, timeout=30)
                self.assertEqual(result.returncode, 1, result.stderr)
                self.assertIn("too little space", result.stderr)
                self.assertEqual(os.listdir(place), [])
            finally:
                desk.run("umount", "-l", place)

    def test_a_recording_of_a_hidden_window_is_recovered(self):
        with Desk(manager=None) as desk:
            window = desk.show(100, 100, 400, 300, managed=False)
            recording = desk.record("--window", str(window.id))
            window.tell("unmap")
            time.sleep(4)
            end(recording.process, signal.SIGKILL)
            self.assertEqual(self.recover(recording.folder), 0)

    def test_a_movie_that_was_cut_is_told(self):
        with Desk(manager=None) as desk:
            recording = desk.record()
            time.sleep(4)
            end(recording.process, signal.SIGKILL)
            movie = recording.folder / "movie.mp4"
            os.truncate(movie, movie.stat().st_size // 2)
            command = [PROGRAMS["recorder"], "--recover", recording.folder]
            self.assertEqual(subprocess.run(command, check=False, capture_output=True).returncode, 3)
            self.assertTrue(recording.output.exists())

    def test_what_is_recorded_is_on_the_disk_each_second(self):
        """A loss of power takes what is in the memory of the system, so all of it goes to the disk again and again."""
        if not shutil.which("strace"):
            self.skipTest("there is no strace")
        with Desk() as desk:
            desk.show()
            calls = desk.folder / "calls"
            recording = desk.record()
            tracer = desk.start(["strace", "-f", "-y", "-e", "trace=fdatasync", "-o", str(calls), "-p",
                                 str(recording.process.pid)])

            def is_synced_again_and_again():
                desk.xdotool("mousemove_relative", 1, 0)
                lines = calls.read_text().splitlines() if calls.exists() else []
                return all(sum(f"/{name}>" in line for line in lines) >= 3
                           for name in ("movie.mp4", "cursorLocation.dat", "systemData.dat"))

            desk.wait_for(lambda: is_synced_again_and_again() or tracer.poll() is not None)
            if tracer.poll() is not None:
                self.skipTest("no process may be traced here")
            self.recorded(recording)

    def test_nothing_to_recover(self):
        with tempfile.TemporaryDirectory() as folder:
            empty = pathlib.Path(folder) / "a.mp4.recording"
            empty.mkdir()
            command = [PROGRAMS["recorder"], "--recover", empty]
            self.assertEqual(subprocess.run(command, check=False, capture_output=True).returncode, 1)
            self.assertEqual(os.listdir(folder), ["a.mp4.recording"])

    def recover(self, *arguments):
        command = [PROGRAMS["recorder"], "--recover", *[str(argument) for argument in arguments]]
        return subprocess.run(command, check=False, capture_output=True).returncode

    def test_a_folder_of_somebody_else_is_never_removed(self):
        """Whatever OUT is, only what was recorded there is removed, and only if OUT holds it."""
        with tempfile.TemporaryDirectory() as name:
            output = pathlib.Path(name) / "Talk.mp4"
            output.write_bytes(struct.pack(">I4s4sI", 16, b"ftyp", b"isom", 0))
            folder = pathlib.Path(name) / "Letters"
            folder.mkdir()
            letter = folder / "letter.txt"
            letter.write_text("Dear", encoding="utf-8")
            self.assertEqual(self.recover(folder, "-o", output, "--delete"), 1)
            self.assertEqual(self.recover(folder, "-o", output), 1)
            self.assertEqual(os.listdir(folder), ["letter.txt"])
            stream = folder / "topmostAppName.dat"  # which OUT does not hold
            shutil.copy(pathlib.Path(__file__).parents[2] / "Data/invalid/text-torn-in-size.dat", stream)
            self.assertEqual(self.recover(folder, "-o", output, "--delete"), 1)
            self.assertEqual(sorted(os.listdir(folder)), ["letter.txt", "topmostAppName.dat"])

    def test_two_recoveries_at_a_time(self):
        """The second one is refused, as long as the first one holds the lock."""
        with Desk(manager=None) as desk:
            recording = desk.record()
            time.sleep(3)  # so that there are whole fragments
            end(recording.process, signal.SIGKILL)
            notes = desk.folder / "out.mp4.recovering"
            notes.write_text("mine", encoding="utf-8")
            first = os.open(recording.folder, os.O_RDONLY)
            fcntl.flock(first, fcntl.LOCK_EX)
            self.assertEqual(self.recover(recording.folder), 2)
            os.close(first)
            self.assertEqual(self.recover(recording.folder), 0)
            self.assertEqual(notes.read_text(encoding="utf-8"), "mine")
            (recording.folder / "movie.mp4").unlink()
            os.mkfifo(recording.folder / "movie.mp4")
            self.assertEqual(self.recover(recording.folder), 1)

    def test_only_files_of_the_recorder_are_deleted(self):
        with Desk(manager=None) as desk:
            recording = desk.record()
            time.sleep(3)  # so that there are whole fragments
            end(recording.process, signal.SIGKILL)
            letter = recording.folder / "letter.txt"
            letter.write_text("Dear", encoding="utf-8")
            inside = recording.folder / "inside.mp4"
            self.assertEqual(self.recover(recording.folder, "-o", inside, "--delete"), 2)
            self.assertFalse(inside.exists())
            saved = desk.folder / "saved"  # as if the recorder was killed while it removed its files
            shutil.copytree(recording.folder, saved)
            (saved / "movie.mp4").unlink()
            self.assertEqual(self.recover(recording.folder, "--delete"), 0)
            self.assertEqual(os.listdir(recording.folder), ["letter.txt"])
            self.assertTrue(streams_of_movie(recording.output))
            other = desk.folder / "other.mp4"
            other.write_bytes(recording.output.read_bytes()[:1000])
            before = sorted(os.listdir(saved))
            self.assertEqual(self.recover(saved, "-o", other, "--delete"), 1)
            self.assertEqual(sorted(os.listdir(saved)), before)
            self.assertEqual(self.recover(saved, "-o", recording.output, "--delete"), 0)
            self.assertEqual(os.listdir(saved), ["letter.txt"])


class Privacy(Test):
    """With the accessibility bus, whose address is that of the root window of the desk."""

    def open_form(self, desk):
        """Returns the process of form.py, whose window is active."""
        desk.start_bus()
        if not desk.open_form():
            self.skipTest("there is no GTK for Python")
        form = desk.processes[-1]
        desk.wait_for(lambda: "Form" in desk.xdotool("getactivewindow", "getwindowname"))
        return form

    def test_what_is_not_known_is_left_out(self):
        """ShownWindow tells the bus nothing, so nobody knows whether it shows a password field."""
        with Desk() as desk:
            desk.start_bus()
            desk.show()
            for mode in ("all", "shortcuts"):
                recording = desk.record_with_bus(mode, name=mode + ".mp4")
                desk.xdotool("key", "a", "F5", "ctrl+c")
                desk.xdotool("mousemove", 600, 400, "click", 1)
                streams = self.recorded(recording)
                self.assertNotIn("keyboardAction", streams)
                self.assertEqual([entry.value for entry in streams["cursorAction"]], [256, 1, 2])

    def test_what_is_typed_into_a_password_field_is_left_out(self):
        with Desk() as desk:
            self.open_form(desk)
            recording = desk.record_with_bus("all")
            time.sleep(0.6)
            desk.xdotool("type", "--delay", "30", "SECRET7")
            time.sleep(0.6)
            desk.xdotool("key", "Tab")
            time.sleep(0.8)
            desk.xdotool("type", "--delay", "30", "open")
            time.sleep(0.8)
            keys = [entry.value[0] for entry in self.recorded(recording)["keyboardAction"]]
            self.assertEqual([chr(key) for key in keys if key > 32], list("open"))
            self.assertFalse([file for file in desk.folder.rglob("*") if file.is_file() and
                              b"SECRET7" in file.read_bytes()])

    def test_what_is_typed_into_a_prompt_over_a_form_is_left_out(self):
        """The form's open field says that it has the focus, though a prompt has grabbed the keyboard."""
        with Desk() as desk:
            self.open_form(desk)
            prompt = desk.show(900, 500, 100, 100, managed=False)
            recording = desk.record_with_bus("all")
            desk.xdotool("key", "Tab")
            time.sleep(0.8)
            prompt.grab_keyboard()
            desk.xdotool("type", "--delay", "30", "SECRET7")
            prompt.ungrab_keyboard()
            time.sleep(0.8)
            desk.xdotool("type", "--delay", "30", "open")
            time.sleep(0.8)
            keys = [entry.value[0] for entry in self.recorded(recording)["keyboardAction"]]
            self.assertEqual([chr(key) for key in keys if key > 32], list("open"))

    def test_what_is_typed_while_the_application_has_no_time_is_recorded(self):
        """Its answer comes later, and what it says of the focus holds for these keys."""
        with Desk() as desk:
            form = self.open_form(desk)
            recording = desk.record_with_bus("all")
            desk.xdotool("key", "Tab")

            def is_recorded():
                """On a busy machine the answer may be too late."""
                form.send_signal(signal.SIGSTOP)
                desk.xdotool("key", "b", "sleep", "1.2", "key", "c")
                form.send_signal(signal.SIGCONT)
                time.sleep(1.5)
                keys = [chr(entry.value[0]) for entry in recording.entries("keyboardAction")]
                return keys[-2:] == ["b", "c"]

            desk.wait_for(is_recorded)
            self.recorded(recording)

    def test_a_password_that_waits_for_a_busy_application_is_left_out(self):
        """It answers questions before it takes the key that moves the focus."""
        with Desk() as desk:
            form = self.open_form(desk)
            recording = desk.record_with_bus("all")
            for _ in range(4):
                desk.xdotool("key", "Tab", "sleep", "0.6")  # into the field that shows what is typed
                form.send_signal(signal.SIGSTOP)
                desk.xdotool("key", "shift+Tab", "type", "--delay", "30", "secret")
                time.sleep(0.9)
                form.send_signal(signal.SIGCONT)
                time.sleep(1)
            streams = self.recorded(recording)
            keys = [chr(entry.value[0]) for entry in streams.get("keyboardAction", [])]
            self.assertFalse(set(keys) & set("secret"), keys)

    def test_a_watcher_that_died_is_started_again(self):
        with Desk() as desk:
            self.open_form(desk)
            recording = desk.record_with_bus("all")
            desk.xdotool("key", "Tab")
            watchers = processes_of(recording.process)
            os.kill(watchers[0], signal.SIGKILL)
            desk.wait_for(lambda: "the accessibility bus does not answer" in recording.errors())
            desk.wait_for(lambda: processes_of(recording.process) not in ([], watchers))

            def is_recorded_again():
                desk.xdotool("key", "x")
                time.sleep(0.5)
                return recording.entries("keyboardAction")

            desk.wait_for(is_recorded_again)
            os.kill(processes_of(recording.process)[0], signal.SIGKILL)
            desk.wait_for(lambda: recording.errors().count("the accessibility bus does not answer") == 2)
            self.recorded(recording)

    def test_the_bus_tells_what_the_pointer_is_over(self):
        with Desk() as desk:
            desk.start_bus()
            fields = desk.open_form()
            if not fields:
                self.skipTest("there is no GTK for Python")
            desk.wait_for(lambda: "Form" in desk.xdotool("getactivewindow", "getwindowname"))
            recording = desk.record()
            for x, y, width, height in fields.values():
                desk.xdotool("mousemove", x + width // 2, y + height // 2)
                time.sleep(0.7)
            rects = [entry.value for entry in self.recorded(recording)["hoverRect"]]
            for name, field in fields.items():
                self.assertIn(field, rects, name)

    def test_a_watcher_that_dies_or_hangs_harms_nothing(self):
        for number in (signal.SIGKILL, signal.SIGSTOP):
            with Desk() as desk:
                desk.start_bus()
                desk.show()
                recording = desk.record_with_bus("all")
                watchers = processes_of(recording.process)
                self.assertEqual(len(watchers), 1)
                os.kill(watchers[0], number)
                for index in range(30):
                    desk.xdotool("mousemove", 300 + index, 300)
                    time.sleep(0.1)
                    desk.xdotool("key", "a")
                streams = self.recorded(recording)
                self.assertNotIn("keyboardAction", streams)
                self.assertEqual(streams["cursorLocation"][-1].value, (329, 300))


def missing_programs():
    missing = [] if PROGRAMS["recorder"] else ["the recorder, whose libraries 'scripts/install.sh record' installs"]
    return missing + [name for name in ("Xvfb", "openbox", "xdotool", "xprop", "xrdb", "setxkbmap", "ffmpeg",
                                      "dbus-daemon")
                      if not shutil.which(name)]


if __name__ == "__main__":
    if missing_programs():
        print("skipped, because there is no " + ", no ".join(missing_programs()))
        sys.exit(77)
    unittest.main(verbosity=2)
