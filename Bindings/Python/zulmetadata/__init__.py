"""The metadata of screen recordings, as NumPy arrays.

    import zulmetadata

    recording = zulmetadata.Recording("Recording.mp4")
    cursor = recording["cursorLocation"]        # a NumPy array of records
    print(len(cursor), cursor["time"][0], cursor["x"].max())

A `Recording` looks for the streams of a file once, when it is made; their bytes are read anew each time that entries
are asked for. Of a file that was changed since, make another one. What goes wrong with a file is an `OSError`, what is
wrong with an argument a `ValueError`, `TypeError` or `KeyError`; a movie that could not be changed is a `SaveError`.
"""

from __future__ import annotations

import os
from collections.abc import Iterable, Iterator, Mapping
from types import TracebackType
from typing import Any, Union

from . import _core
from ._core import (
    Attached,
    AttachedStream,
    Creator,
    Finding,
    RecordedStream,
    Repair,
    RepairChange,
    Report,
    SaveError,
    StreamReport,
    __version__,
    action_text,
    dtype_of,
    key_text,
    modifiers_text,
    recorded_kinds,
    verify,
)
from ._entries import Records as _Records
from ._entries import Rows as _Rows
from ._entries import records_of as _records_of

__all__ = [
    "Attached",
    "AttachedStream",
    "Creator",
    "Finding",
    "RecordedStream",
    "Recording",
    "Repair",
    "RepairChange",
    "Report",
    "SaveError",
    "StreamReport",
    "StreamWriter",
    "__version__",
    "action_text",
    "attach",
    "dtype_of",
    "key_text",
    "modifiers_text",
    "recorded_kinds",
    "repair",
    "stamp",
    "verify",
    "write_stream",
]

_Path = Union[str, "os.PathLike[str]"]


class Recording(Mapping[str, _Records]):
    """A movie, RIFF file or stream file: the entries of each stream by the name of its kind.

    Entries are read anew each time they are asked for, from where the stream was when the `Recording` was made, and are
    the caller's. Only streams that can be decoded are in the mapping; `streams` has all of them.
    """

    def __init__(self, path: _Path) -> None:
        self._file = _core.RecordingFile(os.fspath(path))
        self._decodable = {stream.kind: stream for stream in self._file.streams if stream.is_decodable}
        self.path = path

    @property
    def container(self) -> str:
        """'movie', 'riff' or 'stream'."""
        return self._file.container

    @property
    def duration(self) -> float | None:
        """Seconds, as the movie declares them; None where it does not."""
        return self._file.duration

    @property
    def creators(self) -> list[Creator]:
        """Who stamped the movie, in the order of the file: the last one was stamped last."""
        return self._file.creators

    @property
    def streams(self) -> list[RecordedStream]:
        """Every stream, decodable or not, in the order of their identifiers."""
        return self._file.streams

    def __getitem__(self, kind: str) -> _Records:
        return self._decodable[kind].read()

    def __contains__(self, kind: object) -> bool:
        return kind in self._decodable

    def __iter__(self) -> Iterator[str]:
        return iter(self._decodable)

    def __len__(self) -> int:
        return len(self._decodable)

    def __repr__(self) -> str:
        return f"<{self.container} {os.fspath(self.path)!r}: {', '.join(self) or 'no metadata'}>"


_SOURCE_TYPES = (str, os.PathLike, RecordedStream, Recording)
_Source = Union[_Path, RecordedStream, Recording]


class StreamWriter:
    """Writes a stream file, entry by entry; close it, or use it in a `with`.

        with StreamWriter("cursorLocation.dat", "cursorLocation") as writer:
            writer.append(0.25, 640, 360)

    The values of an entry are those of `dtype_of(kind)`, behind the time. Entries wait in a buffer until `flush`; what
    the disk does not take is an `OSError`.

    Values are looked at before any of them is written: a number that its field cannot hold, a fraction or not-a-number
    for an integer, is a `ValueError`, whatever type it comes in. Only coordinates may have fractions, which are cut
    off, as the library does for applications. A text is a `str`, or `bytes`; anything else is a `TypeError`. An image
    is `bytes`, or None where an earlier entry with the same `id` has it: hot spot and type are then not stored.
    """

    def __init__(self, path: _Path, kind: str) -> None:
        self._fields = dtype_of(kind)
        self._coordinates = _core.coordinates_of(kind)
        self._name = f"{kind} {os.fspath(path)!r}"
        self._file = _core.StreamWriterFile(os.fspath(path), kind)

    def append(self, time: float, *values: Any) -> None:
        """Writes one entry."""
        names = self._fields.names or ()
        if len(values) != len(names) - 1:
            raise TypeError(f"the values of an entry are {', '.join(names[1:])}")
        self.extend([(time, *values)])

    def extend(self, entries: _Records | _Rows) -> None:
        """Writes many entries: a sequence of tuples, an array of records whose fields have the names of
        `dtype_of(kind)`, in any order, or rows of time and values, as an array of two dimensions or a list of lists."""
        self._file.extend(_records_of(entries, self._fields, self._coordinates))

    def flush(self) -> None:
        """Hands what was written to the system."""
        self._file.flush()

    def close(self) -> None:
        """Ends the file. May be called more than once."""
        self._file.close()

    @property
    def closed(self) -> bool:
        """Whether the file was ended."""
        return self._file.closed

    @property
    def entries_written(self) -> int:
        """Since the file was created, in the buffer or out of it."""
        return self._file.entries_written

    def __repr__(self) -> str:
        return f"<StreamWriter {self._name} entries_written={self.entries_written}{': closed' if self.closed else ''}>"

    def __enter__(self) -> StreamWriter:
        return self

    def __exit__(
        self, kind: type[BaseException] | None, error: BaseException | None, trace: TracebackType | None
    ) -> None:
        self.close()


def write_stream(path: _Path, kind: str, entries: _Records | _Rows) -> None:
    """Writes a whole stream file, of entries as `StreamWriter.extend` takes them. Where they do not fit, a file that
    was there stays what it was."""
    _core.write_stream(os.fspath(path), kind, _records_of(entries, dtype_of(kind), _core.coordinates_of(kind)))


def attach(movie: _Path, streams: _Source | Iterable[_Source], *, replace: bool = False) -> Attached:
    """Puts streams into a movie: stream files, single streams of other recordings, or all of a recording's. One of them
    needs no list around it.

    The movie holds them all afterwards, or is byte for byte what it was and `SaveError` is raised. A kind that is there
    already is refused unless `replace` is true. What stands behind the last whole entry of a stream is left out.
    """
    given = [streams] if isinstance(streams, _SOURCE_TYPES) else streams
    sources: list[str | RecordedStream] = []
    for stream in given:
        if isinstance(stream, Recording):
            sources.extend(stream.streams)
        else:
            sources.append(stream if isinstance(stream, RecordedStream) else os.fspath(stream))
    return _core.attach(os.fspath(movie), sources, replace)


def stamp(movie: _Path, creator: str, version: str) -> Creator:
    """Appends who made the movie, and gives what was stored: the platform's name in place of `creator`."""
    return _core.stamp(os.fspath(movie), creator, version)


def repair(movie: _Path, *, dry_run: bool = False) -> Repair:
    """Mends a movie's last atom, or an append that was interrupted. With `dry_run` only says what it would do."""
    return _core.repair(os.fspath(movie), dry_run)
