// Lanes as the reader wants them: fewer, in another order, higher, always in sight.

import assert from 'node:assert/strict';
import { test } from 'node:test';
import { open, opened, ready, recordedSession, textOf } from './support.mjs';

const recording = recordedSession();

async function withLanes(work, options = {}) {
  const { page, problems, close } = await open(recording.page, options);
  await opened(page);
  await ready(page);
  await page.waitForFunction(() => document.querySelectorAll('.lane-label').length > 4);
  await work(page);
  assert.deepEqual(problems, []);
  await close();
}

function names(page) {
  return page.evaluate(() => [...document.querySelectorAll('.lane-label')].map(({ dataset }) => dataset.lane));
}

function untilNames(page, wanted) {
  return page.waitForFunction(
    (wanted) => [...document.querySelectorAll('.lane-label')].map(({ dataset }) => dataset.lane).join() === wanted,
    wanted.join(),
  );
}

async function dialog(page) {
  await page.keyboard.press('a');
  await page.waitForFunction(() => document.getElementById('lanes-dialog').open);
}

const label = (page, name) => page.locator(`.lane-label[data-lane="${name}"]`);

test('a lane is dragged to another place, and stays there in the next visit', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  const before = await names(page);
  const [from, to] = [await label(page, 'Clicks').boundingBox(), await label(page, before[0]).boundingBox()];
  await page.mouse.move(from.x + 30, from.y + 8);
  await page.mouse.down();
  await page.mouse.move(to.x + 30, to.y + 12, { steps: 4 });
  await page.mouse.up();
  const moved = ['Clicks', ...before.filter((name) => name !== 'Clicks')];
  await untilNames(page, moved);
  await page.reload();
  await opened(page);
  await untilNames(page, moved);
  await close();
});

test('the edge below a name makes its lane higher, and what is drawn grows with it', () =>
  withLanes(async (page) => {
    const height = () => label(page, 'Clicks').evaluate((element) => element.offsetHeight);
    const canvas = () => page.locator('.lanes-canvas').evaluate((element) => element.offsetHeight);
    const [before, all] = [await height(), await canvas()];
    const edge = await label(page, 'Clicks').locator('.lane-edge').boundingBox();
    await page.mouse.move(edge.x + 20, edge.y + 2);
    await page.mouse.down();
    await page.mouse.move(edge.x + 20, edge.y + 42, { steps: 4 });
    await page.mouse.up();
    await page.waitForFunction((all) => document.querySelector('.lanes-canvas').offsetHeight === all + 40, all);
    assert.equal(await height(), before + 40);
    await label(page, 'Clicks').locator('.lane-edge').dblclick();
    await page.waitForFunction((all) => document.querySelector('.lanes-canvas').offsetHeight === all, all);
  }));

test('the keyboard hides, moves, pins and resizes lanes', () =>
  withLanes(async (page) => {
    const before = await names(page);
    await dialog(page);
    await page.getByRole('switch', { name: 'Show Keys' }).focus();
    await page.keyboard.press('Space');
    await untilNames(page, before.filter((name) => name !== 'Keys'));
    await page.getByRole('button', { name: 'Move Clicks up' }).focus();
    await page.keyboard.press('Enter');
    const place = before.indexOf('Clicks');
    const moved = before.filter((name) => name !== 'Keys');
    [moved[place - 1], moved[place]] = [moved[place], moved[place - 1]];
    await untilNames(page, moved);
    await page.waitForFunction(() => document.activeElement.getAttribute('aria-label') === 'Move Clicks up');
    await page.keyboard.press('Alt+ArrowDown');
    await untilNames(page, before.filter((name) => name !== 'Keys'));
    await page.getByRole('button', { name: 'Make Clicks higher' }).press('Enter');
    await page.getByRole('button', { name: 'Pin CPU usage' }).press('Enter');
    await page.waitForFunction(() => document.querySelector('.lane-label').dataset.lane === 'CPU usage');
    await page.getByRole('button', { name: 'As they were' }).press('Enter');
    await untilNames(page, before);
    await page.keyboard.press('Escape');
    await page.waitForFunction(() => !document.getElementById('lanes-dialog').open);
  }));

test('a pinned lane stays in sight, and the tip tells what is seen', () =>
  withLanes(
    async (page) => {
      await dialog(page);
      await page.getByRole('button', { name: 'Pin CPU usage' }).click();
      await page.keyboard.press('Escape');
      await page.waitForFunction(() => document.querySelector('.pinned-labels .lane-label'));
      const box = await page.locator('.lanes-scroll').boundingBox();
      await page.evaluate(() => (document.querySelector('.lanes-scroll').scrollTop = 1000));
      await page.waitForFunction(() => document.querySelector('.lanes-scroll').scrollTop > 20);
      for (const name of ['.pinned-labels', '.pinned-canvas'])
        assert.ok(Math.abs((await page.locator(name).boundingBox()).y - box.y) < 1, `${name} is at the top`);
      await page.mouse.move(box.x + box.width * 0.6, box.y + 10);
      await page.waitForFunction(() => document.querySelector('.tip').textContent.includes('CPU usage'));
      await page.mouse.move(box.x + box.width * 0.6, box.y + box.height - 6);
      await page.waitForFunction(() => !document.querySelector('.tip').textContent.includes('CPU usage'));
      const drawn = await page.evaluate(() => {
        const canvas = document.querySelector('.pinned-canvas');
        const { data } = canvas.getContext('2d').getImageData(0, 0, canvas.width, canvas.height);
        return data.filter((value, i) => i % 4 === 3 && value > 0).length;
      });
      assert.ok(drawn > 100, 'the pinned lane is drawn');
    },
    { size: [1280, 520] },
  ));

test('a page without storage arranges lanes too', () =>
  withLanes(
    async (page) => {
      await dialog(page);
      await page.getByRole('switch', { name: 'Show Keys' }).click();
      await page.waitForFunction(() => !document.querySelector('.lane-label[data-lane="Keys"]'));
    },
    {
      before: () => {
        const refuse = () => {
          throw new Error('no storage');
        };
        Object.defineProperty(globalThis, 'localStorage', { get: refuse });
      },
    },
  ));

for (const [what, options, zoom] of [
  ['a narrow screen', { size: [360, 740] }, ''],
  ['text twice as large', { size: [1024, 768] }, '200%'],
  ['forced colours', { size: [360, 740], forcedColors: 'active' }, ''],
])
  test(`the dialog of the lanes and the notes have room with ${what}`, () =>
    withLanes(async (page) => {
      await page.evaluate((zoom) => zoom && document.documentElement.style.setProperty('font-size', zoom), zoom);
      await dialog(page);
      const isCut = () => {
        const outer = document.getElementById('lanes-dialog');
        const edge = outer.getBoundingClientRect();
        return [...outer.querySelectorAll('button, input')].some((element) => {
          const { left, right } = element.getBoundingClientRect();
          return left < edge.left || right > edge.right + 0.5;
        });
      };
      assert.equal(await page.evaluate(isCut), false, 'no control is cut');
      await page.keyboard.press('Escape');
      await page.getByRole('tab', { name: 'Notes' }).click();
      await page.waitForFunction(() => !document.getElementById('pane-notes').hidden);
      const side = await page.locator('.side').boundingBox();
      for (const control of await page.locator('#pane-notes button, #pane-notes input:not([hidden]), .tabs button').all()) {
        const box = await control.boundingBox();
        assert.ok(box.x >= side.x - 0.5 && box.x + box.width <= side.x + side.width + 0.5, await control.textContent());
      }
      assert.notEqual(await textOf(page, '.notes-status'), '');
    }, options));
