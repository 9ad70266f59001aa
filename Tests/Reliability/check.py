"""What the checks of this folder share: a scratch folder, the built programs, and how results are counted."""

import dataclasses
import os
import pathlib
import subprocess


@dataclasses.dataclass
class Result:
    """What one check found. It holds where nothing was lost, nothing crashed and nothing failed."""

    cases: int = 0
    lost: int = 0     # cases in which something was lost that had to be kept
    crashed: int = 0  # cases that crashed, hung or made a sanitizer report
    failures: list[str] = dataclasses.field(default_factory=list)  # one sentence for each case that did not hold
    notes: list[str] = dataclasses.field(default_factory=list)     # what a reader should know though the check holds

    def holds(self):
        return self.cases > 0 and not (self.lost or self.crashed or self.failures)


@dataclasses.dataclass
class Context:
    """What a check gets. `full` asks for the long form; `folder` is empty, its own, and removed behind it."""

    full: bool
    build: pathlib.Path   # of the release preset
    folder: pathlib.Path
    source: pathlib.Path  # the repository

    @property
    def zulm(self):
        return self.build / "Tools/zulm/zulm"

    def program(self, name):
        """A program of Tests/Reliability/Programs, built with the release preset."""
        return self.build / "Tests/Reliability" / name


def run(arguments, timeout=60, environment=None, **options):
    """Runs a program to its end; subprocess.TimeoutExpired where it hangs. A negative returncode is a signal."""
    return subprocess.run([os.fspath(argument) for argument in arguments], capture_output=True, timeout=timeout,
                          env={**os.environ, **(environment or {})}, check=False, **options)
