#!/usr/bin/env python3
"""Derives data/pinyin.tsv, the characters of the pinyin mapping with their readings.

The characters and most readings come from the Unihan files of Debian's package unicode-data; what those cannot
decide stands in the reviewed tables data/pinyin_characters.tsv and data/pinyin_decisions.tsv. The same inputs
always give the same bytes.
"""

import argparse
import pathlib
import sys
import unicodedata
from typing import Callable, Dict, Iterable, List, Sequence, Set, Tuple

import unihan
from syllables import SYLLABLES

DATA_DIR = pathlib.Path(__file__).resolve().parents[1]
PINYIN = DATA_DIR / "pinyin.tsv"
RECORD_COUNT = 15422
MAX_READINGS = 3
CODE_BASE = 0x1000
BIG5_LEVEL_ONE = range(0xA440, 0xC67F)
BIG5_LEVEL_TWO = range(0xC940, 0xF9D6)

# The fixed codes of the special-number names; each is CODE_BASE plus the record index of its character.
SPECIAL_NAMES: Dict[str, Tuple[int, ...]] = {
    "匪警": (0x1398, 0x3D2B),
    "障碍申告": (0x45E3, 0x2EF6, 0x2C8C, 0x146A),
    "本地电话查号": (0x2219, 0x1684, 0x2C8D, 0x3D89, 0x22A9, 0x1424),
    "火警": (0x291E, 0x3D2B),
    "急救中心": (0x1CD9, 0x20CA, 0x1021, 0x1C90),
    "天气预报": (0x17D6, 0x25A8, 0x4741, 0x1EB9),
    "道路交通事故报警": (0x4115, 0x3F3D, 0x1066, 0x40EE, 0x1054, 0x20C3, 0x1EB9, 0x3D2B),
}

# What each sign of use adds to a character's rank; a character of Big5's second level has no other measure.
USE_WEIGHTS: Dict[str, int] = {
    "kFrequency": 8,
    "kGradeLevel": 8,
    "kHKGlyph": 8,
    "kXHC1983": 6,
    "kIICore": 4,
    "kFenn": 4,
    "kTaiwanTelegraph": 3,
    "kMainlandTelegraph": 3,
    "kMatthews": 2,
    "kJis0": 2,
    "kKoreanName": 2,
    "kTang": 1,
    "kCowles": 1,
    "kDefinition": 1,
}
TRADITIONAL_OF_STANDARD_WEIGHT = 10

# Rare characters that names do use stand mostly under these radicals: woman, sun, water, fire, jade and grass.
NAME_RADICALS = {"38", "72", "85", "86", "96", "140"}
NAME_RADICAL_WEIGHT = 2

Fields = Dict[str, Dict[str, str]]
Readings = List[str]


def is_unified(char: str) -> bool:
    return "\u4e00" <= char <= "\u9fff"


def distinct(items: Iterable[str]) -> List[str]:
    return list(dict.fromkeys(items))


def data_rows(name: str) -> List[List[str]]:
    """The tab-separated rows of a file in data/, without its comment lines."""
    text = (DATA_DIR / name).read_text(encoding="utf-8")
    return [line.split("\t") for line in text.splitlines() if line and not line.startswith("#")]


def plain_syllable(pinyin: str) -> str:
    """Pinyin without its tone and with v for ü; "lue" and "nue" are spellings of "lve" and "nve"."""
    letters = unicodedata.normalize("NFD", pinyin).replace("u\u0308", "v")
    plain = "".join(letter for letter in letters if not unicodedata.combining(letter))
    return {"lue": "lve", "nue": "nve"}.get(plain, plain)


def listed_characters(value: str) -> List[str]:
    """The characters of a variant field, whose items look like U+4E07 or U+4E07<kMatthews."""
    return [chr(int(item.split("<")[0][2:], 16)) for item in value.split()]


