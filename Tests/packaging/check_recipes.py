"""Holds the recipes for Conan and vcpkg against the project that they build. Usage: check_recipes.py PROJECT"""

import ast
import json
import re
import sys
from pathlib import Path

project = Path(sys.argv[1])
failures = []


def expect(holds, sentence):
    if not holds:
        failures.append(sentence)


def text_of(path):
    return (project / path).read_text(encoding="utf-8")


def value_of(tree, name):
    """What a recipe assigns to a name of its module."""
    values = [node.value for node in tree.body if isinstance(node, ast.Assign) and node.targets[0].id == name]
    return ast.literal_eval(values[0])


build = text_of("CMakeLists.txt") + "".join(text_of(path) for path in project.glob("*/CMakeLists.txt"))
version = re.search(r"project\(ZULMetaData VERSION ([0-9.]+)", build).group(1)

manifest = json.loads(text_of("packaging/vcpkg/zulmetadata/vcpkg.json"))
port = text_of("packaging/vcpkg/zulmetadata/portfile.cmake")
expect(manifest["version"] == version, f"vcpkg.json says {manifest['version']}, the project {version}")
asked = re.findall(r"^    ([a-z-]+) ZULMETADATA_", port, re.MULTILINE)
expect(sorted(asked) == sorted(manifest["features"]), f"the port knows the features {asked}, its manifest other ones")

recipe = text_of("packaging/conan/conanfile.py")
for folder in value_of(ast.parse(recipe), "FOLDERS"):
    expect((project / folder).is_dir(), f"conanfile.py exports {folder}, which is not there")
ast.parse(text_of("packaging/conan/test_package/conanfile.py"))

consumer = project / "packaging/conan/test_package"
consumers = re.search(r"set\(consumers (.+)\)", text_of(consumer / "CMakeLists.txt")).group(1)
for source in re.findall(r"\$\{consumers\}/([\w/.]+)", text_of(consumer / "CMakeLists.txt")):
    expect((consumer / consumers / source).is_file(), f"the test package builds {source}, which is not there")

for option in sorted(set(re.findall(r"ZULMETADATA_(?:BUILD|WARNINGS|IMAGE|INSTALL)\w*", recipe + port))):
    expect(option in build, f"the recipes set {option}, which the project does not know")

if failures:
    sys.exit("\n".join(failures))
