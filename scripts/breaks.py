"""Runs the breaks of tests/breaks.txt; scripts/breaks calls it from the project's folder."""

import pathlib
import re
import shutil
import subprocess
import sys

ROOT = pathlib.Path.cwd()
WORK = ROOT / "build" / "breaks"
SOURCE = WORK / "source"
BUILD = WORK / "build"


def read_breaks(path):
    """Blocks of `key: value` lines, set apart by blank lines."""
    breaks = []
    for block in re.split(r"\n\s*\n", path.read_text()):
        lines = [line for line in block.splitlines() if line and not line.startswith("#")]
        if lines:
            breaks.append(dict(line.split(": ", 1) for line in lines))
    return breaks


def run(*command):
    return subprocess.run(command, capture_output=True, text=True)


def copy_sources():
    """What git tracks and what it does not ignore, as it is now; files that are the same keep their time."""
    names = run("git", "ls-files", "-co", "--exclude-standard", "-z").stdout.split("\0")
    for name in filter(None, names):
        old, new = ROOT / name, SOURCE / name
        if not old.is_file():
            continue
        if new.is_file() and new.read_bytes() == old.read_bytes():
            continue
        new.parent.mkdir(parents=True, exist_ok=True)
        shutil.copy(old, new)


def build(target):
    return run("cmake", "--build", str(BUILD), "--target", target)


def first_failure(program):
    """The name of the first test that fails, or that it died of; None when all pass."""
    path = next(BUILD.rglob(program))
    try:
        result = subprocess.run([str(path), "--gtest_brief=1"], capture_output=True, text=True,
                                errors="replace", cwd=path.parent, timeout=120)
    except subprocess.TimeoutExpired:
        return "did not end"
    failed = re.search(r"\[  FAILED  \] ([\w./]+)", result.stdout)
    if failed:
        return failed.group(1)
    return f"died with {result.returncode}" if result.returncode else None


def try_break(entry):
    """What caught the break; None when nothing did. Raises where the break itself is wrong."""
    path = SOURCE / entry["file"]
    text = path.read_text()
    if text.count(entry["old"]) != 1:
        raise SystemExit(f"{entry['break']}: `{entry['old']}` stands {text.count(entry['old'])} "
                         f"times in {entry['file']}, not once")
    path.write_text(text.replace(entry["old"], entry["new"]))
    try:
        if build(entry["tests"]).returncode:
            raise SystemExit(f"{entry['break']}: the broken code does not compile")
        return first_failure(entry["tests"])
    finally:
        path.write_text(text)


def main(words):
    breaks = [entry for entry in read_breaks(ROOT / "tests" / "breaks.txt")
              if not words or any(word in entry["break"] for word in words)]
    copy_sources()
    configured = run("cmake", "-S", str(SOURCE), "-B", str(BUILD), "-G", "Ninja",
                     "-DCMAKE_BUILD_TYPE=RelWithDebInfo")
    if configured.returncode:
        raise SystemExit(configured.stderr)
    for program in sorted({entry["tests"] for entry in breaks}):
        built = build(program)
        if built.returncode:
            raise SystemExit(built.stdout)
        if (failure := first_failure(program)) is not None:
            raise SystemExit(f"{program} fails before anything is broken: {failure}")
    missed = 0
    for entry in breaks:
        caught = try_break(entry)
        missed += caught is None
        print(f"{entry['break']:<64} {caught or 'NOT CAUGHT'}", flush=True)
    print(f"\n{len(breaks) - missed} caught, {missed} not caught")
    return 1 if missed else 0


sys.exit(main(sys.argv[1:]))
