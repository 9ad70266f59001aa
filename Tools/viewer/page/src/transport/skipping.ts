// Playing without the times in which nothing was done.

import type { Stretch } from '../model/idle';
import { partition } from '../model/search';

const kept = 0.5; // seconds at either end of a stretch, so that one sees what ends and what begins

/// Where to go on at `time`, or undefined if something is done then.
export function afterIdle(stretches: Stretch[], time: number): number | undefined {
  const stretch = stretches[partition(stretches.length, (i) => stretches[i]!.start <= time) - 1];
  if (!stretch) return undefined;
  const [start, end] = [stretch.start + kept, stretch.end - kept];
  return time >= start && time < end ? end : undefined;
}
