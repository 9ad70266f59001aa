import assert from 'node:assert/strict';
import { test } from 'node:test';
import { memoryText } from '../src/model/format';
import { captionAt, captionText, keyCap } from '../src/model/keys';
import { Track } from '../src/model/track';

type Key = [time: number, label: string, isTyped: boolean, first: number, end: number];

/// As the library makes it.
function track(...keys: Key[]): Track {
  return new Track({
    kind: 'keyboardAction',
    time: Float64Array.from(keys, ([time]) => time),
    columns: {
      label: keys.map(([, label]) => label),
      is_typed: Int32Array.from(keys, ([, , isTyped]) => Number(isTyped)),
      first: Int32Array.from(keys, ([, , , first]) => first),
      end: Float64Array.from(keys, ([, , , , end]) => end),
    },
  });
}

const textAt = (keys: Track, time: number) => captionText(captionAt(keys, time));

test('keys appear as they are pressed, and stay until their caption ends', () => {
  const keys = track([1, 'H', true, 0, 2.9], [1.2, 'I', true, 0, 2.9], [1.4, '⌘S', false, 0, 2.9]);
  assert.deepEqual(
    [0.9, 1, 1.3, 1.5, 2.8, 2.9].map((time) => textAt(keys, time)),
    ['', 'H', 'HI', 'HI ⌘S', 'HI ⌘S', ''],
  );
});

test('the next caption takes the place of one that is still there', () => {
  const keys = track([1, 'H', true, 0, 2.6], [1.1, '[returnKey]', false, 0, 2.6], [1.5, 'I', true, 2, 3]);
  assert.deepEqual([textAt(keys, 1.4), textAt(keys, 1.5), textAt(keys, 2.9)], ['H [returnKey]', 'I', 'I']);
});

test('typed keys are one text, other keys stand alone', () => {
  const keys = track(
    [1, 'a', true, 0, 9],
    [2, ' ', true, 0, 9],
    [3, 'b', true, 0, 9],
    [4, '[tab]', false, 0, 9],
    [5, '[tab]', false, 0, 9],
    [6, 'c', true, 0, 9],
  );
  assert.deepEqual(captionAt(keys, 7), [
    { text: 'a b', isTyped: true },
    { text: '[tab]', isTyped: false },
    { text: '[tab]', isTyped: false },
    { text: 'c', isTyped: true },
  ]);
  assert.equal(textAt(keys, 7), 'a b [tab] [tab] c');
});

test('a key with a name shows without brackets on a cap', () => {
  assert.deepEqual(['[returnKey]', '⌃[up]', '⌘S', '['].map(keyCap), ['Return', '⌃↑', '⌘S', '[']);
});

test('a recording without keys has no captions', () => {
  assert.deepEqual(captionAt(undefined, 1), []);
});

test('keys are called as on a keyboard', () => {
  assert.equal(keyCap('[returnKey]'), 'Return');
  assert.equal(keyCap('⇧⌘[left]'), '⇧⌘←');
  assert.equal(keyCap('[f12]'), 'F12');
  assert.equal(keyCap('[key 200]'), 'Key 200');
  assert.equal(keyCap('⌘S'), '⌘S');
  assert.equal(keyCap('[]'), '[]');
  assert.equal(keyCap(']'), ']');
});

test('memory is told in gigabytes', () => {
  assert.equal(memoryText('24105MB'), '24 GB');
  assert.equal(memoryText('512 MB'), '0.5 GB');
  assert.equal(memoryText('plenty'), 'plenty');
});
