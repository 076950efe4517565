#!/usr/bin/env python3
"""Derives data/folding.tsv from the Unihan files and data/folding_decisions.tsv.

    derive_folding.py [OUTPUT]

A traditional form comes from Unihan's kTraditionalVariant; a form that is itself a character of
today's simplified standard is none, because folding it would damage simplified names. Which rows
change depends on the place of the simplified character in Big5, the code of traditional text:

- It is not in Big5: traditional text needs another form, and the row changes.
- It is in the second level, which holds rare characters: the row changes where Big5 has a form.
- It is in the first level, so that traditional text uses it too: the row changes where the other
  form is an everyday one, by Unihan's kFrequency and kGradeLevel.

The decisions made by hand stand before these rules.
"""

import pathlib
import sys
from typing import Dict, List

import unihan

DATA = pathlib.Path(__file__).resolve().parents[1]
DECISIONS = DATA / "folding_decisions.tsv"
FOLDING = DATA / "folding.tsv"

CHANGED_ROWS = 1295

GB_LEVEL_ONE = range(1601, 5590)
BIG5_LEVEL_TWO = 0xC940

MOST_FREQUENT = range(1, 5)
PRIMARY_GRADES = range(1, 4)

TWICE = "冲"
MISSING = "恰"
MOVED = "桔杰捷睫竭洁结解姐戒藉芥界借介疥诫届巾筋斤金今津襟紧锦仅谨进靳晋禁近烬浸尽劲荆兢"
MOVED_BEFORE = "觉"

HEAD = """\
# The folding table: traditional character, simplified character, one row per line from row 0 on.
# Made by data/derive/derive_folding.py; folding.md tells from what and how.
"""

Fields = Dict[str, Dict[str, str]]


def simplified_column(fields: Fields) -> str:
    """The level-one characters of GB 2312 in code order, with the three differences of the table."""
    codes = {int(code): char for char, code in fields["kGB0"].items()}
    column = "".join(codes[code] for code in sorted(codes) if code in GB_LEVEL_ONE)
    assert MOVED in column
    column = column.replace(MOVED, "").replace(MISSING, "").replace(TWICE, TWICE * 2)
    return column.replace(MOVED_BEFORE, MOVED + MOVED_BEFORE)


def read_decisions() -> Dict[str, str]:
    """Simplified character -> traditional character."""
    decisions = {}
    for line in DECISIONS.read_text(encoding="utf-8").splitlines():
        if line.startswith("#"):
            continue
        simplified, traditional, reason = line.split("\t")
        assert simplified not in decisions and reason, line
        decisions[simplified] = traditional
    return decisions


def traditional_forms(fields: Fields, simplified: str) -> List[str]:
    """The forms that Unihan gives, without those that are simplified characters themselves."""
    value = fields["kTraditionalVariant"].get(simplified, "")
    forms = [chr(int(code[2:], 16)) for code in value.split()]
    return [form for form in forms if form not in fields["kGB0"] and form not in fields["kTGH"]]


def is_everyday(fields: Fields, char: str) -> bool:
    """Whether traditional text uses the character often, or primary schools teach it early."""
    frequency = int(fields["kFrequency"].get(char, "0"))
    grade = int(fields["kGradeLevel"].get(char, "0"))
    return frequency in MOST_FREQUENT or grade in PRIMARY_GRADES


def ruled_forms(fields: Fields, simplified: str) -> List[str]:
    """The forms that the rules leave for a row; none where the row stays as it is."""
    big_five = fields["kBigFive"]
    forms = traditional_forms(fields, simplified)
    in_big_five = [form for form in forms if form in big_five]
    if simplified not in big_five:
        return in_big_five or forms
    if int(big_five[simplified], 16) >= BIG5_LEVEL_TWO:
        return in_big_five
    return [form for form in in_big_five if is_everyday(fields, form)]


def traditional_character(fields: Fields, decisions: Dict[str, str], simplified: str) -> str:
    if simplified in decisions:
        return decisions[simplified]
    forms = ruled_forms(fields, simplified) or [simplified]
    assert len(forms) == 1, f"{simplified}: {' or '.join(forms)} is to be decided by hand"
    return forms[0]


def derive() -> str:
    """The text of folding.tsv."""
    fields = unihan.load("Variants", "OtherMappings", "DictionaryLikeData")
    decisions = read_decisions()
    column = simplified_column(fields)
    unused = [simplified for simplified in decisions if simplified not in column]
    assert not unused, f"decisions without a row: {''.join(unused)}"
    rows = [(traditional_character(fields, decisions, char), char) for char in column]
    changed = sum(traditional != simplified for traditional, simplified in rows)
    assert changed == CHANGED_ROWS, f"{changed} rows change, expected {CHANGED_ROWS}"
    return HEAD + "".join(f"{traditional}\t{simplified}\n" for traditional, simplified in rows)


def main(arguments: List[str]) -> int:
    output = pathlib.Path(arguments[0]) if arguments else FOLDING
    output.write_text(derive(), encoding="utf-8")
    return 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
