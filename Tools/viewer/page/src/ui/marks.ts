// How long the page itself takes, as performance marks and measures that a browser's tools show.

const kept = 2000;

const counts = new Map<string, number>();

/// Measures a part of a frame, or another thing that comes again and again.
export function measured<Result>(name: string, action: () => Result): Result {
  const start = performance.now();
  const result = action();
  const count = (counts.get(name) ?? 0) + 1;
  if (count > kept) performance.clearMeasures(name);
  counts.set(name, count > kept ? 0 : count);
  performance.measure(name, { start, end: performance.now() });
  return result;
}

export function mark(name: string): void {
  performance.mark(name);
}
