// Files that are damaged, and sources that fail: whatever they hold, there is data or a message in words.

import assert from 'node:assert/strict';
import { test } from 'node:test';
import { bytesOf, damagedFiles, load, reportsOf, zulm } from './support.mjs';

const { Recording, ZulmError } = await load('zulmetadata.js');

/** Gives what `work` gives, or its error. A core that broke down is none of the errors that may come out. */
async function tried(work) {
  try {
    return await work();
  } catch (error) {
    assert.ok(error instanceof ZulmError, `${error.stack}`);
    assert.ok(!(error.cause instanceof WebAssembly.RuntimeError), `${error.message}: ${error.cause?.stack}`);
    assert.match(error.message, /\S/);
    return error;
  }
}

async function readAll(bytes, name) {
  const recording = await tried(() => Recording.open(bytes, name));
  if (recording instanceof ZulmError) return undefined;
  const read = {
    dump: await tried(() => recording.dump()),
    info: await tried(() => recording.info()),
    verify: await tried(() => recording.verify()),
  };
  for (const { kind } of recording.streams) await tried(() => recording.entries(kind));
  for (const name of ['captions', 'clicks', 'idle', 'zooms', 'cursor_speed']) await tried(() => recording.insights(name));
  await tried(() => recording.at([0, 1]));
  for (const index of recording.hidden.keys()) await tried(() => recording.hiddenEntries(index));
  return read;
}

/** A document without what the run of the tool complained of. */
const withoutErrors = (document) => document?.replace(/"errors":\[[^]*$/, '');

/** Files whose damage is inside an image, of which the core reads no more than the size. */
const damagedImages = ['cut-short', 'surplus-pixels', 'takes-the-type', 'too-many-pixels', 'wrong-sum'].map(
  (damage) => `/cursor-image-${damage}.dat`,
);

test('tells of every damaged file what the tool tells, unless an image is damaged inside', async () => {
  const files = damagedFiles().filter((file) => !damagedImages.some((name) => file.endsWith(name)));
  assert.ok(files.length > 100, `${files.length} files`);
  const info = reportsOf('info', files);
  const verify = reportsOf('verify', files);
  for (const file of files) {
    const read = await readAll(bytesOf(file), file);
    assert.equal(withoutErrors(read?.dump), withoutErrors(zulm('dump', '--format', 'json', file).stdout), file);
    assert.deepEqual(read.info, info.get(file));
    assert.deepEqual(read.verify, verify.get(file));
  }
});

test('knows a damaged image by the size that it states', async () => {
  const [file] = damagedFiles().filter((path) => path.endsWith('/cursor-image-wrong-sum.dat'));
  const recording = await Recording.open(bytesOf(file), file);
  const [{ entries }] = JSON.parse(recording.dump()).files[0].streams;
  assert.deepEqual(entries[0].image, { width: 2, height: 1, bytes: 77 });
  assert.equal(recording.verify().damaged, false);
});

test('lives through damaged files under any name', async () => {
  for (const file of damagedFiles())
    for (const name of ['a.mp4', 'a.avi', 'a.dat', 'a']) await readAll(bytesOf(file), name);
});

test('lives through changed bytes and cut ends', async () => {
  let state = 1;
  const random = (limit) => (state = (Math.imul(state, 1664525) + 1013904223) >>> 0) % limit;
  for (const file of damagedFiles().filter((_, index) => index % 3 === 0)) {
    const bytes = bytesOf(file);
    for (let round = 0; round < 6 && bytes.length > 0; ++round) {
      const changed = bytes.slice(0, round % 2 ? random(bytes.length) + 1 : bytes.length);
      for (let flip = 0; flip < 1 + round; ++flip) changed[random(changed.length)] = random(256);
      await readAll(changed, file);
    }
  }
});

test('says that a source cannot be read', async () => {
  globalThis.FileReaderSync = class {
    readAsArrayBuffer() {
      throw new DOMException('The file was changed', 'NotReadableError');
    }
  };
  try {
    const error = await tried(() => Recording.open(new File([new Uint8Array(100)], 'Gone.mp4')));
    assert.match(error.message, /^Gone\.mp4: .*cannot be read/);
    assert.equal(error.cause?.name, 'NotReadableError');
  } finally {
    delete globalThis.FileReaderSync;
  }
});
