#!/usr/bin/env python3
"""Judges and prints the rows of the benchmarks (bench/Rounds.h) that the files named hold. Ends with 1 when one is out of
bounds. With --table FILE the first file is a head in Markdown, and both go to FILE as well."""

import statistics
import sys


def quartiles(figures):
    if len(figures) == 1:
        return figures * 3
    return statistics.quantiles(figures, n=4, method="inclusive")


def seconds(value):
    for unit, size in (("s", 1), ("ms", 1e-3), ("µs", 1e-6), ("ns", 1e-9)):
        if abs(value) >= size or unit == "ns":
            break
    digits = 0 if value / size >= 100 else 1 if value / size >= 10 else 2
    return f"{value / size:.{digits}f} {unit}" if value else "0"


def spread(figures, text):
    low, middle, high = quartiles(figures)
    return text(middle) if low == high else f"{text(middle)} ({text(low)} to {text(high)})"


def times(value):
    return f"{value:.2f}"


class Row:
    def __init__(self, line):
        parts = line.rstrip("\n").split("\t")[1:]
        self.what, unit, bound, self.rest, side = parts[:5]
        ours = [float(cost) for cost in parts[5].split()]
        text = seconds if unit == "s" else times
        self.ours = spread(ours, text) + ("" if side == "library" else f", {side}")
        self.peer = self.theirs = self.ratio = ""
        judged = ours
        if len(parts) > 6:
            self.peer = parts[6]
            theirs = [float(cost) for cost in parts[7].split()]
            self.theirs = spread(theirs, text)
            faster = bound[:2] != "<="
            judged = [b / a if faster else a / b for a, b in zip(ours, theirs)]
            self.ratio = spread(judged, times)
            text = lambda value: f"{value:g}"
        low, _, high = quartiles(judged)
        limit = float(bound[2:]) if bound else 0
        self.good = not bound or (high >= limit if bound[:2] == ">=" else low <= limit)
        self.bound = {">=": "at least ", "<=": "at most "}[bound[:2]] + text(limit) if bound else ""
        self.verdict = ("good" if self.good else "OUT OF BOUNDS") if bound else ""

    def cells(self):
        return (self.what, self.ours, self.peer, self.theirs, self.ratio, self.bound, self.verdict)


def main(arguments):
    table = head = None
    if arguments[0] == "--table":
        table, head, arguments = arguments[1], arguments[2], arguments[3:]
    rows = []
    for name in arguments:
        with open(name, encoding="utf-8") as file:
            rows += [Row(line) for line in file if line.startswith("row\t")]
    if table:
        titles = ("What", "Library", "Peer", "Peer's", "Ratio", "Bound", "Verdict", "What the difference consists of")
        with open(head, encoding="utf-8") as file, open(table, "w", encoding="utf-8") as out:
            out.write(file.read() + "\n| " + " | ".join(titles) + " |\n|" + "---|" * len(titles) + "\n")
            for row in rows:
                out.write("| " + " | ".join((*row.cells(), row.rest)) + " |\n")
    else:
        for row in rows:
            print("%-44s %-34s %-30s %-34s %-22s %-15s %s" % row.cells())
    return all(row.good for row in rows)


sys.exit(0 if main(sys.argv[1:]) else 1)
