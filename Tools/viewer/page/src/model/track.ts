// One stream's entries in the order of their times.

import type { Table } from '#decoder';
import { shown } from './format';
import { lastAt } from './search';

/// The order of entries that are not stored in the order of their times.
export interface Sorted {
  /// The rows in the order of their times.
  order: Uint32Array;
  /// Their times.
  times: Float64Array;
}

export class Track {
  readonly kind: string;
  /// Ascending and finite.
  readonly times: Float64Array;
  /// The rows of the stream in the order of their times; null if the stream is in that order itself.
  private readonly order: Uint32Array | null;

  /// `sorted` is what `sortedOf` returns for the times, if it is known.
  constructor(
    readonly entries: Table,
    sorted: Sorted | null = sortedOf(entries.time),
  ) {
    this.kind = entries.kind;
    this.order = sorted?.order ?? null;
    this.times = sorted?.times ?? entries.time;
  }

  /// Whether the stream itself has the order of the times.
  get isByTime(): boolean {
    return this.order === null;
  }

  get count(): number {
    return this.times.length;
  }

  /// The row in the stream of the `index`th entry by time.
  row(index: number): number {
    return this.order ? this.order[index]! : index;
  }

  /// The place of a row of the stream by time, or -1 if it has none.
  place(row: number): number {
    return this.order ? this.order.indexOf(row) : row;
  }

  column(name: string): Table['columns'][string] | undefined {
    return this.entries.columns[name];
  }

  /// A column of numbers by time; what is none is NaN. It is the stream's own column if that has this order.
  values(name: string): ArrayLike<number> {
    const column = this.entries.columns[name];
    const isOwn = !this.order && ArrayBuffer.isView(column) && !(column instanceof BigUint64Array);
    return isOwn ? (column as ArrayLike<number>) : Float64Array.from(this.times, (_, i) => this.number(name, i));
  }

  number(name: string, index: number): number {
    const value = this.entries.columns[name]?.[this.row(index)];
    return typeof value === 'bigint' ? Number(value) : typeof value === 'number' ? value : NaN;
  }

  /// As it is shown.
  text(name: string, index: number): string {
    const value = this.entries.columns[name]?.[this.row(index)];
    return value === null || value === undefined ? '' : shown(String(value));
  }

  bytes(name: string, index: number): Uint8Array | null {
    const value = this.entries.columns[name]?.[this.row(index)];
    return value instanceof Uint8Array ? value : null;
  }

  /// The entry that holds at `time`, or -1 before the first.
  at(time: number): number {
    return lastAt(this.times, time);
  }

  /// When the next entry takes over.
  endOf(index: number, end: number): number {
    return index + 1 < this.count ? this.times[index + 1]! : Math.max(end, this.times[index]!);
  }
}

/// Returns null if the times are in order.
export function sortedOf(times: Float64Array): Sorted | null {
  if (isSorted(times)) return null;
  const order = orderOf(times);
  return { order, times: Float64Array.from(order, (row) => times[row]!) };
}

function isSorted(times: Float64Array): boolean {
  let last = -Infinity;
  for (let i = 0; i < times.length; ++i) {
    const time = times[i]!;
    if (!(time >= last) || time === Infinity || time === -Infinity) return false;
    last = time;
  }
  return true;
}

/// Entries whose time is no number happen never.
function orderOf(times: Float64Array): Uint32Array {
  const rows: number[] = [];
  for (let i = 0; i < times.length; ++i) if (Number.isFinite(times[i])) rows.push(i);
  return Uint32Array.from(rows.sort((a, b) => times[a]! - times[b]! || a - b));
}
