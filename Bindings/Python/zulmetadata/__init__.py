"""The metadata of screen recordings, as NumPy arrays.

    import zulmetadata

    recording = zulmetadata.Recording("Recording.mp4")
    cursor = recording["cursorLocation"]        # a NumPy array of records
    print(len(cursor), cursor["time"][0], cursor["x"].max())

A `Recording` looks for the streams of a file once, when it is created, and reads their bytes each time you ask for
entries. Open the file again after it changes. A problem with a file raises an `OSError`, a wrong argument a
`ValueError`, `TypeError` or `KeyError`, and a movie that could not be changed a `SaveError`.
"""

from __future__ import annotations

import importlib
import json
import os
from collections.abc import Iterable, Iterator, Mapping
from fractions import Fraction
from types import TracebackType
from typing import Any, Literal, Union, cast

import numpy as np
import numpy.typing as npt

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
from ._entries import Entries as _Entries
from ._entries import Records as _Records
from ._entries import records_of as _records_of
from ._kinds import Kind
from ._scan import Batch, Failure, OnError, Scan
from ._tables import table_of as _table_of

__all__ = [
    "Attached",
    "AttachedStream",
    "Batch",
    "Creator",
    "Failure",
    "Finding",
    "Kind",
    "OnError",
    "RecordedStream",
    "Recording",
    "Repair",
    "RepairChange",
    "Report",
    "SaveError",
    "Scan",
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
    "scan",
    "stamp",
    "to_pandas",
    "verify",
    "write_stream",
]

_Path = Union[str, "os.PathLike[str]"]


