#!/usr/bin/env python3
"""Types the same texts into other searches of Chinese names by pinyin and writes bench/peers.md:
SQLite's FTS5 and the npm packages that can be installed (npm and its registry are optional).

peers.py BUILD_DIR
"""
import datetime
import json
import os
import pathlib
import sqlite3
import statistics
import subprocess
import sys
import tempfile

SOURCE = pathlib.Path(__file__).resolve().parent
SIZES = (1000, 10000)
PACKAGES = ("pinyin-match", "pinyin-pro", "pinyin-engine")
TEXTS = ("zhangwei", "wxm", "zhangw", "zhwei", "lina", "wangfang", "lixiaoh", "chongqing", "lexing",
         "zengchang", "tom", "wanfa", "anna", "bjkjgs")
RECORD_BYTES, WORD_BYTES, READING_BYTES, READINGS = 46, 4, 7, 3

HEAD = """# Beside other searches of Chinese names

Written by `bench/peers.py BUILD_DIR`; do not edit by hand. The same sample of names, {texts} texts typed
key by key ({keys} keystrokes), each search a process of its own; a keystroke is the median of three.
"Found" counts, over all keystrokes, the names that this library finds and the peer finds too; "missed"
those that the peer does not; "other" those that the peer alone finds. What counts as a match differs: this
library takes a whole reading or any beginning of one for each character and begins anywhere in the name.
FTS5 searches precomputed forms, per character a whole reading or its initial, by prefix; it is given the
same readings. This library is measured through its Python module: "library" searches everybody at each
keystroke, as the peers do, "incremental" the matches of the keys before. "Memory" is the growth of the
process, which for this library includes mapped files; its build reads the contacts from a database.

- pinyin-engine is faster than a whole-store search, and about as fast as an incremental one: it looks for
  the text in one string of readings per name. So it also finds parts of readings ("ang" in 张伟), and
  misses beginnings of readings before another character ("zhwei", "wangxm") and traditional characters.
- FTS5 is faster than a whole-store search. Its index holds what can be precomputed: it misses beginnings of
  readings before another character ("zhw" for 钟伟), whose number grows with every character of a name.
- pinyin-match takes whole readings and initials before the last character. pinyin-pro accepts the same
  texts as this library. Both have readings of their own (丁 as zheng), and walk all names at each keystroke.

{date}.

| contacts | search | version | build ms | memory MiB | p50 us | p95 us | found | missed | other |
|---|---|---|---|---|---|---|---|---|---|
"""


def readings_of(table):
    """The readings of each character of the pinyin table."""
    readings = {}
    for place in range(0, len(table), RECORD_BYTES):
        record = table[place:place + RECORD_BYTES]
        word = record[:WORD_BYTES].split(b"\0")[0].decode("utf-8")
        slots = (record[WORD_BYTES + i * READING_BYTES:][:READING_BYTES] for i in range(READINGS))
        readings[word] = [slot.split(b"\0")[0].decode() for slot in slots if slot[0] != 0]
    return readings


def install(directory):
    """The packages that npm could install."""
    try:
        subprocess.run(["npm", "install", "--no-save", "--silent", "--prefix", directory, *PACKAGES],
                       cwd=directory, capture_output=True, check=False)
    except FileNotFoundError:
        return []
    return [package for package in PACKAGES
            if pathlib.Path(directory, "node_modules", package).is_dir()]


def answers(build, directory, packages, contacts):
    """Per search what its process printed."""
    data = os.path.join(directory, f"data{contacts}")
    tool = build / "tools/qvlocalize"
    for call in (["sample", "--count", str(contacts)], ["index"]):
        subprocess.run([tool, *call, "--data-dir", data], check=True, stdout=subprocess.DEVNULL)
    database = sqlite3.connect(os.path.join(data, "databases/contacts2.db"))
    rows = database.execute("select contact_id, display_name from localizer where contact_id in "
                            "(select _id from visible_contacts) order by contact_id").fetchall()
    ids, names = zip(*rows)
    keystrokes = [text[:end] for text in TEXTS for end in range(1, len(text) + 1)]
    table = pathlib.Path(data, "files/pyfile.bin").read_bytes()
    given = pathlib.Path(directory, "input.json")
    given.write_text(json.dumps({"ids": ids, "names": names, "keystrokes": keystrokes, "data": data,
                                 "readings": readings_of(table)}), encoding="utf-8")
    environment = {**os.environ, "PYTHONPATH": str(SOURCE.parent / "bindings/python"),
                   "QVLOCALIZE_LIBRARY": str(build / "bindings/c/libqvlocalize.so.1")}
    calls = {peer: [sys.executable, SOURCE / "peers/peers.py", peer] for peer in ("library", "incremental", "fts5")}
    calls.update({package: ["node", SOURCE / "peers/peers.js", package] for package in packages})
    return {peer: json.loads(subprocess.run([*map(str, call), str(given)], cwd=directory, check=True,
                                            env=environment, stdout=subprocess.PIPE).stdout)
            for peer, call in calls.items()}


def row_of(contacts, peer, answer, truth):
    times = sorted(us for us, _ in answer["keystrokes"])
    counts = [0, 0, 0]
    for (_, found), (_, expected) in zip(answer["keystrokes"], truth["keystrokes"]):
        found, expected = set(found), set(expected)
        for i, names in enumerate((found & expected, expected - found, found - expected)):
            counts[i] += len(names)
    cells = [f"{contacts:,}", peer, answer["version"], f"{answer['build_ms']:,.0f}",
             f"{answer['memory_mib']:,.1f}", f"{statistics.median(times):,.0f}",
             f"{times[len(times) * 95 // 100]:,.0f}", *(f"{count:,}" for count in counts)]
    return "| " + " | ".join(cells) + " |\n"


def main():
    build = pathlib.Path(sys.argv[1]).resolve()
    text = HEAD.format(texts=len(TEXTS), keys=sum(map(len, TEXTS)),
                       date=datetime.date.today().isoformat())
    with tempfile.TemporaryDirectory(prefix="qv_peers_") as directory:
        packages = install(directory)
        for contacts in SIZES:
            found = answers(build, directory, packages, contacts)
            for peer, answer in found.items():
                text += row_of(contacts, peer, answer, found["library"])
    (SOURCE / "peers.md").write_text(text, encoding="utf-8")
    print(text)


main()
