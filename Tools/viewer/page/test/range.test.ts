import assert from 'node:assert/strict';
import { test } from 'node:test';
import { prepare } from '../src/model/prepared';
import type { Decoded } from '../src/model/session';
import { adjustmentIn, asRecorded, partsOfAdjustment, shifted, shiftedTable } from '../src/adjust/adjustment';
import { decimal } from '../src/model/decimals';
import { joined } from '../src/model/joining';
import { rangeIn, rangeText, withParts } from '../src/model/link';
import { concatListOf, editListOf } from '../src/range/exports';
import { Selection } from '../src/range/selection';

test('parts of a link are set, replaced and taken away, and others stay', () => {
  assert.equal(withParts('#t=3', [['range', '1-2']]), '#t=3&range=1-2');
  assert.equal(withParts('#range=5-6&t=3&other=', [['range', '1-2']]), '#range=1-2&t=3&other=');
  assert.equal(withParts('#range=5-6&t=3', [['range', undefined]]), '#t=3');
});

test('numbers are written without an exponent and without digits that say nothing', () => {
  assert.deepEqual([0, 1.5, 0.1 + 0.2, 1e-7, -1e-7, 100, -2.25].map(decimal), ['0', '1.5', '0.3', '0', '0', '100', '-2.25']);
});

test('a range in a link has two times in order', () => {
  assert.equal(rangeText({ from: 1.5, to: 3 }), '1.5-3');
  assert.deepEqual(rangeIn('1.5-3'), { from: 1.5, to: 3 });
  for (const text of [undefined, '', '3', '3-1', '1-2-3', 'a-b', '1e3-2e3']) assert.equal(rangeIn(text), undefined, text);
});

test('in and out points move one edge, or make a range with an end of the recording', () => {
  const selection = new Selection();
  selection.start(10);
  selection.setIn(4);
  assert.deepEqual(selection.range, { from: 4, to: 10 });
  selection.setOut(6);
  assert.deepEqual(selection.range, { from: 4, to: 6 });
  selection.setIn(8);
  assert.deepEqual(selection.range, { from: 8, to: 10 });
  selection.setOut(3);
  assert.deepEqual(selection.range, { from: 0, to: 3 });
  selection.select(12, -4);
  assert.deepEqual(selection.range, { from: 0, to: 10 });
  selection.select(5, 5);
  assert.equal(selection.range, undefined);
});

test('a selection ends where the movie ends, also after the movie became shorter', () => {
  const selection = new Selection();
  let told = 0;
  selection.onChange = () => ++told;
  selection.start(20);
  selection.select(5, 20);
  selection.setDuration(18);
  assert.deepEqual([selection.range, told], [{ from: 5, to: 18 }, 2]);
  selection.setDuration(18);
  assert.equal(told, 2);
  selection.setDuration(4);
  assert.equal(selection.range, undefined);
});

test('extending keeps the edge where the selection began', () => {
  const selection = new Selection();
  selection.start(10);
  selection.extend(5, 6);
  selection.extend(6, 7);
  assert.deepEqual(selection.range, { from: 5, to: 7 });
  selection.extend(7, 3);
  assert.deepEqual(selection.range, { from: 3, to: 5 });
});

test('lists for other programs hold exact times and any name', () => {
  assert.equal(
    editListOf({ from: 0.1 + 0.2, to: 12 }),
    '{"schema":"zulm.edits","schema_version":1,"pieces":[{"start":"0.3","end":"12"}]}\n',
  );
  assert.match(concatListOf({ from: 1, to: 2 }, "Bérénice's movie.mp4"), /^file 'Bérénice'\\''s movie\.mp4'$/m);
});

test('an adjustment is read from a link as it was written', () => {
  const adjustment = { offset: -12.5, region: { x: -1920, y: 0, width: 1280, height: 720 } };
  assert.equal(withParts('#t=1', partsOfAdjustment(adjustment)), '#t=1&offset=-12.5&region=-1920,0,1280,720');
  assert.deepEqual(adjustmentIn('#t=1&offset=-12.5&region=-1920,0,1280,720'), adjustment);
  for (const hash of ['', '#offset=x', `#offset=${'9'.repeat(400)}`, `#region=0,0,${'9'.repeat(400)},5`, '#region=1,2,3', '#region=0,0,0,5']) assert.deepEqual(adjustmentIn(hash), asRecorded);
  assert.deepEqual(adjustmentIn('#region=1,2,3,4', adjustment), { offset: -12.5, region: { x: 1, y: 2, width: 3, height: 4 } });
  assert.deepEqual(adjustmentIn('#offset=2', adjustment), { ...adjustment, offset: 2 });
});

test('an offset moves every time, and those of streams without order', async () => {
  const time = Float64Array.of(5, 1);
  const stream = { kind: 'cursorAction', time, columns: {} };
  const prepared = prepare([stream]);
  const decoded = { length: 8, streams: [], entries: [stream], hidden: [], prepared } as unknown as Decoded;
  const moved = await shifted(decoded, 2);
  assert.equal(moved.length, 10);
  assert.deepEqual([...moved.entries[0]!.time], [7, 3]);
  assert.deepEqual([...moved.prepared!.order.cursorAction!.times], [3, 7]);
  assert.deepEqual([...time], [5, 1]);
});

test('an offset moves all times of a table and nothing else', () => {
  const columns = { end: Float64Array.of(2, 3), x: Float64Array.of(7, 8) };
  const moved = shiftedTable({ kind: 'clicks', time: Float64Array.of(1, 2), columns }, 0.5);
  assert.deepEqual([...moved.time], [1.5, 2.5]);
  assert.deepEqual(moved.columns, { end: Float64Array.of(2.5, 3.5), x: columns.x });
});

test('a movie and its stream files are one file to the library', async () => {
  const file = (name: string, text: string) => Object.assign(new Blob([text]), { name }) as File;
  const { name, contents, movie } = joined([file('a.dat', 'stream'), file('m.mp4', 'movie'), file('b.DAT', 'two')]);
  assert.deepEqual([name, movie?.name], ['m.mp4', 'm.mp4']);
  const bytes = Buffer.from(await contents.arrayBuffer());
  assert.equal(bytes.toString('latin1', 0, 5), 'movie');
  assert.equal(bytes.toString('latin1', 9, 13), 'ZULM');
  assert.equal(bytes.readBigUInt64BE(13), BigInt(bytes.length - 5));
  assert.equal(bytes.toString('latin1', 25, 29), 'DATA');
  assert.equal(bytes.readBigUInt64BE(29), 22n);
  assert.equal(bytes.toString('latin1', 37, 43), 'stream');
  assert.equal(bytes.toString('latin1', bytes.length - 3), 'two');
  assert.throws(() => joined([file('a.mp4', ''), file('b.mp4', '')]), /one movie at a time/);
  assert.throws(() => joined([file('a.avi', ''), file('b.dat', '')]), /MP4 or MOV movie only/);
});
