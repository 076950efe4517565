"""Searches a list of names with this library or SQLite's FTS5: peers.py PEER INPUT.json. Prints what
peers.js prints; input: {ids, names, keystrokes, data, readings}."""
import itertools
import json
import pathlib
import sqlite3
import statistics
import sys
import time

ROUNDS = 3
# Until files count as unchanged: this library caches nothing of a table written just now.
SETTLED_SECONDS = 3


class WholeStore:
    """This library: each keystroke searches everybody."""
    version = "1"

    def __init__(self, given):
        import qvlocalize
        self.index = qvlocalize.Index(given["data"])
        self.index.build(force=True)
        self.places = {contact: place for place, contact in enumerate(given["ids"])}

    def prepare(self, text):
        """Not measured."""

    def search(self, text):
        return self.index.search(text)

    def places_of(self, result):
        return [self.places[match.contact_id] for match in result]


class Incremental(WholeStore):
    """This library: each keystroke searches the matches of the keys before it."""

    def prepare(self, text):
        self.typing = self.index.typing()
        for key in text[:-1]:
            self.typing.type(key)

    def search(self, text):
        return self.typing.type(text[-1])


def forms_of(name, readings):
    """What may be typed for a name from each of its characters on: per character the whole reading
    or its initial, the character itself otherwise."""
    choices = [sorted({form for reading in readings.get(character, [])
                       for form in (reading, reading[0])}) or [character.lower()]
               for character in name[:10]]
    return {"".join(form)[:10] for start in range(len(choices))
            for form in itertools.product(*choices[start:start + 5])}


class Fts5:
    """All forms precomputed, searched by prefix."""
    version = sqlite3.sqlite_version

    def __init__(self, given):
        self.database = sqlite3.connect(":memory:")
        self.database.execute("create virtual table forms using fts5(words, content='', "
                              "prefix='1 2 3', tokenize=\"unicode61 remove_diacritics 0\")")
        self.database.executemany("insert into forms(rowid, words) values(?, ?)",
                                  ((place + 1, " ".join(forms_of(name, given["readings"])))
                                   for place, name in enumerate(given["names"])))

    def prepare(self, text):
        """Not measured."""

    def search(self, text):
        return self.database.execute("select rowid from forms where forms match ?",
                                     (f'"{text}"*',)).fetchall()

    def places_of(self, rows):
        return [row[0] - 1 for row in rows]


def memory_mib():
    status = pathlib.Path("/proc/self/status").read_text(encoding="ascii")
    return int(status.split("VmRSS:")[1].split()[0]) / 1024


def measure(peer, text):
    """Median microseconds, and the places of the names found."""
    times = []
    for _ in range(ROUNDS):
        peer.prepare(text)
        begin = time.perf_counter_ns()
        found = peer.search(text)
        times.append((time.perf_counter_ns() - begin) / 1e3)
    return statistics.median(times), peer.places_of(found)


def main():
    given = json.loads(pathlib.Path(sys.argv[2]).read_text(encoding="utf-8"))
    before = memory_mib()
    begin = time.perf_counter()
    peer = {"library": WholeStore, "incremental": Incremental, "fts5": Fts5}[sys.argv[1]](given)
    build = (time.perf_counter() - begin) * 1e3
    time.sleep(SETTLED_SECONDS)
    answers = [measure(peer, text) for text in given["keystrokes"]]
    print(json.dumps({"version": peer.version, "build_ms": build,
                      "memory_mib": memory_mib() - before, "keystrokes": answers}))


main()
