// The page's side of sorting: the keys of a column, taken piece by piece, go to a worker.

import { breath } from '../ui/breath';
import type { Rows } from './rows';
import SortWorker from './sortworker?worker&inline';
import type { Sorted, SortRequest } from './sortworker';

export interface SortOrder {
  column: number;
  isDescending: boolean;
}

const piece = 50_000; // rows at a time

const collator = new Intl.Collator('en', { numeric: true, sensitivity: 'base' });

function compared(a: unknown, b: unknown): number {
  if (typeof a === 'bigint' && typeof b === 'bigint') return a < b ? -1 : a > b ? 1 : 0;
  return collator.compare(String(a), String(b));
}

/// What is no number is known by its place among all that there are.
function ranksOf(values: Set<unknown>): Map<unknown, number> {
  return new Map([...values].sort(compared).map((value, rank) => [value, rank]));
}

async function keysOf(rows: Rows, column: number): Promise<Float64Array> {
  const values = rows.sortValues(column);
  if (ArrayBuffer.isView(values) && !(values instanceof BigUint64Array)) return new Float64Array(values as Int32Array);
  const valueAt = typeof values === 'function' ? values : (row: number): unknown => values?.[row];
  const keys = new Float64Array(rows.count);
  if (rows.columns[column]!.isNumber && typeof values === 'function') {
    await inPieces(rows.count, (row) => (keys[row] = Number(valueAt(row))));
    return keys;
  }
  const distinct = new Set<unknown>();
  await inPieces(rows.count, (row) => distinct.add(valueAt(row)));
  distinct.delete(null);
  const ranks = ranksOf(distinct);
  await inPieces(rows.count, (row) => (keys[row] = ranks.get(valueAt(row)) ?? NaN));
  return keys;
}

async function inPieces(count: number, take: (row: number) => unknown): Promise<void> {
  for (let row = 0; row < count; await breath())
    for (const end = Math.min(count, row + piece); row < end; ++row) take(row);
}

/// Keeps the order of the rows that were sorted last.
export class Sorter {
  private worker: Worker | undefined;
  private lastId = 0;
  private readonly waiting = new Map<number, (sorted: Sorted) => void>();

  async sort(rows: Rows, { column, isDescending }: SortOrder): Promise<void> {
    const keys = await keysOf(rows, column);
    this.send({ id: 0, keys, isDescending }, [keys.buffer as ArrayBuffer]);
  }

  /// The rows to show, in their order.
  shown(matches: Uint32Array | null): Promise<Sorted> {
    const id = ++this.lastId;
    return new Promise((done) => {
      this.waiting.set(id, done);
      this.send({ id, matches }, []);
    });
  }

  private send(request: SortRequest, transfer: ArrayBuffer[]): void {
    if (!this.worker) {
      this.worker = new SortWorker();
      this.worker.onmessage = ({ data }: MessageEvent<Sorted>) => {
        this.waiting.get(data.id)?.(data);
        this.waiting.delete(data.id);
      };
    }
    this.worker.postMessage(request, transfer);
  }
}
