"""The table of folding and the syllables, read without the programs that build them; and what those
programs make, derive and refuse.

tables_test.py PYFILE TestClass...
"""
import bz2
import pathlib
import re
import sys
import tempfile
import unittest

ROOT = pathlib.Path(__file__).resolve().parents[2]
sys.path[:0] = [str(ROOT / "data/derive"), str(ROOT / "tests/Support")]
# pylint: disable=wrong-import-position
import derive_folding
import derive_pinyin
import transcript
import unihan
from syllables import SYLLABLES

PYFILE = pathlib.Path(sys.argv[1]).resolve()
UNIHAN = pathlib.Path("/usr/share/unicode")
SKIPPED = 77
MOVED = "桔杰捷睫竭洁结解姐戒藉芥界借介疥诫届巾筋斤金今津襟紧锦仅谨进靳晋禁近烬浸尽劲荆兢"
MOVED_TO = 1361
# GB 2312 holds 後 though its standard has 后; 矽 is the element that the mainland calls 硅.
FOLDED_ON_PURPOSE = {"後": "后", "矽": "硅"}
# Traditional forms that Big5 does not hold, of characters that it does not hold either.
OUTSIDE_BIG5 = {"釺", "鍁"}


def rows(text):
    return [line.split("\t") for line in text.splitlines() if not line.startswith("#")]


def gb2312(first_row, last_row):
    """The characters of those rows of GB 2312 in code order."""
    cells = (bytes((row + 0xA0, cell + 0xA0)).decode("gb2312", "ignore")
             for row in range(first_row, last_row + 1) for cell in range(1, 95))
    return [char for char in cells if char]


def folding(table):
    """What each traditional character folds to: its first row decides."""
    return dict(reversed(table))


class TablesTest(unittest.TestCase):
    FOLDING = rows((ROOT / "data/folding.tsv").read_text(encoding="utf-8"))

    def test_syllables(self):
        self.assertEqual(416, len(SYLLABLES))
        self.assertEqual(sorted(set(SYLLABLES)), list(SYLLABLES))
        source = (ROOT / "LocalizerImpl/Syllables.cpp").read_text(encoding="utf-8")
        self.assertEqual(list(SYLLABLES), re.findall(r'L"([a-z]+)"', source))

    def test_folding_rows_are_in_the_order_of_gb_2312(self):
        column = "".join(folded for _, folded in self.FOLDING)
        self.assertEqual(MOVED_TO, column.find(MOVED))
        for found, standard in ((MOVED, ""), ("冲冲", "冲"), ("掐洽", "掐恰洽"),
                                ("节茎", f"节{MOVED}茎")):
            column = column.replace(found, standard)
        self.assertEqual("".join(gb2312(16, 55)), column)

    def test_folding_changes_traditional_characters_alone(self):
        folded = folding(self.FOLDING)
        changed = {char: folded[char] for char in gb2312(16, 87) if folded.get(char, char) != char}
        self.assertEqual(FOLDED_ON_PURPOSE, changed)
        for char, simplified in folded.items():
            if char != simplified:
                self.assertEqual(simplified, folded.get(simplified, simplified))
                self.assertTrue(char.encode("big5", "ignore") or char in OUTSIDE_BIG5, char)


class DerivationTest(unittest.TestCase):
    """Runs where the Unihan files are those that the tables were derived from."""

    def test_pinyin(self):
        derived = derive_pinyin.derive()
        self.assertEqual(derive_pinyin.PINYIN.read_text(encoding="utf-8"), derived)
        chars = {char for char, _ in rows(derived)}
        fields = unihan.load("OtherMappings")
        big5_level_one = [char for char, code in fields["kBigFive"].items()
                          if "A440" <= code <= "C67E"]
        for required, allowed in ((fields["kTGH"], 0), (big5_level_one, 0), (fields["kGB0"], 5)):
            lacking = {char for char in required if "\u4e00" <= char <= "\u9fff"} - chars
            self.assertLessEqual(len(lacking), allowed, lacking)
        self.assertNotIn("甴", chars)

    def test_folding(self):
        derived = derive_folding.derive()
        self.assertEqual(derive_folding.FOLDING.read_text(encoding="utf-8"), derived)
        standard = unihan.load("OtherMappings")["kTGH"]
        self.assertEqual([], [char for char, simplified in folding(rows(derived)).items()
                              if char != simplified and char in standard])


class MakeTablesTest(unittest.TestCase):
    """make_tables.py names what is wrong with a table, writes nothing and ends with 1."""

    def test_faults(self):
        call = f'"{sys.executable}" -B "$DATA/derive/make_tables.py" "$@"'
        with tempfile.TemporaryDirectory() as directory:
            transcript.check(self, pathlib.Path(__file__).with_name("make_tables.txt"), directory,
                             f"make_tables() {{ {call}; }}\n", DATA=str(ROOT / "data"),
                             PYFILE=str(PYFILE))


def unihan_versions():
    for path in UNIHAN.glob("Unihan_*.txt.bz2"):
        with bz2.open(path, "rt", encoding="utf-8") as source:
            yield re.search(r"# Unicode version: (\S*)|\Z", source.read(1000)).group(1)


if __name__ == "__main__":
    recorded = (ROOT / "data/unicode-data.version").read_text(encoding="utf-8").strip()
    if "DerivationTest" in sys.argv and set(unihan_versions()) != {recorded}:
        print(f"skipped: {UNIHAN} has no Unihan {recorded}, from which the tables were derived")
        sys.exit(SKIPPED)
    names = [name for name in sys.argv[2:] if name != "--record"]
    unittest.main(argv=[sys.argv[0], *names], verbosity=2)
