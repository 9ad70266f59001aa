// Rows as texts for other programs.

import type { CellValue, Rows } from './rows';

export function asJSON(rows: Rows, chosen: Iterable<number>): string {
  const lines: string[] = [];
  for (const row of chosen) lines.push(JSON.stringify(rows.fields(row)));
  return `[${lines.join(',\n ')}]\n`;
}

function field(value: CellValue | undefined): string {
  if (value === null || value === undefined) return '';
  const text = String(value);
  return /[",\r\n]/.test(text) ? `"${text.replaceAll('"', '""')}"` : text;
}

export function asCSV(rows: Rows, chosen: Iterable<number>): string {
  const all = [...chosen].map((row) => rows.fields(row));
  const names = [...new Set(all.flatMap((fields) => Object.keys(fields)))];
  return [names, ...all.map((fields) => names.map((name) => fields[name]))]
    .map((values) => values.map((value) => field(value)).join(',') + '\n')
    .join('');
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
