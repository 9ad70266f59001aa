// Takes the pictures of the documentation: node screenshots.mjs FOLDER, with the settings of the tests. ZULM_RECORD names
// the recorder; without it the pictures of a real desktop are left out. With --every it takes pictures of the whole page
// instead, in both themes, at four widths, and with text of both sizes.

import { mkdirSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { parseArgs } from 'node:util';
import { enlarge, open, opened, ready, recordedDesktop, recordedSession, seek, zulm } from './support.mjs';

const { values: options, positionals } = parseArgs({ options: { every: { type: 'boolean' } }, allowPositionals: true });
const [output] = positionals;
if (!output) throw new Error('usage: node screenshots.mjs [--every] FOLDER');
mkdirSync(output, { recursive: true });

async function take(recording, name, { text = 100, isWhole = false, ...options }, show) {
  const { page, close } = await open(recording.page, options);
  await opened(page);
  await ready(page);
  await enlarge(page, text);
  // The browser makes its window as high as the page for a picture of all of it; the scroll bar would leave a gap.
  if (isWhole) await page.evaluate(() => (document.documentElement.style.scrollbarWidth = 'none'));
  await page.waitForTimeout(400);
  await show(page);
  await page.evaluate(() => document.activeElement?.blur());
  await page.waitForTimeout(500);
  await page.screenshot({ path: join(output, `${name}.png`), fullPage: isWhole });
  await close();
}

test('a real desktop', { skip: options.every || !process.env.ZULM_RECORD }, async () => {
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

test('a simulated session', { skip: options.every }, async () => {
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

const sizes = [
  [1440, 900],
  [1024, 768],
  [500, 900],
  [360, 740],
];

test('every size, in both themes', { skip: !options.every }, async () => {
  const recording = recordedSession();
  for (const theme of ['dark', 'light'])
    for (const text of [100, 200])
      for (const size of sizes)
        await take(
          recording,
          `${theme}-${size[0]}-${text}`,
          { theme, size, text, isWhole: true, hash: '#t=4.35&range=3-9' },
          async (page) => {
            await page.waitForFunction(() => document.querySelector('.range-facts').textContent.includes('idle'));
            if (theme === 'light') await page.getByRole('tab', { name: 'Facts' }).click();
            await page.evaluate(() => scrollTo(0, 0));
          },
        );
});
