#!/usr/bin/env python3
"""Runs the benchmarks and writes their table to bench/README.md.

Usage: bench/report.py BENCHMARK_PROGRAM [--large | --from JSON]

With --large it measures 1,000,000 contacts beside 100,000 and writes bench/large.md instead.
"""

import json
import pathlib
import subprocess
import sys
from typing import Dict, List, Sequence

SIZES = (1000, 10000, 100000)
CHANGES = ("renewed", "renamed", "removed", "inserted")
Row = Dict[str, float]

HEAD = """# Benchmarks

Written by `scripts/bench.sh`; do not edit by hand. Realistic names with a fixed seed (80 % Chinese
personal names with surnames in their real proportions, the rest Latin, mixed and companies), {queries}
texts typed key by key, each keystroke the median of 9 runs. Times vary with the machine: compare the
shares rather than the microseconds. A share is a time divided by its limit on this machine in this
run, so a share of 1 is the limit.

Machine: {cpu}, {cores} cores; {date}.

Lower bounds (floors), measured in the same run: `copy` maps the store file, copies its records into
memory that was touched before and unmaps; `copy-fresh` copies into memory fresh from the system;
`touch` maps the store file, reads 8 bytes of the localizer key of each record and unmaps;
`scan` reads all result entries; `entries` copies them into fresh memory; `sql` steps through the
statements of a full read; `rewrite` copies the records into a shared mapping of an existing file.
The limit of a keystroke uses a `scan` measured before its text was typed and `entries` measured
right after it.
"""


LARGE_HEAD = """# 1,000,000 contacts

Written by `scripts/bench.sh --large`; do not edit by hand. Each figure beside that of 100,000 contacts in
the same run; limit of the factor: 11. One changed contact also has the limit of its count query + 6 copy,
which does not contain the flush of the moved records to the disk (about 0.3 s), while its time does. Where a
factor is larger: `docs/keystroke.md`.

| figure | 100,000 | 1,000,000 | factor |
|---|---|---|---|
"""
LARGE_FIGURES = {"whole_store": ("p50_us", "p95_us", "max_us"), "lock_held": ("held_max_us",),
                 "narrowed": ("p50_us", "p95_us", "max_us"), "build": ("build_us",),
                 "changes": tuple(f"{kind}_us" for kind in CHANGES), "floors": ("copy_us", "sql_us")}


def large_table(rows: Dict[str, Dict[int, dict]]) -> str:
    text = LARGE_HEAD
    for name, figures in LARGE_FIGURES.items():
        small, large = (rows[name][size] for size in sorted(rows[name]))
        for figure in figures:
            text += (f"| {name}: {figure} | {micro(small[figure])} | {micro(large[figure])} | "
                     f"{large[figure] / small[figure]:.1f} |\n")
    shares = ", ".join(f"{kind} {rows['changes'][max(rows['changes'])][f'{kind}_share']:.2f}"
                       for kind in CHANGES)
    return text + f"\nShares of one changed contact at 1,000,000: {shares}.\n"


def run(program: str, *options: str) -> dict:
    done = subprocess.run([program, *options, "--benchmark_format=json"], stdout=subprocess.PIPE,
                          stderr=subprocess.DEVNULL, check=True, text=True)
    return json.loads(done.stdout)


def rows_by_name(report: dict) -> Dict[str, Dict[int, dict]]:
    rows: Dict[str, Dict[int, dict]] = {}
    for row in report["benchmarks"]:
        name, size = row["name"].split("/")[:2]
        rows.setdefault(name, {})[int(size)] = row
    return rows


def table(head: List[str], lines: List[List[str]]) -> str:
    text = ["| " + " | ".join(head) + " |", "|" + "---|" * len(head)]
    text += ["| " + " | ".join(line) + " |" for line in lines]
    return "\n".join(text) + "\n"


def micro(value: float) -> str:
    return f"{value:,.0f}" if value >= 100 else f"{value:.1f}"


def by_size(rows: Dict[int, Row], columns: Dict[str, str], shares: Dict[str, str],
            only_largest: Sequence[str] = ()) -> str:
    """Shares named in only_largest have a limit at the largest size alone."""
    lines = []
    for size in SIZES:
        if size in rows:
            row = rows[size]
            line = [f"{size:,}"] + [micro(row[key]) for key in columns]
            lines.append(line + ["" if key in only_largest and size != SIZES[-1]
                                 else f"{row[key]:.2f}" for key in shares])
    return table(["contacts", *columns.values(), *shares.values()], lines)


