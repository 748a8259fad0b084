#!/usr/bin/env python3
"""Measures how many small faults the test suite catches.

Applies one change at a time to the library sources (a flipped comparison, a
dropped byte swap, a constant off by one, a skipped statement, a swapped
logical operator or boolean), rebuilds the test executables in their own
build directory, runs the release tests and counts the mutant as killed when
any test fails. The sample is drawn with a fixed seed, so two runs over the
same sources try the same mutants and their figures can be compared.

The source file is always put back from a saved copy, also on Ctrl-C; a copy
left behind by a run that was killed outright is put back at the next start.
"""

import argparse
import os
import random
import re
import shutil
import signal
import subprocess
import sys
import time

ROOT = os.path.dirname(os.path.dirname(os.path.abspath(__file__)))
SOURCE_DIRS = ["api", "datasource/src", "qoramb", "platform"]
TARGETS = ["datasource_tests", "api_tests", "qoramb_tests"]
BACKUP_SUFFIX = ".mutate-orig"

# Spaces around the operator keep template brackets, shifts and arrows out.
FLIPS = {" < ": " <= ", " <= ": " < ", " > ": " >= ", " >= ": " > ",
         " == ": " != ", " != ": " == ", " && ": " || ", " || ": " && "}
FLIP_RE = re.compile("|".join(re.escape(k) for k in sorted(FLIPS, key=len, reverse=True)))
BOOL_RE = re.compile(r"\b(true|false)\b")
INT_RE = re.compile(r"(?<![\w.'])(\d+)(?![\w.'])")
SWAP_VALUE_RE = re.compile(r"\bSwapInt32(?=\()")
SWAP_CALL_RE = re.compile(r"\bSwapBytes\(")
STATEMENT_END = (";", "{", "}", ":")
# Deleting a declaration only breaks the build; such lines are left alone.
DECLARATION_RE = re.compile(r"^\s*((const|static|constexpr)\s+)*[\w:]+(<[^;]*>)?[\s*&]+\w+\s*[={(;\[]")


def code_only(line):
    """The line with string and character literals and comments blanked."""
    out, quote, i = [], None, 0
    while i < len(line):
        c = line[i]
        if quote:
            if c == "\\":
                out.append("  ")
                i += 2
                continue
            out.append(" " if c != quote else c)
            quote = None if c == quote else quote
        elif c in "\"'":
            quote = c
            out.append(c)
        elif line.startswith("//", i):
            break
        else:
            out.append(c)
        i += 1
    return "".join(out).ljust(len(line))


def closing_paren(text, open_at):
    depth = 0
    for i in range(open_at, len(text)):
        depth += {"(": 1, ")": -1}.get(text[i], 0)
        if depth == 0:
            return i
    return None


def line_mutants(line, code, starts_statement):
    """(description, new line) for every change this line allows."""
    found = []
    for m in FLIP_RE.finditer(code):
        new = FLIPS[m.group()]
        found.append((f"'{m.group().strip()}' -> '{new.strip()}'",
                      line[:m.start()] + new + line[m.end():]))
    for m in BOOL_RE.finditer(code):
        new = "false" if m.group() == "true" else "true"
        found.append((f"{m.group()} -> {new}", line[:m.start()] + new + line[m.end():]))
    for m in INT_RE.finditer(code):
        value = int(m.group())
        new = str(value + 1 if value == 0 or m.start() % 2 else value - 1)
        found.append((f"{value} -> {new}", line[:m.start()] + new + line[m.end():]))
    for m in SWAP_VALUE_RE.finditer(code):
        found.append(("SwapInt32 dropped", line[:m.start()] + line[m.end():]))
    for m in SWAP_CALL_RE.finditer(code):
        end = closing_paren(code, m.end() - 1)
        if end is not None:
            found.append(("SwapBytes dropped", line[:m.start()] + "(void)0" + line[end + 1:]))
    stripped = code.strip()
    if (starts_statement and stripped.endswith(";") and stripped.count("(") == stripped.count(")")
            and not stripped.startswith(("return", "using", "typedef", "static_assert"))
            and not DECLARATION_RE.match(code)):
        indent = line[:len(line) - len(line.lstrip())]
        found.append(("statement deleted", indent + ";\n"))
    return found


def file_mutants(path):
    mutants, in_block, prev_end = [], False, ";"
    with open(path, encoding="utf-8") as f:
        lines = f.readlines()
    for number, line in enumerate(lines, 1):
        stripped = line.strip()
        if in_block or stripped.startswith("/*"):
            in_block = "*/" not in stripped
            continue
        if not stripped or stripped.startswith(("#", "//")):
            continue
        code = code_only(line.rstrip("\n")) + "\n"
        for desc, new in line_mutants(line, code, prev_end.endswith(STATEMENT_END)):
            mutants.append((path, number, desc, new))
        prev_end = code.strip() or prev_end
    return mutants


def all_mutants():
    found = []
    for d in SOURCE_DIRS:
        for base, _, names in sorted(os.walk(os.path.join(ROOT, d))):
            for name in sorted(names):
                if name.endswith(".cpp"):
                    found.extend(file_mutants(os.path.join(base, name)))
    return found


def run(cmd, cwd, timeout):
    try:
        return subprocess.run(cmd, cwd=cwd, stdout=subprocess.PIPE, stderr=subprocess.STDOUT,
                              text=True, timeout=timeout).returncode
    except subprocess.TimeoutExpired:
        return None


def failures(build):
    """The tests the last run failed, in the order ctest lists them."""
    try:
        with open(os.path.join(build, "Testing", "Temporary", "LastTestsFailed.log")) as f:
            return [line.strip().split(":", 1)[-1] for line in f if line.strip()]
    except OSError:
        return []


