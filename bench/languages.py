#!/usr/bin/env python3
"""Measures 1,000 searches of the whole index in each language, beside the C++ class, and writes
bench/languages.md.

languages.py BUILD_DIR
"""
import contextlib
import datetime
import os
import pathlib
import statistics
import subprocess
import sys
import tempfile

SOURCE = pathlib.Path(__file__).resolve().parent
SIZES = (1000, 10000)
SEARCHES = 1000
WARM_UP = 2000
ROUNDS = 9
TEXTS = ["z", "zh", "zhang", "zhangs", "wxm", "lixiao", "tom", "张s", "chang", "xq"]
# Times that a language may take of those of C++.
LIMITS = {"Java": 1.3}

HEAD = """# Searches in other languages

Written by `bench/languages.py`, which `scripts/bench.sh` runs; do not edit by hand. {searches:,} searches
of the whole index for {texts} texts in turn, with the ids of the first 20 matches of each, in one process
per language. The processes take turns; of {rounds} rounds the table has the median time and the median
of the times divided by that of C++ in the same round. Java may take {java} of C++.

{date}.

| contacts | language | ms | beside C++ |
|---|---|---|---|
"""


class Loop:
    """A process that searches when it is told how often."""

    def __init__(self, command, environment):
        self.process = subprocess.Popen(command, stdin=subprocess.PIPE, stdout=subprocess.PIPE,
                                        encoding="utf-8", env={**os.environ, **environment})

    def search(self, times):
        """Seconds, and the sum of the ids found."""
        self.process.stdin.write(f"{times}\n")
        self.process.stdin.flush()
        nanoseconds, ids = self.process.stdout.readline().split()
        return int(nanoseconds) / 1e9, int(ids)

    def close(self):
        self.process.stdin.close()
        self.process.wait()


def commands(build):
    """The languages that are there, with the program of each and its environment."""
    bindings = build / "bindings"
    library = {"QVLOCALIZE_LIBRARY": str(bindings / "c/libqvlocalize.so.1"),
               "PYTHONPATH": str(SOURCE.parent / "bindings/python"), "LC_ALL": "C.UTF-8"}
    found = {"C++": ([build / "bench/qv_search_loop"], {}),
             "Python": ([sys.executable, SOURCE / "languages/search_loop.py"], library)}
    jar = build / "bench/search_loop.jar"
    if jar.is_file():
        found["Java"] = (["java", f"-Djava.library.path={bindings / 'java'}", "-cp",
                          f"{bindings / 'java/qvlocalize.jar'}:{jar}", "SearchLoop"], library)
    return found


def measure(build, contacts):
    """Per language the median time in seconds and the median share."""
    with tempfile.TemporaryDirectory(prefix="qv_languages_") as data, \
            contextlib.ExitStack() as stack:
        tool = build / "tools/qvlocalize"
        subprocess.run([tool, "sample", "--count", str(contacts), "--data-dir", data], check=True,
                       stdout=subprocess.DEVNULL)
        subprocess.run([tool, "index", "--data-dir", data], check=True, stdout=subprocess.DEVNULL)
        loops = {}
        for language, (command, environment) in commands(build).items():
            loops[language] = Loop([*map(str, command), data, *TEXTS], environment)
            stack.callback(loops[language].close)
            loops[language].search(WARM_UP)
        rounds = [{language: loop.search(SEARCHES) for language, loop in loops.items()}
                  for _ in range(ROUNDS)]
    assert len({ids for times in rounds for _, ids in times.values()}) == 1, "found differently"
    return {language: (statistics.median(times[language][0] for times in rounds),
                       statistics.median(times[language][0] / times["C++"][0] for times in rounds))
            for language in loops}


def main():
    build = pathlib.Path(sys.argv[1])
    text = HEAD.format(searches=SEARCHES, texts=len(TEXTS), rounds=ROUNDS, java=LIMITS["Java"],
                       date=datetime.date.today().isoformat())
    over = []
    for contacts in SIZES:
        for language, (seconds, share) in measure(build, contacts).items():
            text += f"| {contacts:,} | {language} | {seconds * 1e3:.1f} | {share:.2f} |\n"
            if share > LIMITS.get(language, share):
                over.append(f"{language} at {contacts:,} contacts takes {share:.2f} of C++")
    (SOURCE / "languages.md").write_text(text, encoding="utf-8")
    print(text.split("\n\n")[-1], end="")
    return "\n".join(over) or 0


sys.exit(main())
