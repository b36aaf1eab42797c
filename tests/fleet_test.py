"""Runs examples/fleet.py and the script of docs/archive.md on 2,000 dumps, and holds their results against
those of `morwick table`: on a cluster of three processes at a terminal, after a worker is killed, and without.
Usage: fleet_test.py MORWICK SOURCE"""
import bisect, contextlib, csv, io, os, pathlib, re, subprocess, sys, tempfile, textwrap, time
from concurrent.futures import ThreadPoolExecutor
from signal import SIGKILL

morwick, source = sys.argv[1:]
sys.path.append(source + "/examples")  # workers do not look there: none of their work may need fleet.py
import fleet, pandas
from dask.distributed import Client

# Key 4 counts the host's writes, 18 those to NAND, 47 the grown bad blocks.
record = lambda key, value: bytes([key, 0, 0, 0, 1, 0, 0, 0]) + value.to_bytes(8, "little")
# By the file's index, which is odd for a drive's last dump: empty, a zip file, a part of a header, no writes
# of the host, twice a figure that is missing, and numbers too large for a double. If a fault or a gap were
# taken for a value, the drive would stand out.
strange_dumps = {
    101: b"", 303: b"PK\3\4xxxxyyyyzzzz", 505: record(4, 1) + record(18, 900) + record(47, 900) + b"cut",
    707: record(4, 0) + record(18, 900) + record(47, 0), 909: record(18, 900) + record(47, 0), 911: record(7, 5),
    1111: record(4, 2**64 - 1) + record(18, 2**64 - 3) + record(47, 2**63 + 1)}


def as_rows(table):
    return [["" if pandas.isna(value) else str(value) for value in row] for row in table.itertuples(index=False)]


def ten_of(rows):
    """The ten drives that stand out most, without pandas. A folder is a drive; its last good dump counts."""
    drives = {os.path.dirname(row[0]): row for row in rows if not row[1]}.values()
    figures = [(file, int(nand) / int(host) if nand and host.strip("0") else None, int(bad) if bad else None)
               for file, _, host, nand, bad in drives]
    columns = {i: sorted(row[i] for row in figures if row[i] is not None) for i in (1, 2)}
    rank = lambda column, value: (  # twice the percentile of pandas
        bisect.bisect_left(column, value) + bisect.bisect(column, value) + 1) / len(column)
    return sorted(figures, reverse=True, key=lambda row: (
        max([rank(columns[i], row[i]) for i in (1, 2) if row[i] is not None], default=0)))[:10]


def wait_for(condition):
    for _ in range(600):  # 60 seconds
        if found := condition():
            return found
        time.sleep(0.1)
    raise TimeoutError


def start(*words):
    words += "--host", "127.0.0.1", "--dashboard-address", "127.0.0.1:0", "--scheduler-file", "scheduler.json"
    process = subprocess.Popen([sys.executable, "-m", "dask", *words], cwd="cluster", stdout=sys.stderr)
    at_end.callback(process.wait)
    at_end.callback(process.kill)  # first


with tempfile.TemporaryDirectory() as work, ThreadPoolExecutor() as threads, contextlib.ExitStack() as at_end:
    os.chdir(work)
    os.mkdir("cluster")  # from which nobody can import what is here
    subprocess.run([sys.executable, source + "/examples/make_fleet.py", "fleet"], check=True)
    files = fleet.list_dumps(work + "/fleet")
    assert len(files) == 2000
    for index, dump in strange_dumps.items():
        pathlib.Path(files[index]).write_bytes(dump)
    table = subprocess.run([morwick, "table", "-s", "kvr", "-n", ",".join(fleet.NAMES), work + "/fleet"],
                           capture_output=True, text=True).stdout
    rows = list(csv.reader(io.StringIO(table)))[1:]
    assert [row[0] for row in rows] == files and sum(row[1] != "" for row in rows) == 3
    start("scheduler", "--port", "0")
    for _ in range(2):
        start("worker", "--no-nanny", "--nthreads", "1")
    with Client(scheduler_file="cluster/scheduler.json") as client:
        client.wait_for_workers(2, timeout=60)
        scheduler = client.scheduler.address

        screen = subprocess.run(
            [sys.executable, source + "/tests/terminal.py", "30", "250", "CONT@60",  # may be silent for 60 s
             sys.executable, source + "/examples/fleet.py", work + "/fleet", "--scheduler", scheduler],
            capture_output=True, text=True).stdout.splitlines()
        assert screen[0].startswith("reading: 100%|█") and "10/10" in screen[0], screen
        assert screen[1:4] == [f"fleet.py: {row[0]}: {row[1]}" for row in rows if row[1]], screen
        assert [line.split() for line in screen[5:16]] == [
            [file, f"{amplification:.3f}", str(bad)] for file, amplification, bad in ten_of(rows)
        ] + [[]], screen
        assert screen[-1].endswith("status 1"), screen
        assert pathlib.Path("fleet.png").read_bytes().startswith(b"\x89PNG")

        # The script that docs/archive.md shows, without the cluster and on it.
        page = pathlib.Path(source + "/docs/archive.md").read_text()
        lines = textwrap.dedent(re.search("    import glob.*?\n(?=[^ \n])", page, re.DOTALL)[0])
        lines = lines.replace("/var/lib/dumps", work + "/fleet")
        highest = sorted((row for row in rows if not row[1] and row[3] and row[2].strip("0")),
                         key=lambda row: -int(row[3]) / int(row[2]))[:10]
        for script in lines, lines.replace("processes=False", repr(scheduler)):
            with contextlib.redirect_stdout(io.StringIO()) as printed:
                exec(script, names := {})
            names["client"].close()
            shown = [line.split()[0] for line in printed.getvalue().splitlines()[1:]]
            assert shown == [row[0] for row in highest], shown

        # One dump is a pipe. The worker that comes to it waits there, and is killed.
        pipe = work + "/pipe"
        os.mkfifo(pipe)
        at_end.callback(os.open, pipe, os.O_RDONLY | os.O_NONBLOCK)  # a thread that still waits for a reader goes on
        wait_for(lambda: not any(client.has_what().values()))  # no results of earlier scripts
        read = threads.submit(fleet.read, files[:1100] + [pipe] + files[1100:], scheduler)
        wait_for(lambda: sum(map(len, client.has_what().values())) == 10)  # of eleven parts
        [waiting] = [worker for worker, parts in client.processing().items() if parts]
        assert client.has_what()[waiting], "no part that it has read would be lost with it"
        pid = client.run(os.getpid, workers=[waiting])[waiting]
        os.kill(pid, SIGKILL)
        os.waitpid(pid, 0)  # only now its end of the pipe is closed
        threads.submit(pathlib.Path(pipe).write_bytes, strange_dumps[1111])  # waits for a reader
        assert as_rows(read.result(60)) == rows[:1100] + [[pipe, *rows[1111][1:]]] + rows[1100:]
        assert len(client.scheduler_info()["workers"]) == 1
    assert as_rows(fleet.read(files)) == rows, "without a cluster"
print("2,000 dumps agree")