class ReadingSources:
    """The readings that each dictionary of the Unihan files gives a character, as plain syllables."""

    def __init__(self, fields: Fields, syllables: Sequence[str]) -> None:
        self._fields = fields
        self._syllables = frozenset(syllables)

    def _known(self, pinyin: Iterable[str]) -> Readings:
        return [s for s in distinct(plain_syllable(p) for p in pinyin) if s in self._syllables]

    def _located(self, field: str, char: str) -> Readings:
        """A field whose items are a dictionary position, a colon and readings separated by commas."""
        items = self._fields[field].get(char, "").split()
        return self._known(p for item in items for p in item.split(":")[1].split(","))

    def standard(self, char: str) -> Readings:
        return self._located("kTGHZ2013", char)

    def older(self, char: str) -> Readings:
        return self._located("kXHC1983", char)

    def historical(self, char: str) -> Readings:
        return self._located("kHanyuPinyin", char)

    def customary(self, char: str) -> Readings:
        return self._known(self._fields["kMandarin"].get(char, "").split())

    def counts(self, char: str) -> Dict[str, int]:
        """How often each reading was counted in running text."""
        totals: Dict[str, int] = {}
        for item in self._fields["kHanyuPinlu"].get(char, "").split():
            pinyin, count = item.rstrip(")").split("(")
            syllable = plain_syllable(pinyin)
            totals[syllable] = totals.get(syllable, 0) + int(count)
        return totals

    def living(self, char: str) -> Set[str]:
        """Every reading that a dictionary of today or the count of running text gives this very character."""
        return {*self.standard(char), *self.older(char), *self.customary(char), *self.counts(char)}

    def attested(self, char: str) -> Set[str]:
        """Every reading that any dictionary gives the character, dead ones included."""
        return self.living(char) | {*self.historical(char)}


def by_use(pool: Readings, counts: Dict[str, int], customary: Readings) -> Readings:
    """The pool with the most counted readings first, then the customary ones, then as the pool has them."""

    def key(reading: str) -> Tuple[int, int]:
        custom = customary.index(reading) if reading in customary else len(customary)
        return -counts.get(reading, 0), custom

    return sorted(pool, key=key)


class ReadingRules:
    """Chooses the readings of a character and their order."""

    def __init__(self, fields: Fields, sources: ReadingSources) -> None:
        self._sources = sources
        self._simplified = fields["kSimplifiedVariant"]
        self._traditional = fields["kTraditionalVariant"]
        self._decided = {char: readings.split() for char, readings, _ in data_rows("pinyin_decisions.tsv")}

    def readings(self, char: str) -> Readings:
        if char in self._decided:
            return self._decided[char]
        derived = self._standard(char) or self._from_simplified(char) or self._others(char)
        return derived[:MAX_READINGS]

    def _standard(self, char: str) -> Readings:
        pool = self._sources.standard(char)
        return by_use(pool, self._sources.counts(char), self._sources.customary(char))

    def _from_simplified(self, char: str) -> Readings:
        """A traditional form reads as the simplified one does, as far as the two are the same word.

        The first reading tells which word that is; a further one may belong to another traditional form and
        needs a source that gives it to this one. The historical dictionary is none: it keeps what is dead.
        """
        simplified = [s for s in listed_characters(self._simplified.get(char, "")) if self._is_standard(s) and s != char]
        if len(simplified) != 1:
            return []
        readings = self.readings(simplified[0])
        if self._is_merger(simplified[0]):
            attested = self._sources.attested(char)
            readings = [r for r in readings if r in attested]
        living = self._sources.living(char)
        return readings[:1] + [r for r in readings[1:] if r in living]

    def _is_standard(self, char: str) -> bool:
        return bool(self._sources.standard(char))

    def _is_merger(self, simplified: str) -> bool:
        """Whether a simplified form stands for several traditional ones, itself among them or not."""
        return len(listed_characters(self._traditional.get(simplified, ""))) != 1

    def _others(self, char: str) -> Readings:
        """Outside the standard table an older dictionary's second readings are mostly dead; they need a decision."""
        return self._sources.customary(char)[:1] or self._sources.older(char)[:1]


