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


@pytest.mark.parametrize("kind, entry, error", [
    ("cursorLocation", (0, "a", 1), ValueError),
    ("cursorLocation", (0, 2**40, 1), OverflowError),
    ("slideTitles", (0, 7), TypeError),
    ("slideTitles", (0, "with a \0 inside"), ValueError),
    ("cursorImage", (0, 1, 0, 0, -1, 3, "a text"), TypeError),
])
def test_values_that_do_not_fit_write_nothing(tmp_path, kind, entry, error):
    with zulmetadata.StreamWriter(tmp_path / "stream.dat", kind) as writer:
        with pytest.raises(error):
            writer.extend([entry])
        assert writer.entries_written == 0
    assert (tmp_path / "stream.dat").stat().st_size == 24


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
