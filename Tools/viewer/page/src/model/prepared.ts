// What takes long to work out from a long recording. The decoder's worker does it, so that the page goes on.

import { boundsOf, type Bounds } from './extremes';
import { mergedOf, type Merged } from './merged';
import { speedOf, type Speed } from './speed';
import type { Track } from './track';

export interface Prepared {
  speed: Speed;
  speedBounds: Bounds;
  /// These belong to the positions of the cursor.
  xBounds: Bounds | undefined;
  yBounds: Bounds | undefined;
  merged: Merged;
}

/// Takes all tracks of a recording.
export function prepare(tracks: Track[]): Prepared {
  const positions = tracks.find(({ kind }) => kind === 'cursorLocation');
  const speed = speedOf(positions);
  const [x, y] = [positions?.values('x'), positions?.values('y')];
  return {
    speed,
    speedBounds: boundsOf(speed.values),
    xBounds: x && boundsOf(x),
    yBounds: y && boundsOf(y),
    merged: mergedOf(tracks),
  };
}
