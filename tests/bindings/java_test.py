"""The Java classes under a virtual machine that checks every call of their native half, beside the
Python module on the same index.

java_test.py JAVA CLASS_PATH LIBRARY_FOLDER TOOL PYFILE MODULE_FOLDER
"""
import os
import subprocess
import sys
import tempfile
import unittest

JAVA, CLASS_PATH, LIBRARY_FOLDER, TOOL, PYFILE, MODULE_FOLDER = sys.argv[1:7]
sys.path.insert(0, MODULE_FOLDER)
import qvlocalize  # noqa: E402  the folder is known only now
from qvlocalize import Kind  # noqa: E402

# What the program of the test searches for, in its order.
SEARCHES = [
    ("", {}),
    ("zs", {"starred": True}),
    ("张s", {"group": 2, "phone": True}),
    ("w", {"not_group": [1, 2], "account": 1}),
    ("l", {"mail": True, "postal": True, "not_contact": 3}),
    ("l", {"online": True, "not_account": 1}),
    ("9426", {"kind": Kind.DIGITS}),
    ("tianqi", {"kind": Kind.SPECIAL}),
    ("zh", {"within": "z"}),
    ("z", {}),
    ("\U0001F600" * 10, {}),
    ("zh", {"not_contact": range(40)}),
]


def line(text, result):
    matches = "".join(f" {match.contact_id},{match.name_order},{match.last_contacted},"
                      f"{match.first},{match.last},{ord(match.index_character or chr(0))}"
                      for match in result)
    sections = "".join(f" {section.label}{section.first}+{section.count}"
                       for section in result.sections)
    return f"{text}:{matches} / {result.next_keys} / {result.candidates}{sections}"


class JavaTest(unittest.TestCase):
    def test_finds_what_python_finds_and_keeps_the_rules_of_the_machine(self):
        with tempfile.TemporaryDirectory(prefix="qv_java_") as data:
            subprocess.run([TOOL, "sample", "--data-dir", data, "--pyfile", PYFILE], check=True,
                           stdout=subprocess.DEVNULL)
            process = subprocess.run(
                [JAVA, "-Xcheck:jni", "-Xmx128m", "-ea", f"-Djava.library.path={LIBRARY_FOLDER}",
                 "-Dfile.encoding=UTF-8", "-cp", CLASS_PATH, "IndexTest", data],
                capture_output=True, encoding="utf-8", check=False,
                env={**os.environ, "LC_ALL": "C.UTF-8"})
            self.assertEqual(0, process.returncode, process.stdout[-2000:] + process.stderr)
            told = (process.stdout + process.stderr).splitlines()
            self.assertEqual([], [text for text in told if "WARNING" in text or "FATAL" in text])
            expected = []
            with qvlocalize.Index(data) as index:
                index.sort_type = qvlocalize.SortType.NAME
                index.build(force=True)
                for text, asked in SEARCHES:
                    if "within" in asked:
                        asked["within"] = index.search(asked["within"])
                    expected.append(line(text, index.search(text, **asked)))
            self.maxDiff = 2000
            self.assertEqual(expected, process.stdout.splitlines())


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1], verbosity=2)
