// The entries of all streams by time.

import type { Track } from './track';

/// The stream of each entry, and its row in that stream.
export interface Merged {
  stream: Uint16Array;
  row: Uint32Array;
}

/// Entries at the same time come in the order of their streams. A stream is copied as long as no other one is earlier.
export function mergedOf(tracks: Track[]): Merged {
  const count = tracks.reduce((sum, track) => sum + track.count, 0);
  const [stream, row] = [new Uint16Array(count), new Uint32Array(count)];
  const next = tracks.map(() => 0);
  for (let i = 0; i < count;) {
    const { first, isBefore } = earliest(tracks, next);
    const track = tracks[first]!;
    do {
      stream[i] = first;
      row[i++] = track.row(next[first]!++);
    } while (next[first]! < track.count && isBefore(track.times[next[first]!]!));
  }
  return { stream, row };
}

/// The stream whose turn it is, and whether it still is at a later time of it.
function earliest(tracks: Track[], next: number[]): { first: number; isBefore: (time: number) => boolean } {
  let [first, time] = [-1, Infinity];
  let [second, limit] = [-1, Infinity];
  for (let k = 0; k < tracks.length; ++k) {
    if (next[k]! >= tracks[k]!.count) continue;
    const own = tracks[k]!.times[next[k]!]!;
    if (first < 0 || own < time) {
      [second, limit] = [first, time];
      [first, time] = [k, own];
    } else if (second < 0 || own < limit) [second, limit] = [k, own];
  }
  const isEarlier = first < second;
  return { first, isBefore: (time) => second < 0 || time < limit || (isEarlier && time === limit) };
}
