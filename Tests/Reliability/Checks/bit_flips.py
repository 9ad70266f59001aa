"""Flips every bit of a movie and of each kind's stream, and does with the file whatever the library can do."""

import concurrent.futures

import check
import recordings

MOVIE_BYTES = 8 * 1024
STREAM_BYTES = 400
RANDOM_CASES = 1_000_000  # three bits each, in the long form
WORKERS = 2


def files(context, folder):
    streams = recordings.demo_streams(context)
    around = len(recordings.movie([b""] * len(streams)))
    made = {"movie.mp4": recordings.movie(recordings.shortened_all(streams, MOVIE_BYTES - around).values())}
    for kind, stream in streams.items():
        made[f"{kind}.dat"] = recordings.shortened(stream, STREAM_BYTES)
    for name, contents in made.items():
        (folder / name).write_bytes(contents)
    return [folder / name for name in made]


def flip(context, part, chosen, random_cases):
    with recordings.fast_folder() as scratch:
        return check.run([context.program("bit_flips"), scratch, str(part), str(WORKERS), str(random_cases), *chosen],
                         timeout=3600, environment={"ASAN_OPTIONS": "malloc_context_size=1:quarantine_size_mb=1"})


def run(context):
    chosen = files(context, context.folder)
    random_cases = RANDOM_CASES // WORKERS if context.full else 0
    result = check.Result()
    with concurrent.futures.ThreadPoolExecutor(WORKERS) as pool:
        for done in pool.map(lambda part: flip(context, part, chosen, random_cases), range(WORKERS)):
            result.failures += done.stderr.decode(errors="replace").splitlines()
            result.crashed += done.returncode != 0
            if done.returncode == 0:
                cases, demanding = map(int, done.stdout.split())
                result.cases += cases
                result.notes.append(f"in {demanding:,} of {cases:,} cases the declared size of a text or an image, which "
                                    "readers believe, asks for more memory; the validator warns of each")
    return result
