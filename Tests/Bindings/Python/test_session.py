"""What holds at a time, what follows from a recording, and retiming: the same numbers as in C++."""

import json
import os
import pathlib
import re
import subprocess
import threading

import numpy as np
import pytest
import zulmetadata

EDITS = {
    "schema": "zulm.edits",
    "schema_version": 1,
    "pieces": [{"start": "1", "end": "19/3", "speed": "3/2"}, {"at": "7", "duration": "1"}],
}
needs_programs = pytest.mark.skipif("ZULM_SESSION_NUMBERS" not in os.environ, reason="the tool is not built")


def plain(value):
    if isinstance(value, bytes):
        return list(value)
    if isinstance(value, np.generic):
        value = value.item()
    return None if isinstance(value, float) and np.isnan(value) else value


def plain_table(records):
    return {name: [plain(value) for value in records[name]] for name in records.dtype.names}


@pytest.fixture(scope="module")
def session(tmp_path_factory):
    folder = tmp_path_factory.mktemp("session")
    subprocess.run([os.environ["ZULM_PATH"], "demo", folder], check=True, stdout=subprocess.DEVNULL)
    return zulmetadata.Recording(folder / "Recording.mp4")


@pytest.fixture(scope="module")
def expected(session):
    program = [os.environ["ZULM_SESSION_NUMBERS"], session.path, json.dumps(EDITS)]
    return json.loads(subprocess.run(program, check=True, capture_output=True).stdout)


@needs_programs
def test_knows_what_holds_at_any_time(session, expected):
    assert plain_table(session.at(expected["times"])) == expected["states"]
    assert plain_table(session.at(expected["times"], interpolate="none")) == expected["held"]


@needs_programs
def test_knows_what_follows_from_the_recording(session, expected):
    for name, table in expected["insights"].items():
        assert plain_table(session.insights(name)) == table, name
    assert expected["insights"]["clicks"]["time"]
    assert plain_table(session.insights("idle", least=3)) == expected["least_3"]


@needs_programs
def test_the_guide_lists_the_fields_of_insights(session):
    guide = (pathlib.Path(__file__).resolve().parents[3] / "Docs" / "insights.md").read_text(encoding="utf-8")
    lines = guide.split("## Python and JavaScript")[1].splitlines()
    rows = [line.split("|") for line in lines if line.startswith("| `")]
    listed = {row[1].strip(" `"): ["time", *re.findall(r"`(\w+)`", row[3])] for row in rows}
    assert listed == {name: list(session.insights(name).dtype.names) for name in zulmetadata._core.insight_names}


@needs_programs
def test_retimes_every_stream(session, expected):
    records = session.retime(EDITS)
    names = records.dtype.names
    assert plain_table(records) == {name: expected["retimed"][name] for name in names}
    assert session.retime(json.dumps(EDITS)).tolist() == records.tolist()


@needs_programs
def test_retimed_streams_can_be_attached(session, tmp_path):
    movie = tmp_path / "Edited.mp4"
    movie.write_bytes(b"\0\0\0\x10ftypmp42\0\0\0\0")
    files = []
    for record in session.retime(EDITS):
        files.append(tmp_path / f"{record['kind']}.dat")
        files[-1].write_bytes(record["bytes"])
    zulmetadata.attach(movie, files)
    assert list(zulmetadata.Recording(movie)) == list(session)


@needs_programs
def test_threads_share_a_recording(session, expected):
    failures = []

    def ask():
        if plain_table(session.at(expected["times"])) != expected["states"]:
            failures.append("other states")

    threads = [threading.Thread(target=ask) for _ in range(4)]
    for thread in threads:
        thread.start()
    for thread in threads:
        thread.join()
    assert not failures


def test_a_track_is_in_the_order_of_its_times(tmp_path):
    file = tmp_path / "a.dat"
    zulmetadata.write_stream(file, "cursorLocation", [(2, 5, 6), (1, 3, 4), (1, 7, 8)])
    with zulmetadata.Recording(file) as recording:
        assert recording.track("cursorLocation").tolist() == [(1, 3, 4), (1, 7, 8), (2, 5, 6)]
        assert recording.at(1.5)["x"].tolist() == [6]
        assert recording.at(1.5, interpolate="none")["x"].tolist() == [7]
        assert np.isnan(recording.at([0.5])["x"]).all()
        assert recording.at([]).size == 0


