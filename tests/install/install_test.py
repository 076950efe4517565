"""Installs the build into a temporary prefix and uses it as others would: every installed header
alone, and the programs of docs/embedding.md built with CMake and with pkg-config.

install_test.py TestClass CMAKE GENERATOR BUILD_DIR SOURCE_DIR COMPILER C_COMPILER
                [TOOLCHAIN EMULATOR LIBRARIES]

The last three belong to a build for another processor: its toolchain file, the command that runs
its programs, and where the libraries lie that ours needs.
"""
import os
import pathlib
import re
import shlex
import shutil
import sys
import tempfile
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).parents[1] / "Support"))
# pylint: disable=wrong-import-position
from programs import run

CMAKE, GENERATOR, BUILD, SOURCE, COMPILER, C_COMPILER = sys.argv[2:8]
TOOLCHAIN, EMULATOR, LIBRARIES = sys.argv[8:] or ("", "", "")
CONSUMER = pathlib.Path(__file__).with_name("consumer")
LINK_SEARCH = [f"-Wl,-rpath-link,{LIBRARIES}"] if LIBRARIES else []
WARNINGS = ["-Wall", "-Wextra", "-Wpedantic", "-Wshadow", "-Wconversion", "-Wno-psabi"]
if os.environ.get("QV_WARNINGS_AS_ERRORS") == "1":
    WARNINGS.append("-Werror")
LANGUAGES = {  # CMake's name and target, pkg-config's, and the compiler
    "cpp": ("CXX", "QV_Localize", "QV_Localize", [COMPILER, "-std=c++17"]),
    "c": ("C", "C", "qvlocalize", [C_COMPILER, "-std=c99", "-pedantic"]),
}


def run_built(program, *arguments, **options):
    emulator = [*shlex.split(EMULATOR), "-E", f"LD_LIBRARY_PATH={LIBRARIES}"] if EMULATOR else []
    return run(*emulator, program, *arguments, **options)


