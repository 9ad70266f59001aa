"""The first inputs of the fuzz targets of edit lists: of every form, lists that can be read."""

import struct

import recordings

TEXTS = {
    "own": [
        '{"schema": "zulm.edits", "schema_version": 1, "pieces": [{"start": "10", "end": "61/3", "speed": "3/2"}, '
        '{"at": 12.5, "duration": "2"}, {"start": 1e-3, "end": 0.1}]}',
        '{"schema": "zulm.edits", "schema_version": 1, "pieces": [{"start": "\\u0031", "end": "2.50"}]}',
    ],
    "concat": [
        "ffconcat version 1.0\n# mine\nfile 'a b.mp4'\ninpoint 10\noutpoint 0:20.5\nfile a\\ b.mp4\nduration 500ms\n",
        "file a\ninpoint 1\nstream\n",
    ],
    "lossless_cut": [
        "{version: 1, mediaFileName: 'a.mp4', cutSegments: [{start: 10.5, end: 20, name: '\\x41'}, {end: +1.,}],}",
        '{"version": 2, "cutSegments": [/* */ {"start": 1, "end": 2e1, "selected": false}, {"start": 3}] // x\n}',
    ],
    "cut_table": [',56.9568,First\n70,842.33,"a ""b"", c"\n1234,,Last\n', "00:00:10.5\t00:01:00\ta\r\n"],
    "auto_editor": [
        '{"version": "1", "source": "a", "chunks": [[0, 26, 1.0], [26, 34, 99999.0], [34, 396, 2.5]]}',
        '{"version": "2", "source": "a", "tb": "30/1", "effects": [[], ["speed:2", "volume:0.5"], ["cut"]], '
        '"clips": [[0, 26, 0], [34, 396, 1], [400, 500, 2]]}',
        '{"version": "3", "timebase": "30000/1001", "a": [], "v": [[{"src": "a", "start": 26, "dur": 10, '
        '"offset": 34, "speed": 2.0, "stream": 0}, {"name": "video", "src": "a", "start": 0, "dur": 26, '
        '"offset": 0, "effects": ["varispeed:0.5"]}]]}',
    ],
    "cmx3600": [
        "TITLE: A\nFCM: NON-DROP FRAME\n001  AX  V  C  00:00:10:00 00:00:20:00 01:00:00:00 01:00:05:00\n"
        "M2   AX  050.0  00:00:10:00\n* FROM CLIP NAME: a\n",
        "FCM: DROP FRAME\n001 A V C 00:00:59:28 00:01:00:02 00:00:00:00 00:00:00:02\n002 A A C 1 2 3 4\n",
    ],
}
RANGE = (
    '{"OTIO_SCHEMA": "TimeRange.1", "start_time": {"OTIO_SCHEMA": "RationalTime.1", "value": 90, "rate": 23.976}, '
    '"duration": {"OTIO_SCHEMA": "RationalTime.1", "value": 48, "rate": 24}}'
)
CLIP = (
    '{"OTIO_SCHEMA": "Clip.2", "source_range": %s, "effects": [{"OTIO_SCHEMA": "%s.1", "time_scalar": 2.0}], '
    '"media_references": {"DEFAULT_MEDIA": {"OTIO_SCHEMA": "MissingReference.1"}}}'
)
TIMELINE = (
    '{"OTIO_SCHEMA": "Timeline.1", "tracks": {"OTIO_SCHEMA": "Stack.1", "children": ['
    '{"OTIO_SCHEMA": "Track.1", "kind": "Video", "children": [%s, %s, {"OTIO_SCHEMA": "Gap.1"}]}]}}'
)
KNOWN = (0, 5, 6)  # what the caller knows: nothing, or a frame rate and the duration of the source


def timelines():
    yield TIMELINE % (CLIP % (RANGE, "LinearTimeWarp"), CLIP % (RANGE, "FreezeFrame"))
    yield TIMELINE % (CLIP % (RANGE, "Effect"), CLIP % ("null", "Effect"))


def header(kind, timescale):
    return recordings.atom(kind, struct.pack(">IIIII", 0, 0, 0, timescale, 0))


def movie(version, edits):
    """Returns a movie whose only track shows the edits: length, media time and rate."""
    entries = b"".join(struct.pack(">QqI" if version else ">IiI", *edit) for edit in edits)
    table = recordings.atom(b"elst", struct.pack(">II", version << 24, len(edits)) + entries)
    handler = recordings.atom(b"hdlr", bytes(8) + b"vide" + bytes(13))
    media = recordings.atom(b"mdia", header(b"mdhd", 90000) + handler)
    track = recordings.atom(b"trak", recordings.atom(b"edts", table) + media)
    return recordings.FILE_TYPE + recordings.atom(b"moov", header(b"mvhd", 600) + track)


def seeds():
    """Yields the name of each target and its inputs."""
    lists = {form: [text.encode() for text in texts] for form, texts in TEXTS.items()}
    lists["open_timeline"] = [text.encode() for text in timelines()]
    lists["movie"] = [
        movie(0, [(1200, 900000, 0x10000), (300, 0, 0)]),
        movie(1, [(1200, 900000, 0x8000), (0, 0, 0x10000), (600, -1, 0x10000)]),
    ]
    lists["any"] = [text for texts in lists.values() for text in texts]
    for form, texts in lists.items():
        yield f"edit_list_{form}", [bytes([known]) + text for text in texts for known in KNOWN]
