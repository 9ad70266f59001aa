"""Makes recordings and looks at films without the library, so that both cannot share a mistake."""

import struct
import subprocess
import zlib

KINDS = {"cursorAction": "2b7b6af0", "cursorImage": "2b7b6af1", "cursorLocation": "2b7b6af2", "keyboardAction": "2b7b6af5",
         "recordingRegion": "2b7b6af6", "topmostWindow": "2b7b6af7", "recordingScaleFactor": "2b7b6afb",
         "topmostAppName": "2b7b6a06", "topmostWindowTitle": "2b7b6a07"}
LAYOUTS = {"cursorAction": "<di", "cursorLocation": "<d2i", "keyboardAction": "<d2I", "recordingRegion": "<d4i",
           "topmostWindow": "<d4i", "recordingScaleFactor": "<di"}


def ffmpeg(*words, data=None):
    return subprocess.run(["ffmpeg", "-v", "error", "-nostdin" if data is None else "-y", "-y", *map(str, words)],
                          input=data, check=True, stdout=subprocess.PIPE).stdout


def png(width, height, rgba):
    """A picture of one colour."""
    def chunk(name, data):
        return struct.pack(">I", len(data)) + name + data + struct.pack(">I", zlib.crc32(name + data))
    rows = (b"\0" + bytes(rgba) * width) * height
    return (b"\x89PNG\r\n\x1a\n" + chunk(b"IHDR", struct.pack(">2I5B", width, height, 8, 6, 0, 0, 0)) +
            chunk(b"IDAT", zlib.compress(rows)) + chunk(b"IEND", b""))


def stream(kind, entries):
    """The bytes of a stream: a header and entries, each a time and its values."""
    layout = LAYOUTS.get(kind)
    group = bytes.fromhex(KINDS[kind] + "7a1f11e283d00017f200be7f")
    size = struct.calcsize(layout) if layout else 0
    data = group + struct.pack("<iI", 2 if kind == "cursorImage" else 1, size)
    for time, *values in entries:
        if layout:
            data += struct.pack(layout, time, *values)
        elif kind == "cursorImage":
            number, image, x, y = values
            part = struct.pack("<I2i", len(image), x, y) + image + struct.pack("<iI", -1, 3)
            data += struct.pack("<IdQI", 20 + len(part), time, number, len(part)) + part
        else:
            text = values[0].encode()
            data += struct.pack("<Id", 8 + len(text), time) + text
    return data


def attach(movie, streams):
    """Appends the streams to a movie as its metadata."""
    atoms = b""
    for kind, entries in streams.items():
        data = stream(kind, entries)
        atoms += struct.pack(">I4sQ", 1, b"DATA", 16 + len(data)) + data
    with open(movie, "ab") as file:
        file.write(struct.pack(">I4sQ", 1, b"ZULM", 16 + len(atoms)) + atoms)


def encode(path, width, height, fps, frames, *options):
    """A movie of frames of brightness."""
    words = ["ffmpeg", "-v", "error", "-y", "-f", "rawvideo", "-pix_fmt", "gray", "-s", f"{width}x{height}", "-r", str(fps),
             "-color_range", "pc", "-i", "-", *map(str, options), "-c:v", "libx264", "-preset", "ultrafast", "-crf", "12",
             "-pix_fmt", "yuv420p", str(path)]
    with subprocess.Popen(words, stdin=subprocess.PIPE) as process:
        for frame in frames:
            process.stdin.write(frame)
        process.stdin.close()
        assert process.wait() == 0


def with_box(width, height, x, y, half, value):
    """A black frame with a box whose middle is at x, y."""
    frame = bytearray(width * height)
    left, right = max(0, x - half), min(width, x + half)
    for row in range(max(0, y - half), min(height, y + half)):
        frame[row * width + left:row * width + right] = bytes([value]) * (right - left)
    return bytes(frame)


def frames_of(film, width, height):
    """The brightness of all pictures of a film, from 0 to 255, one picture after the other."""
    words = ["ffmpeg", "-v", "error", "-i", str(film), "-vf", "scale=out_range=pc,format=gray", "-f", "rawvideo", "-"]
    with subprocess.Popen(words, stdout=subprocess.PIPE, stderr=subprocess.DEVNULL) as process:
        while frame := process.stdout.read(width * height):
            yield frame
        assert process.wait() == 0, f"{film} cannot be decoded"


def middle_of(frame, width, least, most=255):
    """The middle of all pixels from one brightness to another; None if there are few."""
    table = bytes(1 if least <= value <= most else 0 for value in range(256))
    marks = frame.translate(table)
    count = sum_x = sum_y = 0
    for y in range(len(frame) // width):
        row = marks[y * width:(y + 1) * width]
        found = row.count(1)
        if not found:
            continue
        count += found
        sum_y += found * (y + 0.5)
        place = row.find(1)
        while place >= 0:
            sum_x += place + 0.5
            place = row.find(1, place + 1)
    return (sum_x / count, sum_y / count) if count > 8 else None


def marker_recording(path, width, height, seconds, fps=30, scale=1, options=()):
    """A movie of a grey box that moves slowly and jumps every two seconds, and the recording of a cursor on it."""
    places = []
    for frame in range(seconds * fps):
        part = frame // (2 * fps)
        step = frame % (2 * fps)
        places.append((60 + (part * 97) % (width // scale - 150) + step // 3,
                       50 + (part * 61) % (height // scale - 110) + step // 4))
    encode(path, width, height, fps, (with_box(width, height, x * scale, y * scale, 20, 110) for x, y in places), *options)
    streams = {"recordingRegion": [(0, 0, 0, width // scale, height // scale)],
               "recordingScaleFactor": [(0, scale)],
               "cursorLocation": [(i / fps, x, y) for i, (x, y) in enumerate(places)],
               "cursorImage": [(0, 1, png(10, 10, (255, 255, 255, 255)), 5, 5)]}
    attach(path, streams)
    return places

