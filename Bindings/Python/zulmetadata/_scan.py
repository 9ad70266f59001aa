"""One kind of entries of many recordings, in batches, as a pandas frame, or as a Dask frame."""

from __future__ import annotations

import glob
import importlib
import os
from collections.abc import Iterable, Iterator, Sequence
from typing import Any, Literal, NamedTuple, Union

import numpy as np
import numpy.typing as npt

from . import _core
from ._kinds import Kind

OnError = Literal["raise", "skip", "report"]
_Path = Union[str, "os.PathLike[str]"]
_Array = npt.NDArray[Any]

_FAILURE_COLUMNS = ("recording", "error", "reason")


class Batch(NamedTuple):
    """The entries of one recording."""

    recording: str
    """The path of the recording, as it was named."""
    time: npt.NDArray[np.float64]
    """The times in seconds, in the order of the stream."""
    fields: dict[str, _Array]
    """The values of each column, as many as there are times."""


class Failure(NamedTuple):
    """A recording that could not be read."""

    recording: str
    """The path of the recording, as it was named."""
    error: str
    """The name of the exception, such as 'FileNotFoundError'."""
    reason: str
    """The message of the exception."""


def _paths_of(recordings: _Path | Iterable[_Path]) -> Iterator[str]:
    if not isinstance(recordings, (str, os.PathLike)):
        yield from (os.fspath(path) for path in recordings)
    elif glob.has_magic(os.fspath(recordings)) and not os.path.lexists(recordings):
        yield from sorted(set(glob.iglob(os.fspath(recordings), recursive=True)))  # ** finds some more than once
    else:
        yield os.fspath(recordings)


def _in_a_frame(path: str) -> str:
    """Returns the path with escapes for bytes that are not UTF-8. Without them pandas takes different names for one."""
    return path.encode(errors="backslashreplace").decode()


class Reader:
    """Reads one kind of entries of a group of recordings. It is pickled into the workers of Dask, which know it as a
    function from which they may ask for fewer columns."""

    def __init__(self, kind: Kind, fields: Sequence[str], on_error: OnError, columns: Sequence[str] | None = None) -> None:
        self._kind = kind
        self._fields = tuple(fields)
        self._on_error = on_error
        self._types = _core.dtype_of(kind)
        self.columns = list(("recording", "time", *fields) if columns is None else columns)

    def project_columns(self, columns: Sequence[str]) -> Reader:
        """Returns a reader of these columns of the frame only."""
        return Reader(self._kind, [name for name in self._fields if name in columns], self._on_error, columns)

    def entries_of(self, path: str) -> _Array | None:
        """Returns the entries of a recording, or None if it has none of this kind."""
        return _core.read_kind(path, self._kind)

    def batches(self, paths: Iterable[str], failures: list[Failure]) -> Iterator[Batch]:
        """Yields a batch for each recording that has entries of the kind."""
        for path in paths:
            try:
                entries = self.entries_of(path)
            except (OSError, ValueError) as error:
                if self._on_error == "raise":
                    raise
                if self._on_error == "report":
                    failures.append(Failure(path, type(error).__name__, str(error)))
                continue
            if entries is not None:
                yield Batch(path, entries["time"], {name: entries[name] for name in self._fields})

    def frame(self, paths: Iterable[str], failures: list[Failure]) -> Any:
        """Returns the entries of these recordings as one frame."""
        pandas = importlib.import_module("pandas")
        batches = list(self.batches(paths, failures))
        whole: dict[str, _Array] = {}
        for name in self.columns:
            if name == "recording":
                names = np.array([_in_a_frame(batch.recording) for batch in batches], object)
                whole[name] = np.repeat(names, [len(batch.time) for batch in batches])
            else:
                # One contiguous copy of each column, so that the bytes of the streams need not stay.
                parts = [batch.time if name == "time" else batch.fields[name] for batch in batches]
                whole[name] = np.concatenate([np.empty(0, self._types[name]), *parts])
        return pandas.DataFrame(whole, columns=self.columns)

    def __call__(self, paths: Sequence[str]) -> Any:
        return self.frame(paths, [])

    def frame_and_failures(self, paths: Sequence[str]) -> tuple[Any, Any]:
        """Returns the frame, and another one of the recordings that could not be read."""
        failures: list[Failure] = []
        frame = self.frame(paths, failures)
        return frame, failures_frame(failures)


