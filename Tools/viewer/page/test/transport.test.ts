import assert from 'node:assert/strict';
import { test } from 'node:test';
import { StageZoom } from '../src/stage/zoom';
import { placeOf } from '../src/transport/place';
import { afterIdle } from '../src/transport/skipping';

test('a place is a time or the number of a picture', () => {
  const times = { '83.5': 83.5, '1:23.5': 83.5, '1:00:00': 3600, ' 2,5 s ': 2.5, '.25': 0.25, '0:07': 7 };
  for (const [text, time] of Object.entries(times)) assert.deepEqual(placeOf(text), { time }, text);
  for (const text of ['#120', '120f', '# 120 ']) assert.deepEqual(placeOf(text), { frame: 120 }, text);
  for (const text of ['', 'now', '1:2:3:4', '-5', '#1.5', '1e3']) assert.equal(placeOf(text), undefined, text);
});

test('idle times are left out but for half a second at either end', () => {
  const stretches = [
    { start: 5, end: 15 },
    { start: 20, end: 24 },
  ];
  assert.equal(afterIdle(stretches, 4), undefined);
  assert.equal(afterIdle(stretches, 5.2), undefined);
  assert.equal(afterIdle(stretches, 5.5), 14.5);
  assert.equal(afterIdle(stretches, 14.5), undefined);
  assert.equal(afterIdle(stretches, 21), 23.5);
  assert.equal(afterIdle([], 21), undefined);
});

test('zooming keeps the point under the pointer, and the picture fills the stage', () => {
  const zoom = new StageZoom();
  zoom.by(2, 0.25, 0.5);
  assert.deepEqual([zoom.scale, zoom.x, zoom.y], [2, 0.125, 0.25]);
  assert.equal(zoom.x + 0.25 / zoom.scale, 0.25);
  zoom.pan(10, -10);
  assert.deepEqual([zoom.x, zoom.y], [0.5, 0]);
  zoom.by(0.001);
  assert.deepEqual([zoom.scale, zoom.x, zoom.y], [1, 0, 0]);
  zoom.by(1000);
  assert.equal(zoom.scale, 16);
  zoom.reset();
  assert.ok(!zoom.isZoomed);
});
