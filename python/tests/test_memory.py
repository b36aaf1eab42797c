"""Refuses each allocation in turn, and looks for what grows."""

import os, sys

import pytest

from test_morwick import SANITIZED, SOURCE, run

WORK = """
import ctypes, os, sys, numpy, morwick
examples = sys.argv[1] + "/examples/"
data, header, kvr = [open(examples + name + ".bin", "rb").read() for name in ("snapshot", "snapshot_header", "kvr")]
words = numpy.frombuffer(data, "u4")
def read():
    with morwick.Controller() as c: return c.read("snapshot")
def table():
    table = morwick.table(examples + "fleet", names=["host*"], jobs=2, progress=lambda *now: None)
    assert len(table.files) == 6
calls = [lambda: dict(morwick.parse(bytearray(kvr)).items()), lambda: morwick.parse(kvr).entries,
         lambda: morwick.parse(kvr).summary, lambda: morwick.parse(kvr[:100] + b"1").fault,
         lambda: morwick.parse(kvr)["readCountHisto"], lambda: morwick.keys("msp"),
         lambda: morwick.snapshot(data), lambda: morwick.snapshot(data, header),
         lambda: morwick.render(words), lambda: morwick.render(data, header), morwick.controllers, read, table]
for call in calls * 3: call()
"""
REFUSE = """
refuse = ctypes.CDLL(None).RefuseAllocation
for call in calls:
    good = repr(call())
    for number in range(1, 100000):
        try: refuse(number); result = call(); error = None
        except (MemoryError, morwick.ControllerError) as raised: error = raised; assert getattr(error, "result", 1), error  # the driver's own
        except ValueError as raised: error = raised; assert "tuple" in str(raised)  # NumPy's own, of a type
        if refuse(0) < number: break
        assert error or repr(result) == good or "result=262" in repr(result), (call, number)  # the driver was refused
    assert error is None and number > 3, (call, number)
    call()
"""
LEAK = """
class Heap(ctypes.Structure): _fields_ = [(name, ctypes.c_size_t) for name in "abcdefghij"]
heap = ctypes.CDLL(None).mallinfo2; heap.restype = Heap  # e (hblkhd) and h (uordblks) are the bytes in use
def grow():
    before = heap()
    for call in calls * 100: call(); morwick.parse(b"").get("x" * len(kvr))
    now = heap(); return now.h + now.e - before.h - before.e
grown = [grow() for _ in range(6)]; assert min(grown) < 20000, grown  # the first calls fill caches
"""


@pytest.mark.skipif(SANITIZED, reason="the sanitizer has a heap of its own")
@pytest.mark.parametrize("code", [REFUSE, LEAK])
def test_memory_that_is_refused_or_given_back(code):
    child = run(sys.executable, "-X", "faulthandler", "-c", WORK + code, SOURCE,
                PYTHONMALLOC="malloc", LD_PRELOAD=os.environ["REFUSE_MEMORY"])  # fmt: skip
    assert child.returncode == 0 and child.stderr == "", child.stderr[-3000:]  # the platform tells of open handles
