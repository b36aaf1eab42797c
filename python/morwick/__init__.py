"""Statistics and snapshots of storage controllers, as values of Python and NumPy.

A dump is the statistics of a controller: the bytes that `morwick read kvr -w FILE` saves, or
that Controller.read returns. It is of one of three streams, "kvr", "ftl" or "msp"; keys() lists
the statistics of each. A snapshot is a time series, with one record for each interval.

    >>> import morwick
    >>> s = morwick.parse(open("kvr.bin", "rb").read())
    >>> s["hostWrites"], s["readCountHisto"], s.fault
    (123456789, array([900,  80,   7,   1,   0], dtype=uint64), None)
    >>> morwick.snapshot(open("snapshot.bin", "rb").read())["reads"]["maxLatency"].max()
    4200
    >>> t = morwick.table("fleet/", names=["hostWrites", "nandWrites"])
    >>> t["nandWrites"] / t["hostWrites"]
    >>> with morwick.Controller() as c:
    ...     c.statistics("kvr")["powerOnHours"]

Dumps, snapshots and headers come from devices and files, and are not trusted: whatever is in
them, nothing beyond their bytes is read. An argument of a wrong type raises a TypeError that
names it. All functions may be called from several threads at once.

__version__ is the library's version, `platform` the platform that it was built for.
"""

from __future__ import annotations

import operator
import os
import sys
from collections.abc import Callable, ItemsView, Iterable, Iterator, KeysView, Mapping, ValuesView
from types import TracebackType
from typing import Any, NamedTuple, Union

import numpy as np
import numpy.typing as npt

from . import _native

__all__ = [
    "Controller", "ControllerClass", "ControllerError", "Key", "Statistics", "Table",
    "controllers", "keys", "parse", "platform", "render", "snapshot", "table",
]  # fmt: skip

__version__: str = _native.version
platform: str = _native.platform

Path = Union[str, bytes, "os.PathLike[str]", "os.PathLike[bytes]"]


class Key(NamedTuple):
    """A statistic: `id` is its number in a dump, `size` how many values it has, 1 if no array."""

    id: int
    name: str
    size: int


def keys(stream: str) -> list[Key]:
    """All statistics of a stream in the order of their ids. ValueError: there is no such stream."""
    return [Key(*key) for key in _native.keys(stream)]


class Statistics(Mapping[str, Any]):
    """The statistics in a dump, by name, in the dump's order.

    A value is an int from 0 to 2**64 - 1, or for an array a new NumPy array of uint64, of shape
    (n,). When a name occurs more than once, the last record counts. A name that the dump lacks
    raises KeyError, which is not the same as 0. Values are made when they are asked for, from
    the bytes as they were when the dump was parsed."""

    __slots__ = ("_dump", "_stream")

    # Arrays among the values cannot be compared to a single True or False.
    __eq__ = object.__eq__
    __hash__ = object.__hash__

    def __init__(self, data: Any, stream: str = "kvr") -> None:
        self._dump = _native.parse(data, stream)
        self._stream = stream

    def __getitem__(self, name: str) -> Any:
        return _native.value(self._dump, name)

    def __contains__(self, name: object) -> bool:
        return _native.has(self._dump, name)

    def __iter__(self) -> Iterator[str]:
        return iter(_native.values(self._dump))

    def __len__(self) -> int:
        return _native.size(self._dump)

    def keys(self) -> KeysView[str]:
        return _native.values(self._dump).keys()

    def values(self) -> ValuesView[Any]:
        return _native.values(self._dump).values()

    def items(self) -> ItemsView[str, Any]:
        return _native.values(self._dump).items()

    @property
    def entries(self) -> list[tuple[str, int]]:
        """All values with their names, repeated ones included, as `morwick stats -o csv` lists
        them. Each element of an array has a name of its own, such as readCountHisto0."""
        return _native.entries(self._dump)

    @property
    def summary(self) -> dict[str, Any]:
        """The main figures of a kvr dump as int or array of uint64, and writeAmplification, a
        float: sectors written to NAND for each one that the host wrote. Empty for other streams."""
        return _native.summary(self._dump)

    @property
    def fault(self) -> str | None:
        """What is wrong with the dump and where, as `morwick stats` says; None for a good dump."""
        return _native.fault(self._dump)

    @property
    def end(self) -> int:
        """Where the statistics end, in bytes: at a fault, an end record or the dump's size."""
        return _native.end(self._dump)

    def __repr__(self) -> str:
        return f"<morwick.Statistics of {self._stream}: {len(self)} names, fault: {self.fault}>"

    def __reduce__(self) -> tuple[Any, ...]:
        return Statistics, (_native.data(self._dump), self._stream)


