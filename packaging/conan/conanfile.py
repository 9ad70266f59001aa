"""Builds and packs the libraries: conan create packaging/conan"""

import os
import re

from conan import ConanFile
from conan.errors import ConanInvalidConfiguration
from conan.tools.build import check_min_cppstd
from conan.tools.cmake import CMake, CMakeDeps, CMakeToolchain, cmake_layout
from conan.tools.files import copy, load, rmdir

required_conan_version = ">=2.0"

FOLDERS = ("cmake", "SharedDependencies", "ZULMetaData", "Platform", "ZULMetaDataBridge", "ZULMetaDataSession")


class ZULMetaDataConan(ConanFile):
    name = "zulmetadata"
    description = "Metadata of screen recordings"
    topics = ("screen-recording", "metadata", "mp4", "quicktime", "riff")
    package_type = "library"
    settings = "os", "arch", "compiler", "build_type"
    options = {"shared": [True, False], "fPIC": [True, False], "bridge": [True, False], "image_codecs": [True, False]}
    default_options = {"shared": False, "fPIC": True, "bridge": True, "image_codecs": True}
    implements = ["auto_shared_fpic"]

    @property
    def _root(self):
        return os.path.join(self.recipe_folder, "..", "..")

    @property
    def _needs_codecs(self):
        return self.options.bridge and self.options.image_codecs

    def set_version(self):
        project = load(self, os.path.join(self._root, "CMakeLists.txt"))
        self.version = re.search(r"project\(ZULMetaData VERSION ([0-9.]+)", project).group(1)

    def export_sources(self):
        for pattern in ("CMakeLists.txt", *(f"{folder}/*" for folder in FOLDERS)):
            copy(self, pattern, src=self._root, dst=self.export_sources_folder)

    def validate(self):
        check_min_cppstd(self, 20)
        if self.settings.os not in ("Linux", "Macos"):
            raise ConanInvalidConfiguration(f"{self.name} is for Linux and macOS")

    def layout(self):
        cmake_layout(self)

    def requirements(self):
        if self._needs_codecs:
            self.requires("libpng/[>=1.6 <2]")
            self.requires("libtiff/[>=4.5 <5]")

    def build_requirements(self):
        self.tool_requires("cmake/[>=3.25]")

    def generate(self):
        CMakeDeps(self).generate()
        toolchain = CMakeToolchain(self)
        toolchain.cache_variables["ZULMETADATA_BUILD_TESTS"] = False
        toolchain.cache_variables["ZULMETADATA_BUILD_TOOLS"] = False
        toolchain.cache_variables["ZULMETADATA_BUILD_BRIDGE"] = bool(self.options.bridge)
        toolchain.cache_variables["ZULMETADATA_IMAGE_CODECS"] = bool(self.options.image_codecs)
        toolchain.cache_variables["ZULMETADATA_WARNINGS_AS_ERRORS"] = False
        toolchain.generate()

    def build(self):
        cmake = CMake(self)
        cmake.configure()
        cmake.build()

    def package(self):
        CMake(self).install()
        rmdir(self, os.path.join(self.package_folder, "lib", "cmake"))
        rmdir(self, os.path.join(self.package_folder, "lib", "pkgconfig"))

    def package_info(self):
        self.cpp_info.set_property("cmake_file_name", "ZULMetaData")
        core = self.cpp_info.components["core"]
        core.libs = ["ZULMetaData"]
        core.set_property("cmake_target_name", "ZULMetaData::Core")
        core.set_property("cmake_target_aliases", ["ZULMetaData::ZULMetaData"])
        core.set_property("pkg_config_name", "zulmetadata-core")
        if not self.options.shared:
            core.defines = ["ZULMETADATA_STATIC"]
        if not self.options.bridge:
            return
        bridge = self.cpp_info.components["bridge"]
        bridge.libs = ["ZULMetaDataBridge"]
        bridge.requires = ["core"]
        bridge.set_property("cmake_target_name", "ZULMetaData::Bridge")
        bridge.set_property("pkg_config_name", "zulmetadata-bridge")
        if self._needs_codecs:
            bridge.requires += ["libpng::libpng", "libtiff::libtiff"]
        session = self.cpp_info.components["session"]
        session.libs = ["ZULMetaDataSession"]
        session.requires = ["bridge"]
        session.set_property("cmake_target_name", "ZULMetaData::Session")
        session.set_property("pkg_config_name", "zulmetadata-session")
