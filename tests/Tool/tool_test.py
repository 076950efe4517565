"""Runs the built qvlocalize and checks its output, its files and its exit codes.

tool_test.py TOOL PYFILE [--record] [TestClass...]
"""
import math
import pathlib
import re
import shutil
import struct
import sys

sys.path.insert(0, str(pathlib.Path(__file__).parents[1] / "Support"))
# pylint: disable=wrong-import-position
import tool_case
from tool_case import ToolCase

TOP = pathlib.Path(__file__).resolve().parents[2]
HERE = TOP / "tests/Tool"


class CallsTest(ToolCase):
    def test_calls(self):
        self.check_transcript(HERE / "calls.txt")

    def test_errors(self):
        self.check_transcript(HERE / "errors.txt")

    def test_changes(self):
        self.check_transcript(HERE / "changes.txt")

    def test_escapes(self):
        hexadecimal = "$(printf %s \"$2\" | od -An -v -tx1 | tr -d ' \\n')"
        self.check_transcript(HERE / "escapes.txt", f"""rename() {{
            sql "UPDATE localizer SET display_name = CAST(x'{hexadecimal}' AS TEXT),
                 localizerkey = '\u4f04' WHERE contact_id = $1"; }}
            """)


class FilesTest(ToolCase):
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


class FilterTest(ToolCase):
    def test_filters_keep_what_the_database_says(self):
        self.check_transcript(HERE / "filters.txt", """kept() {
            sql "SELECT _id FROM visible_contacts JOIN contacts USING (_id)
                 JOIN localizer ON contact_id = _id LEFT JOIN status_updates
                 ON status_update_data_id = status_update_id WHERE $1" | sort >told
            qvlocalize search '' --plain "${@:2}" | cut -f 1 | sort | diff told - && wc -l <told; }
            """)


class CompletionTest(ToolCase):
    """The completions of bash and zsh, run without a terminal, offer what the help tells."""

    WITH_SAMPLE = False
    SHELLS = {
        "bash --norc": """. "$0"/qvlocalize.bash; COMP_WORDS=("$@"); COMP_CWORD=$(($# - 1))
            _qvlocalize "$1" "${COMP_WORDS[COMP_CWORD]}" "${COMP_WORDS[COMP_CWORD - 1]}"
            printf '%s\\n' "${COMPREPLY[@]}" """,
        "zsh -f": """compset() {}; compadd() { print -rl -- ${(M)@[2,-1]:#$words[CURRENT]*} }
            _files() { [[ $1 == -/ ]] && print -rl -- *(/) || print -rl -- * }
            directory=$0; words=("$@"); CURRENT=$#; . $directory/_qvlocalize""",
    }

    def test_shells(self):
        for call, script in self.SHELLS.items():
            if shutil.which(call.split()[0]):
                self.check_transcript(
                    HERE / "completion.txt",
                    f"""offered() {{
                        {call} -c "$SCRIPT" "$TOP"/tools/completion "$TOOL" "$@" | grep . | sort
                    }}""", SCRIPT=script, TOP=str(TOP))


if __name__ == "__main__":
    tool_case.main()
