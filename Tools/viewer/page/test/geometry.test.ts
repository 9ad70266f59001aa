import assert from 'node:assert/strict';
import { test } from 'node:test';
import { cursorImageRect, fitted, placementOf, rectToVideo, screenToVideo } from '../src/model/geometry';

const region = { x: 160, y: 90, width: 1280, height: 720 };

test('the corners of the region are the corners of the movie', () => {
  const placement = placementOf(region, 1, { width: 1280, height: 720 });
  assert.deepEqual(screenToVideo({ x: 160, y: 90 }, placement), { x: 0, y: 0 });
  assert.deepEqual(screenToVideo({ x: 1440, y: 810 }, placement), { x: 1280, y: 720 });
});

test('a movie of another size shows the same region', () => {
  const placement = placementOf(region, 1, { width: 640, height: 360 });
  assert.deepEqual(screenToVideo({ x: 800, y: 450 }, placement), { x: 320, y: 180 });
});

test('each direction has its own scale', () => {
  const placement = placementOf(region, 1, { width: 2560, height: 720 });
  assert.deepEqual(screenToVideo({ x: 170, y: 100 }, placement), { x: 20, y: 10 });
});

test('a movie with a scale factor of 2 has two pixels to a unit', () => {
  const placement = placementOf(region, 2, { width: 2560, height: 1440 });
  assert.deepEqual(screenToVideo({ x: 161, y: 92 }, placement), { x: 2, y: 4 });
});

test('without a region the movie shows the screen from its corner', () => {
  const placement = placementOf(undefined, 2, { width: 2560, height: 1440 });
  assert.deepEqual(screenToVideo({ x: 100, y: 50 }, placement), { x: 200, y: 100 });
});

test('without a movie the region has the size in which it was recorded', () => {
  assert.deepEqual(placementOf(region, 2, undefined).frame, { width: 2560, height: 1440 });
});

test('a region without area and a scale factor without meaning count as absent', () => {
  const placement = placementOf({ x: 5, y: 5, width: 0, height: -3 }, Number.NaN, { width: 100, height: 100 });
  assert.deepEqual(screenToVideo({ x: 7, y: 8 }, placement), { x: 7, y: 8 });
});

test('places outside the region lie outside the movie', () => {
  const placement = placementOf(region, 1, { width: 1280, height: 720 });
  assert.deepEqual(screenToVideo({ x: 0, y: 0 }, placement), { x: -160, y: -90 });
});

test('a rectangle keeps its corner and has its size scaled', () => {
  const placement = placementOf(region, 1, { width: 640, height: 360 });
  const rect = rectToVideo({ x: 180, y: 110, width: 100, height: 50 }, placement);
  assert.deepEqual(rect, { x: 10, y: 10, width: 50, height: 25 });
});

test('the hot spot of a cursor image lies on the location', () => {
  const placement = placementOf(region, 1, { width: 2560, height: 1440 });
  const [location, hotSpot] = [
    { x: 400, y: 300 },
    { x: 5, y: 3 },
  ];
  const rect = cursorImageRect(location, hotSpot, { width: 32, height: 24 }, placement);
  const spot = screenToVideo(location, placement);
  assert.deepEqual({ x: rect.x + hotSpot.x * 2, y: rect.y + hotSpot.y * 2 }, spot);
  assert.deepEqual([rect.width, rect.height], [64, 48]);
});

test('sizes are read where they are not properties of the image itself', () => {
  class Bitmap {
    get width(): number {
      return 8;
    }
    get height(): number {
      return 4;
    }
  }
  const rect = cursorImageRect({ x: 160, y: 90 }, { x: 0, y: 0 }, new Bitmap(), placementOf(region, 1, undefined));
  assert.deepEqual(rect, { x: 0, y: 0, width: 8, height: 4 });
});

test('a frame fits into its room and lies in the middle', () => {
  assert.deepEqual(fitted({ width: 1280, height: 720 }, { width: 640, height: 640 }), {
    x: 0,
    y: 140,
    width: 640,
    height: 360,
  });
});
