"""Runs the built qvlocalize and checks its output, its files and its exit codes.

tool_test.py TOOL PYFILE [TestClass...]
"""
import contextlib
import fcntl
import json
import os
import pathlib
import re
import shutil
import sqlite3
import subprocess
import sys
import tempfile
import unittest

TOOL, PYFILE = map(os.path.abspath, sys.argv[1:3])
DONE, FAILED, USAGE, MISSING = 0, 1, 2, 3
PY_RECORD_SIZE = 46
HANZI_BASE = 0x1000


def run(directory, command, *arguments):
    """The finished process of one call of the tool on a data directory."""
    call = [TOOL, command, "--data-dir", str(directory), *arguments]
    return subprocess.run(call, capture_output=True, encoding="utf-8", check=False)


def make_sample(directory):
    for call in (["sample", "--pyfile", PYFILE], ["index"]):
        process = run(directory, *call)
        assert process.returncode == DONE, process.stderr


class ToolTest(unittest.TestCase):
    """A directory with the sample and its index, made once for a class."""

    @classmethod
    def setUpClass(cls):
        cls.root = pathlib.Path(tempfile.mkdtemp(prefix="qvtool_"))
        cls.addClassCleanup(shutil.rmtree, cls.root)
        cls.data = cls.root / "data"
        make_sample(cls.data)

    def check(self, command, *arguments, code=DONE):
        process = run(self.data, command, *arguments)
        self.assertEqual(code, process.returncode, process.stderr)
        return process

    def search(self, text, *arguments):
        """The JSON document of a search with all matches."""
        process = self.check("search", text, "--json", "--limit", "0", *arguments)
        self.assertEqual("", process.stderr)
        return json.loads(process.stdout)

    def last_step(self, text, *arguments):
        return self.search(text, *arguments)["steps"][-1]

    def sql(self, statement):
        with contextlib.closing(sqlite3.connect(self.data / "databases/contacts2.db")) as database:
            return database.execute(statement).fetchall()


class SampleTest(ToolTest):
    def test_keys_are_the_codes_of_the_folded_names(self):
        table = pathlib.Path(PYFILE).read_bytes()
        words = [table[i:i + 3].decode() for i in range(0, len(table), PY_RECORD_SIZE)]
        zhang, san, feng = (chr(HANZI_BASE + words.index(word)) for word in "张三丰")
        expected = {"张三": zhang + san, "張三豐": zhang + san + feng, "": "",
                    "Tom 2": "\u4f13\u4f0e\u4f0c\u5000\u5a02", "Zoë": "\u4f19\u4f0e\u5000"}
        for name, key in expected.items():
            found = self.sql(f"SELECT DISTINCT localizerkey FROM localizer"
                             f" WHERE display_name = '{name}'")
            self.assertEqual([(key,)], found, name)

    def test_is_the_same_every_time_and_replaced_only_by_force(self):
        before = self.sql("SELECT * FROM contacts JOIN localizer ON contact_id = _id")
        process = self.check("sample", "--pyfile", PYFILE, code=USAGE)
        self.assertIn("--force", process.stderr)
        self.check("sample", "--pyfile", PYFILE, "--force")
        self.assertEqual(before, self.sql("SELECT * FROM contacts JOIN localizer"
                                          " ON contact_id = _id"))
        files = {path.name for path in (self.data / "databases").iterdir()}
        self.assertEqual({"contacts2.db"}, files)

    def test_keeps_what_is_readable_for_all_in_directories_of_its_owner(self):
        for name in ("databases", "files"):
            self.assertEqual(0o40700, (self.data / name).stat().st_mode, name)


class IndexTest(ToolTest):
    def test_shows_phases_and_files(self):
        output = self.check("index").stdout
        for phase in ("copy the pinyin table", "read the database", "spell and sort the names",
                      "write the store"):
            self.assertRegex(output, rf"{phase} +\d+ ms\n")
        visible = self.sql("SELECT count(*) FROM visible_contacts")[0][0]
        self.assertIn(f"{visible} contacts, room for {visible + 1000}\n", output)
        for name in ("PyFileMappint.bin", "ContactsLocalizer.bin", "ContactsReg.bin",
                     "memlock.ini"):
            size = (self.data / "files" / name).stat().st_size
            self.assertRegex(output, rf"{re.escape(name)} +{size} bytes\n")

    def test_leaves_an_index_that_is_there_if_told_so(self):
        records = self.data / "files/ContactsLocalizer.bin"
        before = records.stat().st_mtime_ns
        self.assertIn("there already", self.check("index", "--if-needed").stdout)
        self.assertEqual(before, records.stat().st_mtime_ns)


