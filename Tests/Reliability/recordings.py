"""Recordings for the checks to break: the streams of a demo session, shortened and put together byte by byte."""

import contextlib
import os
import struct
import tempfile

from check import run

HEADER = 24  # bytes of a stream's header


@contextlib.contextmanager
def fast_folder():
    """A folder in memory, where there is such a thing, for checks that write many small files."""
    memory = "/dev/shm"
    with tempfile.TemporaryDirectory(prefix="zulm-reliability-", dir=memory if os.path.isdir(memory) else None) as folder:
        yield folder


def demo_streams(context):
    """The streams of a demo session by their kinds' names."""
    folder = context.folder / "demo"
    run([context.zulm, "demo", folder]).check_returncode()
    return {file.stem: file.read_bytes() for file in sorted((folder / "streams").glob("*.dat"))}


def entry_ends(stream):
    """The end of each whole entry, counted from the stream's header on; first that of the header."""
    (size,) = struct.unpack_from("<I", stream, 20)
    ends = [HEADER]
    while True:
        begin = ends[-1]
        if size == 0 and begin + 4 > len(stream):
            return ends
        end = begin + (size or 4 + struct.unpack_from("<I", stream, begin)[0])
        if end > len(stream):
            return ends
        ends.append(end)


def shortened(stream, most):
    """As many entries as fit into `most` bytes, but at least one."""
    ends = entry_ends(stream)
    fitting = [end for end in ends if end <= most]
    return stream[: max(fitting[-1] if fitting else 0, ends[min(1, len(ends) - 1)])]


def lengthened(stream, most):
    """Its entries again and again, as many as fit into `most` bytes."""
    ends = entry_ends(stream)
    again = stream[HEADER:ends[-1]] * (most // max(1, ends[-1] - HEADER) + 1)
    return shortened(stream[:HEADER] + again, most)


def shortened_all(streams, most):
    """Shortened so that together they fit into `most` bytes, if one entry of each does."""
    share = most
    while sum(len(shortened(stream, share)) for stream in streams.values()) > most and share > HEADER:
        share = share * 9 // 10
    return {kind: shortened(stream, share) for kind, stream in streams.items()}


def atom(kind, payload=b""):
    return struct.pack(">I", 8 + len(payload)) + kind + payload


def sized_atom(kind, size, payload=b"", mark=1):
    """Extended form, with whatever size, and whatever in place of the mark."""
    return struct.pack(">I", mark) + kind + struct.pack(">Q", size) + payload


def extended_atom(kind, payload=b""):
    return sized_atom(kind, 16 + len(payload), payload)


def metadata_atom(streams):
    return extended_atom(b"ZULM", b"".join(extended_atom(b"DATA", stream) for stream in streams))


def chunk(kind, data=b""):
    return kind + struct.pack("<I", len(data)) + data + b"\0" * (len(data) % 2)


def metadata_chunk(streams):
    return chunk(b"ZULM", b"".join(chunk(b"DATA", stream) for stream in streams))


FILE_TYPE = atom(b"ftyp", b"mp42\0\0\0\0isom")
MEDIA = b"0123456789abcdefghijklm"  # of odd size
OPEN_MEDIA = struct.pack(">I", 0) + b"mdat" + MEDIA  # which goes on to the end of the file
RECORDING_INFO = extended_atom(b"ZULR", struct.pack("<q", 1) + b"\0" * 56)


def movie(streams, media=atom(b"mdat", MEDIA)):
    return FILE_TYPE + media + metadata_atom(streams) + RECORDING_INFO


def riff(streams, form=b"AVI "):
    return chunk(b"RIFF", form + chunk(b"JUNK", MEDIA)) + metadata_chunk(streams)
