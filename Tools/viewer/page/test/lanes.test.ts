import assert from 'node:assert/strict';
import { test } from 'node:test';
import { clampedRange, tickDigits, ticks, tickStep, zoomed } from '../src/lanes/axis';
import { drawBands, LaneCanvas } from '../src/lanes/lane';
import { Extremes } from '../src/model/extremes';
import { speedOf } from '../src/model/speed';
import { Track } from '../src/model/track';
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

function speedAlong(time: number[], x: number[]) {
  const { times, values } = speedOf(
    new Track({
      kind: 'cursorLocation',
      time: Float64Array.from(time),
      columns: { x: Int32Array.from(x), y: new Int32Array(x.length) },
    }),
  );
  return [...times].map((time, i) => [Number(time.toFixed(6)), Math.round(values[i]!)]);
}

test('speed is the way to the next position, and the last one is a rest', () => {
  assert.deepEqual(speedAlong([0, 0.5, 0.5, 1], [0, 50, 80, 80]), [
    [0, 100],
    [0.5, 0],
    [1, 0],
  ]);
});

test('the cursor rests where nothing was recorded, and moves within the last usual distance', () => {
  assert.deepEqual(speedAlong([0, 0.1, 0.2, 0.3, 5, 5.1], [0, 10, 20, 30, 40, 50]), [
    [0, 100],
    [0.1, 100],
    [0.2, 100],
    [0.3, 0],
    [4.9, 100],
    [5, 100],
    [5.1, 0],
  ]);
});

test('entries at one time do not make the usual distance shorter, and an even number of distances has its mean', () => {
  const moves = (time: number[]) => speedAlong(time, time.map((_, i) => 10 * i)).filter(([, speed]) => speed !== 0);
  assert.deepEqual(moves([0, 0, 0, 0, 2, 4, 10, 10]).at(-1), [8, 5], 'the last of 2, 2 and 6 is a rest of 4 and a move of 2');
  assert.deepEqual(moves([0, 1, 4, 9]), [
    [0, 10],
    [1, 3],
    [4, 2],
  ]); // 1, 3, 5: 3 is usual
  assert.deepEqual(moves([0, 1, 2, 5, 14]).at(-1), [12, 5]); // 1, 1, 3, 9: 2 is usual
});

test('the synthetic hour has what a real one has', () => {
  const entries = new Map(syntheticEntries(3600).map((stream) => [stream.kind, stream]));
  assert.equal(entries.get('cursorLocation')!.time.length, 216000);
  assert.ok(entries.get('keyboardAction')!.time.length > 15000);
  const images = entries.get('cursorImage')!.columns.image as (Uint8Array | null)[];
  assert.equal(images.filter(Boolean).length, 200);
  assert.equal(entries.size, 17);
});