class SearchTest(ToolTest):
    def marked(self, text, *arguments):
        return [match["marked"] for match in self.last_step(text, *arguments)["matches"]]

    def test_marks_what_matched(self):
        cases = [
            (["zhangsan"], ["[张三]", "[張三]豐", "李[张三]", "[章三]"]),
            (["tom#2"], ["[Tom 2]"]),
            (["wangli"], ["[王Li]"]),
            (["926454", "--type", "num"], ["[王Li]"]),
            (["chan"], ["[单]田芳", "[长]孙无忌"]),
        ]
        for arguments, expected in cases:
            found = self.marked(*arguments)
            for name in expected:
                self.assertIn(name, found, arguments)

    def test_searches_key_by_key(self):
        document = self.search("zhan")
        self.assertEqual(["z", "zh", "zha", "zhan"], [step["typed"] for step in document["steps"]])
        last = document["steps"][-1]
        self.assertIn("张", last["candidates"])
        self.assertIn("g", last["next_keys"])
        self.assertNotIn("n", last["next_keys"])
        self.assertEqual(last["total"], len(last["matches"]))
        self.assertEqual(1, document["version"])
        once = self.search("zhan", "--once")["steps"]
        self.assertEqual(["zhan"], [step["typed"] for step in once])

    def test_filters_keep_what_the_database_says(self):
        member = "'.' || group_id || '.' LIKE '%.2.%'"
        cases = [
            (["--starred"], "starred = 1"),
            (["--phone"], "has_phone_number = 1"),
            (["--mail"], "hasMail = 1"),
            (["--postal"], "hasAddress = 1"),
            (["--online"], "status = 'online'"),
            (["--group", "2"], member),
            (["--not-group", "2"], f"NOT ({member})"),
            (["--group", "-1"], "single_is_secret = 1"),
            (["--account", "3"], "'.' || account_id || '.' LIKE '%.3.%'"),
            (["--not-account", "1", "--not-account", "2"],
             "account_id NOT IN ('1', '2', '1.2', '2.1')"),
            (["--not-contact", "1", "--not-contact", "2"], "_id NOT IN (1, 2)"),
            (["--starred", "--phone", "--group", "2"],
             f"starred = 1 AND has_phone_number = 1 AND {member}"),
        ]
        for arguments, condition in cases:
            rows = self.sql(f"""SELECT _id FROM contacts JOIN localizer ON contact_id = _id
                LEFT JOIN status_updates ON status_update_data_id = status_update_id
                WHERE _id IN (SELECT _id FROM visible_contacts) AND {condition}""")
            found = {match["contact_id"] for match in self.last_step("", *arguments)["matches"]}
            self.assertEqual({row[0] for row in rows}, found, arguments)
            self.assertTrue(found, arguments)

    def test_special_numbers_need_no_contacts_and_take_no_filters(self):
        everything = self.last_step("", "--type", "special", "--starred")
        self.assertEqual(list(range(7)), [match["contact_id"] for match in everything["matches"]])
        self.assertEqual("火警", everything["matches"][3]["name"])
        self.assertEqual(["[火警]"], self.marked("hj", "--type", "special")[:1])

    def test_text_for_people(self):
        output = self.check("search", "zs", "--limit", "1").stdout
        total = self.last_step("zs")["total"]
        self.assertIn(f"> zs_   {total} matches\n", output)
        self.assertRegex(output, r" 1\.  contact \d+ +\S*\[\S+\]\S*\n")
        self.assertIn(f"and {total - 1} more\n", output)
        self.assertIn("> qqq_   0 matches\n", self.check("search", "qqq").stdout)

    def test_plain_form_has_the_matches_of_the_whole_text(self):
        for text, arguments in (("zs", []), ("zs", ["--limit", "2"]), ("", []), ("qqq", [])):
            matches = self.last_step(text, "--once")["matches"]
            if arguments:
                del matches[2:]
            self.assertEqual("".join(f"{match['contact_id']}\t{match['name']}\n"
                                     for match in matches),
                             self.check("search", text, "--plain", *arguments).stdout)

    def test_keypad_search_names_keys(self):
        keys = {letter: key for key, letters in
                zip("23456789", "abc def ghi jkl mno pqrs tuv wxyz".split()) for letter in letters}
        for text in ("", "94", "926454"):
            step = self.last_step(text, "--type", "num", "--once")
            letters = [chr(ord("a") + bit) for bit in range(26) if step["mask"] >> bit & 1]
            other = ["#"] if step["mask"] >> 26 else []
            self.assertEqual(sorted({keys[letter] for letter in letters}) + other,
                             step["next_keys"])
            self.assertIn("next character: " + (" ".join(step["next_keys"]) or "none") + "\n",
                          self.check("search", text, "--type", "num", "--once").stdout)

    def test_hints_at_the_other_kind_of_search(self):
        for text, arguments, hint in (("94264", [], "add --type num"), ("t2", ["--plain"], "add"),
                                      ("zs", ["--type", "num"], "leave --type num out"),
                                      ("94264", ["--type", "num"], ""), ("t#", [], ""),
                                      ("94264", ["--json"], "")):
            error = self.check("search", text, *arguments).stderr
            self.assertEqual(bool(hint), error.startswith("Hint: "), (text, arguments, error))
            self.assertIn(hint, error)

    def test_colours_on_a_terminal_or_when_told_so(self):
        terminal = {"TERM": "xterm"}
        for color, variables, pipe, expected in (
                ("auto", terminal, False, True), ("auto", terminal, True, False),
                ("auto", {"TERM": "dumb"}, False, False), ("auto", {}, False, False),
                ("auto", {**terminal, "NO_COLOR": "1"}, False, False),
                ("auto", {**terminal, "NO_COLOR": ""}, False, True),
                ("always", {"NO_COLOR": "1"}, True, True), ("never", terminal, False, False)):
            output = self.output_to(pipe, variables, "search", "hj", "--type", "special",
                                    "--color", color)
            self.assertIn("\033[1;31m火警\033[0m" if expected else "[火警]", output,
                          (color, variables, pipe))
            self.assertEqual(expected, "\033" in output)

    def output_to(self, pipe, variables, *call):
        """What a call prints into a pipe or on a terminal."""
        try:
            reader, writer = os.pipe() if pipe else os.openpty()
        except OSError as error:
            self.skipTest(f"no terminal to be had: {error}")
        with open(reader, "rb") as source:
            with open(writer, "wb") as target:
                subprocess.run([TOOL, *call, "--data-dir", str(self.data)], stdout=target,
                               env={**os.environ, "TERM": "", "NO_COLOR": "", **variables},
                               check=True)
                return os.read(source.fileno(), 65536).decode()


