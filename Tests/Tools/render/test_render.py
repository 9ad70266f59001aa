#!/usr/bin/env python3
"""Renders films of recordings whose pictures say where the cursor must be, and looks at the films.

Usage: test_render.py SUITE; ZULM_RENDER names the program. Ends with 77 if it is not there."""

import array
import json
import os
import pathlib
import re
import signal
import struct
import subprocess
import sys
import tempfile
import time
import unittest

from recordings import attach, encode, ffmpeg, frames_of, marker_recording, middle_of, png

RENDERER = os.environ.get("ZULM_RENDER", "")
BARE = {"schema": "zulm.style", "schema_version": 1, "background": {"color": "#000000"},
        "frame": {"padding": 0, "corner_radius": 0, "shadow_opacity": 0}, "cursor": {"size": 1, "smooth": False},
        "clicks": {"show": False}, "keys": {"display": "hidden"}, "zoom": {"auto": False}}


def run(*words, command="render", check=True):
    done = subprocess.run([RENDERER, command, *map(str, words)], stdout=subprocess.PIPE, stderr=subprocess.PIPE,
                          text=True, timeout=300)
    if check and done.returncode != 0:
        raise AssertionError(f"{words}: ended with {done.returncode}: {done.stderr}")
    return done


def size_of(film):
    text = subprocess.run(["ffprobe", "-v", "error", "-select_streams", "v", "-show_entries", "stream=width,height",
                           "-of", "csv=p=0", str(film)], check=True, stdout=subprocess.PIPE, text=True).stdout
    return tuple(map(int, text.strip().strip(",").split(",")))


def duration_of(film, kind="v"):
    text = subprocess.run(["ffprobe", "-v", "error", "-select_streams", kind, "-show_entries", "stream=duration", "-of",
                           "csv=p=0", str(film)], check=True, stdout=subprocess.PIPE, text=True).stdout.strip()
    return float(text) if text else None


def streams_of(film):
    """The bytes of the streams in a film's metadata by the last byte of their group."""
    data = pathlib.Path(film).read_bytes()
    start = data.index(b"ZULM") - 4
    found, place, end = {}, start + 16, start + struct.unpack_from(">Q", data, start + 8)[0]
    while place < end:
        size = struct.unpack_from(">Q", data, place + 8)[0]
        found[data[place + 16:place + 20].hex()] = data[place + 16:place + size]
        place += size
    return found


class Films(unittest.TestCase):
    def setUp(self):
        holder = tempfile.TemporaryDirectory(prefix="zulm-render-")
        self.addCleanup(holder.cleanup)
        self.folder = pathlib.Path(holder.name)
        self.film = self.folder / "Film.mp4"
        self.movie = self.folder / "Recording.mp4"

    def style(self, **sections):
        file = self.folder / "style.json"
        file.write_text(json.dumps({**BARE, **sections}))
        return file

    def attached(self, movie, streams=None):
        attach(movie, streams or {"recordingRegion": [(0, 0, 0, 160, 90)], "cursorLocation": [(0, 80, 45), (1, 90, 50)]})
        return movie


