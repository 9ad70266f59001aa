// Large movies, which are read in slices: by a worker, in Node, and from a source of the caller. Node has no reader of
// workers; the one here reads from a file.

import assert from 'node:assert/strict';
import { closeSync, ftruncateSync, openSync, readdirSync, readSync, statSync, writeFileSync, writeSync } from 'node:fs';
import { open } from 'node:fs/promises';
import { join } from 'node:path';
import { after, before, test } from 'node:test';
import { pathToFileURL } from 'node:url';
import { bytesOf, load, recordedSession, temporaryFolder, zulm } from './support.mjs';

const { Recording, ZulmError } = await load('zulmetadata.js');
const { openFile } = await load('node.js');
const folder = temporaryFolder(after);
const { movie } = recordedSession(folder);

/** A part of a file that is only read when it is asked for. */
class FileSlice extends Blob {
  constructor(path, start = 0, end = statSync(path).size) {
    super();
    Object.assign(this, { path, start, end });
  }
  get size() {
    return this.end - this.start;
  }
  slice(start, end) {
    return new FileSlice(this.path, this.start + start, Math.min(this.start + end, this.end));
  }
}

const traffic = { reads: 0, bytes: 0 };

before(() => {
  globalThis.FileReaderSync = class {
    readAsArrayBuffer({ path, start, size }) {
      const file = openSync(path, 'r');
      const bytes = new Uint8Array(size);
      readSync(file, bytes, 0, size, start);
      closeSync(file);
      traffic.reads += 1;
      traffic.bytes += size;
      return bytes.buffer;
    }
  };
});

/** The session behind so many bytes of pictures, of which none is stored. */
function movieOf(media) {
  const path = join(folder, `${media}.mp4`);
  const session = Buffer.from(bytesOf(movie));
  const header = Buffer.alloc(16);
  header.writeUInt32BE(1, 0);
  header.write('mdat', 4);
  header.writeBigUInt64BE(BigInt(media), 8);
  const file = openSync(path, 'w');
  writeSync(file, header, 0, 16, 0);
  ftruncateSync(file, media);
  writeSync(file, session, 0, session.length, media);
  closeSync(file);
  return path;
}

test('reads a few blocks of a movie of 10 GiB', async () => {
  const path = movieOf(10 * 2 ** 30);
  Object.assign(traffic, { reads: 0, bytes: 0 });
  const recording = await Recording.open(new FileSlice(path), path);
  const opened = { ...traffic };
  assert.equal(recording.streams.length, 17);
  assert.equal(recording.dump(), zulm('dump', '--format', 'json', path).stdout);
  assert.ok(opened.bytes < 2 ** 20, `${opened.bytes} bytes in ${opened.reads} reads to open it`);
  assert.ok(traffic.bytes < 2 ** 22, `${traffic.bytes} bytes in ${traffic.reads} reads for all of it`);
});

test('reads the same in slices as at once', async () => {
  const sliced = await Recording.open(new FileSlice(movie), movie);
  const whole = await Recording.open(bytesOf(movie), movie);
  assert.equal(sliced.dump(), whole.dump());
  assert.deepEqual(sliced.verify(), whole.verify());
});

const openFiles = () => readdirSync('/proc/self/fd').length;

test('Node reads a movie of 10 GiB from its file', async () => {
  const path = movieOf(10 * 2 ** 30);
  const before = openFiles();
  for (const file of [path, pathToFileURL(path)]) {
    const recording = await openFile(file);
    assert.equal(openFiles(), before + 1);
    assert.equal(recording.dump(), zulm('dump', '--format', 'json', path).stdout);
    recording.close();
    recording.close();
    assert.equal(openFiles(), before);
    assert.throws(() => recording.info(), ZulmError);
  }
});

test('Node leaves a handle that is open to whoever opened it', async () => {
  const handle = await open(movie);
  const recording = await openFile(handle, 'session.mp4');
  assert.equal(recording.info().path, 'session.mp4');
  assert.equal(recording.dump(), (await Recording.open(bytesOf(movie), 'session.mp4')).dump());
  recording.close();
  assert.equal((await handle.stat()).size, statSync(movie).size);
  await handle.close();
});

test('Node closes what turns out to be no recording, and says which it was', async () => {
  const before = openFiles();
  const text = join(folder, 'text.txt');
  writeFileSync(text, Buffer.alloc(5000, 1));
  for (const path of [text, folder, join(folder, 'missing.mp4')])
    await assert.rejects(openFile(path), (error) => error instanceof ZulmError && error.message.includes(path));
  assert.equal(openFiles(), before);
});

test('reads from a source of the caller, and closes it once', async () => {
  const bytes = bytesOf(movie);
  const reads = [];
  let closed = 0;
  const source = {
    size: bytes.length,
    read: (position, size) => (reads.push(size), bytes.subarray(position, position + size)),
    close: () => ++closed,
  };
  const recording = await Recording.open(source, 'session.mp4');
  assert.equal(recording.streams.length, 17);
  assert.ok(reads.length > 0 && Math.max(...reads) <= 2 ** 16, `${reads}`);
  recording.close();
  recording.close();
  assert.equal(closed, 1);
  const noRecording = (position, size) => new Uint8Array(size).fill(1);
  await assert.rejects(Recording.open({ ...source, read: noRecording }), ZulmError);
  assert.equal(closed, 2);
});

test('a source that does not return bytes is refused, and what it throws is the cause', async () => {
  const failure = new Error('the archive is broken');
  const fail = () => {
    throw failure;
  };
  for (const [read, isCause] of [
    [fail, (cause) => cause === failure],
    [async () => new Uint8Array(8), (cause) => cause instanceof TypeError],
    [(position, size) => new Uint8Array(size + 1), (cause) => cause instanceof TypeError],
  ])
    await assert.rejects(Recording.open({ size: 1000, read }, 'a.mp4'), (error) => {
      assert.ok(error instanceof ZulmError, error);
      return isCause(error.cause);
    });
});
