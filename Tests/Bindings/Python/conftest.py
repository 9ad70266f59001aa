"""What the tests of the package share: recordings."""

import pathlib

import numpy as np
import pytest
import zulmetadata

DATA = pathlib.Path(__file__).parents[2] / "Data"
PLAIN_MOVIE = b"\0\0\0\x10ftypmp42\0\0\0\0"


def texts(kind, *values):
    return np.array([(index / 2, *value) for index, value in enumerate(values)], zulmetadata.dtype_of(kind))


def sample_entries(kind):
    """Some entries of a kind, the first of them with the smallest and the last with the largest numbers."""
    fields = zulmetadata.dtype_of(kind)
    if kind == "systemData":
        return texts(kind, ("ProcessorCount:2", "ActiveProcessorCount:2", "OSVersion:Dëbian", "RAM:512MB"))
    if kind == "cursorImage":
        return texts(kind, (1, 5, -3, 2, 3, b"\x89PNG and so on"), (2**64 - 1, 0, 0, -1, 3, None))
    if fields[1] == object:
        return texts(kind, ("",), ("Größe 📐",), ("bytes that are no text: \udcff",))
    limits = [np.iinfo if np.issubdtype(fields[name], np.integer) else np.finfo for name in fields.names[1:]]
    rows = [tuple(limit(fields[name]).min for name, limit in zip(fields.names[1:], limits)),
            tuple(limit(fields[name]).max for name, limit in zip(fields.names[1:], limits))]
    return texts(kind, *rows)


@pytest.fixture
def plain_movie(tmp_path):
    movie = tmp_path / "Recording.mp4"
    movie.write_bytes(PLAIN_MOVIE)
    return movie


@pytest.fixture
def recording(tmp_path, plain_movie):
    """A movie with some entries of every kind."""
    files = []
    for kind in zulmetadata.recorded_kinds():
        files.append(tmp_path / f"{kind}.dat")
        zulmetadata.write_stream(files[-1], kind, sample_entries(kind))
    zulmetadata.attach(plain_movie, files)
    return plain_movie
