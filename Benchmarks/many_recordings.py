#!/usr/bin/env python3
"""Measures what is done with very many recordings, and prints rows for the table of scripts/bench.sh.

Usage: Benchmarks/many_recordings.py ZULM FOLDER [TASK] [--most N] [--document PAGE]

Makes up to N recordings (20,000 unless told otherwise) in FOLDER, where a later run finds them. Reads and exports the
first 100, 1,000, 10,000 and so on, with one worker and with two, and compares the results with each other before any
time is believed. --document writes time and memory for every number of recordings between the markers in PAGE.
Ends with 1 if a target is missed by more than a tenth. PYTHONPATH must name the package.
"""

import argparse
import math
import os
import pathlib
import re
import resource
import statistics
import subprocess
import sys
import tempfile
import time

import dask
import distributed
import zulmetadata

HERE = pathlib.Path(__file__).resolve().parent
KIND = "cursorLocation"
COUNTS = (100, 1000, 10000, 20000)
SIDE_BY_SIDE = 1000  # recordings that are read again and again beside raw reading
ROUNDS = 5
BLOCK = 128 << 10  # what cat reads at once
PARTITION = 100
MIB = 1 << 20
TOLERANCE = 1.1

MOST_GROWTH = 1.05
MOST_TIMES_RAW = 1 / 0.6
MOST_MORE_MEMORY = 32  # MiB, from 1,000 recordings to all of them

missed = False


def row(task, beside, figure, target, is_met, is_near=False):
    """A figure that is near its target is not met, and does not fail the run."""
    global missed
    missed = missed or not (is_met or is_near)
    print(f"| {task} | {beside} | {figure} | {target} | {'met' if is_met else '**missed**'} |", flush=True)


def recordings_in(folder, count):
    paths = sorted(str(path) for path in folder.glob("*/recording-*.mp4"))
    return paths[:count]


def places_of(paths):
    """Yields where the bytes of the kind are: path, offset, size."""
    for path in paths:
        try:
            streams = zulmetadata.Recording(path).streams
        except (OSError, ValueError):
            continue
        for stream in streams:
            if stream.kind == KIND:
                yield path, stream.offset, stream.bytes


def read_raw(places):
    """Reads these bytes as cat would, and does nothing with them."""
    total = 0
    for path, offset, size in places:
        file = os.open(path, os.O_RDONLY)
        end = offset + size
        while offset < end:
            part = len(os.pread(file, min(BLOCK, end - offset), offset))
            if part == 0:
                break
            offset += part
            total += part
        os.close(file)
    return total


def read_by_scan(paths):
    return sum(len(batch.time) for batch in zulmetadata.scan(paths, KIND, on_error="skip"))


def seconds_of(work, *arguments):
    """Returns processor time, so that other work on the machine does not matter: the files are in memory."""
    begin = time.process_time()
    work(*arguments)
    return time.process_time() - begin


def compare_with_raw(folder):
    paths = recordings_in(folder, SIDE_BY_SIDE)
    places = list(places_of(paths))
    ratios, raws, scans = [], [], []
    for _ in range(ROUNDS):
        raws.append(seconds_of(read_raw, places))
        scans.append(seconds_of(read_by_scan, paths))
        ratios.append(scans[-1] / raws[-1])
    size = sum(size for _, _, size in places)
    per = [statistics.median(times) / len(paths) * 1e9 for times in (scans, raws)]
    ratio = statistics.median(ratios)
    row(f"scan one kind of {len(paths):,} recordings, {size / len(places) / 1024:.0f} KiB each",
        "read(2) of the same bytes", f"{ratio:.2f}x ({per[0]:.1f} ns : {per[1]:.1f} ns)", f"{MOST_TIMES_RAW:.2f}x",
        ratio <= MOST_TIMES_RAW, ratio <= MOST_TIMES_RAW * TOLERANCE)


def peak_of_this_process():
    return resource.getrusage(resource.RUSAGE_SELF).ru_maxrss * 1024


def scan_on_cluster(paths, workers):
    """Returns seconds, the most memory of a worker, and the result."""
    with distributed.LocalCluster(n_workers=workers, threads_per_worker=1, host="127.0.0.1",
                                  dashboard_address=None) as cluster, distributed.Client(cluster) as client:
        client.wait_for_workers(workers)
        zulmetadata.scan(paths[:1], KIND, on_error="skip").to_dask().compute()
        begin = time.perf_counter()
        data, failures = zulmetadata.scan(paths, KIND, on_error="report").to_dask(partition_recordings=PARTITION)
        rows = [[dask.delayed(len)(part) for part in frame.to_delayed()] for frame in (data, failures)]
        result = tuple(map(sum, dask.compute(*rows)))
        seconds = time.perf_counter() - begin
        return seconds, max(client.run(peak_of_this_process).values()), result


def peak_until_end(process):
    """Returns the most memory of a process. What the system tells about one that has ended includes its parent's."""
    peak = 0
    while process.poll() is None:
        found = re.search(r"VmHWM:\s+(\d+)", pathlib.Path(f"/proc/{process.pid}/status").read_text(encoding="ascii"))
        peak = int(found[1]) * 1024 if found else peak
        time.sleep(0.01)
    return peak


