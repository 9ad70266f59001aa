import assert from 'node:assert/strict';
import { test } from 'node:test';
import { clampedRange, tickDigits, ticks, tickStep, zoomed } from '../src/lanes/axis';
import { drawBands, LaneCanvas } from '../src/lanes/lane';
import { Extremes } from '../src/model/extremes';
import type { Palette } from '../src/ui/palette';
import { randomNumbers, syntheticEntries } from './synthetic';

test('the extremes of any run are those of its values', () => {
  const random = randomNumbers(3);
  const values = Float32Array.from({ length: 137 }, () => random() * 200 - 100);
  const extremes = new Extremes(values);
  for (let first = 0; first < values.length; first += 5)
    for (let end = first + 1; end <= values.length; end += 7) {
      const run = values.slice(first, end);
      assert.deepEqual(extremes.of(first, end), [Math.min(...run), Math.max(...run)]);
    }
  assert.deepEqual(extremes.of(4, 4), [Infinity, -Infinity]);
});

test('marks on the axis have round numbers and room', () => {
  assert.equal(tickStep({ from: 0, to: 20 }, 1000, 84), 2);
  assert.equal(tickStep({ from: 0, to: 3600 }, 1000, 84), 600);
  assert.equal(tickStep({ from: 0, to: 90000 }, 1000, 84), 10800);
  assert.deepEqual(ticks({ from: 1.5, to: 6 }, 2), [2, 4, 6]);
  assert.deepEqual([tickDigits(2), tickDigits(0.5), tickDigits(0.02), tickDigits(0.001)], [0, 1, 2, 3]);
});

test('a range stays inside the recording', () => {
  assert.deepEqual(clampedRange({ from: -5, to: 5 }, 20), { from: 0, to: 10 });
  assert.deepEqual(clampedRange({ from: 15, to: 25 }, 20), { from: 10, to: 20 });
  assert.deepEqual(clampedRange({ from: -5, to: 50 }, 20), { from: 0, to: 20 });
});

test('zooming keeps the time below the pointer where it is', () => {
  const { from, to } = zoomed({ from: 0, to: 20 }, 5, 0.5, 20);
  assert.deepEqual([from, to], [2.5, 12.5]);
  const near = zoomed({ from: 4, to: 4.06 }, 4.03, 0.01, 20);
  assert.ok(Math.abs(near.to - near.from - 0.05) < 1e-9);
  assert.deepEqual(zoomed({ from: 5, to: 15 }, 10, 100, 20), { from: 0, to: 20 });
});

/// Draws bands on ten seconds of a thousand pixels, and returns which of them, by their colours.
function drawnBands(times: number[]): string[] {
  const drawn: string[] = [];
  const context = { fillStyle: '', beginPath() {}, roundRect() {}, stroke() {}, fill: () => drawn.push(context.fillStyle) };
  const canvas = new LaneCanvas(context as never, {} as Palette, { from: 0, to: 10 }, 1000, 0, 20);
  drawBands(canvas, Float64Array.from(times), (index) => {
    const [start, end] = [times[index]!, times[index + 1] ?? 10];
    return { start, end, text: '', colour: String(index), edge: '' };
  });
  return drawn;
}

test('a band that holds for long is drawn, however soon it follows on a short one', () => {
  assert.deepEqual(drawnBands([0, 3, 3.001, 6]), ['0', '1', '2', '3']);
  assert.deepEqual(drawnBands([0, 3, 3.001, 3.002, 3.003, 6]), ['0', '1', '4', '5']);
  assert.ok(drawnBands(Array.from({ length: 100_000 }, (_, i) => i / 10_000)).length <= 1000);
});

test('the synthetic hour has what a real one has', () => {
  const entries = new Map(syntheticEntries(3600).map((stream) => [stream.kind, stream]));
  assert.equal(entries.get('cursorLocation')!.time.length, 216000);
  assert.ok(entries.get('keyboardAction')!.time.length > 15000);
  const images = entries.get('cursorImage')!.columns.image as (Uint8Array | null)[];
  assert.equal(images.filter(Boolean).length, 200);
  assert.equal(entries.size, 17);
});