class ShowTest(ToolTest):
    def test_shows_the_registration_record_and_the_records(self):
        output = self.check("show", "--limit", "3").stdout
        visible = self.sql("SELECT count(*) FROM visible_contacts")[0][0]
        self.assertRegex(output, rf"iTotalNum +{visible} ")
        self.assertRegex(output, r"iSortType +0 \(name order\)")
        self.assertRegex(output, rf"iMemSize +{visible + 1000} ")
        self.assertEqual(["0", "1", "2"], re.findall(r"(?m)^ +(\d+) +\d+  \S{6} ", output))
        letters = set("".join(re.findall(r"(?m)^ +\d+ +\d+  (\S{6}) ",
                                         self.check("show", "--limit", "0").stdout)))
        legend = re.search(r"(?m)^ +flags +(.*)$", output).group(1)
        self.assertEqual(letters - {"-"}, {entry[0] for entry in legend.split(", ")})

    def test_time_order_begins_with_the_latest(self):
        self.addCleanup(self.check, "index")
        self.addCleanup(self.check, "show", "--set-sort-type", "name", "--limit", "1")
        output = self.check("show", "--set-sort-type", "time", "--limit", "1").stdout
        self.assertRegex(output, r"iSortType +1 .*\n +iMemSize +0 ")
        self.check("index")
        step = self.last_step("")
        times = [match["last_time_contacted"] for match in step["matches"]]
        self.assertEqual(sorted(times, reverse=True), times)
        self.assertLessEqual(set(step["sections"]), set("12345-"))
        by_name = self.check("show", "--sort-type", "name", "--limit", "2").stdout
        self.assertEqual(["0", "1"], re.findall(r"(?m)^ +(\d+) +\d+  \S{6} ", by_name))


