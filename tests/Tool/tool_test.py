"""Runs the built qvlocalize and checks its output, its files and its exit codes.

tool_test.py TOOL PYFILE [--record] [TestClass...]
"""
import contextlib
import math
import os
import pathlib
import re
import shutil
import sqlite3
import struct
import subprocess
import sys

sys.path.insert(0, str(pathlib.Path(__file__).parents[1] / "Support"))
# pylint: disable=wrong-import-position
import tool_case
from tool_case import DONE, FAILED, MISSING, PYFILE, TOOL, USAGE, ToolCase

TOP = pathlib.Path(__file__).resolve().parents[2]
EVERYTHING = "SELECT * FROM contacts JOIN localizer ON contact_id = _id"


class CallsTest(ToolCase):
    def test_calls(self):
        self.check_transcript(TOP / "tests/Tool/calls.txt")

    def test_errors(self):
        self.check_transcript(TOP / "tests/Tool/errors.txt")


class FilesTest(ToolCase):
    def test_sample_is_the_same_every_time_and_replaced_only_by_force(self):
        before = self.sql(EVERYTHING)
        self.run_tool("sample", "--pyfile", PYFILE, "--force")
        self.assertEqual(before, self.sql(EVERYTHING))
        self.assertEqual([self.database], list(self.database.parent.iterdir()))
        for name in ("databases", "files"):  # for their owner alone
            self.assertEqual(0o40700, (self.data / name).stat().st_mode, name)

    def test_files_are_as_the_document_tells(self):
        document = (TOP / "docs/file-formats.md").read_text(encoding="utf-8")
        contact = struct.pack("<i", self.sql("SELECT contact_id FROM localizer WHERE "
                                             "display_name = '张三'")[0][0])
        counts = {"ContactsReg": 1, "ContactsLocalizer": 1565, "pyfile": 15422}
        for name, section in re.findall(r"(?ms)^## (Contacts\w+|pyfile)(.*?)(?=^## )", document):
            end = 0
            for offset, size in re.findall(r"(?m)^\| (\d+) \| ([\d ×]+) \|", section):
                self.assertEqual(end, int(offset), name)
                end += math.prod(map(int, size.split(" × ")))
            content = (self.data / f"files/{name}.bin").read_bytes()
            self.assertEqual(counts.pop(name) * end, len(content))
            # The examples: lines of bytes, behind their offset in the record where it is not 0.
            if name == "ContactsReg":
                example = re.search(r"```\n((?:[\da-f]{2} *)+)", section).group(1)
                self.assertEqual(content, bytes.fromhex(example))
            if name == "ContactsLocalizer":
                at, = [at for at in range(0, len(content), end) if content[at:at + 4] == contact]
                lines = re.findall(r"(?m)^([\da-f]{3})((?:  ?[\da-f]{2}){16})", section)
                for offset, line in lines:
                    start = at + int(offset, 16)
                    self.assertEqual(bytes.fromhex(line), content[start:start + 16], offset)
        self.assertEqual({}, counts)


class SearchTest(ToolCase):
    def test_filters_keep_what_the_database_says(self):
        member = "'.' || group_id || '.' LIKE '%.2.%'"
        cases = {
            "--starred": "starred = 1",
            "--phone": "has_phone_number = 1",
            "--mail": "hasMail = 1",
            "--postal": "hasAddress = 1",
            "--online": "status = 'online'",
            "--group 2": member,
            "--not-group 2": f"NOT ({member})",
            "--group -1": "single_is_secret = 1",
            "--account 3": "'.' || account_id || '.' LIKE '%.3.%'",
            "--not-account 1 --not-account 2": "account_id NOT IN ('1', '2', '1.2', '2.1')",
            "--not-contact 1 --not-contact 2": "_id NOT IN (1, 2)",
            "--starred --phone --group 2": f"starred AND has_phone_number AND {member}",
        }
        for options, condition in cases.items():
            rows = self.sql(f"""SELECT _id FROM contacts JOIN localizer ON contact_id = _id
                LEFT JOIN status_updates ON status_update_data_id = status_update_id
                WHERE _id IN (SELECT _id FROM visible_contacts) AND {condition}""")
            self.assertEqual({row[0] for row in rows}, self.found("", *options.split()), options)
            self.assertTrue(rows, options)

    def test_colours_on_a_terminal_or_when_told_so(self):
        for color, variables, pipe, expected in (
                ("auto", {}, False, True), ("auto", {}, True, False),
                ("auto", {"TERM": "dumb"}, False, False), ("auto", {"TERM": ""}, False, False),
                ("auto", {"NO_COLOR": "1"}, False, False),
                ("always", {"NO_COLOR": "1"}, True, True), ("never", {}, False, False)):
            reader, writer = os.pipe() if pipe else os.openpty()
            with open(writer, "wb") as target:
                subprocess.run(self.call("search", "hj", "--type", "special", "--color", color),
                               stdout=target, check=True,
                               env={**os.environ, "TERM": "xterm", "NO_COLOR": "", **variables})
            output = ""
            with open(reader, "rb", buffering=0) as source, contextlib.suppress(OSError):
                while part := source.read(65536):  # a terminal's end is an error
                    output += part.decode()
            self.assertIn("\033[1;31m火警\033[0m" if expected else "[火警]", output,
                          (color, variables, pipe))
            self.assertEqual(expected, "\033" in output)


