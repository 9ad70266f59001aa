// Cursor images as the page draws them. Browsers know PNG; TIFF is decoded in a worker, one picture at a time.

import { requireDrawablePNG } from './png';
import type { Pixels } from './tiff';
import ImageWorker from './worker?worker&inline';

const patience = 1000; // milliseconds for one picture

let worker: Worker | undefined;
let last: Promise<unknown> = Promise.resolve();

function isTIFF(bytes: Uint8Array): boolean {
  const start = String.fromCharCode(...bytes.subarray(0, 4));
  return start === 'II*\0' || start === 'MM\0*';
}

function ask(bytes: Uint8Array): Promise<Pixels> {
  return new Promise((done, failed) => {
    const asked = (worker ??= new ImageWorker());
    const giveUp = () => {
      clearTimeout(timer);
      asked.terminate();
      worker = undefined; // the next picture starts another one
      failed(new Error('it could not be decoded in time'));
    };
    const timer = setTimeout(giveUp, patience);
    asked.onerror = giveUp;
    asked.onmessage = ({ data }: MessageEvent<Pixels | string>) => {
      clearTimeout(timer);
      if (typeof data === 'string') failed(new Error(data));
      else done(data);
    };
    asked.postMessage(bytes);
  });
}

function decodedTIFF(bytes: Uint8Array): Promise<Pixels> {
  const answer = last.then(() => ask(bytes));
  last = answer.catch(() => {});
  return answer;
}

/// Rejects what is neither PNG nor TIFF, and what is larger than any cursor.
export async function bitmapOf(bytes: Uint8Array): Promise<ImageBitmap> {
  if (!isTIFF(bytes)) {
    requireDrawablePNG(bytes);
    return createImageBitmap(new Blob([bytes as BlobPart]));
  }
  const { width, height, data } = await decodedTIFF(bytes);
  return createImageBitmap(new ImageData(data, width, height));
}
