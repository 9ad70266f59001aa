// What the cursor looked like: an entry without an image shows the one that came with its number before.

import type { Point } from './geometry';
import type { Track } from './track';

export interface Appearance {
  id: string;
  image: Uint8Array;
  hotSpot: Point;
}

const none: Appearance = { id: '', image: new Uint8Array(), hotSpot: { x: 0, y: 0 } };

/// One for each entry of the track, by time; with an empty image where none has come yet.
export function cursorAppearances(track: Track | undefined): Appearance[] {
  const known = new Map<string, Appearance>();
  const result: Appearance[] = [];
  for (let i = 0; i < (track?.count ?? 0); ++i) {
    const id = track!.text('id', i);
    const image = track!.bytes('image', i);
    if (image && image.length > 0)
      known.set(id, {
        id,
        image,
        hotSpot: { x: track!.number('hotspotOffsetX', i), y: track!.number('hotspotOffsetY', i) },
      });
    result.push(known.get(id) ?? none);
  }
  return result;
}