def parse(data: Any, stream: str = "kvr") -> Statistics:
    """The statistics in a dump.

    `data` is any object with a buffer, such as bytes, bytearray, memoryview, mmap or an array; it
    may be changed afterwards. Bad data raises nothing: the values before a fault are there, and
    `fault` says what is wrong. Gzip data is not unpacked: use gzip.decompress or `table` for files.

    TypeError: `data` has no buffer, or holds other things than numbers and bytes. BufferError: its
    buffer cannot be had now. ValueError: there is no such stream, or `data` has 4 GiB or more."""
    return Statistics(data, stream)


def snapshot(data: Any, header: Any = None) -> npt.NDArray[np.void]:
    """The records of a snapshot as a NumPy structured array of shape (n,), over the buffer itself:
    nothing is copied, and the array keeps the buffer from being closed or resized.

    All numbers are little-endian uint32, as they are stored. Without a header the records are of
    the fixed layout, of 252 bytes, with the names of SnapshotRecord in morwick/snapshot.h; `reads`
    and `writes` have shape (n, 4), by priority, with the fields count, totalLatency and maxLatency
    (microseconds). Bytes after the last whole record are left out.

    With a header, as `morwick read snapshot_header` saves it, the fields are those that it
    describes, each under its label: "TH" for the format " TH=%8u.%02u". Numbers printed with a
    fraction are in thousandths. Numbers by priority are one field under the label of their counts,
    such as "RO", of shape (n, priorities), with the same three fields. As in the text, the last
    record that the header promises is left out. Records that were not filled, whose first field is
    0, are in the array, although the text has no line for them.

    TypeError: an argument has no buffer, or holds other things than numbers and bytes. BufferError:
    `data` is not contiguous, or a buffer cannot be had now. ValueError tells the header's fault."""
    return _native.snapshot(data, header)


def render(data: Any, header: Any = None) -> str:
    """The text of a snapshot: in the fixed layout, or the one that the header describes. Lines
    longer than 8 MiB, which a hostile header can ask for, are left out. Bytes of a header's text
    that are not UTF-8 are kept by surrogateescape. Errors are those of snapshot()."""
    return _native.render(data, header)


class Table(Mapping[str, "np.ma.MaskedArray[Any, np.dtype[np.uint64]]"]):
    """Many dumps: a row each, and a column for each statistic. table[name] is a NumPy masked array
    of uint64, in which the values that a dump lacks are masked; a change of it changes the table.
    `files` are the names of the files, and `faults` says what is wrong with each, None for a good
    dump. Leave out rows with a fault before you rank: a cut dump has fewer figures, not better
    ones."""

    __eq__ = object.__eq__
    __hash__ = object.__hash__

    def __init__(self, files: list[str], faults: list[str | None], names: list[str],
                 values: npt.NDArray[np.uint64], missing: npt.NDArray[np.bool_]) -> None:  # fmt: skip
        self.files = files
        self.faults = faults
        self._columns = {name: column for column, name in enumerate(names)}
        self._values = values
        self._missing = missing

    def __getitem__(self, name: str) -> np.ma.MaskedArray[Any, np.dtype[np.uint64]]:
        column = self._columns[name]
        return np.ma.MaskedArray(self._values[column], self._missing[column])  # type: ignore[no-untyped-call]

    def __iter__(self) -> Iterator[str]:
        return iter(self._columns)

    def __len__(self) -> int:
        return len(self._columns)

    def __repr__(self) -> str:
        return f"<morwick.Table of {len(self.files)} files: {len(self)} columns>"

    def to_pandas(self) -> Any:
        """The table as a pandas.DataFrame with the columns file, fault and those of the statistics,
        in nullable UInt64. ImportError: pandas is not installed."""
        import pandas  # type: ignore[import]

        columns = dict(zip(self, map(pandas.arrays.IntegerArray, self._values, self._missing)))
        return pandas.DataFrame({"file": self.files, "fault": self.faults, **columns})


def table(files: Path | Iterable[Path], stream: str = "kvr", names: str | Iterable[str] | None = None,
          jobs: int | None = None, progress: Callable[[int, int], object] | None = None) -> Table:  # fmt: skip
    """Reads many dumps into one table, as `morwick table` does, in the order of the files.

    `files` is a path or several; a folder stands for all files in it and below, and dumps may be
    compressed by gzip. `names` are the wanted statistics: the name of an array stands for all its
    elements, "host*" for all names that begin so; without it there is a column for every value of
    every known key. `jobs` is the number of threads; without it there is one for each core.
    `progress` is called now and then, and at the end, with the number of dumps read and of those
    with a fault. An exception in it, or Ctrl-C, ends the reading. Python's lock is released
    meanwhile. A file that cannot be read raises nothing: its row has a fault. ValueError: there is
    no such stream or statistic, or `jobs` is below 1."""
    if progress is not None and not callable(progress):
        raise TypeError(f"progress must be callable, not {type(progress).__name__}")
    return Table(*_native.table(_paths(files), stream, _names(names), _jobs(jobs), progress))


