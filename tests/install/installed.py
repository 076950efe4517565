"""What the tests of the installed build share: an installation in a temporary prefix, the programs of
docs/embedding.md, and how programs of this build are run.

The tests are called with
  CMAKE GENERATOR BUILD_DIR SOURCE_DIR COMPILER C_COMPILER [TOOLCHAIN EMULATOR LIBRARIES]

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

CMAKE, GENERATOR, BUILD, SOURCE, COMPILER, C_COMPILER = sys.argv[1:7]
TOOLCHAIN, EMULATOR, LIBRARIES = sys.argv[7:] or ("", "", "")
LINK_SEARCH = [f"-Wl,-rpath-link,{LIBRARIES}"] if LIBRARIES else []
WARNINGS = ["-Wall", "-Wextra", "-Wpedantic", "-Wshadow", "-Wconversion", "-Wno-psabi"]
if os.environ.get("QV_WARNINGS_AS_ERRORS") == "1":
    WARNINGS.append("-Werror")


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


def program_of_the_docs(language):
    text = pathlib.Path(SOURCE, "docs/embedding.md").read_text(encoding="utf-8")
    return re.search(rf"```{language}\n(.*?)```", text, re.DOTALL).group(1)


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

    def sample(self, name):
        """A data directory with sample contacts, made by the installed tool."""
        data = self.root / name
        tool, = self.installed("bin/qvlocalize")
        run_built(tool, "sample", "--data-dir", data)
        table, = self.installed("share/QV_Localize/pyfile.bin")
        self.assertEqual(table.read_bytes(), (data / "files/pyfile.bin").read_bytes())
        return data

    def check_program(self, program, data, **options):
        self.check_output(run_built(program, data, **options))

    def check_output(self, output):
        totals = [int(total) for total in re.findall(r": (\d+) matches", output)]
        self.assertEqual(2, len(totals), output)
        self.assertGreater(totals[0], totals[1])
        self.assertGreater(totals[1], 0)
        self.assertEqual(6, output.count("  contact "), output)

    def build_with_cmake(self, language, project_text, flags):
        """The program `consumer` of the docs' program and a project that finds the package."""
        project = self.root / f"consumer_{language}"
        project.mkdir()
        (project / "CMakeLists.txt").write_text(project_text, encoding="utf-8")
        (project / f"main.{language}").write_text(program_of_the_docs(language), encoding="utf-8")
        cross = [f"-DCMAKE_TOOLCHAIN_FILE={TOOLCHAIN}"] if TOOLCHAIN else []
        flags = " ".join(flags + WARNINGS + LINK_SEARCH)
        run(CMAKE, "-G", GENERATOR, "-S", project, "-B", project / "build",
            f"-DCMAKE_C_COMPILER={C_COMPILER}", f"-DCMAKE_CXX_COMPILER={COMPILER}",
            f"-DCMAKE_C_FLAGS={flags}", f"-DCMAKE_CXX_FLAGS={flags}", "--no-warn-unused-cli",
            f"-DQV_Localize_DIR={self.installed('**/QV_LocalizeConfig.cmake')[0].parent}", *cross)
        run(CMAKE, "--build", project / "build")
        return project / "build/consumer"

    def build_with_pkg_config(self, language, package, compiler, flags):
        """The docs' program with what pkg-config says about the package."""
        environment = dict(os.environ)
        environment["PKG_CONFIG_PATH"] = str(self.installed("**/pkgconfig")[0])
        found = run("pkg-config", "--cflags", "--libs", package, env=environment).split()
        table = run("pkg-config", "--variable=pyfile", package, env=environment).strip()
        self.assertTrue(pathlib.Path(table).is_file(), table)
        source = self.root / f"with_pkg_config.{language}"
        source.write_text(program_of_the_docs(language), encoding="utf-8")
        library, = self.installed(f"lib*/**/lib{package}.so")
        program = self.root / f"with_pkg_config_{language}"
        run(compiler, *flags, *WARNINGS, source, "-o", program, *found,
            f"-Wl,-rpath,{library.parent}", *LINK_SEARCH)
        return program
