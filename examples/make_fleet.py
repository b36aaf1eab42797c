"""Makes up the dumps of a fleet: 1,000 drives on two days, the same ones every time.
Usage: make_fleet.py FOLDER"""

import pathlib
import random
import struct
import sys

folder = pathlib.Path(sys.argv[1])
random.seed(1)
for number in range(1000):
    drive = folder / f"rack{number // 40:02}" / f"drive{number % 40:02}"
    drive.mkdir(parents=True)
    amplification = 1.1 + random.lognormvariate(-0.7, 0.4)
    bad = random.choice((0, 0, 1, 3))
    if random.random() < 0.01:
        amplification *= 2
    if random.random() < 0.01:
        bad += random.randrange(5, 40)
    host = random.randrange(10 ** 8, 10 ** 11)
    for day in (24, 25):
        host += random.randrange(10 ** 9)
        bad += random.random() < 0.1
        # The keys of hostWrites, nandWrites and numGrownBad.
        values = {4: host, 18: int(host * amplification), 47: bad}
        (drive / f"2026-11-{day}.bin").write_bytes(
            b"".join(struct.pack("<IIQ", key, 1, value) for key, value in values.items()))
