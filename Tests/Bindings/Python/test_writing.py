import collections
import struct

import numpy as np
import pytest
import zulmetadata


def test_bytes_of_a_stream(tmp_path):
    file = tmp_path / "cursorLocation.dat"
    with zulmetadata.StreamWriter(file, "cursorLocation") as writer:
        writer.append(0.25, 640, -360)
        writer.extend([(1, 1, 2), (2, 3, 4)])
        assert writer.entries_written == 3 and not writer.closed
    assert writer.closed
    header = bytes.fromhex("2b7b6af27a1f11e283d00017f200be7f") + struct.pack("<iI", 1, 16)
    assert file.read_bytes() == header + struct.pack("<diidiidii", 0.25, 640, -360, 1, 1, 2, 2, 3, 4)


def test_bytes_of_a_text(tmp_path):
    file = tmp_path / "slideTitles.dat"
    zulmetadata.write_stream(file, "slideTitles", [(1.5, "Grüße")])
    assert file.read_bytes()[20:] == struct.pack("<IId", 0, 15, 1.5) + "Grüße".encode()


def test_what_is_flushed_can_be_followed(tmp_path):
    file = tmp_path / "cpuUsage.dat"
    writer = zulmetadata.StreamWriter(file, "cpuUsage")
    writer.append(0, 0.5)
    assert len(zulmetadata.Recording(file)["cpuUsage"]) == 0
    writer.flush()
    assert zulmetadata.Recording(file)["cpuUsage"].tolist() == [(0, 0.5)]
    writer.close()


def test_arrays_of_other_types_are_converted(tmp_path):
    file = tmp_path / "cursorLocation.dat"
    wide = np.array([(1, 2.9, 3)], [("time", "<f4"), ("x", "<f8"), ("y", "<i8")])[::1]
    zulmetadata.write_stream(file, "cursorLocation", wide)
    assert zulmetadata.Recording(file)["cursorLocation"].tolist() == [(1, 2, 3)]


def test_every_other_record_of_an_array(tmp_path):
    entries = np.array([(t, t, t) for t in range(10)], zulmetadata.dtype_of("cursorLocation"))
    zulmetadata.write_stream(tmp_path / "a.dat", "cursorLocation", entries[::2])
    assert zulmetadata.Recording(tmp_path / "a.dat")["cursorLocation"]["x"].tolist() == [0, 2, 4, 6, 8]


LOCATIONS = [(0, 1, 2), (3, 4, 5)]


@pytest.mark.parametrize("entries", [
    LOCATIONS,
    tuple(LOCATIONS),
    [[0.0, 1, 2], [3.0, 4, 5]],
    [(0, 1, 2), np.array([3, 4, 5])],
    np.array(LOCATIONS),
    np.array(LOCATIONS, np.float32),
    np.array(LOCATIONS, object),
    np.array(LOCATIONS, [("time", "<f8"), ("x", "<i4"), ("y", "<i4")]),
    np.array(LOCATIONS, [("time", ">f4"), ("x", ">i2"), ("y", "u1")]),
    np.array([(2, 0, 1), (5, 3, 4)], [("y", "O"), ("time", "<i4"), ("x", "<f8")]),  # in another order
    np.rec.array(LOCATIONS, zulmetadata.dtype_of("cursorLocation")),
    list(np.array(LOCATIONS, zulmetadata.dtype_of("cursorLocation"))),
    collections.deque(LOCATIONS),
])
def test_entries_of_every_shape(tmp_path, entries):
    zulmetadata.write_stream(tmp_path / "a.dat", "cursorLocation", entries)
    assert zulmetadata.Recording(tmp_path / "a.dat")["cursorLocation"].tolist() == LOCATIONS


def failing_after(entries):
    yield from entries
    raise RuntimeError("no more")


def test_generators_are_taken_wherever_entries_are(tmp_path, plain_movie):
    file = tmp_path / "a.dat"
    zulmetadata.write_stream(file, "cursorLocation", (entry for entry in LOCATIONS))
    assert zulmetadata.Recording(file)["cursorLocation"].tolist() == LOCATIONS
    with zulmetadata.StreamWriter(file, "cursorLocation") as writer:
        writer.extend(map(tuple, np.array(LOCATIONS)))
        writer.extend(zip([6], [7], [8]))
        writer.extend(iter(()))
        with pytest.raises(RuntimeError, match="no more"):
            writer.extend(failing_after(LOCATIONS))
        assert writer.entries_written == 3
    assert zulmetadata.Recording(file)["cursorLocation"].tolist() == [*LOCATIONS, (6, 7, 8)]
    with pytest.raises(RuntimeError, match="no more"):
        zulmetadata.write_stream(file, "cursorLocation", failing_after(LOCATIONS))
    assert len(zulmetadata.Recording(file)["cursorLocation"]) == 3
    zulmetadata.attach(plain_movie, (source for source in [file]))
    assert list(zulmetadata.Recording(plain_movie)) == ["cursorLocation"]


