import copy
import gc
import os
import pickle
import struct

import numpy as np
import pytest
import zulmetadata
from conftest import sample_entries

CURSOR_LOCATION = bytes.fromhex("2b7b6af27a1f11e283d00017f200be7f")
CURSOR_OPACITY = bytes.fromhex("2b7b6af37a1f11e283d00017f200be7f")
KEYBOARD_ACTION = bytes.fromhex("2b7b6af57a1f11e283d00017f200be7f")
TOPMOST_APP_NAME = bytes.fromhex("2b7b6a067a1f11e283d00017f200be7f")
OWN = bytes.fromhex("5d1c0a6e0b7f4c359e0d43a16b2f8817")


def stream(identifier, version, entry_size, *entries):
    return identifier + struct.pack("<iI", version, entry_size) + b"".join(entries)


@pytest.mark.parametrize("kind", zulmetadata.recorded_kinds())
def test_every_kind_reads_back_as_written(recording, kind):
    read = zulmetadata.Recording(recording)[kind]
    assert read.dtype == zulmetadata.dtype_of(kind)
    assert read.tolist() == sample_entries(kind).tolist()


def test_is_a_mapping_of_all_kinds(recording):
    opened = zulmetadata.Recording(recording)
    assert sorted(opened) == sorted(zulmetadata.recorded_kinds())
    assert len(opened) == 17 and "cursorImage" in opened and "caretPosition" not in opened
    assert {kind: len(entries) for kind, entries in opened.items()}["cursorImage"] == 2
    assert opened.get("caretPosition") is None
    with pytest.raises(KeyError, match="caretPosition"):
        opened["caretPosition"]


def test_a_recording_is_closed_at_the_end_of_a_with(recording):
    with zulmetadata.Recording(recording) as opened:
        cursor = opened["cursorLocation"]
        assert not opened.closed
    assert opened.closed and len(cursor) == 2 and "cursorLocation" in opened
    with pytest.raises(ValueError, match="closed"):
        opened["cursorLocation"]
    opened.close()
    with pytest.raises(RuntimeError), zulmetadata.Recording(recording) as failed:
        raise RuntimeError
    assert failed.closed


def test_a_pickled_recording_is_opened_again_by_its_path(recording, monkeypatch):
    monkeypatch.chdir(recording.parent)
    opened = zulmetadata.Recording(recording.name)
    pickled = pickle.dumps(opened)
    assert len(pickled) < 1000
    monkeypatch.chdir("/")
    again = pickle.loads(pickled)
    assert again.path == str(recording) and list(again) == list(opened)
    assert again["cursorLocation"].tolist() == sample_entries("cursorLocation").tolist()
    assert copy.copy(again)["cpuUsage"].tolist() == again["cpuUsage"].tolist()
    recording.unlink()
    with pytest.raises(FileNotFoundError):
        pickle.loads(pickled)


def test_numbers_are_decoded_as_the_bytes_say(tmp_path):
    file = tmp_path / "cursorLocation.dat"
    file.write_bytes(stream(CURSOR_LOCATION, 1, 16, struct.pack("<dii", 0.25, 640, -360), struct.pack("<dii", 1, 1, 2)))
    read = zulmetadata.Recording(file)["cursorLocation"]
    assert read["time"].tolist() == [0.25, 1] and read["x"].tolist() == [640, 1] and read["y"].tolist() == [-360, 2]


def test_numbers_stay_where_they_were_read_to(recording):
    opened = zulmetadata.Recording(recording)
    read = opened["cursorLocation"]
    expected = read.tolist()
    assert not read.flags.owndata and type(read.base).__name__ == "PyCapsule"
    assert read.nbytes == 16 * len(read) and read.flags.writeable
    column = read["x"]
    assert np.shares_memory(column, read)
    del opened, read
    gc.collect()
    assert column.tolist() == [entry[1] for entry in expected]


def test_a_torn_entry_is_left_out(tmp_path):
    file = tmp_path / "cursorLocation.dat"
    file.write_bytes(stream(CURSOR_LOCATION, 1, 16, struct.pack("<dii", 0.25, 640, -360), b"\0" * 15))
    assert zulmetadata.Recording(file)["cursorLocation"].tolist() == [(0.25, 640, -360)]


