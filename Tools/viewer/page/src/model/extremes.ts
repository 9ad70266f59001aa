// The least and the greatest of any run of values, without looking at all of them.

const block = 64; // values that are looked at one by one

/// The extremes of blocks of values, as trees: the leaves are the second half.
export interface Bounds {
  least: Float32Array;
  greatest: Float32Array;
}

function finite(value: number): number {
  return Number.isFinite(value) ? value : 0;
}

export function boundsOf(values: ArrayLike<number>): Bounds {
  const blocks = Math.ceil(values.length / block);
  const least = new Float32Array(2 * blocks).fill(Infinity);
  const greatest = new Float32Array(2 * blocks).fill(-Infinity);
  for (let k = 0; k < blocks; ++k) {
    let [low, high] = [Infinity, -Infinity];
    for (let i = k * block, end = Math.min(values.length, i + block); i < end; ++i) {
      const value = finite(values[i]!);
      if (value < low) low = value;
      if (value > high) high = value;
    }
    least[blocks + k] = low;
    greatest[blocks + k] = high;
  }
  for (let i = blocks - 1; i > 0; --i) {
    least[i] = Math.min(least[2 * i]!, least[2 * i + 1]!);
    greatest[i] = Math.max(greatest[2 * i]!, greatest[2 * i + 1]!);
  }
  return { least, greatest };
}

/// What is no number counts as 0.
export class Extremes {
  private least = Infinity;
  private greatest = -Infinity;

  constructor(
    private readonly values: ArrayLike<number>,
    private readonly bounds: Bounds = boundsOf(values),
  ) {}

  /// Returns those of the values from `first` to before `end`, or infinities if there are no values.
  of(first: number, end: number): [number, number] {
    [this.least, this.greatest] = [Infinity, -Infinity];
    const start = Math.ceil(first / block);
    const stop = Math.floor(end / block);
    if (start >= stop) this.takeValues(first, end);
    else {
      this.takeValues(first, start * block);
      this.takeBlocks(start, stop);
      this.takeValues(stop * block, end);
    }
    return [this.least, this.greatest];
  }

  private takeValues(first: number, end: number): void {
    for (let i = first; i < end; ++i) {
      const value = finite(this.values[i]!);
      this.take(value, value);
    }
  }

  private takeBlocks(first: number, end: number): void {
    const { least, greatest } = this.bounds;
    const take = (node: number) => this.take(least[node]!, greatest[node]!);
    let low = first + least.length / 2;
    let high = end + least.length / 2;
    for (; low < high; low >>= 1, high >>= 1) {
      if (low & 1) take(low++);
      if (high & 1) take(--high);
    }
  }

  private take(least: number, greatest: number): void {
    if (least < this.least) this.least = least;
    if (greatest > this.greatest) this.greatest = greatest;
  }
}
