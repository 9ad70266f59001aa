"""Programs whose system calls fail: how they are run, and a small recording for them to work on."""

import dataclasses
import os
import pathlib
import signal
import subprocess

from check import run
from recordings import atom, demo_streams, extended_atom, shortened

KINDS = ("cursorLocation", "keyboardAction", "slideTitles")
TYPE = atom(b"ftyp", b"mp42")
MEDIA = b"pictures and sound"
OPEN_MOVIE = TYPE + atom(b"mdat", MEDIA).replace((8 + len(MEDIA)).to_bytes(4, "big"), bytes(4), 1)
WHOLE_MOVIE = TYPE + atom(b"mdat", MEDIA)
SIZE_FIELD = slice(len(TYPE), len(TYPE) + 4)  # of the media, which a repair of OPEN_MOVIE writes


@dataclasses.dataclass
class Fault:
    """What happens at the `at`th call that it can happen to, and at every `again`th one behind it; 0 is never."""

    kind: str
    at: int = 0
    again: int = 0

    def environment(self, context, report=None):
        return {"LD_PRELOAD": os.fspath(context.program("FaultShim.so")), "FAULT": self.kind,
                "FAULT_AT": str(self.at), "FAULT_AGAIN": str(self.again), "FAULT_REPORT": os.fspath(report or "")}

    def __str__(self):
        return f"{self.kind} at call {self.at}" + (f" and every {self.again}. behind it" if self.again else "")


def run_with(context, fault, arguments, folder=None):
    """Runs a program in a folder. None where it hangs."""
    try:
        return run(arguments, timeout=20, environment=fault.environment(context), cwd=folder)
    except subprocess.TimeoutExpired:
        return None


def count_calls(context, kind, arguments, folder=None):
    """The calls that a kind of fault can happen to."""
    report = context.folder / "calls"
    run(arguments, environment=Fault(kind).environment(context, report), cwd=folder)
    return int(report.read_text())


def is_crash(result):
    return result is None or result.returncode < 0 or result.returncode > 4


def was_killed(result):
    return result is not None and result.returncode == -signal.SIGKILL


def small_streams(context):
    """Some entries of a few kinds, fixed and varying in size."""
    streams = demo_streams(context)
    return {kind: shortened(streams[kind], 200) for kind in KINDS}


def recording(streams):
    """A movie that holds them."""
    return WHOLE_MOVIE + extended_atom(b"ZULM", b"".join(extended_atom(b"DATA", stream) for stream in streams.values()))


def write_files(folder, files):
    """A new folder with these files in it."""
    folder.mkdir(parents=True)
    for name, contents in files.items():
        (folder / name).write_bytes(contents)


def files_in(folder):
    return {os.fspath(path.relative_to(folder)): path.read_bytes()
            for path in sorted(pathlib.Path(folder).rglob("*")) if path.is_file()}