class NotifyTest(ToolTest):
    """A sample for every test: each changes it."""

    def setUp(self):
        super().setUp()
        self.data = pathlib.Path(tempfile.mkdtemp(dir=self.root))
        make_sample(self.data)

    def change(self, statement):
        with contextlib.closing(sqlite3.connect(self.data / "databases/contacts2.db")) as database:
            database.execute(statement)
            database.commit()

    def notify(self, *arguments):
        return self.check("notify", *arguments).stdout

    def found(self, text, *arguments):
        return {match["contact_id"]
                for match in self.last_step(text, "--once", *arguments)["matches"]}

    def test_the_next_search_shows_the_change(self):
        self.change("UPDATE localizer SET (display_name, localizerkey) = (SELECT display_name, "
                    "localizerkey FROM localizer WHERE contact_id = 1) WHERE contact_id = 54")
        self.assertNotIn(54, self.found("zhangsan"))
        self.assertEqual("The index holds 565 contacts, with room for 1565\n",
                         self.notify("contacts", "54"))
        self.assertIn(54, self.found("zhangsan"))
        self.assertNotIn(54, self.found("tom"))

        self.assertNotIn(6, self.found("zs", "--starred"))
        self.notify("star", "6")
        self.assertIn(6, self.found("zs", "--starred"))
        self.notify("star", "6", "--off")
        self.assertNotIn(6, self.found("zs", "--starred"))

        self.change("UPDATE status_updates SET status = 'online' "
                    "WHERE status_update_data_id = 1005")
        self.notify("status")
        self.assertIn(6, self.found("zs", "--online"))

    def test_contacts_come_and_go(self):
        everybody = self.found("")
        self.change("DELETE FROM visible_contacts WHERE _id IN (1, 6)")
        self.assertIn("holds 563 contacts, with room for 1565", self.notify("contacts", "1", "6"))
        self.assertEqual(everybody - {1, 6}, self.found(""))
        self.change("INSERT INTO visible_contacts(_id) VALUES(1), (6)")
        self.assertIn("holds 565 contacts, with room for 1565", self.notify("contacts"))
        self.assertEqual(everybody, self.found(""))

    def test_the_last_contacted_comes_first(self):
        self.check("show", "--set-sort-type", "time")
        self.notify("contacts")
        self.notify("time", "54", "1900000000000")
        self.assertEqual(54, self.last_step("", "--once")["matches"][0]["contact_id"])

    def test_tells_when_the_index_does_not_follow(self):
        self.change("DELETE FROM localizer WHERE contact_id = 54")
        process = self.check("notify", "contacts", "54", code=FAILED)
        self.assertIn("ReadAllLocalizer", process.stderr)
        self.assertIn("builds it anew", process.stderr)

    def test_wrong_use(self):
        for arguments, text in (([], "required"), (["nothing"], 'unknown subcommand "nothing"'),
                                (["star"], "required"), (["star", "0"], "from 1 to 2147483647"),
                                (["time", "5"], "required"), (["contacts", "1", "x"], '"x" is not'),
                                (["time", "5", "-9"], "from 0 to 253402300799999"),
                                (["status", "5"], "not expected: 5"),
                                (["status", "--on"], "--on is not an option of notify")):
            self.assertIn(text, self.check("notify", *arguments, code=USAGE).stderr)
        (self.data / "files/ContactsReg.bin").unlink()
        self.check("notify", "status", code=MISSING)
        (self.data / "databases/contacts2.db").unlink()
        self.check("notify", "status", code=MISSING)


