#!/usr/bin/env python3
"""data/folding.tsv is what its program derives, and folds no character of the simplified standard."""

import sys
from typing import List

import derivation

import derive_folding
import unihan

# The element silicon is 硅 in the mainland; its older name 矽 is folded on purpose.
FOLDED_ON_PURPOSE = {"矽"}


def folded_standard_characters(derived: str) -> List[str]:
    """The characters of the General Standard table that a row changes before one of its own."""
    folded = {}
    for line in derived.splitlines():
        if not line.startswith("#"):
            traditional, simplified = line.split("\t")
            folded.setdefault(traditional, simplified)
    standard = unihan.load("OtherMappings")["kTGH"]
    return [char for char, target in folded.items() if char != target and char in standard]


def main() -> int:
    derivation.skip_without_recorded_version()
    derived = derive_folding.derive()
    failed = derivation.differs(derive_folding.FOLDING, derived)
    damaged = set(folded_standard_characters(derived)) - FOLDED_ON_PURPOSE
    if damaged:
        print(f"simplified characters are folded: {' '.join(sorted(damaged))}")
    return 1 if failed or damaged else 0


if __name__ == "__main__":
    sys.exit(main())
