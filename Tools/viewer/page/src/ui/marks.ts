// How long the page itself takes, as performance marks and measures that a browser's tools show.

const kept = 2000;

let sinceCleared = 0;

/// Measures a part of a frame, or another thing that comes again and again.
export function measured<Result>(name: string, action: () => Result): Result {
  const start = performance.now();
  const result = action();
  if (++sinceCleared > kept) {
    performance.clearMeasures(name);
    sinceCleared = 0;
  }
  performance.measure(name, { start, end: performance.now() });
  return result;
}

export function mark(name: string): void {
  performance.mark(name);
}