def _items(argument: Any, name: str, what: str) -> Iterator[Any]:
    try:
        return iter(argument)
    except TypeError:
        raise TypeError(f"{name} must be {what}, not {type(argument).__name__}") from None


def _paths(files: Path | Iterable[Path]) -> list[bytes]:
    is_path = isinstance(files, (str, bytes, os.PathLike))
    paths = []
    for file in [files] if is_path else _items(files, "files", "a path or an iterable of paths"):
        try:
            paths.append(os.fsencode(file))
        except TypeError as error:
            raise TypeError(f"files: {error}") from error
        except UnicodeEncodeError as error:
            raise ValueError(f"files: {error}") from error
        if b"\0" in paths[-1]:
            raise ValueError("files: a path has a null byte in it")
    return paths


def _names(names: str | Iterable[str] | None) -> list[bytes]:
    if names is None:
        return []
    listed = [names] if isinstance(names, str) else list(_items(names, "names", "an iterable of str"))
    for name in listed:
        if not isinstance(name, str):
            raise TypeError(f"names must hold str, not {type(name).__name__}")
    if not listed:
        raise ValueError("names is empty; leave it out for all statistics")
    return [name.replace("\0", "\\x00").encode("utf-8", "backslashreplace") for name in listed]


def _jobs(jobs: int | None) -> int:
    if jobs is None:
        return 0
    try:
        number = operator.index(jobs)
    except TypeError:
        raise TypeError(f"jobs must be an int, not {type(jobs).__name__}") from None
    if number < 1:
        raise ValueError(f"jobs must be at least 1, not {number}")
    return min(number, sys.maxsize)


class ControllerError(Exception):
    """A controller is absent or has failed. `result` is the driver's result code, or None when the
    driver was not asked or has answered."""

    def __init__(self, message: str, result: int | None = None) -> None:
        super().__init__(message)
        self.result = result


class ControllerClass(NamedTuple):
    """A class of controllers that the library knows, and whether this machine has one. `opened`
    tells whether a connection could be opened, which is closed again; `result` is the driver's
    result code for that, 0 for success or where it was not asked. `offers` names what
    Controller.read can read."""

    name: str
    present: bool
    opened: bool
    result: int
    offers: tuple[str, ...]


def controllers() -> list[ControllerClass]:
    """All known classes, present or not, in the order in which Controller() looks for them."""
    return [ControllerClass(*each) for each in _native.controllers()]


class Controller:
    """A connection to a controller, to be used with `with`: it is closed at the end of the block,
    whatever happens, and at the latest when the object goes. `name` is a class of controllers();
    without it the first one that is present is taken. ControllerError: it is not present, or its
    driver refuses. ValueError: there is no such class, or a closed controller is read from."""

    def __init__(self, name: str | None = None) -> None:
        self._connection = _native.connect(name)

    @property
    def name(self) -> str:
        """The class."""
        return _native.name(self._connection)

    def read(self, what: str) -> bytes:
        """The controller's answer. `what` is "kvr", "ftl" (both are in "statistics"), "msp",
        "snapshot", "snapshot_header", "band", "defects" or "telemetry". Waits for the answer;
        Python's lock is released meanwhile. ControllerError: the driver fails, or the class does
        not offer it. ValueError: there is nothing of that name."""
        return _native.read(self._connection, what)

    def statistics(self, stream: str = "kvr") -> Statistics:
        """Reads and parses the statistics of a stream. Errors are those of read() and parse()."""
        _native.keys(stream)  # raises when there is no such stream, before anything is read
        return parse(self.read(stream), stream)

    def snapshot(self) -> npt.NDArray[np.void]:
        """Reads the snapshot, in the layout of the controller's own header if it offers one. Errors
        are those of read() and snapshot()."""
        offered = _native.offers(self._connection, "snapshot_header")
        header = self.read("snapshot_header") if offered else None
        return snapshot(self.read("snapshot"), header)

    def close(self) -> None:
        """Closes the connection; a second time does nothing. ControllerError: the driver says
        that it failed; the connection is closed in any case."""
        _native.close(self._connection)

    def __enter__(self) -> Controller:
        return self

    def __exit__(self, kind: type[BaseException] | None, error: BaseException | None,
                 trace: TracebackType | None) -> None:  # fmt: skip
        try:
            self.close()
        except ControllerError:
            if error is None:
                raise
