"""Builds programs of Tests/Consumers against the package, and runs those that its options allow"""

import os

from conan import ConanFile
from conan.tools.build import can_run
from conan.tools.cmake import CMake, cmake_layout


class ZULMetaDataTest(ConanFile):
    settings = "os", "arch", "compiler", "build_type"
    generators = "CMakeDeps", "CMakeToolchain"

    def requirements(self):
        self.requires(self.tested_reference_str)

    def build_requirements(self):
        self.tool_requires("cmake/[>=3.25]")

    def layout(self):
        cmake_layout(self)

    def build(self):
        cmake = CMake(self)
        cmake.configure()
        cmake.build()

    def test(self):
        if not can_run(self):
            return
        options = self.dependencies["zulmetadata"].options
        programs = ["player"] + (["application"] if options.bridge and options.image_codecs else [])
        for program in programs:
            self.run(os.path.join(self.cpp.build.bindir, program), env="conanrun")
