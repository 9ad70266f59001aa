import assert from 'node:assert/strict';
import { test } from 'node:test';
import { deflateSync } from 'node:zlib';
import { pixelsOfTIFF } from '../src/images/tiff';

interface Picture {
  samples: number[];
  channels?: number;
  compression?: number;
  isBig?: boolean;
  tags?: [number, number][];
  strips?: Uint8Array[];
  width?: number;
}

/// Two rows of pixels in one strip each.
function tiff({ samples, channels = 4, compression = 1, isBig = false, tags = [], ...rest }: Picture): Uint8Array {
  const width = rest.width ?? samples.length / channels / 2;
  const half = samples.length / 2;
  const strips = rest.strips ?? [Uint8Array.from(samples.slice(0, half)), Uint8Array.from(samples.slice(half))];
  const size = strips.reduce((sum, strip) => sum + strip.length, 0);
  const offsets = [8, 8 + strips[0]!.length];
  const long = (value: number, ...more: number[]) => ({ type: 4, values: [value, ...more] });
  const fields = new Map([
    [256, long(width)],
    [257, long(2)],
    [258, long(8)],
    [259, long(compression)],
    [262, long(channels > 2 ? 2 : 1)],
    [273, long(8 + size, 2)],
    [277, long(channels)],
    [278, long(1)],
    [279, long(16 + size, 2)],
    ...tags.map(([tag, value]) => [tag, long(value)] as const),
  ]);
  const start = 24 + size;
  const bytes = new Uint8Array(start + 2 + fields.size * 12 + 4);
  const view = new DataView(bytes.buffer);
  const isLittle = !isBig;
  bytes.set(isBig ? [77, 77, 0, 42] : [73, 73, 42, 0]);
  view.setUint32(4, start, isLittle);
  bytes.set(strips[0]!, offsets[0]);
  bytes.set(strips[1]!, offsets[1]);
  strips.forEach((strip, i) => {
    view.setUint32(8 + size + 4 * i, offsets[i]!, isLittle);
    view.setUint32(16 + size + 4 * i, strip.length, isLittle);
  });
  view.setUint16(start, fields.size, isLittle);
  [...fields]
    .sort(([a], [b]) => a - b)
    .forEach(([tag, { type, values }], i) => {
      const at = start + 2 + 12 * i;
      view.setUint16(at, tag, isLittle);
      view.setUint16(at + 2, type, isLittle);
      view.setUint32(at + 4, values[1] ?? 1, isLittle);
      view.setUint32(at + 8, values[0]!, isLittle);
    });
  return bytes;
}

const [extraSamples, predictor, tileWidth, planar] = [338, 317, 322, 284];
const samples = [10, 20, 30, 40, 50, 60, 70, 80, 90, 100, 110, 120, 130, 140, 150, 160];
const straight: [number, number][] = [[extraSamples, 2]];
const halves = [Uint8Array.from(samples.slice(0, 8)), Uint8Array.from(samples.slice(8))];

test('rows of four samples are pixels, in both orders of bytes', () => {
  for (const isBig of [false, true]) {
    const { width, height, data } = pixelsOfTIFF(tiff({ samples, isBig, tags: straight }));
    assert.deepEqual([width, height, [...data]], [2, 2, samples]);
  }
});

test('deflated rows are inflated', () => {
  const strips = halves.map((half) => new Uint8Array(deflateSync(half)));
  assert.deepEqual([...pixelsOfTIFF(tiff({ samples, compression: 8, strips, tags: straight })).data], samples);
});

test('rows of differences are summed up', () => {
  const steps = [10, 20, 30, 40, 40, 40, 40, 40, 90, 100, 110, 120, 40, 40, 40, 40];
  const strips = [steps.slice(0, 8), steps.slice(8)].map((half) => new Uint8Array(deflateSync(Uint8Array.from(half))));
  const file = tiff({ samples, compression: 8, strips, tags: [...straight, [predictor, 2]] });
  assert.deepEqual([...pixelsOfTIFF(file).data], samples);
});

test('packed bytes are unpacked', () => {
  const strips = [
    Uint8Array.of(7, 10, 20, 30, 40, 50, 60, 70, 80),
    Uint8Array.of(128, 253, 9, 3, 1, 2, 3, 4), // nothing, four times 9, and four bytes as they are
  ];
  const file = tiff({ samples, compression: 32773, strips, tags: straight });
  assert.deepEqual([...pixelsOfTIFF(file).data], [...samples.slice(0, 8), 9, 9, 9, 9, 1, 2, 3, 4]);
  const short = tiff({ samples, compression: 32773, strips: [strips[0]!, strips[0]!.subarray(0, 5)], tags: straight });
  assert.throws(() => pixelsOfTIFF(short), /end too early/);
});

test('what alpha was multiplied into becomes whole', () => {
  const multiplied = [25, 50, 0, 51, 0, 0, 0, 0, 255, 1, 2, 255, 25, 50, 0, 51];
  const expected = [125, 250, 0, 51, 0, 0, 0, 0, 255, 1, 2, 255, 125, 250, 0, 51];
  const packed = [multiplied.slice(0, 8), multiplied.slice(8)].map((half) => Uint8Array.of(7, ...half));
  const tags: [number, number][] = [[extraSamples, 1]];
  assert.deepEqual([...pixelsOfTIFF(tiff({ samples: multiplied, tags })).data], expected);
  const file = tiff({ samples: multiplied, compression: 32773, strips: packed, tags });
  assert.deepEqual([...pixelsOfTIFF(file).data], expected);
});

test('pictures without alpha are opaque', () => {
  assert.deepEqual(
    [...pixelsOfTIFF(tiff({ samples: samples.slice(0, 6), channels: 3 })).data],
    [10, 20, 30, 255, 40, 50, 60, 255],
  );
  assert.deepEqual(
    [...pixelsOfTIFF(tiff({ samples: samples.slice(0, 2), channels: 1 })).data],
    [10, 10, 10, 255, 20, 20, 20, 255],
  );
});

test('what cannot be shown is refused', () => {
  assert.throws(() => pixelsOfTIFF(tiff({ samples, width: 40_000 })), /its size is 40000/);
  assert.throws(() => pixelsOfTIFF(tiff({ samples, tags: [[planar, 2]] })), /not in rows/);
  assert.throws(
    () => pixelsOfTIFF(tiff({ samples, tags: [...[tileWidth, 323, 324, 325].map((tag) => [tag, 16] as [number, number])] })),
    /not in rows/,
  );
  assert.throws(() => pixelsOfTIFF(tiff({ samples, compression: 7 })), /Unsupported Compression/);
  const whole = tiff({ samples, tags: straight });
  for (let end = 0; end < whole.length; ++end) assert.throws(() => pixelsOfTIFF(whole.subarray(0, end)), `${end}`);
});
