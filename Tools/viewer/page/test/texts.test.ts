import assert from 'node:assert/strict';
import { test } from 'node:test';
import { copyable } from '../src/entries/copy';
import { requireDrawablePNG } from '../src/images/png';
import { shown } from '../src/model/format';

test('signs that are not seen, or that turn a text, show themselves', () => {
  assert.equal(shown('plain – 日本 عربي\tand\nmore'), 'plain – 日本 عربي\tand\nmore');
  assert.equal(shown('a\u202Eb\u2066c\u200Fd'), 'a[U+202E]b[U+2066]c[U+200F]d');
  assert.equal(shown('\0\x1b\x7f\x85'), '␀␛[U+007F][U+0085]');
});

test('a copy does not end at a NUL', () => {
  assert.equal(copyable('before\0after'), 'before␀after');
});

test('a picture is judged by its header', () => {
  const header = (width: number, height: number) => {
    const bytes = new Uint8Array(33);
    bytes.set([0x89, 0x50, 0x4e, 0x47, 0x0d, 0x0a, 0x1a, 0x0a, 0, 0, 0, 13, 0x49, 0x48, 0x44, 0x52]);
    new DataView(bytes.buffer).setUint32(16, width);
    new DataView(bytes.buffer).setUint32(20, height);
    return bytes;
  };
  requireDrawablePNG(header(1, 1024));
  assert.throws(() => requireDrawablePNG(header(1025, 1)), /1025 × 1/);
  assert.throws(() => requireDrawablePNG(header(16, 0)), /16 × 0/);
  assert.throws(() => requireDrawablePNG(header(4e9, 4e9)));
  assert.throws(() => requireDrawablePNG(header(16, 16).subarray(0, 32)), /no picture/);
  assert.throws(() => requireDrawablePNG(new Uint8Array(99)), /no picture/);
});
