"""Turns the columns that the core computes into records."""

from __future__ import annotations

from collections.abc import Sequence
from typing import Any, Union

import numpy as np
import numpy.typing as npt

Column = Union[npt.NDArray[Any], "list[Any]"]


def table_of(columns: Sequence[tuple[str, Column]]) -> npt.NDArray[Any]:
    """Returns an array of records with these columns, which are all of one length. A list becomes a field of objects."""
    fields = [(name, values.dtype if isinstance(values, np.ndarray) else np.dtype(object)) for name, values in columns]
    records = np.empty(len(columns[0][1]), np.dtype(fields))
    for name, values in columns:
        records[name] = values
    return records
