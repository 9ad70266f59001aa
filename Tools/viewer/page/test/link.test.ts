import assert from 'node:assert/strict';
import { test } from 'node:test';
import { hashOf, linkTo, linkToView, partsOf, rangeIn, timeInLink } from '../src/model/link';
import { joined, notesIn, notesText, type NotesFormat } from '../src/model/notes';

test('a link to a time leads to that time', () => {
  assert.equal(linkTo(12.5), '#t=12.5');
  assert.equal(timeInLink('#zoom=1-2&t=12.5&x=y'), 12.5);
  for (const hash of ['', '#t=', '#t=-1', '#t=1e3', '#tt=4', '#t=4s']) assert.equal(timeInLink(hash), undefined, hash);
});

test('parts stand by themselves, and unknown ones are kept', () => {
  const view = { time: 3, zoom: { from: 1.5, to: 20 }, stream: 'cursorAction', filter: 'x>8 & "a b"', layers: ['cursor', 'heat'] };
  const link = linkToView('#range=1.5-3&offset=0.25&t=9', view);
  assert.equal(
    link,
    '#range=1.5-3&offset=0.25&t=3&zoom=1.5-20&stream=cursorAction&filter=x%3E8%20%26%20%22a%20b%22&layers=cursor,heat',
  );
  const parts = partsOf(link);
  assert.equal(parts.get('filter'), view.filter);
  assert.deepEqual(rangeIn(parts.get('zoom')), view.zoom);
  assert.equal(hashOf(parts), link);
  const plain = { ...view, zoom: undefined, stream: '', filter: '', layers: undefined };
  assert.equal(linkToView(link, plain), '#range=1.5-3&offset=0.25&t=3');
  assert.equal(linkToView('#t=1&layers=', { ...plain, layers: [] }), '#t=3&layers=');
});

test('what is no range of time is none, and a lone percent sign does no harm', () => {
  for (const text of [undefined, '', '5', '5-', '7-3', '3-3', 'a-b']) assert.equal(rangeIn(text), undefined);
  assert.equal(partsOf('#filter=100%').get('filter'), '100%');
});

const notes = [
  { time: 0, text: 'start' },
  { time: 62.5, text: 'a "quoted", and\nsecond line' },
  { time: 3723.004, text: 'späť – [x](y) `z`' },
];

test('notes come out of every file as they went in', () => {
  for (const format of ['json', 'csv', 'md'] satisfies NotesFormat[])
    assert.deepEqual(notesIn(notesText(notes, 'Recording.mp4', format)), notes, format);
  assert.equal(notesText(notes.slice(1, 2), 'A.mp4', 'md'), '# Notes on A.mp4\n\n- `1:02.500` a "quoted", and\n  second line\n');
  assert.deepEqual(notesIn('\ufefftime,text\r\n1.5,one\r\n0.5,"t,wo"\r\n'), [
    { time: 0.5, text: 't,wo' },
    { time: 1.5, text: 'one' },
  ]);
});

test('a file without notes is refused, and no note comes twice', () => {
  for (const text of ['', 'hello', '{}', '{"schema": "zulm.notes", "notes": [null, 7]}', '[1', 'time,text\n'])
    assert.throws(() => notesIn(text), text);
  assert.deepEqual(joined(notes.slice(1), notes), notes);
});

test('a file of notes has bounds, and its times are numbers', () => {
  const file = (notes: unknown[]) => JSON.stringify({ schema: 'zulm.notes', schema_version: 1, notes });
  const many = Array.from({ length: 10_001 }, (_, i) => ({ time: i, text: 'note' }));
  assert.throws(() => notesIn(file(many)), /10001 notes.*10000 at most/);
  for (const time of ['', [], true, null]) assert.throws(() => notesIn(file([{ time, text: 'note' }])), /holds no notes/);
  const note = { time: 1, text: 'twice' };
  assert.deepEqual(joined([], [note, { ...note }]), [note]);
});

test('notes keep their times below zero, and their lines', () => {
  const early = [{ time: -7.5, text: 'one\u2028two' }, { time: 0.0000001, text: 'late' }];
  assert.deepEqual(notesIn(notesText(early, 'A.mp4', 'md')), [early[0], { time: 0, text: 'late' }]);
  assert.equal(notesText(early, 'A.mp4', 'csv'), 'time,text\n-7.5,one\u2028two\n0,late\n');
  assert.deepEqual(notesIn('time,text\r-7.5,one\r'), [{ time: -7.5, text: 'one' }]);
  const [exact] = notesIn(notesText([{ time: 1.2344, text: 'note' }], 'A.mp4', 'md'));
  assert.equal(joined([{ time: 1.2344, text: 'note' }], [exact!]).length, 1, 'Markdown has fewer digits');
});
