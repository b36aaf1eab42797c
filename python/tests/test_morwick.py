"""Compares the module with the command on the same bytes, and tests it as a module of Python."""

import ctypes, gzip, json, mmap, os, pathlib, pickle, random, re, signal, struct, subprocess, sys, threading
from concurrent.futures import ThreadPoolExecutor

import numpy as np
import pytest
from hypothesis import given, settings, strategies

import morwick

SOURCE = pathlib.Path(os.environ["SOURCE"])
COMMAND = os.environ["MORWICK"]
SANITIZED = bool(os.environ.get("SANITIZED"))
COUNT = 25 if SANITIZED else 500  # random dumps of a stream; a sanitized command is slow
ENDS = {"kvr": b"no end record", "ftl": b"\xff\xff\0\0", "msp": b"\xff\x2f"}
STREAMS = [*ENDS]
SNAPSHOT, HEADER, KVR = [(SOURCE / f"examples/{name}.bin").read_bytes() for name in ("snapshot", "snapshot_header", "kvr")]
LARGE = KVR.replace(struct.pack("<Q", 123456789), bytes(8)) * 9000 + KVR  # two megabytes


def run(*words, text=True, **environment):
    return subprocess.run([*map(str, words)], capture_output=True, text=text, env={**os.environ, **environment})


def command(*words):
    return run(COMMAND, *words, text=False, LD_PRELOAD="").stdout


