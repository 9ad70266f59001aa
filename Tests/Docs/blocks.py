"""Compiles and runs the blocks of code in a page, for the tests.

The word after the opening fence says whether a block is C++, shell, Python or JSON. If a block of the language `text`
follows immediately, it is what the block must print. C++ without a `main` becomes the body of a function, after its includes.

    blocks.py cpp PAGE OUTPUT    writes a program that runs the block at the line that is its argument
    blocks.py cmake PAGE PREFIX COMPILER    builds a program with each block of CMake and the library in PREFIX
    blocks.py run PAGE PROGRAM ZULM PYTHONPATH VIEWER DUCKDB    runs every block in its own folder of recordings. Skips
        Python if PYTHONPATH is empty, `zulm view` if VIEWER is 0, and Parquet if DUCKDB, the folder of Node's modules,
        is empty. Blocks for Node are those that ask for DuckDB; other JavaScript is for browsers, and is not run

A block of JSON is a document that `zulm render` reads; it is skipped if the renderer was not built.
"""

import json
import os
import pathlib
import re
import shutil
import subprocess
import sys
import tempfile

FENCE = re.compile(r"^```(\w*)\n(.*?)^```$", re.MULTILINE | re.DOTALL)
ROOT = pathlib.Path(__file__).resolve().parents[2]
TESTED = ("cpp", "sh", "python", "json")
OTHERS = ("text", "cmake", "js")
# The option of `zulm render` that reads a document of a schema.
READ_BY_RENDERER = {"zulm.style": "--style", "zulm.zooms": "--zoom", "zulm.redactions": "--redact"}
# 1 means that a file could not be read, 2 wrong usage. The other exit codes say what was found.
FINE = (0, 3, 4)


class Block:
    def __init__(self, language, code, line):
        self.language = language
        self.code = code
        self.line = line
        self.printed = None


def is_for_node(block):
    return block.language == "js" and "@duckdb" in block.code


def blocks_of(page):
    text = page.read_text(encoding="utf-8")
    blocks = []
    end_of_last = -1
    for found in FENCE.finditer(text):
        block = Block(found[1], found[2], text.count("\n", 0, found.start()) + 1)
        if block.language == "text" and blocks and text[end_of_last:found.start()].strip() == "":
            blocks[-1].printed = block.code
        elif block.language in TESTED or is_for_node(block):
            blocks.append(block)
        elif block.language not in OTHERS and page.name != "tool.md":  # its lines of usage are not commands
            sys.exit(f"{page}:{block.line}: this block names no known language")
        end_of_last = found.end()
    return blocks


def cpp_source(page):
    """Turns each block, with or without a `main`, into a function."""
    includes = ['#include "ZULMetaDataBridge/ZULMetaDataBridge.h"', '#include "ZULMetaDataSession/ZULMetaDataSession.h"',
                "#include <filesystem>", "#include <fstream>",
                "#include <iostream>", "#include <memory>", "#include <string>", "#include <vector>"]
    bodies, calls = [], []
    for block in blocks_of(page):
        if block.language != "cpp":
            continue
        includes += re.findall(r"^#include .*$", block.code, re.MULTILINE)
        code = re.sub(r"^(#include .*|using namespace ZULMetaData;)\n", "", block.code, flags=re.MULTILINE)
        name = f"blockAtLine{block.line}"
        if "int main() {" in code:
            code = code.replace("int main() {", f"void {name}() {{")
        else:
            code = f"void {name}() {{\n{code}}}\n"
        bodies.append(f'#line {block.line} "{page.name}"\n{code}')
        calls.append(f"    if (block == {block.line})\n        {name}();\n")
    return "\n".join([*dict.fromkeys(includes), "using namespace ZULMetaData;", "namespace {", *bodies, "}",
                      "int main(int, char** arguments) {", "    const int block = std::atoi(arguments[1]);", *calls, "}"])


def build_by_cmake(page, prefix, compiler):
    """Builds a program that uses the headers with each block."""
    built = 0
    for found in re.finditer(r"^```cmake\n(.*?)^```$", page.read_text(encoding="utf-8"), re.MULTILINE | re.DOTALL):
        (target,) = re.findall(r"target_link_libraries\((\w+)", found[1])
        with tempfile.TemporaryDirectory() as folder:
            folder = pathlib.Path(folder)
            (folder / "main.cpp").write_text('#include "ZULMetaDataBridge/ZULMetaDataBridge.h"\n'
                                             'int main() { return ZULMetaData::validateRecording("a.dat").isDamaged(); }\n')
            (folder / "CMakeLists.txt").write_text(f"cmake_minimum_required(VERSION 3.25)\nproject({target} CXX)\n"
                                                   f"add_executable({target} main.cpp)\n{found[1]}")
            subprocess.run(["cmake", "-S", folder, "-B", folder / "build", f"-DCMAKE_PREFIX_PATH={prefix}",
                            f"-DCMAKE_CXX_COMPILER={compiler}"], check=True, stdout=subprocess.DEVNULL)
            subprocess.run(["cmake", "--build", folder / "build"], check=True, stdout=subprocess.DEVNULL)
        built += 1
    print(f"{built} built")
    return 0 if built else 1


