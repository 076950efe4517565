"""Reads the Unihan files as Debian's package unicode-data installs them."""

import bz2
import pathlib
from typing import Dict, Iterator, Tuple

UNIHAN_DIR = pathlib.Path("/usr/share/unicode")


def _rows(name: str) -> Iterator[Tuple[str, str, str]]:
    with bz2.open(UNIHAN_DIR / f"Unihan_{name}.txt.bz2", "rt", encoding="utf-8") as source:
        for line in source:
            if line.startswith("U+"):
                code, field, value = line.rstrip("\n").split("\t", 2)
                yield chr(int(code[2:], 16)), field, value


def load(*names: str) -> Dict[str, Dict[str, str]]:
    """All fields of the named files ("Readings", "Variants", ...): field -> character -> value."""
    fields: Dict[str, Dict[str, str]] = {}
    for name in names:
        for char, field, value in _rows(name):
            fields.setdefault(field, {})[char] = value
    return fields
