"""Calls what the module offers. "leaks": a hundred times, and looks for memory that is not given back.
"refusals": refuses each allocation in turn, through a preloaded library; tests/attack.py does it."""
import ctypes, os, sys
import numpy, morwick

EXAMPLES = os.environ["SOURCE"] + "/examples/"
data, header, kvr = [open(EXAMPLES + name + ".bin", "rb").read() for name in ("snapshot", "snapshot_header", "kvr")]
words = numpy.frombuffer(data, "u4")
REFUSED_DRIVER = f"result={0x106}"  # of a simulated driver that was refused memory


def read():
    with morwick.Controller() as controller:
        return controller.read("snapshot")


def read_table():
    table = morwick.table(EXAMPLES + "fleet", names=["host*"], jobs=2, progress=lambda *now: None)
    assert len(table.files) == 6


calls = [lambda: dict(morwick.parse(bytearray(kvr)).items()), lambda: morwick.parse(kvr).entries,
         lambda: morwick.parse(kvr).summary, lambda: morwick.parse(kvr[:100] + b"1").fault,
         lambda: morwick.parse(kvr)["readCountHisto"], lambda: morwick.keys("msp"),
         lambda: morwick.snapshot(data), lambda: morwick.snapshot(data, header),
         lambda: morwick.render(words), lambda: morwick.render(data, header), morwick.controllers, read, read_table]


class Heap(ctypes.Structure):  # of mallinfo2
    _fields_ = [(name, ctypes.c_size_t) for name in (
        "arena ordblks smblks hblks hblkhd usmblks fsmblks uordblks fordblks keepcost").split()]


def growth():
    """Of the bytes in use: the heap's own, and those of mapped blocks."""
    before = heap()
    for call in calls * 100:
        call()
        morwick.parse(b"").get("x" * len(kvr))
    now = heap()
    return now.uordblks + now.hblkhd - before.uordblks - before.hblkhd


def refuse_each(call):
    good = repr(call())
    for number in range(1, 100000):
        try:
            refuse(number)
            result, error = call(), None
        except (MemoryError, morwick.ControllerError) as raised:
            error = raised
            assert getattr(error, "result", 1), error  # the code of a driver that was refused memory
        except ValueError as raised:
            error = raised
            assert "tuple" in str(raised)  # NumPy says so when it is refused memory for a type
        if refuse(0) < number:
            break
        assert error or repr(result) == good or REFUSED_DRIVER in repr(result), (call, number)
    assert error is None and number > 3, (call, number)
    call()


for call in calls * 3:  # what is filled once is filled now
    call()
if sys.argv[1] == "leaks":
    heap = ctypes.CDLL(None).mallinfo2
    heap.restype = Heap
    grown = [growth() for _ in range(6)]
    assert min(grown) < 20000, grown  # the first calls fill caches
elif sys.argv[1] == "refusals":
    refuse = ctypes.CDLL(None).RefuseAllocation
    for call in calls:
        refuse_each(call)
