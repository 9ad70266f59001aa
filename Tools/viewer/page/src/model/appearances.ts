// What the cursor looked like.

import type { Table } from '#decoder';
import type { Point } from './geometry';
import { Track } from './track';

export interface Appearance {
  id: string;
  image: Uint8Array;
  hotSpot: Point;
}

const none = new Uint8Array();

/// Takes what the library knows at the times of the stream: one for each of its entries, by time, with an empty image
/// if the recording has none.
export function appearancesIn(states: Table | undefined): Appearance[] {
  const track = states && new Track(states);
  return Array.from(track?.times ?? [], (_, i) => ({
    id: track!.text('cursor_id', i),
    image: track!.bytes('picture', i) ?? none,
    hotSpot: { x: track!.number('hotspot_x', i), y: track!.number('hotspot_y', i) },
  }));
}
