// Which rows a reader looks for: words, and comparisons such as x>800 or action=left.

import { breath } from '../ui/breath';
import type { Rows } from './rows';
import type { RowTest } from './words';

type Test = (rows: Rows, row: number) => boolean;

const comparison = /^([a-z]\w*)(>=|<=|!=|>|<|=)(.+)$/i;

function comparing(name: string, operator: string, wanted: string): Test {
  const number = Number(wanted);
  const text = wanted.toLowerCase();
  const isNumber = wanted.trim() !== '' && !Number.isNaN(number);
  return (rows, row) => {
    const value = rows.value(row, name === 'time' ? 'timestamp' : name);
    if (value === undefined || value === null) return false;
    if (operator === '=' || operator === '!=') {
      const isEqual =
        isNumber && typeof value === 'number' ? value === number : String(value).toLowerCase().includes(text);
      return isEqual === (operator === '=');
    }
    const left = Number(value);
    if (!isNumber || Number.isNaN(left)) return false;
    if (operator === '>') return left > number;
    if (operator === '<') return left < number;
    return operator === '>=' ? left >= number : left <= number;
  };
}

function containing(word: string): Test {
  let asked: Rows | undefined;
  let test: RowTest | undefined;
  return (rows, row) => {
    if (rows !== asked || !test) [asked, test] = [rows, rows.wordTest(word)];
    return test(row);
  };
}

/// Words in quotation marks may hold spaces. Every word must fit. Null where nothing is looked for.
export function testOf(query: string): Test | null {
  const words =
    query
      .match(/[^\s"]*"[^"]*"?|\S+/g)
      ?.map((word) => word.replaceAll('"', ''))
      .filter(Boolean) ?? [];
  const tests = words.map((word) => {
    const parts = comparison.exec(word);
    return parts ? comparing(parts[1]!, parts[2]!, parts[3]!) : containing(word.toLowerCase());
  });
  return tests.length === 0 ? null : (rows, row) => tests.every((test) => test(rows, row));
}

const slice = 12; // milliseconds at a time, so that everything else goes on
const news = 150; // milliseconds from one report to the next

/// Calls `found` with what is known so far, at last with all of it. Ends early once `isObsolete` says so.
export async function filterRows(
  rows: Rows,
  test: Test,
  isObsolete: () => boolean,
  found: (matches: Uint32Array, isDone: boolean) => void,
): Promise<void> {
  let matches = new Uint32Array(1024);
  let used = 0;
  let reported = -Infinity;
  for (let row = 0; row < rows.count;) {
    const end = performance.now() + slice;
    while (row < rows.count && performance.now() < end)
      for (const stop = Math.min(rows.count, row + 256); row < stop; ++row) {
        if (!test(rows, row)) continue;
        if (used === matches.length) matches = grown(matches);
        matches[used++] = row;
      }
    const isDone = row >= rows.count;
    if (isDone || performance.now() - reported > news) {
      found(matches.slice(0, used), isDone);
      reported = performance.now();
    }
    if (!isDone) await breath();
    if (isObsolete()) return;
  }
  if (rows.count === 0) found(matches.slice(0, 0), true);
}

function grown(matches: Uint32Array): Uint32Array<ArrayBuffer> {
  const larger = new Uint32Array(matches.length * 2);
  larger.set(matches);
  return larger;
}
