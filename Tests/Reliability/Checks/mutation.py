"""Changes the stream core a little, 300 times, and sees whether its tests notice.

A mutant is compiled into a copy of the sources as they were last committed, with what includes the changed file, and
runs the test programs of Tests/ZULMetaData that cover it, up to the first that fails. One that never ends counts as
killed; one that does not compile is not counted, and another one takes its place. Those that live on are in
Docs/reliability.md, each with what is to be thought of it."""

import concurrent.futures
import functools
import hashlib
import pathlib
import re
import subprocess
import tempfile

import check
import mutants

WORKERS = 2
SEED = 20240607
WANTED = 300
ENOUGH = 0.85
SECONDS_PER_TEST = 60

COMPILE = ["g++", "-std=c++20", "-O0", "-w"]
LINK = ["-lgtest_main", "-lgmock", "-lgtest", "-lpthread", "-Wl,--wrap=malloc,--wrap=calloc,--wrap=free"]
PRECOMPILED = "#include <gmock/gmock.h>\n#include <gtest/gtest.h>\n"

# The test programs that cover a source: the quickest or most telling first.
READER = ["ZULMMetaDataReader", "MetaDataParser"]
WRITER = ["ZULMMetaDataWriter", "CursorImageWriter"]
CONTAINERS = ["ContainerScan", "ParserUtil", "MetaDataParser"]
CURSORS = ["CursorImageSchema", "CursorImageWriter", "StreamEntries", "ZULMMetaDataWriter"]
COVERED_BY = {
    "AtomFormat.h": ["ContainerScan", "MP4MetaData", "AtomRepair"],
    "AtomWriting.cpp": ["MP4MetaData"],
    "ByteReader.cpp": ["ByteSource", "StreamEntries"],
    "ByteReader.h": ["ByteSource", "StreamEntries"],
    "ByteSource.cpp": ["ByteSource"],
    "ByteSource.h": ["ByteSource"],
    "ByteSourceStream.cpp": ["ByteSource"],
    "ByteSourceStream.h": ["ByteSource"],
    "ContainerLayout.cpp": ["ContainerLayout", "RecordingInfo"],
    "ContainerLayout.h": ["ContainerLayout", "RecordingInfo"],
    "ContainerRecognition.cpp": ["ContainerRecognition"],
    "ContainerRecognition.h": ["ContainerRecognition"],
    "ContainerScan.h": CONTAINERS,
    "ContainerScan.cpp": [*CONTAINERS, "PositionedInput"],
    "CursorImageSchema.cpp": CURSORS,
    "CursorImageSchema.h": CURSORS,
    "CursorImageSteps.h": CURSORS,
    "CursorImageWriter.cpp": CURSORS,
    "CursorImageWriter.h": CURSORS,
    "FileInputBuffer.cpp": ["FileInputBuffer", "MetaDataParser"],
    "FileInputBuffer.h": ["FileInputBuffer", "MetaDataParser"],
    "FourCC.h": ["ContainerLayout", "ContainerScan"],
    "InvalidEntry.h": READER,
    "MP4MetaData.cpp": ["MP4MetaData"],
    "MovieDuration.cpp": ["MovieDuration"],
    "PositionedInput.cpp": [*CONTAINERS, "AtomRepair", "MP4MetaData", "PositionedInput"],
    "PositionedInput.h": [*CONTAINERS, "AtomRepair", "MP4MetaData", "PositionedInput"],
    "RecordingInfo.cpp": ["RecordingInfo"],
    "RepairPlan.cpp": ["RepairPlan"],
    "RepairPlan.h": ["RepairPlan"],
    "StreamBufferAccess.cpp": WRITER,
    "StreamBufferAccess.h": [*WRITER, *READER, "MP4MetaData"],
    "StreamEntries.cpp": ["StreamEntries", "StreamExtent"],
    "StreamEntries.h": ["StreamEntries", "StreamExtent"],
    "Util.cpp": ["AtomRepair", "MetaDataParser"],
    "WideRIFF.cpp": ["WideRIFF", "ContainerRecognition"],
    "WideRIFF.h": ["WideRIFF"],
    "ZULMMetaDataCommon.cpp": ["ValueTypes", "ZULMMetaDataCommon"],
    "ZULMMetaDataCommon.h": ["ValueTypes", "ZULMMetaDataCommon"],
    "ZULMMetaDataParser.cpp": ["MetaDataParser", "ParserUtil"],
    "ZULMMetaDataParser.h": ["MetaDataParser", "ParserUtil"],
    "ZULMMetaDataReader.cpp": READER,
    "ZULMMetaDataReader.h": READER,
    "ZULMMetaDataUUIDs.cpp": ["ZULMMetaDataUUIDs"],
    "ZULMMetaDataUUIDs.h": ["ZULMMetaDataUUIDs"],
    "ZULMMetaDataWriter.h": WRITER,
}


