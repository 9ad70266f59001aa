"""Runs every fuzz target for a while, beginning with its corpus. ZULM_FUZZ_SECONDS says how long each of them runs."""

import concurrent.futures
import os
import re

import check

QUICK_SECONDS = 20
FULL_SECONDS = 120
WORKERS = 2
MOST_MEMORY = 2048  # megabytes; the sanitizers need most of it
QUICK_SEED = 1      # so that the short form finds the same twice; the long form looks elsewhere each time


def built(context):
    """The targets, built with the preset `fuzz` beside the release build."""
    folder = context.build / "fuzz"
    for arguments in (["cmake", "--preset", "fuzz", "-B", folder],
                      ["cmake", "--build", folder, "--target", "fuzzers", "-j", str(WORKERS)]):
        done = check.run(arguments, timeout=3600, cwd=context.source)
        if done.returncode != 0:
            raise RuntimeError(done.stdout.decode(errors="replace")[-3000:] + done.stderr.decode(errors="replace"))
    return sorted(folder.glob("Fuzz/fuzz_*"))


def fuzz(context, program, seconds):
    name = program.name.removeprefix("fuzz_")
    found = context.folder / name
    found.mkdir()
    corpus = context.source / "Fuzz/corpus" / name
    seed = 0 if context.full else QUICK_SEED  # 0 takes another one each time
    done = check.run([program, found, corpus, f"-max_total_time={seconds}", f"-seed={seed}",
                      f"-artifact_prefix={found}/", "-timeout=5",
                      f"-rss_limit_mb={MOST_MEMORY}", "-max_len=16384", "-close_fd_mask=3", "-print_final_stats=1",
                      "-verbosity=0"], timeout=seconds * 3 + 600, cwd=context.folder)
    log = done.stderr.decode(errors="replace")
    executed = re.search(r"stat::number_of_executed_units:\s+(\d+)", log)
    return name, done.returncode, int(executed[1]) if executed else 0, log, found


def reproducer(found):
    """The input that ended the target, small enough to be kept in a message."""
    for file in found.glob("*-*"):
        if file.name.startswith(("crash-", "leak-", "timeout-", "oom-")):
            return f"{file.name.split('-')[0]}: {file.read_bytes()[:300].hex()}"
    return "no input was kept"


def run(context):
    result = check.Result()
    seconds = int(os.environ.get("ZULM_FUZZ_SECONDS", FULL_SECONDS if context.full else QUICK_SECONDS))
    programs = built(context)
    with concurrent.futures.ThreadPoolExecutor(WORKERS) as pool:
        for name, code, executed, log, found in pool.map(lambda program: fuzz(context, program, seconds), programs):
            result.cases += executed
            result.crashed += code != 0
            if code != 0:
                result.failures.append(f"{name} ends with {code}, {reproducer(found)}\n{log[-2000:]}")
            elif executed == 0:
                result.failures.append(f"{name} ran nothing")
    result.notes.append(f"{len(programs)} targets, {seconds} s each")
    return result
