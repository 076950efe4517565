"""Installs the build into a temporary prefix and uses it as others would: every installed header
alone, and the program of docs/embedding.md built with CMake and with pkg-config.

install_test.py CMAKE GENERATOR BUILD_DIR SOURCE_DIR COMPILER [TOOLCHAIN EMULATOR LIBRARIES]

The last three belong to a build for another processor: its toolchain file, the command that runs
its programs, and where the libraries lie that ours needs.
"""
import os
import pathlib
import re
import shlex
import subprocess
import sys
import tempfile
import unittest

CMAKE, GENERATOR, BUILD, SOURCE, COMPILER = sys.argv[1:6]
TOOLCHAIN, EMULATOR, LIBRARIES = sys.argv[6:] or ("", "", "")
LINK_SEARCH = [f"-Wl,-rpath-link,{LIBRARIES}"] if LIBRARIES else []
WARNINGS = ["-std=c++17", "-Wall", "-Wextra", "-Wpedantic", "-Wshadow", "-Wconversion", "-Werror",
            "-Wno-psabi"]
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


def run(*command, **options):
    process = subprocess.run([str(word) for word in command], capture_output=True,
                             encoding="utf-8", check=False, **options)
    assert process.returncode == 0, f"{command}\n{process.stdout}{process.stderr}"
    return process.stdout


def run_built(program, *arguments, **options):
    emulator = shlex.split(EMULATOR)
    if emulator:
        emulator += ["-E", f"LD_LIBRARY_PATH={LIBRARIES}"]
    return run(*emulator, program, *arguments, **options)


def program_of_the_docs():
    text = pathlib.Path(SOURCE, "docs/embedding.md").read_text(encoding="utf-8")
    return re.search(r"```cpp\n(.*?)```", text, re.DOTALL).group(1)


class InstallTest(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        directory = tempfile.TemporaryDirectory(prefix="qv_install_")
        cls.addClassCleanup(directory.cleanup)
        cls.root = pathlib.Path(directory.name)
        cls.prefix = cls.root / "prefix"
        run(CMAKE, "--install", BUILD, "--prefix", cls.prefix)
        (cls.root / "main.cpp").write_text(program_of_the_docs(), encoding="utf-8")

    def installed(self, pattern):
        found = sorted(self.prefix.glob(pattern))
        self.assertTrue(found, f"nothing installed as {pattern}")
        return found

    def sample(self, name):
        """A data directory with sample contacts, made by the installed tool."""
        data = self.root / name
        tool, = self.installed("bin/qvlocalize")
        run_built(tool, "sample", "--data-dir", data)
        table, = self.installed("share/QV_Localize/pyfile.bin")
        self.assertEqual(table.read_bytes(), (data / "files/pyfile.bin").read_bytes())
        return data

    def check_program(self, program, data, **options):
        output = run_built(program, data, **options)
        totals = [int(total) for total in re.findall(r": (\d+) matches", output)]
        self.assertEqual(2, len(totals), output)
        self.assertGreater(totals[0], totals[1])
        self.assertGreater(totals[1], 0)
        self.assertEqual(6, output.count("  contact "), output)

    def test_headers_stand_alone(self):
        include = self.prefix / "include/QV_Localize"
        headers = sorted(path.relative_to(include) for path in include.rglob("*.h"))
        self.assertGreater(len(headers), 30)
        for header in headers:
            with self.subTest(header=header):
                source = self.root / "alone.cpp"
                source.write_text(f"#include <{header}>\n#include <{header}>\n", encoding="utf-8")
                run(COMPILER, *WARNINGS, "-fsyntax-only", "-I", include, source)

    def test_program_built_with_cmake(self):
        project = self.root / "consumer"
        project.mkdir()
        (project / "CMakeLists.txt").write_text(CONSUMER, encoding="utf-8")
        (project / "main.cpp").write_text(program_of_the_docs(), encoding="utf-8")
        cross = [f"-DCMAKE_TOOLCHAIN_FILE={TOOLCHAIN}"] if TOOLCHAIN else []
        run(CMAKE, "-G", GENERATOR, "-S", project, "-B", project / "build",
            f"-DCMAKE_CXX_COMPILER={COMPILER}",
            f"-DCMAKE_CXX_FLAGS={' '.join(WARNINGS[1:] + LINK_SEARCH)}",
            f"-DQV_Localize_DIR={self.installed('**/QV_LocalizeConfig.cmake')[0].parent}", *cross)
        run(CMAKE, "--build", project / "build")
        self.check_program(project / "build/consumer", self.sample("data_cmake"))

    def test_program_built_with_pkg_config(self):
        environment = dict(os.environ)
        environment["PKG_CONFIG_PATH"] = str(self.installed("**/pkgconfig")[0])
        flags = run("pkg-config", "--cflags", "--libs", "QV_Localize", env=environment).split()
        program = self.root / "with_pkg_config"
        library, = self.installed("lib*/**/libQV_Localize.so")
        run(COMPILER, *WARNINGS, self.root / "main.cpp", "-o", program, *flags,
            f"-Wl,-rpath,{library.parent}", *LINK_SEARCH)
        self.check_program(program, self.sample("data_pkg_config"))
        table = run("pkg-config", "--variable=pyfile", "QV_Localize", env=environment).strip()
        self.assertTrue(pathlib.Path(table).is_file(), table)

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

    def test_licence_and_notices_come_along(self):
        for name in ("LICENSE", "NOTICE"):
            installed, = self.installed(f"share/doc/QV_Localize/{name}")
            self.assertEqual(pathlib.Path(SOURCE, name).read_bytes(), installed.read_bytes())


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1], verbosity=2)
