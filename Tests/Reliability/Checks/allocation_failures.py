"""Lets every allocation fail, of the library's operations and of the tool's commands: one alone, then all behind it."""

import concurrent.futures
import dataclasses
import re

import check
import recordings

WORKERS = 2
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

    def name(self):
        return "zulm " + " ".join(self.words)


class Tool:
    def __init__(self, context, folder):
        self.zulm = context.zulm
        self.shim = context.program("AllocationShim.so")
        self.folder = folder
        self.count = folder.with_suffix(".count")

    def run(self, command, number, all_behind):
        """Fills the folder anew, and gives what the tool did and what it left there."""
        self.empty()
        for name, contents in command.files.items():
            (self.folder / name).write_bytes(contents)
        done = check.run([self.zulm, *command.words], cwd=self.folder, stdin=check.subprocess.DEVNULL, environment={
            "LD_PRELOAD": str(self.shim), "ALLOCATION_FAILS": str(number),
            "ALLOCATION_FAILS_BEHIND": str(int(all_behind)), "ALLOCATION_COUNT": str(self.count)})
        return done, self.contents()

    def contents(self):
        files = (path for path in sorted(self.folder.rglob("*")) if path.is_file())
        return {str(path.relative_to(self.folder)): path.read_bytes() for path in files}

    def empty(self):
        for path in sorted(self.folder.rglob("*"), reverse=True):
            path.rmdir() if path.is_dir() else path.unlink()

    def measure(self, command):
        done, command.left = self.run(command, 0, False)
        command.code, command.output = done.returncode, done.stdout
        command.allocations = int(self.count.read_text())


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
        Command(["extract", "r.mp4", "-o", "out"], recorded),
        Command(["salvage", "r.mp4", "-o", "out"], torn),
        Command(["redact", "r.mp4", "--keys", "-o", "o.mp4"], recorded),
        Command(["convert", "r.mp4", "--to", "srt", "--show-keys", "-o", "o.srt"], recorded),
        Command(["attach", "m.mp4", "a.dat", "b.dat", "-o", "o.mp4"], attached),
        Command(["attach", "m.mp4", "a.dat", "b.dat", "--in-place"], attached),
        Command(["repair", "--in-place", "m.mp4"], {"m.mp4": bare}),
        Command(["stamp", "--in-place", "m.mp4", "--creator", "C", "--creator-version", "1"], {"m.mp4": bare}),
    ]


def complaint(command, done, left):
    """What is wrong about a run in which an allocation failed; None where it is as it should be."""
    error = done.stderr.decode(errors="replace").strip()
    if done.returncode < 0:
        return f"was ended by signal {-done.returncode}: {error}"
    if done.returncode == command.code and done.stdout == command.output and left == command.left:
        return None  # there was another way
    if done.returncode != FAILED:
        return f"ended with {done.returncode} and a wrong result: {error}"
    if not OUT_OF_MEMORY.search(done.stderr):
        return f"ended with 1, but said {error!r}"
    wrong = {name for name, contents in left.items() if contents not in (command.files.get(name), command.left.get(name))}
    wrong |= {name for name in command.files if name not in left}
    return f"left {', '.join(sorted(wrong))} as nothing that it should be" if wrong else None


def check_command(context, command, first, result):
    """Of a command the allocations from `first` on; in front of it all commands do the same."""
    folder = context.folder / re.sub(r"\W+", "-", command.name())
    folder.mkdir()
    tool = Tool(context, folder)
    tool.measure(command)
    for all_behind in (False, True):
        for number in range(first, command.allocations + 1):
            done, left = tool.run(command, number, all_behind)
            result.cases += 1
            result.crashed += done.returncode < 0
            if wrong := complaint(command, done, left):
                behind = " and all behind it" if all_behind else ""
                result.failures.append(f"{command.name()}, allocation {number}{behind}: {wrong}")
    return result


def allocations_of_the_command_line(context):
    """What every command begins with: the making of the command line, which --version does and no more."""
    folder = context.folder / "version"
    folder.mkdir()
    command = Command(["--version"], {})
    Tool(context, folder).measure(command)
    return command.allocations


def run(context):
    result = check.Result()
    common = allocations_of_the_command_line(context)
    jobs = [(Command(["--version"], {}), 1)]
    jobs += [(command, 1 if context.full else common - SLACK) for command in commands(context)]
    with concurrent.futures.ThreadPoolExecutor(WORKERS) as pool:
        library = pool.submit(check_library, context, result)
        for part in pool.map(lambda job: check_command(context, *job, check.Result()), jobs):
            result.cases += part.cases
            result.crashed += part.crashed
            result.failures += part.failures
        library.result()
    return result
