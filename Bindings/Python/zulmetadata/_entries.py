"""Makes the records that the core stores of what callers give as entries. Whatever would not be stored as it was given
is refused before anything is converted."""

from __future__ import annotations

from collections.abc import Collection, Sequence
from numbers import Integral, Real
from typing import Any, Union

import numpy as np
import numpy.typing as npt

Records = npt.NDArray[Any]
Rows = Sequence[Union["tuple[Any, ...]", "list[Any]", np.void]]
Column = Union[npt.NDArray[Any], Sequence[Any]]


def records_of(entries: Records | Rows, fields: np.dtype[Any], coordinates: Collection[str]) -> Records:
    """An array of `fields`: `entries` itself where it is one. Fractions of `coordinates` are cut off.

    Throws `TypeError` for what are no entries, `ValueError` for the wrong fields and for numbers that do not fit.
    """
    if isinstance(entries, np.ndarray) and entries.ndim == 1 and entries.dtype == fields:
        return np.ascontiguousarray(entries)
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


def _columns(entries: Records | Rows, names: tuple[str, ...]) -> dict[str, Column]:
    """The values of each field, in the order of `names`."""
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
    if not isinstance(entries, Sequence) or isinstance(entries, (str, bytes, bytearray)):
        raise TypeError(f"entries are a sequence of tuples or an array, and not {type(entries).__name__}")
    rows: Sequence[Any] = entries
    if not (set(map(type, rows)) <= {tuple, list} and set(map(len, rows)) == {len(names)}):
        rows = [_row(entry, names) for entry in entries]
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
    """One object for each value, also where these are sequences themselves. The core looks at them."""
    values = column.tolist() if isinstance(column, np.ndarray) else column
    objects = np.empty(len(values), object)
    for position, value in enumerate(values):
        objects[position] = value
    return objects


def _numbers(column: Column) -> Records:
    """As wide as they are: Python's large integers as objects, which NumPy takes for floating-point numbers."""
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
    """Rounded to what the field holds; infinite only where they were."""
    with np.errstate(over="ignore"):
        stored = numbers.astype(kind)
    overflown = np.isinf(stored) & (stored != numbers)
    if overflown.any():
        raise ValueError(f"{numbers[overflown][0]} is not in the range of {kind.name}")
    return stored


def _extremes(numbers: Records) -> list[Any]:
    """The smallest and the largest, or not-a-number, as Python's own numbers: these compare exactly."""
    places = [numbers.argmin(), numbers.argmax()] if numbers.size else []
    return list(numbers[places].tolist())
