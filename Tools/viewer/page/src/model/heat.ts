// Where the cursor was, and for how long.

import type { Placement } from './geometry';
import { countBefore, countUntil } from './search';
import type { Track } from './track';
import { breath } from '../ui/breath';

export const heatWidth = 128;
export const heatHeight = 72;

const piece = 100_000; // entries at a time
const longestRest = 5; // seconds that one rest counts at most, so that it does not outshine everything else

/// Seconds that the cursor spent in each cell of a grid over the recorded region, from 0 to 1 of the warmest, softened.
/// The page goes on meanwhile. The result means nothing if it has become obsolete.
export async function heatOf(
  track: Track | undefined,
  placement: Placement,
  from: number,
  to: number,
  isObsolete: () => boolean = () => false,
): Promise<Float32Array> {
  const cells = new Float32Array(heatWidth * heatHeight);
  const [x, y] = [track?.column('x'), track?.column('y')];
  if (!track || !x || !y) return cells;
  const { region } = placement;
  const end = countBefore(track.times, to);
  for (let i = Math.max(0, countUntil(track.times, from) - 1); i < end; ++i) {
    if (i % piece === piece - 1) {
      await breath();
      if (isObsolete()) return cells;
    }
    const row = track.row(i);
    const column = Math.floor(((Number(x[row]) - region.x) / region.width) * heatWidth);
    const line = Math.floor(((Number(y[row]) - region.y) / region.height) * heatHeight);
    if (column < 0 || column >= heatWidth || line < 0 || line >= heatHeight) continue;
    const stay = Math.min(track.endOf(i, to), to) - Math.max(track.times[i]!, from);
    cells[line * heatWidth + column]! += Math.max(0, Math.min(stay, longestRest));
  }
  return normalised(softened(cells));
}

const passes = 4; // from which on nobody sees the corners of the box any more

/// Averages over a small box in each direction, several times, so that every spot becomes round.
function softened(cells: Float32Array): Float32Array {
  for (let i = 0; i < passes; ++i) cells = boxed(boxed(cells, 1, heatWidth), heatWidth, heatHeight);
  return cells;
}

const radius = 2;

/// Cells outside the grid count as empty.
function boxed(cells: Float32Array, step: number, length: number): Float32Array {
  const result = new Float32Array(cells.length);
  for (let i = 0; i < cells.length; ++i) {
    const place = Math.floor(i / step) % length;
    let sum = 0;
    for (let k = -radius; k <= radius; ++k) if (place + k >= 0 && place + k < length) sum += cells[i + k * step]!;
    result[i] = sum / (2 * radius + 1);
  }
  return result;
}

function normalised(cells: Float32Array): Float32Array {
  const warmest = cells.reduce((most, value) => Math.max(most, value), 0);
  return warmest > 0 ? cells.map((value) => Math.sqrt(value / warmest)) : cells;
}
