#!/usr/bin/env python3
"""Holds a snapshot's summary, JSON on standard input, against one computed plainly from the file."""

import json
import math
import struct
import sys

with open(sys.argv[1], "rb") as file:
    records = [struct.unpack("<63I", record) for record in iter(lambda: file.read(252), b"")]
summary = json.load(sys.stdin)["summary"]
assert summary["intervals"] == len(records)
for name, base, host, nand in ("reads", 14, 27, 29), ("writes", 2, 28, 30):
    counts = [sum(record[base:base + 12:3]) for record in records]
    totals = [sum(record[base + 1:base + 12:3]) for record in records]
    means = sorted((total / count, -i)
                   for i, (total, count) in enumerate(zip(totals, counts)) if count)
    ranks = [means[math.ceil(len(means) * percent / 100) - 1][0] for percent in (50, 95, 99)]
    most, place = max((max(record[base + 2:base + 12:3]), -i) for i, record in enumerate(records))
    sectors = [sum(record[word] for record in records) for word in (host, nand)]
    expected = [sum(counts), sum(totals) / sum(counts), *ranks, most, records[-place][0], *sectors,
                sectors[1] / sectors[0]]
    expected += [figure for mean, i in means[:-6:-1] for figure in (records[-i][0], mean)]
    seen = [value for key, value in summary[name].items() if key != "slowest"]
    seen += [figure for interval in summary[name]["slowest"] for figure in interval.values()]
    assert len(seen) == len(expected)
    for one, other in zip(seen, expected):
        assert math.isclose(one, other, rel_tol=1e-12), (name, one, other)
print("agree")
