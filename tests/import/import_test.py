"""What an import does to a database and its index, and how vCards and CSV become contacts.

import_test.py TOOL PYFILE [--record] [TestClass...]
"""
import contextlib
import importlib.util
import os
import pathlib
import pty
import subprocess
import sys

sys.path.insert(0, str(pathlib.Path(__file__).parents[1] / "Support"))
# pylint: disable=wrong-import-position
import tool_case
from tool_case import PYFILE, SKIPPED, ToolCase

HERE = pathlib.Path(__file__).resolve().parent
CONTACTS = """contacts() {
    sql "SELECT _id, display_name, localizerkey, group_id, account_id, 'mail ' || hasMail,
        'address ' || hasAddress, 'starred ' || starred, 'phone ' || has_phone_number,
        times_contacted, last_time_contacted, single_is_secret, status_update_id
        FROM contacts JOIN localizer ON contact_id = _id ORDER BY _id"
}
"""
# A sample in a database of its own.
BRING = """bring() {
    rm -rf data
    cp "$SAMPLES/$1" .
    qvlocalize import "$@" --pyfile "$PYFILE" || echo "exit code $?"
    [ ! -e data/databases/contacts2.db ] || contacts
}
"""


class IntoSampleTest(ToolCase):
    def test_calls(self):
        self.check_transcript(HERE / "sample.txt", CONTACTS)


class ImportTest(ToolCase):
    WITH_SAMPLE = False


class CallsTest(ImportTest):
    def test_calls(self):
        self.check_transcript(HERE / "calls.txt")


class BarTest(ImportTest):
    def test_shows_a_bar_on_a_terminal_and_takes_it_away(self):
        gate = self.root / "gate"  # until it is open the converter waits
        os.mkfifo(gate)
        converter, cards = self.root / "waits.py", self.root / "a.vcf"
        converter.write_text(f'print(\'{{"name": "One"}}\', flush=True)\nopen("{gate}").read()')
        cards.write_text("x" * 100)
        terminal, other_end = pty.openpty()
        self.addCleanup(os.close, terminal)
        with subprocess.Popen(
                self.call("import", cards, "--pyfile", PYFILE, "--converter", converter),
                stdout=subprocess.PIPE, stderr=other_end) as process:
            os.close(other_end)
            shown = ""
            while "%" not in shown:
                shown += os.read(terminal, 1000).decode()
            gate.write_text("")
            with contextlib.suppress(OSError):  # the terminal's end
                while True:
                    shown += os.read(terminal, 1000).decode()
            self.assertIn(b"1 added", process.stdout.read())
        self.assertRegex(shown, r"^(\rImporting contacts +\[[#.]{30}\] +\d+%)+\r +\r$")


class SamplesTest(ImportTest):
    """Files as other programs write them, and files with faults: what becomes of them."""

    def test_samples(self):
        self.check_transcript(HERE / "files.txt", CONTACTS + BRING, SAMPLES=str(HERE / "samples"))


class CardsTest(ImportTest):
    def test_samples(self):
        self.check_transcript(HERE / "cards.txt", CONTACTS + BRING, SAMPLES=str(HERE / "samples"))


if __name__ == "__main__":
    if "CardsTest" in sys.argv and importlib.util.find_spec("vobject") is None:
        print("skipped: the module vobject is not installed")
        sys.exit(SKIPPED)
    tool_case.main()
