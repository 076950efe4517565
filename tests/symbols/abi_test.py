"""Compares the binary interface of the library, types included, with the recorded one.

abi_test.py CMAKE BUILD_DIR LIBRARY RECORD [--update]

LIBRARY has debug information; BUILD_DIR is a build whose installed headers tell the interface from
the rest. RECORD is what libabigail's abidw writes, compressed. --update writes it; that is for
changes that are meant, and a change of the interface that breaks programs also needs another
SOVERSION. Ends with 77 where there is nothing to compare with.
"""
import gzip
import pathlib
import shutil
import subprocess
import sys
import tempfile

CMAKE, BUILD, LIBRARY = sys.argv[1:4]
RECORD = pathlib.Path(sys.argv[4])
DESCRIBE = ["--exported-interfaces-only", "--drop-private-types", "--drop-undefined-syms",
            "--no-parameter-names", "--no-show-locs", "--no-comp-dir-path", "--no-corpus-path",
            "--no-elf-needed", "--no-write-default-sizes"]


def run(*command):
    subprocess.run([str(word) for word in command], check=True, stdout=subprocess.DEVNULL)


def main():
    updating = "--update" in sys.argv
    if shutil.which("abidw") is None or shutil.which("abidiff") is None:
        print("not run: libabigail is not installed")
        return 77
    if not RECORD.exists() and not updating:
        print(f"not run: compilers describe an interface in different ways, and there is no "
              f"{RECORD.name}")
        return 77
    with tempfile.TemporaryDirectory(prefix="qv_abi_") as directory:
        root = pathlib.Path(directory)
        run(CMAKE, "--install", BUILD, "--prefix", root)
        headers, now, recorded = root / "include/QV_Localize", root / "now", root / "recorded"
        run("abidw", *DESCRIBE, "--headers-dir", headers, "--out-file", now, LIBRARY)
        if updating:
            RECORD.write_bytes(gzip.compress(now.read_bytes(), mtime=0))
            return 0
        recorded.write_bytes(gzip.decompress(RECORD.read_bytes()))
        return subprocess.run(["abidiff", recorded, now], check=False).returncode


sys.exit(main())
