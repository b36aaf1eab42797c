#!/usr/bin/env python3
"""Compares the summaries of snapshots, JSON on standard input, with those computed plainly from the files."""
import bisect, itertools, json, math, random, re, struct, sys
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


def tried_span(groups, percent):
    """The same, found by trying all operations that make such groups."""
    possible = [[latencies for latencies in itertools.product(range(longest + 1), repeat=count)
                 if sum(latencies) == total and max(latencies) == longest] for count, total, longest in groups]
    rank = math.ceil(sum(group[0] for group in groups) * percent / 100)
    seen = {sorted(itertools.chain(*choice))[rank - 1] for choice in itertools.product(*possible)}
    return [min(seen), max(seen)]


def check(name, line):
    records = list(struct.iter_unpack("<63I", Path(name).read_bytes()))
    summary = json.loads(line)["summary"]
    assert summary["intervals"] == len(records)
    for kind, base, host, nand in ("reads", 14, 27, 29), ("writes", 2, 28, 30):  # words of a record
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
        seen = map(float, re.findall(r": ([-+.e\d]+)", json.dumps(summary[kind])))  # in their order, at any depth
        for one, other in zip(seen, expected, strict=True):
            assert math.isclose(one, other, rel_tol=1e-12), (name, kind, one, other)


random.seed(1)
for _ in range(300):
    operations = [random.choices(range(6), k=random.randint(1, 4)) for _ in range(2)]
    groups = [(len(group), sum(group), max(group)) for group in operations]
    percent = random.choice((20, 50, 95))
    assert span(groups, percent) == tried_span(groups, percent), (groups, percent)
for name, line in zip(sys.argv[1:], sys.stdin, strict=True):
    check(name, line)
print(len(sys.argv) - 1, "agree")
