// Stretches in which the person did nothing.

import type { Table } from '#decoder';
import { Track } from './track';

export interface Stretch {
  start: number;
  end: number;
}

/// How many seconds without activity are shown as idle.
export const shortestIdle = 3;

/// Takes the idle times as the library tells them, within the axis: a damaged time is not idleness.
export function idleIn(table: Table | undefined, duration: number): Stretch[] {
  const track = table && new Track(table);
  const stretches = Array.from(track?.times ?? [], (start, i) => ({
    start: Math.max(0, start),
    end: Math.min(track!.number('end', i), duration),
  }));
  return stretches.filter(({ start, end }) => end - start >= shortestIdle);
}

/// How long the person was idle in all.
export function idleTime(stretches: Stretch[]): number {
  return stretches.reduce((sum, { start, end }) => sum + end - start, 0);
}
