#!/usr/bin/env python3
"""Checks data/pinyin.tsv, the pyfile.bin built from it, data/folding.tsv and the syllable lists.

    tables_test.py PYFILE

It reads the tables by itself, without the program that builds from them.
"""

import pathlib
import re
import sys
from typing import Dict, List, Tuple

ROOT = pathlib.Path(__file__).resolve().parents[2]
sys.path.insert(0, str(ROOT / "tools" / "data"))

from syllables import SYLLABLES  # noqa: E402

WORD_COUNT = 15422
RECORD_SIZE = 46
READING_SLOTS = (4, 11, 18)
DIGIT_SLOTS = (25, 32, 39)
SLOT_SIZE = 7
KEYPAD = dict(zip("abcdefghijklmnopqrstuvwxyz", "22233344455566677778889999"))

# The fixed codes of the special numbers pin the records of 27 characters.
CODE_BASE = 0x1000
SPECIAL_NUMBERS = {
    "匪警": (0x1398, 0x3D2B),
    "障碍申告": (0x45E3, 0x2EF6, 0x2C8C, 0x146A),
    "本地电话查号": (0x2219, 0x1684, 0x2C8D, 0x3D89, 0x22A9, 0x1424),
    "火警": (0x291E, 0x3D2B),
    "急救中心": (0x1CD9, 0x20CA, 0x1021, 0x1C90),
    "天气预报": (0x17D6, 0x25A8, 0x4741, 0x1EB9),
    "道路交通事故报警": (0x4115, 0x3F3D, 0x1066, 0x40EE, 0x1054, 0x20C3, 0x1EB9, 0x3D2B),
}

FOLDING_ROWS = 3755
CHANGED_ROWS = 1295
STATED_ROWS = {
    0: "啊啊", 7: "皚皑", 13: "愛爱", 75: "辦办", 350: "衝冲", 351: "衝冲", 918: "矽硅", 2348: "三三",
    2349: "三叁", 2908: "矽矽", 3659: "著著", 3702: "著着",
}
MOVED = "桔杰捷睫竭洁结解姐戒藉芥界借介疥诫届巾筋斤金今津襟紧锦仅谨进靳晋禁近烬浸尽劲荆兢"
MOVED_TO = 1361

# GB 2312 holds 後 though its standard has 后; 矽 is the element that the mainland calls 硅.
FOLDED_ON_PURPOSE = {"後": "后", "矽": "硅"}
# Traditional forms that Big5 does not hold, of characters that it does not hold either.
OUTSIDE_BIG5 = {"釺", "鍁"}
FOLDED_NAMES = {"張": "张", "陳": "陈", "劉": "刘", "鍾": "钟", "葉": "叶", "蕭": "萧", "關": "关", "淨": "净"}

# Forms of simplified characters with several readings: those of another form's word are not theirs, those that
# are alive are, though the Unihan files may lack them.
TRADITIONAL_READINGS = {
    "纖": "xian", "縴": "qian", "噓": "xu", "說": "shuo shui", "賈": "jia gu", "員": "yuan yun", "綠": "lv lu",
    "調": "diao tiao", "鯽": "ji", "錒": "a",
}

Rows = List[Tuple[str, str]]
failures: List[str] = []


def check(condition: bool, message: str) -> None:
    if not condition:
        failures.append(message)
        print(message)


def read_rows(name: str) -> Rows:
    lines = (ROOT / "data" / name).read_text(encoding="utf-8").splitlines()
    rows = [line.split("\t") for line in lines if not line.startswith("#")]
    return [(first, second) for first, second in rows]


def gb2312_cells(first_row: int, last_row: int) -> List[str]:
    """The characters of those rows of GB 2312 in code order."""
    cells = []
    for row in range(first_row, last_row + 1):
        for cell in range(1, 95):
            cells.append(bytes((row + 0xA0, cell + 0xA0)).decode("gb2312", "ignore"))
    return [char for char in cells if char]


def check_syllables() -> None:
    check(len(SYLLABLES) == 416, f"{len(SYLLABLES)} syllables, expected 416")
    check(list(SYLLABLES) == sorted(set(SYLLABLES)), "the syllables are not ascending")
    source = (ROOT / "LocalizerImpl" / "Syllables.cpp").read_text(encoding="utf-8")
    library = re.findall(r'L"([a-z]+)"', source)
    check(library == list(SYLLABLES), "Syllables.cpp and syllables.py hold different lists")


