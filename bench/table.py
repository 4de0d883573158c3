"""Runs benchmark programs and prints what they measured beside their targets.

    table.py PROGRAMS RESULTS [NAME...]

PROGRAMS is the folder of the built programs, RESULTS where their JSON goes. Each program
NAME has its targets in NAME.targets beside this file, a line each:

    what it tells | numerator | denominator | <= 1.25

Numerator and denominator are names of benchmarks, each standing for the median of its
repetitions in nanoseconds of wall time. NAME@cpu is its processor time, NAME@COUNTER one of
its counters. `X - Y` is a difference. A denominator may be a plain number with a unit: 1 ns,
1 us, 1 ms, 1 s, or 1 MB for a counter of bytes; then the row tells a time or a size and no
ratio. A row whose peer is not built in is skipped. The last column is <= or >= and a limit.
"""

import json
import pathlib
import re
import subprocess
import sys

UNITS = {"": 1.0, "ns": 1.0, "us": 1e3, "ms": 1e6, "s": 1e9, "KB": 1e3, "MB": 1e6}

# What a benchmark's name says of how it was measured is no part of the name here.
HOW = re.compile(r"/(process_time|real_time|manual_time|(iterations|min_time|repeats):[^/]*)")

# The repetitions of all benchmarks of a program are mixed, so that a slow minute of the
# machine falls on both sides of a ratio.
FLAGS = ["--benchmark_repetitions=5", "--benchmark_enable_random_interleaving=true",
         "--benchmark_report_aggregates_only=true", "--benchmark_min_time=0.2"]


def run(program, result):
    """Runs a program and gives its medians: {name: record}."""
    with result.with_suffix(".log").open("w") as log:
        subprocess.run([program, *FLAGS, f"--benchmark_out={result}",
                        "--benchmark_out_format=json"], check=True, stdout=log, stderr=log)
    records = json.loads(result.read_text())["benchmarks"]
    return {HOW.sub("", r["run_name"]): r for r in records
            if r.get("aggregate_name") == "median"}


def term(text, medians):
    """The value of one name or number; None where no such benchmark ran."""
    words = text.split()
    try:
        return float(words[0]) * UNITS[words[1] if len(words) > 1 else ""]
    except ValueError:
        pass
    name, _, metric = text.partition("@")
    record = medians.get(name)
    if record is None:
        return None
    if metric in ("", "cpu"):
        key = "cpu_time" if metric else "real_time"
        return record[key] * UNITS[record["time_unit"]]
    return record[metric]


def value(text, medians):
    left, minus, right = text.partition(" - ")
    values = [term(part.strip(), medians) for part in ([left, right] if minus else [left])]
    if None in values:
        return None
    return values[0] - values[1] if minus else values[0]


def is_literal(text):
    return text.split()[0].replace(".", "", 1).isdigit()


def rows_of(file):
    for number, line in enumerate(file.read_text().splitlines(), 1):
        if line.strip() and not line.startswith("#"):
            cells = [cell.strip() for cell in line.split("|")]
            if len(cells) != 4 or cells[3].split()[0] not in ("<=", ">="):
                sys.exit(f"{file}:{number}: not WHAT | NUMERATOR | DENOMINATOR | <= LIMIT")
            yield cells


def judge(cells, medians):
    """What a row measured and the verdict, as text."""
    what, numerator, denominator, target = cells
    above, below = value(numerator, medians), value(denominator, medians)
    if above is None or below is None:
        return [what, "", target, "skipped"]
    measured = above / below
    sign, limit = target.split()
    met = measured <= float(limit) if sign == "<=" else measured >= float(limit)
    unit = denominator.split()[1] if is_literal(denominator) and " " in denominator else "x"
    return [what, f"{measured:.3g} {unit}", f"{sign} {limit} {unit}", "met" if met else "MISSED"]


def main(programs, results, names):
    here = pathlib.Path(__file__).parent
    results.mkdir(parents=True, exist_ok=True)
    table = []
    for file in sorted(here.glob("*.targets")):
        name = file.stem
        if names and name not in names:
            continue
        print(f"{name} ...", file=sys.stderr, flush=True)
        medians = run(programs / name, results / f"{name}.json")
        for cells in rows_of(file):
            table.append([name, *judge(cells, medians)])
    heads = ["benchmark", "what", "measured", "target", "verdict"]
    widths = [max(len(row[i]) for row in [heads, *table]) for i in range(len(heads))]
    for row in [heads, ["-" * width for width in widths], *table]:
        print("  ".join(cell.ljust(width) for cell, width in zip(row, widths)).rstrip())
    count = {verdict: sum(row[4] == verdict for row in table)
             for verdict in ("met", "MISSED", "skipped")}
    print(f"\n{count['met']} met, {count['MISSED']} missed, {count['skipped']} skipped")
    return 1 if count["MISSED"] else 0


if __name__ == "__main__":
    if len(sys.argv) < 3:
        sys.exit(__doc__)
    sys.exit(main(pathlib.Path(sys.argv[1]), pathlib.Path(sys.argv[2]), sys.argv[3:]))
