"""Puts hostile numbers into every size field of movies, RIFF files and streams: whatever walks them ends soon."""

import pathlib
import resource
import shutil
import struct

import check
import recordings

NUMBERS = [0, 1, 2, 3, 4, 5, 6, 7, 8, 15, 16, 17, 23, 24, 2**31 - 1, 2**31, 2**31 + 1, 2**32 - 1, 2**32, 2**32 + 1,
           2**62, 2**63 - 1, 2**63, 2**64 - 1]
SECONDS = 1     # of the processor: others may keep it busy
SAMPLE = 6      # in the short form the tool is run on every 6th file, and on all crowds
MANY = 1 << 20  # bytes of a file of nothing but small items
DATA_SIZE = {"data": (recordings.HEADER + 20, "<I")}  # of the first entry of cursor images
FULL_BOX = struct.pack(">I", 0)  # version and flags, in front of an atom's own fields

# FILE is the file, OUT does not matter.
COMMANDS = ("verify FILE", "atoms FILE", "info FILE", "dump FILE", "grep x FILE", "diff FILE FILE",
            "salvage FILE --force -o OUT", "extract FILE --force -o OUT", "redact FILE --keys --force -o OUT",
            "convert --to srt FILE", "repair --dry-run FILE")
OF_CONTAINERS = ("atoms", "extract", "redact", "convert")
OF_MOVIES = ("repair",)


def with_number(contents, offset, form, number):
    size = struct.calcsize(form)
    return contents[:offset] + struct.pack(form, number) + contents[offset + size:]


def numbers_for(form, offset):
    """Those that fit; of 64 bits also ends that wrap around to the start, to the item itself and before it."""
    wide = form.endswith("Q")
    wrapping = [2**64 - offset, 2**64 - offset + 8, 2**64 - 8, 2**64 - 16, 2**63 - offset] if wide else [2**32 - 8, 2**32 - 16]
    most = 2**64 if wide else 2**32
    return sorted({number % most for number in wrapping} | {number for number in NUMBERS if number < most})


def variants(name, contents, fields):
    """`fields` maps a label to offset and form."""
    stem, extension = name.split(".")
    for label, (offset, form) in fields.items():
        for number in numbers_for(form, offset):
            yield f"{stem}-{label}-{number}.{extension}", with_number(contents, offset, form, number)


def atom_fields(contents, *labels):
    """Both forms of each atom's size: the short one in front, the extended one behind the type."""
    fields, position = {}, 0
    for label in labels:
        position = contents.index(label.encode(), position + 1) - 4
        number = sum(key.startswith(label) for key in fields)
        fields[f"{label}{number}short"] = (position, ">I")
        fields[f"{label}{number}long"] = (position + 8, ">Q")
        position += 4
    return fields


def movie_fields(contents):
    return atom_fields(contents, "ftyp", "mdat", "ZULM", "DATA", "DATA", "ZULR")


def riff_fields(contents):
    fields, position = {}, 0
    for label in ("RIFF", "ZULM", "DATA", "DATA"):
        position = contents.index(label.encode(), position)
        fields[f"{label}{sum(key.startswith(label) for key in fields)}"] = (position + 4, "<I")
        position += 4
    return fields


def stream_fields(kind, stream):
    """Entry sizes in the header and in front of the entries, and what stands inside the first of them."""
    fields = {"entries": (20, "<I")}
    begin, *later = recordings.entry_ends(stream)
    if struct.unpack_from("<I", stream, 20)[0] == 0:
        fields["entry"] = (begin, "<I")
        if later[1:]:
            fields["second"] = (later[0], "<I")
    if kind == "systemData":
        (first,) = struct.unpack_from("<I", stream, begin + 8)
        fields |= {"count": (begin + 4, "<I"), "text": (begin + 8, "<I"), "text2": (begin + 12 + first, "<I")}
    if kind == "cursorImage":
        data, image = struct.unpack_from("<II", stream, begin + 20)
        assert data == image + 20, "the first entry has an image"
        fields |= {"data": (begin + 20, "<I"), "image": (begin + 24, "<I")}
    return fields


def cursor_images_of_version_1(kind):
    """Its second entry stands for the image of the first."""
    image = struct.pack("<IdQIii", 28 + 4, 1.0, 7, 8 + 4, 1, 1) + b"\x89PNG"
    again = struct.pack("<IdQI", 20, 2.0, 7, 0)
    return kind + struct.pack("<iI", 1, 0) + image + again


def extended_movie(streams):
    media = recordings.extended_atom(b"mdat", recordings.MEDIA)
    return (recordings.extended_atom(b"ftyp", b"mp42") + media + recordings.metadata_atom(streams)
            + recordings.RECORDING_INFO)


def movie_with_duration(streams):
    duration = recordings.atom(b"mvhd", FULL_BOX + struct.pack(">IIII", 0, 0, 600, 1200))
    return recordings.movie(streams) + recordings.atom(b"moov", duration)


