"""The Python module against the tool, which links the C++ library, on one sample.

python_test.py TOOL PYFILE HEADER MODULE_FOLDER
"""
import ctypes
import gc
import json
import pathlib
import re
import shutil
import sqlite3
import subprocess
import sys
import tempfile
import threading
import unittest

TOOL, PYFILE, HEADER, MODULE_FOLDER = sys.argv[1:5]
sys.path.insert(0, MODULE_FOLDER)
import qvlocalize  # noqa: E402  the folder is known only now
from qvlocalize import Kind, SortType, Status  # noqa: E402

# Texts, what the module is asked for beside them, and what the tool is.
SEARCHES = [
    ("", {}, []),
    ("zs", {"starred": True}, ["--starred"]),
    ("zhangs", {}, []),
    ("张s", {"group": 2, "phone": True}, ["--group", "2", "--phone"]),
    ("w", {"not_group": [1, 2], "account": [1]},
     ["--not-group", "1", "--not-group", "2", "--account", "1"]),
    ("z", {"group": -1}, ["--group", "-1"]),
    ("l", {"mail": True, "postal": True, "not_contact": 3},
     ["--mail", "--postal", "--not-contact", "3"]),
    ("l", {"online": True, "not_account": [1, 2]},
     ["--online", "--not-account", "1", "--not-account", "2"]),
    ("9426", {"kind": Kind.DIGITS}, ["--type", "num"]),
    ("tianqi", {"kind": Kind.SPECIAL}, ["--type", "special"]),
]


def tool(data, *arguments):
    return subprocess.run([TOOL, arguments[0], "--data-dir", data, *arguments[1:]], check=True,
                          capture_output=True, encoding="utf-8").stdout


