// What takes long to work out from a long recording. The decoder's worker does it, so that the page goes on.

import type { Entries } from '#decoder';
import { boundsOf, type Bounds } from './extremes';
import { mergedOf, type Merged } from './merged';
import { speedOf, type Speed } from './speed';
import { sortedOf, Track, type Sorted } from './track';

export interface Prepared {
  speed: Speed;
  speedBounds: Bounds;
  /// These belong to the positions of the cursor.
  xBounds: Bounds | undefined;
  yBounds: Bounds | undefined;
  merged: Merged;
  /// The orders of the streams by their kinds; null for those that are in order.
  order: Record<string, Sorted | null>;
}

/// Takes all streams of a recording.
export function prepare(entries: Entries[]): Prepared {
  const order: Prepared['order'] = {};
  for (const { kind, time } of entries) order[kind] = sortedOf(time);
  const tracks = entries.map((stream) => new Track(stream, order[stream.kind]));
  const positions = tracks.find(({ kind }) => kind === 'cursorLocation');
  const speed = speedOf(positions);
  const [x, y] = [positions?.values('x'), positions?.values('y')];
  return {
    speed,
    speedBounds: boundsOf(speed.values),
    xBounds: x && boundsOf(x),
    yBounds: y && boundsOf(y),
    merged: mergedOf(tracks),
    order,
  };
}
