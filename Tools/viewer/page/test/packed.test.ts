import assert from 'node:assert/strict';
import { test } from 'node:test';
import { deflateSync } from 'node:zlib';
import { PackedFile, piecesOf } from '../src/decoder/packed';
import { randomNumbers } from './synthetic';

/// As PackedBytes.h describes it.
function packed(bytes: Uint8Array): string {
  const differences = bytes.map((byte, i) => byte - (i < 16 ? 0 : bytes[i - 16]!));
  return deflateSync(differences).toString('base64');
}

async function unpacked(text: string, size: number): Promise<Uint8Array> {
  const file = new PackedFile();
  for (const piece of piecesOf(text)) file.take(piece);
  return file.unpacked(size);
}

test('a packed file comes out as it was, in one piece or in many', async () => {
  const random = randomNumbers(2);
  for (const size of [0, 1, 16, 17, 5000, 5_000_000]) {
    const bytes = Uint8Array.from({ length: size }, () => random() * 256);
    assert.deepEqual(Buffer.compare(await unpacked(packed(bytes), size), bytes), 0, String(size));
  }
});

test('a page that was cut short or holds more than it says is not read', async () => {
  const text = packed(new Uint8Array(100));
  await assert.rejects(unpacked(text, 99), /damaged/);
  await assert.rejects(unpacked(text, 101), /cut short/);
  await assert.rejects(unpacked('AAAA', 10));
});