class EscapesTest(ToolTest):
    """Texts of others reach the terminal with their control characters escaped."""

    ESCAPED = [  # of a name, and what people see of it
        ("E\x1b[31m\n\t\x7f", r"E\x1b[31m\x0a\x09\x7f"),
        ("E\x85\x9b\u061c\u200e\u200f", r"E\u0085\u009b\u061c\u200e\u200f"),
        ("E\u2028\u2029\u202a\u202e", r"E\u2028\u2029\u202a\u202e"),
        ("E\u2066\u2069\u206f", r"E\u2066\u2069\u206f"),
        ("E\\x1b 张\u3000\xa0\xad", "E\\x1b 张\u3000\xa0\xad"),
        (b"E.\x80\xc3\xe5\xbc.", r"E.\x80\xc3\xe5\xbc."),
        (b"E\xc1\x9b\xed\xa0\x80\xe0\x9f\xbf", r"E\xc1\x9b\xed\xa0\x80\xe0\x9f\xbf"),
        (b"E\xf0\x9f\x98\x80\xf4\x90\x80\x80\xf8", "E\U0001f600" + r"\xf4\x90\x80\x80\xf8"),
    ]

    @classmethod
    def setUpClass(cls):
        super().setUpClass()
        with contextlib.closing(sqlite3.connect(cls.data / "databases/contacts2.db")) as database:
            for contact, (name, _) in enumerate(cls.ESCAPED, 1):
                database.execute("UPDATE localizer SET localizerkey = ?, display_name = "
                                 "CAST(? AS TEXT) WHERE contact_id = ?",
                                 ("\u4f04", name, contact))
            database.commit()
        assert run(cls.data, "index").returncode == DONE

    def printed(self, *call, code=DONE):
        """What a call prints for people, as long as nothing in it is more than text."""
        process = self.check(*call, code=code)
        text = process.stdout + process.stderr
        self.assertNotRegex(text, "[\0-\x09\x0b-\x1f\x7f-\x9f\u061c\u200e\u200f\u2028-\u202e"
                                  "\u2066-\u206f]", call)
        return text

    def test_names(self):
        found = re.findall(r"contact [1-8] +(.*)\n",
                           self.printed("search", "e", "--once", "--limit", "0"))
        self.assertEqual(sorted(shown for _, shown in self.ESCAPED),
                         sorted(name.replace("[E]", "E") for name in found))
        self.assertIn(r"e\x1b[31m\x0a\x09\x7f", self.printed("show", "--limit", "0"))

    def test_arguments_and_paths(self):
        typed = "\x1b\x7f\x9b\u202e"
        shown = r"\x1b\x7f\u009b\u202e"
        self.assertIn(f'Search "{shown}"', self.printed("search", typed))
        self.assertIn(f"> {shown}_", self.printed("search", typed))
        self.assertIn(shown, self.printed("search", "a", "--" + typed, code=USAGE))
        self.assertIn(shown, self.printed("search", "a", "--type", typed, code=USAGE))
        data = self.root / f"line\n{typed}'"
        shutil.copytree(self.data, data)
        self.addCleanup(setattr, self, "data", self.data)
        self.data = data
        self.assertIn(rf"line\x0a{shown}'/files:", self.printed("index"))
        self.assertIn(rf"line\x0a{shown}'/databases", self.printed("sample", code=USAGE))
        (data / "databases/contacts2.db").unlink()
        error = self.printed("index", code=MISSING)
        self.assertIn(rf"line\x0a{shown}'/databases", error)
        advised = re.search(r"--data-dir (.*)", error).group(1)
        self.assertEqual(str(data), subprocess.run(["bash", "-c", "printf %s " + advised],
                                                   capture_output=True, encoding="utf-8",
                                                   check=True).stdout)


