// What a reader writes down about times of a recording.

import { decimal } from './decimals';
import { clock } from './format';

export interface Note {
  time: number;
  text: string;
}

export function sortedNotes(notes: Note[]): Note[] {
  return [...notes].sort((a, b) => a.time - b.time);
}

export type NotesFormat = 'json' | 'csv' | 'md';

/// The notes as a file.
export function notesText(notes: Note[], recording: string, format: NotesFormat): string {
  if (format === 'json') return `${JSON.stringify({ schema: 'zulm.notes', schema_version: 1, recording, notes }, null, 1)}\n`;
  if (format === 'csv') return ['time,text', ...notes.map(({ time, text }) => `${decimal(time)},${quoted(text)}`)].join('\n') + '\n';
  const lines = notes.map(({ time, text }) => `- \`${clock(time)}\` ${text.replaceAll('\n', '\n  ')}`);
  return [`# Notes on ${recording}`, '', ...lines].join('\n') + '\n';
}

function quoted(text: string): string {
  return /[",\r\n]/.test(text) ? `"${text.replaceAll('"', '""')}"` : text;
}

const mostNotes = 10_000;

/// Takes a file that `notesText` made. Throws if it holds no notes, or more than a page can show.
export function notesIn(text: string): Note[] {
  const source = text.replace(/^\ufeff/, '').replace(/\r\n?/g, '\n');
  const notes = source.trimStart().startsWith('{') ? fromJSON(source) : source.startsWith('time,text') ? fromCSV(source) : fromMarkdown(source);
  const good = notes.filter((note) => Number.isFinite(note.time) && note.text.trim() !== '');
  if (good.length === 0) throw new Error('it holds no notes');
  if (good.length > mostNotes) throw new Error(`it holds ${good.length} notes, and the page shows ${mostNotes} at most`);
  return sortedNotes(good);
}

function fromJSON(text: string): Note[] {
  const { schema, notes } = JSON.parse(text) as { schema?: unknown; notes?: unknown };
  if (schema !== 'zulm.notes' || !Array.isArray(notes)) throw new Error('it holds no notes');
  return notes.map((note: Partial<Note> | null) => ({ time: typeof note?.time === 'number' ? note.time : NaN, text: String(note?.text ?? '') }));
}

function fromCSV(text: string): Note[] {
  const rows = [...text.matchAll(/^(-?[\d.]+),(?:"((?:[^"]|"")*)"|([^\n]*))$/gm)];
  return rows.map(([, time, inQuotes, bare]) => ({ time: Number(time), text: inQuotes?.replaceAll('""', '"') ?? bare ?? '' }));
}

function fromMarkdown(text: string): Note[] {
  const items = [...text.matchAll(/^- `([−\d:.]+)` ([^\n]*(?:\n {2}[^\n]*)*)$/gm)];
  return items.map(([, time, words]) => ({ time: secondsOf(time!), text: words!.replaceAll('\n  ', '\n') }));
}

/// The seconds of a time such as "1:02:03.5".
export function secondsOf(clock: string): number {
  const seconds = clock.replace('−', '').split(':').reduce((sum, part) => 60 * sum + Number(part), 0);
  return clock.startsWith('−') ? -seconds : seconds;
}

/// Those of both, each once.
export function joined(notes: Note[], more: Note[]): Note[] {
  const known = new Set(notes.map(nameOf));
  const isNew = (note: Note) => !known.has(nameOf(note)) && known.add(nameOf(note));
  return sortedNotes([...notes, ...more.filter(isNew)]);
}

function nameOf({ time, text }: Note): string {
  return `${time.toFixed(3)} ${text}`; // not every form has more digits
}