class Marker(Films):
    def check(self, *words, most=1.0, least_frames=1, movie=None, **sections):
        """The middle of the cursor lies on the middle of the box in all frames."""
        movie = movie or self.movie
        run(movie, "-o", self.film, "--style", self.style(**sections), "--quality", "8", "--force", *words)
        width, height = size_of(self.film)
        seen, worst = 0, 0.0
        for number, frame in enumerate(frames_of(self.film, width, height)):
            cursor, box = middle_of(frame, width, 200), middle_of(frame, width, 60)
            self.assertIsNotNone(cursor, f"frame {number} has no cursor")
            self.assertIsNotNone(box, f"frame {number} has no box")
            off = max(abs(cursor[0] - box[0]), abs(cursor[1] - box[1]))
            worst = max(worst, off)
            self.assertLessEqual(off, most, f"frame {number}: the cursor is at {cursor}, the box at {box}")
            seen += 1
        self.assertGreaterEqual(seen, least_frames)
        print(f"{self.id()}: {seen} frames, at most {worst:.2f} pixels", file=sys.stderr)

    def test_the_cursor_is_on_the_marker(self):
        marker_recording(self.movie, 640, 360, 6)
        self.check(least_frames=180)

    def test_it_is_on_it_after_cuts_and_at_speeds(self):
        marker_recording(self.movie, 640, 360, 10)
        self.check("--keep", "4.5-6", "--keep", "0.2-1.9@3/2", "--keep", "2.1-3.9@1/2", "--keep", "8.1-9.9@2",
                   least_frames=190)

    def test_it_is_on_it_at_another_size_with_padding(self):
        marker_recording(self.movie, 640, 360, 4)
        self.check("--size", "854x480", frame={"padding": 80, "corner_radius": 20, "shadow_opacity": 0.5})

    def test_it_is_on_it_at_scale_factor_2(self):
        marker_recording(self.movie, 1280, 720, 4, scale=2)
        self.check(least_frames=120)

    def test_it_is_on_it_while_the_camera_moves(self):
        marker_recording(self.movie, 640, 360, 6)
        zooms = self.folder / "zooms.json"
        zooms.write_text(json.dumps({"schema": "zulm.zooms", "schema_version": 1, "zooms": [
            {"start": 0.2, "end": 1.5, "factor": 1.8, "x": 100, "y": 80}]}))
        self.check("--zoom", zooms, "--keep", "0-2")

    def test_a_movie_of_variable_frame_rate(self):
        marker_recording(self.movie, 640, 360, 4, options=["-vf", "select='not(eq(mod(n,3),1))'", "-vsync", "vfr"])
        self.check(most=1.5)

    def test_a_turned_movie(self):
        marker_recording(self.folder / "Straight.mp4", 640, 360, 2)
        streams = streams_of(self.folder / "Straight.mp4")
        ffmpeg("-i", self.folder / "Straight.mp4", "-vf", "transpose=2", "-c:v", "libx264", "-crf", "10",
               self.folder / "Left.mp4")
        ffmpeg("-i", self.folder / "Left.mp4", "-c", "copy", "-metadata:s:v", "rotate=270", self.movie)
        atoms = b"".join(struct.pack(">I4sQ", 1, b"DATA", 16 + len(data)) + data for data in streams.values())
        with open(self.movie, "ab") as file:
            file.write(struct.pack(">I4sQ", 1, b"ZULM", 16 + len(atoms)) + atoms)
        self.check()
        self.assertEqual(size_of(self.film), (640, 360))

    def test_a_movie_of_10_bits(self):
        marker_recording(self.folder / "Plain.mp4", 640, 360, 2)
        streams = streams_of(self.folder / "Plain.mp4")
        ffmpeg("-i", self.folder / "Plain.mp4", "-pix_fmt", "yuv420p10le", "-c:v", "libx264", "-crf", "10", self.movie)
        atoms = b"".join(struct.pack(">I4sQ", 1, b"DATA", 16 + len(data)) + data for data in streams.values())
        with open(self.movie, "ab") as file:
            file.write(struct.pack(">I4sQ", 1, b"ZULM", 16 + len(atoms)) + atoms)
        self.check()

    def test_the_film_can_be_rendered_again(self):
        marker_recording(self.movie, 640, 360, 6)
        first = self.folder / "First.mp4"
        run(self.movie, "-o", first, "--style", self.style(cursor={"size": 0.25, "smooth": False}), "--keep", "4-6",
            "--keep", "0-1.5@2", "--quality", "8")
        self.check(movie=first, most=1.0)


