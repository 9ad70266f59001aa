// What the reader says about a movie that is not the one that was recorded: it was cut, or it shows another region.

import type { StreamSummary, Table } from '#decoder';
import { decimal, decimalsOf } from '../model/decimals';
import { hasArea, type Rect } from '../model/geometry';
import { partsOf } from '../model/link';
import type { Prepared } from '../model/prepared';
import type { Decoded } from '../model/session';
import { breath } from '../ui/breath';

export interface Adjustment {
  /// Seconds that are added to every time of the recording.
  offset: number;
  /// What the movie shows, in units of the display; undefined if the recording says it.
  region: Rect | undefined;
}

export const asRecorded: Adjustment = { offset: 0, region: undefined };

export function regionOf(numbers: number[] | undefined): Rect | undefined {
  if (numbers?.length !== 4) return undefined;
  const [x, y, width, height] = numbers as [number, number, number, number];
  const rect = { x, y, width, height };
  return hasArea(rect) ? rect : undefined;
}

/// What a link lacks is as in `otherwise`.
export function adjustmentIn(hash: string, otherwise = asRecorded): Adjustment {
  const parts = partsOf(hash);
  const [offset] = parts.has('offset') ? (decimalsOf([parts.get('offset')!]) ?? [0]) : [otherwise.offset];
  const numbers = parts.get('region')?.split(',');
  return { offset: offset!, region: numbers ? regionOf(decimalsOf(numbers)) : otherwise.region };
}

/// For a link.
export function partsOfAdjustment({ offset, region }: Adjustment): [string, string | undefined][] {
  const numbers = region && [region.x, region.y, region.width, region.height].map(decimal).join();
  return [
    ['offset', offset === 0 ? undefined : decimal(offset)],
    ['region', numbers],
  ];
}

export function isSame(one: Adjustment, other: Adjustment): boolean {
  return partsOfAdjustment(one).join() === partsOfAdjustment(other).join();
}

/// Columns of insights that hold times.
const timeColumns = ['end', 'zoom_start', 'zoom_end'];

function moved(times: Float64Array, offset: number): Float64Array {
  const result = new Float64Array(times.length);
  for (let i = 0; i < times.length; ++i) result[i] = times[i]! + offset;
  return result;
}

export function shiftedTable<Kind extends Table>(table: Kind, offset: number): Kind {
  if (offset === 0) return table;
  const columns = Object.entries(table.columns).map(([name, column]) => [
    name,
    column instanceof Float64Array && timeColumns.includes(name) ? moved(column, offset) : column,
  ]);
  return { ...table, time: moved(table.time, offset), columns: Object.fromEntries(columns) };
}

function shiftedSummary(stream: StreamSummary, offset: number): StreamSummary {
  const { first, last } = stream;
  if (first === undefined || last === undefined) return stream;
  return { ...stream, first: first + offset, last: last + offset };
}

function shiftedParts(prepared: Prepared, offset: number): Prepared {
  const { times, values } = prepared.speed;
  const order = Object.entries(prepared.order).map(([kind, sorted]) => [
    kind,
    sorted && { ...sorted, times: moved(sorted.times, offset) },
  ]);
  return { ...prepared, speed: { times: moved(times, offset), values }, order: Object.fromEntries(order) };
}

/// Returns everything at the times of the movie. The page goes on meanwhile.
export async function shifted(decoded: Decoded, offset: number): Promise<Decoded> {
  if (offset === 0) return decoded;
  const move = async <Kind extends Table>(table: Kind): Promise<Kind> => {
    await breath();
    return shiftedTable(table, offset);
  };
  const moveIf = async <Kind extends Table>(table: Kind | undefined) => table && move(table);
  const { keys, prepared } = decoded;
  const entries = [];
  for (const table of decoded.entries) entries.push(await move(table));
  const hidden = [];
  for (const { stream, entries } of decoded.hidden)
    hidden.push({ stream: shiftedSummary(stream, offset), entries: await moveIf(entries) });
  await breath();
  return {
    ...decoded,
    length: decoded.length + offset,
    streams: decoded.streams.map((stream) => shiftedSummary(stream, offset)),
    entries,
    keys: keys && { clear: await move(keys.clear), masked: await move(keys.masked) },
    clicks: await moveIf(decoded.clicks),
    idle: await moveIf(decoded.idle),
    appearances: await moveIf(decoded.appearances),
    prepared: prepared && shiftedParts(prepared, offset),
    hidden,
  };
}