class CharacterChoice:
    """Chooses the characters so that every pinned character gets its record index."""

    def __init__(self, fields: Fields, has_reading: Callable[[str], bool]) -> None:
        self._fields = fields
        self._has_reading = has_reading
        hand = [(char, choice) for char, choice, _ in data_rows("pinyin_characters.tsv")]
        self._kept = {char for char, choice in hand if choice == "keep"}
        self._dropped = {char for char, choice in hand if choice == "drop"}

    def characters(self) -> List[str]:
        required = self._required()
        fillers = self._fillers() - required
        chosen: List[str] = []
        for last, room in pinned_rooms():
            chosen += self._fill(room, between(required, chosen, last), between(fillers, chosen, last))
            chosen += [last] if is_unified(last) else []
        return chosen

    def _required(self) -> Set[str]:
        standard = set(filter(is_unified, self._fields["kTGH"]))
        mainland = set(filter(is_unified, self._fields["kGB0"]))
        return self._readable(standard | mainland | self._big5(BIG5_LEVEL_ONE) | self._kept)

    def _fillers(self) -> Set[str]:
        return self._readable(self._big5(BIG5_LEVEL_TWO))

    def _big5(self, level: range) -> Set[str]:
        return {char for char, code in self._fields["kBigFive"].items() if is_unified(char) and int(code, 16) in level}

    def _readable(self, chars: Set[str]) -> Set[str]:
        return {char for char in chars - self._dropped if self._has_reading(char)}

    def _fill(self, room: int, required: Set[str], fillers: Set[str]) -> List[str]:
        """All required characters and the most used of the others, as many as the room takes."""
        spare = room - len(required)
        if not 0 <= spare <= len(fillers):
            raise ValueError(f"{room} records for {len(required)} required and {len(fillers)} other characters")
        ranked = sorted(fillers, key=lambda char: (-self._use(char), self._strokes(char), char))
        return sorted(required | set(ranked[:spare]))

    def _use(self, char: str) -> int:
        use = sum(weight for field, weight in USE_WEIGHTS.items() if char in self._fields[field])
        simplified = listed_characters(self._fields["kSimplifiedVariant"].get(char, ""))
        if any(form in self._fields["kTGH"] for form in simplified):
            use += TRADITIONAL_OF_STANDARD_WEIGHT
        if self._fields["kRSUnicode"][char].split(".")[0] in NAME_RADICALS:
            use += NAME_RADICAL_WEIGHT
        return use

    def _strokes(self, char: str) -> int:
        return int(self._fields["kTotalStrokes"][char].split()[0])


def between(chars: Set[str], chosen: Sequence[str], last: str) -> Set[str]:
    """The characters after the last chosen one and before the next pinned one."""
    return {char for char in chars if (not chosen or char > chosen[-1]) and char < last}


def pinned_indices() -> Dict[str, int]:
    return {char: code - CODE_BASE for name, codes in SPECIAL_NAMES.items() for char, code in zip(name, codes)}


def pinned_rooms() -> List[Tuple[str, int]]:
    """Each pinned character with the number of records before it, and an end mark with the records after the last."""
    rooms: List[Tuple[str, int]] = []
    next_index = 0
    for char, index in sorted(pinned_indices().items()):
        rooms.append((char, index - next_index))
        next_index = index + 1
    rooms.append((chr(sys.maxunicode), RECORD_COUNT - next_index))
    return rooms


def derive() -> str:
    fields = unihan.load("Readings", "OtherMappings", "DictionaryLikeData", "DictionaryIndices", "IRGSources", "Variants")
    rules = ReadingRules(fields, ReadingSources(fields, SYLLABLES))
    chars = CharacterChoice(fields, lambda char: bool(rules.readings(char))).characters()
    head = "# Written by data/derive/derive_pinyin.py: a character and its readings in slot order.\n"
    return head + "".join(f"{char}\t{' '.join(rules.readings(char))}\n" for char in chars)


def main() -> None:
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("--output", type=pathlib.Path, default=PINYIN)
    arguments = parser.parse_args()
    arguments.output.write_text(derive(), encoding="utf-8", newline="\n")


if __name__ == "__main__":
    main()
