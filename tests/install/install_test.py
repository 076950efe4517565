"""Installs the build into a temporary prefix and uses it as others would: every installed header
alone, and the C++ program of docs/embedding.md built with CMake and with pkg-config.

install_test.py ARGUMENT..., as installed.py tells
"""
import os
import pathlib
import re
import sys
import unittest

from installed import (BUILD, COMPILER, EMULATOR, SOURCE, WARNINGS, InstalledTest, run,
                       run_built)

STANDARD = "-std=c++17"
CONSUMER = """\
cmake_minimum_required(VERSION 3.22)
project(consumer LANGUAGES CXX)
find_package(QV_Localize 1.0 REQUIRED)
if(NOT EXISTS "${QV_Localize_PYFILE}")
  message(FATAL_ERROR "no pinyin table at ${QV_Localize_PYFILE}")
endif()
add_executable(consumer main.cpp)
target_link_libraries(consumer PRIVATE QV_Localize::QV_Localize)
"""


class InstallTest(InstalledTest):
    def test_headers_stand_alone(self):
        include = self.prefix / "include/QV_Localize"
        headers = sorted(path.relative_to(include) for path in include.rglob("*.h"))
        self.assertGreater(len(headers), 30)
        for header in headers:
            with self.subTest(header=header):
                source = self.root / "alone.cpp"
                source.write_text(f"#include <{header}>\n#include <{header}>\n", encoding="utf-8")
                run(COMPILER, STANDARD, *WARNINGS, "-fsyntax-only", "-I", include, source)

    def test_no_header_of_the_interface_is_left_out(self):
        include = self.prefix / "include/QV_Localize"
        exporting = [path.relative_to(SOURCE) for path in pathlib.Path(SOURCE).glob("[A-Z]*/*.h")
                     if re.search(r'QV_EXPORT |visibility\("default"\)',
                                  path.read_text(encoding="utf-8"))]
        self.assertGreater(len(exporting), 30)
        missing = [str(header) for header in exporting if not (include / header).is_file()]
        self.assertEqual([], missing, "to be listed in cmake/QVInstall.cmake")

    def test_program_built_with_cmake(self):
        program = self.build_with_cmake("cpp", CONSUMER, [])
        self.check_program(program, self.sample("data_cmake"))

    def test_program_built_with_pkg_config(self):
        program = self.build_with_pkg_config("cpp", "QV_Localize", COMPILER, [STANDARD])
        self.check_program(program, self.sample("data_pkg_config"))

    def test_manual_page_names_every_command_and_option(self):
        page, = self.installed("share/man/man1/qvlocalize.1")
        manual = page.read_text(encoding="utf-8").replace("\\-", "-")
        tool, = self.installed("bin/qvlocalize")
        summary = run_built(tool, "--help")
        commands = re.findall(r"^  ([a-z]+) +[A-Z]", summary.split("Subcommands:")[1], re.MULTILINE)
        self.assertIn("search", commands)
        for command in commands:
            self.assertRegex(manual, rf"(?m)^\.SS {command}\b")
            for option in re.findall(r"--[a-z-]+", run_built(tool, command, "--help")):
                self.assertRegex(manual, rf"{option}(?![a-z-])", f"{command} {option}")

    def test_completions_come_along(self):
        for name in ("bash-completion/completions/qvlocalize", "zsh/site-functions/_qvlocalize"):
            completion, = self.installed(f"share/{name}")
            self.assertIn("_qvlocalize()", completion.read_text(encoding="utf-8"))

    def test_no_installed_file_tells_where_it_was_built(self):
        places = [os.path.realpath(place).encode() for place in (BUILD, SOURCE)]
        for path in self.installed("**/*"):
            if path.is_file():
                content = path.read_bytes()
                self.assertFalse([place for place in places if place in content], path)

    def test_one_version_and_the_plain_name_of_the_library(self):
        changes = pathlib.Path(SOURCE, "CHANGELOG.md").read_text(encoding="utf-8")
        version = re.search(r"^## (\d+\.\d+\.\d+)", changes, re.MULTILINE).group(1)
        tool, = self.installed("bin/qvlocalize")
        self.assertEqual(f"qvlocalize {version}\n", run_built(tool, "--version"))
        library, = self.installed("lib*/**/libQV_Localize.so")
        self.assertEqual(f"libQV_Localize.so.{version}", library.resolve().name)
        if not EMULATOR:
            load = "import ctypes; ctypes.CDLL('libQV_Localize.so')"
            run(sys.executable, "-c", load, env={"LD_LIBRARY_PATH": str(library.parent)})

    def test_licence_and_notices_come_along(self):
        for name in ("LICENSE", "NOTICE"):
            installed, = self.installed(f"share/doc/QV_Localize/{name}")
            self.assertEqual(pathlib.Path(SOURCE, name).read_bytes(), installed.read_bytes())


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1], verbosity=2)
