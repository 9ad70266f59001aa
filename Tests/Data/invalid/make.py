#!/usr/bin/env python3
"""Makes the corpus of invalid recordings byte by byte, and lists what a validator must find in each.

Writes the files into its own folder, and with them expected.tsv, which the tests read, and README.md for people.
"""

import os
import struct
import zlib

HERE = os.path.dirname(os.path.abspath(__file__))
FILES = []  # (name, findings, why)


def be32(value):
    return struct.pack(">I", value)


def be64(value):
    return struct.pack(">Q", value)


def le32(value):
    return struct.pack("<I", value & 0xFFFFFFFF)


def le64(value):
    return struct.pack("<Q", value)


def seconds(value):
    return struct.pack("<d", value)


NAN, INFINITY = float("nan"), float("inf")


# ---- containers ----


def atom(kind, payload=b""):
    return be32(8 + len(payload)) + kind + payload


def sized_atom(kind, size, payload=b"", mark=1):
    """Makes an atom in the long form with any size, and with `mark` in place of the 1."""
    return be32(mark) + kind + be64(size) + payload


def data(stream):
    return sized_atom(b"DATA", 16 + len(stream), stream)


def zulm(*children):
    payload = b"".join(children)
    return sized_atom(b"ZULM", 16 + len(payload), payload)


def chunk(kind, payload=b""):
    return kind + le32(len(payload)) + payload + b"\0" * (len(payload) % 2)


MEDIA = atom(b"ftyp", b"mp42") + atom(b"mdat", b"0123456789")  # 30 bytes
ZULM = len(MEDIA)
FIRST = ZULM + 16  # the first DATA
STREAM = FIRST + 16  # its stream
ENTRIES = STREAM + 24  # and the entries of that

RIFF = chunk(b"RIFF", b"AVI JUNKjunk")  # 20 bytes
RIFF_ZULM = len(RIFF)
RIFF_FIRST = RIFF_ZULM + 8
RIFF_STREAM = RIFF_FIRST + 8
RIFF_ENTRIES = RIFF_STREAM + 24


# ---- streams ----


def header(group, entry_size, version=1):
    rest = bytes.fromhex("7a1f11e283d00017f200be7f")
    return bytes.fromhex(group) + rest + struct.pack("<iI", version, entry_size)


LOCATION, IMAGE, REGION, APP, TITLE = "2b7b6af2", "2b7b6af1", "2b7b6af6", "2b7b6a06", "2b7b6a07"
SYSTEM, SCALE, CARET, STRANGE = "2b7b6afc", "2b7b6afb", "2b7b6aef", "12345678"


def point(time, x=10, y=20):
    return seconds(time) + struct.pack("<ii", x, y)


def text(time, characters, size=None):
    return le32(8 + len(characters) if size is None else size) + seconds(time) + characters


def texts(elements, total=None, count=None):
    body = b"".join(elements)
    return le32(4 + len(body) if total is None else total) + le32(len(elements) if count is None else count) + body


def cursor(image=b"", time=1.0, entry_size=None, data_size=None, image_size=None, tail=b""):
    fields = le32(len(image) if image_size is None else image_size)
    if image:
        fields += struct.pack("<ii", 3, 4) + image + struct.pack("<i", -1)
    fields += le32(3) + tail
    sizes = (20 + len(fields) if entry_size is None else entry_size, len(fields) if data_size is None else data_size)
    return le32(sizes[0]) + seconds(time) + struct.pack("<Q", 7) + le32(sizes[1]) + fields


def png_chunk(kind, body, sum_off_by=0):
    return be32(len(body)) + kind + body + be32((zlib.crc32(kind + body) + sum_off_by) & 0xFFFFFFFF)


def stored(rows):
    """Without compression, so that every zlib makes the same bytes."""
    return b"\x78\x01\x01" + struct.pack("<HH", len(rows), len(rows) ^ 0xFFFF) + rows + be32(zlib.adler32(rows))


def png_file(width, height, depth, colour_type, pixels, sum_off_by=0):
    ihdr = be32(width) + be32(height) + bytes([depth, colour_type, 0, 0, 0])
    return (b"\x89PNG\r\n\x1a\n" + png_chunk(b"IHDR", ihdr) + png_chunk(b"IDAT", pixels, sum_off_by) +
            png_chunk(b"IEND", b""))