class InstalledTest(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        directory = tempfile.TemporaryDirectory(prefix="qv_install_")
        cls.addClassCleanup(directory.cleanup)
        cls.root = pathlib.Path(directory.name)
        cls.prefix = cls.root / "prefix"
        run(CMAKE, "--install", BUILD, "--prefix", cls.prefix)

    def installed(self, pattern):
        found = sorted(self.prefix.glob(pattern))
        self.assertTrue(found, f"nothing installed as {pattern}")
        return found


class InstallTest(InstalledTest):
    def test_headers_stand_alone_and_none_is_left_out(self):
        include = self.prefix / "include/QV_Localize"
        headers = {path.relative_to(include) for path in include.rglob("*.h")}
        for header, language, place in [*((header, "cpp", include) for header in headers),
                                        *(("qvlocalize.h", language, include.parent)
                                          for language in LANGUAGES)]:
            source = self.root / f"alone.{language}"
            source.write_text(f"#include <{header}>\n#include <{header}>\nint main(void);\n")
            run(*LANGUAGES[language][3], *WARNINGS, "-fsyntax-only", "-I", place, source)
        exporting = {path.relative_to(SOURCE) for path in pathlib.Path(SOURCE).glob("[A-Z]*/*.h")
                     if re.search(r'QV_EXPORT |visibility\("default"\)',
                                  path.read_text(encoding="utf-8"))}
        self.assertGreater(len(exporting), 30)
        self.assertEqual(set(), exporting - headers, "to be listed in cmake/QVInstall.cmake")

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

    def test_what_else_comes_along(self):
        completions = "tools/completion"
        for name, source in (
                ("bash-completion/completions/qvlocalize", f"{completions}/qvlocalize.bash"),
                ("zsh/site-functions/_qvlocalize", f"{completions}/_qvlocalize"),
                ("doc/QV_Localize/LICENSE", "LICENSE"), ("doc/QV_Localize/NOTICE", "NOTICE")):
            path, = self.installed(f"share/{name}")
            self.assertEqual(pathlib.Path(SOURCE, source).read_bytes(), path.read_bytes())

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


class EmbeddingTest(InstalledTest):
    def source(self, language, name):
        """The program of docs/embedding.md in a directory of its own."""
        text = pathlib.Path(SOURCE, "docs/embedding.md").read_text(encoding="utf-8")
        path = pathlib.Path(tempfile.mkdtemp(dir=self.root), name)
        path.write_text(re.search(rf"```{language}\n(.*?)```", text, re.DOTALL).group(1),
                        encoding="utf-8")
        return path

    def check(self, run_program, *command, **options):
        """The program finds what is in a sample made by the installed tool."""
        data = pathlib.Path(tempfile.mkdtemp(dir=self.root))
        run_built(*self.installed("bin/qvlocalize"), "sample", "--data-dir", data)
        table, = self.installed("share/QV_Localize/pyfile.bin")
        self.assertEqual(table.read_bytes(), (data / "files/pyfile.bin").read_bytes())
        output = run_program(*command, data, **options)
        totals = [int(total) for total in re.findall(r": (\d+) matches", output)]
        self.assertEqual(2, len(totals), output)
        self.assertGreater(totals[0], totals[1])
        self.assertGreater(totals[1], 0)
        self.assertEqual(6, output.count("  contact "), output)

    def test_programs_built_with_cmake(self):
        for language, (name, target, _, (_, *standard)) in LANGUAGES.items():
            program = self.source(language, f"main.{language}")
            build = program.parent / "build"
            flags = " ".join(standard + WARNINGS + LINK_SEARCH)
            package = self.installed("**/QV_LocalizeConfig.cmake")[0].parent
            run(CMAKE, "-G", GENERATOR, "-S", CONSUMER, "-B", build, f"-DPROGRAM={program}",
                f"-DLANGUAGE={name}", f"-DLIBRARY={target}", f"-DCMAKE_{name}_FLAGS={flags}",
                f"-DCMAKE_C_COMPILER={C_COMPILER}", f"-DCMAKE_CXX_COMPILER={COMPILER}",
                f"-DQV_Localize_DIR={package}", "--no-warn-unused-cli",
                *[f"-DCMAKE_TOOLCHAIN_FILE={TOOLCHAIN}"] * bool(TOOLCHAIN))
            run(CMAKE, "--build", build)
            self.check(run_built, build / "consumer")

    def test_programs_built_with_pkg_config(self):
        environment = {**os.environ, "PKG_CONFIG_PATH": str(self.installed("**/pkgconfig")[0])}
        for language, (_, _, package, compiler) in LANGUAGES.items():
            table = run("pkg-config", "--variable=pyfile", package, env=environment).strip()
            self.assertTrue(pathlib.Path(table).is_file(), table)
            found = run("pkg-config", "--cflags", "--libs", package, env=environment).split()
            source = self.source(language, f"main.{language}")
            library, = self.installed(f"lib*/**/lib{package}.so")
            run(*compiler, *WARNINGS, source, "-o", source.parent / "program", *found,
                f"-Wl,-rpath,{library.parent}", *LINK_SEARCH)
            self.check(run_built, source.parent / "program")

    @unittest.skipIf(EMULATOR, "the interpreter loads this machine's libraries alone")
    def test_python_program(self):
        module, = self.installed("**/qvlocalize.py")
        self.check(run, sys.executable, "-B", self.source("python", "program.py"),
                   env={"PYTHONPATH": str(module.parent), "LC_ALL": "C.UTF-8"})

    def test_java_program(self):
        jars = sorted(self.prefix.glob("share/java/qvlocalize.jar"))
        if not jars or shutil.which("javac") is None:
            self.skipTest("there is no JDK")
        library, = self.installed("lib*/**/libqvlocalize_jni.so")
        source = self.source("java", "Program.java")
        run("javac", "-Xlint:all", "-Werror", "-cp", jars[0], source)
        self.check(run, "java", "-Xcheck:jni", f"-Djava.library.path={library.parent}", "-cp",
                   f"{jars[0]}:{source.parent}", "Program")


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:2], verbosity=2)
