#!/usr/bin/env python3
"""make_tables.py names what is wrong with a table, writes nothing and ends with 1."""

import contextlib
import io
import pathlib
import sys
import tempfile
from typing import Callable, List, Tuple

ROOT = pathlib.Path(__file__).resolve().parents[2]
sys.path.insert(0, str(ROOT / "tools" / "data"))

import make_tables  # noqa: E402

FIRST = 0x4E00


# A kind of table, a way to spoil one that is right, and a part of the message that must tell it.
FAULTS: List[Tuple[str, Callable[[str], str], str]] = [
    ("pyfile", lambda text: text.replace("丁\ta\n", ""), "expected 15422 characters, found 15421"),
    ("pyfile", lambda text: text.replace("丁", "丂", 1), "丂 does not follow 丂"),
    ("pyfile", lambda text: text.replace("丁\ta\n", "丁\tv\n"), ":2: 'v' is no syllable"),
    ("pyfile", lambda text: text.replace("丁\ta\n", "丁\ta a\n"), "a reading stands twice"),
    ("pyfile", lambda text: text.replace("丁\ta\n", "\n"), "expected two columns, found 1"),
    ("pyfile", lambda text: text.replace("丁\ta\n", "é\ta\n"), "is not one character of U+4E00"),
    ("pyfile", lambda text: text[:-1], "the last line has no line end"),
    ("folding", lambda text: text.replace("丁\t丁\n", ""), "expected 3755 rows, found 3754"),
    ("folding", lambda text: text.replace("丁\t丁\n", "丁丁\t丁\n"), ":2: '丁丁' is not one character"),
]


def right_table(kind: str) -> str:
    count = make_tables.PY_WORD_COUNT if kind == "pyfile" else make_tables.FOLDING_ROWS
    chars = (chr(FIRST + index) for index in range(count))
    return "".join(f"{char}\t{'a' if kind == 'pyfile' else char}\n" for char in chars)


def run(kind: str, text: str, directory: pathlib.Path) -> str:
    """The program's error output; asserts that it writes its output exactly when it succeeds."""
    table, output = directory / "table.tsv", directory / "output"
    table.write_text(text, encoding="utf-8")
    output.unlink(missing_ok=True)
    with contextlib.redirect_stderr(io.StringIO()) as errors:
        result = make_tables.main([kind, str(table), str(output)])
    assert (result == 0) == output.exists() and result in (0, 1), f"{kind}: result {result}"
    return errors.getvalue()


def main() -> int:
    failures: List[str] = []
    with tempfile.TemporaryDirectory() as name:
        directory = pathlib.Path(name)
        for kind in ("pyfile", "folding"):
            if run(kind, right_table(kind), directory) != "":
                failures.append(f"{kind}: a right table is refused")
        for kind, spoil, message in FAULTS:
            errors = run(kind, spoil(right_table(kind)), directory)
            if message not in errors:
                failures.append(f"{kind}: expected {message!r}, told {errors!r}")
    for failure in failures:
        print(failure)
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main())
