"""The module beside the command, by what both make of the same bytes; and what it owes Python."""

import ctypes, gzip, json, mmap, os, pathlib, pickle, random, struct, subprocess, sys, textwrap, threading, time
from concurrent.futures import ThreadPoolExecutor

import numpy as np
import pytest
from hypothesis import given, settings, strategies

import morwick

SOURCE = pathlib.Path(os.environ["SOURCE"])
COMMAND = os.environ["MORWICK"]
SANITIZED = bool(os.environ.get("SANITIZED"))
COUNT = 25 if SANITIZED else 500  # the command takes its time there
STREAMS = ["kvr", "ftl", "msp"]
EXAMPLES = sorted((SOURCE / "examples").glob("*.bin"))
SNAPSHOT = (SOURCE / "examples/snapshot.bin").read_bytes()
HEADER = (SOURCE / "examples/snapshot_header.bin").read_bytes()
KVR = (SOURCE / "examples/kvr.bin").read_bytes()


def command(*words):
    environment = {k: v for k, v in os.environ.items() if k != "LD_PRELOAD"}
    return subprocess.run([COMMAND, *map(str, words)], capture_output=True, env=environment)


def random_dump(stream, seed):
    """Records of keys that the stream knows, few of them so that they come again; some of another
    length or unknown, and the end sometimes cut or overwritten."""
    chance = random.Random(f"{stream} {seed}")
    keys = chance.sample(morwick.keys(stream), 12)
    dump = b""
    for _ in range(chance.randrange(40)):
        key = chance.choice(keys)
        size = chance.choice([key.size] * 5 + [0, 1, key.size // 2, key.size + 1])
        number = chance.choice([key.id] * 9 + [chance.randrange(0x2FFE)])
        if stream == "msp":
            values = [chance.getrandbits(chance.randrange(33)) for _ in range(size)]
            dump += struct.pack(f"<HH{size}I", number, 4 * size, *values)
        else:
            values = [chance.getrandbits(chance.randrange(65)) for _ in range(size)]
            dump += struct.pack(f"<II{size}Q", number, size, *values)
    if chance.random() < 0.3:
        dump = dump[: chance.randrange(len(dump) + 1)]
    return dump + bytes(chance.getrandbits(8) for _ in range(chance.choice([0, 0, 0, 2, 9])))


@pytest.fixture(scope="module")
def dumps(tmp_path_factory):
    """Files of each stream: every fuzz seed, without the byte that chooses, every example, and
    random ones; each a mixture of what is read as its own stream and as the others."""
    folder = tmp_path_factory.mktemp("dumps")
    for stream in STREAMS:
        for seed in range(COUNT):
            (folder / f"{stream}-{seed}").write_bytes(random_dump(stream, seed))
        for seed in (SOURCE / "fuzz/seeds").glob("*/*"):
            if seed.name != "gzip":  # which the command unpacks
                (folder / f"{stream}-seed-{seed.name}").write_bytes(seed.read_bytes()[1:])
        for example in EXAMPLES:
            (folder / f"{stream}-{example.name}").write_bytes(example.read_bytes())
    return folder


def entries_of(report):
    for entry in report["entries"]:
        if "value" in entry:
            yield entry["name"], entry["value"]
        for index, value in enumerate(entry.get("values", [])):
            yield f"{entry['name']}{index}", value


def plain(value):
    return value.tolist() if isinstance(value, np.ndarray) else value


def by_key(entries, stream):
    """The last value of each key, by way of the names of its elements."""
    values = {}
    names = {}
    for key in morwick.keys(stream):
        separator = "_" if stream == "ftl" and key.size > 1 else ""
        for index in range(key.size):
            names[key.name + separator + (str(index) if key.size > 1 else "")] = (key, index)
        names.setdefault(key.name + separator, (key, 0))
    for name, value in entries:
        key, index = names[name]
        if key.size == 1:
            values[key.name] = value
        elif index == 0:
            values[key.name] = [value]  # a dict keeps the place of the first
        else:
            values[key.name].append(value)
    return values


@pytest.mark.parametrize("stream", STREAMS)
def test_statistics_are_those_of_the_command(dumps, stream):
    files = sorted(dumps.glob(f"{stream}-*"))
    ask = lambda file: json.loads(command("stats", "-s", stream, "-o", "json", file).stdout)
    with ThreadPoolExecutor(2) as pool:
        reports = list(pool.map(ask, files))
    faults = 0
    for file, report in zip(files, reports):
        statistics = morwick.parse(file.read_bytes(), stream)
        entries = list(entries_of(report))
        assert statistics.entries == entries, file
        values = {name: plain(value) for name, value in statistics.items()}
        assert list(values.items()) == list(by_key(entries, stream).items()), file
        assert values == {name: plain(statistics[name]) for name in statistics}
        summary = {name: plain(value) for name, value in statistics.summary.items()}
        if "writeAmplification" in summary:
            summary["writeAmplification"] = float(f"{summary['writeAmplification']:.3f}")
        said = report.get("summary", {}).items()  # a large number comes once more, as NAME_s
        assert list(summary.items()) == [item for item in said if not item[0].endswith("_s")], file
        said = [message["text"] for message in report["messages"] if message["severity"] == "error"]
        assert (statistics.fault or "") == "; ".join(text.removeprefix(f"{file}: ") for text in said)
        faults += statistics.fault is not None
        assert 0 <= statistics.end <= file.stat().st_size
    assert 0 < faults < len(files)


@pytest.mark.parametrize("stream", STREAMS)
@pytest.mark.parametrize("names", [None, ["*His*", "host*", "blockReadErrors*"][:2]])
def test_table_is_that_of_the_command(dumps, stream, names):
    names = names if names is None or stream != "msp" else ["*e*"]
    lines = command("table", "-s", stream, *(["-n", ",".join(names)] if names else []), dumps).stdout
    heading, *rows = [line.split(",") for line in lines.decode().replace('", ', "").splitlines()]
    seen = []
    table = morwick.table(dumps, stream, names, progress=lambda *now: seen.append(now))
    assert list(table) == heading[2:] and len(table.files) == len(rows)
    cells = [["" if cell is np.ma.masked else str(cell) for cell in table[name]] for name in table]
    if cells:
        width = len(table)
        assert [row[-width:] for row in rows] == [list(row) for row in zip(*cells)]
    assert table.files == [row[0] for row in rows]
    for file, fault in zip(table.files, table.faults):
        assert fault == morwick.parse(pathlib.Path(file).read_bytes(), stream).fault
    assert seen[-1] == (len(rows), sum(fault is not None for fault in table.faults))
    again = pickle.loads(pickle.dumps(table))
    assert all((again[name].filled(7) == table[name].filled(7)).all() for name in list(table)[:9])
    frame = table.to_pandas()
    assert list(frame)[:2] == ["file", "fault"]
    if len(table):
        name = list(table)[-1]
        assert str(frame[name].dtype) == "UInt64"
        assert frame[name].isna().tolist() == np.ma.getmaskarray(table[name]).tolist()


def test_table_takes_what_the_command_takes(tmp_path):
    (tmp_path / "a\udcff").write_bytes(KVR)
    (tmp_path / "b").write_bytes(gzip.compress(KVR[:20]))
    for files in (tmp_path, str(tmp_path), [os.fsencode(tmp_path)], iter([tmp_path / "a\udcff", tmp_path / "b"])):
        table = morwick.table(files, names="hostReads", jobs=2)
        assert table.files == [f"{tmp_path}/a\udcff", f"{tmp_path}/b"]
        assert table["hostReads"].tolist() == [918273645, None]
        assert table.faults[0] is None and "offset 16" in table.faults[1]
    assert morwick.table([]).files == []
    assert "No such file" in morwick.table("missing").faults[0]


def test_snapshots_and_texts_are_those_of_the_command(tmp_path):
    chance = random.Random(3)
    for number in range(2 if SANITIZED else 20):
        data = SNAPSHOT if number == 0 else chance.randbytes(chance.randrange(4000))
        (tmp_path / "data").write_bytes(data)
        (tmp_path / "header").write_bytes(HEADER)
        text = command("snapshot", tmp_path / "data").stdout
        assert len(data) < 252 or morwick.render(data).encode() == text
        text = command("snapshot", "--header", tmp_path / "header", tmp_path / "data").stdout
        assert morwick.render(data, HEADER).encode() == text
        if len(data) < 252:
            continue
        heading, *rows = command("snapshot", "-o", "csv", tmp_path / "data").stdout.decode().splitlines()
        records = morwick.snapshot(data)
        columns = {name: row for name, row in zip(heading.split(","), zip(*[map(int, row.split(",")) for row in rows]))}
        for name, field in [("T", "timestamp"), ("TH_us", "hysteresisTime"), ("C_max", "commandTagsMax"),
                            ("H_normal", "qosDelaysNormal"), ("X_failed", "expeditesFailed"), ("S", "freeSegments")]:
            assert columns[name] == tuple(records[field]), name
        for letter, field in ("R", "reads"), ("W", "writes"):
            for part, inner in ("O", "count"), ("L", "totalLatency"), ("M", "maxLatency"):
                for priority in range(4):
                    expected = columns[f"{letter}{part}_{priority}"]
                    assert expected == tuple(records[field][inner][:, priority])
        assert records.shape == (len(data) // 252,) and records.dtype.itemsize == 252


def test_described_snapshot_has_what_the_header_describes():
    described, fixed = morwick.snapshot(SNAPSHOT, HEADER), morwick.snapshot(SNAPSHOT)
    count = struct.unpack_from("<I", HEADER, 12)[0] - 1
    assert len(described) == count
    for label, field in ("T", "timestamp"), ("TH", "hysteresisTime"), ("HW", "hostWrites"):
        assert (described[label] == fixed[field][:count]).all() and described.dtype[label] == "<u4"
    assert (described["RO"] == fixed["reads"][:count]).all()
    assert (described["WO"]["maxLatency"] == fixed["writes"]["maxLatency"][:count]).all()


@given(strategies.binary(max_size=400), strategies.sampled_from(STREAMS))
@settings(max_examples=50 if SANITIZED else 300, deadline=None, database=None)
def test_any_bytes_are_read_the_same_from_any_buffer(data, stream):
    statistics = morwick.parse(data, stream)
    values = {name: plain(value) for name, value in statistics.items()}
    assert values == by_key(statistics.entries, stream)
    for same in bytearray(data), memoryview(data), np.frombuffer(data, np.uint8) if data else b"":
        assert morwick.parse(same, stream).entries == statistics.entries
    assert pickle.loads(pickle.dumps(statistics)).entries == statistics.entries


@given(strategies.lists(strategies.tuples(strategies.integers(0, len(HEADER) - 1), strategies.integers(0, 255)), max_size=6),
       strategies.binary(max_size=40))
@settings(max_examples=50 if SANITIZED else 300, deadline=None, database=None)
def test_any_header_is_refused_or_describes_what_is_there(changes, tail):
    header = bytearray(HEADER)
    for place, value in changes:
        header[place] = value
    data = SNAPSHOT[:2000] + tail
    try:
        records = morwick.snapshot(data, bytes(header))
    except ValueError as error:
        assert str(error).startswith("header: ")
        with pytest.raises(ValueError, match="^header: ") as refused:
            morwick.render(data, header)
        assert str(refused.value) == str(error) or "fields" in str(error)
        return
    morwick.render(data, header)
    assert records.nbytes <= len(data) and records.dtype.itemsize == struct.unpack_from("<I", header, 8)[0]
    records.tolist()


def test_views_keep_their_buffers():
    data = bytearray(SNAPSHOT)
    records = morwick.snapshot(data)
    with pytest.raises(BufferError):
        data.extend(b"1")
    data[0] = 77  # the same bytes
    assert records["timestamp"][0] == 77
    view = memoryview(data)
    records = morwick.snapshot(view)[::2]
    view.release()
    with pytest.raises(BufferError):
        data.clear()
    assert records["timestamp"][0] == 77
    del records
    data.clear()
    with pytest.raises(ValueError):
        morwick.parse(view)
    with mmap.mmap(-1, 504) as shared:
        records = morwick.snapshot(shared)
        with pytest.raises(BufferError):
            shared.close()
        del records
    assert not morwick.snapshot(SNAPSHOT).flags.writeable
    changed = bytearray(KVR)
    statistics = morwick.parse(changed)
    changed.clear()
    assert statistics["hostReads"] == 918273645 and statistics.entries[0] == ("exportVersion", 7)


@pytest.mark.parametrize("call, error, words", [
    (lambda: morwick.parse("text"), TypeError, "data must be an object with a buffer, not str"),
    (lambda: morwick.parse(None), TypeError, "data"),
    (lambda: morwick.parse(b"", 5), TypeError, "stream must be a str, not int"),
    (lambda: morwick.parse(b"", "KVR"), ValueError, "stream must be 'kvr', 'ftl' or 'msp', not 'KVR'"),
    (lambda: morwick.parse(b"", stream="\udcff"), ValueError, "surrogates"),
    (lambda: morwick.parse(b"")["hostReads"], KeyError, "hostReads"),
    (lambda: morwick.parse(KVR)["no such"], KeyError, "no such"),
    (lambda: morwick.parse(KVR)[[]], TypeError, "unhashable"),
    (lambda: morwick.snapshot(7), TypeError, "data"),
    (lambda: morwick.snapshot(np.zeros((9, 9), np.uint8)[:, ::2]), (BufferError, ValueError), "contiguous"),
    (lambda: morwick.snapshot(b"", 7), TypeError, "header must be an object with a buffer, not int"),
    (lambda: morwick.snapshot(b"", HEADER[:35]), ValueError, "header: "),
    (lambda: morwick.render([]), TypeError, "data"),
    (lambda: morwick.render(b"", "header"), TypeError, "header"),
    (lambda: morwick.keys(None), TypeError, "stream"),
    (lambda: morwick.table(7), TypeError, "files must be a path or an iterable of paths, not int"),
    (lambda: morwick.table([7]), TypeError, "files must hold paths, not int"),
    (lambda: morwick.table("a\0b"), ValueError, "files"),
    (lambda: morwick.table([], names=[7]), TypeError, "names must hold str, not int"),
    (lambda: morwick.table([], names=7), TypeError, "names"),
    (lambda: morwick.table([], names=[]), ValueError, "names is empty"),
    (lambda: morwick.table([], names="hostReeds"), ValueError, "the closest is hostReads"),
    (lambda: morwick.table([], stream=b"kvr"), TypeError, "stream"),
    (lambda: morwick.table([], jobs="2"), TypeError, "jobs must be an int, not str"),
    (lambda: morwick.table([], jobs=0), ValueError, "jobs must be at least 1, not 0"),
    (lambda: morwick.table([], progress=1), TypeError, "progress must be callable, not int"),
    (lambda: morwick.Controller(7), TypeError, "name must be a str, not int"),
    (lambda: morwick.Controller("None"), ValueError, "None"),
])  # fmt: skip
def test_wrong_arguments_are_named(call, error, words):
    with pytest.raises(error) as raised:
        call()
    assert words in str(raised.value)


def test_threads_find_the_same(dumps):
    alone = morwick.table(dumps, names="host*")
    large = random_dump("kvr", 1) * 5000
    entries = len(morwick.parse(large).entries)

    def work(_):
        table = morwick.table(dumps, names="host*", jobs=3)
        assert table.faults == alone.faults and len(morwick.parse(large).entries) == entries
        return all((table[name].filled(1) == alone[name].filled(1)).all() for name in alone)

    with ThreadPoolExecutor(4) as pool:
        assert all(pool.map(work, range(8)))


def test_progress_and_an_interrupt_end_the_reading(tmp_path):
    with pytest.raises(ZeroDivisionError):
        morwick.table([SOURCE / "examples"] * 50, progress=lambda dumps, faults: 1 / 0)
    os.mkfifo(tmp_path / "pipe")
    threading.Timer(0.3, lambda: os.kill(os.getpid(), 2)).start()
    start = time.monotonic()
    with pytest.raises(KeyboardInterrupt):
        morwick.table(tmp_path / "pipe")
    assert time.monotonic() - start < 30
    os.close(os.open(tmp_path / "pipe", os.O_WRONLY))  # the thread that waited goes


def play(scenario, code):
    """What a fresh interpreter prints, with the platform's complaints of handles that are open."""
    path = SOURCE / "packaging/scenarios" / scenario
    run = subprocess.run([sys.executable, "-c", "import morwick\n" + textwrap.dedent(code)],
                         env={**os.environ, "GRELLON_SCENARIO": str(path)}, capture_output=True, text=True)  # fmt: skip
    return run.stdout + run.stderr


def test_controllers_are_read_and_given_back():
    assert play("statistics.toml", """
        with morwick.Controller() as c:
            print(c.name, c.read("statistics") == open("kvr.bin", "rb").read(), c.statistics("ftl")["version"])
            print(c.snapshot().dtype.names[0], len(c.snapshot()), c.statistics("msp").fault)
        left = morwick.Controller("VeltoQRN3NVMeController")
        print([(each.name, each.present, each.opened) for each in morwick.controllers()])
        for call in lambda: c.read("kvr"), lambda: left.read("nothing"), lambda: left.read(7):
            try: call()
            except (ValueError, TypeError) as error: print(error)
        """.replace('"kvr.bin"', repr(str(SOURCE / "examples/kvr.bin")))) == textwrap.dedent("""\
        VeltoQRN3NVMeController True 5
        T 120 None
        [('VeltoQRN3NVMeController', True, True), ('VeltoEmbeddedNVMeController', False, False), ('KVRStorage', False, False)]
        the controller is closed
        what must be one of kvr, ftl, statistics, msp, snapshot, snapshot_header, band, defects, telemetry, not 'nothing'
        what must be a str, not int
        """)  # fmt: skip
    failing = """
        for call in morwick.Controller, lambda: morwick.Controller("KVRStorage"):
            try:
                with call() as c: c.read("msp")
            except morwick.ControllerError as error: print(error, error.result)
        print(c.close()) if "c" in globals() else 0
        """
    refused = "VeltoQRN3NVMeController: the connection was refused, result 0x"
    said = play("refuses.toml", failing).splitlines()
    assert said[0].startswith(refused) and int(said[0].split()[-1]) == int(said[0].split()[-2], 16) != 0
    assert said[1:] == ["KVRStorage: the controller is not present None"]
    assert play("fails.toml", failing).splitlines()[:1] == [
        "VeltoEmbeddedNVMeController: msp: this controller does not offer it None"]  # fmt: skip
    assert "closing the connection failed, result" in play("fails.toml", "morwick.Controller().close()")


WORK = """
import ctypes, os, sys
import morwick
data = open(sys.argv[1] + "/examples/snapshot.bin", "rb").read()
header = open(sys.argv[1] + "/examples/snapshot_header.bin", "rb").read()
kvr = open(sys.argv[1] + "/examples/kvr.bin", "rb").read()
fleet = sys.argv[1] + "/examples/fleet"
def read():
    with morwick.Controller() as c: return c.read("snapshot")
calls = [lambda: dict(morwick.parse(bytearray(kvr)).items()), lambda: morwick.parse(kvr).entries,
         lambda: morwick.parse(kvr).summary, lambda: morwick.parse(kvr[:100] + b"1").fault,
         lambda: morwick.parse(kvr)["readCountHisto"], lambda: morwick.keys("msp"),
         lambda: morwick.snapshot(data), lambda: morwick.snapshot(data, header),
         lambda: morwick.render(data), lambda: morwick.render(data, header), morwick.controllers, read,
         lambda: morwick.table(fleet, names=["host*"], jobs=2, progress=lambda *now: None)]
for call in calls * 3: call()
"""


@pytest.mark.skipif(SANITIZED, reason="the sanitizer has a heap of its own")
@pytest.mark.parametrize("then", ["refuse", "leak"])
def test_memory_that_is_refused_or_given_back(then):
    code = {
        "refuse": """
            refuse = ctypes.CDLL(None).RefuseAllocation
            for call in calls:
                for number in range(1, 100000):
                    try:
                        refuse(number); call(); error = None
                    except MemoryError as raised: error = raised
                    except ValueError as raised:  # NumPy's own word, when it makes a type
                        assert "tuple" in str(raised); error = raised
                    except morwick.ControllerError as raised: error = raised  # the driver's own
                    if refuse(0) < number: break
                assert error is None and number > 3, (call, number)
                call()
            """,
        "leak": """
            class Heap(ctypes.Structure): _fields_ = [(name, ctypes.c_size_t) for name in "abcdefghij"]
            heap = ctypes.CDLL(None).mallinfo2
            heap.restype = Heap
            def used():
                now = heap(); return now.h + now.e
            def many():
                for _ in range(100):
                    for call in calls: call()
            many(); before = used(); many(); grown = used() - before
            assert grown < 40000, grown
            """,
    }[then]
    run = subprocess.run([sys.executable, "-X", "faulthandler", "-c", WORK + textwrap.dedent(code), SOURCE],
                         env={**os.environ, "PYTHONMALLOC": "malloc", "LD_PRELOAD": os.environ["REFUSE_MEMORY"]},
                         capture_output=True, text=True)  # fmt: skip
    assert run.returncode == 0, run.stderr[-3000:]


def test_types_hold():
    run = subprocess.run(["/usr/bin/mypy", "--strict", "--cache-dir", os.devnull, SOURCE / "python/morwick"],
                         capture_output=True, text=True)  # fmt: skip
    assert run.returncode == 0, run.stdout


def test_everything_public_is_described():
    for name in morwick.__all__:
        thing = getattr(morwick, name)
        assert name == "platform" or thing.__doc__, name
    library = [line for line in subprocess.run(["nm", "-D", "--defined-only", morwick._native.__file__],
               capture_output=True, text=True).stdout.splitlines()]  # fmt: skip
    assert [line.split()[-1] for line in library] == ["PyInit__native"]
