"""Runs the checks of this folder and prints one table. Started by scripts/reliability.sh, which builds first."""

import argparse
import concurrent.futures
import importlib
import json
import pathlib
import subprocess
import sys
import tempfile
import time
import traceback

from check import Context, Result

SOURCE = pathlib.Path(__file__).resolve().parents[2]

# Module in Checks/ and the name in the table, in the table's order.
CHECKS = {
    "kill_recorder": "recorder killed at random moments",
    "screen_kills": "screen recorder killed at random moments, and on full disks",
    "screen_passwords": "passwords that the screen recorder must not have",
    "screen_sync": "picture of the screen recorder against its entries",
    "screen_cost": "processor and memory that the screen recorder takes",
    "kill_system_calls": "attach, repair and stamp killed at every system call",
    "io_faults": "ENOSPC, EIO, EINTR and short transfers at every operation",
    "full_disk": "a real full disk at every fill level",
    "odd_files": "limits, permissions, FIFOs, devices, links and odd names",
    "allocation_failures": "allocation failure at every allocation",
    "truncations": "recordings cut at every byte",
    "bit_flips": "every bit flipped",
    "hostile_sizes": "hostile numbers in every size field",
    "sparse_movies": "movies around and far above 4 GiB",
    "fuzzing": "fuzzing of every input",
    "differential": "atom walks against other programs",
    "random_edits": "random edits against an oracle",
    "valgrind": "the test suite under valgrind",
    "threads": "readers and writers on many threads",
    "mutation": "mutants of the stream core killed by the tests",
}
FULL_ONLY = {"mutation"}
# They measure times of pictures, which other checks beside them would change.
ALONE = ["screen_kills", "screen_passwords", "screen_sync", "screen_cost"]
MOST_SHOWN = 50  # failures of one check
LONGEST = ["fuzzing", "mutation", "valgrind", "truncations", "bit_flips"]  # started first


def execute(name, arguments):
    started = time.monotonic()
    with tempfile.TemporaryDirectory(prefix="zulm-reliability-") as folder:
        context = Context(arguments.extent == "full", arguments.build, pathlib.Path(folder), SOURCE)
        try:
            result = importlib.import_module(f"Checks.{name}").run(context)
        except Exception:  # a check that breaks is a check that fails; the others go on
            result = Result(failures=[traceback.format_exc()])
    return name, result, time.monotonic() - started


def row(name, result, seconds):
    holds = "" if result.holds() else " **fails**"
    return f"| {CHECKS[name]}{holds} | {result.cases:,} | {result.lost:,} | {result.crashed:,} | {seconds:.0f} s |"


def table(rows):
    """`rows` by the names of their checks."""
    head = ["| test | cases | lost | crashed | time |", "|---|---:|---:|---:|---:|"]
    return "\n".join(head + [rows[name] for name in CHECKS if name in rows])


def remember(arguments, rows):
    """Gives the rows of all checks that have run in this form, in this build folder; each as its last run printed it."""
    file = arguments.build / f"reliability-{arguments.extent}.json"
    earlier = json.loads(file.read_text(encoding="utf-8")) if file.exists() else {}
    file.write_text(json.dumps(earlier | rows, indent=1), encoding="utf-8")
    return earlier | rows


def tell(name, result, seconds):
    print(f"{name}: {'holds' if result.holds() else 'FAILS'} ({result.cases} cases, {seconds:.0f} s)", file=sys.stderr,
          flush=True)
    for line in result.notes + result.failures[:MOST_SHOWN]:
        print(f"    {line}", file=sys.stderr)


def document(text):
    subprocess.run([sys.executable, SOURCE / "scripts/put_table.py", SOURCE / "Docs/reliability.md"], input=text,
                   encoding="utf-8", check=True)


def main():
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("extent", nargs="?", choices=("quick", "full"), default="quick")
    parser.add_argument("only", nargs="*", help="run these checks alone: " + ", ".join(CHECKS))
    parser.add_argument("--build", type=lambda path: pathlib.Path(path).resolve(), required=True)
    parser.add_argument("--document", action="store_true", help="put the table into Docs/reliability.md")
    arguments = parser.parse_args()
    if unknown := set(arguments.only) - set(CHECKS):
        parser.error("no check is called " + ", ".join(sorted(unknown)))

    names = arguments.only or [name for name in CHECKS if arguments.extent == "full" or name not in FULL_ONLY]
    order = [name for name in LONGEST if name in names] + [name for name in names if name not in LONGEST]
    outcomes = {}
    for workers, some in ((1, [name for name in ALONE if name in names]),
                          (2, [name for name in order if name not in ALONE])):
        with concurrent.futures.ProcessPoolExecutor(workers) as pool:
            for done in concurrent.futures.as_completed([pool.submit(execute, name, arguments) for name in some]):
                name, result, seconds = done.result()
                outcomes[name] = (name, result, seconds)
                tell(name, result, seconds)

    rows = {name: row(*outcome) for name, outcome in outcomes.items()}
    print(table(rows))
    all_rows = remember(arguments, rows)
    if arguments.document:
        document(f"This is what the last `{arguments.extent}` run of each check printed.\n\n{table(all_rows)}")
    return 0 if all(result.holds() for _, result, _ in outcomes.values()) else 1


if __name__ == "__main__":
    sys.exit(main())
