// How fast the cursor was.

import type { Track } from './track';

/// In units of the screen to a second, on the way to each position from the one before.
export function speeds(track: Track | undefined): Float32Array {
  const result = new Float32Array(track?.count ?? 0);
  const [x, y] = [track?.column('x'), track?.column('y')];
  if (!track || !x || !y) return result;
  for (let i = 1; i < result.length; ++i) {
    const [row, before] = [track.row(i), track.row(i - 1)];
    const passed = track.times[i]! - track.times[i - 1]!;
    const way = Math.hypot(Number(x[row]) - Number(x[before]), Number(y[row]) - Number(y[before]));
    if (passed > 0 && Number.isFinite(way)) result[i] = way / passed;
  }
  return result;
}
