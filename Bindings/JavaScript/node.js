// Recordings in Node, which are read from their files in slices.

import { closeSync, fstatSync, openSync, readSync } from 'node:fs';
import { fileURLToPath } from 'node:url';
import { Recording, ZulmError } from './zulmetadata.js';

/** Returns the file as a source of bytes. The core waits for every slice, so they are read synchronously. */
function sourceOver(descriptor, close) {
  const stat = fstatSync(descriptor);
  if (!stat.isFile()) throw new Error('is not a file');
  const read = (position, size) => {
    const bytes = new Uint8Array(size);
    let held = 0;
    for (let more = 1; more > 0 && held < size; held += more)
      more = readSync(descriptor, bytes, held, size - held, position + held);
    return bytes.subarray(0, held);
  };
  return { size: stat.size, read, close };
}

function sourceOf(file) {
  if (typeof file?.fd === 'number') return sourceOver(file.fd);
  const descriptor = openSync(file, 'r');
  const close = () => closeSync(descriptor);
  try {
    return sourceOver(descriptor, close);
  } catch (error) {
    close();
    throw error;
  }
}

export async function openFile(file, name) {
  const path = file instanceof URL && file.protocol === 'file:' ? fileURLToPath(file) : file;
  const called = name ?? (typeof path === 'string' ? path : 'recording');
  let source;
  try {
    source = sourceOf(path);
  } catch (error) {
    throw new ZulmError(`${called}: ${error.message}`, { cause: error });
  }
  return Recording.open(source, called);
}
