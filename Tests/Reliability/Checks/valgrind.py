"""Runs the test programs and a sample of the tool's commands under valgrind's memory checker.

The programs are those of the dev preset, which scripts/reliability.sh builds. The short form runs the library's; those
that do little but start the tool, whose process is not looked into, are left to the long form."""

import concurrent.futures
import pathlib
import re

import check
import recordings

WORKERS = 2
ERRORS_FOUND = 99
MEMCHECK = ["valgrind", "--quiet", f"--error-exitcode={ERRORS_FOUND}", "--leak-check=full",
            "--errors-for-leak-kinds=definite", "--trace-children=no",
            f"--suppressions={pathlib.Path(__file__).resolve().parents[1] / 'valgrind.supp'}"]

# Tests that hold a text of 4 GiB, which valgrind has no room for, and that count or refuse memory, which it hands out
# itself.
LEFT_OUT = [
    "ImageWithoutMemory.ThrowsWhateverItIsNeededFor",
    "DumpCommand.NeedsNoMoreMemoryForMoreEntries",
    "MetaDataValidator.AsksForNoMoreMemoryThanTwiceTheFileAnd16MiB",
    "MetaDataValidator.LetsGoOfALargeImageBeforeItDecodesASmallTIFF",
    "BelievedSize.MakesAReaderOfAFewBytesAskForAllTheMemoryThatItSays",
    "TextReader.AsksForLittleMoreMemoryThanThereIsInputUntilItEnds",
    "TextReader.WrapsASizeBelowThatOfTheTimeAround",
]
# Tests of large pictures of one colour, of millions of entries or random edits, and of every number or character. They take minutes and
# cover few lines, so only the long form runs them.
SLOW = [
    "*Million*",
    "EditList.RefusesDeepAndLargeDocuments",
    "EditList.RefusesDenominatorsWithoutEnd",
    "Retiming.DoesWhatTheOracleDoesForRandomEdits",
    "EncodedImageCheck.DoesNotUnpackAGigabyteOfPixels",
    "EncodedImageCheck.DoesNotUnpackALargeTIFFFile",
    "EncodedImageCheck.SeesWrongCheckSumsInAPictureThatIsTooLargeToUnpack",
    "PNGDecode.LargePicturesOfOneColourAreNotTakenForHostileOnes",
    "TIFFDecode.LargePicturesOfOneColourAreNotTakenForHostileOnes",
    "UTF8.HasEveryCharacterInItsShortestFormUnlessItIsASurrogate",
    "UTF8.HasNothingAboveTheLastCharacter",
]
PARTS = 4  # into which each test program is divided, so that all workers end at about the same time


def programs(context):
    """The test programs, those of the library alone in the short form."""
    found = sorted((context.build.with_name("dev") / "Tests").glob("*Tests"))
    if not found:
        raise RuntimeError("there are no test programs in the build of the dev preset")
    return [program for program in found if context.full or program.name != "ToolsTests"]


def replays(context):
    """The fuzz targets, which go through their corpora, and these."""
    targets = sorted((context.build.with_name("dev") / "Fuzz").glob("fuzz_*"))
    return [(target, context.source / "Fuzz/corpus" / target.name.removeprefix("fuzz_")) for target in targets]


def judge(name, done, cases, has_failed, how):
    """What memcheck complains of; where it is content, `how` the program failed, if it has."""
    text = done.stderr.decode(errors="replace")
    if done.returncode == ERRORS_FOUND:
        found = " / ".join(re.findall(r"^==\d+== (\S.*)", text, re.M)[:6])
        return check.Result(cases=cases, crashed=1, failures=[f"{name}: {found}"])
    return check.Result(cases=cases, failures=[f"{name}: fails under valgrind: {how}"] if has_failed else [])


