"""What the tests that call the tool share: SCRIPT TOOL PYFILE [ARGUMENT...]"""
import contextlib
import json
import os
import pathlib
import shutil
import sqlite3
import sys
import tempfile
import unittest

import transcript
from programs import run

TOOL, PYFILE = map(os.path.abspath, sys.argv[1:3])
SKIPPED = 77
LEAKS = pathlib.Path(__file__).resolve().parents[1] / "Tool/ncurses.supp"
os.environ["LSAN_OPTIONS"] = f"suppressions={LEAKS}:print_suppressions=0"


# What transcripts call: the tool, whose subcommands work in the directory data; its database, which
# answers a statement and holds its transaction while a command behind it runs; a command on a
# terminal of its own.
SHELL = r"""
qvlocalize() {
    local command=${1-}
    case $command in
        [a-z]*) shift; "$TOOL" "$command" --data-dir data "$@" ;;
        *) "$TOOL" "$@" ;;
    esac
}
export -f qvlocalize
sql() {
    "$PYTHON" -c '
import sqlite3, subprocess, sys
database = sqlite3.connect("data/databases/contacts2.db")
for row in database.execute(sys.argv[1]):
    print(*row, sep="|")
code = subprocess.run(["bash", "-c", "\"$@\"", "bash", *sys.argv[2:]]).returncode
database.commit()
sys.exit(code)' "$@"
}
on_terminal() {
    "$PYTHON" -c '
import pty, sys
pty.spawn(["bash", "-c", "\"$@\"; echo exit code $?", "bash", *sys.argv[1:]])' "$@" |
        sed 's/\r$//; s/\x1b/\\e/g'
}
"""


class ToolCase(unittest.TestCase):
    """Each test has a data directory of its own, with the sample and its index."""

    WITH_SAMPLE = True
    maxDiff = None

    def setUp(self):
        self.root = pathlib.Path(tempfile.mkdtemp(prefix="qvtool_"))
        self.addCleanup(shutil.rmtree, self.root)
        self.data = self.root / "data"
        if self.WITH_SAMPLE:
            self.run_tool("sample", "--pyfile", PYFILE)
            self.run_tool("index")

    @property
    def database(self):
        return self.data / "databases/contacts2.db"

    def call(self, command, *arguments):
        return [TOOL, command, "--data-dir", str(self.data), *map(str, arguments)]

    def run_tool(self, command, *arguments):
        return run(*self.call(command, *arguments))

    def check_transcript(self, path, shell="", **variables):
        transcript.check(self, path, self.root, SHELL + shell, TOOL=TOOL, PYFILE=PYFILE,
                         PYTHON=sys.executable, **variables)

    def steps(self, text, *arguments):
        """The steps of a search, with all their matches."""
        return json.loads(
            self.run_tool("search", text, "--json", "--limit", "0", *arguments))["steps"]

    def search(self, text, *arguments):
        return self.steps(text, *arguments)[-1]

    def sql(self, statement, *values):
        with contextlib.closing(sqlite3.connect(self.database)) as database, database:
            return database.execute(statement, values).fetchall()


def main():
    unittest.main(argv=[sys.argv[0], *(name for name in sys.argv[3:] if name != "--record")])
