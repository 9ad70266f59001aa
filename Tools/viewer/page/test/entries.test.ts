import assert from 'node:assert/strict';
import { test } from 'node:test';
import { asCSV, asJSON, csvOf } from '../src/entries/copy';
import { filterRows, testOf } from '../src/entries/filter';
import { AllRows, StreamRows, type Rows } from '../src/entries/rows';
import { orderOf, picked, placesOf, rankedKeys } from '../src/entries/sorting';
import { mergedOf } from '../src/model/merged';
import { Track } from '../src/model/track';
import { randomNumbers } from './synthetic';

const keys = new Track({
  kind: 'keyboardAction',
  time: Float64Array.of(2, 2.5),
  columns: {
    characterCode: Uint32Array.of(72, 73),
    characterString: ['H', 'I'],
    eventFlagsCode: Uint32Array.of(0, 0),
    eventFlagsString: ['NONE', '<Shift>, "so"'],
  },
});

const points = new Track({
  kind: 'cursorLocation',
  time: Float64Array.of(1, 2, 3, Number.NaN),
  columns: { x: Int32Array.of(100, 200, 900, 4), y: Int32Array.of(5, 6, 7, 8) },
});

async function found(rows: Rows, query: string): Promise<number[]> {
  let result: number[] = [];
  await filterRows(
    rows,
    testOf(query)!,
    () => false,
    (matches, isDone) => isDone && (result = [...matches]),
  );
  return result;
}

test('all streams come by time, entries without a time come never', () => {
  const rows = new AllRows([keys, points], () => true);
  assert.equal(rows.count, 5);
  assert.deepEqual(
    [0, 1, 2, 3, 4].map((row) => [rows.time(row), rows.cell(row, 1)]),
    [
      [1, 'Cursor location'],
      [2, 'Keyboard action'],
      [2, 'Cursor location'],
      [2.5, 'Keyboard action'],
      [3, 'Cursor location'],
    ],
  );
  assert.equal(rows.rowAt(2.2), 2);
});

test('one stream comes as it is stored', () => {
  const rows = new StreamRows(points, () => true);
  assert.equal(rows.count, 4);
  assert.deepEqual(
    rows.columns.map(({ title }) => title),
    ['Time', 'X', 'Y'],
  );
  assert.deepEqual([rows.cell(2, 0), rows.cell(2, 1), rows.cell(3, 0)], ['0:03.000', '900', 'NaN']);
});

test('words and comparisons find rows', async () => {
  const rows = new StreamRows(points, () => true);
  assert.deepEqual(await found(rows, 'x>150'), [1, 2]);
  assert.deepEqual(await found(rows, 'x>=200 y!=7'), [1]);
  assert.deepEqual(await found(rows, 'time<2.5'), [0, 1]);
  assert.deepEqual(await found(rows, '900'), [2]);
  assert.deepEqual(await found(rows, 'nothing'), []);
  assert.equal(testOf('   '), null);
  assert.deepEqual(await found(new AllRows([keys, points], () => true), 'kind=keyboard shift'), [3]);
});

test('what was typed is neither shown nor found nor copied before the reader asks', async () => {
  let shows = false;
  const rows = new StreamRows(keys, () => shows);
  assert.equal(rows.cell(0, 2), '•');
  assert.deepEqual(await found(rows, 'characterString=H'), []);
  assert.deepEqual(await found(rows, 'characterCode=72'), []);
  assert.ok(!(await asJSON(rows, [0])).includes('72') && !csvOf(rows, [0]).includes('H'));
  assert.ok(!new AllRows([keys], () => shows).cell(0, 2).includes('72'));
  shows = true;
  assert.equal(rows.cell(0, 2), 'H');
  assert.deepEqual(await found(rows, 'characterString=H'), [0]);
});

test('rows are copied as JSON and CSV', async () => {
  const rows = new StreamRows(keys, () => true);
  assert.deepEqual(JSON.parse(await asJSON(rows, [1])), [
    {
      characterCode: 73,
      characterString: 'I',
      eventFlagsCode: 0,
      eventFlagsString: '<Shift>, "so"',
      timestamp: 2.5,
    },
  ]);
  assert.equal(
    csvOf(rows, [1]),
    'characterCode,characterString,eventFlagsCode,eventFlagsString,timestamp\n73,I,0,"<Shift>, ""so""",2.5\n',
  );
});