def export(zulm, paths, workers):
    """Returns seconds, the most memory, and the result: recordings, and bytes of their tables."""
    with tempfile.TemporaryDirectory(dir=pathlib.Path(paths[0]).parents[1]) as folder:
        tables = pathlib.Path(folder) / "Tables"
        names = pathlib.Path(folder) / "names"
        names.write_text("".join(f"{path}\n" for path in paths))
        begin = time.perf_counter()
        process = subprocess.Popen([zulm, "--quiet", "export", "--files-from", names, "--jobs", str(workers), "-o",
                                    tables], stderr=subprocess.DEVNULL)
        memory = peak_until_end(process)
        seconds = time.perf_counter() - begin
        with open(tables / "manifest.ndjson", encoding="utf-8") as manifest:
            lines = sum(1 for _ in manifest)
        return seconds, memory, (lines - 1, sum(path.stat().st_size for path in tables.glob("kind=*/*")
                                                               if path.suffix == ".csv"))


def exponent(counts, seconds):
    """Returns the slope of the line through the logarithms, by least squares."""
    x, y = [math.log(count) for count in counts], [math.log(second) for second in seconds]
    middle = statistics.mean(x)
    return sum((a - middle) * b for a, b in zip(x, y)) / sum((a - middle) ** 2 for a in x)


def report_growth(name, counts, measured):
    """`measured` has seconds and memory for each number of recordings."""
    for workers, figures in measured.items():
        who = "one worker" if workers == 1 else "two workers"
        growth = exponent(counts, [seconds for seconds, _, _ in figures])
        row(f"growth of {name} {counts[0]:,} to {counts[-1]:,} recordings, {who}", "linear: exponent 1",
            f"{growth:.3g}", f"{MOST_GROWTH}", growth <= MOST_GROWTH)
        base = next(memory for count, (_, memory, _) in zip(counts, figures) if count >= SIDE_BY_SIDE or count == counts[-1])
        more = (figures[-1][1] - base) / MIB
        row(f"the same: memory of a worker from {SIDE_BY_SIDE:,} recordings to {counts[-1]:,}", "-",
            f"{more:.3g} MiB", f"{MOST_MORE_MEMORY} MiB", more <= MOST_MORE_MEMORY,
            more <= MOST_MORE_MEMORY * TOLERANCE)


def table_of(counts, sizes, scans, exports):
    yield ("| recordings | MB | scan, 1 worker | scan, 2 workers | memory of a worker | export, 1 job | export, 2 jobs "
           "| memory of export |")
    yield "|---:|---:|---:|---:|---:|---:|---:|---:|"
    for i, (count, size) in enumerate(zip(counts, sizes)):
        cells = [f"{figures[i][0]:.2f} s" for figures in (*scans.values(), *exports.values())]
        memory = [max(figures[i][1] for figures in measured.values()) / MIB for measured in (scans, exports)]
        yield (f"| {count:,} | {size / 1e6:,.1f} | {cells[0]} | {cells[1]} | {memory[0]:.0f} MiB | {cells[2]} | {cells[3]} "
               f"| {memory[1]:.0f} MiB |")


def measure(options, counts):
    paths = recordings_in(options.folder, counts[-1])
    sizes = [sum(os.path.getsize(path) for path in paths[:count]) for count in counts]
    read_raw((path, 0, os.path.getsize(path)) for path in paths)  # so that no measurement waits for the disk alone
    scans = {workers: [scan_on_cluster(paths[:count], workers) for count in counts] for workers in (1, 2)}
    exports = {jobs: [export(options.zulm, paths[:count], jobs) for count in counts] for jobs in (1, 2)}
    for measured in (scans, exports):
        if [result for *_, result in measured[1]] != [result for *_, result in measured[2]]:
            sys.exit("one worker and two have different results")
    report_growth("scanning", counts, scans)
    report_growth("exporting", counts, exports)
    if options.document:
        table = "\n".join(table_of(counts, sizes, scans, exports))
        subprocess.run([sys.executable, HERE.parent / "scripts" / "put_table.py", options.document], check=True,
                       input=table, text=True)


def main():
    parser = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    parser.add_argument("zulm", type=pathlib.Path)
    parser.add_argument("folder", type=pathlib.Path)
    parser.add_argument("task", nargs="?", default="")
    parser.add_argument("--most", type=int, default=COUNTS[-1])
    parser.add_argument("--document", type=pathlib.Path)
    options = parser.parse_args()
    if options.task not in "scan one kind of many recordings, growth of scanning and exporting":
        return
    counts = [count for count in COUNTS if count < options.most] + [options.most]
    subprocess.run([sys.executable, HERE / "make_recordings.py", options.folder, "--count", str(options.most)],
                   check=True, stdout=sys.stderr)
    compare_with_raw(options.folder)
    measure(options, counts)
    sys.exit(1 if missed else 0)


if __name__ == "__main__":
    main()
