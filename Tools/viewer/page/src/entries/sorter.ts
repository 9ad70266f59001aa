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

type Unsorted = { keys: Float64Array } | { values: unknown[]; places: Uint32Array };

/// Returns a number for each row, or the distinct values and which of them each row has.
async function keysOf(rows: Rows, column: number): Promise<Unsorted> {
  const values = rows.sortValues(column);
  if (ArrayBuffer.isView(values) && !(values instanceof BigUint64Array))
    return { keys: new Float64Array(values as Int32Array) };
  const valueAt = typeof values === 'function' ? values : (row: number): unknown => values?.[row] ?? null;
  if (rows.columns[column]!.isNumber && typeof values === 'function') {
    const keys = new Float64Array(rows.count);
    await inPieces(rows.count, (row) => (keys[row] = Number(valueAt(row))));
    return { keys };
  }
  const known = new Map<unknown, number>();
  const places = new Uint32Array(rows.count);
  await inPieces(rows.count, (row) => {
    const value = valueAt(row);
    const place = known.get(value) ?? known.size;
    known.set(value, place);
    places[row] = place;
  });
  return { values: [...known.keys()], places };
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

  /// Changes nothing if another order was asked for meanwhile.
  async sort(rows: Rows, { column, isDescending }: SortOrder, isObsolete: () => boolean): Promise<void> {
    const unsorted = await keysOf(rows, column);
    if (isObsolete()) return;
    const { buffer } = 'keys' in unsorted ? unsorted.keys : unsorted.places;
    this.send({ id: 0, ...unsorted, isDescending }, [buffer as ArrayBuffer]);
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
