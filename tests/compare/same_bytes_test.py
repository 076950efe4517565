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
FILES = ("ContactsLocalizer.bin", "ContactsReg.bin", "PyFileMappint.bin")
CONTACTS = 2000
# So long ago that no contact comes to another age while the test runs.
NOW = 1_000_000_000_000
SEARCHES = [
    *(["search", text] for text in ("", "z", "zs", "zhangs", "zhangsan", "zengguofan", "lgs",
                                    "tom#2", "wangli", "chan", "张s", "張三", "曾", "o'b", "ü")),
    *(["search", text, "--type", "num"] for text in ("9", "94", "9426472", "5474", "110")),
    *(["search", text, "--type", "special"] for text in ("", "b", "bj", "hj", "tqyb")),
    ["search", "l", "--group", "2", "--phone"],
    ["search", "w", "--not-group", "2", "--starred"],
    ["search", "", "--account", "3", "--online"],
    ["search", "c", "--not-account", "3", "--not-contact", "7", "--mail"],
    ["search", "li", "--whole", "--postal"],
]


def run(tool, directory, command, *arguments):
    call = [tool, command, "--data-dir", str(directory), *arguments]
    process = subprocess.run(call, capture_output=True, encoding="utf-8", check=False)
    assert process.returncode == 0, f"{call}\n{process.stdout}{process.stderr}"
    return process.stdout


class SameBytesTest(unittest.TestCase):
    @classmethod
    def setUpClass(cls):
        directory = tempfile.TemporaryDirectory(prefix="qv_compare_")
        cls.addClassCleanup(directory.cleanup)
        root = pathlib.Path(directory.name)
        cls.pairs = ((NATIVE, root / "native"), (OTHER, root / "other"))
        first = cls.pairs[0][1]
        run(NATIVE, first, "sample", "--count", str(CONTACTS), "--now", str(NOW))
        shutil.copytree(first, cls.pairs[1][1])

    def check_order(self, order):
        for tool, directory in self.pairs:
            run(tool, directory, "index")
            run(tool, directory, "show", "--set-sort-type", order)
            run(tool, directory, "index")
        (_, native), (_, other) = self.pairs
        for name in FILES:
            with self.subTest(order=order, file=name):
                content = (native / "files" / name).read_bytes()
                self.assertGreater(len(content), 0)
                self.assertEqual(content, (other / "files" / name).read_bytes())
        for search in SEARCHES:
            with self.subTest(order=order, search=search):
                answers = [run(tool, directory, *search, "--json", "--limit", "0")
                           for tool, directory in self.pairs]
                self.assertIn('"total"', answers[0])
                self.assertEqual(answers[0], answers[1])

    def test_name_order(self):
        self.check_order("name")

    def test_order_of_last_contact(self):
        self.check_order("time")


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1], verbosity=2)
