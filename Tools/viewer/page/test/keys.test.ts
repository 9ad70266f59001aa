import assert from 'node:assert/strict';
import { test } from 'node:test';
import { captionAt, captionsOf, labelOf } from '../src/model/keys';
import { Track } from '../src/model/track';

type Key = [time: number, code: number, name: string, modifiers?: string];

function track(...keys: Key[]): Track {
  return new Track({
    kind: 'keyboardAction',
    time: Float64Array.from(keys, ([time]) => time),
    columns: {
      characterCode: Int32Array.from(keys, ([, code]) => code),
      characterString: keys.map(([, , name]) => name),
      eventFlagsString: keys.map(([, , , modifiers]) => modifiers ?? 'NONE'),
    },
  });
}

function label(code: number, name: string, modifiers: string, showsKeys = true): string {
  return labelOf({ code, name, modifiers }, showsKeys).text;
}

test('keys are called as the tool calls them', () => {
  assert.equal(label(65, 'A', '(IsVK)'), 'a');
  assert.equal(label(65, 'A', '<Shift>(IsVK)'), 'A');
  assert.equal(label(65, 'A', 'NONE'), 'A');
  assert.equal(label(83, 'S', '<Shift><Cmd>(IsVK)'), '⇧⌘S');
  assert.equal(label(32, ' ', 'NONE'), ' ');
  assert.equal(label(53, '5', 'NONE'), '5');
  assert.equal(label(53, 'percent', '<Shift>(IsVK)'), '%');
  assert.equal(label(190, 'period', '(IsVK)'), '.');
  assert.equal(label(13, 'returnKey', 'NONE'), '[returnKey]');
  assert.equal(label(38, 'up', '<Ctrl>(IsVK)'), '⌃[up]');
  assert.equal(label(0x20ac, '€', 'NONE'), '€');
  assert.equal(label(0xd800, 'key 55296', 'NONE'), '[key 55296]');
  assert.equal(label(1, 'key 1', 'NONE'), '[key 1]');
});

test('what was typed is masked, keys that type nothing are not', () => {
  assert.equal(label(65, 'A', '(IsVK)', false), '•');
  assert.equal(label(65, 'A', '<Cmd>(IsVK)', false), '⌘•');
  assert.equal(label(13, 'returnKey', 'NONE', false), '[returnKey]');
  assert.equal(label(38, 'up', '(IsVK)', false), '[up]');
  assert.equal(label(39, "'", 'NONE', false), '•');
  assert.equal(label(97, 'key 97', '(IsVK)', false), '•'); // it may type a character
});

test('keys near each other make a caption, Return ends it', () => {
  const keys = track([1, 72, 'H'], [1.2, 73, 'I'], [1.4, 13, 'returnKey'], [1.6, 79, 'O'], [3, 75, 'K']);
  const captions = captionsOf(keys, true);
  assert.deepEqual(
    captions.map(({ text, start, end }) => [text, start, end]),
    [
      ['HI [returnKey]', 1, 2.9],
      ['O', 1.6, 3.1],
      ['K', 3, 4.5],
    ],
  );
});

test('a caption is no longer than a line', () => {
  const many = captionsOf(track(...Array.from({ length: 50 }, (_, i): Key => [i / 10, 65, 'A'])), true);
  assert.deepEqual(
    many.map(({ text }) => text.length),
    [42, 8],
  );
});

test('keys appear as they are pressed', () => {
  const captions = captionsOf(track([1, 72, 'H'], [1.2, 73, 'I'], [1.4, 83, 'S', '<Cmd>']), true);
  const at = (time: number) => captionAt(captions, 0, time)?.text;
  assert.deepEqual(
    [at(0.9), at(1), at(1.3), at(1.5), at(2.8), at(2.9)],
    [undefined, 'H', 'HI', 'HI ⌘S', 'HI ⌘S', undefined],
  );
});

test('the next caption takes the place of one that is still there', () => {
  const captions = captionsOf(track([1, 72, 'H'], [1.1, 13, 'returnKey'], [1.5, 73, 'I']), true);
  assert.equal(captionAt(captions, 0, 1.6), undefined);
  assert.equal(captionAt(captions, 1, 1.6)?.text, 'I');
});

test('a recording without keys has no captions', () => {
  assert.deepEqual(captionsOf(undefined, true), []);
});
