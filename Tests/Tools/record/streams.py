"""Reads recordings without the library, so that both cannot share a mistake."""

import dataclasses
import pathlib
import struct

KINDS = {"f0": "cursorAction", "f1": "cursorImage", "f2": "cursorLocation", "f3": "cursorOpacity",
         "f5": "keyboardAction", "f6": "recordingRegion", "f7": "topmostWindow", "fb": "recordingScaleFactor",
         "fc": "systemData"}
LATER_KINDS = {"05": "scrollAction", "06": "topmostAppName", "07": "topmostWindowTitle", "08": "cpuUsage",
               "09": "hoverRect"}
VALUES = {"cursorAction": "<i", "cursorLocation": "<2i", "cursorOpacity": "<d", "keyboardAction": "<2I",
          "recordingRegion": "<4i", "topmostWindow": "<4i", "recordingScaleFactor": "<i", "scrollAction": "<2i",
          "cpuUsage": "<f", "hoverRect": "<4i"}


@dataclasses.dataclass
class Entry:
    time: float
    value: object


def kind_of(header):
    last = header[3:4].hex()
    return KINDS.get(last) if header[2:3].hex() == "6a" and last >= "ef" else LATER_KINDS.get(last)


def entries_of(stream):
    """The kind and the whole entries of a stream with its header."""
    kind = kind_of(stream)
    body = stream[24:]
    entries = []
    if kind in VALUES:
        layout = VALUES[kind]
        size = 8 + struct.calcsize(layout)
        for start in range(0, len(body) - size + 1, size):
            value = struct.unpack_from(layout, body, start + 8)
            entries.append(Entry(struct.unpack_from("<d", body, start)[0], value if len(value) > 1 else value[0]))
        return kind, entries
    start = 0
    while start + 4 <= len(body):
        size = struct.unpack_from("<I", body, start)[0]
        entry = body[start + 4:start + 4 + size]
        if len(entry) < size:
            break
        start += 4 + size
        if kind in ("topmostAppName", "topmostWindowTitle"):
            entries.append(Entry(struct.unpack_from("<d", entry)[0], entry[8:].decode()))
        else:
            entries.append(Entry(0.0, entry))
    return kind, entries


def atoms_of(data, start=0, end=None):
    end = len(data) if end is None else end
    while start + 8 <= end:
        size, name = struct.unpack_from(">I4s", data, start)
        head = 8
        if size == 1:
            size = struct.unpack_from(">Q", data, start + 8)[0]
            head = 16
        if size < head or start + size > end:
            return
        yield name.decode("latin1"), start + head, start + size
        start += size


def streams_of_movie(path):
    """The streams of a movie by kind; of several of one kind the last one."""
    data = pathlib.Path(path).read_bytes()
    streams = {}
    for name, start, end in atoms_of(data):
        if name != "ZULM":
            continue
        for inner, first, last in atoms_of(data, start, end):
            if inner == "DATA":
                kind, entries = entries_of(data[first:last])
                streams[kind] = entries
    return streams


def streams_of_folder(path):
    streams = {}
    for file in pathlib.Path(path).glob("*.dat"):
        kind, entries = entries_of(file.read_bytes())
        streams[kind] = entries
    return streams
