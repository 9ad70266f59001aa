"""Many recordings at once: in batches, as frames of pandas, and as frames of Dask, also when a worker dies."""

import os
import pathlib
import pickle
import shutil
import subprocess
import sys
import threading
import time

import numpy as np
import pytest
import zulmetadata
from zulmetadata import _core

KIND = "cursorLocation"


@pytest.fixture
def recordings(tmp_path):
    """Ten recordings. The one called 0 has no entries, and n has n of them, at n seconds and later."""
    for number in range(10):
        entries = [(number + step / 4, number, step) for step in range(number)]
        zulmetadata.write_stream(tmp_path / f"{number}.dat", KIND, entries)
    return tmp_path


@pytest.fixture
def damaged(recordings):
    """Two that cannot be read, among the others in the order of the names: one of a version that nobody knows, and one
    that is not there."""
    known = (recordings / "3.dat").read_bytes()
    (recordings / "3a.dat").write_bytes(known[:16] + b"\x63" + known[17:])
    (recordings / "7a.dat").symlink_to(recordings / "nowhere")
    return recordings


def pattern(folder):
    return str(folder / "*.dat")


def expected_rows(folder):
    return [(str(folder / f"{number}.dat"), number + step / 4, number, step)
            for number in range(10) for step in range(number)]


def rows(frame):
    return list(frame.itertuples(index=False, name=None))


def test_yields_a_batch_for_each_recording(recordings):
    batches = list(zulmetadata.scan(pattern(recordings), KIND))
    assert [pathlib.Path(batch.recording).stem for batch in batches] == list("0123456789")
    assert batches[2].time.tolist() == [2, 2.25]
    assert {name: values.tolist() for name, values in batches[2].fields.items()} == {"x": [2, 2], "y": [0, 1]}


def test_takes_a_path_a_pattern_of_folders_and_an_iterable(recordings):
    (recordings / "inside").mkdir()
    zulmetadata.write_stream(recordings / "inside" / "a.dat", KIND, [(1, 2, 3)])
    everywhere = zulmetadata.scan(recordings / "**" / "*.dat", KIND)
    assert len(list(everywhere)) == len(list(everywhere)) == 11
    one = zulmetadata.scan(recordings / "5.dat", KIND, columns=["y"])
    assert [list(batch.fields) for batch in one] == [["y"]]
    some = zulmetadata.scan((recordings / name for name in ("7.dat", "2.dat")), KIND)
    assert [len(batch.time) for batch in some] == [7, 2]


def test_reads_the_recordings_of_an_iterator_again(recordings):
    scan = zulmetadata.scan(recordings.glob("[23].dat"), KIND)
    assert [len(list(scan)) for _ in range(2)] == [2, 2]


def test_the_path_of_a_file_that_is_there_is_no_pattern(recordings):
    (recordings / "4.dat").rename(recordings / "Talk [1].dat")
    assert [len(batch.time) for batch in zulmetadata.scan(recordings / "Talk [1].dat", KIND)] == [4]


def test_a_recording_without_the_kind_is_no_failure(recordings):
    titles = zulmetadata.scan(pattern(recordings), "topmostWindowTitle", on_error="report")
    assert list(titles) == [] and titles.failures == []


@pytest.mark.parametrize("wrong", [{"columns": ["z"]}, {"columns": ["x", "x"]}, {"columns": ["time"]},
                                   {"on_error": "ignore"}])
def test_what_cannot_be_asked_is_refused_at_once(recordings, wrong):
    with pytest.raises(ValueError):
        zulmetadata.scan(pattern(recordings), KIND, **wrong)
    with pytest.raises(KeyError):
        zulmetadata.scan(pattern(recordings), "nothing")
    with pytest.raises(TypeError, match="list of names"):
        zulmetadata.scan(pattern(recordings), KIND, columns="x")


def test_a_recording_that_a_pattern_finds_twice_is_read_once(recordings):
    found = list(zulmetadata.scan(recordings / "**" / "**" / "5.dat", KIND))
    assert [pathlib.Path(batch.recording) for batch in found] == [recordings / "5.dat"]


def test_failures_are_raised_or_passed_over_or_reported(damaged):
    with pytest.raises(ValueError, match="3a.dat"):
        list(zulmetadata.scan(pattern(damaged), KIND))
    assert len(list(zulmetadata.scan(pattern(damaged), KIND, on_error="skip"))) == 10
    reported = zulmetadata.scan(pattern(damaged), KIND, on_error="report")
    assert len(list(reported)) == 10
    assert [(pathlib.Path(failure.recording).name, failure.error) for failure in reported.failures] == [
        ("3a.dat", "ValueError"), ("7a.dat", "FileNotFoundError")]
    assert "3a.dat" in reported.failures[0].reason


