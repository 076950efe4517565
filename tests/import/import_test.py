"""What an import does to a database and its index: import_test.py TOOL PYFILE CONVERTER"""
import os
import pty
import sqlite3
import subprocess

from importing import (ALL, DONE, FAILED, MISSING, PARTLY, PYFILE, USAGE, ImportTest,
                       main)

STATE = ("_id, display_name, localizerkey, group_id, account_id, hasMail, hasAddress, starred, "
         "has_phone_number, times_contacted, last_time_contacted, single_is_secret, "
         "status_update_id")


class IntoNothingTest(ImportTest):
    def test_database_and_index_are_made(self):
        counts, refused = self.bring_lines(
            {"name": " 张三 ", "uid": "u1", "phones": ["1"], "groups": ["Family", "Work"]},
            {"name": "Zoë", "mails": ["z@e"], "addresses": [" "], "starred": True},
            {"name": "\U0001f600", "addresses": ["Main St"], "groups": ["Work"]})
        self.assertEqual(([3, 0, 0, 0], {}), (counts, refused))
        rows = self.sql(f"SELECT display_name, has_phone_number, hasMail, hasAddress, starred,"
                        f" group_id FROM {ALL} WHERE _id IN (SELECT _id FROM visible_contacts)")
        self.assertEqual([("张三", 1, 0, 0, 0, "1.2"), ("Zoë", 0, 1, 0, 1, ""),
                          ("\U0001f600", 0, 0, 1, 0, "2")], rows)
        self.assertEqual({"Family": 1, "Work": 2}, self.groups())
        self.assertEqual({1}, self.found("zhangsan", "--group", "1", "--phone"))
        self.assertEqual({1, 3}, self.found("", "--group", "2"))
        self.assertEqual({"contacts2.db"}, {path.name for path in self.database.parent.iterdir()})

    def test_nothing_is_made_of_nothing(self):
        self.assertEqual([0, 0, 0, 0], self.bring_lines()[0])
        self.assertEqual([0, 0, 0, 1], self.bring_lines({}, code=PARTLY)[0])
        self.assertEqual([], list(self.database.parent.iterdir()))

    def test_what_cannot_be_taken_is_told_by_line(self):
        text = b'\xef\xbb\xbf{"name": "One"}\n\nname: Two\n["Three"]\n{"name": " "}\n' \
               b'{"name": "Fi\xffve"}\n{"name": 6}\n{"name": "7", "phones": "7"}\n' \
               b'{"name": "8", "starred": 1}\n{"name": "9\\u0000"}\n' \
               b'{"line": 70, "error": "bad\\u001b[1m"}\n{"name": "Ten", "uid": null, "x": 1}'
        counts, refused = self.bring(self.file("a.jsonl", text), code=PARTLY)
        self.assertEqual([2, 0, 0, 9], counts)
        self.assertEqual({3: "not JSON in UTF-8", 4: "not a JSON object", 5: "no name",
                          6: "not JSON in UTF-8", 7: '"name" is no text', 8: '"phones" is no list',
                          9: '"starred" is neither true nor false',
                          10: '"name" holds a zero character', 70: r"bad\x1b[1m"}, refused)
        self.assertEqual([("One",), ("Ten",)], self.sql("SELECT display_name FROM localizer"))

    def test_standard_input_and_formats(self):
        line = b'{"name": "One"}\n'
        self.assertEqual([1, 0, 0, 0], self.bring("-", input=line)[0])
        self.assertEqual([0, 0, 1, 0], self.bring(self.file("no_end", line))[0])
        self.assertEqual([1, 0, 0, 0], self.bring(self.file("b.csv", "Name\nTwo\n"))[0])
        self.assertEqual([0, 0, 1, 0], self.bring("-", input=b"Name,X\nTwo,y\n")[0])
        self.bring(self.file("c.csv", line), code=PARTLY)
        self.bring(self.file("c.csv", line), "--format", "jsonl")