class CompletionTest(unittest.TestCase):
    """The completions of bash and zsh, run without a terminal."""

    FILES = pathlib.Path(__file__).resolve().parents[2] / "tools/completion"
    RUN = {
        "bash": """. "$0"/qvlocalize.bash; COMP_WORDS=("$@"); COMP_CWORD=$(($# - 1))
            _qvlocalize "$1" "${COMP_WORDS[COMP_CWORD]}" "${COMP_WORDS[COMP_CWORD - 1]}"
            printf '%s\\n' "${COMPREPLY[@]}" """,
        "zsh": """compset() {}; compadd() { print -rl -- ${(M)@[2,-1]:#$words[CURRENT]*} }
            _files() { [[ $1 == -/ ]] && print -rl -- *(/) || print -rl -- * }
            directory=$0; words=("$@"); CURRENT=$#; . $directory/_qvlocalize""",
    }

    def complete(self, shell, *words):
        with tempfile.TemporaryDirectory(prefix="qvtool_") as place:
            pathlib.Path(place, "a-file").touch()
            pathlib.Path(place, "a-place").mkdir()
            flags = ["-f"] if shell == "zsh" else ["--norc"]
            process = subprocess.run([shell, *flags, "-c", self.RUN[shell], str(self.FILES), TOOL,
                                      *words], cwd=place, capture_output=True, encoding="utf-8",
                                     check=False)
        self.assertEqual("", process.stderr)
        return set(process.stdout.split())

    def test_offers_what_the_help_tells(self):
        cases = [
            (["s"], {"sample", "search", "show"}),
            (["notify", "s"], {"star", "status"}),
            (["--"], {"--help", "--version"}),
            (["search", "zs", "--p"], {"--phone", "--plain", "--postal"}),
            (["notify", "star", "--"], {"--data-dir", "--help", "--off"}),
            (["search", "--color", "a"], {"auto", "always"}),
            (["show", "--sort-type", ""], {"name", "time"}),
            (["sample", "--pyfile", ""], {"a-file", "a-place"}),
            (["sample", "--data-dir", ""], {"a-place"}),
            (["show", "--limit", ""], set()),
            (["search", ""], set()),
        ]
        for shell in ("bash", "zsh"):
            if shutil.which(shell):
                for words, expected in cases:
                    self.assertEqual(expected, self.complete(shell, *words), (shell, words))


