import os

import pytest
import zulmetadata
from conftest import DATA, PLAIN_MOVIE, sample_entries


def test_attach_says_what_it_did(tmp_path, plain_movie):
    file = tmp_path / "cursorLocation.dat"
    zulmetadata.write_stream(file, "cursorLocation", [(0, 1, 2), (1, 3, 4)])
    file.write_bytes(file.read_bytes() + b"torn")
    attached = zulmetadata.attach(plain_movie, [file])
    (stream,) = attached.streams
    assert (stream.kind, stream.entries, stream.bytes, stream.bytes_cut) == ("cursorLocation", 2, 56, 4)
    assert attached.repair.state == "whole"
    assert plain_movie.read_bytes().startswith(PLAIN_MOVIE)


def test_names_that_are_not_utf8(tmp_path, plain_movie):
    with pytest.raises(zulmetadata.SaveError, match="cannot be opened") as error:
        zulmetadata.attach(os.fsdecode(b"no\xffpe.mp4"), [b"\xff.dat"])
    assert error.value.file == "\udcff.dat"
    file = tmp_path / os.fsdecode(b"\xff.dat")
    zulmetadata.write_stream(file, "cpuUsage", [(0, 0.5)])
    with pytest.raises(zulmetadata.SaveError) as error:
        zulmetadata.attach(os.fsdecode(b"no\xffpe.mp4"), [file])
    assert error.value.file == "no\udcffpe.mp4"
    assert zulmetadata.attach(plain_movie, [file]).streams[0].name == str(file)


def test_save_errors_of_others_have_the_attributes_too():
    error = zulmetadata.SaveError("mine")
    assert (str(error), error.file, error.sentence, error.reason) == ("mine", "", "", "failed")


def test_streams_of_other_recordings(tmp_path, recording):
    copy = tmp_path / "Copy.mp4"
    copy.write_bytes(PLAIN_MOVIE)
    opened = zulmetadata.Recording(recording)
    zulmetadata.attach(copy, [opened])
    assert {kind: entries.tolist() for kind, entries in zulmetadata.Recording(copy).items()} == {
        kind: entries.tolist() for kind, entries in opened.items()}
    single = tmp_path / "Single.mp4"
    single.write_bytes(PLAIN_MOVIE)
    zulmetadata.attach(single, opened.streams[:1])
    assert list(zulmetadata.Recording(single)) == [opened.streams[0].kind]


def test_a_single_source_needs_no_list(tmp_path, recording):
    file = tmp_path / "cpuUsage.dat"
    opened = zulmetadata.Recording(recording)
    for number, (source, kinds) in enumerate([(str(file), ["cpuUsage"]), (file, ["cpuUsage"]),
                                              (opened.streams[2], [opened.streams[2].kind]), (opened, list(opened))]):
        movie = tmp_path / f"{number}.mp4"
        movie.write_bytes(PLAIN_MOVIE)
        zulmetadata.attach(movie, source)
        assert list(zulmetadata.Recording(movie)) == kinds


def test_a_kind_is_replaced_only_when_asked(tmp_path, recording):
    before = recording.read_bytes()
    file = tmp_path / "new.dat"
    zulmetadata.write_stream(file, "cpuUsage", [(9, 0.25)])
    with pytest.raises(zulmetadata.SaveError) as error:
        zulmetadata.attach(recording, [file])
    assert error.value.reason == "kind-exists" and error.value.file == str(recording)
    assert error.value.sentence in str(error.value)
    assert recording.read_bytes() == before
    zulmetadata.attach(recording, [file], replace=True)
    assert zulmetadata.Recording(recording)["cpuUsage"].tolist() == [(9, 0.25)]


def test_stamp(plain_movie):
    stamped = zulmetadata.stamp(plain_movie, "Recorder", "4.2")
    (creator,) = zulmetadata.Recording(plain_movie).creators
    assert (creator.name, creator.version) == (stamped.name, stamped.version) == ("Mac", "4.2")
    assert creator.platform_version == stamped.platform_version != ""


def test_creators_that_are_no_texts(plain_movie):
    zulmetadata.stamp(plain_movie, "Recorder", "4.2")
    plain_movie.write_bytes(plain_movie.read_bytes().replace(b"Mac\0", b"M\xffc\0").replace(b"4.2\0", b"\xfe.2\0"))
    (creator,) = zulmetadata.Recording(plain_movie).creators
    assert (creator.name, creator.version) == ("M\udcffc", "\udcfe.2")
    assert zulmetadata.stamp(plain_movie, "Recorder", creator.version).version == creator.version
    assert b"\xfe.2\0" in plain_movie.read_bytes()[-60:]
    with pytest.raises(ValueError, match="zero character"):
        zulmetadata.stamp(plain_movie, "Recorder", "4\0002")


