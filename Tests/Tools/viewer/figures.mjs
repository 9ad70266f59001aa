// Prints the tables of Docs/viewer.md, measured from pictures of the screen and from outside of the browser: node
// figures.mjs, with the settings of the tests.

import { statSync } from 'node:fs';
import { test } from 'node:test';
import { after, differencesOf, look, numberedRecording, settled, watch } from './numbered.mjs';
import {
  longestTask,
  longestTasks,
  longRecording,
  mostMemory,
  open,
  opened,
  ready,
  timeToFind,
  watchingTasks,
  wholeDay,
} from './support.mjs';

const rates = [
  ['10', '10'],
  ['29.97', '30000/1001'],
  ['30', '30'],
  ['60', '60'],
];
const count = 30;

async function measured(recording, work) {
  const { page, close } = await open(recording.page, { size: [1280, 800] });
  await opened(page);
  await ready(page);
  await settled(page);
  const result = await work(page);
  await close();
  return result;
}

/// How many of the steps or seeks show the picture that they ask for, with the cursor of its time.
async function right(recording, page, ask) {
  let found = 0;
  for (let number = 5; number < 5 + count; ++number) {
    await ask(number);
    await settled(page);
    const seen = await look(page);
    const late = after(seen.time, recording.times[number]);
    if (seen.number === number && late > -0.01 && late < 0.11) ++found;
  }
  return `${found} of ${count}`;
}

async function row(name, rate) {
  const recording = numberedRecording(`Figures${name.replace('.', '')}`, { rate, seconds: 8 });
  const go = (page, time) => page.evaluate((time) => zulmViewer.seek(time), time);
  const [up, down = 1] = rate.split('/').map(Number);
  const seeks = await measured(recording, (page) => right(recording, page, (number) => go(page, (number * down) / up)));
  const steps = await measured(recording, async (page) => {
    await go(page, recording.times[4]);
    await settled(page);
    return right(recording, page, () => page.keyboard.press('.'));
  });
  const playing = await measured(recording, async (page) => differencesOf(await watch(page, recording, 6)));
  return [name, steps, seeks, playing.median, playing.nearlyAll, playing.worst];
}

test('figures', async () => {
  const lines = [
    ['pictures a second', 'right steps', 'right seeks', 'median', '95 %', 'worst'],
    ['---:', '---:', '---:', '---:', '---:', '---:'],
  ];
  for (const [name, rate] of rates) lines.push(await row(name, rate));
  process.stdout.write(lines.map((cells) => `| ${cells.join(' | ')} |\n`).join(''));
});

const megabytes = (bytes) => `${(bytes / 1e6).toFixed(0)} MB`;
const milliseconds = (time) => `${time.toFixed(0)} ms`;
const taskText = (time) => (time < 50 ? 'below 50 ms' : milliseconds(time));

test('figures of eight hours', async () => {
  const recording = longRecording('Day', wholeDay);
  const { page, close } = await open(recording.page, { before: watchingTasks });
  await opened(page);
  const memory = await mostMemory();
  const first = await page.evaluate(() => performance.getEntriesByName('zulm:first-picture')[0].startTime);
  await page.waitForFunction(() => document.querySelector('.entries-status').textContent.includes('entries'));
  await page.waitForTimeout(1000);
  const opening = await longestTasks(page);
  const word = await timeToFind(page, 'terminal');
  const digits = await timeToFind(page, '4321');
  const finding = await longestTask(page);
  await close();
  const lines = [
    ['a recording of eight hours', ''],
    ['---', '---:'],
    ['the page', megabytes(statSync(recording.page).size)],
    ['first picture after', milliseconds(first)],
    ['most memory until then', megabytes(memory * 1e6)],
    ['a word is found in', milliseconds(word)],
    ['digits are found in', milliseconds(digits)],
    ['longest task while opening', taskText(opening.any)],
    ['longest of them after the browser has read the page', taskText(opening.own)],
    ['longest task while finding', taskText(finding)],
  ];
  process.stdout.write(lines.map((cells) => `| ${cells.join(' | ')} |\n`).join(''));
});
