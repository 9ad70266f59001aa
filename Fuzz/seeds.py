#!/usr/bin/env python3
"""Makes the first inputs of the fuzz targets: a short demo recording, the invalid recordings of the tests, and pictures.

Usage: Fuzz/seeds.py ZULM FOLDER. The committed corpora are what this makes; what ended a target once is kept with them.
"""

import pathlib
import re
import struct
import sys
import tempfile
import types
import zlib

SOURCE = pathlib.Path(__file__).resolve().parents[1]
sys.path.insert(0, str(SOURCE / "Tests/Reliability"))
import edit_list_seeds  # noqa: E402
import recordings  # noqa: E402

READERS = {
    "point": ["cursorLocation", "scrollAction"],
    "rect": ["recordingRegion", "topmostWindow", "hoverRect"],
    "key_stroke": ["keyboardAction"],
    "cursor_image": ["cursorImage"],
    "int": ["cursorAction", "recordingScaleFactor"],
    "float": ["cpuUsage"],
    "double": ["cursorOpacity"],
    "string": ["slideTitles", "topmostAppName"],
    "string_list": ["systemData"],
}
COMMANDS = len(re.findall(r'^    \{"', (SOURCE / "Fuzz/commands.cpp").read_text(encoding="utf-8"), re.M))
STREAM_BYTES = 200
IDENTIFIERS = ["2b7b6af1-7a1f-11e2-83d0-0017f200be7f", "00000000-0000-0000-0000-000000000000", "2B7B-", "zz", ""]


def tiff(entries, data, order="<"):
    """A file of one picture; `entries` are tag, type, count and value."""
    mark = b"II*\0" if order == "<" else b"MM\0*"
    begin = struct.pack(order + "I", 8 + len(data))
    table = struct.pack(order + "H", len(entries))
    for tag, kind, count, value in entries:
        number = struct.pack(order + ("I" if kind == 4 else "H"), value).ljust(4, b"\0")
        table += struct.pack(order + "HHI", tag, kind, count) + number
    return mark + begin + data + table + bytes(4)


def plain_tiff(order, samples, compression, data):
    return tiff([(256, 4, 1, 2), (257, 4, 1, 1), (258, 3, 1, 8), (259, 3, 1, compression),
                 (262, 3, 1, 2 if samples > 2 else 1), (273, 4, 1, 8), (277, 3, 1, samples), (278, 4, 1, 1),
                 (279, 4, 1, len(data))], data, order)


def png(width, height, depth, colour, rows, interlace=0, extra=b""):
    def part(kind, body):
        return struct.pack(">I", len(body)) + kind + body + struct.pack(">I", zlib.crc32(kind + body))

    head = part(b"IHDR", struct.pack(">IIBBBBB", width, height, depth, colour, 0, 0, interlace))
    return b"\x89PNG\r\n\x1a\n" + head + extra + part(b"IDAT", zlib.compress(rows)) + part(b"IEND", b"")


def pictures():
    yield png(2, 1, 8, 6, b"\0\xff\0\0\xff\0\xff\0\x80")
    yield png(2, 2, 8, 2, (b"\0" + b"\1\2\3" * 2) * 2)
    yield png(3, 1, 1, 0, b"\0\xa0")
    yield png(2, 1, 16, 4, b"\0" + bytes(8))
    yield png(4, 4, 8, 0, b"\0" + bytes(40), interlace=1)
    for order in "<>":
        yield plain_tiff(order, 4, 1, bytes(range(8)))
        yield plain_tiff(order, 3, 1, bytes(range(6)))
        yield plain_tiff(order, 1, 32773, b"\1ab")
        yield plain_tiff(order, 3, 8, zlib.compress(bytes(6)))


def atom(name, *payload):
    body = b"".join(payload)
    return struct.pack(">I", 8 + len(body)) + name.encode() + body


def numbers(*values):
    return struct.pack(f">{len(values)}I", *values)


