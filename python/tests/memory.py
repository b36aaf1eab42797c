"""Calls what the module offers. "leaks": a hundred times, and looks for memory that is not given back.
"refusals": refuses each allocation in turn, through a preloaded library; tests/attack.py does it."""
import ctypes, os, sys
import numpy, morwick

EXAMPLES = os.environ["SOURCE"] + "/examples/"
data, header, kvr = [open(EXAMPLES + name + ".bin", "rb").read() for name in ("snapshot", "snapshot_header", "kvr")]
words = numpy.frombuffer(data, "u4")


def read():
    with morwick.Controller() as controller:
        return controller.read("snapshot")


def table():
    table = morwick.table(EXAMPLES + "fleet", names=["host*"], jobs=2, progress=lambda *now: None)
    assert len(table.files) == 6


calls = [lambda: dict(morwick.parse(bytearray(kvr)).items()), lambda: morwick.parse(kvr).entries,
         lambda: morwick.parse(kvr).summary, lambda: morwick.parse(kvr[:100] + b"1").fault,
         lambda: morwick.parse(kvr)["readCountHisto"], lambda: morwick.keys("msp"),
         lambda: morwick.snapshot(data), lambda: morwick.snapshot(data, header),
         lambda: morwick.render(words), lambda: morwick.render(data, header), morwick.controllers, read, table]


class Heap(ctypes.Structure):  # of mallinfo2
    _fields_ = [(name, ctypes.c_size_t) for name in "abcdefghij"]


def growth():
    """In bytes. The fields e (hblkhd) and h (uordblks) are the bytes in use."""
    before = heap()
    for call in calls * 100:
        call()
        morwick.parse(b"").get("x" * len(kvr))
    now = heap()
    return now.h + now.e - before.h - before.e


def refuse_each(call):
    good = repr(call())
    for number in range(1, 100000):
        try:
            refuse(number)
            result, error = call(), None
        except (MemoryError, morwick.ControllerError) as raised:
            error = raised
            assert getattr(error, "result", 1), error  # the driver's own
        except ValueError as raised:
            error = raised
            assert "tuple" in str(raised)  # NumPy's own, about a type
        if refuse(0) < number:
            break
        assert error or repr(result) == good or "result=262" in repr(result), (call, number)  # the driver was refused
    assert error is None and number > 3, (call, number)
    call()


for call in calls * 3:  # what is filled once is filled now
    call()
if sys.argv[1] == "leaks":
    heap = ctypes.CDLL(None).mallinfo2
    heap.restype = Heap
    grown = [growth() for _ in range(6)]
    assert min(grown) < 20000, grown  # the first calls fill caches
else:
    refuse = ctypes.CDLL(None).RefuseAllocation
    for call in calls:
        refuse_each(call)
