#!/usr/bin/env python3
"""Prints one table of benchmark results.

benchmark_table.py RESULT...    each the JSON file of a benchmark program, with or without ".json"

Medians, where a benchmark was repeated. Columns:
  time       wall-clock time of one run
  per item   the same divided by the items of one run (pixels, rows, nodes: as the program counts them)
  GB/s       bytes read plus bytes written, in 10^9 bytes a second
  memcpy     time, as a multiple of what memcpy takes for the same bytes in the same program run: the benchmarks
             named "memcpy/<bytes>", of which the one nearest in size is taken; or the counter "to_memcpy" of a
             program that measured the two by turns
  plain      how many times faster than the plain version: the benchmark whose name differs in one part alone, which
             is "plain" or, where there is none, "threads_1"; per item, where items are counted; or the counter
             "to_plain" of a program that measured the two by turns
  notes      label and counters of the program
"""

import json
import os
import sys

TIME_UNITS = {"ns": 1e-9, "us": 1e-6, "ms": 1e-3, "s": 1.0}
BASELINES = ("plain", "threads_1")

# What Google Benchmark writes of its own; every other number of an entry is a counter of the program.
OWN_NUMBERS = {
    "family_index", "per_family_instance_index", "repetitions", "repetition_index", "threads", "iterations",
    "real_time", "cpu_time", "bytes_per_second", "items_per_second", "to_memcpy",
    "to_plain",
}


class Row:
    """One benchmark: its median run."""

    def __init__(self, entry):
        self.name = entry["run_name"].removesuffix("/real_time")
        self.seconds = entry["real_time"] * TIME_UNITS[entry["time_unit"]]
        self.bytes_per_second = entry.get("bytes_per_second")
        self.items_per_second = entry.get("items_per_second")
        self.to_memcpy = entry.get("to_memcpy")
        self.to_plain = entry.get("to_plain")
        counters = [f"{key} {value:.4g}" for key, value in entry.items()
                    if isinstance(value, (int, float)) and not isinstance(value, bool) and key not in OWN_NUMBERS]
        self.notes = ", ".join(filter(None, [entry.get("label", ""), *counters]))
        self.failure = entry.get("error_message", "skipped") if entry.get("error_occurred") else None

    @property
    def bytes(self):
        return self.bytes_per_second * self.seconds if self.bytes_per_second else None

    @property
    def items(self):
        return self.items_per_second * self.seconds if self.items_per_second else None


def read_rows(path):
    """The rows of one result file in the order of the program: medians where there are any, single runs elsewhere."""
    with open(path, encoding="utf-8") as file:
        entries = json.load(file)["benchmarks"]
    rows = {}
    for entry in entries:
        is_median = entry.get("aggregate_name") == "median"
        is_single = entry.get("run_type") == "iteration" and entry["run_name"] not in rows
        if is_median or is_single:
            rows[entry["run_name"]] = Row(entry)
    return list(rows.values())


def memcpy_ratio(row, rows):
    """Time of the row as a multiple of memcpy's for the same bytes; None where there is nothing to compare."""
    if row.to_memcpy:
        return row.to_memcpy
    copies = [other for other in rows if other.name.startswith("memcpy/") and other.bytes]
    if not row.bytes or not copies or row in copies:
        return None
    nearest = min(copies, key=lambda other: abs(other.bytes - row.bytes))
    return nearest.bytes_per_second / row.bytes_per_second


def find_baseline(row, rows):
    """The plain version of the row: equal in all parts of the name but one, which is the baseline's mark."""
    parts = row.name.split("/")
    for mark in BASELINES:
        for other in rows:
            other_parts = other.name.split("/")
            if len(other_parts) != len(parts) or mark not in other_parts:
                continue
            differing = [i for i, part in enumerate(parts) if part != other_parts[i]]
            if len(differing) == 1 and other_parts[differing[0]] == mark and parts[differing[0]] not in BASELINES:
                return other
    return None


def plain_ratio(row, rows):
    """How many times faster than its plain version the row is, per item where items are counted."""
    if row.to_plain:
        return row.to_plain
    plain = find_baseline(row, rows)
    if plain is None or plain.failure or not row.seconds:
        return None
    if plain.items and row.items:
        return row.items_per_second / plain.items_per_second
    return plain.seconds / row.seconds


def format_seconds(seconds):
    for unit, size in (("s", 1.0), ("ms", 1e-3), ("us", 1e-6)):
        if seconds >= size:
            return f"{seconds / size:.3g} {unit}" if seconds / size < 1000 else f"{seconds / size:.0f} {unit}"
    return f"{seconds * 1e9:.3g} ns"


def cells(row, rows):
    """The texts of the row's columns."""
    if row.failure:
        return [row.name, row.failure, "", "", "", "", row.notes]
    memcpy, plain = memcpy_ratio(row, rows), plain_ratio(row, rows)
    return [
        row.name,
        format_seconds(row.seconds),
        format_seconds(row.seconds / row.items) if row.items else "",
        f"{row.bytes_per_second / 1e9:.1f}" if row.bytes_per_second else "",
        f"{memcpy:.2f} x" if memcpy else "",
        f"{plain:.2f} x" if plain else "",
        row.notes,
    ]


def print_table(lines):
    header = ["benchmark", "time", "per item", "GB/s", "memcpy", "plain", "notes"]
    widths = [max(len(line[i]) for line in [header, *lines]) for i in range(len(header))]

    def print_line(line):
        texts = [line[0].ljust(widths[0])] + [line[i].rjust(widths[i]) for i in range(1, 6)] + [line[6]]
        print("  ".join(texts).rstrip())

    print_line(header)
    print("-" * (sum(widths) + 2 * (len(widths) - 1)))
    for line in lines:
        print_line(line)


def main(arguments):
    if not arguments:
        print(__doc__, file=sys.stderr)
        return 2
    lines = []
    for argument in arguments:
        path = argument if os.path.exists(argument) else argument + ".json"
        try:
            rows = read_rows(path)
        except (OSError, ValueError, KeyError) as failure:
            print(f"benchmark_table: {path}: {failure}", file=sys.stderr)
            return 1
        lines.extend(cells(row, rows) for row in rows)
    print()
    print_table(lines)
    print("\nMedians. memcpy: time as a multiple of memcpy's for the same bytes read plus written, in the same run.")
    print("plain: how many times faster than the plain version, or than one thread, in the same run.")
    return 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
