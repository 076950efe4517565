"""Lets two builds of the tool, for two processors, index one database and type the same texts, and
compares the files that they write and what they answer, byte by byte.

same_bytes_test.py NATIVE_TOOL OTHER_TOOL
"""
import pathlib
import shutil
import subprocess
import sys
import tempfile
import unittest

NATIVE, OTHER = sys.argv[1:3]
# So long ago that no contact comes to another age while the test runs.
NOW = "1000000000000"
SEARCHES = [
    *([text] for text in ("", "z", "zs", "zhangs", "zhangsan", "zengguofan", "lgs", "tom#2",
                          "wangli", "chan", "张s", "張三", "曾", "o'b", "ü")),
    *([text, "--type", "num"] for text in ("9", "94", "9426472", "5474", "110")),
    *([text, "--type", "special"] for text in ("", "b", "bj", "hj", "tqyb")),
    *(call.split() for call in ("l --group 2 --phone", "w --not-group 2 --starred",
                                "c --not-account 3 --not-contact 7 --mail", "li --whole --postal")),
    ["", "--account", "3", "--online"],
]


def run(tool, directory, command, *arguments):
    process = subprocess.run([tool, command, "--data-dir", str(directory), *arguments],
                             capture_output=True, encoding="utf-8", check=False)
    assert process.returncode == 0, f"{process.args}\n{process.stdout}{process.stderr}"
    return process.stdout


class SameBytesTest(unittest.TestCase):
    def test_both_orders(self):
        directory = tempfile.TemporaryDirectory(prefix="qv_compare_")
        self.addCleanup(directory.cleanup)
        native, other = (pathlib.Path(directory.name, name) for name in ("native", "other"))
        run(NATIVE, native, "sample", "--count", "2000", "--now", NOW)
        shutil.copytree(native, other)
        for order in ("name", "time"):
            for tool, data in ((NATIVE, native), (OTHER, other)):
                run(tool, data, "index")
                run(tool, data, "show", "--set-sort-type", order)
                run(tool, data, "index")
            for name in ("ContactsLocalizer.bin", "ContactsReg.bin", "PyFileMappint.bin"):
                content = (native / "files" / name).read_bytes()
                self.assertGreater(len(content), 0)
                self.assertEqual(content, (other / "files" / name).read_bytes(), (order, name))
            for search in SEARCHES:
                answers = [run(tool, data, "search", *search, "--json", "--limit", "0")
                           for tool, data in ((NATIVE, native), (OTHER, other))]
                self.assertIn('"total"', answers[0])
                self.assertEqual(*answers, (order, search))


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1], verbosity=2)
