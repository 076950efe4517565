"""The interfaces for other languages against the tool, which links the C++ library, on one sample.

languages_test.py TOOL PYFILE TestClass NAME=PLACE...
"""
import ctypes
import doctest
import gc
import os
import pathlib
import random
import re
import sqlite3
import string
import subprocess
import sys
import threading
import unittest

TESTS = pathlib.Path(__file__).resolve().parents[1]
BINDINGS = TESTS.parent / "bindings"
sys.path[:0] = [str(TESTS / "Support"), str(BINDINGS / "python")]
# pylint: disable=wrong-import-position
import qvlocalize
from qvlocalize import Kind, SortType, Status
from tool_case import ToolCase

HEADER = (BINDINGS / "c/qvlocalize.h").read_text(encoding="utf-8")
PLACES = dict(word.split("=", 1) for word in sys.argv[4:])

# Texts and what the module is asked for beside them, in the order of the program of Java.
SEARCHES = [
    ("", {}),
    ("zs", {"starred": True}),
    ("张s", {"group": 2, "phone": True}),
    ("w", {"not_group": [1, 2], "account": 1}),
    ("l", {"mail": True, "postal": True, "not_contact": 3}),
    ("l", {"online": True, "not_account": [1, 2]}),
    ("9426", {"kind": 1}),
    ("tianqi", {"kind": 2}),
    ("z", {"group": -1}),
]
TEXTS = ["zhangs", "ZS", "wxm", "lixiao", "z#s", "tom#l", "张s", "chang", "王é", "hjzhong", "tianqi",
         "94264", "5494", "74#", "100"]
KEYS = string.ascii_lowercase + "#"
FLAGS = ["starred", "phone", "mail", "postal", "online"]
LISTS = ["group", "account", "not_group", "not_account", "not_contact"]


class ModuleTest(ToolCase):
    def setUp(self):
        super().setUp()
        self.index = qvlocalize.Index(self.data)
        self.addCleanup(self.index.close)

    def told(self, text, kind=0, **asked):
        """The steps that the tool shows for what the module is asked."""
        options = ["--type", ("word", "num", "special")[kind]]
        for name, value in asked.items():
            for number in value if isinstance(value, list) else [value]:
                options.append("--" + name.replace("_", "-"))
                options += [] if number is True else [number]
        return self.steps(text, *options)