class Recording(Mapping[Kind, _Records]):
    """A movie, RIFF file or stream file. It maps the name of each kind to the entries of its stream.

    Entries are read each time you ask for them, from where the stream was when the `Recording` was created. The arrays
    are yours. The mapping has only the streams that can be decoded; `streams` has all of them.

    A `Recording` can be used in a `with` statement and can be pickled. A pickle holds the absolute path of the file,
    not its contents; the file is opened again when the pickle is loaded.
    """

    def __init__(self, path: _Path) -> None:
        self._file = _core.RecordingFile(os.fspath(path))
        self._decodable = {cast(Kind, stream.kind): stream for stream in self._file.streams if stream.is_decodable}
        self._closed = False
        self._session: _core.Session | None = None
        self.path = path

    @property
    def container(self) -> str:
        """'movie', 'riff' or 'stream'."""
        return self._file.container

    @property
    def duration(self) -> float | None:
        """The duration in seconds that the movie declares, or None if it declares none."""
        return self._file.duration

    @property
    def creators(self) -> list[Creator]:
        """The stamps of the movie, in the order of the file. The last one is the newest."""
        return self._file.creators

    @property
    def streams(self) -> list[RecordedStream]:
        """All streams, decodable or not, in the order of their identifiers."""
        return self._file.streams

    def close(self) -> None:
        """Ends the use of the recording: asking for entries raises a `ValueError` afterwards. May be called more than
        once. Arrays that were read stay valid. No file is kept open before this either."""
        self._closed = True
        self._session = None

    @property
    def closed(self) -> bool:
        """True after `close`."""
        return self._closed

    def _require_open(self) -> None:
        if self._closed:
            raise ValueError(f"{os.fspath(self.path)}: the recording is closed")

    def _opened(self) -> _core.Session:
        """Returns the recording as the session layer knows it. It keeps the tracks that it has read."""
        self._require_open()
        if self._session is None:
            self._session = _core.Session(os.fspath(self.path))
        return self._session

    def track(self, kind: Kind) -> _Records:
        """Returns the entries of a kind with a finite time, in the order of their times. Entries at the same time keep
        the order of the stream. Raises a `KeyError` if the recording has no stream of the kind."""
        entries = self[kind]
        entries = entries[np.isfinite(entries["time"])]
        return entries[np.argsort(entries["time"], kind="stable")]

    def at(self, times: npt.ArrayLike, *, interpolate: Literal["linear", "none"] = "linear") -> _Records:
        """Returns what holds at each of these times, in seconds: one record for each, with the fields `x` and `y` of the
        cursor, `cursor_id`, `hotspot_x`, `hotspot_y` and `picture` of what it looks like, `opacity`, `buttons`,
        `modifiers`, `window_x` to `window_height`, `title`, `application`, `slide_title`, `slide_text`,
        `slide_comment`, `hover_x` to `hover_height`, `region_x` to `region_height`, `scale` and `cpu`.

        A number that is not known is not-a-number, and anything else None. Buttons and modifiers are names with "+"
        between two, such as "shift+ctrl". With "linear" the cursor moves between two entries, but rests while nothing
        was recorded; with "none" it is where the last entry says. A stream that cannot be decoded is a `UserWarning`,
        and nothing is known of it.
        """
        if interpolate not in ("linear", "none"):
            raise ValueError(f"interpolate is 'linear' or 'none', not {interpolate!r}")
        asked = np.atleast_1d(np.asarray(times, dtype=np.float64)).ravel()
        return _table_of(self._opened().states(asked, interpolate == "linear"))

    def insights(self, name: str, **parameters: float) -> _Records:
        """Returns what follows from the recording: "clicks", "captions", "idle", "chapters", "zooms", "cursor_path",
        "cursor_speed", "camera", "activity" or "applications". `dtype.names` of the result lists the fields. Parameters
        change the defaults of the C++ library, by their names in lower case with underscores, such as
        `least=3`. Another name raises a `ValueError`. A stream that cannot be decoded is a `UserWarning`."""
        return _table_of(self._opened().insight(name, {key: float(value) for key, value in parameters.items()}))

    def retime(
        self, edits: str | Mapping[str, Any] | os.PathLike[str], *, frame_rate: float | str | Fraction | None = None
    ) -> _Records:
        """Returns the streams for a movie that was cut by an edit list. `edits` is the text of a list, the mapping that
        a JSON document describes, or the path of a file, as a `pathlib.Path`. Lists of other programs are read, too.
        `frame_rate`, such as 25 or "30000/1001", is for those that count frames. An impossible list raises a `ValueError`.

        A record has the `kind` and all `bytes` of a stream. If `is_copied` is 0, `moved`, `carried`, `added` and
        `left_out` count its entries. A `UserWarning` says what is not in the result, such as a hidden stream."""
        name = "edits"
        if isinstance(edits, os.PathLike):
            name = os.fspath(edits)
            with open(name, "rb") as file:
                text = file.read()
        else:
            text = (edits if isinstance(edits, str) else json.dumps(edits)).encode()
        rate = "" if frame_rate is None else str(frame_rate)
        return _table_of(self._opened().retimed(text, name, rate))[
            ["kind", "bytes", "is_copied", "moved", "carried", "added", "left_out"]
        ]

    def __getitem__(self, kind: Kind) -> _Records:
        self._require_open()
        return self._decodable[kind].read()

    def __contains__(self, kind: object) -> bool:
        return kind in self._decodable

    def __iter__(self) -> Iterator[Kind]:
        return iter(self._decodable)

    def __len__(self) -> int:
        return len(self._decodable)

    def __repr__(self) -> str:
        return f"<{self.container} {os.fspath(self.path)!r}: {', '.join(self) or 'no metadata'}>"

    def __enter__(self) -> Recording:
        return self

    def __exit__(
        self, kind: type[BaseException] | None, error: BaseException | None, trace: TracebackType | None
    ) -> None:
        self.close()

    def __reduce__(self) -> tuple[type[Recording], tuple[str]]:
        return type(self), (os.path.abspath(os.fspath(self.path)),)


def to_pandas(records: _Records) -> Any:
    """Returns records as a `pandas.DataFrame`, with the time in seconds as its index if they have one. Raises an
    `ImportError` if pandas is not installed."""
    pandas = importlib.import_module("pandas")
    frame = pandas.DataFrame({name: records[name] for name in records.dtype.names or ()})
    return frame.set_index("time") if "time" in frame else frame


def scan(
    recordings: _Path | Iterable[_Path],
    kind: Kind,
    *,
    columns: Iterable[str] | None = None,
    on_error: OnError = "raise",
) -> Scan:
    """Returns the entries of one kind in many recordings: in batches, as a pandas frame or as a Dask frame.

        for batch in zulmetadata.scan("Recordings/**/*.mp4", "cursorLocation", columns=["x"], on_error="skip"):
            print(batch.recording, batch.time[-1], batch.fields["x"].max())

    `recordings` is a path, a pattern as `glob` has them (with "**" for folders inside folders, in the order of the
    names), or an iterable of paths. `columns` are some of the fields of the kind; all of them if it is None. If a
    recording cannot be read, its error is raised, or, if `on_error` is "skip" or "report", the others are read all the
    same; "report" says afterwards what failed and why. A recording without entries of the kind is no failure.
    """
    if isinstance(columns, str):
        raise TypeError(f"columns is a list of names, such as [{columns!r}]")
    return Scan(recordings, kind, None if columns is None else list(columns), on_error)


