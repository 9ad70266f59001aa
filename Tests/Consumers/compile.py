"""Compiles what an application might write, and looks at what the compiler says or reads.

    compile.py refused SOURCE SENTENCE COMPILER...    SOURCE does not compile: there is one error, with SENTENCE in it
    compile.py cost HEADER SHARE COMPILER...          HEADER and all that it includes are not much longer than the
                                                      standard headers that the library's signatures need

COMPILER is the compiler's path, followed by its options. SHARE is how much of those standard headers' length is allowed
on top of it, in percent; below 0, how much shorter HEADER must be. `cost` prints the best of three times as well.
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


# std::filesystem::path, std::ofstream&, std::list<std::string> and so on stand in signatures that programs rely on.
NEEDED = ("filesystem", "fstream", "list", "map", "memory", "optional", "span", "string", "variant", "vector")


def measured(what, source, command):
    lines = run([*command, "-E"], source).stdout.count("\n")
    seconds = min(seconds_to_compile(command, source) for _ in range(3))
    print(f"{what}: {lines} lines after preprocessing, {seconds:.2f} s of processor time")
    return lines


def cost(header, share, command):
    needed = measured("standard headers in signatures", "".join(f"#include <{name}>\n" for name in NEEDED), command)
    lines = measured(header, f'#include "{header}"\n', command)
    if not 0 < lines <= needed * (100 + share) / 100:
        sys.exit(f"{header} is {lines / needed * 100 - 100:+.0f} % longer, and {share:+} % is allowed")


def main():
    if len(sys.argv) < 5 or sys.argv[1] not in ("refused", "cost"):
        sys.exit(__doc__)
    what, subject, bound, *command = sys.argv[1:]
    if what == "refused":
        refused(subject, bound, command)
    else:
        cost(subject, int(bound), command)


main()
