#!/usr/bin/env python3
"""Measures what the tests catch: changes one token of the library at a time, rebuilds the test
programs and runs them. Prints the share of the changes that some case noticed, those that none did
and, with --all-killers, the cases that were never the only ones to notice.

Works in a clone of this checkout's last commit, below build/mutation; the same seed gives the same
changes. Takes up to half a minute a change."""
import argparse
import json
import pathlib
import random
import re
import resource
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


def build(tree, targets=()):
    call = ["cmake", "--build", "build"] + (["--target", *targets] if targets else [])
    return subprocess.run(call, cwd=tree, capture_output=True, check=False).returncode == 0


def run(program, fail_fast):
    """The cases that failed."""
    limits = lambda: resource.setrlimit(resource.RLIMIT_AS, (MEMORY, MEMORY))
    with tempfile.TemporaryDirectory() as scratch:
        report = pathlib.Path(scratch) / "report.json"
        call = [program, f"--gtest_output=json:{report}"] + ["--gtest_fail_fast"] * fail_fast
        try:
            end = subprocess.run(call, cwd=scratch, env={"TMPDIR": scratch, "PATH": "/usr/bin:/bin"},
                                 capture_output=True, timeout=SECONDS, preexec_fn=limits, check=False)
        except subprocess.TimeoutExpired:
            return [f"{program.name}: hangs"]
        if end.returncode == 0:
            return []
        if not report.exists():
            return [f"{program.name}: ends"]
        cases = [c for s in json.loads(report.read_text())["testsuites"] for c in s["testsuite"]]
        return [f"{c['classname']}.{c['name']}" for c in cases if "failures" in c]


def killers_of(tree, programs, mutant, all_killers):
    """The cases that notice a change; None where it does not compile."""
    name, line, column, before, after = mutant
    source = tree / name
    text = source.read_text(encoding="utf-8")
    lines = text.split("\n")
    lines[line] = lines[line][:column] + after + lines[line][column + len(before):]
    source.write_text("\n".join(lines), encoding="utf-8")
    killers = [] if build(tree, [p.name for p in programs]) else None
    for program in programs if killers is not None else []:
        if not killers or all_killers:
            killers += run(program, not all_killers)
    source.write_text(text, encoding="utf-8")
    return killers


def main():
    options = argparse.ArgumentParser(description=__doc__)
    options.add_argument("--count", type=int, default=204)
    options.add_argument("--seed", type=int, default=1)
    options.add_argument("--revision", default="HEAD", help="the commit to measure")
    options.add_argument("--all-killers", action="store_true", help="run all cases, every time")
    options = options.parse_args()

    tree = TOP / "build" / f"mutation-{options.revision}"
    shutil.rmtree(tree, ignore_errors=True)
    subprocess.run(["git", "clone", "--quiet", TOP, tree], check=True)
    subprocess.run(["git", "checkout", "--quiet", "--detach", options.revision], cwd=tree, check=True)
    subprocess.run(["cmake", "-G", "Ninja", "-B", "build", "-DCMAKE_BUILD_TYPE=Release",
                    "-DCMAKE_CXX_FLAGS_RELEASE=-O1"], cwd=tree, check=True, capture_output=True)
    assert build(tree), "the unchanged tree does not build"
    programs = sorted((p for p in tree.glob("build/tests/**/test_*") if p.is_file() and not p.suffix),
                      key=lambda p: ("fault" in p.name, p.name))
    for program in programs:
        assert not run(program, True), f"{program.name} fails on the unchanged tree"

    found = {}
    for mutant in choose(tree, options.count, options.seed):
        killers = killers_of(tree, programs, mutant, options.all_killers)
        if killers is not None:
            name, line, column, before, after = mutant
            told = f"{name}:{line + 1}:{column + 1}: {before.strip()} -> {after or 'nothing'}"
            print(f"{told}: {', '.join(killers) or 'SURVIVES'}", flush=True)
            found[told] = killers
    survivors = [told for told, killers in found.items() if not killers]
    print(f"\n{len(found) - len(survivors)} of {len(found)} caught; not caught:", *survivors, sep="\n  ")
    if options.all_killers:
        only = {killers[0] for killers in found.values() if len(killers) == 1}
        seen = {killer for killers in found.values() for killer in killers}
        print("never the only one:", *sorted(seen - only), sep="\n  ")


if __name__ == "__main__":
    main()
