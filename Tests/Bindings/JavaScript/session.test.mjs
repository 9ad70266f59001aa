// What holds at a time, what follows from a recording, and retiming: the same numbers as in C++.

import assert from 'node:assert/strict';
import { after, test } from 'node:test';
import { bytesOf, load, recordedSession, sessionNumbers, temporaryFolder } from './support.mjs';

const { Recording, ZulmError } = await load('zulmetadata.js');
const { movie } = recordedSession(temporaryFolder(after));
const edits = {
  schema: 'zulm.edits',
  schema_version: 1,
  pieces: [
    { start: '1', end: '19/3', speed: '3/2' },
    { at: '7', duration: '1' },
  ],
};
const expected = sessionNumbers(movie, JSON.stringify(edits));
const recording = await Recording.open(bytesOf(movie), movie);

function plain(value) {
  if (value instanceof Uint8Array) return Array.from(value);
  if (typeof value === 'bigint') return String(value);
  return Number.isNaN(value) ? null : value;
}

const listOf = (column) => Array.from(column, plain);

function plainTable({ time, columns }) {
  const lists = Object.entries(columns).map(([name, column]) => [name, listOf(column)]);
  return { time: listOf(time), ...Object.fromEntries(lists) };
}

test('knows what holds at any time', () => {
  assert.deepEqual(plainTable(recording.at(expected.times)), expected.states);
  assert.deepEqual(plainTable(recording.at(expected.times, { interpolate: 'none' })), expected.held);
});

test('knows what follows from the recording', () => {
  for (const [name, table] of Object.entries(expected.insights))
    assert.deepEqual(plainTable(recording.insights(name)), table, name);
  assert.ok(expected.insights.clicks.time.length > 0);
  assert.deepEqual(plainTable(recording.insights('idle', { least: 3 })), expected.least_3);
});

test('retimes every stream', () => {
  const streams = recording.retime(edits);
  assert.deepEqual(
    streams.map(({ kind }) => kind),
    expected.retimed.kind,
  );
  streams.forEach(({ bytes, moved, carried, added, leftOut, isCopied }, row) => {
    assert.deepEqual(Array.from(bytes), expected.retimed.bytes[row]);
    assert.deepEqual(
      [moved, carried, added, leftOut, Number(isCopied)],
      ['moved', 'carried', 'added', 'left_out', 'is_copied'].map((name) => expected.retimed[name][row]),
    );
  });
  assert.deepEqual(recording.retime(JSON.stringify(edits)), streams);
});

test('has the entries of a kind in the order of their times', () => {
  const { time, columns } = recording.track('cursorLocation');
  assert.equal(time.length, columns.x.length);
  assert.ok(time.every((value, index) => index === 0 || value >= time[index - 1]));
});

test('orders a track by time, and leaves out entries at no time', async () => {
  const stream = new Uint8Array(24 + 4 * 16);
  stream.set(Buffer.from('2b7b6af27a1f11e283d00017f200be7f', 'hex'));
  const view = new DataView(stream.buffer);
  view.setInt32(16, 1, true);
  view.setInt32(20, 16, true);
  [2, NaN, 1, 1].forEach((time, row) => {
    view.setFloat64(24 + 16 * row, time, true);
    view.setInt32(32 + 16 * row, row, true);
  });
  const { time, columns } = (await Recording.open(stream, 'a.dat')).track('cursorLocation');
  assert.deepEqual(time, Float64Array.of(1, 1, 2));
  assert.deepEqual(columns.x, Int32Array.of(2, 3, 0));
});

test('takes one time, and stays open after a wrong argument', () => {
  assert.deepEqual(recording.at(3), recording.at([3]));
  assert.throws(() => recording.at(undefined), TypeError);
  assert.equal(recording.at([1, 2]).time.length, 2);
});

test('reads edit lists of other programs', () => {
  const streams = recording.retime({ ...edits, pieces: [{ start: '1', end: '3' }] });
  assert.deepEqual(recording.retime('1,3\n', { name: 'cuts.csv' }), streams);
  const decisions = '001  AX V C 00:00:01:00 00:00:03:00 00:00:00:00 00:00:02:00\n';
  assert.deepEqual(recording.retime(decisions, { name: 'cuts.edl', frameRate: 25 }), streams);
  assert.throws(() => recording.retime(decisions, { name: 'cuts.edl' }), { message: /^cuts\.edl: / });
});

test('warns of what is missing', async () => {
  const damaged = await Recording.open(bytesOf(movie).subarray(0, -100), 'Torn.mp4');
  const warnings = [];
  damaged.onWarning = (sentence) => warnings.push(sentence);
  const streams = damaged.retime(edits);
  assert.equal(streams.length, 17);
  assert.ok(warnings.length > 0);
  for (const sentence of warnings) assert.match(sentence, /^Torn\.mp4: hoverRect /);
});

test('says what it does not know', () => {
  assert.throws(() => recording.insights('moods'), { name: 'ZulmError', message: 'there are no insights moods' });
  assert.throws(() => recording.insights('idle', { most: 3 }), { message: 'idle has no parameter most' });
  assert.throws(() => recording.insights('camera', { rate: 0 }), ZulmError);
  assert.throws(() => recording.at([0], { interpolate: 'cubic' }), TypeError);
  assert.throws(() => recording.retime('{}'), ZulmError);
  assert.throws(() => recording.retime({ ...edits, pieces: [{ start: '2', end: '1' }] }), ZulmError);
  assert.equal(recording.at([]).time.length, 0);
});