@pytest.mark.parametrize("time", [float("nan"), float("inf"), -float("inf"), np.float32("nan")])
def test_times_that_are_not_finite_are_refused(tmp_path, time):
    file = tmp_path / "a.dat"
    with zulmetadata.StreamWriter(file, "cursorLocation") as writer:
        for entries in ([(0, 1, 2), (time, 3, 4)], np.array([(0, 1, 2), (time, 3, 4)]),
                        np.array([(0, 1, 2), (time, 3, 4)], zulmetadata.dtype_of("cursorLocation"))):
            with pytest.raises(ValueError, match=r"time: -?(nan|inf) \(entry 1\) is not a finite number of seconds"):
                writer.extend(entries)
        with pytest.raises(ValueError, match="not a finite number of seconds"):
            writer.append(time, 1, 2)
        assert writer.entries_written == 0
    before = file.read_bytes()
    for kind, entry in (("slideTitles", (time, "a")), ("cursorImage", (time, 1, 0, 0, 0, 3, None))):
        with pytest.raises(ValueError, match="not a finite number of seconds"):
            zulmetadata.write_stream(file, kind, [entry])
    assert file.read_bytes() == before


@pytest.mark.parametrize("entries", [[], (), np.empty((0, 3)), np.array([])])
def test_no_entries(tmp_path, entries):
    zulmetadata.write_stream(tmp_path / "a.dat", "cursorLocation", entries)
    assert len(zulmetadata.Recording(tmp_path / "a.dat")["cursorLocation"]) == 0


@pytest.mark.parametrize("entries, error, sentence", [
    (5, TypeError, "tuples in order, or an array, and not int"),
    ("abc", TypeError, "and not str"),
    ({0: (1, 2)}, TypeError, "and not dict"),
    ({(0, 1, 2)}, TypeError, "and not set"),
    (iter("abc"), TypeError, "an entry is a tuple of time, x, y, and not str"),
    ([0, 1, 2], TypeError, "an entry is a tuple of time, x, y, and not int"),
    (["abc"], TypeError, "and not str"),
    (np.array([0.0, 1, 2]), TypeError, "an entry is a tuple"),
    (np.array(5), ValueError, "0 dimensions"),
    (np.zeros((2, 3, 3)), ValueError, "3 dimensions"),
    (np.zeros((2, 2)), ValueError, "2 columns; an entry has time, x, y"),
    ([(0, 1, 2), (0, 1)], ValueError, "an entry of 2 values"),
    (np.zeros(2, "<f8,<i4,<i4"), ValueError, "records of f0, f1, f2; an entry has time, x, y"),
    (np.zeros(2, [("time", "<f8"), ("x", "<i4")]), ValueError, "records of time, x;"),
    (np.zeros((2, 2), zulmetadata.dtype_of("cursorLocation")), ValueError, "2 dimensions"),
    (np.zeros(2, [("time", "<f8"), ("x", "<i4", 2), ("y", "<i4")]), ValueError, "x: a number"),
    (list(np.zeros(2, "<f8,<i4,<i4")), ValueError, "records of f0"),
    (np.array([("0", "1", "2")]), ValueError, "time: a number is wanted"),
])
def test_what_are_no_entries_leaves_a_file_alone(tmp_path, entries, error, sentence):
    file = tmp_path / "a.dat"
    file.write_text("precious")
    with pytest.raises(error, match=sentence):
        zulmetadata.write_stream(file, "cursorLocation", entries)
    assert file.read_text() == "precious"


@pytest.mark.parametrize("kind, entry, error", [
    ("cursorLocation", (0, "a", 1), ValueError),
    ("cursorLocation", (0, None, 1), ValueError),
    ("slideTitles", (0, 7), TypeError),
    ("slideTitles", (0, ["a"]), TypeError),
    ("slideTitles", (0, "with a \0 inside"), ValueError),
    ("systemData", (0, "a", "b", "c", 7), TypeError),
    ("cursorImage", (0, 1, 0, 0, -1, 3, "a text"), TypeError),
])
def test_values_that_do_not_fit_write_nothing(tmp_path, kind, entry, error):
    with zulmetadata.StreamWriter(tmp_path / "stream.dat", kind) as writer:
        with pytest.raises(error):
            writer.extend([entry])
        assert writer.entries_written == 0
    before = (tmp_path / "stream.dat").read_bytes()
    assert len(before) == 24
    with pytest.raises(error):
        zulmetadata.write_stream(tmp_path / "stream.dat", kind, [entry, entry])
    assert (tmp_path / "stream.dat").read_bytes() == before


def comings(value):
    """The value as Python's number, and in arrays of every type that holds it."""
    yield [(0, value)]
    yield [(0, value), (0, 1.0)]
    yield np.array([(0, value)], object)
    for kind in ("<i8", "<u8", "<f8", "<f4"):
        if kind[1] == "f" or (isinstance(value, int) and np.iinfo(kind).min <= value <= np.iinfo(kind).max):
            with np.errstate(over="ignore"):
                yield np.array([(0, value)], [("time", "<f8"), ("rawActionValue", kind)])
                yield np.array([(0, value)], kind)


