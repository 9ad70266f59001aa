"""Small changes to a C++ source, of which each should make a test fail."""

import dataclasses
import re

SWAPS = {
    " < ": [" <= "], " <= ": [" < "], " > ": [" >= "], " >= ": [" > "], " == ": [" != "], " != ": [" == "],
    " + ": [" - "], " - ": [" + "], " * ": [" / "], " / ": [" * "], " % ": [" * "],
    " += ": [" -= "], " -= ": [" += "], " && ": [" || "], " || ": [" && "], " | ": [" & "], " & ": [" | "],
    "++": ["--"], "return true;": ["return false;"], "return false;": ["return true;"],
}
SWAP = re.compile("|".join(re.escape(text) for text in SWAPS))
NUMBER = re.compile(r"(?<![\w.'\"])(\d+)(?![\w.'\"])")
CONDITION = re.compile(r"\b(if|while) \((?!const auto|auto|const std|char\*|const MetaDataKind)(.*)\)( \{)?$")
STATEMENT = re.compile(r"^\s+(?!return|throw|using|case|default|const |auto |static|break|continue|else|for |if |while )"
                       r"(\w[\w.:\->\[\]*<>]*\(.*\)|\*?[\w.\->\[\]()]+ [-+|&]?= .*|(\+\+|--)\w+);$")
# What no test could notice: the values that a source's variables have in front of a read, and the sizes of buffers.
BEGINNING = re.compile(r"^\s+std::u?int\d+_t \w+ = 0;")
BUFFER_SIZE = re.compile(r"constexpr std::size_t s_(copySize|\w*[bB]ufferSize|windowSize|\w+Block) = ")
IGNORED = re.compile(r"^\s*(#|//|///|template|static_assert|using|namespace|friend|\}|\{\"|class |struct |enum )|operator"
                     r"|constexpr uuid|kindUUID\(0x|std::cout|std::cerr|reserve\(")


@dataclasses.dataclass(frozen=True)
class Mutant:
    file: str
    line: int  # from 1 on
    kind: str
    before: str
    after: str

    def __str__(self):
        return f"{self.file}:{self.line}: {self.kind}: {self.before.strip()}  =>  {self.after.strip()}"


def code_of(line):
    """The line without its comment, and with the characters of texts made unrecognisable; as long as before."""
    blank = re.sub(r'"(\\.|[^"\\])*"|\'(\\.|[^\'\\])+\'', lambda text: "\"" + "\0" * (len(text[0]) - 2) + "\"", line)
    return blank.split("//")[0].rstrip()


def swaps(code, line):
    for found in SWAP.finditer(code):
        for other in SWAPS[found[0]]:
            yield "operator" if "return" not in found[0] else "result", \
                line[:found.start()] + other + line[found.end():]


def numbers(code, line):
    for found in NUMBER.finditer(code):
        yield "number", line[:found.start()] + str(int(found[0]) + 1) + line[found.end():]


def conditions(code, line):
    if found := CONDITION.search(code):
        condition = line[found.start(2):found.end(2)]
        if condition.count("(") == condition.count(")"):
            yield "negation", line[:found.start(2)] + "!(" + condition + ")" + line[found.end(2):]


def statements(code, line):
    if STATEMENT.match(code):
        yield "removal", re.match(r"\s*", line)[0] + ";"


def is_neutral(file, code):
    return bool(BUFFER_SIZE.search(code)) or file.endswith(".cpp") and bool(BEGINNING.search(code))


def mutants(file, source):
    """All of them, in the order of the source's lines."""
    for number, line in enumerate(source.splitlines(), 1):
        code = code_of(line)
        if not code or IGNORED.search(code) or is_neutral(file, code):
            continue
        for make in (swaps, numbers, conditions, statements):
            for kind, changed in make(code, line):
                yield Mutant(file, number, kind, line, changed)


def apply(mutant, source):
    lines = source.splitlines()
    assert lines[mutant.line - 1] == mutant.before
    lines[mutant.line - 1] = mutant.after
    return "\n".join(lines) + "\n"
