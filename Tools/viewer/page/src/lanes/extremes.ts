// The least and the greatest of any run of values, without looking at all of them.

export class Extremes {
  private readonly least: Float32Array;
  private readonly greatest: Float32Array;

  constructor(readonly values: Float32Array) {
    const count = values.length;
    this.least = new Float32Array(2 * count);
    this.greatest = new Float32Array(2 * count);
    this.least.set(values, count);
    this.greatest.set(values, count);
    for (let i = count - 1; i > 0; --i) {
      this.least[i] = Math.min(this.least[2 * i]!, this.least[2 * i + 1]!);
      this.greatest[i] = Math.max(this.greatest[2 * i]!, this.greatest[2 * i + 1]!);
    }
  }

  /// Returns the least and the greatest of the values from `first` up to, but not including, `end`. If there are none,
  /// both are infinite.
  of(first: number, end: number): [number, number] {
    let [least, greatest] = [Infinity, -Infinity];
    const take = (node: number) => {
      least = Math.min(least, this.least[node]!);
      greatest = Math.max(greatest, this.greatest[node]!);
    };
    let low = first + this.values.length;
    let high = end + this.values.length;
    for (; low < high; low >>= 1, high >>= 1) {
      if (low & 1) take(low++);
      if (high & 1) take(--high);
    }
    return [least, greatest];
  }
}
