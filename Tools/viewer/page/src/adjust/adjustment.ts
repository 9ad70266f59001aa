// What the reader says about a movie that is not the one that was recorded: it was cut, or it shows another region.

import type { StreamSummary, Table } from '#decoder';
import { decimal, decimalsOf } from '../model/decimals';
import { hasArea, type Rect } from '../model/geometry';
import { partsOf } from '../model/link';
import type { Prepared } from '../model/prepared';
import type { Decoded } from '../model/session';

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

export function adjustmentIn(hash: string): Adjustment {
  const parts = partsOf(hash);
  const [offset] = decimalsOf([parts.get('offset') ?? '0']) ?? [0];
  return { offset: offset!, region: regionOf(decimalsOf(parts.get('region')?.split(',') ?? [])) };
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

export function shiftedTable<Kind extends Table>(table: Kind, offset: number): Kind {
  if (offset === 0) return table;
  const shift = (times: Float64Array) => times.map((time) => time + offset);
  const columns = Object.entries(table.columns).map(([name, column]) => [
    name,
    column instanceof Float64Array && timeColumns.includes(name) ? shift(column) : column,
  ]);
  return { ...table, time: shift(table.time), columns: Object.fromEntries(columns) };
}

function shiftedSummary(stream: StreamSummary, offset: number): StreamSummary {
  const { first, last } = stream;
  if (first === undefined || last === undefined) return stream;
  return { ...stream, first: first + offset, last: last + offset };
}

function shiftedParts(prepared: Prepared, offset: number): Prepared {
  const { times, values } = prepared.speed;
  return { ...prepared, speed: { times: times.map((time) => time + offset), values } };
}

/// Everything at the times of the movie.
export function shifted(decoded: Decoded, offset: number): Decoded {
  if (offset === 0) return decoded;
  const moved = <Kind extends Table>(table: Kind | undefined) => table && shiftedTable(table, offset);
  const { keys, prepared } = decoded;
  return {
    ...decoded,
    streams: decoded.streams.map((stream) => shiftedSummary(stream, offset)),
    entries: decoded.entries.map((entries) => shiftedTable(entries, offset)),
    keys: keys && { clear: shiftedTable(keys.clear, offset), masked: shiftedTable(keys.masked, offset) },
    clicks: moved(decoded.clicks),
    idle: moved(decoded.idle),
    appearances: moved(decoded.appearances),
    prepared: prepared && shiftedParts(prepared, offset),
    hidden: decoded.hidden.map(({ stream, entries }) => ({
      stream: shiftedSummary(stream, offset),
      entries: moved(entries),
    })),
  };
}
