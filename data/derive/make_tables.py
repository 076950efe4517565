#!/usr/bin/env python3
"""Turns the reviewed tables of data/ into what the build uses.

    make_tables.py pyfile data/pinyin.tsv pyfile.bin
    make_tables.py folding data/folding.tsv FoldingTable.cpp

Both inputs are checked whole; a fault is named with its file and line and nothing is written.
"""

import pathlib
import sys
from typing import Iterator, List, NoReturn, Tuple

from syllables import SYLLABLES

PY_WORD_COUNT = 15422
PY_RECORD_SIZE = 46
WORD_SLOT = 4
READING_SLOT = 7
MAX_READINGS = 3

FOLDING_ROWS = 3755
FOLD_FIRST = 0x4E00
FOLD_LAST = 0x9FFF
NUMBERS_PER_LINE = 12

KEYPAD = {
    letter: digit
    for digit, letters in {
        "2": "abc", "3": "def", "4": "ghi", "5": "jkl", "6": "mno", "7": "pqrs", "8": "tuv", "9": "wxyz",
    }.items()
    for letter in letters
}


class TableError(Exception):
    """A fault of an input file, told to the one who edits it."""


def fail(path: pathlib.Path, number: int, message: str) -> NoReturn:
    raise TableError(f"{path}:{number}: {message}")


def read_rows(path: pathlib.Path) -> Iterator[Tuple[int, List[str]]]:
    """The line number and the tab-separated columns of every line that is not a comment."""
    lines = path.read_text(encoding="utf-8").split("\n")
    if lines.pop() != "":
        fail(path, len(lines) + 1, "the last line has no line end")
    for number, line in enumerate(lines, start=1):
        if line.startswith("#"):
            continue
        columns = line.split("\t")
        if len(columns) != 2:
            fail(path, number, f"expected two columns, found {len(columns)}: {line!r}")
        yield number, columns


def check_ideograph(path: pathlib.Path, number: int, text: str) -> None:
    if len(text) != 1 or not FOLD_FIRST <= ord(text) <= FOLD_LAST:
        fail(path, number, f"{text!r} is not one character of U+{FOLD_FIRST:04X}..U+{FOLD_LAST:04X}")


def spell(reading: str) -> str:
    """The keypad digits of a reading."""
    return "".join(KEYPAD[letter] for letter in reading)


def check_readings(path: pathlib.Path, number: int, readings: List[str]) -> None:
    if not 1 <= len(readings) <= MAX_READINGS:
        fail(path, number, f"expected 1 to {MAX_READINGS} readings, found {len(readings)}")
    if len(set(readings)) != len(readings):
        fail(path, number, f"a reading stands twice: {' '.join(readings)}")
    for reading in readings:
        if reading not in SYLLABLES:
            fail(path, number, f"{reading!r} is no syllable of the table")


def pinyin_record(char: str, readings: List[str]) -> bytes:
    """One record: the character, three slots of readings, three slots of their keypad digits."""
    slots = readings + [""] * (MAX_READINGS - len(readings))
    record = char.encode("utf-8").ljust(WORD_SLOT, b"\0")
    for text in slots + [spell(reading) for reading in slots]:
        record += text.encode("ascii").ljust(READING_SLOT, b"\0")
    assert len(record) == PY_RECORD_SIZE
    return record


def make_pyfile(path: pathlib.Path) -> bytes:
    records = []
    previous = ""
    for number, (char, text) in read_rows(path):
        check_ideograph(path, number, char)
        if char <= previous:
            fail(path, number, f"{char} does not follow {previous} in code point order")
        previous = char
        readings = text.split(" ")
        check_readings(path, number, readings)
        records.append(pinyin_record(char, readings))
    if len(records) != PY_WORD_COUNT:
        raise TableError(f"{path}: expected {PY_WORD_COUNT} characters, found {len(records)}")
    return b"".join(records)


def read_folding(path: pathlib.Path) -> List[Tuple[str, str]]:
    rows = []
    for number, (traditional, simplified) in read_rows(path):
        check_ideograph(path, number, traditional)
        check_ideograph(path, number, simplified)
        rows.append((traditional, simplified))
    if len(rows) != FOLDING_ROWS:
        raise TableError(f"{path}: expected {FOLDING_ROWS} rows, found {len(rows)}")
    return rows


def folded_characters(rows: List[Tuple[str, str]]) -> List[int]:
    """For each code point what it folds to, 0 where no row changes it; its first row decides."""
    folded = {}
    for traditional, simplified in rows:
        folded.setdefault(traditional, simplified)
    codes = []
    for code in range(FOLD_FIRST, FOLD_LAST + 1):
        target = folded.get(chr(code), chr(code))
        codes.append(0 if target == chr(code) else ord(target))
    return codes


def cpp_numbers(codes: List[int]) -> str:
    lines = []
    for start in range(0, len(codes), NUMBERS_PER_LINE):
        part = codes[start : start + NUMBERS_PER_LINE]
        lines.append("    " + " ".join(f"0x{code:04X}," for code in part))
    return "\n".join(lines)


def cpp_column(name: str, column: List[str]) -> str:
    """One zero-terminated array, each line of numbers under its first row and its characters."""
    lines = []
    for start in range(0, len(column), NUMBERS_PER_LINE):
        part = column[start : start + NUMBERS_PER_LINE]
        lines.append(f"    // {start}: {''.join(part)}")
        lines.append(cpp_numbers([ord(char) for char in part]))
    body = "\n".join(lines)
    return f"const wchar_t {name}[{len(column) + 1}] = {{\n{body}\n    0x0000,\n}};\n"


def make_folding(path: pathlib.Path) -> bytes:
    rows = read_folding(path)
    lookup = cpp_numbers(folded_characters(rows))
    source = "\n".join(
        [
            "// Made from data/folding.tsv by data/derive/make_tables.py; edit that table instead.",
            "",
            '#include "LocalizerImpl/FoldingLookup.h"',
            '#include "LocalizerImpl/NameFolding.h"',
            "",
            cpp_column("g_szTraditional", [traditional for traditional, _ in rows]),
            cpp_column("g_szSimplified", [simplified for _, simplified in rows]),
            "const char16_t g_foldedCharacters[FOLD_LAST - FOLD_FIRST + 1] = {",
            lookup,
            "};",
            "",
        ]
    )
    return source.encode("utf-8")


MAKERS = {"pyfile": make_pyfile, "folding": make_folding}


def main(arguments: List[str]) -> int:
    if len(arguments) != 3 or arguments[0] not in MAKERS:
        print("usage: make_tables.py pyfile|folding TABLE.tsv OUTPUT", file=sys.stderr)
        return 1
    kind, table, output = arguments
    try:
        content = MAKERS[kind](pathlib.Path(table))
        pathlib.Path(output).write_bytes(content)
    except (TableError, OSError, UnicodeDecodeError) as error:
        print(f"make_tables.py: {error}", file=sys.stderr)
        return 1
    return 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
