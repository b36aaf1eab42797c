#!/usr/bin/env python3
"""Compares the summaries of snapshots, JSON on standard input, with those computed plainly from the files."""
import bisect, collections, itertools, json, math, re, struct, sys
from pathlib import Path


def span(groups, percent):
    """The least and the greatest latency that the percentile of all operations can be, by nearest rank. Of each
    group only the count, the total and the longest latency are known."""
    groups = [group for group in groups if group[0]]
    rank = math.ceil(sum(group[0] for group in groups) * percent / 100)
    latencies = range(max(group[2] for group in groups))

    def can_be(latency):  # can operations up to the rank take so little?
        return sum(count if latency >= longest else
                   min(count - 1, max(0, count * longest - total) // (longest - latency))
                   for count, total, longest in groups) >= rank

    def cannot_exceed(latency):  # can none of those from the rank on take more?
        return sum(0 if latency >= longest else
                   1 + min(count - 1, max(0, total - longest) // (latency + 1))
                   for count, total, longest in groups) <= sum(count for count, *_ in groups) - rank

    return [bisect.bisect_left(latencies, True, key=key) for key in (can_be, cannot_exceed)]


# All operations of two small groups.
small = [latencies for count in range(1, 5)
         for latencies in itertools.combinations_with_replacement(range(6), count)]
seen = collections.defaultdict(set)
for one, other in itertools.product(small, repeat=2):
    groups = tuple((len(group), sum(group), max(group)) for group in (one, other))
    for percent in 20, 50, 95:
        rank = math.ceil(len(one + other) * percent / 100)
        seen[groups, percent].add(sorted(one + other)[rank - 1])
for case, latencies in seen.items():
    assert span(*case) == [min(latencies), max(latencies)], case

for name, line in zip(sys.argv[1:], sys.stdin, strict=True):
    records = list(struct.iter_unpack("<63I", Path(name).read_bytes()))
    summary = json.loads(line)["summary"]
    assert summary["intervals"] == len(records)
    for kind, base, host, nand in ("reads", 14, 27, 29), ("writes", 2, 28, 30):  # words of a record
        counts = [sum(record[base:base + 12:3]) for record in records]
        totals = [sum(record[base + 1:base + 12:3]) for record in records]
        means = sorted((total / n, -i) for i, (total, n) in enumerate(zip(totals, counts)) if n)
        groups = [record[at:at + 3] for record in records for at in range(base, base + 12, 3)]
        bounds = [bound for percent in (50, 95, 99) for bound in span(groups, percent)]
        most, place = max((max(record[base + 2:base + 12:3]), -i) for i, record in enumerate(records))
        sectors = [sum(record[word] for record in records) for word in (host, nand)]
        expected = [sum(counts), sum(totals) / sum(counts), *bounds, most, records[-place][0], *sectors,
                    sectors[1] / sectors[0]]
        expected += [figure for mean, i in means[:-6:-1] for figure in (records[-i][0], mean)]
        seen = map(float, re.findall(r": ([-+.e\d]+)", json.dumps(summary[kind])))  # in their order, at any depth
        for one, other in zip(seen, expected, strict=True):
            assert math.isclose(one, other, rel_tol=1e-12), (name, kind, one, other)

print(len(sys.argv) - 1, "agree")
