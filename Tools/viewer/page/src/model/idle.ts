// Stretches in which the person did nothing.

import type { Table } from '#decoder';
import { Track } from './track';

export interface Stretch {
  start: number;
  end: number;
}

/// How many seconds without activity are shown as idle.
export const shortestIdle = 3;

/// Takes the idle times as the library tells them.
export function idleIn(table: Table | undefined): Stretch[] {
  const track = table && new Track(table);
  return Array.from(track?.times ?? [], (start, i) => ({ start, end: track!.number('end', i) }));
}

/// How long the person was idle in all.
export function idleTime(stretches: Stretch[]): number {
  return stretches.reduce((sum, { start, end }) => sum + end - start, 0);
}
