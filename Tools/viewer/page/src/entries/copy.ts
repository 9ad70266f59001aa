// Rows as texts for other programs.

import { breath } from '../ui/breath';
import type { CellValue, Rows } from './rows';

type Fields = Record<string, CellValue>;

function field(value: CellValue | undefined): string {
  if (value === null || value === undefined) return '';
  const text = String(value);
  return /[",\r\n]/.test(text) ? `"${text.replaceAll('"', '""')}"` : text;
}

const lineOf = (values: (CellValue | undefined)[]) => values.map((value) => field(value)).join(',') + '\n';

export function csvOf(rows: Rows, chosen: number[]): string {
  const all = chosen.map((row) => rows.fields(row));
  const names = [...new Set(all.flatMap((fields) => Object.keys(fields)))];
  return [lineOf(names), ...all.map((fields) => lineOf(names.map((name) => fields[name])))].join('');
}

const piece = 1000; // rows at a time

/// Lets the page go on after each piece.
async function inPieces<Item, Result>(items: Item[], take: (item: Item) => Result): Promise<Result[]> {
  const results: Result[] = [];
  for (let i = 0; i < items.length; i += piece) {
    for (const item of items.slice(i, i + piece)) results.push(take(item));
    await breath();
  }
  return results;
}

export async function asJSON(rows: Rows, chosen: number[]): Promise<string> {
  const lines = await inPieces(chosen, (row) => JSON.stringify(rows.fields(row)));
  return `[${lines.join(',\n ')}]\n`;
}

/// Like `csvOf`, for many rows.
export async function asCSV(rows: Rows, chosen: number[]): Promise<string> {
  const names = new Set<string>();
  const all = await inPieces(chosen, (row): Fields => {
    const fields = rows.fields(row);
    for (const name of Object.keys(fields)) names.add(name);
    return fields;
  });
  const lines = await inPieces(all, (fields) => lineOf([...names].map((name) => fields[name])));
  return [lineOf([...names]), ...lines].join('');
}

/// Clipboards end a text at its first NUL.
export function copyable(text: string): string {
  return text.replaceAll('\0', '␀');
}

/// Pages from a disk may have no clipboard of their own.
export async function copyText(source: string): Promise<void> {
  const text = copyable(source);
  try {
    await navigator.clipboard.writeText(text);
  } catch {
    const area = document.createElement('textarea');
    area.value = text;
    document.body.append(area);
    area.select();
    const isCopied = document.execCommand('copy');
    area.remove();
    if (!isCopied) throw new Error('the browser does not let this page copy');
  }
}