def duration_fields(contents):
    first = contents.index(b"mvhd") + 4
    return atom_fields(contents, "moov", "mvhd") | {"version": (first, ">I"), "timescale": (first + 12, ">I"),
                                                    "duration": (first + 16, ">I")}


def crowds():
    """Files of nothing but the smallest items, some of which end inside their own headers."""
    for size in (4, 5, 6, 7, 8):
        smallest = struct.pack(">I", size) + b"\0\0\0\0"[: size - 4]
        yield f"crowd-of-{size}.mp4", smallest * (MANY // size)
    yield "crowd-of-extended-8.mp4", struct.pack(">Q", 8) * (MANY // 8)
    yield "crowd-of-extended-16.mp4", recordings.extended_atom(b"free") * (MANY // 16)
    yield "crowd-in-metadata.mp4", recordings.extended_atom(b"ZULM", recordings.extended_atom(b"DATA") * (MANY // 16))
    yield "crowd-of-metadata.mp4", recordings.extended_atom(b"ZULM") * (MANY // 16)
    yield "crowd-of-chunks.avi", recordings.chunk(b"JUNK", b"x") * (MANY // 10)
    yield "crowd-of-empty-chunks.avi", recordings.chunk(b"RIFF") * (MANY // 8)
    yield "crowd-in-metadata.avi", recordings.chunk(b"ZULM", recordings.chunk(b"DATA", b"x") * (MANY // 10))


def cases(streams):
    two = [streams["cursorLocation"], streams["slideTitles"]]
    plain = recordings.movie(two)
    yield from variants("movie.mp4", plain, movie_fields(plain))
    extended = extended_movie(two)
    yield from variants("extended.mp4", extended, movie_fields(extended))
    spare = recordings.FILE_TYPE + recordings.atom(b"wide") + recordings.OPEN_MEDIA
    yield from variants("spare.mp4", spare, atom_fields(spare, "wide", "mdat"))
    timed = movie_with_duration(two)
    yield from variants("timed.mp4", timed, duration_fields(timed))
    riff = recordings.riff(two)
    yield from variants("riff.avi", riff, riff_fields(riff))
    for kind, stream in streams.items():
        yield from variants(f"{kind}.dat", stream, stream_fields(kind, stream))
    old = cursor_images_of_version_1(streams["cursorImage"][:16])
    yield from variants("cursorImageV1.dat", old, stream_fields("", old) | DATA_SIZE)
    yield from crowds()


def processor_seconds():
    """Of all programs that have been run to their end."""
    used = resource.getrusage(resource.RUSAGE_CHILDREN)
    return used.ru_utime + used.ru_stime


def remove(path):
    if path.is_dir():
        shutil.rmtree(path)
    else:
        path.unlink(missing_ok=True)


def suits(command, extension):
    return not (command in OF_CONTAINERS and extension == ".dat" or command in OF_MOVIES and extension != ".mp4")


def run_tool(context, file, result):
    """What a person would try with a broken file."""
    words = {"FILE": file, "OUT": context.folder / f"out{file.suffix}"}
    for command, *arguments in map(str.split, COMMANDS):
        if not suits(command, file.suffix):
            continue
        before = processor_seconds()
        done = check.run([context.zulm, command, *(words.get(word, word) for word in arguments)], timeout=60)
        seconds = processor_seconds() - before
        result.cases += 1
        result.crashed += done.returncode < 0
        if done.returncode not in (0, 1, 3, 4):
            result.failures.append(f"zulm {command} {file.name} ends with {done.returncode}")
        if seconds > SECONDS:
            result.failures.append(f"zulm {command} {file.name} takes {seconds:.1f} s")
        remove(words["OUT"])


def run_library(context, files, result):
    with recordings.fast_folder() as scratch:
        done = check.run([context.program("hostile_sizes"), scratch, *files], timeout=600)
    result.failures += done.stderr.decode(errors="replace").splitlines()
    result.crashed += done.returncode != 0
    if done.returncode == 0:
        ran, demanding = map(int, done.stdout.split())
        result.cases += ran
        result.notes.append(f"in {demanding:,} of {ran:,} files a declared size, which readers believe, asks for more "
                            "memory than twice the file and 16 MiB; the validator warns of each")


def run(context):
    streams = {kind: recordings.shortened(stream, 200) for kind, stream in recordings.demo_streams(context).items()}
    folder = pathlib.Path(context.folder) / "files"
    folder.mkdir()
    files = []
    for name, contents in cases(streams):
        files.append(folder / name)
        files[-1].write_bytes(contents)
    result = check.Result()
    for number, file in enumerate(files):
        if context.full or number % SAMPLE == 0 or file.name.startswith("crowd"):
            run_tool(context, file, result)
    run_library(context, files, result)
    return result
