// How fast the cursor was, by the rule of the library's cursorSpeedsOf. A worker that asked the library for it would take
// 300 MB more for eight hours: the speeds twice over, in a memory that never shrinks.

import type { Track } from './track';

/// A speed from each of its times on, in units of the screen to a second.
export interface Speed {
  times: Float64Array;
  values: Float32Array;
}

/// Returns the median of the distances between entries at different times, or 0 if there is none. It is that of the
/// library, which computes positions between two entries by it.
function usualDistance(times: Float64Array): number {
  const distances = new Float64Array(times.length);
  let count = 0;
  for (let i = 1; i < times.length; ++i) if (times[i]! > times[i - 1]!) distances[count++] = times[i]! - times[i - 1]!;
  if (count === 0) return 0;
  const all = distances.subarray(0, count);
  const half = count >> 1;
  const above = inOrder(all, half);
  return count % 2 === 1 ? above : (greatest(all, half) + above) / 2;
}

/// Returns the value that has this place in ascending order, and moves all lesser ones before it.
function inOrder(values: Float64Array, place: number): number {
  let [low, high] = [0, values.length - 1];
  while (low < high) {
    const pivot = values[low + Math.floor(Math.random() * (high - low + 1))]!; // no file can choose a slow one
    let [i, k] = [low, high];
    while (i <= k) {
      while (values[i]! < pivot) ++i;
      while (values[k]! > pivot) --k;
      if (i > k) break;
      const value = values[i]!;
      values[i++] = values[k]!;
      values[k--] = value;
    }
    if (k < place) low = i;
    if (i > place) high = k;
  }
  return values[place]!;
}

function greatest(values: Float64Array, count: number): number {
  let most = -Infinity;
  for (let i = 0; i < count; ++i) most = Math.max(most, values[i]!);
  return most;
}

/// Positions that stay the same are not recorded: after more than twice the usual distance the cursor has rested, and
/// has moved within the last usual distance.
export function speedOf(track: Track | undefined): Speed {
  const [x, y] = [track?.column('x'), track?.column('y')];
  if (!track || !x || !y) return { times: new Float64Array(), values: new Float32Array() };
  const { times, count } = track;
  const usual = usualDistance(times);
  const rests = (i: number) => times[i]! - times[i - 1]! > 2 * usual;
  let length = count > 0 ? 1 : 0;
  for (let i = 1; i < count; ++i) length += Number(rests(i)) + Number(times[i]! > times[i - 1]!);
  const starts = new Float64Array(length);
  const values = new Float32Array(length);
  let used = 0;
  const add = (time: number, value: number) => {
    starts[used] = time;
    values[used++] = Number.isFinite(value) ? value : 0;
  };
  for (let i = 1; i < count; ++i) {
    const [row, before] = [track.row(i), track.row(i - 1)];
    const passed = times[i]! - times[i - 1]!;
    const way = Math.hypot(Number(x[row]) - Number(x[before]), Number(y[row]) - Number(y[before]));
    const rested = rests(i);
    if (rested) add(times[i - 1]!, 0);
    if (passed > 0) add(rested ? times[i]! - usual : times[i - 1]!, way / (rested ? usual : passed));
  }
  if (count > 0) add(times[count - 1]!, 0);
  return { times: starts, values };
}