def png(width=2, height=1, sum_off_by=0):
    """Two pixels."""
    rows = b"\0" + bytes([255, 0, 0, 255, 0, 255, 0, 128])
    return png_file(width, height, 8, 6, stored(rows), sum_off_by)


def grey_png(width, further_rows=0):
    """A row of one bit a pixel."""
    return png_file(width, 1, 1, 0, stored(b"\0" * (1 + width // 8) * (1 + further_rows)))


LOCATIONS = header(LOCATION, 16) + point(0.5) + point(1.0)  # 56 bytes
REGIONS = header(REGION, 24) + seconds(0.0) + struct.pack("<iiii", 0, 0, 640, 480)  # 48 bytes
APPS = header(APP, 0) + text(0.5, b"Abc") + text(2.0, b"Notes")  # 24 + 15 + 17 bytes
SYSTEM_TEXTS = [text(0.0, name) for name in (b"ProcessorCount:4", b"ActiveProcessorCount:4", b"OSVersion:1", b"RAM:1MB")]
ZULR = atom(b"ZULR", b"\0" * 64)


def invalid(name, contents, why, *findings):
    """Findings as (code, offset), the one that the file is about first."""
    assert len(contents) < 4096, name
    with open(os.path.join(HERE, name), "wb") as file:
        file.write(contents)
    FILES.append((name, findings, why))


def movies():
    good = MEDIA + zulm(data(LOCATIONS))
    invalid("movie-trailing-bytes.mp4", good + b"\0" * 5, "the 5 bytes after the last atom are not an atom",
            ("trailing-bytes", len(good)))
    invalid("movie-trailing-half-header.mp4", good + be32(1) + b"free" + b"\0" * 4,
            "the file ends inside an 64-bit size", ("trailing-bytes", len(good)))
    invalid("movie-open-media.mp4", atom(b"ftyp", b"mp42") + be32(0) + b"mdat" + b"0123456789",
            "the media data was never closed", ("open-ended-atom", 12))
    invalid("movie-open-media-hides-metadata.mp4",
            atom(b"ftyp", b"mp42") + be32(0) + b"mdat" + b"0123456789" + zulm(data(LOCATIONS)),
            "the open media data includes the metadata after it", ("open-ended-atom", 12))
    invalid("movie-open-extended-media.mp4", atom(b"ftyp", b"mp42") + sized_atom(b"mdat", 0, b"0123456789"),
            "the 64-bit size of the media data is 0", ("open-ended-atom", 12))
    invalid("movie-interrupted-append.mp4", MEDIA + sized_atom(b"ZULM", 0, data(LOCATIONS)),
            "the size of the ZULM was never set", ("open-ended-atom", ZULM), ("unreachable-stream", STREAM))
    invalid("movie-interrupted-append-empty.mp4", MEDIA + sized_atom(b"ZULM", 0),
            "the ZULM was begun and nothing more", ("open-ended-atom", ZULM))
    invalid("movie-interrupted-append-torn.mp4", MEDIA + sized_atom(b"ZULM", 0, data(LOCATIONS)[:-3]),
            "the append was interrupted inside an entry", ("open-ended-atom", ZULM), ("beyond-file", FIRST),
            ("unreachable-stream", STREAM), ("torn-entry", ENTRIES + 16))
    children = data(LOCATIONS)
    invalid("movie-size-marker-5.mp4", MEDIA + sized_atom(b"ZULM", 16 + len(children), children, mark=5),
            "the 32-bit size of the ZULM is 5", ("size-marker", ZULM))
    invalid("movie-size-marker-child-7.mp4", MEDIA + zulm(sized_atom(b"DATA", 16 + len(LOCATIONS), LOCATIONS, mark=7)),
            "the 32-bit size of the DATA is 7", ("size-marker", FIRST))
    invalid("movie-size-marker-child-0.mp4", MEDIA + zulm(sized_atom(b"DATA", 16 + len(LOCATIONS), LOCATIONS, mark=0)),
            "the 32-bit size of the DATA is 0, though an 64-bit size follows", ("size-marker", FIRST))
    invalid("movie-size-below-header.mp4", MEDIA + sized_atom(b"free", 15, b"\0" * 16) + zulm(data(LOCATIONS)),
            "an 64-bit size of 15 does not cover its own header", ("size-below-header", ZULM))
    invalid("movie-size-below-header-child.mp4", MEDIA + zulm(sized_atom(b"DATA", 8, LOCATIONS)),
            "the 64-bit size of the DATA is 8", ("size-below-header", FIRST))
    invalid("movie-media-beyond-file.mp4", atom(b"ftyp", b"mp42") + be32(19) + b"mdat" + b"0123456789",
            "the media data states one byte more than there is", ("beyond-file", 12))
    invalid("movie-media-wraps-around.mp4",
            atom(b"ftyp", b"mp42") + sized_atom(b"mdat", 2**64 - 12, b"0123456789") + zulm(data(LOCATIONS)),
            "the end of the media data wraps around 64 bits to the start of the file", ("beyond-file", 12))
    invalid("movie-zulm-beyond-file.mp4", good[:-16], "the file was cut short between two entries",
            ("beyond-file", ZULM), ("beyond-file", FIRST))
    invalid("movie-zulm-wraps-around.mp4", MEDIA + sized_atom(b"ZULM", 2**64 - 12, data(LOCATIONS)),
            "the end of the ZULM wraps around 64 bits to the start of the file", ("beyond-file", ZULM))
    invalid("movie-cut-in-entry.mp4", good[:-5], "the file was cut short inside an entry", ("beyond-file", ZULM),
            ("beyond-file", FIRST), ("torn-entry", ENTRIES + 16))
    invalid("movie-cut-in-stream-header.mp4", good[:STREAM + 20], "the file was cut short inside a stream's header",
            ("beyond-file", ZULM), ("beyond-file", FIRST), ("short-header", STREAM))
    invalid("movie-cut-in-data-header.mp4", good[:FIRST + 6], "the file was cut short inside the header of the DATA",
            ("beyond-file", ZULM), ("trailing-bytes", FIRST))
    invalid("movie-zulm-too-small.mp4",
            MEDIA + sized_atom(b"ZULM", 16 + 16 + 24 + 16, data(LOCATIONS)) + atom(b"free", b"\0" * 8),
            "the ZULM ends inside its DATA, and its second half is not an atom", ("beyond-parent", FIRST),
            ("open-ended-atom", STREAM + 40))
    invalid("movie-data-beyond-zulm.mp4", MEDIA + zulm(sized_atom(b"DATA", 16 + 56 + 16, LOCATIONS)) + ZULR,
            "the DATA states one entry more than its ZULM holds", ("beyond-parent", FIRST))
    invalid("movie-data-beyond-file.mp4", MEDIA + zulm(sized_atom(b"DATA", 2**63 - 1, LOCATIONS)),
            "the DATA states a size of 8 EiB", ("beyond-file", FIRST))
    invalid("movie-data-wraps-around.mp4", MEDIA + zulm(sized_atom(b"DATA", 2**64 - 16, LOCATIONS)),
            "the end of the DATA wraps around 64 bits", ("beyond-file", FIRST))
    invalid("movie-zero-size-child.mp4", MEDIA + zulm(data(LOCATIONS), sized_atom(b"DATA", 0)),
            "the second DATA has no size", ("zero-size-child", FIRST + 72))
    invalid("movie-zero-size-child-hides-stream.mp4", MEDIA + zulm(sized_atom(b"free", 0, mark=0), data(LOCATIONS)),
            "a child without a size hides the stream after it", ("zero-size-child", FIRST))
    invalid("movie-foreign-child.mp4", MEDIA + zulm(atom(b"free", b"1234"), data(LOCATIONS)),
            "a child of the ZULM is a free atom", ("foreign-child", FIRST))
    invalid("movie-misspelt-data.mp4", MEDIA + zulm(data(LOCATIONS).replace(b"DATA", b"DAT\xc1"), data(REGIONS)),
            "one bit in the type of a DATA is wrong: its stream is lost", ("foreign-child", FIRST))
    invalid("movie-foreign-child-beyond-zulm.mp4",
            MEDIA + zulm(data(LOCATIONS), be32(20) + b"free" + b"1234") + atom(b"free", b"12345678"),
            "a foreign child reaches beyond the ZULM", ("foreign-child", FIRST + 72), ("beyond-parent", FIRST + 72))
    invalid("movie-short-data-header.mp4", MEDIA + zulm(atom(b"DATA", LOCATIONS)),
            "the DATA has a header of 8 bytes, so that readers cut 8 bytes off its stream",
            ("short-data-header", FIRST))
    invalid("movie-short-data-header-empty.mp4", MEDIA + zulm(atom(b"DATA"), data(LOCATIONS)),
            "a DATA of 8 bytes holds nothing", ("short-data-header", FIRST), ("short-header", FIRST + 8))
    invalid("movie-data-too-short.mp4", MEDIA + zulm(data(LOCATIONS[:23])),
            "a DATA of 23 bytes is too small for a stream header", ("short-header", STREAM))
    invalid("movie-zulm-trailing-bytes.mp4", MEDIA + zulm(data(LOCATIONS), b"\0\0\0") + atom(b"free", b"1234"),
            "the last 3 bytes in the ZULM are not an atom", ("trailing-bytes", FIRST + 72))
    invalid("movie-zulm-trailing-half-header.mp4", MEDIA + zulm(data(LOCATIONS), be32(1) + b"DATA" + b"\0" * 7),
            "the ZULM ends inside the header of a DATA", ("trailing-bytes", FIRST + 72))
    invalid("movie-short-recording-info.mp4", good + atom(b"ZULR", b"\0" * 63),
            "the ZULR holds 63 bytes of a record of 64", ("short-recording-info", len(good)))


def dropped_tails():
    invalid("movie-dropped-tail.mp4",
            MEDIA + zulm(sized_atom(b"DATA", 16 + 56 + 5, LOCATIONS), data(REGIONS)),
            "the size of a DATA counts 5 bytes that were not copied, and the stream after it is lost",
            ("dropped-tail", FIRST), ("unreachable-stream", STREAM + 72))
    invalid("movie-dropped-tail-of-text.mp4", MEDIA + zulm(sized_atom(b"DATA", 16 + 56 + 30, APPS), data(REGIONS)),
            "the same after a stream of texts", ("dropped-tail", FIRST), ("unreachable-stream", STREAM + 72))
    invalid("movie-dropped-tail-twice.mp4",
            MEDIA + zulm(sized_atom(b"DATA", 16 + 56 + 5, LOCATIONS), sized_atom(b"DATA", 16 + 56 + 2, APPS),
                         data(REGIONS)),
            "two sizes count bytes that were not copied", ("dropped-tail", FIRST), ("unreachable-stream", STREAM + 72),
            ("dropped-tail", FIRST + 72), ("unreachable-stream", STREAM + 144))
    invalid("movie-dropped-tail-last.mp4", MEDIA + zulm(sized_atom(b"DATA", 16 + 56 + 5, LOCATIONS)) + ZULR,
            "the last DATA counts 5 bytes of the atom after the ZULM as its own", ("dropped-tail", FIRST))


def riffs():
    good = RIFF + chunk(b"ZULM", chunk(b"DATA", LOCATIONS))
    invalid("riff-trailing-bytes.wav", good + b"\0\0\0", "the 3 bytes after the last chunk are not a chunk",
            ("trailing-bytes", len(good)))
    invalid("riff-chunk-beyond-file.avi", b"RIFF" + le32(200) + b"AVI JUNKjunk", "the RIFF chunk is cut short",
            ("beyond-file", 0))
    ds64 = chunk(b"ds64", le64(4 + 36 + 200) + bytes(20))
    invalid("riff-rf64-beyond-file.wav", b"RF64" + le32(-1) + b"WAVE" + ds64, "the ds64 chunk says 200 bytes too many",
            ("beyond-file", 0))
    invalid("riff-from-pipe-zulm-cut-short.wav", b"RIFF" + le32(-1) + b"AVI JUNKjunk" + good[RIFF_ZULM:-4],
            "the file came from a pipe, and its metadata was cut short", ("beyond-file", RIFF_ZULM),
            ("wide-riff", 0), ("beyond-file", RIFF_ZULM + 8), ("torn-entry", RIFF_STREAM + 40))
    invalid("riff-zero-chunk-hides-metadata.avi", RIFF + chunk(b"JUNK") + good[RIFF_ZULM:],
            "readers stop at the empty chunk before the ZULM", ("zero-size-chunk", RIFF_ZULM))
    invalid("riff-zero-size-child.avi", RIFF + chunk(b"ZULM", chunk(b"DATA") + chunk(b"DATA", LOCATIONS)),
            "readers stop at the empty DATA", ("zero-size-child", RIFF_FIRST))
    invalid("riff-foreign-child.avi", RIFF + chunk(b"ZULM", chunk(b"JUNK", b"12") + chunk(b"DATA", LOCATIONS)),
            "a child of the ZULM is a JUNK chunk", ("foreign-child", RIFF_FIRST))
    invalid("riff-data-beyond-zulm.wav",
            RIFF + chunk(b"ZULM", b"DATA" + le32(56 + 16) + LOCATIONS) + chunk(b"JUNK", b"0123456789"),
            "the DATA states one entry more than its ZULM holds", ("beyond-parent", RIFF_FIRST))
    invalid("riff-cut-in-entry.wav", good[:-4], "the file was cut short inside an entry", ("beyond-file", RIFF_ZULM),
            ("beyond-file", RIFF_FIRST), ("torn-entry", RIFF_ENTRIES + 16))
    invalid("riff-zulm-trailing-bytes.avi", RIFF + chunk(b"ZULM", chunk(b"DATA", LOCATIONS) + b"DATA"),
            "the last 4 bytes in the ZULM are not a chunk", ("trailing-bytes", RIFF_FIRST + 64))
    invalid("riff-data-too-short.avi", RIFF + chunk(b"ZULM", chunk(b"DATA", LOCATIONS[:10])),
            "a DATA of 10 bytes is too small for a stream header", ("short-header", RIFF_STREAM))
    invalid("riff-torn-text.wav", RIFF + chunk(b"ZULM", chunk(b"DATA", APPS[:-4])),
            "the last text of a stream is cut short", ("entry-beyond-end", RIFF_ENTRIES + 15))


def headers():
    invalid("header-empty.dat", b"", "a stream of no bytes", ("short-header", 0))
    invalid("header-1-byte.dat", LOCATIONS[:1], "a stream of one byte", ("short-header", 0))
    invalid("header-23-bytes.dat", LOCATIONS[:23], "the header lacks its last byte", ("short-header", 0))
    invalid("header-version-0.dat", header(LOCATION, 16, 0) + point(0.5), "the version is 0", ("bad-version", 16))
    invalid("header-version-negative.dat", header(APP, 0, -1) + text(0.5, b"Abc"), "the version is -1",
            ("bad-version", 16))
    invalid("header-entry-size-0.dat", header(LOCATION, 0) + point(0.5),
            "locations have a fixed size, but the header states that they vary", ("entry-size-mismatch", 20))
    invalid("header-entry-size-12.dat", header(LOCATION, 12) + point(0.5), "locations take 16 bytes, not 12",
            ("entry-size-mismatch", 20))
    invalid("header-entry-size-huge.dat", header(REGION, 0xFFFFFFFF) + REGIONS[24:], "regions take 24 bytes, not 4 GiB",
            ("entry-size-mismatch", 20))
    invalid("header-entry-size-of-text.dat", header(APP, 16) + text(0.5, b"Abc"), "texts have no fixed size",
            ("entry-size-mismatch", 20))
    invalid("header-entry-size-of-image.dat", header(IMAGE, 32, 2) + cursor(), "cursor images have no fixed size",
            ("entry-size-mismatch", 20))
    invalid("header-scale-as-double.dat", header(SCALE, 16) + seconds(0.0) + seconds(2.0),
            "the scale factor is an integer, not a 64-bit float", ("entry-size-mismatch", 20))
    invalid("header-unknown-kind-without-time.dat", header(STRANGE, 7) + b"1234567",
            "entries of 7 bytes have no space for their time, whatever their kind is", ("entry-size-mismatch", 20),
            ("unknown-kind", 0))


def fixed_entries():
    invalid("fixed-torn-in-time.dat", LOCATIONS + seconds(1.5)[:3], "the stream ends inside a time",
            ("torn-entry", 56))
    invalid("fixed-torn-in-value.dat", LOCATIONS + point(1.5)[:-1], "the last location lacks a byte",
            ("torn-entry", 56))
    invalid("fixed-torn-only-entry.dat", header(REGION, 24) + b"\0" * 23, "the only region lacks a byte",
            ("torn-entry", 24))
    invalid("fixed-torn-unrecorded-kind.dat", header(CARET, 16) + point(0.5) + b"\0" * 9,
            "a stream of a kind that is never decoded ends inside an entry", ("torn-entry", 40))
    invalid("fixed-torn-huge-entry.dat", header(STRANGE, 0xFFFFFFFF) + seconds(0.5),
            "an entry of an unknown kind states a size of 4 GiB", ("torn-entry", 24), ("unknown-kind", 0))
    invalid("time-not-a-number.dat", LOCATIONS + point(NAN), "a time is not a number", ("time-not-finite", 56))
    invalid("time-infinite.dat", header(LOCATION, 16) + point(INFINITY) + point(1.0), "a time is infinite",
            ("time-not-finite", 24))
    invalid("time-infinite-of-text.dat", APPS + text(-INFINITY, b"x"), "a text's time is infinite",
            ("time-not-finite", 56))
    invalid("time-not-a-number-of-image.dat", header(IMAGE, 0, 2) + cursor() + cursor(time=NAN),
            "a cursor image's time is not a number", ("time-not-finite", 56), ("cursor-without-image", 24))
    invalid("time-not-a-number-in-list.dat",
            header(SYSTEM, 0) + texts([text(0.0, b"a"), text(NAN, b"b"), text(0.0, b"c"), text(0.0, b"d")]),
            "the time of a list's second text is not a number", ("time-not-finite", 45))


def text_entries():
    start = len(APPS)
    invalid("text-size-0.dat", APPS + text(3.0, b"x", 0), "a text states a size of 0 bytes", ("zero-entry-size", start))
    invalid("text-size-7.dat", APPS + text(3.0, b"x", 7), "a text states a size of 7 bytes, fewer than its time has",
            ("entry-too-small", start))
    invalid("text-size-4-gib.dat", APPS + text(3.0, b"x", 0xFFFFFFFF), "a text states a size of 4 GiB",
            ("entry-beyond-end", start))
    invalid("text-size-2-gib.dat", APPS + text(3.0, b"x", 0x80000000), "a text states a size of 2 GiB",
            ("entry-beyond-end", start))
    invalid("text-one-byte-short.dat", APPS + text(3.0, b"Notes")[:-1], "the last text lacks a byte",
            ("entry-beyond-end", start))
    invalid("text-torn-in-size.dat", APPS + text(3.0, b"Notes")[:3], "the stream ends inside a text's size",
            ("torn-entry", start))
    invalid("text-torn-in-time.dat", APPS + text(3.0, b"Notes")[:9], "the stream ends inside a text's time",
            ("torn-entry", start))
    for name, characters, bad, why in (
        ("continuation", b"ab\x80", 2, "a continuation byte without a beginning"),
        ("overlong", b"\xc0\xafx", 0, "an overlong form of a slash"),
        ("surrogate", b"a\xed\xa0\x80", 1, "half of a surrogate pair"),
        ("cut-character", b"abc\xe2\x82", 3, "a character that the text's end cuts"),
        ("beyond-unicode", b"\xf4\x90\x80\x80", 0, "a character beyond U+10FFFF"),
        ("latin-1", "Bérénice".encode("latin-1"), 1, "letters in ISO 8859-1"),
    ):
        invalid(f"text-not-utf8-{name}.dat", header(TITLE, 0) + text(0.5, b"ok") + text(1.0, characters), why,
                ("not-utf8", 24 + 14 + 12 + bad))
    invalid("text-unknown-kind-size-0.dat", header(STRANGE, 0) + le32(2) + b"ab" + le32(0),
            "an entry of an unknown kind states a size of 0 bytes", ("zero-entry-size", 30), ("unknown-kind", 0))
    invalid("text-unknown-kind-beyond-end.dat", header(STRANGE, 0) + le32(5) + b"ab",
            "an entry of an unknown kind reaches beyond the stream", ("entry-beyond-end", 24), ("unknown-kind", 0))


def lists():
    start = header(SYSTEM, 0)
    invalid("list-total-0.dat", start + texts(SYSTEM_TEXTS, total=0),
            "a list states a size of 0 bytes", ("zero-entry-size", 24))
    invalid("list-total-3.dat", start + texts(SYSTEM_TEXTS, total=3),
            "a list states a size of 3 bytes, fewer than its count has",
            ("entry-too-small", 24))
    invalid("list-total-beyond-end.dat", start + texts(SYSTEM_TEXTS, total=1000),
            "a list states a larger size than there is",
            ("entry-beyond-end", 24))
    invalid("list-torn-in-total.dat", start + texts(SYSTEM_TEXTS)[:2], "the stream ends inside a list's total",
            ("torn-entry", 24))
    invalid("list-torn-in-count.dat", start + texts(SYSTEM_TEXTS)[:6], "the stream ends inside a list's count",
            ("torn-entry", 24))
    invalid("list-count-too-large.dat", start + texts(SYSTEM_TEXTS, count=40),
            "a list counts 40 texts in the space of 8",
            ("list-count", 24))
    invalid("list-count-4-gib.dat", start + texts(SYSTEM_TEXTS, count=0xFFFFFFFF), "a list counts 2^32 - 1 texts",
            ("list-count", 24))
    invalid("list-count-too-small.dat", start + texts(SYSTEM_TEXTS, count=3), "a list counts 3 of its 4 texts",
            ("list-total", 24))
    invalid("list-count-one-more.dat", start + texts(SYSTEM_TEXTS, count=5), "a list counts a fifth text of its 4",
            ("list-total", 24))
    invalid("list-total-too-large.dat", start + texts(SYSTEM_TEXTS, total=4 + sum(map(len, SYSTEM_TEXTS)) + 6) + b"\0" * 6,
            "a list's total counts 6 bytes after its last text", ("list-total", 24))
    invalid("list-total-too-small.dat", start + texts(SYSTEM_TEXTS, total=4 + sum(map(len, SYSTEM_TEXTS)) - 2),
            "a list's total ends inside its last text, and the rest is not a list", ("list-total", 24),
            ("torn-entry", 24 + 8 + sum(map(len, SYSTEM_TEXTS)) - 2))
    invalid("list-text-size-7.dat",
            start + texts([SYSTEM_TEXTS[0], text(0.0, b"x", 7), *SYSTEM_TEXTS[2:]]),
            "a text in a list states a size of 7 bytes", ("entry-too-small", 24 + 8 + len(SYSTEM_TEXTS[0])))
    invalid("list-text-size-4-gib.dat", start + texts([*SYSTEM_TEXTS[:3], text(0.0, b"x", 0xFFFFFFFF)]),
            "a text in a list states a size of 4 GiB", ("list-total", 24))
    invalid("list-too-few-texts.dat", start + texts(SYSTEM_TEXTS[:3]), "the system data has 3 texts, but needs 4",
            ("too-few-texts", 24))
    invalid("list-empty.dat", start + texts([]), "the system data has no text", ("too-few-texts", 24))


def cursors():
    start = header(IMAGE, 0, 2)
    picture = png()
    image = 24 + 36  # where an entry's image is
    invalid("cursor-size-0.dat", start + cursor(entry_size=0),
            "a record states a size of 0 bytes", ("zero-entry-size", 24))
    invalid("cursor-size-19.dat", start + cursor(entry_size=19),
            "a record states a size of 19 bytes, fewer than its first fields",
            ("entry-too-small", 24))
    invalid("cursor-size-beyond-end.dat", start + cursor(entry_size=29),
            "a record states a size that is one byte too large",
            ("entry-beyond-end", 24))
    invalid("cursor-torn.dat", start + cursor() + cursor(picture)[:-4], "the last record lacks its flags",
            ("entry-beyond-end", 56), ("cursor-without-image", 24))
    invalid("cursor-torn-in-time.dat", start + cursor() + cursor()[:10], "the stream ends inside a record's time",
            ("torn-entry", 56), ("cursor-without-image", 24))
    invalid("cursor-sizes-disagree.dat", start + cursor(data_size=9) + cursor(), "a record's two sizes differ by one",
            ("cursor-sizes", 24), ("cursor-without-image", 56))
    invalid("cursor-data-size-4-gib.dat", start + cursor(data_size=0xFFFFFFFF), "the data part states a size of 4 GiB",
            ("cursor-sizes", 24))
    invalid("cursor-data-empty.dat", start + cursor()[:-8].replace(le32(28), le32(20)).replace(le32(8), le32(0)),
            "the data part of version 2 is empty", ("cursor-data", 24))
    invalid("cursor-without-flags.dat", start + cursor(entry_size=24, data_size=4)[:-4],
            "the data part ends before the flags", ("cursor-data", 24))
    invalid("cursor-image-beyond-record.dat", start + cursor(picture, image_size=len(picture) + 9),
            "the image states a larger size than its record", ("image-beyond-entry", 24))
    invalid("cursor-image-4-gib.dat", start + cursor(picture, image_size=0xFFFFFFFF),
            "the image states a size of 4 GiB",
            ("image-beyond-entry", 24))
    invalid("cursor-image-takes-the-type.dat", start + cursor(picture, image_size=len(picture) + 6),
            "the image states a size that is 6 bytes too large and leaves no space for the cursor's type", ("cursor-data", 24),
            ("image-surplus", 137))
    invalid("cursor-version-1-half-hot-spot.dat",
            header(IMAGE, 0, 1) + le32(25) + seconds(1.0) + struct.pack("<Q", 7) + le32(5) + b"\0" * 5,
            "the data part of version 1 ends inside its hot spot", ("cursor-data", 24))
    invalid("cursor-image-is-text.dat", start + cursor(b"not a picture"), "the image is not a picture",
            ("undecodable-image", image))
    invalid("cursor-image-wrong-sum.dat", start + cursor(png(sum_off_by=1)), "a checksum in the image is wrong",
            ("undecodable-image", image))
    invalid("cursor-image-cut-short.dat", start + cursor(picture[:-16]), "the image lacks its last 16 bytes",
            ("undecodable-image", image))
    invalid("cursor-image-too-many-pixels.dat", start + cursor(png(16384, 16384)),
            "77 bytes claim to be 16384 x 16384 pixels", ("undecodable-image", image))
    invalid("cursor-image-surplus-pixels.dat", start + cursor(grey_png(8, further_rows=1)),
            "the image has compressed data after its last pixel", ("undecodable-image", image))
    invalid("cursor-image-tiff-cut-short.dat", start + cursor(b"II*\0" + le32(8) + b"\x01\0"),
            "a TIFF file of 10 bytes has no directory", ("undecodable-image", image))
    invalid("cursor-image-version-1-is-text.dat",
            header(IMAGE, 0, 1) + le32(31) + seconds(1.0) + struct.pack("<Q", 7) + le32(11) + b"\0" * 8 + b"abc",
            "the image of a version 1 record is not a picture", ("undecodable-image", 24 + 32))


def write_tables():
    with open(os.path.join(HERE, "expected.tsv"), "w", encoding="utf-8") as table:
        for name, findings, _ in FILES:
            table.write(name + "\t" + " ".join(f"{code}@{offset}" for code, offset in findings) + "\n")
    with open(os.path.join(HERE, "README.md"), "w", encoding="utf-8") as page:
        page.write("# Invalid recordings\n\n"
                   f"{len(FILES)} small files, each wrong in one way. `make.py` writes them, this page, and\n"
                   "`expected.tsv`, which tells the tests what `zulm verify` must find and at which offset from\n"
                   "the start of the file. The first finding is what the file is about; the others follow from it.\n\n"
                   "| file | why it is wrong | finding | offset | what follows |\n|---|---|---|---:|---|\n")
        for name, findings, why in FILES:
            (code, offset), rest = findings[0], findings[1:]
            consequences = ", ".join(f"{c} at {o}" for c, o in rest)
            page.write(f"| {name} | {why} | {code} | {offset} | {consequences} |\n")


movies()
dropped_tails()
riffs()
headers()
fixed_entries()
text_entries()
lists()
cursors()
write_tables()