class PythonTest(unittest.TestCase):
    def setUp(self):
        self.data = pathlib.Path(tempfile.mkdtemp(prefix="qv_python_"))
        self.addCleanup(shutil.rmtree, self.data)
        tool(self.data, "sample", "--pyfile", PYFILE)
        self.index = qvlocalize.Index(self.data)
        self.addCleanup(self.index.close)
        self.index.build()

    def test_constants_and_layouts_are_those_of_the_header(self):
        header = pathlib.Path(HEADER).read_text(encoding="utf-8")
        names = dict(re.findall(r"\bQV_([A-Z0-9_]+)(?: = | (?=\d))(-?\d+)", header))
        mine = {"KEY_SIZE": qvlocalize._KEY_SIZE, "PICK_SIZE": qvlocalize._PICK_SIZE,
                "MAX_SECTIONS": qvlocalize._MAX_SECTIONS, "MAX_TYPED": 10}
        for prefix, enumeration in (("", Status), ("KIND_", Kind), ("SORT_", SortType),
                                    ("FILTER_", qvlocalize._FilterKind)):
            mine.update({prefix + member.name: member.value for member in enumeration})
        self.assertEqual({name: int(value) for name, value in names.items()}, mine)
        self.assertEqual(88, ctypes.sizeof(qvlocalize._Match))

    def test_finds_what_the_tool_finds(self):
        for sort_type in SortType:
            self.index.sort_type = sort_type
            self.index.build(force=True)
            for text, asked, options in SEARCHES:
                with self.subTest(text=text, sort_type=sort_type):
                    step = json.loads(tool(self.data, "search", text, "--json", "--once",
                                           "--limit", "0", *options))["steps"][-1]
                    with self.index.search(text, **asked) as result:
                        self.assertEqual(step["total"], len(result))
                        self.check_step(step, result)

    def check_step(self, step, result):
        self.assertEqual(
            [(match["contact_id"], match["name_order"], match["last_time_contacted"],
              match.get("first_matched", 0), match.get("last_matched", 0),
              match.get("index_character", "")) for match in step["matches"]],
            [(match.contact_id, match.name_order, match.last_contacted, match.first, match.last,
              match.index_character) for match in result])
        keys = "abcdefghijklmnopqrstuvwxyz#"
        self.assertEqual([key for bit, key in enumerate(keys) if step["mask"] >> bit & 1],
                         list(result.next_keys))
        self.assertEqual("".join(step["candidates"]), result.candidates)
        self.assertEqual(step.get("sections", {}),
                         {section.label: section.count for section in result.sections})
        for section in result.sections:
            self.assertEqual(section.label, result[section.first].index_character)

    def test_is_a_sequence_until_it_is_closed(self):
        result = self.index.search("z")
        matches = list(result)
        self.assertEqual(matches[-1], result[-1])
        self.assertEqual(matches[2:9:3], result[2:9:3])
        self.assertEqual(3, result.find(matches[3].contact_id))
        self.assertIsNone(result.find(-1))
        self.assertRaises(IndexError, lambda: result[len(matches)])
        nobody = self.index.search("z", group=99)
        self.assertEqual([], list(self.index.search("z", within=nobody)), "an empty result counts")
        result.close()
        result.close()
        self.assertRaises(ValueError, len, result)
        self.assertRaises(ValueError, self.index.search, "zs", within=result)

    def test_typing_narrows_takes_back_and_picks(self):
        with self.index.typing(phone=True) as typing:
            everybody = len(typing.result)
            for text in ("z", "zh", "zha", "zhan", "zhang", "zhangs"):
                typing.type(text[-1])
                self.assertEqual(list(self.index.search(text, phone=True)), list(typing.result))
            self.assertIn("三", typing.result.candidates)
            picked = list(typing.pick("三"))
            self.assertEqual("zhang三", typing.text.lower())
            self.assertEqual(list(self.index.search("zhang三", phone=True)), picked)
            while typing.text:
                typing.back()
            self.assertEqual(everybody, len(typing.back()))
        self.assertRaises(ValueError, lambda: typing.result)

    def test_converts_names_and_refuses_what_is_no_text(self):
        names = ["张三", "Tom 2", "", "\U0001F600张", "x" * 5000]
        with sqlite3.connect(self.data / "databases/contacts2.db") as database:
            known = dict(database.execute("select display_name, localizerkey from localizer"))
        keys = self.index.localizer_keys(names)
        self.assertEqual([known["张三"], known["Tom 2"], ""], keys[:3])
        self.assertEqual("\u5000" + known["张三"][0], keys[3])
        self.assertEqual("\u4f17" * 10, keys[4])
        self.assertEqual("ZHANG三", self.index.pick("zhangs", 6, "三"))
        for text, error in (("z\0", ValueError), ("\ud83d", UnicodeEncodeError),
                            ("zhangsansix", qvlocalize.Error)):
            self.assertRaises(error, self.index.search, text)
        with self.assertRaises(qvlocalize.Error) as raised:
            qvlocalize.Index(self.data / "files")
        self.assertEqual(Status.ERROR_OTHER_DIRECTORY, raised.exception.code)
        self.assertRegex(str(raised.exception), "another data directory")
        self.assertRaises(OverflowError, self.index.star_changed, 2**31, True)

    def test_follows_changes_of_the_database(self):
        with sqlite3.connect(self.data / "databases/contacts2.db") as database:
            database.execute("update localizer set (display_name, localizerkey) = (select"
                             " display_name, localizerkey from localizer where contact_id = 1)"
                             " where contact_id = 54")
        self.assertIsNone(self.index.search("zhangsan").find(54))
        self.index.contacts_changed([54])
        self.assertIsNotNone(self.index.search("zhangsan").find(54))
        self.assertIsNone(self.index.search("zhangsan", starred=True).find(54))
        self.index.star_changed(54, True)
        self.assertIsNotNone(self.index.search("zhangsan", starred=True).find(54))
        self.index.time_changed(54, 1_800_000_000_123)
        match, = [match for match in self.index.search("") if match.contact_id == 54]
        self.assertEqual(1_800_000_000_123, match.last_contacted)
        self.index.status_changed()
        self.index.all_contacts_changed()
        self.assertFalse(self.index.needs_build)

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
        forgotten = qvlocalize.Index(self.data)
        del forgotten
        gc.collect()
        qvlocalize.Index(self.data / "files").close()  # nothing is open any more

    def test_hands_the_log_on(self):
        lines = []
        qvlocalize.set_log(lambda *line: lines.append(line))
        self.index.search("z")
        qvlocalize.set_log(None)
        self.index.search("z")
        self.assertEqual((3, "QV_Localize", "QV_Contacts: Search Start"), lines[0])
        self.assertEqual(1, lines.count(lines[0]))


if __name__ == "__main__":
    unittest.main(argv=sys.argv[:1], verbosity=2)