def test_a_stream_of_nothing_but_its_header_is_empty(tmp_path):
    for kind in zulmetadata.recorded_kinds():
        zulmetadata.write_stream(tmp_path / "stream.dat", kind, [])
        assert zulmetadata.Recording(tmp_path / "stream.dat")[kind].tolist() == []


def test_streams_that_cannot_be_decoded_are_listed_only(tmp_path):
    file = tmp_path / "own.dat"
    file.write_bytes(stream(OWN, 7, 12, struct.pack("<df", 1, 2)))
    opened = zulmetadata.Recording(file)
    assert list(opened) == [] and opened.container == "stream"
    (own,) = opened.streams
    assert (own.kind, own.version, own.offset, own.bytes) == ("5d1c0a6e-0b7f-4c35-9e0d-43a16b2f8817", 7, 0, 36)
    assert own.raw() == file.read_bytes() and not own.is_decodable
    with pytest.raises(ValueError, match="version"):
        own.read()


def test_what_cannot_be_opened_is_an_os_error(tmp_path):
    missing = tmp_path / "missing.mp4"
    notes = tmp_path / "notes.txt"
    notes.write_text("neither a movie nor a stream")
    for call in (zulmetadata.Recording, zulmetadata.verify):
        with pytest.raises(FileNotFoundError) as error:
            call(missing)
        assert error.value.filename == str(missing)
        with pytest.raises(OSError):
            call(tmp_path)
        with pytest.raises(ValueError, match="begins neither"):
            call(notes)


def test_errors_of_a_file_that_vanished_name_it(tmp_path, recording):
    opened = zulmetadata.Recording(recording)
    recording.unlink()
    for call in (lambda: opened["cursorLocation"], lambda: opened.streams[0].raw()):
        with pytest.raises(FileNotFoundError, match="No such file") as error:
            call()
        assert error.value.filename == str(recording)


def test_names_that_are_not_utf8(tmp_path):
    missing = str(tmp_path / os.fsdecode(b"no\xffpe.mp4"))
    for call in (zulmetadata.Recording, zulmetadata.verify):
        with pytest.raises(FileNotFoundError) as error:
            call(missing)
        assert error.value.filename == missing
    unknown = tmp_path / os.fsdecode(b"no\xffpe.txt")
    unknown.touch()
    with pytest.raises(ValueError, match=r"no\udcffpe.txt: begins neither"):
        zulmetadata.Recording(unknown)
    newer = tmp_path / os.fsdecode(b"\xff.dat")
    newer.write_bytes(stream(CURSOR_LOCATION, 9, 16))
    with pytest.raises(ValueError, match=r"\udcff.dat: the entries cannot be decoded"):
        zulmetadata.Recording(newer).streams[0].read()


def test_a_file_without_metadata_is_an_empty_recording(plain_movie):
    opened = zulmetadata.Recording(plain_movie)
    assert opened.container == "movie" and len(opened) == 0 and opened.creators == [] and opened.duration is None
    assert "no metadata" in repr(opened)


def test_texts_for_input_actions():
    assert zulmetadata.action_text(1 + 16 + 128) == "left down + shift + cmd"
    assert [zulmetadata.key_text(code) for code in (13, ord("w"), 0xE9, 0x444)] == ["returnKey", "w", "é", "ф"]
    assert [zulmetadata.key_text(code, 0x40000000) for code in (32, 119, 200)] == ["space", "f8", "key 200"]
    assert zulmetadata.modifiers_text(0x00120000) == "<Shift><Cmd>"


def test_texts_are_whole(tmp_path):
    file = tmp_path / "names.dat"
    text = b"a\0secret\xff"
    entry = struct.pack("<Id", 8 + len(text), 1.5) + text
    file.write_bytes(stream(TOPMOST_APP_NAME, 1, 0, entry))
    assert zulmetadata.Recording(file)["topmostAppName"].tolist() == [(1.5, "a\0secret\udcff")]


def test_numbers_keep_their_range(tmp_path):
    file = tmp_path / "keys.dat"
    file.write_bytes(stream(KEYBOARD_ACTION, 1, 16, struct.pack("<dII", 1, 2**32 - 1, 0xC0000000)))
    assert zulmetadata.Recording(file)["keyboardAction"].tolist() == [(1, 2**32 - 1, 0xC0000000)]
    file.write_bytes(stream(CURSOR_OPACITY, 1, 16, struct.pack("<dd", 1, 1e39)))
    assert zulmetadata.Recording(file)["cursorOpacity"]["opacity"].tolist() == [1e39]
