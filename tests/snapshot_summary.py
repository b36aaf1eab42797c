#!/usr/bin/env python3
"""The figures of a snapshot, computed plainly from standard input: a line for reads, one for writes."""

import math
import struct
import sys

records = [struct.unpack("<63I", record)
           for record in iter(lambda: sys.stdin.buffer.read(252), b"")]
for base, host, nand in (14, 27, 29), (2, 28, 30):
    counts = [sum(record[base:base + 12:3]) for record in records]
    totals = [sum(record[base + 1:base + 12:3]) for record in records]
    means = sorted((total / count, -i)
                   for i, (total, count) in enumerate(zip(totals, counts)) if count)
    ranks = [means[math.ceil(len(means) * percent / 100) - 1][0] for percent in (50, 95, 99)]
    most, place = max((max(record[base + 2:base + 12:3]), -i) for i, record in enumerate(records))
    sectors = [sum(record[word] for record in records) for word in (host, nand)]
    print(sum(counts), *(f"{figure:.6f}" for figure in (sum(totals) / sum(counts), *ranks)), most,
          records[-place][0], *sectors, f"{sectors[1] / sectors[0]:.6f}",
          *(f"{records[-i][0]}:{mean:.6f}" for mean, i in means[:-6:-1]))
