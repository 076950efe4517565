#!/usr/bin/env python3
"""data/pinyin.tsv is what its program derives, and holds every character that names must find."""

import sys
from typing import List, Set

import derivation

import derive_pinyin
import unihan

MAX_LEFT_OUT_OF_GB2312 = 5
BIG5_LEVEL_ONE = ("A440", "C67E")
LEFT_OUT = {"甴"}


def unified(chars: Set[str]) -> Set[str]:
    return {char for char in chars if "\u4e00" <= char <= "\u9fff"}


def wrong_choices(chars: Set[str]) -> List[str]:
    """What the chosen characters lack, or hold against the rules."""
    fields = unihan.load("OtherMappings")
    first, last = BIG5_LEVEL_ONE
    level_one = {char for char, code in fields["kBigFive"].items() if first <= code <= last}
    wrong = []
    for name, lacking, allowed in (
        ("the General Standard table", unified(set(fields["kTGH"])) - chars, 0),
        ("Big5's first level", unified(level_one) - chars, 0),
        ("GB 2312", unified(set(fields["kGB0"])) - chars, MAX_LEFT_OUT_OF_GB2312),
    ):
        if len(lacking) > allowed:
            wrong.append(f"{name} lacks {' '.join(sorted(lacking))}")
    wrong += [f"{char} cannot stand in the table" for char in sorted(LEFT_OUT & chars)]
    return wrong


def main() -> int:
    derivation.skip_without_recorded_version()
    derived = derive_pinyin.derive()
    failed = derivation.differs(derive_pinyin.PINYIN, derived)
    wrong = wrong_choices({line[0] for line in derived.splitlines() if not line.startswith("#")})
    for line in wrong:
        print(line)
    return 1 if failed or wrong else 0


if __name__ == "__main__":
    sys.exit(main())
