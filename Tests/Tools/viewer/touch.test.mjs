// Fingers: the lanes are moved and pinched, the ruler and the overview are dragged, the page below still scrolls.

import assert from 'node:assert/strict';
import { test } from 'node:test';
import { open, opened, ready, recordedSession, state, textOf } from './support.mjs';

const recording = recordedSession();

async function touched(size, work) {
  const { page, problems, close } = await open(recording.page, { size, hasTouch: true, isMobile: size[0] < 600 });
  await opened(page);
  await ready(page);
  const session = await page.context().newCDPSession(page);
  const send = (type, points) => session.send('Input.dispatchTouchEvent', { type, touchPoints: points });
  /// Each finger is a list of places, all as long.
  const fingers = async (...paths) => {
    for (let i = 0; i < paths[0].length; ++i)
      await send(
        i === 0 ? 'touchStart' : 'touchMove',
        paths.map((path, id) => ({ ...path[i], id })),
      );
    await send('touchEnd', []);
    await page.waitForTimeout(50);
  };
  await work(page, fingers);
  assert.deepEqual(problems, []);
  await close();
}

/// From one place to another, in steps.
function path(from, to, steps = 8) {
  return Array.from({ length: steps + 1 }, (_, i) => ({
    x: from.x + ((to.x - from.x) * i) / steps,
    y: from.y + ((to.y - from.y) * i) / steps,
  }));
}

const zoomText = (page) => page.evaluate(() => document.querySelector('.zoom-text').textContent);
const seconds = async (page) => Number(/^[\d.]+/.exec(await zoomText(page))?.[0]);

for (const size of [
  [360, 740],
  [1280, 800],
])
  test(`fingers move the lanes at ${size.join(' by ')}`, () =>
    touched(size, async (page, fingers) => {
      const lanes = page.locator('.lanes-body');
      await lanes.scrollIntoViewIfNeeded();
      const box = await lanes.boundingBox();
      const at = (part) => ({ x: box.x + box.width * part, y: box.y + 40 });

      await page.touchscreen.tap(at(0.25).x, at(0.25).y);
      assert.ok(Math.abs((await state(page)).time - 5) < 0.1, 'a tap goes there');

      await fingers(path(at(0.25), at(0.75)));
      assert.ok(Math.abs((await state(page)).time - 15) < 0.1, 'where all is in sight a finger moves the playhead');

      await fingers(path(at(0.45), at(0.2)), path(at(0.55), at(0.8)));
      const length = await seconds(page);
      assert.ok(length > 2 && length < 6, `two fingers zoom: ${await zoomText(page)}`);
      assert.ok(Math.abs((await state(page)).time - 15) < 0.1, 'and leave the playhead where it is');

      await page.touchscreen.tap(at(0.5).x, at(0.5).y);
      const middle = (await state(page)).time;
      assert.ok(Math.abs(middle - 10) < 0.5, `what was between the fingers stays there: ${middle}`);

      await fingers(path(at(0.7), at(0.3)));
      assert.equal((await state(page)).time, middle, 'one finger now moves the lanes');
      await page.touchscreen.tap(at(0.1).x, at(0.1).y);
      assert.ok(Math.abs((await state(page)).time - middle) < 0.1, 'by as much as it went');

      await fingers(path(at(0.2), at(0.45)), path(at(0.8), at(0.55)));
      await fingers(path(at(0.1), at(0.45)), path(at(0.9), at(0.55)));
      assert.equal(await zoomText(page), 'all', 'and fingers that meet show all again');
    }));

test('a finger on the ruler moves the playhead, and nothing else', () =>
  touched([360, 740], async (page, fingers) => {
    const box = await page.locator('.ruler').boundingBox();
    const at = (part) => ({ x: box.x + box.width * part, y: box.y + box.height / 2 });
    await fingers(path(at(0.1), at(0.5)));
    assert.ok(Math.abs((await state(page)).time - 10) < 0.2);
    assert.equal(await page.evaluate(() => scrollY), 0);
  }));

test('a finger that goes up on the lanes scrolls a narrow page', () =>
  touched([360, 740], async (page, fingers) => {
    const box = await page.locator('.lanes-body').boundingBox();
    const from = { x: box.x + 100, y: box.y + 200 };
    const { time } = await state(page);
    await fingers(path(from, { x: from.x, y: from.y - 250 }, 16));
    await page.waitForFunction(() => scrollY > 100);
    assert.equal((await state(page)).time, time);
  }));

test('what a finger must meet is large enough', () =>
  touched([360, 740], async (page) => {
    for (const button of await page.locator('button:visible').all()) {
      const { width, height } = await button.boundingBox();
      assert.ok(Math.min(width, height) >= 24, `${await button.getAttribute('aria-label')}: ${width} by ${height}`);
    }
    await page.locator('#frame').tap();
    assert.equal((await state(page)).playing, true);
    assert.equal(await textOf(page, '#recording-name'), 'Recording.mp4');
  }));
