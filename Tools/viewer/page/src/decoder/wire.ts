// Tables on their way from the decoder to the page. Texts and images that are equal go once.

import type { Table } from '#decoder';
import type { Decoded } from '../model/session';
import { breath } from '../ui/breath';

type Columns = Table['columns'];
type Listed = Extract<Columns[string], unknown[]>;

interface Coded {
  distinct: Listed;
  places: Uint32Array;
}

function coded(column: Listed): Coded {
  const known = new Map<unknown, number>();
  const places = new Uint32Array(column.length);
  for (let i = 0; i < column.length; ++i) {
    const value = column[i];
    let place = known.get(value);
    if (place === undefined) known.set(value, (place = known.size));
    places[i] = place;
  }
  return { distinct: [...known.keys()] as Listed, places };
}

function spread({ distinct, places }: Coded): Listed {
  const column = new Array<unknown>(places.length);
  for (let i = 0; i < places.length; ++i) column[i] = distinct[places[i]!];
  return column as Listed;
}

const codedColumn = (column: Columns[string]) => (Array.isArray(column) ? coded(column) : column);
const spreadColumn = (column: unknown) =>
  ArrayBuffer.isView(column) ? column : spread(column as Coded);

function withColumns<Some extends Table>(table: Some, change: (column: Columns[string]) => unknown): Some {
  const columns = Object.entries(table.columns).map(([name, column]) => [name, change(column)]);
  return { ...table, columns: Object.fromEntries(columns) as Some['columns'] };
}

function changed(decoded: Decoded, change: (column: Columns[string]) => unknown): Decoded {
  const table = <Some extends Table>(one: Some) => withColumns(one, change);
  const { entries, keys, clicks, idle, appearances, hidden } = decoded;
  return {
    ...decoded,
    entries: entries.map(table),
    keys: keys && { clear: table(keys.clear), masked: table(keys.masked) },
    clicks: clicks && table(clicks),
    idle: idle && table(idle),
    appearances: appearances && table(appearances),
    hidden: hidden.map(({ stream, entries }) => ({ stream, entries: entries && table(entries) })),
  };
}

/// What is sent. It is read by `unwrapped` alone.
export function wrapped(decoded: Decoded): Decoded {
  return changed(decoded, codedColumn);
}

/// The page goes on meanwhile.
export async function unwrapped(decoded: Decoded): Promise<Decoded> {
  const known = new Map<unknown, Columns[string]>();
  const listed: unknown[] = [];
  changed(decoded, (column) => (ArrayBuffer.isView(column) || listed.push(column), column));
  for (const column of listed) {
    known.set(column, spreadColumn(column) as Columns[string]);
    await breath();
  }
  return changed(decoded, (column) => known.get(column) ?? column);
}

/// All memory that can be handed over instead of copied. Images may share theirs with others, and are copied.
export function buffersIn(value: unknown, found = new Set<ArrayBuffer>()): Set<ArrayBuffer> {
  if (ArrayBuffer.isView(value)) {
    if (!(value instanceof Uint8Array) && value.buffer instanceof ArrayBuffer) found.add(value.buffer);
  } else if (typeof value === 'object' && value !== null && !Array.isArray(value))
    for (const part of Object.values(value)) buffersIn(part, found);
  else if (Array.isArray(value) && typeof value[0] === 'object') for (const part of value) buffersIn(part, found);
  return found;
}
