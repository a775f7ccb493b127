# Untested: a draft, for Conan 2. From the top folder: conan create packaging/conan
"""The recipe of the library. The Python package is not part of it."""

import os

from conan import ConanFile
from conan.errors import ConanInvalidConfiguration
from conan.tools.build import check_min_cppstd
from conan.tools.cmake import CMake, CMakeToolchain, cmake_layout
from conan.tools.files import copy, rmdir


class GridmillConan(ConanFile):
    name = "gridmill"
    version = "0.1.0"
    description = "Raster image operators for remote sensing, exact to the bit"
    license = "Apache-2.0"
    topics = ("remote sensing", "raster", "terrain analysis")
    package_type = "shared-library"
    settings = "os", "arch", "compiler", "build_type"
    options = {"isa": ["auto", "x86-64", "x86-64-v3", "x86-64-v4"]}
    default_options = {"isa": "auto"}

    def validate(self):
        if self.settings.os != "Linux":
            raise ConanInvalidConfiguration("gridmill is for Linux")
        check_min_cppstd(self, 20)

    def export_sources(self):
        top = os.path.join(self.recipe_folder, os.pardir, os.pardir)
        for pattern in ("CMakeLists.txt", "LICENSE", "cmake/*", "basic/*", "processes/*"):
            copy(self, pattern, src=top, dst=self.export_sources_folder)

    def layout(self):
        cmake_layout(self)

    def generate(self):
        toolchain = CMakeToolchain(self)
        toolchain.cache_variables["GRIDMILL_BUILD_TESTS"] = False
        toolchain.cache_variables["GRIDMILL_ISA"] = str(self.options.isa)
        toolchain.generate()

    def build(self):
        cmake = CMake(self)
        cmake.configure()
        cmake.build()

    def package(self):
        copy(self, "LICENSE", src=self.source_folder, dst=os.path.join(self.package_folder, "licenses"))
        CMake(self).install()
        # Conan writes its own.
        rmdir(self, os.path.join(self.package_folder, "lib", "cmake"))
        rmdir(self, os.path.join(self.package_folder, "lib", "pkgconfig"))

    def package_info(self):
        self.cpp_info.set_property("cmake_file_name", "gridmill")
        self.cpp_info.set_property("cmake_target_name", "gridmill::gridmill")
        self.cpp_info.set_property("pkg_config_name", "gridmill")
        self.cpp_info.libs = ["gridmill"]
        self.cpp_info.includedirs = [os.path.join("include", "gridmill")]
