"""Readers, writers and appends on 27 threads at once, under the thread sanitizer."""

import re

import check
from check import Result

ROUNDS = {False: 100, True: 2000}


def run_program(context):
    folder = context.folder / "threads"
    folder.mkdir()
    return check.run([context.program("threads"), folder, str(ROUNDS[context.full])], timeout=1200,
                     environment={"TSAN_OPTIONS": "halt_on_error=0 exitcode=66"})


def check_results(done, result):
    """Every stream that was read, recorded or appended is a case."""
    counts = re.search(r"(\d+) right, (\d+) wrong", done.stdout.decode())
    if not counts:
        result.failures.append(f"the program ended with {done.returncode}: {done.stderr.decode()[-2000:]}")
        return
    right, wrong = map(int, counts.groups())
    result.cases += right + wrong
    result.lost += wrong


def run(context):
    result = Result()
    done = run_program(context)
    reports = re.findall(r"WARNING: ThreadSanitizer: .*", done.stderr.decode())
    result.crashed += len(reports)
    result.failures += reports
    check_results(done, result)
    if done.returncode != 0 and not reports and not result.lost:
        result.failures.append(f"the program ended with {done.returncode}")
    return result
