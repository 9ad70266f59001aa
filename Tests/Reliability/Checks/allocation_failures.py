"""Lets every allocation fail, of the library's operations and of the tool's commands: one alone, then all behind it."""

import concurrent.futures
import dataclasses
import os
import pathlib
import re
import shutil

import check
import recordings
from datasets import has_temporary_files, problem_between
from faults import files_in, write_files
from recordings import fast_folder

WORKERS = 2
BATCH = 100  # runs of the tool whose files are there at a time
FAILED = 1  # the tool's exit code
SLACK = 300  # allocations that --version itself needs at most, behind those that all commands begin with
OUT_OF_MEMORY = re.compile(rb"out of memory|Cannot allocate memory")


def check_library(context, result):
    folder = context.folder / "library"
    folder.mkdir()
    done = check.run([context.program("allocation_failures"), folder], timeout=1200)
    result.failures += done.stderr.decode(errors="replace").splitlines()
    result.cases += sum(map(int, re.findall(rb": (\d+) cases", done.stdout)))
    result.crashed += done.returncode < 0
    if done.returncode != 0 and not result.failures:
        result.failures.append(f"allocation_failures ended with {done.returncode}")


@dataclasses.dataclass
class Command:
    """A run of the tool: what it is given, in a folder of its own, and what it does with all the memory there is."""

    words: list[str]
    files: dict[str, bytes]
    code: int = 0
    output: bytes = b""
    left: dict[str, bytes] = dataclasses.field(default_factory=dict)  # files in the folder behind it
    allocations: int = 0
    makes_data_set: bool = False

    def name(self):
        return "zulm " + " ".join(self.words)


@dataclasses.dataclass
class Ended:
    """A run of the tool: how it ended, and what it left."""

    code: int  # negative where a signal ended it
    output: bytes
    errors: bytes
    left: dict[str, bytes]
    after: dict[str, bytes] | None = None  # files in the folder after the same run with all the memory there is


class Tool:
    """Runs a command in folders of its own."""

    def __init__(self, context, folder, command):
        self.program = context.zulm
        self.shim = context.program("AllocationShim.so")
        self.folder = folder
        self.command = command

    def run(self, environment):
        return check.run([self.program, *self.command.words], cwd=self.folder, stdin=check.subprocess.DEVNULL,
                         environment={"LD_PRELOAD": str(self.shim)} | environment)

    def ended_in(self, place, status):
        """Returns how a run ended there, and runs an export once more."""
        ended = Ended(os.waitstatus_to_exitcode(status), (place / "output").read_bytes(),
                      (place / "errors").read_bytes(), files_in(place / "files"))
        if self.command.makes_data_set:
            again = check.run([self.program, *self.command.words], cwd=place / "files")
            ended.after = files_in(place / "files") if again.returncode == 0 else None
        return ended

    def measure(self):
        """Fills in what the command does with all the memory there is."""
        write_files(self.folder, self.command.files)
        done = self.run({"ALLOCATION_COUNT": str(self.folder.with_suffix(".count"))})
        self.command.code, self.command.output = done.returncode, done.stdout
        self.command.left = files_in(self.folder)
        self.command.allocations = int(self.folder.with_suffix(".count").read_text())

    def fail(self, numbers, all_behind):
        """Gives, of each number, how the run ended whose allocation of this number failed."""
        shutil.rmtree(self.folder)
        for number in numbers:
            write_files(self.folder / str(number) / "files", self.command.files)
        done = self.run({"ALLOCATION_FIRST": str(numbers[0]), "ALLOCATION_LAST": str(numbers[-1]),
                         "ALLOCATION_STEP": str(numbers.step), "ALLOCATIONS_BEHIND": str(int(all_behind))})
        for line in done.stdout.splitlines():
            number, status = map(int, line.split())
            yield number, self.ended_in(self.folder / str(number), status)


