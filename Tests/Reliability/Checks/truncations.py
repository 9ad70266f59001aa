"""Cuts recordings after every number of bytes, and checks what the library and `zulm verify` make of the rest."""

import concurrent.futures
import struct

import check
import recordings

SMALL = 6 * 1024   # bytes of metadata at most
LARGE = 64 * 1024
SAMPLE = 97        # in the short form the tool is run on every 97th length


def movies(streams, most):
    """Whole; with media that was never closed; and in the middle of an append."""
    chosen = list(recordings.shortened_all(streams, most).values())
    appended = recordings.metadata_atom(chosen)
    return {
        "whole.mp4": recordings.movie(chosen),
        "open.mov": recordings.FILE_TYPE + recordings.atom(b"wide") + recordings.OPEN_MEDIA,
        "interrupted.zcap": recordings.FILE_TYPE + recordings.atom(b"mdat", recordings.MEDIA) + appended[:8]
        + bytes(8) + appended[16:],
    }


def files(context, streams):
    made = movies(streams, SMALL)
    small = list(recordings.shortened_all(streams, SMALL).values())
    made["small.avi"] = recordings.riff(small)
    made["small.wav"] = recordings.riff(small[:4], b"WAVE")
    for kind, stream in streams.items():
        made[f"{kind}.dat"] = recordings.shortened(stream, 600)
    if context.full:
        share = (LARGE - 1024) // len(streams)
        large = [recordings.lengthened(stream, share) for stream in streams.values()]
        made["large.mp4"] = recordings.movie(large)
        made["large.avi"] = recordings.riff(large)
        made["large.wav"] = recordings.riff(large, b"WAVE")
        for kind in ("cursorLocation", "topmostWindowTitle", "cursorImage"):
            made[f"large-{kind}.dat"] = recordings.lengthened(streams[kind], LARGE)
    for name, contents in made.items():
        (context.folder / name).write_bytes(contents)
    return {name: context.folder / name for name in made}


def in_process(context, chosen):
    with recordings.fast_folder() as scratch:
        return check.run([context.program("truncations"), scratch, *chosen], timeout=3600)


def ends_of(name, contents):
    """Where a cut cannot be told from a file that was never longer, and what `verify` then ends with."""
    if name.endswith(".dat"):
        return {end: 0 for end in recordings.entry_ends(contents)}
    ends, code, position = {0: 4}, 4, 0
    is_riff = contents.startswith(b"RIFF")
    while position < len(contents):
        kind = contents[position:position + 4] if is_riff else contents[position + 4:position + 8]
        if is_riff:
            size = 8 + struct.unpack_from("<I", contents, position + 4)[0]
        else:
            (size,) = struct.unpack_from(">I", contents, position)
            size = struct.unpack_from(">Q", contents, position + 8)[0] if size == 1 else size
        if size == 0:
            break
        code = 0 if kind == b"ZULM" else code
        ends[position + size] = code
        position += size + (size % 2 if is_riff else 0)
        ends[position] = code
    return ends


def verify(context, name, contents, result):
    """What `zulm verify` ends with for the file cut after some lengths, or after each."""
    expected = ends_of(name, contents)
    lengths = range(0, len(contents) + 1, 1 if context.full and len(contents) < LARGE // 2 else SAMPLE)
    for length in sorted({*lengths, *(end for end in expected)}):
        with recordings.fast_folder() as folder:
            file = f"{folder}/{name}"
            with open(file, "wb") as cut:
                cut.write(contents[:length])
            code = check.run([context.zulm, "verify", file]).returncode
        result.cases += 1
        result.crashed += code < 0
        if code != expected.get(length, 3):
            result.failures.append(f"verify of {name} cut after {length} bytes ends with {code}")


def run(context):
    chosen = files(context, recordings.demo_streams(context))
    result = check.Result()
    others = [path for name, path in chosen.items() if not name.startswith("large")]
    groups = [others, *([path] for path in chosen.values() if path not in others)]
    repaired = 0
    with concurrent.futures.ThreadPoolExecutor(2) as pool:
        jobs = [pool.submit(in_process, context, group) for group in groups]
        for name, path in chosen.items():
            verify(context, name, path.read_bytes(), result)
        for done in (job.result() for job in jobs):
            result.failures += done.stderr.decode(errors="replace").splitlines()
            result.crashed += done.returncode != 0
            if done.returncode == 0:
                cases, lost, repairs = map(int, done.stdout.split())
                result.cases += cases
                result.lost += lost
                repaired += repairs
    if repaired == 0:
        result.failures.append("no movie was cut in a way that can be repaired safely")
    return result
