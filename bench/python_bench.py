"""The Python module beside the library and the command, in turn in one run.
Usage: python_bench.py BUILD_FOLDER FOLDER_WITH_DUMPS"""
import json, pathlib, statistics, subprocess, sys, threading, time, timeit

build, fleet = map(pathlib.Path, sys.argv[1:])
sys.path.insert(0, str(build / "python"))
import morwick

names = ["hostWrites", "nandWrites", "numGrownBad"]
dump = next(fleet.rglob("*.bin")).read_bytes()


def compare(what, first, second, factor=1, runs=9):
    """Calls both in turn; each returns seconds, printed times `factor`. Prints medians, and the medians
    of ratios and differences. The first turn only warms the caches."""
    first(), second()
    times = [(first(), second()) for _ in range(runs)]
    medians = [statistics.median(column) for column in zip(*times)]
    ratio = statistics.median(b / a for a, b in times)
    more = statistics.median(b - a for a, b in times)
    print(f"{what}: {medians[0] * factor:.4g} {medians[1] * factor:.4g}, ratio {ratio:.2f}, more {more * factor:.4g}", flush=True)


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


def some(data):
    parsed = morwick.parse(data)
    return [parsed[name] for name in names]


def everything(data):
    return morwick.parse(data).items()


def table(**options):
    return lambda: timeit.timeit(lambda: morwick.table(fleet, **options), number=1)


def by_threads(count, function, data, times):
    """The seconds that `count` threads take for the same work together."""
    def work():
        for _ in range(times // count): function(data)

    threads = [threading.Thread(target=work) for _ in range(count)]
    start = time.perf_counter()
    for thread in threads: thread.start()
    for thread in threads: thread.join()
    return time.perf_counter() - start


python = [sys.executable, "-c"]
path = f"import sys; sys.path.insert(0, {str(build / 'python')!r}); "
compare("import numpy, import morwick, ms", lambda: run(*python, path + "import numpy"),
        lambda: run(*python, path + "import morwick"), 1e3)
compare("walk, parse and three names, us", walk, call(lambda: some(dump)), 1e6)
compare("walk, parse and all names, us", walk, call(lambda: everything(dump)), 1e6)
command = [build / "tools/morwick", "table", "-s", "kvr"]
compare("morwick table and morwick.table, three names, s", lambda: run(*command, "-n", ",".join(names), fleet), table(names=names))
compare("morwick table and morwick.table, all columns, s", lambda: run(*command, fleet), table())
for copies, times in (1, 20000), (8, 5000), (700, 64):
    for what, function in ("parse", morwick.parse), ("three names", some), ("all names", everything):
        work = function, dump * copies, times
        compare(f"{what} of {len(dump) * copies} bytes {times} times, by two threads and by one, s",
                lambda: by_threads(2, *work), lambda: by_threads(1, *work))
