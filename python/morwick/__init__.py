"""Statistics and snapshots of storage controllers, as values of Python and NumPy."""

from __future__ import annotations

import os
from collections.abc import Callable, Iterable, Iterator, Mapping
from typing import Any, Union

import numpy as np

from . import _native

__version__ = _native.version
platform = _native.platform


class Statistics(Mapping):
    def __init__(self, data, stream="kvr"):
        self._dump = _native.Dump(data, stream)
        self._stream = stream
        self._values = None

    def __getitem__(self, name):
        return self._dump.value(name) if self._values is None else self._values[name]

    def _all(self):
        if self._values is None:
            self._values = self._dump.values()
        return self._values

    def __iter__(self):
        return iter(self._all())

    def __len__(self):
        return self._dump.size

    def __contains__(self, name):
        return self._dump.has(name)

    def keys(self):
        return self._all().keys()

    def values(self):
        return self._all().values()

    def items(self):
        return self._all().items()

    @property
    def entries(self):
        return self._dump.entries()

    @property
    def summary(self):
        return self._dump.summary()

    @property
    def fault(self):
        return self._dump.fault

    @property
    def end(self):
        return self._dump.end

    def __reduce__(self):
        return parse, (self._dump.data, self._stream)


def parse(data, stream="kvr"):
    return Statistics(data, stream)


def snapshot(data, header=None):
    return _native.snapshot(data, header)


def render(data, header=None):
    return _native.render(data, header)


class Table(Mapping):
    def __init__(self, files, faults, names, values, missing):
        self.files = files
        self.faults = faults
        self._columns = {name: i for i, name in enumerate(names)}
        self._values = values
        self._missing = missing

    def __getitem__(self, name):
        column = self._columns[name]
        return np.ma.MaskedArray(self._values[column], self._missing[column])

    def __iter__(self):
        return iter(self._columns)

    def __len__(self):
        return len(self._columns)

    def to_pandas(self):
        import pandas

        columns = {"file": self.files, "fault": self.faults}
        for name, column in self._columns.items():
            columns[name] = pandas.arrays.IntegerArray(self._values[column], self._missing[column])
        return pandas.DataFrame(columns)


def table(files, stream="kvr", names=None, jobs=None, progress=None):
    if isinstance(files, (str, bytes, os.PathLike)):
        files = [files]
    return Table(*_native.table([os.fsencode(file) for file in files], stream,
                                [] if names is None else [names] if isinstance(names, str) else list(names),
                                jobs or 0, progress))


def keys(stream="kvr"):
    return _native.keys(stream)
