// What the reader says about a movie that is not the one that was recorded: it was cut, or it shows another region.

import type { StreamSummary, Table } from '#decoder';
import { decimal, decimalsOf, partOf, withPart } from '../model/fragments';
import { hasArea, type Rect } from '../model/geometry';
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
  const [offset] = decimalsOf([partOf(hash, 'offset') ?? '0']) ?? [0];
  return { offset: offset!, region: regionOf(decimalsOf(partOf(hash, 'region')?.split(',') ?? [])) };
}

export function withAdjustment(hash: string, { offset, region }: Adjustment): string {
  const numbers = region && [region.x, region.y, region.width, region.height].map(decimal).join();
  return withPart(withPart(hash, 'offset', offset === 0 ? undefined : decimal(offset)), 'region', numbers);
}

export function isSame(one: Adjustment, other: Adjustment): boolean {
  return withAdjustment('', one) === withAdjustment('', other);
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

/// Everything at the times of the movie.
export function shifted(decoded: Decoded, offset: number): Decoded {
  if (offset === 0) return decoded;
  const moved = <Kind extends Table>(table: Kind | undefined) => table && shiftedTable(table, offset);
  const { keys } = decoded;
  return {
    ...decoded,
    streams: decoded.streams.map((stream) => shiftedSummary(stream, offset)),
    entries: decoded.entries.map((entries) => shiftedTable(entries, offset)),
    keys: keys && { clear: shiftedTable(keys.clear, offset), masked: shiftedTable(keys.masked, offset) },
    clicks: moved(decoded.clicks),
    idle: moved(decoded.idle),
    appearances: moved(decoded.appearances),
    hidden: decoded.hidden.map(({ stream, entries }) => ({
      stream: shiftedSummary(stream, offset),
      entries: moved(entries),
    })),
  };
}
