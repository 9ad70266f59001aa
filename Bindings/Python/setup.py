"""Builds the package's core by the project's own CMake, the libraries inside it.

What is compiled stays in build/python of the project, or where ZULMETADATA_PYTHON_BUILD says.
"""

import os
import pathlib
import re
import subprocess
import sys

import pybind11
from setuptools import Extension, setup
from setuptools.command.build_ext import build_ext

HERE = pathlib.Path(__file__).resolve().parent
PROJECT = HERE.parent.parent
BUILD = pathlib.Path(os.environ.get("ZULMETADATA_PYTHON_BUILD", PROJECT / "build/python")).resolve()


class BuildByCMake(build_ext):
    def build_extension(self, extension):
        place = pathlib.Path(self.get_ext_fullpath(extension.name)).resolve()
        build = BUILD / "cmake"
        subprocess.run(
            ["cmake", "-S", PROJECT, "-B", build, "-DCMAKE_BUILD_TYPE=Release", "-DBUILD_SHARED_LIBS=OFF",
             "-DCMAKE_UNITY_BUILD=ON",
             "-DZULMETADATA_BUILD_PYTHON=ON", f"-DPython_EXECUTABLE={sys.executable}",
             f"-Dpybind11_DIR={pybind11.get_cmake_dir()}", "-DZULMETADATA_BUILD_TESTS=OFF",
             "-DZULMETADATA_BUILD_TOOLS=OFF", "-DZULMETADATA_INSTALL=OFF"],
            check=True)
        subprocess.run(
            ["cmake", "--build", build, "--target", "zulmetadata_python", "--parallel", str(os.cpu_count() or 1)],
            check=True)
        place.parent.mkdir(parents=True, exist_ok=True)
        built = build / "Bindings/Python/package/zulmetadata" / place.name
        self.copy_file(str(built), str(place))


BUILD.mkdir(parents=True, exist_ok=True)
setup(
    options={"build": {"build_base": str(BUILD)}, "egg_info": {"egg_base": str(BUILD)}},
    version=re.search(r"project\(ZULMetaData VERSION ([0-9.]+)", (PROJECT / "CMakeLists.txt").read_text()).group(1),
    ext_modules=[Extension("zulmetadata._core", [])],
    cmdclass={"build_ext": BuildByCMake},
)