class Tree:
    """The sources as they were last committed, their objects, and what each object was made of."""

    def __init__(self, source, folder):
        self.root = folder / "tree"
        self.objects = folder / "objects"
        self.root.mkdir()
        self.objects.mkdir()
        archive = subprocess.run(["git", "-C", source, "archive", "HEAD"], stdout=subprocess.PIPE, check=True).stdout
        subprocess.run(["tar", "x", "-C", self.root], input=archive, check=True)
        (self.objects / "tests.h").write_text(PRECOMPILED)
        subprocess.run([*COMPILE, "-x", "c++-header", self.objects / "tests.h"], check=True)
        self.library = [path.relative_to(self.root) for room in ("SharedDependencies", "ZULMetaData")
                        for path in sorted((self.root / room).rglob("*.cpp"))]
        self.library += [pathlib.Path("Tests/Support/Files.cpp"), pathlib.Path("Tests/Support/MemoryWatch.cpp")]
        tests = self.root / "Tests/ZULMetaData"
        self.tests = {name: next(tests.rglob(f"{name}Test.cpp")).relative_to(self.root)
                      for name in sorted({name for names in COVERED_BY.values() for name in names})}
        self.needs = {}

    def compile(self, file, target, overlay=None, timeout=300):
        """True where it compiles. `overlay` holds the file that is changed."""
        includes = [f"-I{overlay}"] if overlay else []
        path = overlay / file if overlay and (overlay / file).exists() else self.root / file
        done = check.run([*COMPILE, *includes, f"-I{self.root}", "-include", self.objects / "tests.h",
                          "-MD", "-c", path, "-o", target], timeout=timeout)
        return done.returncode == 0

    def build(self):
        with concurrent.futures.ThreadPoolExecutor(WORKERS) as pool:
            files = [*self.library, *self.tests.values()]
            for file, compiled in zip(files, pool.map(lambda file: self.compile(file, self.object(file)), files)):
                if not compiled:
                    raise RuntimeError(f"{file} does not compile")
                made_of = self.object(file).with_suffix(".d").read_text()
                self.needs[file] = set(re.findall(re.escape(str(self.root)) + r"/(\S+)", made_of))

    def object(self, file):
        return self.objects / (str(file).replace("/", ".") + ".o")


