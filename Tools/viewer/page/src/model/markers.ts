// Where one jumps to: clicks, other windows, other slides.

import type { Session } from './session';
import { countBefore, countUntil } from './search';

const together = 0.05; // seconds: what changes at once is one marker

export function markersOf(session: Pick<Session, 'track' | 'clicks'>): Float64Array {
  const all = session.clicks.map(({ start }) => start);
  for (const kind of ['topmostAppName', 'topmostWindowTitle', 'slideTitles'])
    for (const time of session.track(kind)?.times ?? []) all.push(time);
  const times = Float64Array.from(all).sort();
  const markers: number[] = [];
  for (const time of times)
    if (markers.length === 0 || time - markers[markers.length - 1]! > together) markers.push(time);
  return Float64Array.from(markers);
}

const near = 0.001; // seconds: a movie's own times are not exact

export function markerBefore(markers: Float64Array, time: number): number | undefined {
  return markers[countBefore(markers, time - near) - 1];
}

export function markerAfter(markers: Float64Array, time: number): number | undefined {
  return markers[countUntil(markers, time + near)];
}
