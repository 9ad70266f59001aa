// The timeline: one axis of time for everything in it, with scroll bars as readers have them.

import assert from 'node:assert/strict';
import { join } from 'node:path';
import { test } from 'node:test';
import { attached, ffmpeg, positionsOf } from './numbered.mjs';
import { drawn, folder, open, opened, ready, recordedSession, seek, state, textOf, waitUntil } from './support.mjs';

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
    const places = () =>
      page.evaluate(() =>
        ['.playhead', '.overview-playhead'].map((name) => {
          const { left, width } = document.querySelector(name).getBoundingClientRect();
          return left + width / 2;
        }),
      );
    const isThere = (place) => Math.abs(place - boxes.ruler.x - (boxes.ruler.width * 18) / 20) < 1;
    await waitUntil(places, (places) => places.every(isThere), (places) => `the playheads are at ${places}`);
  }));

test('a cursor that rests has no speed', async () => {
  const moving = Array.from({ length: 60 }, (_, i) => [i / 60, 10 * i, 100]);
  const again = Array.from({ length: 60 }, (_, i) => [11 + i / 60, 600 - 10 * i, 300]);
  const plain = join(folder, 'rest-plain.mp4');
  ffmpeg('-f', 'lavfi', '-i', 'color=c=gray:s=640x360:r=10', '-t', '12', '-pix_fmt', 'yuv420p', plain);
  const rested = attached('Rest', plain, { cursorLocation: positionsOf([...moving, ...again]) });
  const { page, close } = await open(rested.page);
  await opened(page);
  const speedAt = async (time) => {
    await seek(page, time);
    return textOf(page, '.lane-label:has-text("Cursor speed") .lane-value');
  };
  assert.equal(await speedAt(0.5), '600 px/s');
  assert.equal(await speedAt(5), '0 px/s');
  assert.equal(await speedAt(10.9), '0 px/s');
  assert.equal(await speedAt(11.5), '600 px/s');
  await close();
});

test('the wheel scrolls the lanes, and with Control it zooms them; the tip stays true', () =>
  inLowWindow(async (page) => {
    const box = await page.locator('.lanes-scroll').boundingBox();
    const top = () => page.evaluate(() => document.querySelector('.lanes-scroll').scrollTop);
    await page.mouse.move(box.x + box.width * 0.7, box.y + 30);
    await page.mouse.wheel(0, 60);
    await page.waitForFunction(() => document.querySelector('.lanes-scroll').scrollTop > 20);
    assert.equal(await textOf(page, '.zoom-text'), 'all');
    await page.mouse.move(box.x + box.width * 0.7, box.y + 32);
    const before = await textOf(page, '.tip b');
    const scrolled = await top();
    await page.keyboard.down('Control');
    await page.mouse.wheel(0, -400);
    await page.keyboard.up('Control');
    await page.waitForFunction(() => document.querySelector('.zoom-text').textContent !== 'all');
    await drawn(page);
    assert.equal(await top(), scrolled);
    assert.equal(await textOf(page, '.tip b'), before, 'what is below the pointer stays there');
    await page.keyboard.press('0');
    await page.keyboard.press('Home');
    for (let i = 0; i < 3; ++i) await page.keyboard.press('+');
    await page.waitForFunction((before) => document.querySelector('.tip b').textContent !== before, before);
  }));

test('the wheel over the lanes scrolls a narrow page', async () => {
  const { page, close } = await open(recording.page, { size: [360, 740] });
  await opened(page);
  const box = await page.locator('.lanes-body').boundingBox();
  await page.mouse.move(box.x + 100, box.y + 40);
  await page.mouse.wheel(0, 200);
  await page.waitForFunction(() => scrollY > 100);
  await close();
});