def random_dump(stream, seed):
    """Records of a few known keys, so that keys repeat. Some records have another length or an unknown
    key. The end may be cut, and other bytes may follow."""
    draw = random.Random(f"{stream} {seed}")
    keys = draw.sample(morwick.keys(stream), 12)
    # The formats of header and value, a value's length in the header, and 1 more than its bits.
    header, value, length, bits = ("HH", "I", 4, 33) if stream == "msp" else ("II", "Q", 1, 65)
    dump = b""
    for _ in range(draw.randrange(40)):
        key = draw.choice(keys)
        size = draw.choice([key.size] * 5 + [0, 1, key.size // 2, key.size + 1])
        number = draw.choice([key.id] * 36 + [draw.randrange(0x2FFE)] * 4 + [0x2FFF, 0xFFFF])  # which end msp and ftl
        values = [draw.getrandbits(draw.randrange(bits)) for _ in range(size)]
        part = draw.choice([0, 0, 0, 2]) if stream == "msp" else 0  # of a value, in bytes
        dump += struct.pack(f"<{header}{size}{value}{part}x", number, length * size + part, *values)
    if draw.random() < 0.3:
        dump = dump[: draw.randrange(len(dump) + 1)]
    return dump + bytes(draw.getrandbits(8) for _ in range(draw.choice([0, 0, 0, 2, 9])))


@pytest.fixture(scope="module")
def dumps(tmp_path_factory):
    """Files for each stream: random dumps of it, and every example and fuzz seed, whichever stream it
    is of. A seed's first byte, which chooses what is fuzzed, is left out."""
    folder = tmp_path_factory.mktemp("dumps")
    for stream in STREAMS:
        for seed in range(COUNT):
            (folder / f"{stream}-{seed}").write_bytes(random_dump(stream, seed))
        for file in [*(SOURCE / "fuzz/seeds").glob("*/*"), *(SOURCE / "examples").glob("*.bin")]:
            if not file.name.startswith("gzip"):  # which the command unpacks
                (folder / f"{stream}-{file.name}").write_bytes(file.read_bytes()[file.suffix != ".bin" :])
    (folder / "kvr-unwritten").write_bytes(struct.pack("<IIQIIQ", 4, 1, 5, 18, 1, 0))  # hostWrites, nandWrites
    return folder


def plain(items):
    """Arrays as lists; one of another type than uint64 stays, and can be equal to no list. The arrays
    are filled with another number, which nobody else sees."""
    return [(name, (value.tolist(), value.fill(7))[0] if isinstance(value, np.ndarray) and value.dtype == np.uint64 else value)
            for name, value in items]  # fmt: skip


@pytest.mark.parametrize("stream", STREAMS)
def test_statistics_are_those_of_the_command(dumps, stream):
    keys = {key.name + "_" * (stream == "ftl" and key.size > 1): key for key in morwick.keys(stream)}
    files = sorted(dumps.glob(f"{stream}-*"))
    ask = lambda file: json.loads(command("stats", "-s", stream, "-o", "json", file))
    with ThreadPoolExecutor(2) as pool:
        reports = list(pool.map(ask, files))
    for file, report in zip(files, reports):
        data = file.read_bytes()
        statistics = morwick.parse(data, stream)
        entries, last = [], {}
        for entry in report["entries"]:
            name, values = entry["name"], entry.get("values") or [entry["value"]]
            entries += [(f"{name}{i}" if "values" in entry else name, value) for i, value in enumerate(values)]
            key = keys[name]
            last[key.name] = values if key.size > 1 else values[0]  # at the place of the first
        assert statistics.entries == entries, file
        assert plain(statistics.items()) == list(last.items()), file
        for same in ((name, statistics[name]) for name in statistics), zip(statistics.keys(), statistics.values()):
            assert plain(same) == list(last.items())
        assert {key.name for key in keys.values() if key.name in statistics} == {*last}
        summary = [(name, float(f"{value:.3f}") if isinstance(value, float) else value)
                   for name, value in plain(statistics.summary.items())]  # fmt: skip
        reported = report.get("summary", {}).items()  # a large number comes once more, as NAME_s
        assert summary == [item for item in reported if not item[0].endswith("_s")], file
        errors = [message["text"] for message in report["messages"] if message["severity"] == "error"]
        fault = "; ".join(text.removeprefix(f"{file}: ") for text in errors) or None
        assert repr(statistics) == f"<morwick.Statistics of {stream}: {len(last)} names, fault: {fault}>"
        assert statistics.fault == fault
        named = re.search(r"(?:statistics end|end record) at offset (\d+)", str(report["messages"]))
        left = data[statistics.end :]  # without a message nothing, or an end record
        assert len(data) - len(left) == int(named[1]) if named else left == b"" or left.startswith(ENDS[stream])
        assert pickle.loads(pickle.dumps(statistics)).entries == entries
    assert 0 < sum(report["status"] != 0 for report in reports) < len(files)


@pytest.mark.parametrize("stream", STREAMS)
@pytest.mark.parametrize("names", [None, ["*His*", "*Read*"]])
def test_table_is_that_of_the_command(dumps, stream, names):
    lines = command("table", "-s", stream, *(["-n", ",".join(names)] if names else []), dumps)
    heading, *rows = [line.split(",") for line in lines.decode().replace('", ', "").splitlines()]
    seen = []
    table = morwick.table(dumps, stream, names, progress=lambda *now: seen.append(now))
    assert list(table) == heading[2:] and table.files == [row[0] for row in rows]
    assert names or len(table) == sum(key.size for key in morwick.keys(stream))
    cells = [["" if cell is np.ma.masked else str(cell) for cell in table[name]] for name in table]
    assert [row[-len(table) :] for row in rows] == [list(row) for row in zip(*cells)]
    assert table.faults == [morwick.parse(pathlib.Path(file).read_bytes(), stream).fault for file in table.files]
    assert seen[-1] == (len(rows), sum(fault is not None for fault in table.faults))
    again = pickle.loads(pickle.dumps(table))
    assert again != table and all(again[name].dtype == np.uint64 and (again[name].filled(7) == table[name].filled(7)).all() for name in table)
    assert repr(table) == f"<morwick.Table of {len(rows)} files: {len(heading) - 2} columns>"
    frame = table.to_pandas()
    assert list(frame) == heading and {*map(str, frame.dtypes[2:])} == {"UInt64"}
    assert frame["file"].tolist() == table.files and frame["fault"].tolist() == table.faults
    for name in [*table][-9:]:
        assert frame[name].astype(object).where(frame[name].notna(), None).tolist() == table[name].tolist()


def test_table_takes_what_the_command_takes(tmp_path):
    (tmp_path / "a\udcff").write_bytes(KVR)
    (tmp_path / "b").write_bytes(gzip.compress(KVR[:20]))
    name = os.fsencode(tmp_path)
    for files in (tmp_path, str(tmp_path), name, [name], iter([tmp_path / "a\udcff", tmp_path / "b"])):
        table = morwick.table(files, names=iter(["hostWrites", "hostReads"]), jobs=np.int64(1) if files is name else 2**70)
        assert table.files == [f"{tmp_path}/a\udcff", f"{tmp_path}/b"]
        assert [table[name].tolist() for name in table] == [[123456789, None], [918273645, None]]
        assert table.faults[0] is None and "offset 16" in table.faults[1]
    code = "import morwick, os, sys; print(morwick.table('-', names='readCountHisto')['readCountHisto1'], os.path.sameopenfile(0, 3), 'pandas' in sys.modules)"
    assert run("bash", "-c", f"exec 3< {SOURCE}/examples/kvr.bin; {sys.executable} -c \"{code}\" <&3 2>&1").stdout == "[80] True False\n"
    assert morwick.table([]).files == []
    missing = morwick.table("./missing")
    assert missing.files == ["./missing"] and "No such file" in missing.faults[0]


CSV_ORDER = """timestamp erasedBands hostReads hostWrites nandReads nandWrites hysteresisTime collectedSectors
    wearLevelBands intermediatePendingErase userPendingErase freeNodes bufferFragments bufferHighWater preemptPercent
    qosDelaysNormal qosDelaysExtreme expeditesSucceeded expeditesFailed oldestCommandAge qosInterval commandTagsMin
    commandTagsMax freeSegments hostUnmaps reads writes""".split()


def test_snapshots_and_texts_are_those_of_the_command(tmp_path):
    draw = random.Random(3)
    # No UTF-8, a field of text alone, three priorities, and one.
    odd = HEADER.replace(b" E=", b"\xff\xc3=").replace(b" P=%2u", b" P=-2u")
    odd = odd.replace(struct.pack("<II", 56, 48), struct.pack("<II", 56, 36)).replace(struct.pack("<II", 8, 48), struct.pack("<II", 8, 12))
    (tmp_path / "header").write_bytes(odd)
    for number in range(2 if SANITIZED else 20):
        # The first data has more records than the header promises, and its last one is cut.
        data = SNAPSHOT + SNAPSHOT[:600] if number == 0 else draw.randbytes(draw.randrange(252, 4000))
        (tmp_path / "data").write_bytes(data)
        for header, words in (None, []), (odd, ["--header", tmp_path / "header"]):
            assert os.fsencode(morwick.render(data, header)) == command("snapshot", *words, tmp_path / "data")
            heading, *rows = os.fsdecode(command("snapshot", "-o", "csv", *words, tmp_path / "data")).splitlines()
            other = morwick.snapshot(data, header).dtype  # whose names are the caller's own
            other["RO" if header else "reads"].base.names, other.names = [*"cba"], [*map(str, range(len(other)))]
            records = morwick.snapshot(data, header)
            names = CSV_ORDER if header is None else records.dtype.names
            columns = []
            for field in map(records.__getitem__, names):
                parts = [field[part].T for part in ("count", "totalLatency", "maxLatency")] if field.ndim == 2 else [field[None]]
                columns += np.concatenate(parts).tolist()
            assert rows == [",".join(map(str, row)) for row in zip(*columns)]
        labels = [name.split("_")[0] for name in heading.split(",")[: len(names) - 2]]
        assert all(os.fsencode(name).decode(errors="replace") in (label, f"at_{records.dtype.fields[name][1]}") for name, label in zip(names, labels))
        assert morwick.render(records, odd) == morwick.render(data, odd)
    many = HEADER[:12] + struct.pack("<I", 1 << 20) + HEADER[16:]
    for header, other in (None, 27 + 1), (many, 2):  # more than 65,535 records, and text than is kept at once
        assert morwick.render(SNAPSHOT * 547, header).count("\n") == other + 547 * 120


@given(strategies.lists(strategies.tuples(strategies.integers(0, len(HEADER) - 1), strategies.integers(0, 255)), max_size=6),
       strategies.binary(max_size=40))
@settings(max_examples=50 if SANITIZED else 300, deadline=None, database=None)
def test_any_header_is_refused_or_describes_what_is_there(changes, tail):
    header = bytearray(HEADER)
    for place, value in changes:
        header[place] = value
    data = SNAPSHOT[:2000] + tail
    try:
        records = morwick.snapshot(data, memoryview(header[::-1])[::-1])
    except ValueError as error:
        with pytest.raises(ValueError, match="^header: ") as refused:
            morwick.render(data, header)
        assert str(refused.value) == str(error) or str(error).startswith("header: ") and "fields" in str(error)
        return
    morwick.render(data, header)
    assert records.nbytes <= len(data) and records.dtype.itemsize == struct.unpack_from("<I", header, 8)[0]
    records.tolist()


def test_views_keep_their_buffers():
    for data, resize in (bytearray(SNAPSHOT), bytearray.clear), (mmap.mmap(-1, 504), mmap.mmap.close):
        with memoryview(data) as view:
            records = [morwick.snapshot(view)[::2], morwick.snapshot(data)]
        data[0] = 77  # which the records show too
        while records:
            with pytest.raises(BufferError):
                resize(data)
            assert records.pop()["timestamp"][0] == 77
        resize(data)
    assert not morwick.snapshot(SNAPSHOT).flags.writeable
    changed = bytearray(LARGE)
    statistics = morwick.Statistics(changed)
    changed.clear()
    assert statistics.summary["writeAmplification"] == 234567891 / 123456789 and statistics.entries[0] == ("exportVersion", 7)
    assert statistics == statistics and len({statistics, morwick.parse(KVR), morwick.table([])}) == 3
    number = struct.unpack_from("<I", KVR, KVR.index(struct.pack("<Q", 918273645)) - 8)[0]
    assert (number, "hostReads", 1) in morwick.keys("kvr") == sorted(morwick.keys("kvr"))


def test_buffers_of_any_shape_are_read():
    words, Record = np.frombuffer(KVR, "u4").reshape(4, -1), type("R", (ctypes.Structure,), {"_fields_": [("z", ctypes.c_int)]})
    mixed = memoryview(np.frombuffer(KVR, "?,b,B,>h,H,i,I,q,Q,e,f,d,g,S1,(2,3)<u2,V10,V172"))
    for data in mixed, memoryview(KVR).cast("c"), words, np.asfortranarray(words), (Record * words.size).from_buffer_copy(KVR):
        assert morwick.parse(data).entries == morwick.parse(KVR, "kvr").entries
    small = HEADER[:8] + struct.pack("<2I", 126, 999) + HEADER[16:]  # records of half the size
    assert len(morwick.snapshot(SNAPSHOT, small.ljust(1 << 20))) == 240
    assert len(morwick.snapshot(SNAPSHOT, HEADER[:12] + bytes(4) + HEADER[16:])) == 0  # the last record that a header counts is not printed
    (released := memoryview(KVR)).release()
    with pytest.raises(BufferError) as raised:
        morwick.parse(released)
    assert "released" in str(raised.value.__cause__)


HUGE = np.lib.stride_tricks.as_strided(np.zeros(1, np.uint64), (1 << 29,), (0,))  # 4 GiB that take 8 bytes
WIDE = struct.pack("<9IQ", 0, 6, 252, 9, 0, 0, 36, 0, 0, 1025) + struct.pack("<4sII16s", b"", 0, 4, b"%u") * 1025
POINTERS = ctypes.c_char_p, ctypes.c_void_p, ctypes.POINTER(ctypes.c_int), ctypes.CFUNCTYPE(None)
OBJECTS, MIXED = np.array([None] * 99), np.zeros(99, [("I", "u4"), ("b", "O")])


@pytest.mark.parametrize("error, words, calls", [
    (TypeError, "data must be an object with a buffer, not str",
     [lambda: morwick.parse("text"), lambda: morwick.snapshot("7"), lambda: morwick.render("")]),
    (TypeError, "header must be an object with a buffer, not int", [lambda: morwick.snapshot(b"", 7), lambda: morwick.render(b"", 0)]),
    (TypeError, "data must hold numbers or bytes, not items of the format O",
     [lambda: morwick.parse(memoryview(OBJECTS)), lambda: morwick.snapshot(OBJECTS), lambda: morwick.render(OBJECTS)]),
    (TypeError, "data must hold", [lambda: morwick.snapshot(MIXED), *(lambda kind=kind: morwick.parse((kind * 8)()) for kind in POINTERS)]),
    (TypeError, "header must hold", [lambda: morwick.snapshot(b"", OBJECTS)]),
    (BufferError, "data: ndarray is not C-contiguous", [lambda: morwick.snapshot(HUGE), lambda: morwick.render(np.zeros((9, 9))[:, ::2])]),
    (BufferError, "data: ", [lambda: morwick.parse(np.zeros(1, "M8[s]"))]),
    (ValueError, "data is larger than 4294967295 bytes", [lambda: morwick.parse(HUGE)]),
    (ValueError, "header is larger than 1048576 bytes", [lambda: morwick.snapshot(b"", HEADER.ljust((1 << 20) + 1))]),
    (ValueError, "header: ", [lambda: morwick.snapshot(b"", HEADER[:35])]),
    (ValueError, "more than 1024 fields", [lambda: morwick.snapshot(b"", WIDE)]),
    (TypeError, "stream must be a str, not", [lambda: morwick.parse(b"", 5), lambda: morwick.table([], b"kvr")]),
    (ValueError, r"stream must be 'kvr', 'ftl' or 'msp', not '\udcff'", [lambda: morwick.keys("\udcff")]),
    (KeyError, "host", [lambda: morwick.parse(KVR)["hosts"], lambda: morwick.parse(b"")["hostReads"], lambda: morwick.table([])["hosts"]]),
    (TypeError, "unhashable", [lambda: morwick.parse(KVR)[[]], lambda: [] in morwick.parse(KVR)]),
    (TypeError, "files must be a path or an iterable of paths, not int", [lambda: morwick.table(7)]),
    (TypeError, "files: expected str, bytes or os.PathLike object, not int", [lambda: morwick.table([7])]),
    (TypeError, "after *", [lambda: morwick.table([*7] for _ in "1")]),  # the caller's own
    (ValueError, "files: ", [lambda: morwick.table(["a", "b\0"]), lambda: morwick.table("\ud800")]),
    (TypeError, "names must ", [lambda: morwick.table([], names=[7]), lambda: morwick.table([], names=7)]),
    (ValueError, "names is empty", [lambda: morwick.table([], names=iter([]))]),
    (ValueError, "the closest is hostReads", [lambda: morwick.table([], names="hostReeds")]),
    (ValueError, r"no statistic has the name 'boots\x00\ud800'", [lambda: morwick.table([], names="boots\0\ud800")]),
    (TypeError, "jobs must be an int, not str", [lambda: morwick.table([], jobs="2")]),
    (ValueError, "jobs must be at least 1, not 0", [lambda: morwick.table([], jobs=0)]),
    (TypeError, "progress must be callable, not int", [lambda: morwick.table([], progress=0)]),
    (TypeError, "name must be a str, not int", [lambda: morwick.Controller(7)]),
    (ValueError, "name: there is no controller class ''", [lambda: morwick.Controller("")]),
    (ValueError, r"no controller class 'KVRStorage\x00'", [lambda: morwick.Controller("KVRStorage\0")]),
])  # fmt: skip
def test_wrong_arguments_are_named(error, words, calls):
    for call in calls:
        with pytest.raises(error) as raised:
            call()
        assert words in str(raised.value)


@pytest.mark.skipif(SANITIZED, reason="the sanitizer has a heap of its own")
def test_memory_is_given_back():
    child = run(sys.executable, "-X", "faulthandler", SOURCE / "python/tests/memory.py", "leaks", PYTHONMALLOC="malloc")
    assert child.returncode == 0 and child.stderr == "", child.stderr[-3000:]  # the platform tells of open handles


def test_long_work_lets_other_threads_run(request):
    def lets_run(call):
        gate = threading.Lock()
        with ThreadPoolExecutor() as pool:
            with gate:
                other = pool.submit(lambda: (gate.acquire(), data.append(1)))
            call()
            return other.done() and type(other.exception())

    before = sys.getswitchinterval()
    request.addfinalizer(lambda: sys.setswitchinterval(before))
    sys.setswitchinterval(1000)  # a thread runs only while another gives the interpreter's lock back
    data = bytearray(SNAPSHOT * 99)  # which keeps its size while it is read
    for call, error in (lambda: morwick.render(data), BufferError), (lambda: morwick.parse(LARGE), type(None)):
        assert any(lets_run(call) is error for _ in range(50))


def test_progress_and_an_interrupt_end_the_reading(tmp_path):
    signal.alarm(60)  # ends what no interrupt ends
    signal.signal(signal.SIGINT, signal.default_int_handler)  # a job in the background ignores it
    seen, threads = [], lambda: len(os.listdir("/proc/self/task"))
    watch = lambda *now: seen.append((*now, threads() - before))
    before = threads()
    for files in [], [SOURCE / "examples"] * 500:
        with pytest.raises(ZeroDivisionError):
            morwick.table(files, progress=lambda dumps, faults: 1 / 0)
    while threads() > before:
        os.sched_yield()
    os.mkfifo(tmp_path / "pipe")
    for jobs, progress in (5, None), (5, watch), (200, watch), (None, watch):
        before = threads()
        threading.Timer(0.5, lambda: os.kill(os.getpid(), signal.SIGINT)).start()
        with pytest.raises(KeyboardInterrupt):
            morwick.table([tmp_path / "pipe"] * 2000, jobs=jobs, progress=progress)
    assert {*seen} == {(0, 0, 1 + jobs) for jobs in (5, 32, min(len(os.sched_getaffinity(0)), 32))} and 3 < len(seen) < 24  # now and then, also while nothing comes
    signal.alarm(0)
    os.close(os.open(tmp_path / "pipe", os.O_WRONLY))  # the thread that waited goes


def test_types_hold():
    checked = run("/usr/bin/mypy", "--strict", "--cache-dir", os.devnull, SOURCE / "python/morwick")
    assert checked.returncode == 0, checked.stdout


def test_everything_public_is_described_and_nothing_else_exported():
    own = {name: value for name, value in vars(morwick).items() if getattr(value, "__module__", "").startswith("morwick")}
    assert {name for name in own if name[0] != "_"} == {*morwick.__all__} - {"platform"}
    assert all(own[name].__doc__ for name in morwick.__all__ if name != "platform")
    for tests in "test_*.py", "memory.py":
        called = "".join(file.read_text() for file in pathlib.Path(__file__).parent.glob(tests))
        assert all(re.search(rf"morwick\.{name}[(,]", called) for name in own if name[0].islower()), tests
    stub = re.findall(r"^def (\w+)", (SOURCE / "python/morwick/_native.pyi").read_text(), re.M)
    assert stub and all(hasattr(morwick._native, name) for name in stub)
    assert command("--version").decode() == f"morwick {morwick.__version__} (platform {morwick.platform})\n"
    assert run("nm", "-D", "--defined-only", morwick._native.__file__).stdout.split()[2:] == ["PyInit__native"]
