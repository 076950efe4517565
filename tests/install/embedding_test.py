"""Builds and runs the programs of docs/embedding.md in other languages than C++ against an
installation, as somebody who embeds the library would.

embedding_test.py ARGUMENT..., as installed.py tells
"""
import shutil
import sys
import unittest

from installed import (COMPILER, C_COMPILER, EMULATOR, WARNINGS, InstalledTest,
                       program_of_the_docs, run)

C99 = ["-std=c99", "-pedantic"]
CONSUMER = """\
cmake_minimum_required(VERSION 3.22)
project(consumer LANGUAGES C)
find_package(QV_Localize 1.0 REQUIRED)
add_executable(consumer main.c)
target_link_libraries(consumer PRIVATE QV_Localize::C)
"""


class EmbeddingTest(InstalledTest):
    def test_header_stands_alone_in_c_and_in_cpp(self):
        header, = self.installed("include/qvlocalize.h")
        for name, compiler, flags in (("c", C_COMPILER, C99), ("cpp", COMPILER, ["-std=c++17"])):
            source = self.root / f"alone.{name}"
            source.write_text("#include <qvlocalize.h>\n#include <qvlocalize.h>\n"
                              "int main(void) { return qv_strerror(QV_OK) == 0; }\n",
                              encoding="utf-8")
            run(compiler, *flags, *WARNINGS, "-fsyntax-only", "-I", header.parent, source)

    def test_c_program_built_with_cmake(self):
        program = self.build_with_cmake("c", CONSUMER, C99)
        self.check_program(program, self.sample("data_cmake"))

    def test_c_program_built_with_pkg_config(self):
        program = self.build_with_pkg_config("c", "qvlocalize", C_COMPILER, C99)
        self.check_program(program, self.sample("data_pkg_config"))

    @unittest.skipIf(EMULATOR, "the interpreter loads this machine's libraries alone")
    def test_python_program(self):
        module, = self.installed("**/qvlocalize.py")
        program = self.root / "program.py"
        program.write_text(program_of_the_docs("python"), encoding="utf-8")
        self.check_output(run(sys.executable, "-B", program, self.sample("data_python"),
                              env={"PYTHONPATH": str(module.parent), "LC_ALL": "C.UTF-8"}))

    def test_java_program(self):
        jars = sorted(self.prefix.glob("share/java/qvlocalize.jar"))
        if not jars or shutil.which("javac") is None:
            self.skipTest("there is no JDK")
        library, = self.installed("lib*/**/libqvlocalize_jni.so")
        source = self.root / "Program.java"
        source.write_text(program_of_the_docs("java"), encoding="utf-8")
        run("javac", "-Xlint:all", "-Werror", "-d", self.root, "-cp", jars[0], source)
        self.check_output(run("java", "-Xcheck:jni", f"-Djava.library.path={library.parent}", "-cp",
                              f"{jars[0]}:{self.root}", "Program", self.sample("data_java")))


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1], verbosity=2)
