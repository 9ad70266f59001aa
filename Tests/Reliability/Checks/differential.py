"""Walks the same files with `zulm atoms` and with two other programs, which must see the same items in the same places.

ffprobe tells each atom's size and how far it has read (not behind the media in every file: what it saw is compared);
exiftool tells the type, the payload's size and where the payload's bytes stand, of movies and RIFF files.
"""

import itertools
import json
import random
import re
import struct

import check
import recordings

QUICK, FULL = 50, 300
SEED = 17
MUXERS = (
    ("mp4", []), ("mp4", ["-movflags", "+faststart"]), ("mp4", ["-movflags", "+frag_keyframe+empty_moov"]),
    ("mp4", ["-movflags", "+frag_keyframe+separate_moof+default_base_moof"]), ("mov", []),
    ("mov", ["-movflags", "+faststart"]), ("mp4", ["-brand", "M4V ", "-write_tmcd", "0"]),
    ("mp4", ["-f", "ipod"]), ("mp4", ["-f", "3gp", "-c:a", "aac"]), ("avi", []), ("wav", []),
)
SIZES = ("32x32", "64x48", "160x90", "320x180")
TYPES = [b"free", b"skip", b"wide", b"uuid", b"ZULM", b"ZULR", b"abcd", b"mdat"]


def encoded(folder, number, chance):
    """A file made by an encoder, with streams behind it in every other one."""
    extension, flags = MUXERS[number % len(MUXERS)]
    file = folder / f"encoded-{number}.{extension}"
    seconds = f"{chance.uniform(0.2, 1.5):.2f}"
    picture = [] if extension == "wav" else ["-f", "lavfi", "-i", f"testsrc=size={chance.choice(SIZES)}:rate=10"]
    sound = ["-f", "lavfi", "-i", f"sine=frequency={chance.randrange(200, 900)}"] if chance.random() < 0.6 or not picture else []
    codecs = ["-c:v", "mpeg4"] if picture else []
    check.run(["ffmpeg", "-v", "error", "-y", *picture, *sound, "-t", seconds, *codecs, "-metadata",
               f"title={'x' * chance.randrange(20)}", *flags, file]).check_returncode()
    if number // len(MUXERS) % 2:
        stream = b"\0" * recordings.HEADER + bytes(chance.randrange(100))
        with file.open("ab") as end:
            end.write(recordings.metadata_atom([stream]) if extension in ("mp4", "mov") else recordings.metadata_chunk([stream]))
    return file


def built_movie(folder, number, chance):
    """Atoms in both forms and of any size, and now and then a last one without a size."""
    contents = recordings.FILE_TYPE
    for _ in range(chance.randrange(1, 12)):
        form = recordings.extended_atom if chance.random() < 0.4 else recordings.atom
        contents += form(chance.choice(TYPES), bytes(chance.randrange(1, 200)))
    if chance.random() < 0.3:
        contents += struct.pack(">I", 0) + b"mdat" + bytes(chance.randrange(1, 50))
    file = folder / f"built-{number}.mov"
    file.write_bytes(contents)
    return file


def built_riff(folder, number, chance):
    inner = b"".join(recordings.chunk(chance.choice([b"JUNK", b"data", b"note"]), bytes(chance.randrange(1, 60)))
                     for _ in range(chance.randrange(4)))
    sound = recordings.chunk(b"fmt ", struct.pack("<HHIIHH", 1, 1, 8000, 8000, 1, 8))
    contents = recordings.chunk(b"RIFF", b"WAVE" + sound + recordings.chunk(b"LIST", b"INFO") + inner)
    for _ in range(chance.randrange(1, 6)):
        contents += recordings.chunk(chance.choice([b"ZULM", b"JUNK", b"abcd"]), bytes(chance.randrange(1, 90)))
    file = folder / f"built-{number}.wav"
    file.write_bytes(contents)
    return file


def our_items(context, file):
    """Type, offset, header's size and size of every item at the top."""
    done = check.run([context.zulm, "atoms", "--json", file])
    (document,) = json.loads(done.stdout)["files"]
    return [(item["type"], item["offset"], item["header_size"], item["size"], item["header"]) for item in document["items"]]


def by_ffprobe(file, ours):
    """Differences in the atoms that it saw. It counts an extended header's last 8 bytes as read, not as size."""
    done = check.run(["ffprobe", "-v", "trace", file])
    seen = re.findall(r"type:'(.{4})' parent:'root' sz: (\d+) (\d+) \d+", done.stderr.decode(errors="replace"))
    again = [i for i in range(1, len(seen)) if int(seen[i][2]) < int(seen[i - 1][2])]
    seen = seen[: again[0]] if again else seen  # where it finds no movie it looks a second time
    for (kind, size, read), (our_kind, offset, _, our_size, form) in zip(seen, ours):
        extended = 8 if form == "extended" else 0
        size = int(size) + extended if form != "open-ended" else our_size
        if (kind, int(read) - 8 - extended, size) != (our_kind, offset, our_size):
            yield f"ffprobe sees {kind} of {size} bytes at {int(read) - 8 - extended}, we {our_kind} of {our_size} at {offset}"
    if not seen or len(seen) > len(ours):
        yield f"ffprobe sees {len(seen)} atoms, we {len(ours)}"


def by_exiftool_movie(file, ours):
    listing = check.run(["exiftool", "-v3", file]).stdout.decode(errors="replace")
    seen = re.findall(r"^  - Tag '(.{4})'.*? \((\d+) bytes\):\n(?:      ([0-9a-f]+): )?", listing, re.MULTILINE)
    wanted = [(kind, size - header, offset + header) for kind, offset, header, size, form in ours if form != "open-ended"]
    if len(seen) < len(wanted):
        yield f"exiftool sees {len(seen)} atoms, we {len(wanted)}"
    for (kind, size, position), (our_kind, our_size, our_position) in zip(seen, wanted):
        place = int(position, 16) if position else our_position
        if (kind, int(size), place) != (our_kind, our_size, our_position):
            yield f"exiftool sees {kind} of {size} bytes at {place}, we {our_kind} of {our_size} at {our_position}"


def by_exiftool_riff(file, ours):
    """It lists what is inside the RIFF chunk and goes on behind it."""
    listing = check.run(["exiftool", "-v3", file]).stdout.decode(errors="replace")
    position, seen = 12, []
    (_, _, _, first_end, _), rest = ours[0], ours[1:]
    for kind, size in re.findall(r"^RIFF '(.{4})(?:_.{4})?' chunk \((\d+) bytes of data\)", listing, re.MULTILINE):
        length = int(size) + (4 if kind == "LIST" else 0)
        if position >= first_end:
            seen.append((kind, position, length + 8))
        position += 8 + length + length % 2
    if seen != [(kind, offset, size) for kind, offset, _, size, _ in rest]:
        yield f"exiftool sees {seen} behind the RIFF chunk, we {rest}"


def compare(context, file):
    ours = our_items(context, file)
    if file.suffix in (".avi", ".wav"):
        return by_exiftool_riff(file, ours)
    return itertools.chain(by_ffprobe(file, ours), by_exiftool_movie(file, ours))


def run(context):
    chance = random.Random(SEED)
    result = check.Result()
    for number in range(FULL if context.full else QUICK):
        make = (encoded, built_movie, encoded, built_riff)[number % 4]
        file = make(context.folder, number // 2 if make is encoded else number, chance)
        result.cases += 1
        result.failures += [f"{file.name}: {difference}" for difference in compare(context, file)]
    return result
