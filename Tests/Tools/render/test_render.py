#!/usr/bin/env python3
"""Renders films of recordings whose pictures say where the cursor must be, and looks at the films.

Usage: test_render.py SUITE; ZULM_RENDER names the program. Ends with 77 if it is not there."""

import array
import json
import os
import pathlib
import random
import re
import signal
import struct
import subprocess
import sys
import tempfile
import time
import unittest

from recordings import attach, encode, ffmpeg, frames_of, marker_recording, middle_of, png, stream

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


def append(movie, streams):
    """Attaches streams that `streams_of` returned."""
    atoms = b"".join(struct.pack(">I4sQ", 1, b"DATA", 16 + len(data)) + data for data in streams.values())
    with open(movie, "ab") as file:
        file.write(struct.pack(">I4sQ", 1, b"ZULM", 16 + len(atoms)) + atoms)


def most_memory(*words):
    """The most memory that the renderer has had, in megabytes."""
    process = subprocess.Popen([RENDERER, "render", *map(str, words)], stdout=subprocess.DEVNULL)
    _, status, usage = os.wait4(process.pid, 0)
    process.returncode = os.waitstatus_to_exitcode(status)
    if process.returncode != 0:
        raise AssertionError(f"{words}: ended with {process.returncode}")
    return usage.ru_maxrss / 1024


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
        self.check(most=1.01)

    def test_a_turned_movie(self):
        marker_recording(self.folder / "Straight.mp4", 640, 360, 2)
        streams = streams_of(self.folder / "Straight.mp4")
        ffmpeg("-i", self.folder / "Straight.mp4", "-vf", "transpose=2", "-c:v", "libx264", "-crf", "10",
               self.folder / "Left.mp4")
        ffmpeg("-i", self.folder / "Left.mp4", "-c", "copy", "-metadata:s:v", "rotate=270", self.movie)
        append(self.movie, streams)
        self.check()
        self.assertEqual(size_of(self.film), (640, 360))

    def test_a_movie_of_10_bits(self):
        marker_recording(self.folder / "Plain.mp4", 640, 360, 2)
        streams = streams_of(self.folder / "Plain.mp4")
        ffmpeg("-i", self.folder / "Plain.mp4", "-pix_fmt", "yuv420p10le", "-c:v", "libx264", "-crf", "10", self.movie)
        append(self.movie, streams)
        self.check()

    def test_the_film_can_be_rendered_again(self):
        marker_recording(self.movie, 640, 360, 6)
        first = self.folder / "First.mp4"
        run(self.movie, "-o", first, "--style", self.style(cursor={"size": 0.25, "smooth": False}), "--keep", "4-6",
            "--keep", "0-1.5@2", "--quality", "8")
        self.check(movie=first, most=1.0)


    def test_pixels_that_are_wider_than_high(self):
        marker_recording(self.folder / "Square.mp4", 640, 360, 2)
        streams = streams_of(self.folder / "Square.mp4")
        ffmpeg("-i", self.folder / "Square.mp4", "-vf", "scale=480:360,setsar=4/3", "-c:v", "libx264", "-crf", "10", self.movie)
        append(self.movie, streams)
        self.check()
        self.assertEqual(size_of(self.film), (640, 360))

    def test_a_movie_of_odd_sides(self):
        marker_recording(self.folder / "Even.mp4", 642, 362, 2)
        streams = streams_of(self.folder / "Even.mp4")
        ffmpeg("-i", self.folder / "Even.mp4", "-vf", "crop=641:361:0:0:exact=1,format=yuv444p", "-c:v", "libx264", "-crf", "10",
               self.movie)
        streams["2b7b6af6"] = stream("recordingRegion", [(0, 0, 0, 641, 361)])
        append(self.movie, streams)
        self.check()

    def test_an_avi_movie(self):
        marker_recording(self.folder / "Movie.mp4", 320, 240, 2)
        streams = streams_of(self.folder / "Movie.mp4")
        movie = self.folder / "Movie.avi"
        ffmpeg("-i", self.folder / "Movie.mp4", "-c:v", "mpeg4", "-q:v", "2", movie)
        chunks = b"".join(b"DATA" + struct.pack("<I", len(data)) + data + bytes(len(data) % 2) for data in streams.values())
        with open(movie, "ab") as file:
            file.write(b"ZULM" + struct.pack("<I", len(chunks)) + chunks)
        self.check(movie=movie)


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

    def test_sound_keeps_its_pitch(self):
        ffmpeg("-f", "lavfi", "-i", "color=s=160x90:d=4", "-f", "lavfi", "-i", "sine=frequency=500:duration=4", "-c:v", "libx264",
               "-pix_fmt", "yuv420p", self.movie)
        self.attached(self.movie)
        for speed, length in (("2", 2), ("1/2", 8)):
            run(self.movie, "-o", self.film, "--style", self.style(), "--keep", f"0-4@{speed}", "--force")
            raw = array.array("h", ffmpeg("-i", self.film, "-f", "s16le", "-ac", 1, "-ar", 48000, "-"))
            middle = raw[48000 // 2:(length * 48000) - 48000 // 2]
            rises = sum(a < 0 <= b for a, b in zip(middle, middle[1:]))
            self.assertAlmostEqual(rises / (len(middle) / 48000), 500, delta=5, msg=f"at speed {speed}")

    def test_extreme_speeds_are_silent(self):
        self.beeps(2)
        run(self.movie, "-o", self.film, "--style", self.style(), "--keep", "0-2@1" + "0" * 300, "--keep", "0-0.0001@1/20000")
        self.assertAlmostEqual(duration_of(self.film), 2, delta=0.1)

    def test_sound_that_changes_its_channels(self):
        one, two = self.folder / "one.mp3", self.folder / "two.mp3"
        for file, channels in ((one, 2), (two, 1)):
            ffmpeg("-f", "lavfi", "-i", "sine=frequency=500:duration=2", "-ac", channels, "-ar", 44100, file)
        (self.folder / "both.mp3").write_bytes(one.read_bytes() + two.read_bytes() + one.read_bytes())
        ffmpeg("-f", "lavfi", "-i", "color=s=160x90:d=6", "-i", self.folder / "both.mp3", "-c:v", "libx264", "-pix_fmt", "yuv420p",
               "-c:a", "copy", self.movie)
        self.attached(self.movie)
        run(self.movie, "-o", self.film, "--style", self.style())
        raw = array.array("h", ffmpeg("-i", self.film, "-f", "s16le", "-ac", 1, "-ar", 8000, "-"))
        for second in (1, 3, 5):
            self.assertGreater(max(raw[second * 8000:second * 8000 + 800]), 1000, f"at {second} s")

    def test_a_pause_of_the_sound_stays_a_pause(self):
        self.beeps(12)
        whole = self.folder / "Whole.mp4"
        self.movie.rename(whole)
        streams = streams_of(whole)
        ffmpeg("-i", whole, "-c:v", "copy", "-af", "aselect='lt(t,2)+gt(t,10)'", "-c:a", "aac", self.movie)
        append(self.movie, streams)
        run(self.movie, "-o", self.film, "--style", self.style(), "--fps", self.FPS, "--keep", "0-2", "--keep", "10-12")
        self.check(4)
        run(self.movie, "-o", self.film, "--style", self.style(), "--fps", self.FPS, "--force")
        flashes, beeps = self.onsets()
        self.assertEqual((len(flashes), len(beeps)), (12, 4))
        for beep, flash in zip(beeps, flashes[:2] + flashes[10:]):
            self.assertLess(abs(beep - flash), 0.020)

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
        self.assertIn('style.json: line 4: is not a JSON document', self.refused(head + '"zoom": {\n"auto" true}}'))
        self.assertIn('style.json: line 3: "schema" is given twice', self.refused(head + '"schema": "zulm.style"}'))
        self.assertIn('"schema" must be "zulm.style"', self.refused("{}"))
        self.assertIn('line 2: "schema_version" must be 1', self.refused('{"schema": "zulm.style",\n"schema_version": 2}'))
        self.assertIn('style.json: line 3: "cursor.size" is not known', self.refused(head + '"cursor.size": 9}'))
        self.assertIn('style.json: line 3: "background.color" must be a colour such as "#3d7bff"',
                      self.refused(head + '"background": {"color": "#3d7bff80"}}'))

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

    def test_what_is_left_out_is_as_in_product(self):
        file = self.folder / "empty.json"
        file.write_text('{"schema": "zulm.style", "schema_version": 1}')
        pictures = []
        for style in (file, "product"):
            stills = self.folder / "stills"
            run(self.movie, "--frames", stills, "--at", "0.5", "--style", style, "--force")
            pictures.append((stills / "frame-00000.500.png").read_bytes())
        self.assertEqual(*pictures)

    def test_a_file_does_not_take_the_place_of_a_style_that_ships(self):
        (self.folder / "product").write_text("no style")
        done = subprocess.run([RENDERER, "render", str(self.movie), "-o", str(self.film)], cwd=self.folder, timeout=300,
                              stderr=subprocess.PIPE)
        self.assertEqual(done.returncode, 0, done.stderr)

    def test_corners_are_round_in_a_small_film_too(self):
        style = self.style(background={"color": "#ffffff"}, frame={"padding": 0, "corner_radius": 400, "shadow_opacity": 0})
        run(self.movie, "-o", self.film, "--style", style, "--size", "160x90", "--quality", "5")
        frame = next(frames_of(self.film, 160, 90))
        self.assertGreater(frame[0], 250)
        self.assertGreater(frame[89 * 160 + 159], 250)
        for x, y in ((60, 45), (60, 2), (60, 87), (4, 45), (155, 45)):
            self.assertAlmostEqual(frame[y * 160 + x], 90, delta=5, msg=f"at {x}, {y}")

    def test_the_schema_takes_what_the_renderer_takes(self):
        """Documents that both take, and documents that both refuse."""
        try:
            import jsonschema
        except ImportError:
            self.skipTest("python3-jsonschema is not installed")
        sources = pathlib.Path(__file__).resolve().parents[3]
        schema = json.loads((sources / "Docs" / "schemas" / "zulm.style.schema.json").read_text())
        shipped = [json.loads(file.read_text()) for file in sorted((sources / "Tools" / "render" / "styles").iterdir())]
        self.assertEqual(len(shipped), 2)
        head = {"schema": "zulm.style", "schema_version": 1}
        fine = shipped + [{**head, **sections} for sections in (
            {}, {"name": "x"}, {"background": {"color": "#012345", "to": "#abcDEF", "angle": -360}}, {"frame": {"padding": 400}},
            {"cursor": {"size": 0.25, "hide_after": None}}, {"cursor": {"hide_after": 0.1}}, {"clicks": {"color": "#01234567"}},
            {"keys": {"display": "hidden", "size": 6}}, {"zoom": {"auto": False, "factor": 8}})]
        wrong = [{}, {**head, "schema": "zulm.zooms"}, {**head, "schema_version": 2}] + [{**head, **sections} for sections in (
            {"cursor.size": 9}, {"frame": 1}, {"frame": {"padding": 401}}, {"frame": {"padding": "1"}}, {"name": "x" * 201},
            {"background": {"to": "#012345"}}, {"background": {"color": "#01234567"}}, {"background": {"color": "blue"}},
            {"background": {"color": "#012345", "angle": 361}}, {"cursor": {"size": 0.2}}, {"cursor": {"smooth": 1}},
            {"cursor": {"hide_after": 0}}, {"clicks": {"duration": 0.01}}, {"clicks": {"show": None}},
            {"keys": {"display": "Shown"}}, {"keys": {"font": 1}}, {"zoom": {"factor": 0.5}}, {"zoom": {"speed": 1}})]
        file = self.folder / "style.json"
        for documents, is_fine in ((fine, True), (wrong, False)):
            for document in documents:
                file.write_text(json.dumps(document))
                done = run(self.movie, "--frames", self.folder / "stills", "--at", "0", "--style", file, "--force", check=False)
                self.assertEqual(done.returncode, 0 if is_fine else 1, f"{document}: {done.stderr}")
                self.assertEqual(jsonschema.Draft202012Validator(schema).is_valid(document), is_fine, document)

    def test_the_film_carries_the_region_with_its_padding(self):
        style = self.style(frame={"padding": 108, "corner_radius": 0, "shadow_opacity": 0})
        run(self.movie, "-o", self.film, "--style", style, "--size", "320x180")
        region = struct.unpack_from("<d4i", streams_of(self.film)["2b7b6af6"], 24)
        self.assertEqual(region, (0, -20, -11, 200, 113))

    def test_the_film_gets_a_region_if_positions_would_not_fit_it(self):
        movie = self.folder / "Plain.mp4"
        encode(movie, 160, 90, 30, [bytes([90]) * (160 * 90)] * 10)
        attach(movie, {"cursorLocation": [(0, 80, 45)]})
        run(movie, "-o", self.film, "--style", self.style())
        self.assertNotIn("2b7b6af6", streams_of(self.film))
        run(movie, "-o", self.film, "--style", self.style(), "--size", "320x240", "--force")
        self.assertEqual(struct.unpack_from("<d4i", streams_of(self.film)["2b7b6af6"], 24), (0, 0, -15, 160, 120))


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


class Cursor(Films):
    """How the cursor and the clicks are drawn, on a black movie."""

    def setUp(self):
        super().setUp()
        encode(self.movie, 320, 180, 30, [bytes(320 * 180)] * 180)
        attach(self.movie, {"recordingRegion": [(0, 0, 0, 320, 180)],
                            "cursorLocation": [(i / 30, 60 + i, 60 + 40 * (i // 10 % 2)) for i in range(61)],
                            "cursorAction": [(2.2, 1), (5, 2)],
                            "cursorImage": [(0, 1, png(10, 10, (255, 255, 255, 255)), 2, 7)]})

    def frame(self, time_of, *words, **sections):
        stills = self.folder / "stills"
        run(self.movie, "--frames", stills, "--at", time_of, "--force", "--style", self.style(**sections), *words)
        return ffmpeg("-i", stills / f"frame-{float(time_of):09.3f}.png", "-f", "rawvideo", "-pix_fmt", "gray", "-")

    def test_it_grows_around_its_hot_spot(self):
        for size in (1, 2.5, 4):
            frame = self.frame("2", "--cursor-size", size)
            self.assertAlmostEqual(sum(value > 127 for value in frame), 100 * size * size, delta=12 * size, msg=f"size {size}")
            middle = middle_of(frame, 320, 128)
            self.assertAlmostEqual(middle[0], 120 + 3 * size, delta=0.6)
            self.assertAlmostEqual(middle[1], 60 - 2 * size, delta=0.6)

    def test_it_disappears_at_rest_if_asked(self):
        self.assertGreater(max(self.frame("4.9")), 200)
        self.assertGreater(max(self.frame("2.9", "--hide-cursor", "1")), 200)
        self.assertLess(max(self.frame("4.5", "--hide-cursor", "1")), 16)

    def test_it_moves_smoothly_unless_raw(self):
        """The cursor jumps up and down three times a second, by 40 units."""
        def steps(*words):
            run(self.movie, "-o", self.film, "--style", self.style(cursor={"size": 1, "smooth": True}), "--keep", "0-2", "--force",
                *words)
            heights = [middle_of(frame, 320, 128)[1] for frame in frames_of(self.film, 320, 180)]
            return max(abs(a - b) for a, b in zip(heights, heights[1:]))
        self.assertGreater(steps("--raw-cursor"), 35)
        self.assertLess(steps(), 30)

    def test_a_click_has_a_ring_as_long_as_it_is_held_through_cuts(self):
        rings = {"show": True, "color": "#ffffff", "radius": 100, "duration": 0.3}
        def light(time_of, *words):
            return sum(value > 20 for value in self.frame(time_of, *words, clicks=rings))
        bare = light("2.1")
        self.assertGreater(light("2.3"), 2 * bare)
        self.assertGreater(light("4"), 2 * bare) # the button is held
        self.assertEqual(light("5.6"), bare)
        self.assertGreater(light("1", "--keep", "0-0.5", "--keep", "3-6"), 2 * bare)


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
        run("--remove-idle", movie, "-o", self.film, "--idle-rest", "2", "--style", self.style())
        self.assertAlmostEqual(duration_of(self.film), 20 - (15 - 2.9) + 2, delta=0.05)

    def test_an_existing_film_is_replaced_only_if_asked(self):
        self.film.write_text("mine")
        self.assertEqual(run(self.movie, "-o", self.film, check=False).returncode, 1)
        self.assertEqual(self.film.read_text(), "mine")
        run(self.movie, "-o", self.film, "--force")
        self.assertNotEqual(self.film.read_bytes()[:4], b"mine")

    @staticmethod
    def interruptible(*words):
        """A renderer that SIGINT ends, also if these tests ignore it because they run in the background."""
        return subprocess.Popen([RENDERER, *map(str, words)], stderr=subprocess.PIPE,
                                preexec_fn=lambda: signal.signal(signal.SIGINT, signal.SIG_DFL))

    def test_an_interruption_leaves_nothing(self):
        long = self.folder / "Long.mp4"
        encode(long, 640, 360, 30, [bytes(640 * 360)] * 3000)
        self.attached(long)
        with self.interruptible("render", long, "-o", self.film) as process:
            deadline = time.monotonic() + 60
            while not any(path.stat().st_size > 0 for path in self.folder.glob(".Film.*")):
                self.assertLess(time.monotonic(), deadline, "nothing was begun")
                time.sleep(0.02)
            process.send_signal(signal.SIGINT)
            process.wait(60)
        self.assertEqual(process.returncode, -signal.SIGINT)
        self.assertEqual(sorted(path.name for path in self.folder.iterdir()), ["Long.mp4", "Recording.mp4"])

    def test_frames_guides_and_images_leave_nothing_if_they_are_interrupted(self):
        clicks = [(0.1 + i / 100, (1, 2, 4, 8)[i % 4]) for i in range(380)] # left and right in turn
        attach(self.movie, {"recordingRegion": [(0, 0, 0, 320, 240)], "cursorLocation": [(i / 25, 3 * i, 2 * i) for i in range(100)],
                            "cursorAction": clicks})
        times = ",".join(f"{i / 1000}" for i in range(4000))
        before = sorted(path.name for path in self.folder.iterdir())
        for words in (["guide", self.movie, "-o", self.folder / "guide"],
                      ["render", self.movie, "--frames", self.folder / "stills", "--at", times],
                      ["render", self.movie, "-o", self.folder / "Film.gif", "--gif", "--fps", "50"]):
            with self.interruptible(*words, "--size", "1280x960") as process:
                deadline = time.monotonic() + 60
                while not [path for path in self.folder.rglob("*") if path.is_file() and path.name not in before]:
                    self.assertLess(time.monotonic(), deadline, "nothing was begun")
                    time.sleep(0.01)
                process.send_signal(signal.SIGINT)
                message = process.communicate(timeout=60)[1]
            self.assertEqual(process.returncode, -signal.SIGINT, message)
            self.assertEqual(sorted(path.name for path in self.folder.iterdir()), before, words)

    def test_what_damage_hides_is_told_whatever_is_made(self):
        encode(self.movie, 160, 90, 30, [bytes(160 * 90)] * 30)
        attach(self.movie, {"recordingRegion": [(0, 0, 0, 160, 90)], "cursorLocation": [(0, 10, 10), (float("nan"), 1, 1)],
                            "cursorAction": [(0.2, 1), (0.3, 2)]})
        for words in (["-o", self.film], ["-o", self.folder / "Film.gif", "--gif"], ["--frames", self.folder / "stills", "--at", "0"]):
            self.assertEqual(run(self.movie, *words, check=False).returncode, 3, words)
        self.assertEqual(run(self.movie, "-o", self.folder / "guide", command="guide", check=False).returncode, 3)

    def test_other_encoders_take_a_quality(self):
        noise = random.Random(1)
        encode(self.movie, 160, 90, 30, [noise.randbytes(160 * 90) for _ in range(15)])
        self.attached(self.movie)
        sizes = []
        for quality in ("2", "45"):
            done = run(self.movie, "-o", self.film, "--codec", "mpeg4", "--quality", quality, "--force")
            self.assertIn("its own scale of quality", done.stderr)
            sizes.append(self.film.stat().st_size)
        self.assertGreater(sizes[0], 2 * sizes[1])

    def test_edit_lists_and_removed_ranges(self):
        run(self.movie, "-o", self.film, "--remove", "1-3", "--style", self.style())
        self.assertAlmostEqual(duration_of(self.film), 2, delta=0.04)
        edits = self.folder / "edits.json"
        edits.write_text(json.dumps({"schema": "zulm.edits", "schema_version": 1, "pieces": [
            {"start": 0, "end": 2, "speed": 2}, {"at": 1, "duration": 1}]}))
        run(self.movie, "-o", self.film, "--edits", edits, "--style", self.style(), "--force")
        self.assertAlmostEqual(duration_of(self.film), 2, delta=0.04)

    def test_names_of_files_cannot_write_to_the_terminal(self):
        done = run(self.movie, "-o", self.folder / "\x1b[31mFilm.mp4", "--keep", "0-0.2")
        self.assertNotIn("\x1b", done.stdout)
        self.assertIn("Film.mp4", done.stdout)

    def test_no_file_that_is_read_is_replaced(self):
        zooms = self.folder / "zooms.mp4"
        zooms.write_text('{"schema": "zulm.zooms", "schema_version": 1, "zooms": []}')
        self.assertEqual(run(self.movie, "--zoom", zooms, "-o", zooms, "--force", check=False).returncode, 1)
        self.assertIn("zulm.zooms", zooms.read_text())

    def test_memory_does_not_grow_with_the_film(self):
        style = self.style()
        short = most_memory(self.movie, "-o", self.film, "--style", style, "--keep", "0-1")
        pieces = [word for _ in range(30) for word in ("--keep", "0-4@1/2")]
        long = most_memory(self.movie, "-o", self.film, "--style", style, "--force", *pieces)
        self.assertLess(long, short + 16, "megabytes")

    def test_two_times_of_one_name_are_refused(self):
        stills = self.folder / "stills"
        self.assertEqual(run(self.movie, "--frames", stills, "--at", "1,1.0001", check=False).returncode, 1)
        self.assertFalse(stills.exists())

    def test_a_full_standard_output_is_a_failure(self):
        with open("/dev/full", "wb") as full:
            done = subprocess.run([RENDERER, "render", str(self.movie), "-o", str(self.film)], stdout=full,
                                  stderr=subprocess.PIPE, timeout=300)
        self.assertEqual(done.returncode, 1, done.stderr)

    def test_numbers_must_be_numbers(self):
        for option in ("--fps", "--cursor-size", "--hide-cursor", "--quality"):
            for value in ("nan", "inf", "-1", "x"):
                self.assertEqual(run(self.movie, "-o", self.film, option, value, check=False).returncode, 2, (option, value))
        for option in ("--idle-least", "--idle-rest"):
            self.assertEqual(run(self.movie, "-o", self.film, "--remove-idle", option, "nan", check=False).returncode, 2)
        self.assertEqual(run(self.movie, "--frames", self.folder / "stills", "--at", "1,nan", check=False).returncode, 2)

    def test_wrong_options_are_refused(self):
        for words in ([], ["-o", "x.avi"], ["--gif", "-o", "x.mp4"], ["-o", "x.mp4", "--size", "3x3"],
                      ["-o", "x.mp4", "--size", "101x100"], ["--frames", "x"], ["-o", "x.mp4", "--keep", "1-2",
                                                                               "--remove-idle"],
                      ["-o", "x.mp4", "--size", " 320x+240"], ["-o", "x.gif", "--gif", "--fps", "51"],
                      ["-o", "x.mp4", "--idle-rest", "1"], ["-o", "x.mp4", "--idle-least", "1"]):
            self.assertEqual(run(self.movie, *words, check=False).returncode, 2, words)


class Hostile(Films):
    def failed(self, *words, code=1):
        done = run(*words, "-o", self.film, check=False)
        self.assertEqual(done.returncode, code, done.stderr)
        self.assertFalse(self.film.exists())
        self.assertGreater(len(done.stderr.strip()), 10)

    def test_what_is_no_movie_is_refused(self):
        self.failed(self.folder / "absent.mp4")
        for contents, code in ((b"", 4), (b"x" * 100, 4), (bytes(5000), 1)):
            self.movie.write_bytes(contents)
            self.failed(self.movie, code=code)

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
            self.assertIn(run(self.movie, "-o", self.film, "--force", check=False).returncode, (0, 1, 3))

    def test_a_movie_that_was_cut_off_is_told(self):
        """Half of the pictures are missing in the file, though its table has them."""
        marker_recording(self.folder / "Whole.mp4", 320, 240, 4)
        streams = streams_of(self.folder / "Whole.mp4")
        ffmpeg("-i", self.folder / "Whole.mp4", "-c", "copy", "-movflags", "+faststart", self.folder / "Fast.mp4")
        data = (self.folder / "Fast.mp4").read_bytes()
        start = data.index(b"mdat") - 4
        self.assertLess(data.index(b"moov"), start)
        half = (len(data) - start) // 2
        self.movie.write_bytes(data[:start] + struct.pack(">I", half) + data[start + 4:start + half])
        append(self.movie, streams)
        done = run(self.movie, "-o", self.film, check=False)
        self.assertEqual(done.returncode, 3, done.stderr)
        self.assertIn("end before the movie does", done.stderr)
        self.assertAlmostEqual(duration_of(self.film), 4, delta=0.04)

    def test_whole_movies_are_not_taken_for_cut_off(self):
        marker_recording(self.folder / "Whole.mp4", 160, 120, 4)
        streams = streams_of(self.folder / "Whole.mp4")
        whole = ["-i", self.folder / "Whole.mp4"]
        coding = ["-c:v", "libx264", "-pix_fmt", "yuv420p"]
        sound = ["-f", "lavfi", "-i", "sine=duration=9", "-c:a", "aac"]
        for words in (["-ss", "1.3", *whole, "-c", "copy"], [*whole, *sound, *coding], [*whole, *coding, "-bf", "3", "-r", "7"],
                      [*whole, "-vf", "select='lt(n,20)+eq(n,110)'", "-vsync", "vfr", *coding],
                      [*whole, "-c", "copy", "-movflags", "+frag_keyframe+empty_moov"],
                      [*whole, "-vf", "tpad=stop_duration=3:stop_mode=clone,select='lt(n,120)+eq(n,200)'", "-vsync", "vfr", *coding]):
            ffmpeg(*words, self.movie)
            append(self.movie, streams)
            self.assertEqual(run(self.movie, "-o", self.film, "--force", "--style", self.style()).stderr, "", words)

    def test_pieces_that_nobody_can_have_recorded_are_refused(self):
        marker_recording(self.movie, 160, 120, 2)
        for piece in ("0-100000000000000000000", "100000000000000000000-100000000000000000001", "0-1@1/100000000"):
            self.failed(self.movie, "--keep", piece)

    def test_many_large_cursors_take_little_memory(self):
        encode(self.movie, 160, 90, 30, [bytes(160 * 90)] * 60)
        attach(self.movie, {"recordingRegion": [(0, 0, 0, 160, 90)], "cursorLocation": [(0, 80, 45)],
                            "cursorImage": [(i / 30, i, png(1024, 1024, (i, 0, 0, 255)), 5, 5) for i in range(60)]})
        self.assertLess(most_memory(self.movie, "-o", self.film, "--style", self.style()), 200)

    def test_a_list_of_files_is_no_movie(self):
        secret = self.folder / "Secret.mp4"
        marker_recording(secret, 160, 120, 1)
        self.movie.write_text(f"ffconcat version 1.0\nfile '{secret}'\n")
        streams = streams_of(secret)
        append(self.movie, streams)
        self.assertNotEqual(run(self.movie, "-o", self.film, check=False).returncode, 0)
        self.assertFalse(self.film.exists())

    def test_bad_zooms_name_the_line(self):
        marker_recording(self.movie, 160, 120, 1)
        file = self.folder / "zooms.json"
        head = '{"schema": "zulm.zooms", "schema_version": 1,\n"zooms": [\n'
        for text, sentence in ((head + '{"start": 1}]}', 'line 3: "zooms[0]" has no "end"'),
                               (head + '{"start": 2, "end": 1}]}', 'line 3: "zooms[0]" must end after its start'),
                               (head + '{"start": 0, "end": 1, "factor": 99}]}', '"zooms[0].factor" must be a number from 1 to 20'),
                               (head + '{"start": 0, "end": 1, "who": 1}]}', '"zooms[0].who" is not known'), ("[]", "is not an object")):
            file.write_text(text)
            done = run(self.movie, "-o", self.film, "--zoom", file, check=False)
            self.assertEqual(done.returncode, 1)
            self.assertIn(sentence, done.stderr)

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

    def test_every_result_is_covered(self):
        words = ["--redact", self.file, "--style", self.style()]
        run(self.movie, "-o", self.folder / "Film.gif", "--gif", *words)
        for number, frame in enumerate(frames_of(self.folder / "Film.gif", 320, 240)):
            covered = [frame[y * 320 + x] for x, y in ((102, 82), (180, 90), (197, 157), (102, 157))]
            if 12 <= number <= 36:
                self.assertLess(max(covered), 16, f"frame {number}")
        run(self.movie, "--frames", self.folder / "stills", "--at", "1,2,3", *words)
        run(self.movie, "-o", self.folder / "guide", *words, command="guide")
        pictures = sorted((self.folder / "stills").iterdir())
        self.assertEqual(len(pictures), 3)
        for picture in pictures:
            raw = ffmpeg("-i", picture, "-f", "rawvideo", "-pix_fmt", "gray", "-")
            self.assertLess(max(raw[y * 320 + x] for x, y in ((102, 82), (150, 120), (197, 157))), 8, picture.name)
        for text in ("guide.html", "guide.md"):
            self.assertNotIn(self.SECRET, (self.folder / "guide" / text).read_text())

    def test_a_place_without_a_rectangle_is_all_of_the_picture(self):
        self.file.write_text(json.dumps({"schema": "zulm.redactions", "schema_version": 1, "places": [{"from": 1, "to": 3}]}))
        run(self.movie, "-o", self.film, "--redact", self.file, "--style", self.style(), "--quality", "5")
        for number, frame in enumerate(frames_of(self.film, 320, 240)):
            if 30 <= number <= 90:
                self.assertLess(max(frame), 8, f"frame {number}")
            else:
                self.assertGreater(frame[120 * 320 + 250], 180, f"frame {number}")

    def test_a_picture_that_is_shown_early_is_covered_as_at_its_own_time(self):
        late = self.folder / "Late.mp4"
        streams = streams_of(self.movie)
        ffmpeg("-itsoffset", "0.5", "-i", self.movie, "-c", "copy", late)
        append(late, streams)
        self.file.write_text(json.dumps({"schema": "zulm.redactions", "schema_version": 1, "places": [
            {"from": 0.4, "to": 1, "x": 100, "y": 80, "width": 100, "height": 80}]}))
        run(late, "--frames", self.folder / "stills", "--at", "0.1,2", "--redact", self.file, "--style", self.style())
        early, later = (ffmpeg("-i", picture, "-f", "rawvideo", "-pix_fmt", "gray", "-")
                        for picture in sorted((self.folder / "stills").iterdir()))
        self.assertLess(early[120 * 320 + 150], 8)
        self.assertGreater(later[120 * 320 + 150], 180)

    def test_the_images_of_a_cursor_in_a_place_are_removed(self):
        shown, hidden = png(12, 12, (250, 1, 2, 255)), png(13, 13, (3, 250, 4, 255))
        encode(self.movie, 320, 240, 30, [bytes([200]) * (320 * 240)] * 120)
        attach(self.movie, {"recordingRegion": [(0, 0, 0, 320, 240)],
                            "cursorLocation": [(0, 10, 10), (1.5, 150, 110), (2.5, 160, 120), (3.5, 20, 20)],
                            "cursorImage": [(0, 1, shown, 0, 0), (1.6, 2, hidden, 0, 0), (2.6, 1, b"", 0, 0)]})
        run(self.movie, "-o", self.film, "--redact", self.file, "--style", self.style())
        data = self.film.read_bytes()
        self.assertIn(shown, data)
        self.assertNotIn(hidden, data)

    def test_a_stream_that_cannot_be_decoded_is_left_out_and_told(self):
        streams = streams_of(self.movie)
        for kind in ("2b7b6af2", "2b7b6af5"): # positions and windows: what depends on them is not known
            data = bytearray(streams[kind])
            struct.pack_into("<I", data, 20, 99)
            streams[kind] = bytes(data)
        encode(self.movie, 320, 240, 30, [bytes([200]) * (320 * 240)] * 120)
        append(self.movie, streams)
        done = run(self.movie, "-o", self.film, "--redact", self.file, "--style", self.style(), "--quiet", check=False)
        self.assertEqual(done.returncode, 3, done.stderr)
        self.assertIn("cannot be decoded", done.stderr)
        found = streams_of(self.film)
        self.assertNotIn("2b7b6af2", found)
        actions = [struct.unpack_from("<di", found["2b7b6af0"], at)[0] for at in range(24, len(found["2b7b6af0"]), 12)]
        self.assertFalse([when for when in actions if 1 <= when <= 3], actions)

    def test_many_places_are_covered_in_little_time_and_too_many_refused(self):
        attach(self.movie, {"cursorLocation": [(i / 25000, i % 320, i % 240) for i in range(100_000)],
                            "recordingRegion": [(0, 0, 0, 320, 240)]})
        place = {"from": 0, "to": 4, "x": 100, "y": 80, "width": 100, "height": 80}
        for count, code in ((1000, 0), (1001, 1)):
            self.file.write_text(json.dumps({"schema": "zulm.redactions", "schema_version": 1, "places": [place] * count}))
            done = run(self.movie, "--frames", self.folder / "stills", "--at", "1", "--redact", self.file, "--style", self.style(),
                       "--force", check=False)
            self.assertEqual(done.returncode, code, done.stderr)
        self.assertIn("has 1001 places; at most 1000 are covered", done.stderr)

    def test_sound_that_is_not_covered_is_told(self):
        streams = streams_of(self.movie)
        loud = self.folder / "Loud.mp4"
        ffmpeg("-i", self.movie, "-f", "lavfi", "-i", "sine=duration=4", "-c:v", "copy", "-c:a", "aac", loud)
        append(loud, streams)
        self.assertIn("its sound is not covered; --no-sound leaves it out",
                      run(loud, "-o", self.film, "--redact", self.file, "--style", self.style()).stderr)
        self.assertEqual(run(loud, "-o", self.film, "--redact", self.file, "--style", self.style(), "--force", "--no-sound").stderr, "")

    def test_errors_name_the_line_and_the_member(self):
        self.file.write_text('{"schema": "zulm.redactions", "schema_version": 1,\n"places": [\n{"from": 1}]}')
        done = run(self.movie, "-o", self.film, "--redact", self.file, check=False)
        self.assertEqual(done.returncode, 1)
        self.assertIn('line 3: "places[0]" has no "to"', done.stderr)


class Golden(Films):
    """The styles look as they looked. ZULM_WRITE_GOLDEN=1 writes the pictures that this compares with.

    Encoders and decoders differ a little. On average a value of a pixel is at most 1 of 255 away, and in no block of 16
    by 16 pixels it is more than 8 away: a cursor, a ring or a caption that is missing or moved is more."""

    FOLDER = pathlib.Path(__file__).resolve().parents[2] / "Data" / "golden" / "films"
    WIDTH, HEIGHT, BLOCK = 640, 360, 16

    def setUp(self):
        super().setUp()
        picture = bytes((x // 2 + y) % 200 + 30 if (x // 20 + y // 20) % 2 else 220
                        for y in range(self.HEIGHT) for x in range(self.WIDTH))
        encode(self.movie, self.WIDTH, self.HEIGHT, 30, [picture] * 120)
        attach(self.movie, {
            "recordingRegion": [(0, 0, 0, self.WIDTH, self.HEIGHT)],
            "cursorLocation": [(i / 30, 200 + i, 150 + i // 2) for i in range(120)],
            "cursorAction": [(1, 1), (1.15, 2), (3, 4), (3.1, 8)],
            "keyboardAction": [(1.9, ord("S"), 0x40040000), (1.95, 13, 0)],
            "cursorImage": [(0, 1, png(16, 16, (255, 60, 20, 200)), 3, 3)]})

    def assertAlike(self, file, golden):
        now, then = (ffmpeg("-i", name, "-f", "rawvideo", "-pix_fmt", "rgb24", "-") for name in (file, golden))
        self.assertEqual(len(now), 3 * self.WIDTH * self.HEIGHT)
        self.assertEqual(len(now), len(then))
        off = bytes(abs(a - b) for a, b in zip(now, then))
        self.assertLess(sum(off) / len(off), 1, golden.name)
        row, side = 3 * self.WIDTH, 3 * self.BLOCK
        worst, where = max((sum(sum(off[y * row + x:y * row + x + side]) for y in range(top, min(top + self.BLOCK, self.HEIGHT))) /
                            (side * (min(top + self.BLOCK, self.HEIGHT) - top)), (x // 3, top))
                           for top in range(0, self.HEIGHT, self.BLOCK) for x in range(0, row, side))
        self.assertLess(worst, 8, f"{golden.name}: the block at {where}")

    def test_styles_look_as_they_did(self):
        for style in ("plain", "product"):
            stills = self.folder / style
            run(self.movie, "--frames", stills, "--at", "0.2,1.2,2", "--style", style)
            for still in sorted(stills.iterdir()):
                golden = self.FOLDER / f"{style}-{still.name}"
                if os.environ.get("ZULM_WRITE_GOLDEN"):
                    self.FOLDER.mkdir(exist_ok=True)
                    golden.write_bytes(still.read_bytes())
                self.assertAlike(still, golden)

    def test_something_that_is_missing_is_seen(self):
        """The tolerance is tight enough: frames without a cursor, a ring or a caption are not alike."""
        without_rings = self.style(cursor={"size": 1, "smooth": False}, clicks={"show": False}, keys={})
        for name, at, words in (("frame-00001.200.png", "1.2", ["--style", "plain", "--cursor-size", "0.25"]),
                                ("frame-00001.200.png", "1.2", ["--style", without_rings]),
                                ("frame-00002.000.png", "2", ["--style", "plain", "--keys", "hidden"])):
            stills = self.folder / "changed"
            run(self.movie, "--frames", stills, "--at", at, "--force", *words)
            with self.assertRaises(AssertionError):
                self.assertAlike(stills / name, self.FOLDER / f"plain-{name}")


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

    def test_a_guide_tells_drags_and_modifiers_and_no_signs_that_turn_the_writing(self):
        encode(self.movie, 320, 240, 30, [bytes([60]) * (320 * 240)] * 120)
        attach(self.movie, {"recordingRegion": [(0, 0, 0, 320, 240)],
                            "cursorLocation": [(0, 20, 20), (1.2, 200, 200), (3, 50, 50)],
                            "cursorAction": [(1, 1), (1.5, 2), (3.1, 1), (3.2, 2)],
                            "topmostWindowTitle": [(0, "one\u202etwo"), (2.5, "x" * 400)]})
        run(self.movie, "-o", self.folder / "guide", command="guide")
        page = (self.folder / "guide" / "guide.html").read_text()
        self.assertEqual([words.strip() for words in re.findall(r"<li>([^<]*)", page)], ["Drag", "Click"])
        self.assertIn("one[U+202E]two", page)
        self.assertNotIn("\u202e", page)
        self.assertNotIn("x" * 121, page)

    def test_a_shorter_guide_removes_the_pictures_of_a_longer_one(self):
        encode(self.movie, 160, 90, 30, [bytes([60]) * (160 * 90)] * 90)
        attach(self.movie, {"recordingRegion": [(0, 0, 0, 160, 90)], "cursorLocation": [(0, 10, 10)],
                            "cursorAction": [(0.5, 1), (0.6, 2), (2, 1), (2.1, 2)]})
        folder = self.folder / "guide"
        run(self.movie, "-o", folder, command="guide")
        self.assertEqual(run(self.movie, "-o", folder, command="guide", check=False).returncode, 1)
        (folder / "mine.txt").write_text("mine")
        redactions = self.folder / "redactions.json"
        redactions.write_text(json.dumps({"schema": "zulm.redactions", "schema_version": 1, "places": [{"from": 1, "to": 3}]}))
        run(self.movie, "-o", folder, "--force", "--redact", redactions, command="guide")
        self.assertEqual(sorted(path.name for path in folder.iterdir()), ["guide.html", "guide.md", "mine.txt", "step-001.png"])


if __name__ == "__main__":
    if not RENDERER or not pathlib.Path(RENDERER).exists():
        print("zulm-render is not built")
        sys.exit(77)
    unittest.main(verbosity=2)
