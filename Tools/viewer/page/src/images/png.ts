// The header of a PNG: it says how much memory the picture wants before any is taken.

import { requireCursorSize } from './size';

const start = [0x89, 0x50, 0x4e, 0x47, 0x0d, 0x0a, 0x1a, 0x0a];

/// Throws unless it is a PNG of a size that a cursor can have.
export function requireDrawablePNG(bytes: Uint8Array): void {
  if (bytes.length < 33 || start.some((value, i) => bytes[i] !== value)) throw new Error('it is no picture');
  const header = new DataView(bytes.buffer, bytes.byteOffset + 16, 8);
  requireCursorSize(header.getUint32(0), header.getUint32(4));
}
