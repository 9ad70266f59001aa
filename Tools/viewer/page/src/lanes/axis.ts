// Time along the lanes.

import type { TimeRange } from '../model/link';

export type Range = TimeRange;

const steps = [0.001, 0.002, 0.005, 0.01, 0.02, 0.05, 0.1, 0.2, 0.5, 1, 2, 5, 10, 15, 30, 60, 120, 300, 600, 900, 1800];

/// Seconds between two marks that are at least `room` pixels apart.
export function tickStep(range: Range, width: number, room: number): number {
  const least = ((range.to - range.from) / Math.max(1, width)) * room;
  return steps.find((step) => step >= least) ?? Math.ceil(least / 3600) * 3600;
}

export function ticks(range: Range, step: number): number[] {
  const first = Math.ceil(range.from / step - 1e-9);
  const last = Math.floor(range.to / step + 1e-9);
  return Array.from({ length: Math.max(0, last - first + 1) }, (_, i) => (first + i) * step);
}

/// Returns how many decimals of a second tell two marks apart.
export function tickDigits(step: number): number {
  return step >= 1 ? 0 : Math.ceil(-Math.log10(step) - 1e-9);
}

const shortest = 0.05; // seconds

/// As near to `range` as fits into a recording of `duration` seconds.
export function clampedRange({ from, to }: Range, duration: number): Range {
  const length = Math.min(Math.max(to - from, Math.min(shortest, duration)), duration);
  const start = Math.max(0, Math.min(from, duration - length));
  return { from: start, to: start + length };
}

/// Returns a range that is `factor` times as long and has `anchor` at the same place.
export function zoomed({ from, to }: Range, anchor: number, factor: number, duration: number): Range {
  const length = Math.min(Math.max((to - from) * factor, Math.min(shortest, duration)), duration);
  const place = (anchor - from) / (to - from);
  return clampedRange({ from: anchor - place * length, to: anchor + (1 - place) * length }, duration);
}
