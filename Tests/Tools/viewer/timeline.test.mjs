// The timeline: one axis of time for everything in it, with scroll bars as readers have them.

import assert from 'node:assert/strict';
import { test } from 'node:test';
import { open, opened, ready, recordedSession, state, textOf } from './support.mjs';

const recording = recordedSession();

/// How much the lanes scroll; they do in a low window.
async function inLowWindow(work, options = {}) {
  const { page, problems, close } = await open(recording.page, { size: [1280, 520], ...options });
  await opened(page);
  await ready(page);
  const hasBar = () => {
    const element = document.querySelector('.lanes-scroll');
    return element.offsetWidth > element.clientWidth;
  };
  assert.ok(await page.evaluate(hasBar), 'a scroll bar takes room beside the lanes');
  await work(page);
  assert.deepEqual(problems, []);
  await close();
}

test('ruler, overview and lanes have one axis', () =>
  inLowWindow(async (page) => {
    const boxes = {};
    for (const name of ['ruler', 'overview', 'lanes-body'])
      boxes[name] = await page.locator(`.timeline .${name}`).boundingBox();
    for (const [name, { x, width }] of Object.entries(boxes))
      assert.deepEqual([x, width], [boxes.ruler.x, boxes.ruler.width], name);
    for (const { x, y, width, height } of [boxes.ruler, boxes['lanes-body']]) {
      await page.mouse.click(x + (width * 18) / 20, y + Math.min(12, height / 2));
      assert.ok(Math.abs((await state(page)).time - 18) < 0.02, `${(await state(page)).time}`);
    }
    await page.waitForTimeout(100);
    const places = await page.evaluate(() =>
      ['.playhead', '.overview-playhead'].map((name) => {
        const { left, width } = document.querySelector(name).getBoundingClientRect();
        return left + width / 2;
      }),
    );
    for (const place of places)
      assert.ok(Math.abs(place - boxes.ruler.x - (boxes.ruler.width * 18) / 20) < 1, `a playhead is at ${place}`);
  }));
