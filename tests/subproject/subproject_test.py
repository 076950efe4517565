"""Builds the library as a subproject of another project, as add_subdirectory makes it.

subproject_test.py CMAKE GENERATOR COMPILER SOURCE_DIR BUILD_DIR

The other project's warnings are errors, among them some that this one has; its debug information
names the sources relative to the checkout, so that it is the same everywhere.
"""
import pathlib
import re
import shutil
import sys
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).parents[1] / "Support"))
# pylint: disable=wrong-import-position
from programs import run

CMAKE, GENERATOR, COMPILER, SOURCE, BUILD = sys.argv[1:6]
PROJECT = """\
cmake_minimum_required(VERSION 3.22)
project(parent LANGUAGES CXX)
add_subdirectory("{source}" "${{CMAKE_BINARY_DIR}}/engine")
add_executable(program main.cpp)
target_link_libraries(program PRIVATE QV_Localize::QV_Localize)
if(NOT QV_Localize_PYFILE)
  message(FATAL_ERROR "no pinyin table")
endif()
file(WRITE "${{CMAKE_BINARY_DIR}}/pyfile" "${{QV_Localize_PYFILE}}")
"""
FLAGS = f"-Wall -Wextra -Weffc++ -Wold-style-cast -Werror -g -ffile-prefix-map={SOURCE}=."


class SubprojectTest(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        cls.build = pathlib.Path(BUILD, "build")
        cls.parent = pathlib.Path(BUILD, "parent")
        cls.parent.mkdir(parents=True, exist_ok=True)
        (cls.parent / "CMakeLists.txt").write_text(PROJECT.format(source=SOURCE), encoding="utf-8")
        shutil.copy(pathlib.Path(__file__).with_name("main.cpp"), cls.parent)

    def configure(self, *options):
        run(CMAKE, "--fresh", "-G", GENERATOR, "-S", self.parent, "-B", self.build,
            f"-DCMAKE_CXX_COMPILER={COMPILER}", f"-DCMAKE_CXX_FLAGS={FLAGS}",
            "-DCMAKE_BUILD_TYPE=Release", *options)

    def has_target(self, name):
        targets = run(CMAKE, "--build", self.build, "--target", "help")
        return re.search(rf"\b{name}(:|\s)", targets) is not None

    def test_program_with_the_library(self):
        self.configure()
        for target in ("test_platform", "qv_bench", "qvlocalize"):
            self.assertFalse(self.has_target(target), target)
        run(CMAKE, "--build", self.build, "--target", "program")
        run(self.build / "program")
        table = pathlib.Path((self.build / "pyfile").read_text(encoding="utf-8"))
        self.assertEqual(709412, table.stat().st_size)
        own = {"CMakeCache.txt", "CMakeFiles", "cmake_install.cmake", "engine", "program", "pyfile"}
        others = {path.name for path in self.build.iterdir()} - own
        self.assertFalse([name for name in others if "ninja" not in name and name != "Makefile"])

    def test_tests_only_where_asked_for(self):
        self.configure("-DQV_BUILD_TESTS=ON", "-DBUILD_TESTING=OFF")
        self.assertFalse(self.has_target("test_platform"))
        self.configure("-DQV_BUILD_TESTS=ON")
        run(CMAKE, "--build", self.build, "--target", "test_platform")
        tests = pathlib.Path(CMAKE).with_name("ctest")
        run(tests, "--test-dir", self.build / "engine", "-R", "^Platform/", "--no-tests=error")


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1], verbosity=2)