class Sound(Films):
    FPS = 60

    def beeps(self, seconds):
        """A movie that flashes and beeps for a tenth of a second in the middle of every second."""
        rate = 48000
        samples = array.array("h", bytes(2 * rate * seconds))
        for second in range(seconds):
            for i in range(rate // 10):
                samples[second * rate + rate // 2 + i] = 20000 if (i // 24) % 2 else -20000
        (self.folder / "beeps.raw").write_bytes(samples.tobytes())
        light, dark = bytes([235]) * (160 * 90), bytes([16]) * (160 * 90)
        encode(self.movie, 160, 90, self.FPS,
               (light if self.FPS // 2 <= n % self.FPS < self.FPS // 2 + 6 else dark for n in range(seconds * self.FPS)),
               "-f", "s16le", "-ar", rate, "-ac", 1, "-i", self.folder / "beeps.raw", "-c:a", "aac")
        self.attached(self.movie)

    def onsets(self):
        flashes, before = [], False
        for number, frame in enumerate(frames_of(self.film, 160, 90)):
            is_light = sum(frame[45 * 160:46 * 160]) > 128 * 160
            if is_light and not before:
                flashes.append(number / self.FPS)
            before = is_light
        raw = array.array("h", ffmpeg("-i", self.film, "-f", "s16le", "-ac", 1, "-ar", 48000, "-"))
        beeps, quiet = [], 4800
        for i, value in enumerate(raw):
            if abs(value) > 6000:
                if quiet > 1200:
                    beeps.append(i / 48000)
                quiet = 0
            else:
                quiet += 1
        return flashes, beeps

    def check(self, count):
        flashes, beeps = self.onsets()
        self.assertEqual((len(flashes), len(beeps)), (count, count))
        worst = max(abs(a - b) for a, b in zip(flashes, beeps))
        print(f"{self.id()}: at most {worst * 1000:.1f} ms", file=sys.stderr)
        self.assertLess(worst, 0.020)

    def test_sound_stays_with_the_pictures_through_50_cuts(self):
        self.beeps(51)
        pieces = [word for i in range(50) for word in ("--keep", f"{i}.2-{i}.9")]
        run(self.movie, "-o", self.film, "--style", self.style(), "--fps", self.FPS, *pieces)
        self.check(50)

    def test_sound_stays_with_the_pictures_at_speeds(self):
        self.beeps(12)
        run(self.movie, "-o", self.film, "--style", self.style(), "--fps", self.FPS, "--keep", "0-4@2", "--keep", "4-8",
            "--keep", "8-12@2/3")
        self.check(12)

    def test_sound_is_as_long_as_the_pictures(self):
        self.beeps(4)
        run(self.movie, "-o", self.film, "--style", self.style(), "--keep", "0.5-3.2")
        self.assertAlmostEqual(duration_of(self.film, "v"), 2.7, delta=0.034)
        self.assertAlmostEqual(duration_of(self.film, "a"), 2.7, delta=0.05)

    def test_a_movie_without_sound_makes_a_film_without_sound(self):
        encode(self.movie, 160, 90, 30, [bytes(160 * 90)] * 30)
        self.attached(self.movie)
        run(self.movie, "-o", self.film)
        self.assertIsNone(duration_of(self.film, "a"))


class Styles(Films):
    def setUp(self):
        super().setUp()
        encode(self.movie, 160, 90, 30, [bytes([90]) * (160 * 90)] * 30)
        self.attached(self.movie)

    def refused(self, text):
        file = self.folder / "style.json"
        file.write_text(text) if isinstance(text, str) else file.write_bytes(text)
        done = run(self.movie, "-o", self.film, "--style", file, check=False)
        self.assertEqual(done.returncode, 1, done.stderr)
        self.assertFalse(self.film.exists())
        self.assertEqual([path.name for path in self.folder.iterdir() if "Film" in path.name], [])
        return done.stderr.replace(str(file), "style.json").strip()

    def test_errors_name_the_line_and_the_key(self):
        head = '{"schema": "zulm.style",\n "schema_version": 1,\n '
        self.assertIn('style.json: line 3: "cursor.size" must be a number from 0.25 to 10',
                      self.refused(head + '"cursor": {"size": 99\n}}'))
        self.assertIn('style.json: line 4: "cursor.colour" is not known',
                      self.refused(head + '"cursor": {\n"colour": 1}}'))
        self.assertIn('style.json: line 3: "background.color" must be a colour',
                      self.refused(head + '"background": {"color": "red"}}'))
        self.assertIn('style.json: line 3: "keys.display" must be one of "shown", "shortcuts", "hidden"',
                      self.refused(head + '"keys": {"display": "all"}}'))
        self.assertIn('style.json: line 4: no JSON document', self.refused(head + '"zoom": {\n"auto" true}}'))
        self.assertIn('style.json: line 3: "schema" stands there twice', self.refused(head + '"schema": "zulm.style"}'))
        self.assertIn('"schema" must be "zulm.style"', self.refused("{}"))

    def test_hostile_styles_are_refused(self):
        for text in ("", "[]", "null", '"x"', "[" * 100000, '{"a":' * 50000, b"\xff\xfe\x00", "{" + '"x":1,' * 100,
                     '{"schema": "zulm.style", "schema_version": 1e999}',
                     '{"schema": "zulm.style", "schema_version": 1, "cursor": {"size": 1e308}}',
                     '{"schema": "zulm.style", "schema_version": 1, "cursor": []}',
                     '{"schema": "zulm.style", "schema_version": 1, "keys": {"font": "%s"}}' % ("x" * 5000),
                     "x" * (2 << 20)):
            self.refused(text)

    def test_an_unknown_style_names_those_that_are_there(self):
        done = run(self.movie, "-o", self.film, "--style", "fancy", check=False)
        self.assertEqual(done.returncode, 1)
        self.assertIn("plain, product", done.stderr)

    def test_the_background_and_the_movie_are_where_the_style_says(self):
        style = self.style(background={"color": "#ffffff"}, frame={"padding": 108, "corner_radius": 0,
                                                                   "shadow_opacity": 0})
        run(self.movie, "-o", self.film, "--style", style, "--size", "320x180", "--quality", "5")
        frame = next(frames_of(self.film, 320, 180))
        for x, y, light in ((5, 5, 255), (160, 10, 255), (36, 22, 90), (284, 156, 90), (300, 90, 255), (160, 170, 255)):
            self.assertAlmostEqual(frame[y * 320 + x], light, delta=4, msg=f"at {x}, {y}")

    def test_the_film_carries_the_region_with_its_padding(self):
        style = self.style(frame={"padding": 108, "corner_radius": 0, "shadow_opacity": 0})
        run(self.movie, "-o", self.film, "--style", style, "--size", "320x180")
        region = struct.unpack_from("<d4i", streams_of(self.film)["2b7b6af6"], 24)
        self.assertEqual(region, (0, -20, -11, 200, 113))


class Captions(Films):
    """Two recordings that differ in one key alone show whether a film tells which key it was."""
    CONTROL, ALT, VIRTUAL = 0x40000, 0x80000, 0x40000000

    def picture(self, code, flags, display):
        encode(self.movie, 320, 180, 30, [bytes([60]) * (320 * 180)] * 60)
        attach(self.movie, {"recordingRegion": [(0, 0, 0, 320, 180)], "cursorLocation": [(0, 5, 5)],
                            "keyboardAction": [(0.5, code, flags)]})
        stills = self.folder / "stills"
        run(self.movie, "--frames", stills, "--at", "1", "--keys", display, "--force", "--style", self.style())
        return ffmpeg("-i", stills / "frame-00001.000.png", "-f", "rawvideo", "-pix_fmt", "gray", "-")

    def tells(self, flags, display):
        return self.picture(ord("S"), flags, display) != self.picture(ord("Q"), flags, display)

    def test_a_shortcut_shows_its_character(self):
        for display in ("shown", "shortcuts"):
            self.assertTrue(self.tells(self.VIRTUAL | self.CONTROL, display), display)
        self.assertFalse(self.tells(self.VIRTUAL | self.CONTROL, "hidden"))

    def test_what_is_typed_shows_only_if_asked(self):
        self.assertTrue(self.tells(self.VIRTUAL, "shown"))
        self.assertEqual(self.picture(ord("S"), self.VIRTUAL, "shortcuts"), self.picture(ord("S"), self.VIRTUAL, "hidden"))

    def test_a_character_that_alt_types_shows_only_if_asked(self):
        self.assertTrue(self.tells(self.ALT, "shown"))
        self.assertFalse(self.tells(self.ALT, "shortcuts"))


class Outputs(Films):
    def setUp(self):
        super().setUp()
        marker_recording(self.movie, 320, 240, 4)

    def test_frames_are_pictures_of_the_film(self):
        run(self.movie, "--frames", self.folder / "stills", "--at", "0.5,2.5", "--style", self.style())
        names = sorted(path.name for path in (self.folder / "stills").iterdir())
        self.assertEqual(names, ["frame-00000.500.png", "frame-00002.500.png"])
        raw = ffmpeg("-i", self.folder / "stills" / names[0], "-f", "rawvideo", "-pix_fmt", "gray", "-")
        cursor, box = middle_of(raw, 320, 200), middle_of(raw, 320, 60)
        self.assertLess(abs(cursor[0] - box[0]) + abs(cursor[1] - box[1]), 1)

    def test_a_gif_is_as_long_as_the_film(self):
        film = self.folder / "Film.gif"
        run(self.movie, "-o", film, "--gif", "--keep", "0-2", "--style", self.style())
        self.assertEqual(film.read_bytes()[:6], b"GIF89a")
        frames = list(frames_of(film, 320, 240))
        self.assertAlmostEqual(len(frames), 24, delta=1)
        cursor, box = middle_of(frames[12], 320, 200), middle_of(frames[12], 320, 60)
        self.assertLess(abs(cursor[0] - box[0]) + abs(cursor[1] - box[1]), 1.5)

    def test_idle_time_is_cut_to_a_rest(self):
        movie = self.folder / "Idle.mp4"
        encode(movie, 160, 90, 30, [bytes(160 * 90)] * 600)
        moves = [(t / 10, 20 + t, 30) for t in list(range(0, 30)) + list(range(150, 180))]
        attach(movie, {"recordingRegion": [(0, 0, 0, 160, 90)], "cursorLocation": moves})
        run(movie, "-o", self.film, "--remove-idle", "--idle-rest", "2", "--style", self.style())
        self.assertAlmostEqual(duration_of(self.film), 20 - (15 - 2.9) + 2, delta=0.05)

    def test_an_existing_film_is_replaced_only_if_asked(self):
        self.film.write_text("mine")
        self.assertEqual(run(self.movie, "-o", self.film, check=False).returncode, 1)
        self.assertEqual(self.film.read_text(), "mine")
        run(self.movie, "-o", self.film, "--force")
        self.assertNotEqual(self.film.read_bytes()[:4], b"mine")

    def test_an_interruption_leaves_nothing(self):
        long = self.folder / "Long.mp4"
        encode(long, 640, 360, 30, [bytes(640 * 360)] * 3000)
        self.attached(long)
        with subprocess.Popen([RENDERER, "render", str(long), "-o", str(self.film)], stderr=subprocess.PIPE) as process:
            deadline = time.monotonic() + 60
            while not any(path.stat().st_size > 0 for path in self.folder.glob(".Film.*")):
                self.assertLess(time.monotonic(), deadline, "nothing was begun")
                time.sleep(0.02)
            process.send_signal(signal.SIGINT)
            process.wait(60)
        self.assertEqual(process.returncode, -signal.SIGINT)
        self.assertEqual(sorted(path.name for path in self.folder.iterdir()), ["Long.mp4", "Recording.mp4"])

    def test_two_times_of_one_name_are_refused(self):
        stills = self.folder / "stills"
        self.assertEqual(run(self.movie, "--frames", stills, "--at", "1,1.0001", check=False).returncode, 1)
        self.assertFalse(stills.exists())

    def test_a_full_standard_output_is_a_failure(self):
        with open("/dev/full", "wb") as full:
            done = subprocess.run([RENDERER, "render", str(self.movie), "-o", str(self.film)], stdout=full,
                                  stderr=subprocess.PIPE, timeout=300)
        self.assertEqual(done.returncode, 1, done.stderr)

    def test_wrong_options_are_refused(self):
        for words in ([], ["-o", "x.avi"], ["--gif", "-o", "x.mp4"], ["-o", "x.mp4", "--size", "3x3"],
                      ["-o", "x.mp4", "--size", "101x100"], ["--frames", "x"], ["-o", "x.mp4", "--keep", "1-2",
                                                                               "--remove-idle"]):
            self.assertEqual(run(self.movie, *words, check=False).returncode, 2, words)


class Hostile(Films):
    def failed(self, *words):
        done = run(*words, "-o", self.film, check=False)
        self.assertEqual(done.returncode, 1, done.stderr)
        self.assertFalse(self.film.exists())
        self.assertGreater(len(done.stderr.strip()), 10)

    def test_what_is_no_movie_is_refused(self):
        self.failed(self.folder / "absent.mp4")
        for contents in (b"", b"x" * 100, bytes(5000)):
            self.movie.write_bytes(contents)
            self.failed(self.movie)

    def test_a_movie_without_metadata_is_told(self):
        encode(self.movie, 160, 90, 30, [bytes(160 * 90)] * 10)
        done = run(self.movie, "-o", self.film, check=False)
        self.assertEqual(done.returncode, 4)
        self.assertFalse(self.film.exists())

    def test_a_movie_without_pictures_is_refused(self):
        ffmpeg("-f", "lavfi", "-i", "sine=duration=1", self.movie)
        self.attached(self.movie)
        self.failed(self.movie)

    def test_odd_cursors_make_a_film(self):
        encode(self.movie, 160, 90, 30, [bytes(160 * 90)] * 30)
        far = 2147483647
        attach(self.movie, {
            "recordingRegion": [(0, 0, 0, 160, 90)],
            "cursorLocation": [(0, 10, 10), (0.3, far, -far), (0.5, 40, 40), (float("nan"), 1, 1), (0.6, -far, far)],
            "cursorAction": [(0.1, 1), (0.55, 2), (0.7, 256), (0.8, 77)],
            "cursorImage": [(0, 1, png(1500, 1500, (255, 0, 0, 255)), far, -far), (0.2, 2, b"nothing", 0, 0),
                            (0.4, 3, b"", 0, 0), (0.5, 4, png(1, 1, (1, 2, 3, 4)), -far, far)]})
        done = run(self.movie, "-o", self.film, "--style", "product", check=False)
        self.assertEqual(done.returncode, 3, done.stderr) # an entry without a time is left out
        self.assertAlmostEqual(duration_of(self.film), 1, delta=0.04)

    def test_a_damaged_movie_makes_a_film_or_an_error(self):
        marker_recording(self.folder / "Whole.mp4", 160, 120, 2)
        whole = (self.folder / "Whole.mp4").read_bytes()
        start = whole.index(b"mdat") + 8
        for step, size in ((37, 3), (5, 2), (200, 60)):
            damaged = bytearray(whole)
            for place in range(start, min(start + 4000, whole.index(b"moov") - 8), step):
                damaged[place:place + size] = bytes(size)
            self.movie.write_bytes(damaged)
            self.assertIn(run(self.movie, "-o", self.film, "--force", check=False).returncode, (0, 1))

    def test_an_odd_region_makes_a_film(self):
        for region in ((0, 0, 0, 0, 0), (0, -5, -5, 1, 1), (0, 0, 0, 2147483647, 2147483647), (0, 0, 0, -10, -10)):
            encode(self.movie, 160, 90, 30, [bytes(160 * 90)] * 15)
            attach(self.movie, {"recordingRegion": [region], "cursorLocation": [(0, 10, 10)]})
            run(self.movie, "-o", self.film, "--force", "--style", "product")


class Redaction(Films):
    SECRET = "secret name"

    def setUp(self):
        super().setUp()
        encode(self.movie, 320, 240, 30, [bytes([200]) * (320 * 240)] * 120)
        attach(self.movie, {
            "recordingRegion": [(0, 0, 0, 320, 240)],
            "cursorLocation": [(0, 10, 10), (1.5, 150, 110), (2.5, 160, 120), (3.5, 20, 20)],
            "cursorImage": [(0, 1, png(1, 1, (0, 0, 0, 0)), 0, 0)],
            "cursorAction": [(0.5, 1), (0.6, 2), (2, 1), (2.1, 2), (3.6, 1), (3.7, 2)],
            "keyboardAction": [(0.2, 65, 0), (1.8, 66, 0), (3.8, 67, 0)],
            "topmostWindow": [(0, 0, 0, 50, 50), (1.4, 90, 90, 120, 100), (3.2, 0, 0, 50, 50)],
            "topmostWindowTitle": [(0, "public"), (1.4, self.SECRET), (3.2, "public")]})
        self.file = self.folder / "redactions.json"
        self.file.write_text(json.dumps({"schema": "zulm.redactions", "schema_version": 1, "places": [
            {"from": 1, "to": 3, "x": 101, "y": 81, "width": 98, "height": 78}]}))

    def test_places_are_black_at_their_times_and_not_at_others(self):
        run(self.movie, "-o", self.film, "--redact", self.file, "--style", self.style(), "--quality", "5")
        for number, frame in enumerate(frames_of(self.film, 320, 240)):
            covered = [frame[y * 320 + x] for x, y in ((102, 82), (180, 90), (197, 157), (102, 157))]
            if 30 <= number <= 90:
                self.assertLess(max(covered), 8, f"frame {number}")
            else:
                self.assertGreater(min(covered), 180, f"frame {number}")
            self.assertGreater(frame[70 * 320 + 250], 180)

    def test_streams_lose_what_lies_there(self):
        run(self.movie, "-o", self.film, "--redact", self.file, "--style", self.style())
        streams = streams_of(self.film)
        self.assertNotIn(self.SECRET.encode(), self.film.read_bytes())
        positions = [struct.unpack_from("<d2i", streams["2b7b6af2"], at)
                     for at in range(24, len(streams["2b7b6af2"]), 16)]
        for time_of, x, y in positions:
            self.assertFalse(1 <= time_of <= 3 and 101 <= x <= 199 and 81 <= y <= 159, positions)
        keys = [struct.unpack_from("<d2I", streams["2b7b6af5"], at)[1] for at in range(24, len(streams["2b7b6af5"]), 16)]
        self.assertEqual(keys, [65, 67])
        actions = [struct.unpack_from("<di", streams["2b7b6af0"], at)[0] for at in range(24, len(streams["2b7b6af0"]), 12)]
        self.assertFalse([when for when in actions if 1.9 < when < 2.2])

    def test_errors_name_the_line_and_the_member(self):
        self.file.write_text('{"schema": "zulm.redactions", "schema_version": 1,\n"places": [\n{"from": 1}]}')
        done = run(self.movie, "-o", self.film, "--redact", self.file, check=False)
        self.assertEqual(done.returncode, 1)
        self.assertIn('line 3: "places[0]" has no "to"', done.stderr)


class Golden(Films):
    """The styles look as they looked. ZULM_WRITE_GOLDEN=1 writes the pictures that this compares with.

    Encoders and decoders differ a little: on average a value of a pixel is at most 2 of 255 away, and at most one pixel
    in a hundred is more than 24 away."""

    FOLDER = pathlib.Path(__file__).resolve().parents[2] / "Data" / "golden" / "films"

    def setUp(self):
        super().setUp()
        picture = bytes((x // 2 + y) % 200 + 30 if (x // 20 + y // 20) % 2 else 220 for y in range(360) for x in range(640))
        encode(self.movie, 640, 360, 30, [picture] * 120)
        attach(self.movie, {
            "recordingRegion": [(0, 0, 0, 640, 360)],
            "cursorLocation": [(i / 30, 200 + i, 150 + i // 2) for i in range(120)],
            "cursorAction": [(1, 1), (1.15, 2), (3, 4), (3.1, 8)],
            "cursorImage": [(0, 1, png(16, 16, (255, 60, 20, 200)), 3, 3)]})

    def test_styles_look_as_they_did(self):
        for style in ("plain", "product"):
            stills = self.folder / style
            run(self.movie, "--frames", stills, "--at", "0.2,1.2,2", "--style", style)
            for still in sorted(stills.iterdir()):
                golden = self.FOLDER / f"{style}-{still.name}"
                if os.environ.get("ZULM_WRITE_GOLDEN"):
                    self.FOLDER.mkdir(exist_ok=True)
                    golden.write_bytes(still.read_bytes())
                now, then = (ffmpeg("-i", file, "-f", "rawvideo", "-pix_fmt", "rgb24", "-") for file in (still, golden))
                self.assertEqual(len(now), len(then))
                off = [abs(a - b) for a, b in zip(now, then)]
                self.assertLess(sum(off) / len(off), 2, golden.name)
                self.assertLess(sum(value > 24 for value in off) / len(off), 0.01, golden.name)


class Guide(Films):
    def test_a_guide_has_a_step_for_each_click_and_the_keys(self):
        encode(self.movie, 320, 240, 30, [bytes([60]) * (320 * 240)] * 240)
        attach(self.movie, {
            "recordingRegion": [(0, 0, 0, 320, 240)],
            "cursorLocation": [(0, 100, 100), (4, 200, 50)],
            "cursorAction": [(1, 1), (1.1, 2), (1.2, 1), (1.3, 2), (5, 4), (5.1, 8)],
            "keyboardAction": [(3, 112, 0), (3.1, 113, 0), (6.5, ord("S"), 0x40040000)],
            "topmostAppName": [(0, "Editor")], "topmostWindowTitle": [(0, "<b> & *stars*"), (4, "Second")]})
        run(self.movie, "-o", self.folder / "guide", command="guide")
        names = sorted(path.name for path in (self.folder / "guide").iterdir())
        self.assertEqual(names, ["guide.html", "guide.md", "step-001.png", "step-002.png", "step-003.png",
                                 "step-004.png"])
        page = (self.folder / "guide" / "guide.html").read_text()
        self.assertEqual(re.findall(r"<li>([^<]*)", page)[0].strip(), "Double-click")
        self.assertIn("&lt;b&gt; &amp; *stars* (Editor)", page)
        self.assertNotIn("<b>", page)
        text = (self.folder / "guide" / "guide.md").read_text()
        self.assertIn("2. Type the text", text)
        self.assertIn("3. Right-click — Second \\(Editor\\)", text)
        self.assertIn("4. Press ⌃S", text)


if __name__ == "__main__":
    if not RENDERER or not pathlib.Path(RENDERER).exists():
        print("zulm-render is not built")
        sys.exit(77)
    unittest.main(verbosity=2)