def fragmented_movies():
    """What a recorder of screens leaves that was killed: pictures in short fragments, and perhaps sound."""
    def track(number, kind, scale):
        header = atom("tkhd", numbers(3, 0, 0, number, 0, 0), bytes(60))
        media = atom("mdia", atom("mdhd", numbers(0, 0, 0, scale, 0, 0)), atom("hdlr", numbers(0, 0), kind, bytes(13)),
                     atom("minf", atom("stbl", atom("stsd", numbers(0, 0)))))
        return atom("trak", header, media), atom("trex", numbers(0, number, 1, 0, 0, 0))

    def beginning(*tracks):
        return atom("ftyp", b"isom", bytes(4)) + atom("moov", atom("mvhd", numbers(0, 0, 0, 1000, 0), bytes(80)), *[
            trak for trak, _ in tracks], atom("mvex", *[defaults for _, defaults in tracks]))

    def fragment(time, *runs):
        def moof(place):
            return atom("moof", atom("mfhd", numbers(0, 1)), *[
                atom("traf", atom("tfhd", numbers(0x20000, number)), atom("tfdt", numbers(0x1000000, 0, time)),
                     atom("trun", numbers(0x701, len(sizes), place + sum(len(data) for data in before)),
                          *[numbers(3000, size, 0x2000000 if index == 0 else 0x1010000)
                            for index, size in enumerate(sizes)]))
                for number, sizes, before in runs])
        return moof(len(moof(0)) + 8) + atom("mdat", bytes(sum(sum(sizes) for _, sizes, _ in runs)))

    pictures, sound = track(1, b"vide", 90000), track(2, b"soun", 48000)
    plain = beginning(pictures) + fragment(0, (1, [3], [])) + fragment(3000, (1, [4, 2, 1], []))
    yield plain
    yield plain[:-3]
    yield beginning(pictures, sound) + fragment(0, (1, [3, 2], []), (2, [5], [bytes(5)]))
    yield plain.replace(b"moov", b"free").replace(b"moof", b"free", 1) + atom("skip", bytes(12))
    same = atom("tfhd", numbers(0x20038, 1, 4500, 2, 0)) + atom("tfdt", numbers(0, 0))
    moof = atom("moof", atom("mfhd", numbers(0, 1)), atom("traf", same, atom("trun", numbers(0x5, 2, 108, 0x2000000))))
    yield beginning(pictures) + moof + atom("mdat", bytes(4))


def movies(streams):
    all_streams = list(streams.values())
    yield recordings.movie(all_streams)
    yield recordings.movie(all_streams[:2])
    open_media = struct.pack(">I", 0) + b"mdat" + recordings.MEDIA
    yield recordings.FILE_TYPE + open_media
    yield recordings.FILE_TYPE + recordings.atom(b"wide") + open_media
    appended = recordings.metadata_atom(all_streams[:3])
    yield recordings.FILE_TYPE + appended[:8] + bytes(8) + appended[16:-5]


def invalid(pattern):
    return [file.read_bytes() for file in sorted((SOURCE / "Tests/Data/invalid").glob(pattern))]


def records(stream):
    ends = recordings.entry_ends(stream)
    return [stream[begin:end] for begin, end in zip(ends, ends[1:])]


def seeds(streams):
    all_movies = list(movies(streams)) + invalid("movie-*.mp4")
    all_riffs = [recordings.riff(list(streams.values())[:4])] + invalid("riff-*")
    bare = list(streams.values()) + invalid("*.dat")
    for name, kinds in READERS.items():
        identifiers = {streams[kind][:4] for kind in kinds}
        if name == "string":
            identifiers |= {stream[:4] for stream in invalid("text-*.dat")}
        yield f"stream_reader_{name}", [b"\0" + stream for stream in bare if stream[:4] in identifiers]
    cursor_streams = [streams["cursorImage"]] + invalid("cursor-*.dat")
    yield "cursor_record", [bytes([version]) + record for stream in cursor_streams for record in records(stream)
                            for version in (1, 2)]
    yield "atom_scan", all_movies
    yield "riff_scan", all_riffs
    yield "raw_scan", bare
    yield "repair", all_movies
    yield "append_walk", bare
    yield "fragmented_movie", list(fragmented_movies())
    yield "uuid_text", [text.encode() for text in IDENTIFIERS]
    yield "image_decode", list(pictures())
    yield "recording", all_movies + all_riffs + bare
    yield from edit_list_seeds.seeds()
    files = [(0, movie) for movie in all_movies[:3]] + [(1, all_riffs[0])]
    files += [(2, streams[kind]) for kind in ("cursorImage", "keyboardAction", "slideTitles", "systemData")]
    yield "commands", [bytes([command, kind]) + contents for command in range(COMMANDS) for kind, contents in files]


def main():
    folder = pathlib.Path(sys.argv[2])
    with tempfile.TemporaryDirectory() as scratch:
        context = types.SimpleNamespace(zulm=pathlib.Path(sys.argv[1]).resolve(), folder=pathlib.Path(scratch))
        streams = recordings.demo_streams(context)
    streams = {kind: recordings.shortened(stream, STREAM_BYTES) for kind, stream in streams.items()}
    for target, inputs in seeds(streams):
        (folder / target).mkdir(parents=True, exist_ok=True)
        for number, contents in enumerate(inputs):
            if contents not in inputs[:number]:
                (folder / target / f"seed-{number:03}").write_bytes(contents)


if __name__ == "__main__":
    main()
