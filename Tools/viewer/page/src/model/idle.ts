// Stretches in which the person did nothing.

import type { Session } from './session';
import type { Track } from './track';

export interface Stretch {
  start: number;
  end: number;
}

const shortest = 3; // seconds

/// When the cursor was somewhere else than before.
function moves(track: Track | undefined): Float64Array {
  const [x, y] = [track?.column('x'), track?.column('y')];
  if (!track || !x || !y) return new Float64Array();
  const times = new Float64Array(track.count);
  let used = 0;
  for (let i = 0; i < track.count; ++i) {
    const row = track.row(i);
    const before = i > 0 ? track.row(i - 1) : row;
    if (i === 0 || x[row] !== x[before] || y[row] !== y[before]) times[used++] = track.times[i]!;
  }
  return times.subarray(0, used);
}

export function idleStretches(session: Pick<Session, 'track' | 'duration'>): Stretch[] {
  const kinds = ['cursorAction', 'keyboardAction', 'scrollAction'];
  const lists = kinds.map((kind) => session.track(kind)?.times ?? new Float64Array());
  if (!session.track('cursorLocation') && lists.every(({ length }) => length === 0)) return [];
  const moved = moves(session.track('cursorLocation'));
  const active = new Float64Array([...lists, moved].reduce((sum, { length }) => sum + length, 0));
  let used = 0;
  for (const list of [...lists, moved]) {
    active.set(list, used);
    used += list.length;
  }
  active.sort();
  const stretches: Stretch[] = [];
  let last = 0;
  const take = (start: number, end: number) => {
    if (end - start >= shortest) stretches.push({ start, end });
  };
  for (const time of active) {
    if (time > session.duration) break;
    take(last, time);
    last = Math.max(last, time);
  }
  take(last, session.duration);
  return stretches;
}

/// How long the person was idle in all.
export function idleTime(stretches: Stretch[]): number {
  return stretches.reduce((sum, { start, end }) => sum + end - start, 0);
}