def main() -> int:
    if sys.argv[2:] == ["--large"]:
        text = large_table(rows_by_name(run(sys.argv[1], "--large")))
        pathlib.Path(__file__).with_name("large.md").write_text(text, encoding="utf-8")
        return 0
    if len(sys.argv) == 4 and sys.argv[2] == "--from":
        report = json.loads(pathlib.Path(sys.argv[3]).read_text(encoding="utf-8"))
    else:
        report = run(sys.argv[1])
    rows = rows_by_name(report)
    cpu = next((line.split(":")[1].strip() for line in
                pathlib.Path("/proc/cpuinfo").read_text(encoding="utf-8").splitlines()
                if line.startswith("model name")), "unknown")
    queries = pathlib.Path(__file__).with_name("Queries.h").read_text(encoding="utf-8").count("{IME_")
    text = HEAD.format(queries=queries, cpu=cpu, cores=report["context"]["num_cpus"],
                       date=report["context"]["date"][:10])
    text += "\n## Lower bounds (microseconds)\n\n" + by_size(
        rows["floors"], {"copy_us": "copy", "copy_fresh_us": "copy-fresh", "touch_us": "touch", "scan_us": "scan",
                         "entries_us": "entries", "sql_us": "sql", "rewrite_us": "rewrite"}, {})
    times = {"p50_us": "p50 us", "p95_us": "p95 us", "max_us": "max us",
             "p50_ns_per_contact": "p50 ns per contact"}
    text += ("\n## Whole-store search\n\nLimits: p95 1.5 copy + 2 entries of the result, max 2.5 "
             "copy + 2 entries; below 100,000 contacts p95 2 copy + 2 entries + 100 us. "
             "`worst/median`: the slowest keystroke divided by the median one, without entries "
             "(limit 3). `memory share`: the allocated memory divided by contacts x 176 + matches x "
             "136 + 1 MiB.\n\n") + by_size(
        rows["whole_store"], times, {"p95_share": "p95 share", "max_share": "max share",
                                     "worst_to_median": "worst/median",
                                     "memory_share": "memory share"}, ["max_share"])
    text += ("\n## Store lock in a whole-store search\n\nThe time of the whole selection, with the "
             "text and the opening of files, compared with copying the records, for which the lock "
             "would be held otherwise.\n\n") + by_size(
        rows["lock_held"], {"held_p50_us": "p50 us", "held_max_us": "max us", "copy_us": "copy",
                            "copy_fresh_us": "copy-fresh"}, {"lock_share": "max / copy-fresh"})
    text += ("\n## Incremental search\n\nA keystroke that narrows the previous result. Limits: p95 6 "
             "scans of the previous result + 2 entries of the new one + 50 us; the median keystroke "
             "of 100,000 contacts copy / 20.\n\n") + by_size(
        rows["narrowed"], times, {"p95_share": "p95 share", "median_share": "median share"},
        ["median_share"])
    text += ("\n## Beside touching one cache line of each record\n\nThe keystrokes of the whole-store "
             "search above. Limits at 100,000 contacts: p50 2 touch + 1.2 entries, p95 3 touch + 1.5 "
             "entries; below, p50 3 touch + 1.2 entries + 40 us. Incremental: p95 4 scan + 1.5 entries "
             "+ 40 us, and for 9494949494 in every keystroke.\n\n") + by_size(
        {size: {**row, "incremental": rows["narrowed"][size]["tight_p95_share"],
                "slow_text": rows["narrowed"][size]["slow_text_share"]}
         for size, row in rows["whole_store"].items()},
        {"touch_us": "touch", "p50_us": "p50 us", "p95_us": "p95 us"},
        {"touch_p50_share": "p50 share", "touch_p95_share": "p95 share",
         "incremental": "incremental p95 share", "slow_text": "9494949494"}, ["touch_p95_share"])
    filters = ("starred", "id", "group")
    text += ("\n## With a filter that keeps everybody\n\nThe first character of every text, in the "
             "median. Limit: 1.5 times the same without a filter.\n\n") + by_size(
        rows["filtered"], {f"{kind}_us": f"{kind} us" for kind in ("plain", *filters)},
        {f"{kind}_share": f"{kind} share" for kind in filters})
    text += ("\n## The first search of a process\n\nNothing is cached. Limit at 1,000 contacts: 1 "
             "ms.\n\n") + by_size(rows["cold"], {"cold_us": "us"}, {"cold_share": "us / 1 ms"})
    text += ("\n## A full build onto an existing store\n\nLimit at 100,000 contacts: 1.8 x (sql + "
             "copy-fresh + rewrite).\n\n") + by_size(
        rows["build"], {"build_us": "build us", "floor_us": "floor us"}, {"build_share": "share"},
        ["build_share"])
    text += ("\n## One changed contact\n\nLimits at 100,000 contacts: the count query + 1.5 copy when "
             "it is renewed in place, + 6 copy when it moves, is inserted or removed. In a small "
             "store most of the time is opening the database a second time.\n\n") + by_size(
        rows["changes"], {f"{kind}_us": f"{kind} us" for kind in CHANGES},
        {f"{kind}_share": f"{kind} share" for kind in CHANGES},
        [f"{kind}_share" for kind in CHANGES])
    text += ("\n## 200 changed contacts in one notification\n\nThe time for which the store lock is "
             "held. Limit at 100,000 contacts: 4 copy for every kind of change.\n\n") + by_size(
        rows["many_changes"], {"copy_us": "copy", **{f"{kind}_us": f"{kind} us" for kind in CHANGES}},
        {f"{kind}_share": f"{kind} share" for kind in CHANGES},
        [f"{kind}_share" for kind in CHANGES])
    text += ("\n## Two processes that type at once\n\nBoth search at the same moment. Limit of the "
             "wait: 3 times the longest that the other process holds the lock.\n\n") + by_size(
        rows["two_typists"], {"wait_us": "longest wait us", "held_us": "longest held us"},
        {"wait_share": "share"})
    text += ("\n## Contacts of one surname, typed by its initial\n\nAll match and are ranked, in a "
             "whole-store search and in a candidate set in random order. `sort` is the time of "
             "sorting as many matches by one number.\n\n") + by_size(
        rows["one_surname"], {"whole_us": "whole store us", "shuffled_us": "in no order us",
                              "sort_us": "sort", "entries_us": "entries"}, {})
    pathlib.Path(__file__).with_name("README.md").write_text(text, encoding="utf-8")
    return 0


if __name__ == "__main__":
    sys.exit(main())
