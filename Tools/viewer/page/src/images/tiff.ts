// Pictures out of TIFF files, which browsers do not show. Cursor images may be such files.

import { decode, type TiffIfd } from 'tiff';
import { requireCursorSize } from './size';

/// Straight alpha, row by row.
export interface Pixels {
  width: number;
  height: number;
  data: Uint8ClampedArray<ArrayBuffer>;
}

const packBits = 32773;

/// Returns the pixels of the first picture. Throws if the file is damaged, or stores its pixels in another way than in
/// rows of 8 or 16 bits.
export function pixelsOfTIFF(bytes: Uint8Array): Pixels {
  const [header] = decode(bytes, { pages: [0], ignoreImageData: true });
  if (!header) throw new Error('it holds no picture');
  requireUsual(header, bytes.length);
  if (header.compression === packBits) {
    const pixels = pixelsOf(header, unpacked(header, bytes));
    return header.associatedAlpha ? straightened(pixels) : pixels;
  }
  const [picture] = decode(bytes, { pages: [0] });
  return pixelsOf(picture!, picture!.data);
}

function requireUsual(header: TiffIfd, size: number): void {
  const { width, height, type, bitsPerSample, compression, stripByteCounts } = header;
  requireCursorSize(width, height);
  if (header.tiled || header.planarConfiguration !== 1) throw new Error('its samples are not in rows');
  if (type !== 1 && type !== 2) throw new Error('it is neither grey nor of red, green and blue');
  const isWide = bitsPerSample === 16 && compression !== packBits;
  if (bitsPerSample !== 8 && !isWide) throw new Error(`its samples have ${bitsPerSample} bits`);
  const stored = stripByteCounts?.reduce((sum, count) => sum + count, 0) ?? 0;
  if (stored > size) throw new Error('its rows are larger than the file');
}

/// Each strip is runs of one byte, and bytes as they are.
function unpacked(header: TiffIfd, bytes: Uint8Array): Uint8Array {
  const samples = new Uint8Array(header.width * header.height * header.samplesPerPixel);
  let used = 0;
  header.stripOffsets.forEach((start, i) => {
    const strip = bytes.subarray(start, start + header.stripByteCounts[i]!);
    for (let at = 0; at < strip.length && used < samples.length;) {
      const count = (strip[at++]! << 24) >> 24;
      if (count >= 0) {
        const plain = strip.subarray(at, at + Math.min(count + 1, samples.length - used));
        samples.set(plain, used);
        [at, used] = [at + count + 1, used + plain.length];
      } else if (count > -128) {
        samples.fill(strip[at++] ?? 0, used, used + 1 - count);
        used += 1 - count;
      }
    }
  });
  if (used < samples.length) throw new Error('its rows end too early');
  return samples;
}

type Samples = ArrayLike<number>;

/// The sample that follows the colours is alpha.
function pixelsOf({ width, height, samplesPerPixel: step, type, bitsPerSample }: TiffIfd, samples: Samples): Pixels {
  const data = new Uint8ClampedArray(width * height * 4).fill(255);
  const colours = type === 2 ? 3 : 1;
  const shift = bitsPerSample - 8;
  for (let from = 0, to = 0; to < data.length; from += step, to += 4) {
    for (let k = 0; k < 3; ++k) data[to + k] = samples[from + (k % colours)]! >> shift;
    if (step > colours) data[to + 3] = samples[from + colours]! >> shift;
  }
  return { width, height, data };
}

/// Colours that alpha is multiplied into become whole again.
function straightened({ width, height, data }: Pixels): Pixels {
  data.forEach((value, i) => {
    const alpha = data[i - (i % 4) + 3]!;
    if (i % 4 < 3 && alpha > 0) data[i] = (value * 255) / alpha;
  });
  return { width, height, data };
}
