// Takes the pictures of the documentation: node screenshots.mjs FOLDER, with the settings of the tests. ZULM_RECORD names
// the recorder; without it the pictures of a real desktop are left out.

import { mkdirSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { open, opened, ready, recordedDesktop, recordedSession, seek, zulm } from './support.mjs';

const output = process.argv[2];
if (!output) throw new Error('usage: node screenshots.mjs FOLDER');
mkdirSync(output, { recursive: true });

async function take(recording, name, options, show) {
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

test('a real desktop', { skip: !process.env.ZULM_RECORD }, async () => {
  const recording = recordedDesktop();
  const actions = zulm('dump', '--stream', 'cursorAction', '--format', 'ndjson', recording.movie)
    .split('\n')
    .filter((line) => line.includes('left'))
    .map((line) => JSON.parse(line));
  const dropped = actions.filter(({ action }) => action === 'left up')[3]; // the terminal, by its title
  await take(recording, 'desktop', {}, async (page) => {
    await page.keyboard.press('t');
    await seek(page, dropped.timestamp - 0.35);
  });
});

test('a simulated session', async () => {
  const recording = recordedSession();
  await take(recording, 'playing', {}, async (page) => {
    await page.keyboard.press('t');
    await seek(page, 4.35);
  });
  await take(recording, 'light', { theme: 'light' }, async (page) => {
    await page.getByRole('tab', { name: 'Facts' }).click();
    await page.keyboard.press('t');
    await seek(page, 3.1);
  });
  await take(recording, 'heat-map', {}, async (page) => {
    await page.keyboard.press('7');
    await page.getByRole('tab', { name: 'Check' }).click();
    await seek(page, 14.45);
  });
  await take(recording, 'zoomed', { theme: 'light' }, async (page) => {
    await page.getByLabel('Stream', { exact: true }).selectOption('cursorAction');
    await page.keyboard.press('6');
    await seek(page, 8.1);
    for (let i = 0; i < 2; ++i) await page.keyboard.press('+');
  });
  await take(recording, 'narrow', { size: [360, 740] }, (page) => seek(page, 18.35));
});
