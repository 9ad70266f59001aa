// Searching sorted times.

/// How many of the first numbers fit, where those that fit come before all others.
export function partition(count: number, fits: (index: number) => boolean): number {
  let low = 0;
  let high = count;
  while (low < high) {
    const middle = (low + high) >>> 1;
    if (fits(middle)) low = middle + 1;
    else high = middle;
  }
  return low;
}

/// How many of the times lie before `time`.
export function countBefore(times: ArrayLike<number>, time: number): number {
  return partition(times.length, (i) => times[i]! < time);
}

/// How many of the times are `time` or lie before it.
export function countUntil(times: ArrayLike<number>, time: number): number {
  return partition(times.length, (i) => times[i]! <= time);
}

/// The last entry that had happened at `time`, or -1.
export function lastAt(times: ArrayLike<number>, time: number): number {
  return countUntil(times, time) - 1;
}
