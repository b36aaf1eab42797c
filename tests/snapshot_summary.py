#!/usr/bin/env python3
"""Holds a snapshot's summary, JSON on standard input, against one computed plainly from the file."""

import bisect
import json
import math
import struct
import sys


def span(groups, percent):
    """The least and the most that the percentile of single operations can be, by nearest rank."""
    groups = [group for group in groups if group[0]]
    rank = math.ceil(sum(group[0] for group in groups) * percent / 100)
    latencies = range(max(group[2] for group in groups))

    def enough(latency):  # can operations up to the rank take so little?
        return sum(count if latency >= longest else
                   min(count - 1, max(0, count * longest - total) // (longest - latency))
                   for count, total, longest in groups) >= rank

    def too_much(latency):  # can none of those from the rank on take more?
        return sum(0 if latency >= longest else
                   1 + min(count - 1, max(0, total - longest) // (latency + 1))
                   for count, total, longest in groups) <= sum(count for count, *_ in groups) - rank

    return [bisect.bisect_left(latencies, True, key=key) for key in (enough, too_much)]


with open(sys.argv[1], "rb") as file:
    records = [struct.unpack("<63I", record) for record in iter(lambda: file.read(252), b"")]
summary = json.load(sys.stdin)["summary"]
assert summary["intervals"] == len(records)
for name, base, host, nand in ("reads", 14, 27, 29), ("writes", 2, 28, 30):
    counts = [sum(record[base:base + 12:3]) for record in records]
    totals = [sum(record[base + 1:base + 12:3]) for record in records]
    means = sorted((total / count, -i)
                   for i, (total, count) in enumerate(zip(totals, counts)) if count)
    groups = [record[at:at + 3] for record in records for at in range(base, base + 12, 3)]
    bounds = [bound for percent in (50, 95, 99) for bound in span(groups, percent)]
    most, place = max((max(record[base + 2:base + 12:3]), -i) for i, record in enumerate(records))
    sectors = [sum(record[word] for record in records) for word in (host, nand)]
    expected = [sum(counts), sum(totals) / sum(counts), *bounds, most, records[-place][0], *sectors,
                sectors[1] / sectors[0]]
    expected += [figure for mean, i in means[:-6:-1] for figure in (records[-i][0], mean)]
    seen = [value for key, value in summary[name].items() if key != "slowest"]
    seen = [one for value in seen for one in (value.values() if isinstance(value, dict) else [value])]
    seen += [figure for interval in summary[name]["slowest"] for figure in interval.values()]
    assert len(seen) == len(expected)
    for one, other in zip(seen, expected):
        assert math.isclose(one, other, rel_tol=1e-12), (name, one, other)
print("agree")
