"""Compares a table of data/ with what its program derives from the installed Unihan files."""

import bz2
import difflib
import pathlib
import sys
from typing import Set

ROOT = pathlib.Path(__file__).resolve().parents[2]
UNIHAN_DIR = pathlib.Path("/usr/share/unicode")
VERSION_LINE = "# Unicode version: "
SKIPPED = 77
SHOWN_LINES = 20

sys.path.insert(0, str(ROOT / "tools" / "data"))


def _version_of(path: pathlib.Path) -> str:
    """What the comment head of a Unihan file says, or "unknown"."""
    with bz2.open(path, "rt", encoding="utf-8") as source:
        for line in source:
            if line.startswith(VERSION_LINE):
                return line[len(VERSION_LINE) :].strip()
            if not line.startswith("#"):
                break
    return "unknown"


def installed_versions() -> Set[str]:
    """The Unicode versions that the installed Unihan files name: one, or none without the files."""
    return {_version_of(path) for path in UNIHAN_DIR.glob("Unihan_*.txt.bz2")}


def skip_without_recorded_version() -> None:
    """Ends the test as skipped where a table derived anew could rightly differ."""
    recorded = (ROOT / "data" / "unicode-data.version").read_text(encoding="utf-8").strip()
    installed = installed_versions()
    if installed != {recorded}:
        found = ", ".join(sorted(installed)) or "none"
        print(f"skipped: derived from Unihan {recorded}, installed in {UNIHAN_DIR}: {found}")
        sys.exit(SKIPPED)


def differs(table: pathlib.Path, derived: str) -> bool:
    """Whether the table differs from its derived text in any byte; prints the first lines that do."""
    content = table.read_bytes()
    if content == derived.encode("utf-8"):
        return False
    print(f"{table} is not what its program derives:")
    lines = difflib.unified_diff(
        content.decode("utf-8").splitlines(), derived.splitlines(), "recorded", "derived", n=0, lineterm=""
    )
    for _, line in zip(range(SHOWN_LINES), lines):
        print(line)
    return True
