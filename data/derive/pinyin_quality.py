#!/usr/bin/env python3
"""Reports how good data/pinyin.tsv is, measured on what takes no part in its derivation.

Those are the order of GB 2312's first level, which is sorted by reading, the dictionary kXHC1983,
which the derivation asks only where no other source has a reading, and the lists of this directory.
"""

import bisect
import pathlib
import re
from typing import Dict, Iterator, List, Tuple

import derive_pinyin
import unihan

HERE = pathlib.Path(__file__).resolve().parent
GB_LEVEL_ONE = range(1601, 5590)
GENERAL_STANDARD_LEVEL_ONE = 3500
SHOWN = 60

Table = Dict[str, List[str]]
Claim = Tuple[str, str]


def report(title: str, total: int, misses: List[str]) -> None:
    share = 100 * (total - len(misses)) / total
    print(f"{title}: {total - len(misses)} of {total} ({share:.2f} %)")
    if misses:
        print("    " + " ".join(misses[:SHOWN]) + (" ..." if len(misses) > SHOWN else ""))


def read_table() -> Table:
    return {char: readings.split() for char, readings in derive_pinyin.data_rows("pinyin.tsv")}


def list_text(name: str) -> str:
    lines = (HERE / name).read_text(encoding="utf-8").splitlines()
    return "\n".join(line for line in lines if not line.startswith("#"))


def claims(name: str) -> Iterator[Claim]:
    """Each character of a list with each reading it claims; forms of one character share the readings."""
    for chars, readings in re.findall(r"([^\sa-z,]+)([a-z,]+)", list_text(name)):
        for char in chars:
            for reading in readings.split(","):
                yield char, reading


def gb_order_key(reading: str) -> str:
    """GB 2312 sorts ü right after u and üe as ue."""
    return reading.replace("ve", "ue").replace("v", "u\0")


def out_of_order(chars: List[str], table: Table) -> List[str]:
    """The fewest characters without which the first readings ascend."""
    keys = [gb_order_key(table[char][0]) for char in chars]
    tails: List[str] = []
    lengths = []
    for key in keys:
        place = bisect.bisect_right(tails, key)
        tails[place : place + 1] = [key]
        lengths.append(place + 1)
    wanted = len(tails)
    strangers = []
    for index in range(len(chars) - 1, -1, -1):
        if lengths[index] == wanted:
            wanted -= 1
        else:
            strangers.append(chars[index])
    return strangers[::-1]


def report_first_by_gb_order(table: Table, fields: derive_pinyin.Fields) -> None:
    codes = {int(code): char for char, code in fields["kGB0"].items()}
    chars = [codes[code] for code in sorted(codes) if code in GB_LEVEL_ONE]
    strangers = out_of_order(chars, table)
    report("First readings in the order of GB 2312's first level", len(chars), [f"{c}:{table[c][0]}" for c in strangers])


def report_first_by_older(title: str, chars: List[str], table: Table, sources: derive_pinyin.ReadingSources) -> None:
    """Where the older dictionary has one reading only, it is the first one."""
    single = [char for char in chars if len(sources.older(char)) == 1]
    misses = [f"{c}:{table[c][0]}/{sources.older(c)[0]}" for c in single if table[c][0] != sources.older(c)[0]]
    report(f"First reading is the only one of kXHC1983, {title}", len(single), misses)


def report_weighted(table: Table, sources: derive_pinyin.ReadingSources) -> None:
    """How much of running text is read by the first reading, and by any."""
    total = first = found = 0
    for char, readings in table.items():
        for reading, count in sources.counts(char).items():
            total += count
            first += count * (reading == readings[0])
            found += count * (reading in readings)
    print(f"Running text (kHanyuPinlu) by the first reading {100 * first / total:.2f} %, by any {100 * found / total:.2f} %")


def report_claims(title: str, name: str, table: Table) -> None:
    wanted = sorted(set(claims(name)))
    report(title, len(wanted), [f"{c}:{r}" for c, r in wanted if r not in table.get(c, [])])


def report_given_names(table: Table) -> None:
    wanted = sorted(set(list_text("given_name_characters.txt")) - {"\n"})
    report("Given-name characters present", len(wanted), [char for char in wanted if char not in table])


def report_noise(table: Table, sources: derive_pinyin.ReadingSources) -> None:
    """Second readings that neither another modern source nor the list of living readings knows."""
    living = set(claims("living_readings.txt")) | set(claims("living_surnames.txt"))
    known = set(living)
    for char in table:
        known |= {(char, reading) for reading in sources.older(char) + list(sources.counts(char))}
    extra = [(char, reading) for char, readings in table.items() for reading in readings[1:]]
    noise = [f"{c}:{r}" for c, r in extra if (c, r) not in known]
    print(f"Second and third readings: {len(extra)}; known to no list left out: {len(noise)}, "
          f"{100 * len(noise) / len(table):.2f} per 100 characters")
    print("    " + " ".join(noise))


def general_standard(fields: derive_pinyin.Fields, first_level: bool, table: Table) -> List[str]:
    rank = {char: int(value.split(":")[1]) for char, value in fields["kTGH"].items()}
    return [c for c in table if c in rank and (rank[c] <= GENERAL_STANDARD_LEVEL_ONE) == first_level]


def main() -> None:
    fields = unihan.load("Readings", "OtherMappings")
    sources = derive_pinyin.ReadingSources(fields, derive_pinyin.SYLLABLES)
    table = read_table()
    report_first_by_gb_order(table, fields)
    report_first_by_older("3500 most used", general_standard(fields, True, table), table, sources)
    rest = [char for char in fields["kGB0"] if char in table and char not in general_standard(fields, True, table)]
    report_first_by_older("rest of GB 2312", rest, table, sources)
    report_weighted(table, sources)
    report_claims("Living readings present", "living_readings.txt", table)
    report_claims("Surnames found by their readings", "living_surnames.txt", table)
    report_given_names(table)
    report_noise(table, sources)
    print("Left out of GB 2312: " + " ".join(sorted(c for c in fields["kGB0"] if derive_pinyin.is_unified(c) and c not in table)))


if __name__ == "__main__":
    main()