@pytest.mark.parametrize("value", [2**31, -2**31 - 200, 2**40, 2**63, 2**64, 2**70, 1e300, np.nan, np.inf, 1.5])
def test_numbers_that_do_not_fit_are_value_errors_however_they_come(tmp_path, value):
    with zulmetadata.StreamWriter(tmp_path / "stream.dat", "cursorAction") as writer:
        for entries in comings(value):
            with pytest.raises(ValueError, match="rawActionValue: .* is not"):
                writer.extend(entries)
            assert writer.entries_written == 0


def test_the_largest_numbers_fit_however_they_come(tmp_path):
    for kind, field, values in (("cursorAction", "rawActionValue", (-2**31, 2**31 - 1)),
                                ("keyboardAction", "characterCode", (0, 2**32 - 1))):
        for value in values:
            for entries in ([(0, value)], [(0, float(value))], np.array([(0, value)])):
                if kind == "keyboardAction":
                    entries = [(*row, 0) for row in entries]
                zulmetadata.write_stream(tmp_path / "a.dat", kind, entries)
                assert zulmetadata.Recording(tmp_path / "a.dat")[kind][field].tolist() == [value]


def test_large_identifiers_are_exact(tmp_path):
    entries = [(0, 1, 0, 0, 0, 0, None), (1, 2**64 - 1, 0, 0, 0, 0, None), (2, 2**53 + 1, 0, 0, 0, 0, None)]
    zulmetadata.write_stream(tmp_path / "a.dat", "cursorImage", entries)
    assert zulmetadata.Recording(tmp_path / "a.dat")["cursorImage"]["id"].tolist() == [1, 2**64 - 1, 2**53 + 1]
    with pytest.raises(ValueError, match="id: "):
        zulmetadata.write_stream(tmp_path / "a.dat", "cursorImage", [(0, 2.0**64, 0, 0, 0, 0, None)])


def test_beside_no_image_hot_spot_and_type_are_not_stored(tmp_path):
    entries = [(0, 1, 5, 6, 2, 3, b"an image"), (1, 1, 5, 6, 2, 3, None)]
    zulmetadata.write_stream(tmp_path / "a.dat", "cursorImage", entries)
    assert zulmetadata.Recording(tmp_path / "a.dat")["cursorImage"].tolist() == [entries[0], (1, 1, 0, 0, -1, 3, None)]


def test_fractions_of_coordinates_are_cut_off(tmp_path):
    for kind in ("cursorLocation", "recordingRegion", "cursorImage"):
        fields = zulmetadata.dtype_of(kind)
        entry = [2.9 if name in ("x", "y", "width", "height") or "Offset" in name else 1 for name in fields.names]
        if kind == "cursorImage":
            entry[-1] = b"an image"
        negative = [-value if value == 2.9 else value for value in entry]
        zulmetadata.write_stream(tmp_path / "a.dat", kind, [entry, negative])
        first, second = zulmetadata.Recording(tmp_path / "a.dat")[kind].tolist()
        assert set(first[1:]) - {1, b"an image"} == {2} and set(second[1:]) - {1, b"an image"} == {-2}


def test_floating_point_numbers_are_rounded_but_do_not_overflow(tmp_path):
    zulmetadata.write_stream(tmp_path / "a.dat", "cpuUsage", [(0, 0.1), (1, float("inf")), (2, float("nan"))])
    assert str(zulmetadata.Recording(tmp_path / "a.dat")["cpuUsage"]["cpuUsage"]) == "[0.1 inf nan]"
    for entries in ([(0, 1e300)], [(0, -10**400)], [(10**400, 0)], [(10**400, 0.5), (0.5, 0)], np.array([(0, 1e300)])):
        with pytest.raises(ValueError, match="cpuUsage: |time: "):
            zulmetadata.write_stream(tmp_path / "a.dat", "cpuUsage", entries)


def test_too_few_values_say_which_there_are(tmp_path):
    with zulmetadata.StreamWriter(tmp_path / "stream.dat", "cursorLocation") as writer:
        with pytest.raises(TypeError, match="x, y"):
            writer.append(0, 1)


def test_kinds_without_entries_cannot_be_written(tmp_path):
    for kind in ("caretPosition", "nonsense"):
        with pytest.raises(KeyError, match=kind):
            zulmetadata.StreamWriter(tmp_path / "stream.dat", kind)
    assert not (tmp_path / "stream.dat").exists()


def test_what_the_disk_does_not_take_is_an_error(tmp_path):
    with pytest.raises(OSError, match="No space left"):
        zulmetadata.StreamWriter("/dev/full", "cursorLocation")
    with pytest.raises(FileNotFoundError):
        zulmetadata.StreamWriter(tmp_path / "no" / "folder.dat", "cursorLocation")


def test_nothing_can_be_written_after_the_end(tmp_path):
    writer = zulmetadata.StreamWriter(tmp_path / "stream.dat", "cpuUsage")
    writer.close()
    writer.close()
    with pytest.raises(ValueError, match="closed"):
        writer.append(0, 1)
