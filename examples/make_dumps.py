#!/usr/bin/env python3
"""Makes the example dumps in this folder; the same ones every time."""

import gzip
import math
import pathlib
import random
import struct

folder = pathlib.Path(__file__).parent
random.seed(1)


def statistics(records):
    """KVR and FTL records: key id, length in 64-bit words, values. The library lists the keys."""
    return b"".join(
        struct.pack(f"<II{len(values)}Q", key, len(values), *values) for key, values in records)


(folder / "kvr.bin").write_bytes(statistics([
    (53, [7]), (52, [4096]), (51, [8]), (50, [1152]), (49, [16384]),
    (7, [918273645]), (4, [123456789]), (19, [1020304050]), (18, [234567891]), (20, [40961]),
    (48, [312]), (47, [23]), (17, [77]), (265, [900, 80, 7, 1, 0]),
]))

(folder / "ftl.bin").write_bytes(statistics([
    (1, [5]), (2, [45678]), (3, [98765]), (14, [2 ** i for i in range(10)]),
    (9, [12]), (10, [13]), (11, [1]),
]))

(folder / "msp.bin").write_bytes(b"".join(
    struct.pack(f"<HH{len(values)}I", key, 4 * len(values), *values) for key, values in [
        (4096, [812345]), (4127, [5, 4, 3, 2, 1, 0, 0, 0, 0, 0]), (4137, [3]),
        (8195, list(range(31, 47))), (8202, [4]),
    ]))


def record(second):
    """The words of one SnapshotRecord: a load that rises and falls, and a burst of slow writes."""
    load = 1 + math.sin(second / 9) ** 2
    burst = 40 if 55 <= second < 65 else 1
    words = [0] * 63
    words[0] = second
    for priority in range(4):
        writes = int(300 * load / (priority + 1)) + random.randrange(20)
        reads = int(700 * load / (priority + 1)) + random.randrange(50)
        write_latency = writes * (90 + random.randrange(30)) * burst
        read_latency = reads * (60 + random.randrange(20)) * (1 + burst // 8)
        at = 3 * priority
        words[2 + at:5 + at] = [writes, write_latency, 900 * burst + random.randrange(300)]
        words[14 + at:17 + at] = [reads, read_latency, 700 * (1 + burst // 8)]
    words[1] = 10 * burst // 4
    words[26:32] = [2 * burst, 9000, 4000, 9500, 4400 + 10 * burst, 120 * burst]
    words[33] = 1
    words[36:38] = [3, 17]
    words[39:46] = [1230 * burst, burst, 4 * burst, 310 - burst, 2, 10, 5120 - 20 * burst]
    words[47:49] = [6, 9]
    words[50:55] = [12, 1, 256, 2, 31]
    return struct.pack("<63I", *words)


(folder / "snapshot.bin").write_bytes(b"".join(record(second) for second in range(1, 121)))

# A header that describes the fixed layout: kind, offset, size and format of each field. A format with
# two numbers prints thousandths, which is kind 2.
descriptors = [(2 if form.count(b"%") == 2 else 0, offset, 4, form) for offset, form in (
    (0, b"T=%04u"), (104, b" E=%02u"), (108, b" HR=%4u"), (112, b" HW=%4u"), (116, b" NR=%4u"),
    (120, b" NW=%4u"), (156, b" TH=%8u.%02u"), (124, b" GC=%4u"), (132, b" W=%2u"),
    (144, b" BI=%3u"), (148, b" BU=%3u"), (180, b" V=%5u"), (188, b" BF=%2u"), (192, b"/%2u"),
    (4, b" P=%2u"), (164, b" H=%2u"), (160, b"/%2u"), (200, b" X=%2u"), (204, b"/%2u"),
    (172, b" L=%3u"), (176, b"/%3u"), (212, b" C=%2u"), (216, b"/%2u"), (168, b" S=%4u"),
    (208, b" U=%8u"))]
descriptors += [(3, 56, 48, b" R%s="), (3, 8, 48, b" W%s=")]
text = b"Example layout\0\0"
table = 36 + len(text)
(folder / "snapshot_header.bin").write_bytes(
    struct.pack("<9I", 0, 6, 252, 121, 0, 0, table, 0, 0) + text +  # 120 records, and 1 is not printed
    struct.pack("<II", len(descriptors), 0) +
    b"".join(struct.pack("<HHII16s", kind, 0, offset, size, form)
             for kind, offset, size, form in descriptors))

# A dump of each machine on two days; one machine wears out, one dump was cut, one is compressed.
for machine, writes, amplification, bad in (
        ("b7", 80, 1.5, (2, 2)), ("b8", 95, 3.9, (11, 19)), ("c2", 31, 1.6, (0, 0))):
    for day in (0, 1):
        host = (writes + day) * 10 ** 9 + 123456
        dump = statistics([(57, [1795503600 + 86400 * day]), (4, [host]), (7, [2 * host]),
                           (18, [int(host * amplification)]), (47, [bad[day]]), (10, [3])])
        file = folder / "fleet" / machine / f"2026-11-{24 + day}.bin"
        file.parent.mkdir(parents=True, exist_ok=True)
        if machine == "c2" and day == 1:
            dump = dump[:60]
        if machine == "b7" and day == 0:
            file, dump = file.with_suffix(".bin.gz"), gzip.compress(dump, mtime=0)
        file.write_bytes(dump)
