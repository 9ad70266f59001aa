// How fast the cursor was.

import type { Track } from './track';

/// A speed from each of its times on, in units of the screen to a second.
export interface Speed {
  times: Float64Array;
  values: Float32Array;
}

const sampled = 4096; // distances that the usual one is taken from

/// The distance between two entries that half of all distances do not exceed; 0 if there is none.
function usualDistance(times: Float64Array): number {
  const step = Math.max(1, Math.floor(times.length / sampled));
  const distances: number[] = [];
  for (let i = 1; i < times.length; i += step) distances.push(times[i]! - times[i - 1]!);
  return distances.sort((a, b) => a - b)[distances.length >> 1] ?? 0;
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