def check_pinyin_table(rows: Rows) -> None:
    chars = [char for char, _ in rows]
    check(len(rows) == WORD_COUNT, f"pinyin.tsv has {len(rows)} characters, expected {WORD_COUNT}")
    check(chars == sorted(set(chars)), "pinyin.tsv is not in ascending code point order")
    for char, text in rows:
        readings = text.split(" ")
        check(1 <= len(readings) <= 3, f"{char} has {len(readings)} readings")
        check(len(set(readings)) == len(readings), f"{char} has a reading twice: {text}")
        check(all(reading in SYLLABLES for reading in readings), f"{char} has no syllable: {text}")


def check_traditional_readings(rows: Rows) -> None:
    readings = dict(rows)
    for char, expected in TRADITIONAL_READINGS.items():
        check(readings[char] == expected, f"{char} reads {readings[char]}, expected {expected}")


def check_special_numbers(records: List[bytes]) -> None:
    for name, codes in SPECIAL_NUMBERS.items():
        words = (records[code - CODE_BASE][:3] for code in codes)
        decoded = b"".join(words).decode("utf-8", "replace")
        check(decoded == name, f"a special number reads {decoded}, expected {name}")


def expected_record(char: str, text: str) -> bytes:
    record = bytearray(RECORD_SIZE)
    record[0:3] = char.encode("utf-8")
    for reading, letters_at, digits_at in zip(text.split(" "), READING_SLOTS, DIGIT_SLOTS):
        digits = "".join(KEYPAD[letter] for letter in reading)
        record[letters_at : letters_at + len(reading)] = reading.encode("ascii")
        record[digits_at : digits_at + len(reading)] = digits.encode("ascii")
    return bytes(record)


def check_pyfile(path: pathlib.Path, rows: Rows) -> None:
    content = path.read_bytes()
    check(len(content) == WORD_COUNT * RECORD_SIZE, f"{path} has {len(content)} bytes")
    records = [content[at : at + RECORD_SIZE] for at in range(0, len(content), RECORD_SIZE)]
    for index, (record, (char, text)) in enumerate(zip(records, rows)):
        check(record == expected_record(char, text), f"record {index} is not {char} {text}: {record!r}")
    if len(records) == WORD_COUNT:
        check_special_numbers(records)


def check_folding_columns(rows: Rows) -> None:
    changed = sum(traditional != simplified for traditional, simplified in rows)
    check(len(rows) == FOLDING_ROWS, f"folding.tsv has {len(rows)} rows, expected {FOLDING_ROWS}")
    check(changed == CHANGED_ROWS, f"{changed} rows change, expected {CHANGED_ROWS}")
    for index, row in STATED_ROWS.items():
        check("".join(rows[index]) == row, f"row {index} is {''.join(rows[index])}, expected {row}")


def check_simplified_order(rows: Rows) -> None:
    """Undoes the three differences and compares with the standard's code order."""
    column = "".join(simplified for _, simplified in rows)
    check(column.find(MOVED) == MOVED_TO, f"the moved characters stand at row {column.find(MOVED)}")
    column = column.replace(MOVED, "").replace("冲冲", "冲").replace("掐洽", "掐恰洽")
    column = column.replace("节茎", "节" + MOVED + "茎")
    check(column == "".join(gb2312_cells(16, 55)), "the simplified column is not in GB 2312's order")


def folding(rows: Rows) -> Dict[str, str]:
    """What each traditional character folds to: its first row decides."""
    folded: Dict[str, str] = {}
    for traditional, simplified in rows:
        folded.setdefault(traditional, simplified)
    return folded


def check_kept_characters(folded: Dict[str, str]) -> None:
    for char in gb2312_cells(16, 87):
        expected = FOLDED_ON_PURPOSE.get(char, char)
        found = folded.get(char, char)
        check(found == expected, f"the simplified character {char} folds to {found}")


def check_changed_characters(folded: Dict[str, str]) -> None:
    for traditional, simplified in FOLDED_NAMES.items():
        check(folded.get(traditional) == simplified, f"{traditional} does not fold to {simplified}")
    for traditional, simplified in folded.items():
        if traditional == simplified:
            continue
        check(folded.get(simplified, simplified) == simplified, f"{simplified} folds once more")
        in_big5 = bool(traditional.encode("big5", "ignore"))
        check(in_big5 or traditional in OUTSIDE_BIG5, f"{traditional} is no form of Big5 text")


def main(arguments: List[str]) -> int:
    if len(arguments) != 1:
        print("usage: tables_test.py PYFILE", file=sys.stderr)
        return 1
    check_syllables()
    pinyin = read_rows("pinyin.tsv")
    check_pinyin_table(pinyin)
    check_traditional_readings(pinyin)
    check_pyfile(pathlib.Path(arguments[0]), pinyin)
    rows = read_rows("folding.tsv")
    check_folding_columns(rows)
    check_simplified_order(rows)
    check_kept_characters(folding(rows))
    check_changed_characters(folding(rows))
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