def test_a_text_that_holds_is_one_object(tmp_path):
    file = tmp_path / "a.dat"
    zulmetadata.write_stream(file, "topmostAppName", [(0, "Editor"), (3, "Browser")])
    first, second, third = zulmetadata.Recording(file).at([1, 2, 3])["application"]
    assert first == "Editor" and first is second and third == "Browser"


def test_what_cannot_be_asked_is_refused(tmp_path):
    file = tmp_path / "a.dat"
    zulmetadata.write_stream(file, "cursorLocation", [(2, 5, 6)])
    recording = zulmetadata.Recording(file)
    with pytest.raises(ValueError, match="there are no insights moods"):
        recording.insights("moods")
    with pytest.raises(ValueError, match="idle has no parameter most"):
        recording.insights("idle", most=3)
    with pytest.raises(ValueError, match="interpolate is"):
        recording.at([0], interpolate="cubic")
    with pytest.raises(ValueError):
        recording.retime("{}")
    recording.close()
    with pytest.raises(ValueError, match="is closed"):
        recording.at([0])


@needs_programs
def test_reads_edit_lists_of_other_programs(session, tmp_path):
    cuts = tmp_path / "cuts.csv"
    cuts.write_text("1,3\n5,\n")
    pieces = [{"start": 1, "end": 3}, {"start": 5, "end": 20}]
    expected = session.retime(EDITS | {"pieces": pieces}).tolist()
    assert session.retime(cuts).tolist() == expected
    concat = "ffconcat version 1.0\nfile a.mp4\ninpoint 1\noutpoint 3\nfile a.mp4\ninpoint 5\noutpoint 20\n"
    assert session.retime(concat).tolist() == expected
    with pytest.raises(FileNotFoundError):
        session.retime(tmp_path / "none.csv")


@needs_programs
def test_takes_the_rate_of_lists_that_count_frames(session, tmp_path):
    cuts = tmp_path / "cuts.edl"
    cuts.write_text("001  AX V C 00:00:01:00 00:00:03:00 00:00:00:00 00:00:02:00\n")
    expected = session.retime(EDITS | {"pieces": [{"start": 1, "end": 3}]}).tolist()
    assert session.retime(cuts, frame_rate=25).tolist() == session.retime(cuts, frame_rate="25").tolist() == expected
    with pytest.raises(ValueError, match="cuts.edl: .* name its frame rate"):
        session.retime(cuts)
    with pytest.raises(ValueError, match="-1 is no frame rate"):
        session.retime(cuts, frame_rate=-1)


def test_a_file_that_is_gone_is_an_error_of_the_system(tmp_path):
    file = tmp_path / "a.dat"
    zulmetadata.write_stream(file, "cursorLocation", [(2, 5, 6)])
    recording = zulmetadata.Recording(file)
    file.unlink()
    with pytest.raises(FileNotFoundError) as caught:
        recording.at([0])
    assert caught.value.filename == str(file)


def test_warns_of_what_is_missing(tmp_path):
    file = tmp_path / "a.dat"
    zulmetadata.write_stream(file, "topmostAppName", [(1, "Editor"), (2, "Browser")])
    file.write_bytes(file.read_bytes()[:-1])
    with zulmetadata.Recording(file) as recording:
        with pytest.warns(UserWarning, match="a.dat: topmostAppName") as caught:
            assert recording.retime(EDITS)["moved"].tolist() == [1]
        assert caught[0].filename == __file__


def test_a_path_without_positions_has_its_fields(tmp_path):
    file = tmp_path / "a.dat"
    zulmetadata.write_stream(file, "topmostAppName", [(1, "Editor")])
    assert zulmetadata.Recording(file).insights("cursor_path").dtype.names == ("time", "x", "y")


def test_records_become_a_data_frame(tmp_path):
    pytest.importorskip("pandas")
    file = tmp_path / "a.dat"
    zulmetadata.write_stream(file, "cursorLocation", [(1, 3, 4), (2, 5, 6)])
    frame = zulmetadata.to_pandas(zulmetadata.Recording(file)["cursorLocation"])
    assert frame.index.tolist() == [1, 2] and frame["x"].tolist() == [3, 5]
