"""Converts the entries that callers pass into the records that the core stores. A value that would not be stored as it
was given is refused before anything is converted."""

from __future__ import annotations

from collections.abc import Collection, Iterable, Mapping, Sequence, Set
from numbers import Integral, Real
from typing import Any, Union

import numpy as np
import numpy.typing as npt

Records = npt.NDArray[Any]
Row = Union["tuple[Any, ...]", "list[Any]", np.void]
Entries = Union[Records, Iterable[Row]]
Column = Union[npt.NDArray[Any], Sequence[Any]]


def records_of(entries: Entries, fields: np.dtype[Any], coordinates: Collection[str]) -> Records:
    """Returns an array of `fields`, which is `entries` itself if it is one. Fractions of `coordinates` are cut off.

    Raises `TypeError` for something that is not entries, and `ValueError` for wrong fields, for numbers that do not fit
    and for times that are not finite.
    """
    if isinstance(entries, np.ndarray) and entries.ndim == 1 and entries.dtype == fields:
        records = np.ascontiguousarray(entries)
    else:
        records = _converted(entries, fields, coordinates)
    broken = ~np.isfinite(records["time"])
    if broken.any():
        position = int(broken.argmax())
        raise ValueError(f"time: {records['time'][position]} (entry {position}) is not a finite number of seconds")
    return records


def _converted(entries: Entries, fields: np.dtype[Any], coordinates: Collection[str]) -> Records:
    columns = _columns(entries, fields.names or ())
    records = np.empty(len(next(iter(columns.values()))), fields)
    for name, column in columns.items():
        if fields[name] == object:
            records[name] = _objects(column)
        else:
            try:
                records[name] = _stored(_numbers(column), fields[name], name in coordinates)
            except (OverflowError, ValueError) as error:
                raise ValueError(f"{name}: {error}") from None
    return records


def _columns(entries: Entries, names: tuple[str, ...]) -> dict[str, Column]:
    """Returns the values of each field, in the order of `names`."""
    if isinstance(entries, np.ndarray):
        if entries.ndim == 1 and entries.dtype.names is not None:
            _require_names(entries.dtype.names, names)
            return {name: entries[name] for name in names}
        if entries.ndim == 2 and entries.dtype.names is None:
            if entries.shape[1] != len(names):
                raise ValueError(f"{entries.shape[1]} columns; an entry has {', '.join(names)}")
            return dict(zip(names, entries.T))
        if entries.ndim != 1:
            raise ValueError(f"an array of {entries.ndim} dimensions; entries are records, or rows of numbers")
        entries = entries.tolist()
    if not isinstance(entries, Iterable) or isinstance(entries, (str, bytes, bytearray, Mapping, Set)):
        raise TypeError(f"entries are tuples in order, or an array, and not {type(entries).__name__}")
    rows: Sequence[Any] = entries if isinstance(entries, (list, tuple)) else list(entries)
    if not (set(map(type, rows)) <= {tuple, list} and set(map(len, rows)) == {len(names)}):
        rows = [_row(entry, names) for entry in rows]
    return dict(zip(names, zip(*rows))) if rows else {name: () for name in names}


def _row(entry: Any, names: tuple[str, ...]) -> Sequence[Any]:
    if isinstance(entry, np.void) and entry.dtype.names is not None:
        _require_names(entry.dtype.names, names)
        return [entry[name] for name in names]
    if isinstance(entry, np.ndarray) and entry.ndim == 1:
        entry = entry.tolist()
    if not isinstance(entry, (tuple, list)):
        raise TypeError(f"an entry is a tuple of {', '.join(names)}, and not {type(entry).__name__}")
    if len(entry) != len(names):
        raise ValueError(f"an entry of {len(entry)} values; it has {', '.join(names)}")
    return entry


def _require_names(given: tuple[str, ...], names: tuple[str, ...]) -> None:
    if set(given) != set(names):
        raise ValueError(f"records of {', '.join(given)}; an entry has {', '.join(names)}")


def _objects(column: Column) -> Records:
    """Returns one object for each value, even if the values are sequences. The core checks them."""
    values = column.tolist() if isinstance(column, np.ndarray) else column
    objects = np.empty(len(values), object)
    for position, value in enumerate(values):
        objects[position] = value
    return objects


def _numbers(column: Column) -> Records:
    """Returns the numbers in their full width. Large integers stay objects; NumPy would make them floating-point."""
    if isinstance(column, np.ndarray) and column.dtype.kind != "O":
        if column.ndim != 1 or column.dtype.kind not in "biuf":
            raise ValueError(f"a number is wanted, and not {column.dtype}")
        return column
    types = set(map(type, column))
    for kind in types:
        if not issubclass(kind, (Real, np.bool_)):
            raise ValueError(f"a number is wanted, and not {kind.__name__}")
    if not all(issubclass(kind, Integral) for kind in types):
        return np.array(column, float)
    numbers = np.array(column)
    return numbers if numbers.dtype.kind in "biu" else np.array(column, object)


def _stored(numbers: Records, kind: np.dtype[Any], is_coordinate: bool) -> Records:
    if kind.kind == "f":
        return _floats(numbers, kind)
    if numbers.dtype.kind == "f":
        whole = np.trunc(numbers)
        broken = whole != numbers
        if broken.any() and not is_coordinate:
            raise ValueError(f"{numbers[broken][0]} is not an integer")
        numbers = whole
    limits = np.iinfo(kind)
    for value in _extremes(numbers):
        if not limits.min <= value <= limits.max:
            raise ValueError(f"{value} is not in the range from {limits.min} to {limits.max}")
    return numbers.astype(kind)


def _floats(numbers: Records, kind: np.dtype[Any]) -> Records:
    """Returns the numbers rounded to what the field holds. A number becomes infinite only if it was."""
    with np.errstate(over="ignore"):
        stored = numbers.astype(kind)
    overflown = np.isinf(stored) & (stored != numbers)
    if overflown.any():
        raise ValueError(f"{numbers[overflown][0]} is not in the range of {kind.name}")
    return stored


def _extremes(numbers: Records) -> list[Any]:
    """Returns the smallest and the largest number, or not-a-number, as Python's own numbers, which compare exactly."""
    places = [numbers.argmin(), numbers.argmax()] if numbers.size else []
    return list(numbers[places].tolist())