class Worker:
    """Compiles and tests one mutant after the other in a folder of its own."""

    def __init__(self, tree):
        self.tree = tree
        self.folder = pathlib.Path(tempfile.mkdtemp(dir=tree.objects.parent))
        self.overlay = self.folder / "overlay"
        (self.overlay / "ZULMetaData").mkdir(parents=True)

    def object(self, file, changed):
        """The object of a file, compiled anew where the changed file is part of it; None where it cannot be."""
        if changed not in self.tree.needs[file]:
            return self.tree.object(file)
        target = self.folder / self.tree.object(file).name
        if target not in self.made:
            if not self.tree.compile(file, target, self.overlay):
                return None
            self.made.add(target)
        return target

    def is_killed(self, name, library, changed):
        """By one test program; None where it does not compile or link."""
        test = self.object(self.tree.tests[name], changed)
        program = self.folder / "program"
        if not test or check.run(["g++", test, *library, "-o", program, *LINK], timeout=300).returncode != 0:
            return None
        try:
            done = check.run([program, "--gtest_fail_fast", "--gtest_brief=1"], timeout=SECONDS_PER_TEST,
                             cwd=self.folder, environment={"TMPDIR": str(self.folder)})
        except subprocess.TimeoutExpired:
            return True
        return done.returncode != 0

    def judge(self, mutant):
        """Whether a test notices; None where the mutant does not compile."""
        self.made = set()
        changed = str(next((self.tree.root / "ZULMetaData").rglob(mutant.file)).relative_to(self.tree.root))
        source = (self.tree.root / changed).read_text()
        (self.overlay / changed).parent.mkdir(parents=True, exist_ok=True)
        (self.overlay / changed).write_text(mutants.apply(mutant, source))
        try:
            library = [self.object(file, changed) for file in self.tree.library]
            if None in library:
                return None
            for name in COVERED_BY[mutant.file]:
                killed = self.is_killed(name, library, changed)
                if killed is not False:
                    return killed
            return False
        finally:
            (self.overlay / changed).unlink()


def lot(mutant):
    """Draws mutants so that a change of one source leaves those of the others drawn."""
    return hashlib.sha256(f"{SEED} {mutant.file} {mutant.before} {mutant.after}".encode()).digest()


def all_mutants(tree):
    found = []
    for file in sorted((tree.root / "ZULMetaData").rglob("*.*")):
        if file.suffix in (".h", ".cpp"):
            found += mutants.mutants(file.name, file.read_text())
    if unknown := {mutant.file for mutant in found} - set(COVERED_BY):
        raise RuntimeError(f"no tests are named for {', '.join(sorted(unknown))}")
    return sorted(found, key=lot)


def check_tests(tree):
    """The tests must hold where nothing is changed, or every mutant would count as killed."""
    worker = Worker(tree)
    worker.made = set()
    library = [tree.object(file) for file in tree.library]
    return [name for name in tree.tests if worker.is_killed(name, library, "") is not False]


def judge_all(tree, wanted, candidates, journal):
    """Pairs of mutant and whether it was killed, of those that compile. The journal shows them as they come."""
    workers = [Worker(tree) for _ in range(WORKERS)]
    candidates = iter(candidates)
    judged = []

    def work(worker):
        for mutant in iter(functools.partial(next, candidates, None), None):
            if len(judged) >= wanted:
                return
            killed = worker.judge(mutant)
            if killed is not None and len(judged) < wanted:
                judged.append((mutant, killed))
                print("killed" if killed else "LIVES", mutant, file=journal, flush=True)

    with concurrent.futures.ThreadPoolExecutor(WORKERS) as pool:
        list(pool.map(work, workers))
    return judged


def run(context, wanted=WANTED):
    result = check.Result()
    tree = Tree(context.source, context.folder)
    candidates = all_mutants(tree)
    tree.build()
    if failing := check_tests(tree):
        result.failures.append(f"without a change these tests fail: {', '.join(failing)}")
        return result
    with open(context.build / "mutants.log", "w", encoding="utf-8") as journal:
        judged = judge_all(tree, wanted, candidates, journal)
    living = [mutant for mutant, killed in judged if not killed]
    result.cases = len(judged)
    result.notes = [f"{len(judged) - len(living)} of {len(judged)} mutants were killed; the others:",
                    *map(str, sorted(living, key=lambda mutant: (mutant.file, mutant.line)))]
    if len(judged) < wanted or len(living) > len(judged) * (1 - ENOUGH):
        result.failures.append(result.notes[0])
    return result
