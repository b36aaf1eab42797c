"""The Python module beside the library and the command, in turn in one run.
Usage: python_bench.py BUILD_FOLDER FOLDER_WITH_DUMPS"""
import json, pathlib, statistics, subprocess, sys, threading, time, timeit

build, fleet = map(pathlib.Path, sys.argv[1:])
sys.path.insert(0, str(build / "python"))
import morwick

names = ["hostWrites", "nandWrites", "numGrownBad"]
dump = next(fleet.rglob("*.bin")).read_bytes()


def compare(what, first, second, factor=1, runs=9):
    """Each is called in turn and returns seconds; medians, and the median of the ratios."""
    times = [(first(), second()) for _ in range(runs)]
    medians = [statistics.median(column) for column in zip(*times)]
    ratio = statistics.median(b / a for a, b in times)
    print(f"{what}: {medians[0] * factor:.4g} {medians[1] * factor:.4g}, ratio {ratio:.2f}", flush=True)


def run(*words):
    start = time.perf_counter()
    subprocess.run(words, stdout=subprocess.DEVNULL, check=True)
    return time.perf_counter() - start


def walk():
    report = subprocess.run([build / "bench/parsers_bench", "--benchmark_filter=KVR/walk/x1$", "--benchmark_format=json"],
                            capture_output=True, check=True).stdout
    return json.loads(report)["benchmarks"][0]["real_time"] / 1e9


def call(function, number=2000):
    return lambda: timeit.timeit(function, number=number) / number


def some():
    parsed = morwick.parse(dump)
    return [parsed[name] for name in names]


def table(**options):
    return lambda: timeit.timeit(lambda: morwick.table(fleet, **options), number=1)


def parse_by(count, large, times=64):
    def work():
        for _ in range(times // count):
            morwick.parse(large)

    def timed():
        threads = [threading.Thread(target=work) for _ in range(count)]
        start = time.perf_counter()
        for thread in threads: thread.start()
        for thread in threads: thread.join()
        return time.perf_counter() - start

    return timed


python = [sys.executable, "-c"]
path = f"import sys; sys.path.insert(0, {str(build / 'python')!r}); "
compare("import numpy, import morwick, ms", lambda: run(*python, path + "import numpy"),
        lambda: run(*python, path + "import morwick"), 1e3)
compare("walk, parse and three names, us", walk, call(some), 1e6)
compare("walk, parse and all names, us", walk, call(lambda: morwick.parse(dump).items()), 1e6)
command = [build / "tools/morwick", "table", "-s", "kvr"]
compare("morwick table and morwick.table, three names, s", lambda: run(*command, "-n", ",".join(names), fleet), table(names=names))
compare("morwick table and morwick.table, all columns, s", lambda: run(*command, fleet), table())
compare("parse of a dump of 15 MB 64 times, by two threads and by one, s", parse_by(2, dump * 700), parse_by(1, dump * 700))