_SOURCE_TYPES = (str, os.PathLike, RecordedStream, Recording)
_Source = Union[_Path, RecordedStream, Recording]


class StreamWriter(_core.StreamWriterFile):
    """Writes a stream file, entry by entry. Close it at the end, or use it in a `with` statement.

        with StreamWriter("cursorLocation.dat", "cursorLocation") as writer:
            writer.append(0.25, 640, 360)

    An entry is its time in seconds, followed by the values of `dtype_of(kind)`. Entries wait in a buffer until `flush`.
    If the disk does not take them, an `OSError` is raised.

    All values are checked before any of them is written. A number that its field cannot hold raises a `ValueError`,
    whatever its type; so do a fraction or not-a-number for an integer, and a time that is not finite. Only coordinates
    may have fractions, which are cut off, as the C++ library does. A text is a `str` or `bytes`; any other type raises a
    `TypeError`. An image is `bytes`, or None if an earlier entry with the same `id` has it; hot spot and type are not
    stored without an image.
    """

    def __init__(self, path: _Path, kind: Kind) -> None:
        self._fields = dtype_of(kind)
        self._coordinates = _core.coordinates_of(kind)
        self._name = f"{kind} {os.fspath(path)!r}"
        super().__init__(os.fspath(path), kind)

    def append(self, time: float, *values: Any) -> None:
        """Writes one entry."""
        names = self._fields.names or ()
        if len(values) != len(names) - 1:
            raise TypeError(f"the values of an entry are {', '.join(names[1:])}")
        self.extend([(time, *values)])

    def extend(self, entries: _Entries) -> None:
        """Writes many entries. They are tuples in a list, a generator or another iterable; or an array of records, whose
        fields have the names of `dtype_of(kind)` in any order; or rows of time and values, as an array of two dimensions
        or as lists. An iterable is read to its end before anything is written."""
        super().extend(_records_of(entries, self._fields, self._coordinates))

    def __repr__(self) -> str:
        return f"<StreamWriter {self._name} entries_written={self.entries_written}{': closed' if self.closed else ''}>"

    def __enter__(self) -> StreamWriter:
        return self

    def __exit__(
        self, kind: type[BaseException] | None, error: BaseException | None, trace: TracebackType | None
    ) -> None:
        self.close()


def write_stream(path: _Path, kind: Kind, entries: _Entries) -> None:
    """Writes a whole stream file, of entries in the forms that `StreamWriter.extend` accepts. If an entry does not fit,
    an existing file stays as it was."""
    _core.write_stream(os.fspath(path), kind, _records_of(entries, dtype_of(kind), _core.coordinates_of(kind)))


def attach(
    movie: _Path, streams: _Source | Iterable[_Source], *, replace: bool = False, unchecked: bool = False
) -> Attached:
    """Puts streams into a movie: stream files, single streams of other recordings, or all streams of a recording.
    `streams` is one of these, or an iterable of them.

    Afterwards the movie holds all of them; otherwise a `SaveError` is raised and the movie is byte for byte what it was.
    A kind that the movie already has is refused unless `replace` is true. Bytes after the last whole entry of a stream
    are left out.

    A source of no known kind and version is refused, and so is one that holds bytes but not one whole entry: it is often
    a wrong path. The `reason` of the `SaveError` is then 'doubtful'. `unchecked` attaches such a source.
    """
    given = [streams] if isinstance(streams, _SOURCE_TYPES) else streams
    sources: list[str | RecordedStream] = []
    for stream in given:
        if isinstance(stream, Recording):
            sources.extend(stream.streams)
        else:
            sources.append(stream if isinstance(stream, RecordedStream) else os.fspath(stream))
    return _core.attach(os.fspath(movie), sources, replace, unchecked)


def stamp(movie: _Path, creator: str, version: str) -> Creator:
    """Appends a record of who made the movie, and returns the record as it was stored. Its name is that of the platform,
    which takes the place of `creator`."""
    return _core.stamp(os.fspath(movie), creator, version)


def repair(movie: _Path, *, dry_run: bool = False) -> Repair:
    """Repairs a movie whose last atom is unfinished or to which streams were appended incompletely. With `dry_run` the
    result says what would be done, and the movie is not changed."""
    return _core.repair(os.fspath(movie), dry_run)