def commands(context):
    streams = recordings.shortened_all(recordings.demo_streams(context), 1500)
    movie = recordings.movie(list(streams.values()))
    bare = recordings.FILE_TYPE + b"\0\0\0\0mdat" + recordings.MEDIA  # open-ended
    recorded = {"r.mp4": movie}
    location, keys = streams["cursorLocation"], streams["keyboardAction"]
    attached = {"m.mp4": bare, "a.dat": location, "b.dat": keys}
    torn = {"r.mp4": recordings.FILE_TYPE + recordings.metadata_atom([location, keys + b"torn"])}
    return [
        Command(["info", "r.mp4"], recorded),
        Command(["info", "--json", "r.mp4"], recorded),
        Command(["atoms", "r.mp4"], recorded),
        Command(["dump", "--format", "ndjson", "r.mp4"], recorded),
        Command(["verify", "--json", "r.mp4"], torn),
        Command(["diff", "r.mp4", "t.mp4"], {"r.mp4": movie, "t.mp4": torn["r.mp4"]}),
        Command(["grep", "-i", "e", "r.mp4"], recorded),
        Command(["state", "r.mp4", "--at", "1,2", "--json"], recorded),
        Command(["insights", "r.mp4", "--json"], recorded),
        Command(["retime", "r.mp4", "--movie", "m.mp4", "--keep", "1-4", "--keep", "2-3@3/2", "-o", "o.mp4"],
                recorded | {"m.mp4": bare}),
        Command(["extract", "r.mp4", "-o", "out"], recorded),
        Command(["salvage", "r.mp4", "-o", "out"], torn),
        Command(["redact", "r.mp4", "--keys", "-o", "o.mp4"], recorded),
        Command(["convert", "r.mp4", "--to", "srt", "--show-keys", "-o", "o.srt"], recorded),
        Command(["attach", "m.mp4", "a.dat", "b.dat", "-o", "o.mp4"], attached),
        Command(["attach", "m.mp4", "a.dat", "b.dat", "--in-place"], attached),
        Command(["repair", "--in-place", "m.mp4"], {"m.mp4": bare}),
        Command(["view", "r.mp4", "-o", "o.html", "--page", "p.html"], recorded | {"p.html": b"<head></head>"}),
        Command(["stamp", "--in-place", "m.mp4", "--creator", "C", "--creator-version", "1"], {"m.mp4": bare}),
        Command(["export", "--format", "ndjson", "a.dat", "b.dat", "-o", "out"], {"a.dat": location, "b.dat": keys},
                makes_data_set=True),
    ]


def complaint(command, ended):
    """What is wrong about a run in which an allocation failed; None where it is as it should be."""
    error = ended.errors.decode(errors="replace").strip()
    if ended.code < 0:
        return f"was ended by signal {-ended.code}: {error}"
    if command.makes_data_set and (wrong := problem_between(ended.left, ended.after, command.left)):
        return wrong
    if command.makes_data_set and has_temporary_files(ended.after):
        return "left a temporary file"
    left = command.left if command.makes_data_set else ended.left  # the times in the manifest are others in each run
    if (ended.code, ended.output, left) == (command.code, command.output, command.left):
        return None  # there was another way
    if ended.code != FAILED:
        return f"ended with {ended.code} and a wrong result: {error}"
    if not OUT_OF_MEMORY.search(ended.errors):
        return f"ended with 1, but said {error!r}"
    wrong = {name for name, contents in left.items() if contents not in (command.files.get(name), command.left.get(name))}
    wrong |= {name for name in command.files if name not in left}
    return f"left {', '.join(sorted(wrong))} as nothing that it should be" if wrong else None


def check_command(folder, context, command, first):
    """Of a command the allocations from `first` on; in front of it all commands do the same."""
    result = check.Result()
    tool = Tool(context, folder / re.sub(r"\W+", "-", command.name()), command)
    tool.measure()
    for all_behind in (False, True):
        before = result.cases
        numbers = range(first, command.allocations + 1, 4 if all_behind and not context.full else 1)
        for start in range(0, len(numbers), BATCH):
            for number, ended in tool.fail(numbers[start:start + BATCH], all_behind):
                result.cases += 1
                result.crashed += ended.code < 0
                if wrong := complaint(command, ended):
                    behind = " and all behind it" if all_behind else ""
                    result.failures.append(f"{command.name()}, allocation {number}{behind}: {wrong}")
        if result.cases - before != len(numbers):
            result.failures.append(f"{command.name()}: ran {result.cases - before} of {len(numbers)} times")
    return result


def allocations_of_the_command_line(folder, context):
    """What every command begins with: the making of the command line, which --version does and no more."""
    command = Command(["--version"], {})
    Tool(context, folder / "version", command).measure()
    return command.allocations


def run_tool(context, result):
    with fast_folder() as name, concurrent.futures.ThreadPoolExecutor(WORKERS) as pool:
        folder = pathlib.Path(name)
        common = allocations_of_the_command_line(folder, context)
        jobs = [(Command(["--version"], {}), 1)]
        jobs += [(command, 1 if context.full else common - SLACK) for command in commands(context)]
        for part in pool.map(lambda job: check_command(folder, context, *job), jobs):
            result.cases += part.cases
            result.crashed += part.crashed
            result.failures += part.failures


def run(context):
    result = check.Result()
    check_library(context, result)
    run_tool(context, result)
    return result