class IntoSampleTest(ImportTest):
    def setUp(self):
        super().setUp()
        self.make_sample()

    def state(self, where="1"):
        return self.sql(f"SELECT {STATE} FROM {ALL} WHERE {where} ORDER BY _id")

    def test_adds_updates_and_leaves_the_rest(self):
        before = self.state()
        first, second, *_ = [row[0] for row in self.state("display_name = '张三'"
                                                          " AND _id IN visible_contacts")] + [0]
        counts, _ = self.bring_lines(
            {"name": "张三", "uid": "u1", "phones": [], "groups": ["Family"]},
            {"name": "阿不思", "uid": "u2", "mails": ["a@b"]})
        new = 1 + max(row[0] for row in before)
        self.assertEqual([1, 1, 0, 0], counts)
        old, = self.sql(f"SELECT {STATE} FROM {ALL} WHERE _id = ?", first)
        expected = list(before[[row[0] for row in before].index(first)])
        expected[3] = ".".join(filter(None, [expected[3], "7"]))  # after the sample's six groups
        expected[8] = 0
        self.assertEqual(expected, list(old))
        rest = f"_id NOT IN ({first}, {new})"
        self.assertEqual([row for row in before if row[0] != first], self.state(rest))
        self.assertEqual({new}, self.found("abusi"))
        self.assertIn(first, self.found("zs", "--group", "7"))
        self.assertNotEqual(second, first)

        counts, _ = self.bring_lines({"name": "章四", "uid": "u1", "groups": []},
                                     {"name": "阿不思", "starred": True}, {"name": "阿不思"})
        self.assertEqual([1, 2, 0, 0], counts)
        self.assertIn(first, self.found("zhangsi"))
        self.assertNotIn(first, self.found("zhangsan"))
        self.assertEqual({new}, self.found("abusi", "--starred"))
        self.assertEqual({new, new + 1}, self.found("abusi"))
        self.assertEqual(before[[row[0] for row in before].index(first)][3],
                         self.state(f"_id = {first}")[0][3])

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
            self.execute(f"DELETE FROM {table} WHERE {column} = {gone}")
        self.assertEqual([1, 0, 0, 0], self.bring_lines({"name": "Gone", "uid": "u"})[0])
        self.assertEqual([(gone + 1,)], self.sql("SELECT contact_id FROM qv_imported_uids"))

    def execute(self, statement):
        with sqlite3.connect(self.database) as database:
            database.execute(statement)
        database.close()

    def test_a_converter_that_fails_changes_nothing(self):
        converter = self.file("broken.py", 'print(\'{"name": "New"}\', flush=True)\nraise SystemExit(1)')
        cards = self.file("a.vcf", "")
        before = self.database.read_bytes()
        process = self.run_tool("import", cards, "--converter", converter, code=FAILED)
        self.assertIn("Nothing was imported", process.stderr)
        self.assertEqual(before, self.database.read_bytes())

    def test_a_database_that_another_process_writes(self):
        database = sqlite3.connect(self.database, isolation_level=None)
        self.addCleanup(database.close)
        database.execute("BEGIN IMMEDIATE")
        path = self.file("a.jsonl", '{"name": "New"}\n')
        process = self.run_tool("import", path, code=FAILED)
        self.assertIn("database is locked", process.stderr)
        database.execute("ROLLBACK")
        self.assertEqual([1, 0, 0, 0], self.bring(path)[0])


class ErrorsTest(ImportTest):
    def fails(self, code, text, *arguments, **options):
        process = self.run_tool("import", *arguments, code=code, **options)
        self.assertIn(text, process.stderr)
        self.assertEqual("", process.stdout)
        self.assertFalse(self.database.exists())

    def test_says_what_is_missing(self):
        self.fails(MISSING, "none.vcf: No such file", self.root / "none.vcf")
        self.fails(FAILED, "Is a directory", self.root)
        self.fails(USAGE, "--format", self.file("a", ""), "--format", "odt")
        self.fails(MISSING, "--converter", self.file("a.csv", ""), "--converter", "none.py")
        (self.root / "vobject.py").write_text("raise ImportError")
        environment = {**os.environ, "PYTHONPATH": str(self.root)}
        self.fails(MISSING, "apt install python3-vobject", self.file("a.vcf", ""), "--pyfile",
                   PYFILE, env=environment)


class ProgressTest(ImportTest):
    """A converter that goes on only when it is told to makes the work as long as it takes."""

    def start(self, stderr):
        gate = self.root / "gate"
        os.mkfifo(gate)
        converter = self.file("waits.py", f'print(\'{{"name": "One"}}\', flush=True)\n'
                                          f'open("{gate}").read()\n')
        process = subprocess.Popen(
            self.call("import", self.file("a.vcf", "x" * 100), "--pyfile", PYFILE, "--converter",
                      converter), stdout=subprocess.PIPE, stderr=stderr)
        self.addCleanup(process.wait)
        return process, gate

    def test_shows_a_bar_on_a_terminal_and_takes_it_away(self):
        terminal, other_end = pty.openpty()
        self.addCleanup(os.close, terminal)
        process, gate = self.start(other_end)
        shown = ""
        while "%" not in shown:
            shown += os.read(terminal, 1000).decode()
        gate.write_text("")
        self.assertRegex(shown, r"\rImporting contacts +\[[#.]{30}\] +\d+%")
        output = process.communicate()[0].decode()
        os.write(other_end, b"$")
        while "$" not in shown:
            shown += os.read(terminal, 1000).decode()
        os.close(other_end)
        self.assertRegex(shown, r"%\r +\r\$$")
        self.assertIn("1 added", output)

    def test_shows_nothing_in_a_pipe(self):
        process, gate = self.start(subprocess.PIPE)
        gate.write_text("")
        output, errors = process.communicate()
        self.assertEqual((b"", DONE), (errors, process.returncode))
        self.assertNotIn(b"\r", output)


if __name__ == "__main__":
    main()