class NotifyTest(ToolCase):
    def test_the_next_search_shows_the_change(self):
        for change, call, search, changed in (
                ("UPDATE localizer SET (display_name, localizerkey) = (SELECT display_name, "
                 "localizerkey FROM localizer WHERE contact_id = 1) WHERE contact_id = 54",
                 "contacts 54", ["zhangsan"], {54}),
                ("", "star 6", ["zs", "--starred"], {6}),
                ("", "star 6 --off", ["zs", "--starred"], {6}),
                ("UPDATE status_updates SET status = 'online' WHERE status_update_data_id = 1005",
                 "status", ["zs", "--online"], {6}),
                ("DELETE FROM visible_contacts WHERE _id IN (1, 6)", "contacts 1 6", [""], {1, 6}),
                ("INSERT INTO visible_contacts(_id) VALUES(1), (6)", "contacts", [""], {1, 6})):
            before = self.found(*search)
            self.sql(change)
            self.run_tool("notify", *call.split())
            self.assertEqual(changed, before ^ self.found(*search), call)
        self.run_tool("show", "--set-sort-type", "time")
        self.run_tool("notify", "contacts")
        self.run_tool("notify", "time", "54", "1900000000000")
        self.assertEqual(54, self.search("")["matches"][0]["contact_id"])

    def test_tells_when_the_index_does_not_follow(self):
        self.sql("DELETE FROM localizer WHERE contact_id = 54")
        process = self.run_tool("notify", "contacts", "54", code=FAILED)
        self.assertRegex(process.stderr, r"ReadAllLocalizer(.*\n)*.*builds it anew")


class EscapesTest(ToolCase):
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

    def printed(self, *call, code=DONE):
        """What a call prints for people, as long as nothing in it is more than text."""
        process = self.run_tool(*call, code=code)
        text = process.stdout + process.stderr
        self.assertNotRegex(text, "[\0-\x09\x0b-\x1f\x7f-\x9f\u061c\u200e\u200f\u2028-\u202e"
                                  "\u2066-\u206f]", call)
        return text

    def test_names(self):
        for contact, (name, _) in enumerate(self.ESCAPED, 1):
            self.sql("UPDATE localizer SET localizerkey = ?, display_name = CAST(? AS TEXT) WHERE "
                     "contact_id = ?", "\u4f04", name, contact)
        self.run_tool("index")
        found = re.findall(r"contact [1-8] +(.*)\n",
                           self.printed("search", "e", "--once", "--limit", "0"))
        self.assertEqual(sorted(shown for _, shown in self.ESCAPED),
                         sorted(name.replace("[E]", "E") for name in found))
        self.assertIn(r"e\x1b[31m\x0a\x09\x7f", self.printed("show", "--limit", "0"))

    def test_arguments_and_paths(self):
        typed = "\x1b\x7f\x9b\u202e"
        shown = r"\x1b\x7f\u009b\u202e"
        self.data = self.data.rename(self.root / f"line\n{typed}'")
        place = rf"line\x0a{shown}'"
        for call, code, text in ((["search", typed], DONE, f'Search "{shown}"'),
                                 (["search", typed], DONE, f"> {shown}_"),
                                 (["search", "a", "--" + typed], USAGE, shown),
                                 (["search", "a", "--type", typed], USAGE, shown),
                                 (["index"], DONE, f"{place}/files:"),
                                 (["sample"], USAGE, f"{place}/databases")):
            self.assertIn(text, self.printed(*call, code=code))
        self.database.unlink()
        error = self.printed("index", code=MISSING)
        self.assertIn(f"{place}/databases", error)
        advised = re.search(r"--data-dir (.*)", error).group(1)
        self.assertEqual(str(self.data), subprocess.run(
            ["bash", "-c", "printf %s " + advised], capture_output=True, encoding="utf-8",
            check=True).stdout)


class CompletionTest(ToolCase):
    """The completions of bash and zsh, run without a terminal, offer what the help tells."""

    WITH_SAMPLE = False
    RUN = {
        "bash": """. "$0"/qvlocalize.bash; COMP_WORDS=("$@"); COMP_CWORD=$(($# - 1))
            _qvlocalize "$1" "${COMP_WORDS[COMP_CWORD]}" "${COMP_WORDS[COMP_CWORD - 1]}"
            printf '%s\\n' "${COMPREPLY[@]}" """,
        "zsh": """compset() {}; compadd() { print -rl -- ${(M)@[2,-1]:#$words[CURRENT]*} }
            _files() { [[ $1 == -/ ]] && print -rl -- *(/) || print -rl -- * }
            directory=$0; words=("$@"); CURRENT=$#; . $directory/_qvlocalize""",
    }
    OFFERED = [
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

    def test_shells(self):
        (self.root / "a-file").touch()
        (self.root / "a-place").mkdir()
        for shell, flag in (("bash", "--norc"), ("zsh", "-f")):
            for words, expected in self.OFFERED if shutil.which(shell) else []:
                process = subprocess.run(
                    [shell, flag, "-c", self.RUN[shell], TOP / "tools/completion", TOOL, *words],
                    cwd=self.root, capture_output=True, encoding="utf-8", check=False)
                self.assertEqual((expected, ""), (set(process.stdout.split()), process.stderr),
                                 (shell, words))


class LockedTest(ToolCase):
    def test_a_database_that_another_process_holds(self):
        with contextlib.closing(sqlite3.connect(self.database)) as database:
            database.execute("BEGIN EXCLUSIVE")
            self.refused(FAILED, "the database cannot be read: database is locked", "search", "")
        self.run_tool("search", "a")


if __name__ == "__main__":
    tool_case.main()
