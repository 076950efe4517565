"""What an import does to a database and its index, and how vCards and CSV become contacts.

import_test.py TOOL PYFILE [TestClass...]
"""
import contextlib
import importlib.util
import json
import os
import pathlib
import pty
import re
import sqlite3
import subprocess
import sys

sys.path.insert(0, str(pathlib.Path(__file__).parents[1] / "Support"))
# pylint: disable=wrong-import-position
import tool_case
from tool_case import DONE, FAILED, PARTLY, PYFILE, SKIPPED, ToolCase

SAMPLES = pathlib.Path(__file__).parent / "samples"

ALL = "contacts JOIN localizer ON contact_id = _id"
STATE = ("_id, display_name, localizerkey, group_id, account_id, hasMail, hasAddress, starred, "
         "has_phone_number, times_contacted, last_time_contacted, single_is_secret, "
         "status_update_id")


class ImportTest(ToolCase):
    WITH_SAMPLE = False

    def file(self, name, content):
        path = self.root / name
        path.write_bytes(content if isinstance(content, bytes) else content.encode())
        return path

    def bring(self, path, *arguments, code=DONE, **options):
        """Imports the file: how many were added, updated, unchanged and refused, and what was
        refused by line."""
        process = self.run_tool("import", path, "--pyfile", PYFILE, *arguments, code=code,
                                **options)
        shown = "standard input" if path == "-" else str(path)
        counts = process.stdout.split(f"{shown}: ")[1].split("\n")[0]
        numbers = [int(word) for word in counts.split() if word.isdigit()]
        refused = re.findall(rf"(?m)^{re.escape(shown)}:(\d+): refused: (.*)$", process.stderr)
        self.assertEqual(numbers[3], len(refused), process.stderr)
        self.assertNotIn("\r", process.stderr, "a bar in a pipe")
        return numbers, {int(line): reason for line, reason in refused}

    def bring_lines(self, *entries, **options):
        text = "".join(json.dumps(entry) + "\n" for entry in entries)
        return self.bring(self.file("entries.jsonl", text), **options)

    def groups(self):
        return dict(self.sql("SELECT name, group_id FROM qv_imported_groups"))


class CallsTest(ImportTest):
    def test_calls(self):
        self.check_transcript(SAMPLES.with_name("calls.txt"))


class IntoSampleTest(ImportTest):
    WITH_SAMPLE = True

    def state(self):
        return {row[0]: list(row) for row in self.sql(f"SELECT {STATE} FROM {ALL}")}

    def test_adds_updates_and_leaves_the_rest(self):
        expected = self.state()
        first, = self.sql("SELECT min(_id) FROM visible_contacts JOIN localizer ON _id = contact_id"
                          " WHERE display_name = '张三'")[0]
        new = 1 + max(expected)
        counts, _ = self.bring_lines(
            {"name": "张三", "uid": "u1", "phones": [], "groups": ["Family"]},
            {"name": "阿不思", "uid": "u2", "mails": ["a@b"]})
        self.assertEqual([1, 1, 0, 0], counts)
        state = self.state()
        state.pop(new)
        groups = expected[first][3]
        expected[first][3] = ".".join(filter(None, [groups, "7"]))  # after the sample's six groups
        expected[first][8] = 0
        self.assertEqual(expected, state)
        self.assertEqual({new}, self.found("abusi"))
        self.assertIn(first, self.found("zs", "--group", "7"))

        counts, _ = self.bring_lines({"name": "章四", "uid": "u1", "groups": []},
                                     {"name": "阿不思", "starred": True}, {"name": "阿不思"})
        self.assertEqual([1, 2, 0, 0], counts)
        self.assertIn(first, self.found("zhangsi"))
        self.assertNotIn(first, self.found("zhangsan"))
        self.assertEqual({new}, self.found("abusi", "--starred"))
        self.assertEqual({new, new + 1}, self.found("abusi"))
        self.assertEqual(groups, self.state()[first][3])

    def test_the_same_again_changes_nothing(self):
        entries = [{"name": "王五", "uid": f"u{i % 7}" if i % 2 else None, "groups": [f"g{i % 3}"]}
                   for i in range(30)]
        self.bring_lines(*entries)
        before = self.state(), self.groups(), self.found("")
        counts, _ = self.bring_lines(*entries)
        self.assertEqual(0, counts[0])
        once = [entry for i, entry in enumerate(entries) if not i % 2]  # each uid stands twice
        self.assertEqual([0, 0, 15, 0], self.bring_lines(*once)[0])
        self.assertEqual(before, (self.state(), self.groups(), self.found("")))

    def test_more_than_the_index_is_patched_with(self):
        everybody = self.found("")
        entries = [{"name": f"王{i}", "phones": ["1"]} for i in range(1200)]
        self.assertEqual([1200, 0, 0, 0], self.bring_lines(*entries)[0])
        self.assertEqual(len(everybody) + 1200, len(self.found("")))
        self.assertEqual([0, 0, 1200, 0], self.bring_lines(*entries)[0])

    def test_a_deleted_contact_comes_back_under_a_new_id(self):
        self.bring_lines({"name": "Gone", "uid": "u"})
        (gone,), = self.sql("SELECT contact_id FROM localizer WHERE display_name = 'Gone'")
        for table, column in (("contacts", "_id"), ("visible_contacts", "_id"),
                              ("localizer", "contact_id")):
            self.sql(f"DELETE FROM {table} WHERE {column} = {gone}")
        self.assertEqual([1, 0, 0, 0], self.bring_lines({"name": "Gone", "uid": "u"})[0])
        self.assertEqual([(gone + 1,)], self.sql("SELECT contact_id FROM qv_imported_uids"))

    def test_a_busy_database_is_not_changed(self):
        before = self.database.read_bytes()
        path = self.file("a.jsonl", '{"name": "New"}\n')
        with contextlib.closing(sqlite3.connect(self.database)) as database:
            database.execute("BEGIN IMMEDIATE")
            self.refused(FAILED, "database is locked", "import", path)
        self.assertEqual(before, self.database.read_bytes())
        self.assertEqual([1, 0, 0, 0], self.bring(path)[0])


