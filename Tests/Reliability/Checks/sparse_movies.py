"""Repairs, reads and extends movies around and far above 4 GiB, of which hardly anything is stored or read."""

import os
import struct
import subprocess

import check
import recordings

GIB = 1 << 30
LENGTHS = (4 * GIB - 1, 4 * GIB, 4 * GIB + 1, 5 * GIB, 64 * GIB)  # of the media atom that was never closed
MOST_READ = 1 << 20                                               # bytes, metadata included, which is small here
WIDE = recordings.atom(b"wide")
OPEN = struct.pack(">I", 0) + b"mdat"


def run_counted(context, result, *arguments):
    """Runs a program to its end and counts what it reads, by the system's own book."""
    with subprocess.Popen([os.fspath(argument) for argument in arguments], stdout=subprocess.PIPE,
                          stderr=subprocess.PIPE) as process:
        output, errors = process.stdout.read(), process.stderr.read()
        os.waitid(os.P_PID, process.pid, os.WEXITED | os.WNOWAIT)
        with open(f"/proc/{process.pid}/io", encoding="ascii") as book:
            read = int(book.readline().split()[1])
    result.crashed += process.returncode < 0
    if read >= MOST_READ:
        result.failures.append(f"{' '.join(map(str, arguments[:2]))} reads {read} bytes of {arguments[-1]}")
    return process.returncode, output.decode(), errors.decode()


class Movie:
    """One length, with or without the spare atom in front of the open media."""

    def __init__(self, context, result, length, has_spare, stream):
        self.context, self.result, self.length, self.has_spare, self.stream = context, result, length, has_spare, stream
        self.file = context.folder / f"{length}{'-wide' if has_spare else ''}.mp4"
        self.head = recordings.FILE_TYPE + (WIDE if has_spare else b"")
        self.start = len(self.head)
        self.entries = len(recordings.entry_ends(stream.read_bytes())) - 1

    def make(self):
        with open(self.file, "wb") as movie:
            movie.write(self.head + OPEN)
            movie.truncate(self.start + self.length)
        self.result.cases += 1

    def expect(self, what, found, expected):
        if found != expected:
            self.result.failures.append(f"{self.file.name}: {what}: {found!r}, not {expected!r}")

    def bytes_at_head(self):
        with open(self.file, "rb") as movie:
            return movie.read(self.start + len(OPEN))

    def library(self, *arguments):
        code, output, _ = run_counted(self.context, self.result, self.context.program("large_movies"), arguments[0],
                                      self.file, *arguments[1:])
        self.expect("the program's end", code, 0)
        return output.strip()

    def tool(self, *arguments):
        return run_counted(self.context, self.result, self.context.zulm, *arguments)

    def closed_head(self, length_with_spare):
        """The head once the media has its size; unchanged where that has no place."""
        if self.length < 4 * GIB:
            return self.head + struct.pack(">I", self.length) + b"mdat"
        if self.has_spare:
            return recordings.FILE_TYPE + recordings.sized_atom(b"mdat", length_with_spare)
        return self.head + OPEN

    def check_format(self):
        """The repair of the format: of 4 GiB and more it keeps the length without the spare atom, 8 bytes less."""
        self.make()
        can_repair = self.length < 4 * GIB or self.has_spare
        self.expect("the repair gives", self.library("repair"), str(int(can_repair)))
        self.expect("its bytes", self.bytes_at_head(), self.closed_head(self.length))
        self.make()
        self.library("attach", self.stream)  # which repairs first
        self.expect("entries read", self.library("read"), str(self.entries if self.length < 4 * GIB else 0))

    def check_safe(self):
        self.make()
        size = self.file.stat().st_size
        can_repair = self.length < 4 * GIB or self.has_spare
        code, _, errors = self.tool("repair", "--in-place", self.file)
        self.expect("zulm repair ends with", (code, bool(errors)), (0, False) if can_repair else (1, True))
        self.expect("its bytes", self.bytes_at_head(), self.closed_head(self.length + len(WIDE)))
        self.expect("its size", self.file.stat().st_size, size)
        self.make()
        code, _, _ = self.tool("attach", "--in-place", self.file, self.stream)
        self.expect("zulm attach ends with", code, 0 if can_repair else 1)
        if not can_repair:
            self.expect("a refused movie", (self.bytes_at_head(), self.file.stat().st_size), (self.head + OPEN, size))
            return
        self.expect("entries read", self.library("read"), str(self.entries))
        self.expect("zulm verify ends with", self.tool("verify", self.file)[0], 0)
        self.expect("zulm atoms ends with", self.tool("atoms", self.file)[0], 0)
        self.expect("zulm info ends with", self.tool("info", self.file)[0], 0)

    def check_left_short(self):
        """What the repair of the format left 8 bytes short is made whole by the safe one."""
        if self.length < 4 * GIB or not self.has_spare:
            return
        self.make()
        self.library("repair")
        self.expect("zulm attach ends with", self.tool("attach", "--in-place", self.file, self.stream)[0], 0)
        self.expect("its bytes", self.bytes_at_head(), self.closed_head(self.length + len(WIDE)))
        self.expect("entries read", self.library("read"), str(self.entries))


def run(context):
    result = check.Result()
    stream = context.folder / "cursorLocation.dat"
    stream.write_bytes(recordings.shortened(recordings.demo_streams(context)["cursorLocation"], 4096))
    for has_spare in (False, True):
        head = len(recordings.FILE_TYPE + (WIDE if has_spare else b""))
        for length in (*LENGTHS, *(length - head for length in LENGTHS[:3])):  # and so long is the whole movie
            movie = Movie(context, result, length, has_spare, stream)
            movie.check_format()
            movie.check_safe()
            movie.check_left_short()
            movie.file.unlink()
    return result
