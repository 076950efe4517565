"""A data directory that the tests of this folder import into."""
import contextlib
import importlib.util
import json
import pathlib
import shutil
import sqlite3
import subprocess
import sys
import tempfile
import unittest

TOOL, PYFILE, CONVERTER = sys.argv[1:4]
DONE, FAILED, USAGE, MISSING, PARTLY = range(5)
SKIPPED = 77
ALL = "contacts JOIN localizer ON contact_id = _id"


def skip_without(*modules):
    for module in modules:
        if importlib.util.find_spec(module) is None:
            print("skipped: no Python module", module)
            sys.exit(SKIPPED)


class ImportTest(unittest.TestCase):
    def setUp(self):
        self.root = pathlib.Path(tempfile.mkdtemp(prefix="qvimport_"))
        self.addCleanup(shutil.rmtree, self.root)
        self.data = self.root / "data"
        self.database = self.data / "databases/contacts2.db"

    def call(self, command, *arguments):
        return [TOOL, command, "--data-dir", str(self.data), *map(str, arguments)]

    def run_tool(self, command, *arguments, code=DONE, **options):
        process = subprocess.run(self.call(command, *arguments), capture_output=True, check=False,
                                 **options)
        process.stdout, process.stderr = process.stdout.decode(), process.stderr.decode()
        self.assertEqual(code, process.returncode, process.stdout + process.stderr)
        return process

    def make_sample(self):
        self.run_tool("sample", "--pyfile", PYFILE)
        self.run_tool("index")

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
        refused = {}
        for line in process.stderr.splitlines():
            if line.startswith(f"{shown}:"):
                number, reason = line[len(shown) + 1:].split(": refused: ")
                refused[int(number)] = reason
        self.assertEqual(numbers[3], len(refused), process.stderr)
        return numbers, refused

    def bring_lines(self, *entries, **options):
        text = "".join(json.dumps(entry) + "\n" for entry in entries)
        return self.bring(self.file("entries.jsonl", text), **options)

    def sql(self, statement, *values):
        with contextlib.closing(sqlite3.connect(self.database)) as database:
            return database.execute(statement, values).fetchall()

    def groups(self):
        return dict(self.sql("SELECT name, group_id FROM qv_imported_groups"))

    def found(self, text, *arguments):
        """The ids that a search of the index finds."""
        process = self.run_tool("search", text, "--json", "--limit", "0", "--once", *arguments)
        return {match["contact_id"] for match in json.loads(process.stdout)["steps"][-1]["matches"]}


def main():
    unittest.main(argv=sys.argv[:1] + sys.argv[4:], verbosity=2)