class PythonTest(ModuleTest):
    def test_constants_and_layouts_are_those_of_the_header(self):
        names = dict(re.findall(r"\bQV_([A-Z0-9_]+)(?: = | (?=\d))(-?\d+)", HEADER))
        mine = {"KEY_SIZE": qvlocalize._KEY_SIZE, "PICK_SIZE": qvlocalize._PICK_SIZE,
                "MAX_SECTIONS": qvlocalize._MAX_SECTIONS, "MAX_TYPED": 10}
        for prefix, enumeration in (("", Status), ("KIND_", Kind), ("SORT_", SortType),
                                    ("FILTER_", qvlocalize._FilterKind)):
            mine.update({prefix + member.name: member.value for member in enumeration})
        self.assertEqual({name: int(value) for name, value in names.items()}, mine)
        self.assertEqual(88, ctypes.sizeof(qvlocalize._Match))
        functions = re.findall(r"(?m)^ *QV_API .*?\b(qv_\w+)\(", HEADER)
        self.assertIn("qv_search", functions)
        self.assertFalse([name for name in functions if not hasattr(qvlocalize._lib, name)])

    def assert_same(self, step, result):
        self.assertEqual(
            [(match["contact_id"], match["name_order"], match["last_time_contacted"],
              match.get("first_matched", 0), match.get("last_matched", 0),
              match.get("index_character", "")) for match in step["matches"]],
            [(match.contact_id, match.name_order, match.last_contacted, match.first, match.last,
              match.index_character) for match in result])
        keys = [key for bit, key in enumerate(KEYS) if step["mask"] >> bit & 1]
        self.assertEqual((keys, "".join(step["candidates"])),
                         (list(result.next_keys), result.candidates))
        self.assertEqual(step.get("sections", {}),
                         {section.label: section.count for section in result.sections})
        for section in result.sections:
            self.assertEqual(section.label, result[section.first].index_character)

    def any_question(self, dice, names):
        asked = {"kind": dice.choice([0, 0, 0, 1, 1, 2])}
        for name in dice.sample(FLAGS + LISTS, dice.randrange(4)):
            numbers = [dice.randrange(-1, 8) for _ in range(dice.randint(1, 2))]
            asked[name] = numbers if name in LISTS else True
        return dice.choice(TEXTS + dice.sample(names, 5))[:dice.randrange(1, 11)], asked

    def test_finds_what_the_tool_finds(self):
        dice = random.Random(15)
        names = [name for name, in self.sql("SELECT display_name FROM localizer")]
        for sort_type in SortType:
            self.index.sort_type = sort_type
            self.index.build(force=True)
            for text, asked in SEARCHES + [self.any_question(dice, names) for _ in range(60)]:
                result = None
                for step in self.told(text, **asked):  # each key within the matches before it
                    result = self.index.search(step["typed"], within=result, **asked)
                    with self.subTest(text=step["typed"], sort_type=sort_type, asked=asked):
                        self.assert_same(step, result)

    def test_examples_in_its_documentation(self):
        def prepare(example):
            self.doCleanups()
            self.setUp()
            database = sqlite3.connect(self.database)
            self.addCleanup(database.close)
            names = dict(self.sql("SELECT contact_id, display_name FROM localizer"))
            example.globs.update(qvlocalize=qvlocalize, index=self.index, database=database,
                                 names=names)

        examples = doctest.DocTestSuite(qvlocalize, setUp=prepare, optionflags=doctest.ELLIPSIS)
        outcome = unittest.TextTestRunner(verbosity=2).run(examples)
        self.assertTrue(outcome.wasSuccessful() and outcome.testsRun > 10)

    def test_refuses_what_it_cannot_take(self):
        self.assertEqual(["", "\u5000" + self.index.localizer_key("张")[0], "\u4f17" * 10],
                         self.index.localizer_keys(["", "\U0001F600张", "x" * 5000]))
        result = self.index.search("z")
        self.assertRaises(IndexError, lambda: result[len(result)])
        result.close()
        result.close()
        for wrong, error in ((lambda: self.index.search("z\0"), ValueError),
                             (lambda: self.index.search("\ud83d"), UnicodeEncodeError),
                             (lambda: self.index.search("zs", within=result), ValueError),
                             (lambda: self.index.star_changed(2**31, True), OverflowError)):
            self.assertRaises(error, wrong)

    def test_threads_share_an_index_and_forgotten_objects_are_released(self):
        expected = len(self.index.search("z"))
        counts = []
        threads = [threading.Thread(target=lambda: counts.extend(
            len(self.index.search("z")) for _ in range(50))) for _ in range(4)]
        for thread in threads:
            thread.start()
        for thread in threads:
            thread.join()
        self.assertEqual([expected] * 200, counts)
        result = self.index.search("z")
        self.index.close()
        self.assertEqual(expected, len(list(result)), "a result outlives its index")
        self.assertRaises(ValueError, self.index.search, "z")
        qvlocalize.Index(self.data)  # is forgotten
        gc.collect()
        qvlocalize.Index(self.data / "files").close()  # nothing is open any more


class JavaTest(ModuleTest):
    """The Java classes under a virtual machine that checks every call of their native half."""

    def line(self, text, asked):
        result = self.index.search(text, **asked)
        matches = "".join(f" {match.contact_id},{match.name_order},{match.last_contacted},"
                          f"{match.first},{match.last},{ord(match.index_character or chr(0))}"
                          for match in result)
        sections = "".join(f" {section.label}{section.first}+{section.count}"
                           for section in result.sections)
        return f"{text}:{matches} / {result.next_keys} / {result.candidates}{sections}"

    def test_finds_what_python_finds_and_keeps_the_rules_of_the_machine(self):
        searches = [*SEARCHES, ("zh", {"within": self.index.search("z")}),
                    ("\U0001F600" * 10, {}), ("zh", {"not_contact": range(40)})]
        expected = [self.line(*search) for search in searches]
        for path in (self.data / "files").glob("Contacts*"):
            path.unlink()
        process = subprocess.run(
            [PLACES["java"], "-Xcheck:jni", "-Xmx128m", "-ea", "-Dfile.encoding=UTF-8", "-cp",
             PLACES["classes"], f"-Djava.library.path={PLACES['jni']}", "IndexTest", self.data],
            capture_output=True, encoding="utf-8", check=False,
            env={**os.environ, "LC_ALL": "C.UTF-8"})
        self.assertEqual(0, process.returncode, process.stdout[-2000:] + process.stderr)
        self.assertNotRegex(process.stdout + process.stderr, "WARNING|FATAL")
        self.assertEqual(expected, process.stdout.splitlines())


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0], sys.argv[3]], verbosity=2)