def test_becomes_one_frame_of_pandas(damaged):
    pytest.importorskip("pandas")
    frame, failures = zulmetadata.scan(pattern(damaged), KIND, on_error="report").to_pandas()
    assert list(frame.columns) == ["recording", "time", "x", "y"]
    assert rows(frame) == expected_rows(damaged)
    assert failures["recording"].tolist() == [str(damaged / "3a.dat"), str(damaged / "7a.dat")]
    assert failures["error"].tolist() == ["ValueError", "FileNotFoundError"]
    nothing = zulmetadata.scan([], KIND).to_pandas()
    assert nothing.dtypes.tolist() == frame.dtypes.tolist() and len(nothing) == 0


def test_texts_become_objects(tmp_path):
    pytest.importorskip("pandas")
    zulmetadata.write_stream(tmp_path / "a.dat", "topmostAppName", [(0.5, "Mail"), (1, "Größe")])
    frame = zulmetadata.scan(tmp_path / "a.dat", "topmostAppName").to_pandas()
    assert frame["name"].tolist() == ["Mail", "Größe"]


@pytest.mark.parametrize("scheduler, kind", [("synchronous", KIND), ("threads", "topmostAppName"), ("processes", KIND)])
def test_a_dask_frame_is_what_its_meta_says(recordings, scheduler, kind):
    pytest.importorskip("dask.dataframe")
    zulmetadata.write_stream(recordings / "name.dat", "topmostAppName", [(0.5, "Mail")])
    scan = zulmetadata.scan(pattern(recordings), kind)
    frame = scan.to_dask(partition_recordings=4)
    assert frame.npartitions == 3 and not frame.known_divisions
    computed = frame.compute(scheduler=scheduler)
    assert computed.dtypes.tolist() == frame.dtypes.tolist() == frame._meta.dtypes.tolist()
    assert rows(computed) == rows(scan.to_pandas())
    for part in range(frame.npartitions):
        assert frame.get_partition(part).compute(scheduler="synchronous").dtypes.tolist() == frame.dtypes.tolist()


def test_partitions_are_groups_by_bytes(recordings):
    pytest.importorskip("dask.dataframe")
    scan = zulmetadata.scan(pattern(recordings), KIND)
    sizes = [os.path.getsize(recordings / f"{number}.dat") for number in range(10)]
    assert scan.to_dask(partition_bytes=sum(sizes)).npartitions == 1
    assert scan.to_dask(partition_bytes=sum(sizes) - 1).npartitions == 2
    assert scan.to_dask(partition_bytes=1).npartitions == 10
    assert zulmetadata.scan([], KIND).to_dask().compute(scheduler="synchronous").columns.tolist() == [
        "recording", "time", "x", "y"]


def test_only_the_columns_that_are_used_are_read(recordings, monkeypatch):
    pytest.importorskip("dask.dataframe")
    frame = zulmetadata.scan(pattern(recordings), KIND).to_dask()
    read = []
    whole = zulmetadata._scan.Reader.frame
    monkeypatch.setattr(zulmetadata._scan.Reader, "frame",
                        lambda reader, *arguments: read.append(reader.columns) or whole(reader, *arguments))
    total = sum(step for number in range(10) for step in range(number))
    assert frame["y"].sum().compute(scheduler="synchronous") == total
    assert read == [["y"]]


def test_a_dask_frame_comes_with_one_of_what_failed(damaged):
    dask = pytest.importorskip("dask")
    pytest.importorskip("dask.dataframe")
    data, failures = zulmetadata.scan(pattern(damaged), KIND, on_error="report").to_dask(partition_recordings=5)
    frame, failed = dask.compute(data, failures, scheduler="threads")
    assert rows(frame) == expected_rows(damaged)
    assert failed["recording"].tolist() == [str(damaged / "3a.dat"), str(damaged / "7a.dat")]
    with pytest.raises(ValueError):
        zulmetadata.scan(pattern(damaged), KIND).to_dask().compute(scheduler="synchronous")


def test_a_worker_gets_the_paths_of_its_partition_only(recordings):
    pytest.importorskip("dask.dataframe")
    frame = zulmetadata.scan(pattern(recordings), KIND).to_dask(partition_recordings=1)
    graph = dict(frame.__dask_graph__())
    for key in frame.__dask_keys__():
        sent = pickle.dumps(graph[key])
        assert sum(str(recordings / f"{number}.dat").encode() in sent for number in range(10)) == 1


