"""Compares the dynamic symbols that a library defines with the reviewed list of its processor, and
checks that no reference of the library to one of them can be bound elsewhere.

exported_symbols_test.py NM READELF CXXFILT LIBRARY LIST [--update]

A line of the list is a symbol as the linker knows it, a tab, and the same for readers. --update
writes the list; look at its difference before it goes into the repository.
"""
import difflib
import pathlib
import re
import subprocess
import sys

NM, READELF, CXXFILT, LIBRARY = sys.argv[1:5]
LIST = pathlib.Path(sys.argv[5])


def output(*command, **options):
    return subprocess.run(command, check=True, capture_output=True, encoding="utf-8",
                          **options).stdout.splitlines()


def main():
    symbols = sorted(line.split()[0] for line in output(NM, "--dynamic", "--defined-only",
                                                        "--format=posix", LIBRARY))
    readable = output(CXXFILT, input="\n".join(symbols))
    lines = [f"{symbol}\t{name}" for symbol, name in zip(symbols, readable)]
    if "--update" in sys.argv:
        LIST.write_text("\n".join(lines) + "\n", encoding="utf-8")
        return 0
    reviewed = LIST.read_text(encoding="utf-8").splitlines()
    faults = list(difflib.unified_diff(reviewed, lines, "reviewed", "exported", lineterm="", n=0))
    relocations = "\n".join(output(READELF, "--relocs", "--wide", LIBRARY))
    looked_up = set(re.findall(r"(?m)^\S+ +\S+ +R_\S+ +\S+ +([^\s@]+)", relocations))
    faults += [f"bound by the dynamic linker: {name}" for name in sorted(looked_up & set(symbols))]
    print("\n".join(faults))
    if faults:
        print("Update the list with --update if the difference is meant; see docs/embedding.md.")
    return 1 if faults else 0


sys.exit(main())
