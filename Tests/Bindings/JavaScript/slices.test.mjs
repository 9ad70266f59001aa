// Large movies, which a worker reads in slices. Node has no reader for that; this one reads from a file.

import assert from 'node:assert/strict';
import { closeSync, ftruncateSync, openSync, readSync, statSync, writeSync } from 'node:fs';
import { join } from 'node:path';
import { after, before, test } from 'node:test';
import { bytesOf, load, recordedSession, temporaryFolder, zulm } from './support.mjs';

const { Recording } = await load('zulmetadata.js');
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