def failures_frame(failures: Sequence[Failure]) -> Any:
    """Returns failures as a frame of texts."""
    pandas = importlib.import_module("pandas")
    rows = [failure._replace(recording=_in_a_frame(failure.recording)) for failure in failures]
    return pandas.DataFrame(rows, columns=_FAILURE_COLUMNS, dtype=object)


def _first(pair: tuple[Any, Any]) -> Any:
    return pair[0]


def _second(pair: tuple[Any, Any]) -> Any:
    return pair[1]


def _size_of(path: str) -> int:
    try:
        return os.stat(path).st_size
    except OSError:
        return 0  # the worker says why it cannot be read


def groups_of(paths: Iterable[str], most_bytes: int, most_recordings: int) -> list[tuple[str, ...]]:
    """Returns the paths in groups of files that have so many bytes together. A larger file is a group of its own."""
    groups: list[tuple[str, ...]] = []
    group: list[str] = []
    size = 0
    for path in paths:
        more = _size_of(path)
        if group and (size + more > most_bytes or len(group) >= most_recordings):
            groups.append(tuple(group))
            group, size = [], 0
        group.append(path)
        size += more
    if group:
        groups.append(tuple(group))
    return groups


class Scan:
    """The entries of one kind in many recordings, which are read when you ask for them.

    Iteration yields a `Batch` for each recording that has entries of the kind, and holds one recording at a time.
    """

    def __init__(
        self,
        recordings: _Path | Iterable[_Path],
        kind: Kind,
        columns: Sequence[str] | None,
        on_error: OnError,
    ) -> None:
        names = (_core.dtype_of(kind).names or ())[1:]
        fields = names if columns is None else tuple(columns)
        unknown = [name for name in fields if name not in names]
        if unknown or len(set(fields)) < len(fields):
            raise ValueError(f"the columns of {kind} are {', '.join(names)}, each at most once, not {', '.join(fields)}")
        if on_error not in ("raise", "skip", "report"):
            raise ValueError(f"on_error is 'raise', 'skip' or 'report', not {on_error!r}")
        self._recordings = tuple(recordings) if isinstance(recordings, Iterator) else recordings  # iterators end
        self._on_error: OnError = on_error
        self._reader = Reader(kind, fields, on_error)
        self._failures: list[Failure] = []

    def __iter__(self) -> Iterator[Batch]:
        self._failures = []
        return self._reader.batches(_paths_of(self._recordings), self._failures)

    @property
    def failures(self) -> list[Failure]:
        """The recordings that the last iteration could not read. Empty unless `on_error` is 'report'."""
        return self._failures

    def to_pandas(self) -> Any:
        """Returns all entries as one `pandas.DataFrame` with the columns `recording`, `time` and the fields. If
        `on_error` is 'report', returns this frame and another one of what failed, with the columns `recording`, `error`
        and `reason`. Raises an `ImportError` if pandas is not installed."""
        paths = list(_paths_of(self._recordings))
        return self._reader.frame_and_failures(paths) if self._on_error == "report" else self._reader(paths)

    def to_dask(self, *, partition_bytes: int = 1 << 30, partition_recordings: int = 500) -> Any:
        """Returns the same as `dask.dataframe.DataFrame`, whose divisions are unknown. With 'report' it returns two of
        them; compute both at once, so that nothing is read twice.

        A partition is a group of recordings, which a worker opens by their paths when it computes the partition. A
        group has at most so many recordings, and its files at most so many bytes, of which only the metadata is read.
        Nothing is read before, except that `meta` is known. Raises an `ImportError` if Dask is not installed."""
        frames = importlib.import_module("dask.dataframe")
        groups = groups_of(_paths_of(self._recordings), partition_bytes, partition_recordings) or [()]
        meta = self._reader(())
        if self._on_error != "report":
            return frames.from_map(self._reader, groups, meta=meta, label="zulmetadata-scan")
        delayed = importlib.import_module("dask").delayed
        pairs = [delayed(self._reader.frame_and_failures, pure=True)(group) for group in groups]
        return (
            frames.from_delayed([delayed(_first, pure=True)(pair) for pair in pairs], meta=meta, verify_meta=False),
            frames.from_delayed(
                [delayed(_second, pure=True)(pair) for pair in pairs], meta=failures_frame(()), verify_meta=False
            ),
        )