def run_program(program, part, folder, left_out):
    done = check.run([*MEMCHECK, program, "--gtest_brief=1", f"--gtest_filter=-{':'.join(left_out)}"], timeout=3000,
                     cwd=folder, environment={"GTEST_TOTAL_SHARDS": str(PARTS), "GTEST_SHARD_INDEX": str(part)})
    tests = re.search(rb"(\d+) tests? from \d+ test suites? ran", done.stdout)
    failed = re.findall(r"^\[  FAILED  \] (\S+)(?: \(|$)", done.stdout.decode(errors="replace"), re.M)
    how = ", ".join(sorted(set(failed))) or f"ended with {done.returncode}"
    return judge(program.name, done, int(tests[1]) if tests else 0, done.returncode != 0, how)


def run_replay(target, corpus, folder):
    done = check.run([*MEMCHECK, target, corpus], timeout=3000, cwd=folder)
    cases = sum(1 for _ in corpus.iterdir())
    return judge(target.name, done, cases, done.returncode != 0, f"ended with {done.returncode}")


def commands(context):
    """What the tool does: reading, writing, damage."""
    streams = recordings.shortened_all(recordings.demo_streams(context), 3000)
    folder = context.folder / "tool"
    folder.mkdir()
    (folder / "r.mp4").write_bytes(recordings.movie(streams.values()))
    (folder / "torn.mp4").write_bytes(recordings.movie(streams.values())[:-1500])
    for name in ("m.mp4", "change.mp4"):
        (folder / name).write_bytes(recordings.FILE_TYPE + recordings.OPEN_MEDIA)
    (folder / "a.dat").write_bytes(streams["cursorLocation"])
    (folder / "page.html").write_bytes(b"<head></head>")
    return folder, [
        ["info", "r.mp4"], ["atoms", "r.mp4"], ["dump", "--format", "ndjson", "r.mp4"], ["verify", "torn.mp4"],
        ["grep", "e", "r.mp4"], ["state", "torn.mp4", "--at", "1,2"], ["extract", "r.mp4", "-o", "out"],
        ["salvage", "torn.mp4", "-o", "rescued"],
        ["redact", "r.mp4", "--keys", "-o", "redacted.mp4"], ["attach", "m.mp4", "a.dat", "-o", "attached.mp4"],
        ["repair", "m.mp4", "-o", "repaired.mp4"], ["diff", "r.mp4", "torn.mp4"],
        ["stamp", "m.mp4", "-o", "s.mp4", "--creator", "C", "--creator-version", "1"],
        ["attach", "change.mp4", "--from", "r.mp4", "--in-place"], ["dump", "--images", "images", "r.mp4"],
        ["convert", "--to", "srt", "r.mp4"], ["convert", "--to", "chapters", "r.mp4"], ["info", "--json", "torn.mp4"],
        ["view", "r.mp4", "--page", "page.html", "-o", "view.html"], ["verify", "--json", "r.mp4"], ["demo", "shown"],
        ["info", "missing.mp4"], ["--help"], ["no-command"],
    ]


def run_command(zulm, words, folder):
    done = check.run([*MEMCHECK, zulm, *words], timeout=600, cwd=folder)
    return judge("zulm " + words[0], done, 1, done.returncode < 0, f"ended by signal {-done.returncode}")


def run(context):
    folder, samples = commands(context)
    zulm = context.build.with_name("dev") / "Tools/zulm/zulm"
    left_out = LEFT_OUT if context.full else LEFT_OUT + SLOW
    jobs = [lambda program=program, part=part: run_program(program, part, context.folder, left_out)
            for program in programs(context) for part in range(PARTS)]
    jobs += [lambda replay=replay: run_replay(*replay, context.folder) for replay in replays(context) if context.full]
    jobs += [lambda words=words: run_command(zulm, words, folder) for words in samples]
    result = check.Result()
    with concurrent.futures.ThreadPoolExecutor(WORKERS) as pool:
        for part in pool.map(lambda job: job(), jobs):
            result.cases += part.cases
            result.crashed += part.crashed
            result.failures += part.failures
    return result
