#!/usr/bin/env python3
"""Runs the benchmarks and writes their table to bench/README.md.

Usage: bench/report.py BENCHMARK_PROGRAM [--from JSON]
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
texts typed key by key, each keystroke the median of 9 runs. These machines are noisy: read the
shares, each a time divided by what it may take at most on this machine in this run, rather than the
microseconds. A share of 1 is the limit.

Machine: {cpu}, {cores} cores; {date}.

Floors, in the same run: `copy` maps the store file, copies its records into touched memory and
unmaps; `copy-fresh` the same into memory fresh from the system; `scan` reads all result entries;
`entries` copies them into fresh memory; `sql` steps through the statements of a full read;
`rewrite` copies the records into a shared mapping of an existing file. A keystroke is held
against a `scan` measured before its text was typed and `entries` measured right behind it.
"""


def run(program: str) -> dict:
    done = subprocess.run([program, "--benchmark_format=json"], stdout=subprocess.PIPE,
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
    text += "\n## Floors (microseconds)\n\n" + by_size(
        rows["floors"], {"copy_us": "copy", "copy_fresh_us": "copy-fresh", "scan_us": "scan",
                         "entries_us": "entries", "sql_us": "sql", "rewrite_us": "rewrite"}, {})
    times = {"p50_us": "p50 us", "p95_us": "p95 us", "max_us": "max us",
             "p50_ns_per_contact": "p50 ns per contact"}
    text += ("\n## A keystroke against the whole store\n\nAllowed: p95 1.5 copy + 2 entries of the "
             "result, max 2.5 copy + 2 entries; below 100,000 contacts p95 2 copy + 2 entries + 100 "
             "us. `worst/median`: the slowest keystroke beside the median one, entries aside (limit "
             "3). `memory`: what is held at the allocator beside contacts x 176 + matches x 136 + 1 "
             "MiB.\n\n") + by_size(
        rows["whole_store"], times, {"p95_share": "p95 share", "max_share": "max share",
                                     "worst_to_median": "worst/median",
                                     "memory_share": "memory share"}, ["max_share"])
    text += ("\n## How long a keystroke may hold the store lock\n\nThe whole selection, text and "
             "opening of files included, beside copying the records out, which is what the lock "
             "would be held for otherwise.\n\n") + by_size(
        rows["lock_held"], {"held_p50_us": "p50 us", "held_max_us": "max us", "copy_us": "copy",
                            "copy_fresh_us": "copy-fresh"}, {"lock_share": "max / copy-fresh"})
    text += ("\n## A keystroke that narrows the previous result\n\nAllowed: p95 6 scans of the "
             "previous result + 2 entries of the new one + 50 us; the median keystroke of 100,000 "
             "contacts copy / 20.\n\n") + by_size(
        rows["narrowed"], times, {"p95_share": "p95 share", "median_share": "median share"},
        ["median_share"])
    text += ("\n## A full build onto an existing store\n\nAllowed at 100,000 contacts: 1.8 x (sql + "
             "copy-fresh + rewrite).\n\n") + by_size(
        rows["build"], {"build_us": "build us", "floor_us": "floor us"}, {"build_share": "share"},
        ["build_share"])
    text += ("\n## One changed contact\n\nAllowed at 100,000 contacts: the count query + 1.5 copy when "
             "it is renewed in place, + 6 copy when it moves, comes or goes. In a small store most "
             "of it is opening the database a second time.\n\n") + by_size(
        rows["changes"], {f"{kind}_us": f"{kind} us" for kind in CHANGES},
        {f"{kind}_share": f"{kind} share" for kind in CHANGES},
        [f"{kind}_share" for kind in CHANGES])
    text += ("\n## 200 changed contacts in one notification\n\nHow long the store lock is held. Allowed "
             "at 100,000 contacts: 4 copy, whatever changes.\n\n") + by_size(
        rows["many_changes"], {"copy_us": "copy", **{f"{kind}_us": f"{kind} us" for kind in CHANGES}},
        {f"{kind}_share": f"{kind} share" for kind in CHANGES},
        [f"{kind}_share" for kind in CHANGES])
    text += ("\n## Two processes that type at once\n\nBoth press each key at the same moment. Allowed: "
             "to wait 3 times as long as the other one holds the lock at most.\n\n") + by_size(
        rows["two_typists"], {"wait_us": "longest wait us", "held_us": "longest held us"},
        {"wait_share": "share"})
    text += ("\n## Contacts of one surname, typed by its initial\n\nAll match and are ranked: in the "
             "whole store, and among candidates in no order. `sort` sorts as many matches by one "
             "number.\n\n") + by_size(
        rows["one_surname"], {"whole_us": "whole store us", "shuffled_us": "in no order us",
                              "sort_us": "sort", "entries_us": "entries"}, {})
    pathlib.Path(__file__).with_name("README.md").write_text(text, encoding="utf-8")
    return 0


if __name__ == "__main__":
    sys.exit(main())