class BarTest(ImportTest):
    def test_shows_a_bar_on_a_terminal_and_takes_it_away(self):
        gate = self.root / "gate"  # until it is open the converter waits
        os.mkfifo(gate)
        converter = self.file("waits.py", f'print(\'{{"name": "One"}}\', flush=True)\n'
                                          f'open("{gate}").read()\n')
        terminal, other_end = pty.openpty()
        self.addCleanup(os.close, terminal)
        process = subprocess.Popen(
            self.call("import", self.file("a.vcf", "x" * 100), "--pyfile", PYFILE, "--converter",
                      converter), stdout=subprocess.PIPE, stderr=other_end)
        self.addCleanup(process.wait)
        shown = ""
        while "%" not in shown:
            shown += os.read(terminal, 1000).decode()
        gate.write_text("")
        self.assertRegex(shown, r"\rImporting contacts +\[[#.]{30}\] +\d+%")
        self.assertIn(b"1 added", process.communicate()[0])
        os.write(other_end, b"$")
        while "$" not in shown:
            shown += os.read(terminal, 1000).decode()
        os.close(other_end)
        self.assertRegex(shown, r"%\r +\r\$$")


class SamplesTest(ImportTest):
    """Files as other programs write them, and files with faults, give what expected.txt says: each
    contact, behind whether it has phone, mail, address and star, and what was refused."""

    KIND = r"csv|jsonl"

    def test_samples(self):
        for name, expected in tool_case.sections(SAMPLES / "expected.txt").items():
            if not re.search(rf"\.({self.KIND})$", name):
                continue
            self.data = self.root / name
            charset = ["--charset", "gb18030"] if name.startswith("gbk") else []
            code = PARTLY if "line " in expected else DONE
            counts, refused = self.bring(SAMPLES / name, *charset, code=code)
            rows = self.sql(
                "SELECT has_phone_number || hasMail || hasAddress || starred || ' ' || display_name"
                " || coalesce((SELECT group_concat(', in ' || name, '') FROM qv_imported_groups "
                "WHERE '.' || localizer.group_id || '.' LIKE '%.' || group_id || '.%'), '') "
                f"FROM {ALL} ORDER BY _id") if counts[0] else []
            lines = [text for text, in rows]
            lines += [f"line {line}: {reason}" for line, reason in refused.items()]
            self.assertEqual(expected.splitlines(), lines, name)
            self.assertEqual([len(rows), 0, 0, len(refused)], counts, name)


class CardsTest(SamplesTest):
    KIND = "vcf"


if __name__ == "__main__":
    if "CardsTest" in sys.argv and importlib.util.find_spec("vobject") is None:
        print("skipped: the module vobject is not installed")
        sys.exit(SKIPPED)
    tool_case.main()
