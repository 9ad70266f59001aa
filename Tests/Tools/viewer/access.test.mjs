// For everybody: no serious fault that axe finds, at any size, in both themes; nothing that leaves the screen.

import assert from 'node:assert/strict';
import { readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { axeSource, emptyPage, folder, open, opened, ready, recordedSession, seek } from './support.mjs';

const recording = recordedSession();
const empty = join(folder, 'empty.html');
writeFileSync(empty, emptyPage(readFileSync(recording.page, 'utf8')));

async function faults(page) {
  await page.evaluate(axeSource);
  const { violations, passes } = await page.evaluate(() => axe.run());
  assert.ok(passes.length > 10, `only ${passes.length} rules were checked`);
  return violations
    .filter(({ impact }) => impact === 'serious' || impact === 'critical')
    .map(
      ({ id, nodes }) => `${id}: ${nodes.map(({ html, failureSummary }) => `${html} ${failureSummary}`).join('; ')}`,
    );
}

const views = {
  welcome: { path: empty, show: async () => {} },
  entries: { path: recording.page, show: (page) => seek(page, 3.2) },
  facts: { path: recording.page, show: (page) => page.getByRole('tab', { name: 'Facts' }).click() },
  check: { path: recording.page, show: (page) => page.getByRole('tab', { name: 'Check' }).click() },
  layers: { path: recording.page, show: (page) => page.locator('#layers-button').click() },
  help: { path: recording.page, show: (page) => page.locator('#help-button').click() },
  about: { path: recording.page, show: (page) => page.locator('#about-button').click() },
};

for (const [name, { path, show }] of Object.entries(views))
  test(`axe finds no serious fault: ${name}`, async () => {
    for (const [theme, size] of [
      ['dark', [1280, 800]],
      ['light', [360, 740]],
    ]) {
      const { page, close } = await open(path, { theme, size });
      if (path !== empty) {
        await opened(page);
        await ready(page);
      }
      await show(page);
      await page.waitForTimeout(200);
      assert.deepEqual(await faults(page), [], `${theme} ${size}`);
      await close();
    }
  });

for (const size of [
  [360, 740],
  [768, 1024],
  [1280, 800],
  [3840, 2160],
])
  test(`nothing is wider than the screen at ${size.join(' by ')}`, async () => {
    const { page, close } = await open(recording.page, { size });
    await opened(page);
    await ready(page);
    const { width, stage } = await page.evaluate(() => ({
      width: document.documentElement.scrollWidth,
      stage: document.getElementById('frame').getBoundingClientRect().width,
    }));
    assert.ok(width <= size[0], `${width} pixels`);
    assert.ok(stage > size[0] * 0.3, `the movie is ${stage} pixels wide`);
    for (const button of await page.locator('.transport > button:visible').all()) {
      const box = await button.boundingBox();
      assert.ok(box.x >= 0 && box.x + box.width <= size[0], `${await button.getAttribute('id')} is at ${box.x}`);
    }
    await close();
  });

test('whoever wants less motion gets no trail', async () => {
  const drawn = async (reducedMotion) => {
    const { page, close } = await open(recording.page, { reducedMotion });
    await opened(page);
    for (const layer of ['1', '2', '3', '5']) await page.keyboard.press(layer);
    await seek(page, 1);
    const painted = await page.evaluate(() => {
      const canvas = document.getElementById('overlay');
      const { data } = canvas.getContext('2d').getImageData(0, 0, canvas.width, canvas.height);
      return data.some((value) => value > 0);
    });
    await close();
    return painted;
  };
  assert.equal(await drawn('no-preference'), true);
  assert.equal(await drawn('reduce'), false);
});
