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

/// Controls that are cut by the edge of the screen, or that lie below another thing; those of the table scroll with it.
function hiddenControls() {
  const width = document.documentElement.clientWidth;
  const controls = [...document.querySelectorAll('button, select, input, [role="tab"]')];
  return controls
    .filter((element) => element.checkVisibility({ visibilityProperty: true }) && element.getBoundingClientRect().width > 0)
    .flatMap((element) => {
      element.scrollIntoView({ block: 'center', inline: 'nearest' });
      const { left, right, top, bottom, width: wide, height } = element.getBoundingClientRect();
      const points = [0.15, 0.5, 0.85].map((part) => document.elementFromPoint(left + wide * part, (top + bottom) / 2));
      const isCovered = points.some((seen) => !seen || !(element.contains(seen) || seen.contains(element)));
      const isSquare = !element.matches('.is-icon') || Math.abs(wide - height) < 2;
      const isCut = left < 0 || right > width + 0.5 || element.scrollWidth > element.clientWidth + 1;
      const name = element.id || element.getAttribute('aria-label') || element.textContent;
      return isCovered || !isSquare || (isCut && !element.matches('input')) ? [`${name} at ${left} to ${right}, ${top}`] : [];
    });
}

for (const [size, text] of [
  [[360, 740], 100],
  [[500, 900], 100],
  [[768, 1024], 100],
  [[1024, 768], 100],
  [[1280, 800], 100],
  [[3840, 2160], 100],
  [[1440, 900], 200],
  [[720, 450], 100], // 1440 by 900, everything twice as large
  [[500, 900], 200],
])
  test(`nothing is cut or covered at ${size.join(' by ')}, text at ${text} %`, async () => {
    const { page, close } = await open(recording.page, { size });
    await page.evaluate((text) => (document.documentElement.style.fontSize = text === 100 ? '' : `${(16 * text) / 100}px`), text);
    await opened(page);
    await ready(page);
    const { width, stage } = await page.evaluate(() => ({
      width: document.documentElement.scrollWidth,
      stage: document.getElementById('frame').getBoundingClientRect().width,
    }));
    assert.ok(width <= size[0], `${width} pixels`);
    assert.ok(stage > size[0] * (text > 100 ? 0.25 : 0.3), `the movie is ${stage} pixels wide`);
    assert.deepEqual(await page.evaluate(hiddenControls), []);
    for (const id of ['frame-back', 'frame-forward', 'full-screen', 'clock-total'])
      assert.ok(await page.locator(`#${id}`).isVisible(), id);
    await close();
  });

test('the movie stays in sight where the page scrolls', async () => {
  for (const size of [[360, 740], [720, 450]]) {
    const { page, close } = await open(recording.page, { size });
    await opened(page);
    await ready(page);
    await page.evaluate(() => scrollTo(0, document.documentElement.scrollHeight));
    await page.waitForFunction(() => scrollY > 100);
    const { y, height } = await page.locator('#frame').boundingBox();
    assert.ok(y >= 0 && height > 100 && y + height < size[1] * 0.7, `${y} to ${y + height}`);
    await close();
  }
});

test('full screen has a scrubber', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  await ready(page);
  assert.equal(await page.locator('#scrubber').isVisible(), false);
  await page.locator('#full-screen').click();
  await page.waitForFunction(() => document.fullscreenElement);
  const box = await page.locator('#scrubber').boundingBox();
  assert.ok(box.y > 0 && box.y + box.height <= page.viewportSize().height);
  await page.mouse.click(box.x + box.width / 2, box.y + box.height / 2);
  const { time } = await page.evaluate(() => zulmViewer.state());
  assert.ok(Math.abs(time - 10) < 0.2, `${time}`);
  await page.keyboard.press('Space');
  await page.waitForFunction(() => zulmViewer.state().playing);
  await close();
});

test('while a recording loads nobody is asked for one', async () => {
  const before = () => {
    globalThis.Worker = class {
      postMessage() {} // takes forever
      terminate() {}
    };
  };
  const { page, close } = await open(recording.page, { before, size: [360, 740] });
  assert.equal(await page.locator('#welcome-title').innerText(), 'Opening Recording.mp4…');
  assert.ok(await page.locator('.welcome progress').isVisible());
  assert.equal(await page.locator('#welcome-open').isVisible(), false);
  await close();
});

test('heads of columns are whole', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  for (const kind of ['cursorImage', 'keyboardAction', 'systemData']) {
    await page.getByLabel('Stream', { exact: true }).selectOption(kind);
    const cut = await page.evaluate(() =>
      [...document.querySelectorAll('.table-head > *')]
        .filter(({ scrollWidth, clientWidth }) => scrollWidth > clientWidth)
        .map(({ textContent }) => textContent),
    );
    assert.deepEqual(cut, [], kind);
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