class ErrorsTest(ToolTest):
    def fails(self, directory, code, text, command, *arguments):
        process = run(directory, command, *arguments)
        self.assertEqual(code, process.returncode, (command, arguments, process.stderr))
        self.assertIn(text, process.stderr)
        self.assertEqual("", process.stdout)

    def test_says_what_is_missing_and_what_makes_it(self):
        empty = self.root / "it's empty"
        advice = f"qvlocalize sample --data-dir '{self.root}/it'\\''s empty'"
        self.fails(empty, MISSING, advice, "index")
        self.fails(empty, MISSING, advice, "search", "a")
        self.fails(empty, MISSING, "qvlocalize index --data-dir", "show")
        unindexed = self.root / "unindexed"
        shutil.copytree(self.data, unindexed)
        (unindexed / "files/ContactsReg.bin").unlink()
        self.fails(unindexed, MISSING, f"qvlocalize index --data-dir {unindexed}\n", "search", "a")
        (unindexed / "files/pyfile.bin").unlink()
        self.fails(unindexed, MISSING, "there is no pinyin table", "index")
        self.fails(empty, MISSING, "--pyfile", "sample", "--pyfile", str(self.root / "none"))

    def test_refuses_a_pinyin_table_of_another_size(self):
        data = self.root / "table"
        shutil.copytree(self.data, data)
        table = data / "files/pyfile.bin"
        for content in (table.read_bytes()[:-1], table.read_bytes() + b"0", b""):
            table.write_bytes(content)
            text = f"it has {len(content)} bytes, a pinyin table has 709412"
            before = [path.read_bytes() for path in sorted(data.rglob("*.bin"))]
            self.fails(data, FAILED, text, "index")
            self.fails(data, FAILED, text, "sample", "--force", "--pyfile", str(table))
            self.assertEqual(before, [path.read_bytes() for path in sorted(data.rglob("*.bin"))])

    def test_refuses_what_cannot_be_searched(self):
        self.fails(self.data, USAGE, "11 characters; a search takes at most 10", "search",
                   "abcdefghijk")
        self.fails(self.data, USAGE, "beyond U+FFFF", "search", "\U0001F600")
        self.fails("x" * 4001, USAGE, "too long", "search", "a")

    def test_refuses_a_wrong_command_line_by_name(self):
        for call, text in (
                (["serch", "a"], 'unknown subcommand "serch"; there are sample, import, index, search'),
                (["--data-dir", "x", "search", "a"], "--data-dir is not an option of qvlocalize;"),
                (["search", "a", "--count", "1"], "--count is not an option of search"),
                (["search", "a", "b"], "not expected: b"),
                (["search", "a", "--type", "letters"], "--type: letters not in {word,num,special}"),
                (["search", "a", "--limit", "-1"], '"-1" is not a whole number from 0 to 21'),
                (["search", "a", "--group", "4294967297"], '--group: "4294967297" is not a whole'),
                (["search", "a", "--plain", "--json"], "--json excludes --plain"),
                (["sample", "--count", "200001"], "--count: \"200001\" is not a whole number from 1"
                                                  " to 200000"),
                (["sample", "--now", "1e3"], '"1e3" is not a whole number from 0 to'),
                ([], "required")):
            process = subprocess.run([TOOL, *call], capture_output=True, encoding="utf-8",
                                     check=False)
            self.assertEqual((USAGE, ""), (process.returncode, process.stdout), call)
            self.assertRegex(process.stderr, r"\Aqvlocalize: .*\nRun with --help .*\n\Z")
            self.assertIn(text, process.stderr)

    def test_tells_what_is_damaged(self):
        special = ("search", "hj", "--type", "special")
        reg, records, database = "ContactsReg.bin", "ContactsLocalizer.bin", "contacts2.db"
        cases = [  # a file, what becomes of it, and what each call says of it
            (reg, b"abc", {("show",): "could not be read", ("search", "a"): "could not be read"}),
            (reg, b"\xff" * 12, {("show",): "the index is damaged"}),
            (records, None, {("show",): "is damaged", ("search", "a"): "is damaged",
                             ("notify", "star", "5"): "is damaged"}),
            ("PyFileMappint.bin", b"abc", {special: "index's pinyin table",
                                           ("search", "a"): "index's pinyin table"}),
            (database, b"no database", {
                ("index",): "ReadAllLocalizer select contacts count sqlite3_prepare ERROR",
                ("search", "a"): "not a contacts database: file is not a database"}),
            (database, b"", {("search", "a"): "not a contacts database: no such table"}),
        ]
        for name, content, calls in cases:
            data = self.root / "damaged"
            shutil.copytree(self.data, data)
            path, = data.glob(f"*/{name}")
            path.unlink()
            if content is not None:
                path.write_bytes(content)
            for call, text in calls.items():
                self.fails(data, FAILED, text, *call)
            if name in (reg, records):
                self.assertIn("Index built", run(data, "index", "--if-needed").stdout)
                self.assertEqual(DONE, run(data, "show").returncode)
            shutil.rmtree(data)

    def test_a_lock_file_that_is_none_and_a_busy_database(self):
        data = self.root / "locks"
        shutil.copytree(self.data, data)
        with contextlib.closing(sqlite3.connect(data / "databases/contacts2.db")) as database:
            database.execute("BEGIN EXCLUSIVE")
            self.fails(data, FAILED, "the database cannot be read: database is locked", "search", "")
        (data / "files/memlock.ini").unlink()
        (data / "files/memlock.ini").mkdir()
        self.fails(data, FAILED, "the lock file cannot be opened", "search", "")

    def test_output_that_cannot_be_written(self):
        for call in (["search", "zs"], ["search", "zs", "--json"], ["--help"], ["index"]):
            data = [] if call == ["--help"] else ["--data-dir", str(self.data)]
            for close, target in (("", "/dev/full"), (">&-", "/dev/null")):
                with open(target, "wb") as output:
                    process = subprocess.run(
                        ["bash", "-c", f'"$0" "$@" {close}', TOOL, *call, *data], stdout=output,
                        stderr=subprocess.PIPE, encoding="utf-8", check=False)
                self.assertEqual((FAILED, "qvlocalize: the output could not be written\n"),
                                 (process.returncode, process.stderr), (call, target))

    def test_a_store_that_another_process_holds(self):
        with open(self.data / "files/memlock.ini", "ab") as lock:
            fcntl.flock(lock, fcntl.LOCK_EX)
            self.fails(self.data, FAILED, "(result -1): another process holds the store\n"
                       "  QV_Contacts:InitContactRecord write share memo lock", "index")
            self.fails(self.data, FAILED, "the index could not be read", "search", "a", "--json")
            self.fails(self.data, FAILED, "another process holds the store", "show")
        self.check("search", "a")


if __name__ == "__main__":
    unittest.main(argv=[sys.argv[0], *sys.argv[3:]])
