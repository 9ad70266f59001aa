// Takes the pictures of the documentation: node screenshots.mjs FOLDER, with the settings of the tests.

import { mkdirSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { open, opened, ready, recordedSession, seek } from './support.mjs';

const output = process.argv[2];
if (!output) throw new Error('usage: node screenshots.mjs FOLDER');
mkdirSync(output, { recursive: true });
const recording = recordedSession();

async function take(name, options, show) {
  const { page, close } = await open(recording.page, options);
  await opened(page);
  await ready(page);
  await page.waitForTimeout(400);
  await show(page);
  await page.evaluate(() => document.activeElement?.blur());
  await page.waitForTimeout(500);
  await page.screenshot({ path: join(output, `${name}.png`) });
  await close();
}

test('pictures', async () => {
  await take('playing', {}, async (page) => {
    await page.keyboard.press('t');
    await seek(page, 4.35);
  });
  await take('light', { theme: 'light' }, async (page) => {
    await page.getByRole('tab', { name: 'Facts' }).click();
    await page.keyboard.press('t');
    await seek(page, 3.1);
  });
  await take('heat-map', {}, async (page) => {
    await page.keyboard.press('7');
    await page.getByRole('tab', { name: 'Check' }).click();
    await seek(page, 14.45);
  });
  await take('zoomed', { theme: 'light' }, async (page) => {
    await page.getByLabel('Stream', { exact: true }).selectOption('cursorAction');
    await page.keyboard.press('6');
    await seek(page, 8.1);
    for (let i = 0; i < 2; ++i) await page.keyboard.press('+');
  });
  await take('narrow', { size: [360, 740] }, (page) => seek(page, 18.35));
});