def slowly(frame, folder):
    """Leaves a sign in the folder, so that the test knows when work has begun, and takes its time."""
    (folder / f"{os.getpid()}-{time.monotonic_ns()}").touch()
    time.sleep(0.2)
    return frame


def wait_for(state, seconds=60):
    end = time.monotonic() + seconds
    while not state():
        assert time.monotonic() < end
        time.sleep(0.02)


@pytest.fixture
def cluster():
    """A client of a scheduler on the loopback address, and two worker processes without anything that restarts them."""
    distributed = pytest.importorskip("distributed")
    folders = [str(pathlib.Path(zulmetadata.__file__).parents[1]), str(pathlib.Path(__file__).parent)]
    environment = os.environ | {"PYTHONPATH": os.pathsep.join(folders)}
    with distributed.LocalCluster(n_workers=0, processes=False, host="127.0.0.1", protocol="tcp://",
                                  dashboard_address=None) as local, distributed.Client(local) as client:
        command = [sys.executable, "-m", "distributed.cli.dask_worker", local.scheduler_address, "--no-nanny",
                   "--nthreads", "1", "--host", "127.0.0.1", "--no-dashboard"]
        workers = [subprocess.Popen(command, env=environment, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
                   for _ in range(2)]
        try:
            client.wait_for_workers(2, timeout=120)
            yield client, workers
        finally:
            for worker in workers:
                worker.kill()
                worker.wait()


def test_a_cluster_that_loses_a_worker_computes_the_same(damaged, tmp_path, cluster):
    client, workers = cluster
    signs = tmp_path / "signs"
    signs.mkdir()
    data, failures = zulmetadata.scan(pattern(damaged), KIND, on_error="report").to_dask(partition_recordings=1)
    futures = client.compute([data.map_partitions(slowly, signs, meta=data._meta), failures])

    def at_work():
        return {int(sign.name.split("-")[0]) for sign in signs.iterdir()}
    wait_for(lambda: at_work() == {worker.pid for worker in workers})
    assert not any(future.done() for future in futures)
    workers[0].kill()
    frame, failed = client.gather(futures)
    assert rows(frame) == expected_rows(damaged)
    assert failed["error"].tolist() == ["ValueError", "FileNotFoundError"]
    assert len(client.scheduler_info()["workers"]) == 1


@pytest.mark.parametrize("read", [zulmetadata.Recording, zulmetadata.verify,
                                  lambda path: list(zulmetadata.scan(path, KIND))])
def test_reading_lets_other_threads_run(recordings, read):
    """Here the interpreter takes its lock from no thread: another one runs only if the reading one leaves the lock."""
    path = str(recordings / "9.dat")
    begin = threading.Lock()
    begin.acquire()
    ran = []
    other = threading.Thread(target=lambda: begin.acquire() and ran.append(True))
    other.start()
    interval = sys.getswitchinterval()
    sys.setswitchinterval(1e6)
    try:
        begin.release()
        for _ in range(20000):
            read(path)
            if ran:
                break
        assert ran
    finally:
        sys.setswitchinterval(interval)
        other.join()


def test_names_that_are_not_utf8_stay_apart(recordings):
    names = [os.fsdecode(os.fsencode(recordings) + name) for name in (b"/na\xfe.dat", b"/na\xff.dat")]
    for name in names:
        shutil.copy(recordings / "2.dat", name)
    scan = zulmetadata.scan(names, KIND)
    assert [batch.recording for batch in scan] == names
    shown = [str(recordings / name) for name in (r"na\udcfe.dat", r"na\udcff.dat")]
    assert scan.to_pandas()["recording"].unique().tolist() == shown
    frame = scan.to_dask(partition_recordings=1)
    assert frame.compute(scheduler="processes")["recording"].unique().tolist() == shown


def test_fields_that_are_renamed_are_those_of_one_array(recordings):
    first = _core.read_kind(str(recordings / "4.dat"), KIND)
    first.dtype.names = ("when", "column", "row")
    assert _core.read_kind(str(recordings / "4.dat"), KIND).dtype.names == ("time", "x", "y")


def test_arrays_of_batches_stay(recordings):
    batch = list(zulmetadata.scan(recordings / "4.dat", KIND))[0]
    (recordings / "4.dat").unlink()
    assert np.array_equal(batch.fields["y"], [0, 1, 2, 3])
