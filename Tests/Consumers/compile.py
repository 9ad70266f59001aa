"""Compiles what an application might write, and looks at what the compiler says or reads.

    compile.py refused SOURCE SENTENCE COMPILER...    SOURCE does not compile: there is one error, with SENTENCE in it
    compile.py cost HEADER LINES COMPILER...          HEADER and all that it includes are at most LINES lines long

COMPILER is the compiler's path, followed by its options. `cost` also prints the best of three times for HEADER.
"""

import os
import re
import resource
import subprocess
import sys

LONGEST_COMPLAINT = 12  # lines, with those that show the application's source


def run(command, source):
    return subprocess.run([*command, "-x", "c++", "-"], input=source, capture_output=True, text=True,
                          env=os.environ | {"LC_ALL": "C.UTF-8"})


def refused(source, sentence, command):
    with open(source, encoding="utf-8") as file:
        compiled = run([*command, "-fsyntax-only"], file.read())
    print(compiled.stderr, end="")
    errors = re.findall(r"^.*\berror: .*$", compiled.stderr, re.MULTILINE)
    lines = compiled.stderr.count("\n")
    if compiled.returncode == 0:
        sys.exit("it compiles")
    if len(errors) != 1 or sentence not in errors[0] or lines > LONGEST_COMPLAINT:
        sys.exit(f"{len(errors)} errors in {lines} lines; expected one, with: {sentence}")


def seconds_to_compile(command, source):
    before = resource.getrusage(resource.RUSAGE_CHILDREN)
    if run([*command, "-fsyntax-only"], source).returncode != 0:
        sys.exit("it does not compile")
    after = resource.getrusage(resource.RUSAGE_CHILDREN)
    return after.ru_utime + after.ru_stime - before.ru_utime - before.ru_stime


def cost(header, most, command):
    source = f'#include "{header}"\n'
    lines = run([*command, "-E"], source).stdout.count("\n")
    seconds = min(seconds_to_compile(command, source) for _ in range(3))
    print(f"{header}: {lines} lines after preprocessing, {seconds:.2f} s of processor time to check")
    if not 0 < lines <= most:
        sys.exit(f"more than {most} lines")


def main():
    if len(sys.argv) < 5 or sys.argv[1] not in ("refused", "cost"):
        sys.exit(__doc__)
    what, subject, bound, *command = sys.argv[1:]
    if what == "refused":
        refused(subject, bound, command)
    else:
        cost(subject, int(bound), command)


main()