def test_repair(tmp_path):
    movie = tmp_path / "open.mp4"
    movie.write_bytes(PLAIN_MOVIE + b"\0\0\0\0mdatpicture")
    plan = zulmetadata.repair(movie, dry_run=True)
    (change,) = plan.changes
    assert (plan.state, change.offset, change.before, change.after) == ("repairable", 16, b"\0\0\0\0", b"\0\0\0\x0f")
    assert movie.read_bytes().endswith(b"\0\0\0\0mdatpicture")
    assert zulmetadata.repair(movie).state == "repairable"
    assert movie.read_bytes().endswith(b"\0\0\0\x0fmdatpicture")
    assert zulmetadata.repair(movie, dry_run=True).state == "whole"


def test_verify(recording):
    report = zulmetadata.verify(recording)
    assert report.has_metadata and report.bytes == recording.stat().st_size
    assert {stream.kind: stream.entries for stream in report.streams} == {
        kind: len(sample_entries(kind)) for kind in zulmetadata.recorded_kinds()}
    codes = {finding.code for finding in report.findings}
    assert codes == {"undecodable-image", "not-utf8", "cursor-without-image"}  # which the sample has on purpose


def test_what_is_printed_tells_something(tmp_path, plain_movie):
    file = tmp_path / "cursorLocation.dat"
    writer = zulmetadata.StreamWriter(file, "cursorLocation")
    writer.append(0, 1, 2)
    assert repr(writer) == f"<StreamWriter cursorLocation '{file}' entries_written=1>"
    writer.close()
    assert repr(writer) == f"<StreamWriter cursorLocation '{file}' entries_written=1: closed>"
    attached = zulmetadata.attach(plain_movie, file)
    assert repr(attached) == "<Attached streams=1 repair=whole>"
    assert repr(attached.streams) == "[<AttachedStream cursorLocation offset=48 entries=1 bytes_cut=0>]"
    stamped = zulmetadata.stamp(plain_movie, "Recorder", "4.2")
    assert repr(stamped) == f"<Creator 'Mac' version='4.2' platform_version='{stamped.platform_version}'>"
    (stream,) = zulmetadata.Recording(plain_movie).streams
    assert repr(stream) == "<RecordedStream cursorLocation version=1 offset=48 bytes=40>"
    size = plain_movie.stat().st_size
    report = zulmetadata.verify(plain_movie)
    assert repr(report) == f"<Report bytes={size} streams=1 findings=0>"
    assert repr(report.streams) == "[<StreamReport cursorLocation offset=48 entries=1>]"

    file.write_bytes(file.read_bytes() + b"torn")
    report = zulmetadata.verify(file)
    (finding,) = report.findings
    assert repr(report) == "<Report bytes=44 streams=1 findings=1: damaged>"
    assert repr(finding) == f"<Finding torn-entry cursorLocation offset=40: {finding.sentence}>"

    plain_movie.write_bytes(PLAIN_MOVIE + b"\0\0\0\0mdatpicture")
    plan = zulmetadata.repair(plain_movie, dry_run=True)
    assert repr(plan) == "<Repair repairable changes=1>"
    assert repr(plan.changes) == f"[<RepairChange offset=16 bytes=4: {plan.changes[0].reason}>]"


def test_a_source_that_is_no_stream_is_attached_only_if_asked_for(plain_movie, tmp_path):
    wrong = tmp_path / "wrong.dat"
    wrong.write_bytes(PLAIN_MOVIE + bytes(100))
    before = plain_movie.read_bytes()
    with pytest.raises(zulmetadata.SaveError, match="is no stream of a known kind") as caught:
        zulmetadata.attach(plain_movie, wrong)
    assert caught.value.reason == "doubtful"
    assert plain_movie.read_bytes() == before
    assert len(zulmetadata.attach(plain_movie, wrong, unchecked=True).streams) == 1


INVALID = dict(line.split("\t", 1) for line in (DATA / "invalid" / "expected.tsv").read_text().splitlines())


@pytest.mark.parametrize("name", INVALID)
def test_damaged_files_are_judged_and_read_without_harm(name):
    file = DATA / "invalid" / name
    findings = {f"{finding.code}@{finding.offset}" for finding in zulmetadata.verify(file).findings}
    assert findings == set(INVALID[name].split())
    for entries in zulmetadata.Recording(file).values():
        entries.tolist()


def test_entries_of_another_size_than_their_kind_has_are_not_decoded():
    recording = zulmetadata.Recording(DATA / "invalid" / "header-scale-as-double.dat")
    (stream,) = recording.streams
    assert not stream.is_decodable
    assert list(recording) == []
    with pytest.raises(ValueError, match="the entries cannot be decoded"):
        stream.read()
