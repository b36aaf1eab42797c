"""Reads the dumps of a fleet with Dask, here or on a cluster, and says which drives stand out.

A drive is a folder of dumps whose names are in the order of their days; its last good dump counts.
A drive stands out when few have a write amplification as high, or as many grown bad blocks. A picture
shows how both spread over the fleet. A dump with a fault is named on standard error and ranks nowhere;
the status is 1 then."""

import argparse
import os
import sys

import morwick
import pandas
from dask.distributed import Client, as_completed
from matplotlib.figure import Figure
from tqdm import tqdm

NAMES = ["hostWrites", "nandWrites", "numGrownBad"]
MEASURES = {"amplification": "write amplification", "numGrownBad": "grown bad blocks"}
PART = 200  # dumps in a task: few enough that no worker waits long for another at the end
LOOPBACK = {"dashboard_address": "127.0.0.1:0", "worker_dashboard_address": "127.0.0.1:0"}  # any port


def list_dumps(path):
    """The files in a folder and below, or those that a list names, one a line."""
    if not os.path.isdir(path):
        with open(path, errors="surrogateescape") as names:
            return [name for name in names.read().split("\n") if name]
    files = []
    unreadable = lambda error: files.append(error.filename)  # gets a row that says why
    for folder, _, names in os.walk(path, onerror=unreadable, followlinks=True):
        files += [os.path.join(folder, name) for name in names]
    return sorted(files, key=os.fsencode)


def read(files, scheduler=None):
    """The statistics, a row for each dump. One machine needs no processes: threads read in parallel."""
    parts = [files[i:i + PART] for i in range(0, len(files), PART)]
    with Client(scheduler) if scheduler else Client(processes=False, **LOOPBACK) as client:
        # Not pure: a file may have other content next time.
        tables = client.map(morwick.table, parts, names=NAMES, jobs=1, pure=False)
        for _ in tqdm(as_completed(tables), "reading", len(tables), disable=None):
            pass  # the bar moves, at a terminal
        return pandas.concat([table.to_pandas() for table in client.gather(tables)],
                             ignore_index=True)


def rank(table):
    """The drives, those that stand out most first."""
    good = table[table.fault.isna()].sort_values("file")
    drives = good.groupby(good.file.map(os.path.dirname)).tail(1)
    host = drives.hostWrites.replace(0, pandas.NA)
    drives = drives.assign(amplification=drives.nandWrites / host)
    drives["place"] = drives[list(MEASURES)].astype(float).rank(pct=True).max(axis=1)
    return drives.dropna(subset="place").sort_values("place", ascending=False, kind="stable")


def draw(drives, picture):
    """Draws how many drives have each value or more; dots are the ten that stand out most."""
    figure = Figure(figsize=(9, 4.2), layout="constrained")
    panels = figure.subplots(1, 2, sharey=True)
    for panel, (name, title) in zip(panels, MEASURES.items()):
        values = drives[name].astype(float)
        count = values.rank(ascending=False, method="max")
        order = values.sort_values().index
        panel.step(values[order], count[order])
        panel.plot(values[:10], count[:10], "o", color="tab:red", label="the ten that stand out")
        panel.set(xlabel=title, yscale="log")
        panel.grid(alpha=0.4)
    panels[0].set_ylabel("drives that have as much or more")
    panels[0].legend()
    figure.savefig(picture)


def main():
    parser = argparse.ArgumentParser(description=__doc__)
    parser.add_argument("dumps", metavar="FOLDER|LIST",
                        help="where the dumps are, under names that all workers know")
    parser.add_argument("--scheduler", metavar="ADDRESS",
                        help="of a cluster, such as tcp://HOST:8786; this machine if not given")
    parser.add_argument("--picture", metavar="FILE", default="fleet.png",
                        help="fleet.png if not given")
    options = parser.parse_args()
    sys.stdout.reconfigure(errors="surrogateescape")
    files = list_dumps(options.dumps)
    if not files:
        parser.error(f"{options.dumps}: there are no dumps in it")
    table = read(files, options.scheduler)
    bad = table[table.fault.notna()]
    for file, fault in zip(bad.file, bad.fault):
        print(f"fleet.py: {file}: {fault}", file=sys.stderr)
    drives = rank(table)
    if drives.empty:
        sys.exit("fleet.py: no drive has a good dump with these statistics")
    ten = drives[:10].set_index("file")[list(MEASURES)].rename_axis(None)
    ten = ten.rename(columns=MEASURES)
    print(ten.to_string(float_format="{:.3f}".format))
    draw(drives, options.picture)
    return 1 if len(bad) else 0


if __name__ == "__main__":
    try:
        sys.exit(main())
    except (OSError, ValueError) as error:
        sys.exit(f"fleet.py: {error}")
