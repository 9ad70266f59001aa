"""Retimes small random recordings by random edit lists, and compares every stream with a slow, obvious computation."""

import concurrent.futures

import check

QUICK, FULL = 50_000, 1_000_000
WORKERS = 2


def retime(context, part, count):
    return check.run([context.program("random_edits"), str(1 + part * count), str(count)], timeout=3600)


def run(context):
    result = check.Result()
    count = (FULL if context.full else QUICK) // WORKERS
    with concurrent.futures.ThreadPoolExecutor(WORKERS) as pool:
        for done in pool.map(lambda part: retime(context, part, count), range(WORKERS)):
            result.failures += done.stderr.decode(errors="replace").splitlines()
            result.crashed += done.returncode != 0
            if done.returncode == 0:
                result.cases += int(done.stdout)
    return result
