// The rows of the entries' table: one stream in its own order, or all of them by time.

import { brief, clock, shown, titleOf } from '../model/format';
import { mask } from '../model/keys';
import { lastAt } from '../model/search';
import type { Track } from '../model/track';

export interface ColumnInfo {
  name: string;
  /// In the table's head.
  title: string;
  isNumber: boolean;
}

export type CellValue = string | number | null;

export interface Rows {
  readonly count: number;
  readonly columns: ColumnInfo[];
  time(row: number): number;
  /// As it is shown.
  cell(row: number, column: number): string;
  /// Of the fields of the entry, for copies and comparisons; undefined where it has no such field.
  value(row: number, name: string): CellValue | undefined;
  /// What is copied of an entry.
  fields(row: number): Record<string, CellValue>;
  /// The last row that had happened at a time, or -1.
  rowAt(time: number): number;
}

const masked: Record<string, string[]> = { keyboardAction: ['characterCode', 'characterString'] };

/// Whether a field tells what was typed.
export function isMasked(kind: string, column: string, showsKeys: boolean): boolean {
  return !showsKeys && (masked[kind]?.includes(column) ?? false);
}

function plain(value: unknown): CellValue {
  if (value === null || value === undefined) return null;
  if (typeof value === 'number') return Number.isFinite(value) ? value : String(value);
  if (value instanceof Uint8Array) return `${value.length} bytes`;
  return String(value);
}

export class StreamRows implements Rows {
  readonly columns: ColumnInfo[];
  private readonly names: string[];

  constructor(
    readonly track: Track,
    private readonly showsKeys: () => boolean,
  ) {
    const { columns } = track.entries;
    this.names = Object.keys(columns).filter((name) => name !== 'timestamp');
    this.columns = [
      { name: 'timestamp', title: 'Time', isNumber: true },
      ...this.names.map((name) => ({ name, title: titleOf(name), isNumber: isNumeric(columns[name]) })),
    ];
  }

  get count(): number {
    return this.track.entries.time.length;
  }

  time(row: number): number {
    return this.track.entries.time[row]!;
  }

  cell(row: number, column: number): string {
    if (column === 0) return timeText(this.time(row));
    const value = this.value(row, this.names[column - 1]!);
    return value === null || value === undefined ? '–' : typeof value === 'number' ? brief(value) : shown(value);
  }

  value(row: number, name: string): CellValue | undefined {
    if (name === 'timestamp') return plain(this.time(row));
    if (name === 'kind') return this.track.kind;
    const column = this.track.entries.columns[name];
    if (!column) return undefined;
    return isMasked(this.track.kind, name, this.showsKeys()) ? mask : plain(column[row]);
  }

  fields(row: number): Record<string, CellValue> {
    const fields: Record<string, CellValue> = {};
    for (const name of this.names) fields[name] = this.value(row, name) ?? null;
    fields.timestamp = plain(this.time(row));
    return fields;
  }

  rowAt(time: number): number {
    const index = this.track.at(time);
    return index < 0 ? -1 : this.track.row(index);
  }

  /// All fields in one line.
  summary(row: number): string {
    const parts = this.names.map((name) => `${name}=${this.value(row, name) ?? '–'}`);
    return shown(parts.join('  '));
  }
}

function isNumeric(column: unknown): boolean {
  return ArrayBuffer.isView(column);
}

function timeText(time: number): string {
  return Number.isFinite(time) ? clock(time) : String(time);
}

export class AllRows implements Rows {
  readonly columns: ColumnInfo[] = [
    { name: 'timestamp', title: 'Time', isNumber: true },
    { name: 'kind', title: 'Stream', isNumber: false },
    { name: 'entry', title: 'Entry', isNumber: false },
  ];
  private readonly streams: StreamRows[];
  private readonly times: Float64Array;
  private readonly stream: Uint16Array;
  private readonly row: Uint32Array;

  constructor(tracks: Track[], showsKeys: () => boolean) {
    this.streams = tracks.map((track) => new StreamRows(track, showsKeys));
    const count = tracks.reduce((sum, track) => sum + track.count, 0);
    this.times = new Float64Array(count);
    this.stream = new Uint16Array(count);
    this.row = new Uint32Array(count);
    this.merge(tracks);
  }

  /// Entries at the same time come in the order of their streams.
  private merge(tracks: Track[]): void {
    const next = tracks.map(() => 0);
    for (let i = 0; i < this.times.length; ++i) {
      let first = -1;
      let earliest = Infinity;
      for (let k = 0; k < tracks.length; ++k) {
        const time = next[k]! < tracks[k]!.count ? tracks[k]!.times[next[k]!]! : Infinity;
        if (time < earliest) [first, earliest] = [k, time];
      }
      this.times[i] = earliest;
      this.stream[i] = first;
      this.row[i] = tracks[first]!.row(next[first]!++);
    }
  }

  get count(): number {
    return this.times.length;
  }

  time(row: number): number {
    return this.times[row]!;
  }

  cell(row: number, column: number): string {
    if (column === 0) return timeText(this.time(row));
    const stream = this.streams[this.stream[row]!]!;
    return column === 1 ? titleOf(stream.track.kind) : stream.summary(this.row[row]!);
  }

  value(row: number, name: string): CellValue | undefined {
    const stream = this.streams[this.stream[row]!]!;
    return name === 'kind' ? stream.track.kind : stream.value(this.row[row]!, name);
  }

  fields(row: number): Record<string, CellValue> {
    const stream = this.streams[this.stream[row]!]!;
    return { kind: stream.track.kind, ...stream.fields(this.row[row]!) };
  }

  rowAt(time: number): number {
    return lastAt(this.times, time);
  }
}
