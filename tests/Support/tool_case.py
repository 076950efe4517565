"""What the tests that call the tool share: SCRIPT TOOL PYFILE [ARGUMENT...]"""
import contextlib
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

import transcript

TOOL, PYFILE = map(os.path.abspath, sys.argv[1:3])
DONE, FAILED, USAGE, MISSING, PARTLY = range(5)
SKIPPED = 77


# The tool as transcripts call it: subcommands in the directory data.
SHELL = """qvlocalize() {
    local command=${1-}
    case $command in
        [a-z]*) shift; "$TOOL" "$command" --data-dir data "$@" ;;
        *) "$TOOL" "$@" ;;
    esac
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

    def run_tool(self, command, *arguments, code=DONE, **options):
        process = subprocess.run(self.call(command, *arguments), capture_output=True, check=False,
                                 **options)
        process.stdout, process.stderr = process.stdout.decode(), process.stderr.decode()
        self.assertEqual(code, process.returncode, (arguments, process.stdout, process.stderr))
        return process

    def check_transcript(self, path):
        transcript.check(self, path, self.root, SHELL, TOOL=TOOL, PYFILE=PYFILE)

    def refused(self, code, text, *call, **options):
        """The error output, which holds the text, of a call that prints nothing else."""
        process = self.run_tool(*call, code=code, **options)
        self.assertEqual("", process.stdout)
        self.assertIn(text, process.stderr)
        return process.stderr

    def steps(self, text, *arguments):
        """The steps of a search, with all their matches."""
        process = self.run_tool("search", text, "--json", "--limit", "0", *arguments)
        self.assertEqual("", process.stderr)
        return json.loads(process.stdout)["steps"]

    def search(self, text, *arguments):
        return self.steps(text, *arguments)[-1]

    def found(self, text, *arguments):
        return {match["contact_id"] for match in self.search(text, "--once", *arguments)["matches"]}

    def sql(self, statement, *values):
        with contextlib.closing(sqlite3.connect(self.database)) as database, database:
            return database.execute(statement, values).fetchall()


def sections(path):
    """The texts of a file by their names, each of which stands in a line behind five signs."""
    parts = re.split(r"(?m)^===== (.*)\n", path.read_text(encoding="utf-8"))
    return dict(zip(parts[1::2], parts[2::2]))


def main():
    unittest.main(argv=[sys.argv[0], *(name for name in sys.argv[3:] if name != "--record")])
