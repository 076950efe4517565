"""The built libqvlocalize from outside: what it exports, and that it lives beside other libraries.

c_library_test.py NM LIBRARY HEADER TOOL PYFILE [COLLISION...]

COLLISION are programs that link another library with names of ours.
"""
import pathlib
import re
import subprocess
import sys
import tempfile
import unittest

NM, LIBRARY, HEADER, TOOL, PYFILE = sys.argv[1:6]
COLLISIONS = sys.argv[6:]


def run(*command):
    return subprocess.run(command, capture_output=True, encoding="utf-8", check=False)


class CLibraryTest(unittest.TestCase):
    def test_exports_what_the_header_declares_and_nothing_else(self):
        lines = run(NM, "--dynamic", "--defined-only", "--format=posix", LIBRARY).stdout.split("\n")
        exported = {line.split("@")[0] for line in lines if line and line.split()[1] != "A"}
        header = pathlib.Path(HEADER).read_text(encoding="utf-8")
        declared = set(re.findall(r"^ *QV_API .*?\b(qv_\w+)\(", header, re.MULTILINE))
        self.assertEqual(declared, exported)
        self.assertIn("qv_search", exported)

    @unittest.skipUnless(COLLISIONS, "libwinpr2-2 is not installed")
    def test_lives_beside_a_library_with_the_same_names(self):
        with tempfile.TemporaryDirectory(prefix="qv_collision_") as data:
            sample = run(TOOL, "sample", "--data-dir", data, "--pyfile", PYFILE)
            self.assertEqual(0, sample.returncode, sample.stderr)
            for program in COLLISIONS:
                process = run(program, data)
                self.assertEqual(0, process.returncode, process.stdout + process.stderr)


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1], verbosity=2)