def make_recordings(folder, zulm):
    """Makes the files that the blocks name: the demo's recording and streams, a movie without metadata, a damaged one."""
    subprocess.run([zulm, "demo", "demo"], check=True, cwd=folder, stdout=subprocess.DEVNULL)
    recording = (folder / "demo" / "Recording.mp4").read_bytes()
    metadata = recording.index(b"ZULM") - 4
    for name in ("Recording", "Original", "Edited", "Talk"):
        (folder / f"{name}.mp4").write_bytes(recording)
    for name in ("Movie", "Remuxed", "Copy", "Cut"):
        (folder / f"{name}.mp4").write_bytes(recording[:metadata])
    (folder / "Broken.mp4").write_bytes(recording[:-100])
    for stream in (folder / "demo" / "streams").iterdir():
        shutil.copy(stream, folder / stream.name)
    shutil.rmtree(folder / "demo")
    (folder / "Project.llc").write_text('{"version": 2, "cutSegments": [{"start": 1, "end": 3}]}\n')
    (folder / "private").mkdir()
    (folder / "Recordings").mkdir()
    shutil.copy(folder / "Recording.mp4", folder / "Recordings")


def shell_lines(code):
    """Yields one command for each line."""
    for line in code.splitlines():
        command = line.split("#")[0].strip() if "'" not in line else line.strip()
        if command:
            yield command


def run_shell(block, folder, environment, has_viewer):
    printed = ""
    for command in shell_lines(block.code):
        script = command.split()[0]
        run_elsewhere = r"scripts/|cmake |ctest |zulm (record|cut|render|guide) "
        if re.match(run_elsewhere, command) or re.search(r"\b(pip|venv)\b", command):
            if script.startswith("scripts/") and not os.access(ROOT / script, os.X_OK):
                return f"{script} is not a script", printed
            continue
        if "zulm view" in command and not has_viewer or "parquet" in command and not environment["NODE_PATH"]:
            continue
        for output in re.findall(r"-o (\S+)", command):
            shutil.rmtree(folder / output, ignore_errors=True)
            (folder / output).unlink(missing_ok=True)
        ended = subprocess.run(["bash", "-o", "pipefail", "-c", command], cwd=folder, env=environment,
                               capture_output=True, text=True, timeout=120)
        printed += ended.stdout
        if ended.returncode not in FINE:
            return f"`{command}` ended with {ended.returncode}: {ended.stderr}", printed
    return None, printed


def run_json(block, folder, environment):
    (folder / "block.json").write_text(block.code, encoding="utf-8")
    option = READ_BY_RENDERER[json.loads(block.code)["schema"]]
    return run_program(["zulm", "render", "--quiet", "Talk.mp4", "--frames", "stills", "--at", "1", option, "block.json"],
                       folder, environment)


def run_program(command, folder, environment):
    ended = subprocess.run(command, cwd=folder, env=environment, capture_output=True, text=True, timeout=120)
    complaint = f"ended with {ended.returncode}: {ended.stderr}" if ended.returncode or ended.stderr else None
    return complaint, ended.stdout


def run(page, program, zulm, python_path, viewer, duckdb):
    has_viewer = viewer == "1"
    environment = os.environ | {"PATH": f"{pathlib.Path(zulm).parent}:{os.environ['PATH']}", "PYTHONPATH": python_path,
                                "NODE_PATH": duckdb, "LC_ALL": "C.UTF-8"}
    failures = ran = 0
    for block in blocks_of(page):
        if block.language == "python" and not python_path or is_for_node(block) and not duckdb:
            continue
        if block.language == "json" and not (pathlib.Path(zulm).parents[1] / "render/zulm-render").exists():
            continue
        with tempfile.TemporaryDirectory() as folder:
            folder = pathlib.Path(folder)
            make_recordings(folder, zulm)
            if block.language == "cpp":
                complaint, printed = run_program([program, str(block.line)], folder, environment)
            elif block.language == "python":
                complaint, printed = run_program(["/usr/bin/python3", "-c", block.code], folder, environment)
            elif block.language == "js":
                complaint, printed = run_program(["node", "-e", block.code], folder, environment)
            elif block.language == "json":
                complaint, printed = run_json(block, folder, environment)
            else:
                complaint, printed = run_shell(block, folder, environment, has_viewer)
        if complaint is None and block.printed is not None and printed != block.printed:
            complaint = f"printed:\n{printed}"
        if complaint is not None:
            print(f"{page.name}:{block.line}: {complaint}")
            failures += 1
        ran += 1
    print(f"{ran} blocks, {failures} of them wrong")
    return 1 if failures or ran == 0 else 0


def main():
    command, page, *rest = sys.argv[1:]
    if command == "run":
        sys.exit(run(pathlib.Path(page), *rest))
    if command == "cmake":
        sys.exit(build_by_cmake(pathlib.Path(page), *rest))
    source = cpp_source(pathlib.Path(page))
    output = pathlib.Path(rest[0])
    if not output.exists() or output.read_text(encoding="utf-8") != source:
        output.write_text(source, encoding="utf-8")


main()
