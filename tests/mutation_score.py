#!/usr/bin/env python3
"""Measures what the tests catch: changes one token of the library at a time, rebuilds the test
programs and runs them. Prints each change with the case that noticed it, and the share caught.

Works in a clone of this checkout's last commit, below build/mutation; the same seed gives the same
changes. Takes up to half a minute a change."""
import argparse
import pathlib
import random
import re
import shutil
import subprocess
import tempfile

TOP = pathlib.Path(__file__).resolve().parent.parent
FOLDERS = ["Core", "LocalizerImpl", "MemManager", "DBOperator", "Filter", "Common"]
SECONDS = 240  # a program that takes longer hangs
MEMORY = 8 << 30
SWAPS = {"==": "!=", "!=": "==", "<": "<=", "<=": "<", ">": ">=", ">=": ">", "&&": "||", "||": "&&",
         "+": "-", "-": "+", "*": "+", "++": "--", "+=": "-=", "-=": "+=", "|=": "&=", "&=": "|=",
         "true": "false", "false": "true", "!": "", "0": "1", "1": "2", "continue": "break"}
TOKEN = re.compile(r'(?P<skip>//.*|"(?:\\.|[^"\\])*"|\'(?:\\.|[^\'\\])*\'|->|<<|>>|::|/=)|'
                   r"(?P<token>(?<![\w.])[01](?![\w.])|\b(?:true|false|continue)\b|"
                   r"[=!<>]=|&&|\|\||\+\+|[+|&-]=|(?<= )[<>+*-](?= )|!(?=[\w(]))|"
                   r"(?P<statement>^ +(?!delete|return)[\w.>-]+\([^;{}]*\);$)")
NO_CODE = re.compile(r"^\s*(#|static_assert|template|using|constexpr|LOG)|QV_LOG|Log\(|\boperator\b")


def mutants_of(path, name):
    """(file, line, column, before, after) of each token that can change."""
    for number, line in enumerate(path.read_text(encoding="utf-8").split("\n")):
        if NO_CODE.search(line):
            continue
        for match in TOKEN.finditer(line):
            if match["statement"]:
                yield name, number, 0, line, ""
            elif match["token"]:
                yield name, number, match.start(), match["token"], SWAPS[match["token"]]


def choose(tree, count, seed):
    """Evenly over the folders, in random order."""
    dice = random.Random(seed)
    pools = []
    for folder in FOLDERS:
        files = sorted((tree / folder).glob("**/*.cpp"))
        pool = [m for f in files for m in mutants_of(f, str(f.relative_to(tree)))]
        dice.shuffle(pool)
        pools.append(pool[:-(-count // len(FOLDERS))])
    return [mutant for row in zip(*pools) for mutant in row][:count]


def build(tree, targets=("all",)):
    return subprocess.run(["cmake", "--build", "build", "--target", *targets], cwd=tree,
                          capture_output=True, check=False).returncode == 0


def failure_of(program):
    """The first case that failed, or how else the program ended; empty when all passed."""
    with tempfile.TemporaryDirectory() as scratch:
        call = ["prlimit", f"--as={MEMORY}", "timeout", "-s", "KILL", str(SECONDS), program,
                "--gtest_fail_fast"]
        end = subprocess.run(call, cwd=scratch, env={"TMPDIR": scratch, "PATH": "/usr/bin:/bin"},
                             capture_output=True, encoding="utf-8", errors="replace", check=False)
    failed = re.search(r"\[  FAILED  \] (\S+)", end.stdout)
    if failed or not end.returncode:
        return failed[1] if failed else ""
    return f"{program.name} ends with {end.returncode}"


def killer_of(tree, programs, mutant):
    """What notices a change; None where it does not compile."""
    name, line, column, before, after = mutant
    source = tree / name
    text = source.read_text(encoding="utf-8")
    lines = text.split("\n")
    lines[line] = lines[line][:column] + after + lines[line][column + len(before):]
    source.write_text("\n".join(lines), encoding="utf-8")
    builds = build(tree, [program.name for program in programs])
    killer = next(filter(None, map(failure_of, programs)), "") if builds else None
    source.write_text(text, encoding="utf-8")
    return killer


def main():
    options = argparse.ArgumentParser(description=__doc__)
    options.add_argument("--count", type=int, default=204)
    options.add_argument("--seed", type=int, default=1)
    options = options.parse_args()

    tree = TOP / "build/mutation"
    shutil.rmtree(tree, ignore_errors=True)
    for call in (["git", "clone", "--quiet", TOP, tree],
                 ["cmake", "-G", "Ninja", "-S", tree, "-B", tree / "build",
                  "-DCMAKE_BUILD_TYPE=Release", "-DCMAKE_CXX_FLAGS_RELEASE=-O1"]):
        subprocess.run(call, check=True, stdout=subprocess.DEVNULL)
    assert build(tree), "the unchanged tree does not build"
    programs = [p for p in tree.glob("build/tests/**/test_*") if p.is_file() and not p.suffix]
    programs.sort(key=lambda p: ("fault" in p.name, p.name))
    for program in programs:
        assert not failure_of(program), f"{program.name} fails on the unchanged tree"

    caught = []
    for mutant in choose(tree, options.count, options.seed):
        killer = killer_of(tree, programs, mutant)
        if killer is not None:
            name, line, column, before, after = mutant
            print(f"{name}:{line + 1}:{column + 1}: {before.strip()} -> {after or 'nothing'}: "
                  f"{killer or 'SURVIVES'}", flush=True)
            caught.append(bool(killer))
    print(f"{sum(caught)} of {len(caught)} caught")


if __name__ == "__main__":
    main()
