// The rows of the entries' table: one stream in its own order, or all of them by time.

import { brief, clock, shown, titleOf } from '../model/format';
import { mask } from '../model/keys';
import { mergedOf, type Merged } from '../model/merged';
import { partition } from '../model/search';
import type { Appearance } from '../model/appearances';
import type { Track } from '../model/track';
import { cachedTest, clockTest, never, numberTest, type RowTest } from './words';

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
  /// Whether the rows are in the order of their times.
  readonly isByTime: boolean;
  /// The last row that had happened at a time, or -1.
  rowAt(time: number): number;
  /// Whether a cell of a row holds a word in small letters.
  wordTest(word: string): RowTest;
  /// The numbers or texts that a column is sorted by; undefined if it is not.
  sortValues(column: number): SortValues | undefined;
  isSortable(column: number): boolean;
  /// The column that shows a picture, and what the cursor looks like in a row.
  readonly pictureColumn: number;
  appearance(row: number): Appearance | undefined;
}

/// What a reader sees of a row, as a value that can be compared, or nothing.
export type SortValues = ArrayLike<unknown> | ((row: number) => unknown);

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
    private readonly appearances: Appearance[] = [],
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

  get isByTime(): boolean {
    return this.track.isByTime;
  }

  rowAt(time: number): number {
    const index = this.track.at(time);
    return index < 0 ? -1 : this.track.row(index);
  }

  wordTest(word: string): RowTest {
    const tests = [this.timeTest(word), ...this.names.map((name) => this.columnTest(name, word, brief))];
    return anyOf(tests);
  }

  /// Like `wordTest`, for `summary`.
  summaryTest(word: string): RowTest {
    if (this.spansFields(word)) return (row) => this.summary(row).toLowerCase().includes(word);
    if (this.names.some((name) => name.toLowerCase().includes(word))) return () => true;
    return anyOf(this.names.map((name) => this.columnTest(name, word, String)));
  }

  /// Whether a part of `summary` can be the word that belongs to no single value.
  private spansFields(word: string): boolean {
    const ends = [...word.matchAll(/\s/g)].map(({ index }) => word.slice(index + 1));
    return word.includes('=') || ends.some((end) => this.names.some((name) => ` ${name}`.toLowerCase().startsWith(end)));
  }

  timeTest(word: string): RowTest {
    return clockTest(this.track.entries.time, timeText, word);
  }

  private columnTest(name: string, word: string, textOf: (value: number) => string): RowTest {
    const column = this.track.entries.columns[name]!;
    if (isMasked(this.track.kind, name, this.showsKeys())) return mask.includes(word) ? () => true : never;
    if (ArrayBuffer.isView(column) && !(column instanceof BigUint64Array)) return numberTest(column, textOf, word);
    return cachedTest(column as ArrayLike<unknown>, (value) => shown(String(plain(value) ?? '–')), word);
  }

  sortValues(column: number): SortValues {
    if (column === 0) return this.track.entries.time;
    const name = this.names[column - 1]!;
    const values = this.track.entries.columns[name] as ArrayLike<unknown>;
    if (isMasked(this.track.kind, name, this.showsKeys())) return () => mask;
    return name === 'image' ? (row) => (values[row] as Uint8Array | null)?.length ?? null : values;
  }

  isSortable(): boolean {
    return true;
  }

  get pictureColumn(): number {
    return this.names.indexOf('image') + 1 || -1;
  }

  appearance(row: number): Appearance | undefined {
    const place = this.track.place(row);
    return place < 0 ? undefined : this.appearances[place];
  }

  /// All fields in one line.
  summary(row: number): string {
    const parts = this.names.map((name) => `${name}=${this.value(row, name) ?? '–'}`);
    return shown(parts.join('  '));
  }
}

function anyOf(tests: RowTest[]): RowTest {
  const possible = tests.filter((test) => test !== never);
  if (possible.length === 0) return never;
  return possible.length === 1 ? possible[0]! : (row) => possible.some((test) => test(row));
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
  private readonly stream: Uint16Array;
  private readonly row: Uint32Array;

  constructor(tracks: Track[], showsKeys: () => boolean, merged: Merged = mergedOf(tracks), appearances?: Appearance[]) {
    this.streams = tracks.map(
      (track) => new StreamRows(track, showsKeys, track.kind === 'cursorImage' ? appearances : undefined),
    );
    ({ stream: this.stream, row: this.row } = merged);
  }

  get count(): number {
    return this.row.length;
  }

  time(row: number): number {
    return this.streams[this.stream[row]!]!.time(this.row[row]!);
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

  wordTest(word: string): RowTest {
    const tests = this.streams.map((stream) => {
      if (titleOf(stream.track.kind).toLowerCase().includes(word)) return () => true;
      return anyOf([stream.timeTest(word), stream.summaryTest(word)]);
    });
    return (row) => tests[this.stream[row]!]!(this.row[row]!);
  }

  sortValues(column: number): SortValues | undefined {
    if (column === 0) return (row) => this.time(row);
    const titles = this.streams.map(({ track }) => titleOf(track.kind));
    return column === 1 ? (row) => titles[this.stream[row]!]! : undefined;
  }

  isSortable(column: number): boolean {
    return column < 2;
  }

  readonly pictureColumn = 2;
  readonly isByTime = true;

  appearance(row: number): Appearance | undefined {
    return this.streams[this.stream[row]!]!.appearance(this.row[row]!);
  }

  rowAt(time: number): number {
    return partition(this.count, (row) => this.time(row) <= time) - 1;
  }
}