test('copies of several streams have the columns of all', async () => {
  const rows = new AllRows([keys, points], () => true);
  const lines = csvOf(rows, [0, 1]).split('\n');
  assert.equal(lines[0], 'kind,x,y,timestamp,characterCode,characterString,eventFlagsCode,eventFlagsString');
  assert.equal(lines[1], 'cursorLocation,100,5,1,,,,');
  assert.equal(await asCSV(rows, [0, 1]), csvOf(rows, [0, 1]), 'in pieces as at once');
});

test('a phrase is found in one value, and across two fields', async () => {
  const titles = new Track({
    kind: 'topmostWindowTitle',
    time: Float64Array.of(1, 2, 3),
    columns: { title: ['Two words here', 'Two', 'words'], other: ['', 'x', ''] },
  });
  const rows = new AllRows([titles], () => true);
  assert.deepEqual(await found(rows, '"two words"'), [0]);
  assert.deepEqual(await found(rows, '"two  oth"'), [1]);
  assert.deepEqual(await found(rows, '"words two"'), []);
});

test('a word is found in what is shown, however it is looked for', async () => {
  const random = randomNumbers(5);
  const times = Float64Array.from({ length: 400 }, (_, i) => i * 27.3 + random());
  const numbers = new Track({
    kind: 'cursorLocation',
    time: times,
    columns: {
      x: Int32Array.from(times, () => Math.round(random() * 4000 - 1000)),
      opacity: Float64Array.from(times, () => random()),
      title: Array.from(times, (_, i) => `Window ${i % 7}`),
    },
  });
  for (const rows of [new StreamRows(numbers, () => true), new AllRows([keys, numbers], () => true)])
    for (const word of ['12', '-9', '0.5', '1:2', ':07.', 'window 3', 'x', 'x=1', '.3', 'cursor', 'e', '-']) {
      const cells = (row: number) => rows.columns.map((_, column) => rows.cell(row, column).toLowerCase());
      const expected = Array.from({ length: rows.count }, (_, row) => row).filter((row) =>
        cells(row).some((cell) => cell.includes(word)),
      );
      const test = rows.wordTest(word);
      const actual = Array.from({ length: rows.count }, (_, row) => row).filter(test);
      assert.deepEqual(actual, expected, word);
    }
});

test('rows that are equal keep their order, and what is no number comes last', () => {
  const values = [3, 1, Number.NaN, -2, 1, -0.5, 0, -0, Infinity, -Infinity, 3];
  const sorted = (isDescending: boolean) => [...orderOf(Float64Array.from(values), isDescending)];
  assert.deepEqual(sorted(false), [9, 3, 5, 6, 7, 1, 4, 0, 10, 8, 2]);
  assert.deepEqual(sorted(true), [8, 0, 10, 1, 4, 6, 7, 5, 3, 9, 2]);
  const random = randomNumbers(9);
  const many = Float64Array.from({ length: 5000 }, () => Math.floor(random() * 2e9 - 1e9) / (random() < 0.5 ? 1 : 1e6));
  const order = orderOf(many.slice(), false);
  for (let i = 1; i < order.length; ++i) assert.ok(many[order[i - 1]!]! <= many[order[i]!]!);
  const matches = Uint32Array.of(1, 4, 7);
  assert.deepEqual([...picked(Uint32Array.of(7, 3, 4, 1, 0, 2, 5, 6), matches)], [7, 4, 1]);
  assert.deepEqual([...placesOf(Uint32Array.of(2, 0), 4)], [1, -1, 0, -1]);
});

test('all streams by time are merged as one by one', () => {
  const random = randomNumbers(4);
  const track = (kind: string, length: number, step: number) =>
    new Track({ kind, time: Float64Array.from({ length }, () => Math.floor(random() * step)), columns: {} });
  const tracks = [track('a', 30, 20), track('b', 0, 1), track('c', 50, 20), track('d', 3, 9)];
  const { stream, row } = mergedOf(tracks);
  const all = tracks.flatMap((one, k) => Array.from(one.times, (time, i) => ({ time, k, row: one.row(i) })));
  all.sort((a, b) => a.time - b.time || a.k - b.k);
  assert.deepEqual([...stream], all.map(({ k }) => k));
  assert.deepEqual([...row], all.map(({ row }) => row));
});

test('texts have the numbers of their order, and nothing comes last', () => {
  const values = ['b10', 'b9', null, 'A'];
  assert.deepEqual([...rankedKeys(values, Uint32Array.of(0, 1, 2, 3, 0))].map((key, row) => [row, key]).filter(([, key]) => !Number.isNaN(key)).sort((a, b) => a[1]! - b[1]!).map(([row]) => row), [3, 1, 0, 4]);
  assert.ok(Number.isNaN(rankedKeys(values, Uint32Array.of(2))[0]));
});