def object_of(build, path):
    rel = os.path.relpath(path, ROOT)
    return os.path.join(build, "CMakeFiles", "qoracore.dir", rel + ".o")


class Mutation:
    """One change applied to one file; leaving puts the file and its object back,
    with their times, so the next build recompiles neither."""

    def __init__(self, build, path, number, new_line):
        self.path, self.number, self.new_line = path, number, new_line
        self.obj = object_of(build, path)

    def __enter__(self):
        shutil.copy2(self.path, self.path + BACKUP_SUFFIX)
        shutil.copy2(self.obj, self.obj + BACKUP_SUFFIX)
        with open(self.path, encoding="utf-8") as f:
            lines = f.readlines()
        lines[self.number - 1] = self.new_line
        with open(self.path, "w", encoding="utf-8") as f:
            f.writelines(lines)
        return self

    def __exit__(self, *exc):
        os.replace(self.obj + BACKUP_SUFFIX, self.obj)
        os.replace(self.path + BACKUP_SUFFIX, self.path)
        # The executables were linked with the mutant: make the object newer.
        os.utime(self.obj)
        return False


def restore_leftovers(build):
    for d in SOURCE_DIRS:
        for base, _, names in os.walk(os.path.join(ROOT, d)):
            for name in names:
                if name.endswith(BACKUP_SUFFIX):
                    src = os.path.join(base, name[: -len(BACKUP_SUFFIX)])
                    os.replace(os.path.join(base, name), src)
                    obj = object_of(build, src)
                    if os.path.exists(obj + BACKUP_SUFFIX):
                        os.replace(obj + BACKUP_SUFFIX, obj)
                    print(f"restored {src} from an interrupted run")


def configure(build):
    if os.path.exists(os.path.join(build, "CMakeCache.txt")):
        return
    cmd = ["cmake", "-S", ROOT, "-B", build, "-DCMAKE_BUILD_TYPE=RelWithDebInfo"]
    if shutil.which("ld.lld"):
        cmd += ["-DCMAKE_EXE_LINKER_FLAGS=-fuse-ld=lld", "-DCMAKE_SHARED_LINKER_FLAGS=-fuse-ld=lld"]
    subprocess.run(cmd, check=True, stdout=subprocess.DEVNULL)


def main():
    parser = argparse.ArgumentParser(description=__doc__.split("\n")[0])
    parser.add_argument("--count", type=int, default=100)
    parser.add_argument("--seed", type=int, default=16)
    parser.add_argument("--build", default=os.path.join(ROOT, "build-mutate"))
    parser.add_argument("--jobs", default="2")
    parser.add_argument("--list", action="store_true", help="print the sample and stop")
    parser.add_argument("--kills", metavar="FILE",
                        help="run every test against every mutant and write, one line per "
                             "mutant, the tests that kill it (slower; shows which tests "
                             "nothing else can replace)")
    parser.add_argument("--exclude", metavar="REGEX",
                        help="leave out the tests the regular expression names")
    parser.add_argument("--only", metavar="LOG",
                        help="try only the sampled mutants named in LOG (a run's output)")
    args = parser.parse_args()

    sample = random.Random(args.seed).sample(all_mutants(), args.count)
    if args.only:
        with open(args.only, encoding="utf-8") as f:
            named = f.read()
        sample = [m for m in sample if f"{os.path.relpath(m[0], ROOT)}:{m[1]}: {m[2]}" in named]
    if args.list:
        for path, number, desc, _ in sample:
            print(f"{os.path.relpath(path, ROOT)}:{number}: {desc}")
        return 0
    signal.signal(signal.SIGTERM, lambda *_: sys.exit(143))
    build = os.path.abspath(args.build)
    configure(build)
    restore_leftovers(build)
    build_cmd = ["cmake", "--build", build, "-j", args.jobs, "--target"] + TARGETS
    excluded = "InstallAndBuildExamples" + ("|" + args.exclude if args.exclude else "")
    test_cmd = ["ctest", "--timeout", "60", "-j", args.jobs, "-E", excluded]
    if not args.kills:
        test_cmd.append("--stop-on-failure")
    kills = open(args.kills, "w", encoding="utf-8") if args.kills else None
    if run(build_cmd, ROOT, None) != 0 or run(test_cmd, build, None) != 0:
        print("the unchanged sources do not build or pass their tests")
        return 1

    started = time.time()
    killed, survived, unbuilt = [], [], []
    for i, (path, number, desc, new) in enumerate(sample, 1):
        where = f"{os.path.relpath(path, ROOT)}:{number}: {desc}"
        with Mutation(build, path, number, new):
            if run(build_cmd, ROOT, 900) != 0:
                unbuilt.append(where)
                verdict = "does not build"
            elif run(test_cmd, build, 1800) == 0:
                survived.append(where)
                verdict = "SURVIVED"
            else:
                killed.append(where)
                failed = failures(build) or ["a timeout"]
                verdict = "killed by " + failed[0]
                if kills:
                    print("\t".join([where] + failed), file=kills, flush=True)
        print(f"[{i}/{len(sample)}] {where}: {verdict}", flush=True)
    run(build_cmd, ROOT, None)

    built = len(killed) + len(survived)
    minutes = (time.time() - started) / 60
    print(f"\n{len(killed)} of {built} mutants that build killed "
          f"({100.0 * len(killed) / max(built, 1):.1f}%); {len(unbuilt)} did not build; "
          f"{minutes:.1f} minutes")
    print("survivors:")
    for where in survived:
        print("  " + where)
    return 0


if __name__ == "__main__":
    sys.exit(main())
