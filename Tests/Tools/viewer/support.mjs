// A browser with the viewer's page in it, and the recordings that it is tested with.
//
// ZULM_PATH names the tool, ZULM_TEST_MODULES the folder in which the packages are installed, ZULM_LONG_RECORDING the
// program that records an hour, ZULM_TEST_DATA the damaged files. CHROMIUM may name the browser.

import assert from 'node:assert/strict';
import { execFileSync, spawnSync } from 'node:child_process';
import { mkdtempSync, readFileSync, rmSync, truncateSync, writeFileSync } from 'node:fs';
import { createRequire } from 'node:module';
import { tmpdir } from 'node:os';
import { join } from 'node:path';
import { after } from 'node:test';
import { fileURLToPath, pathToFileURL } from 'node:url';

export function setting(name) {
  const value = process.env[name];
  if (!value) throw new Error(`${name} is not set`);
  return value;
}

const require = createRequire(join(setting('ZULM_TEST_MODULES'), 'package.json'));
const { chromium } = require('playwright-core');
export const axeSource = require('axe-core').source;

const sources = fileURLToPath(new URL('../../..', import.meta.url));

export const folder = mkdtempSync(join(tmpdir(), 'zulm-viewer-'));
after(() => rmSync(folder, { recursive: true, force: true }));

/// What the tool prints; it works in the folder of the recordings.
export function zulm(...parameters) {
  const { stdout, stderr, status } = spawnSync(setting('ZULM_PATH'), parameters, {
    cwd: folder,
    encoding: 'utf8',
    maxBuffer: 1 << 28,
  });
  assert.equal(status, 0, `zulm ${parameters.join(' ')}: ${stderr}`);
  return stdout;
}

/// The demo's recording over a movie of its windows, with its page beside it.
export function recordedSession() {
  const plain = join(folder, 'plain.mp4');
  execFileSync(join(sources, 'scripts/desktop-movie.sh'), [plain], { stdio: ['ignore', 'ignore', 'inherit'] });
  zulm('demo', '.', '--movie', plain, '--force');
  zulm('view', 'Recording.mp4', '-o', 'Recording.html');
  return { movie: join(folder, 'Recording.mp4'), page: join(folder, 'Recording.html') };
}

/// A recording of an editor and a terminal that somebody uses, with its page beside it.
export function recordedDesktop() {
  const movie = join(folder, 'Desktop.mp4');
  execFileSync('python3', [join(sources, 'Tests/Tools/record/real_desktop.py'), movie], {
    stdio: ['ignore', 'ignore', 'inherit'],
    env: { ...process.env, ZULM_RECORD: setting('ZULM_RECORD') },
  });
  zulm('view', 'Desktop.mp4', '-o', 'Desktop.html');
  return { movie, page: join(folder, 'Desktop.html') };
}

/// What a long recording holds; `rate` is in cursor positions a second.
export const wholeDay = { rate: 174, hours: 8, keys: 100_000, titles: 50_000 };

/// Metadata of an hour, or as long as it says, and a movie of a picture every second, or every ten.
export function longRecording(name, { rate, hours = 1, keys = 20_000, titles = 150 }) {
  const movie = join(folder, `${name}.mp4`);
  const picture = ['-f', 'lavfi', '-i', `color=c=0x202633:s=640x360:r=${hours > 1 ? 0.1 : 1}`, '-t', String(hours * 3600), '-g', '30'];
  const parameters = [
    '-v',
    'error',
    '-y',
    ...picture,
    '-c:v',
    'libx264',
    '-preset',
    'ultrafast',
    '-pix_fmt',
    'yuv420p',
    movie,
  ];
  execFileSync('ffmpeg', parameters, { stdio: ['ignore', 'ignore', 'inherit'] });
  execFileSync(setting('ZULM_LONG_RECORDING'), [movie, join(folder, name), ...[rate, hours, keys, titles].map(String)]);
  zulm('view', `${name}.mp4`, '-o', `${name}.html`);
  return { movie, page: join(folder, `${name}.html`) };
}

const gigabyte = 1024 ** 3;

/// A movie of that many gigabytes, nearly all of it a hole, with an hour of metadata behind it.
export function hugeMovie(gigabytes) {
  const path = join(folder, 'Huge.mp4');
  const type = Buffer.from('\0\0\0\x14ftypisom\0\0\x02\0isom', 'latin1');
  const pictures = Buffer.from('\0\0\0\x01mdat\0\0\0\0\0\0\0\0', 'latin1');
  pictures.writeBigUInt64BE(BigInt(gigabytes * gigabyte), 8);
  writeFileSync(path, Buffer.concat([type, pictures]));
  truncateSync(path, type.length + gigabytes * gigabyte);
  execFileSync(setting('ZULM_LONG_RECORDING'), [path, join(folder, 'huge'), '60']);
  return path;
}

/// The page that `zulm view` wrote, without its recording.
export function emptyPage(text) {
  return text.replace(/<script type="[a-z/]*" id="zulm-(recording|metadata)">[^<]*<\/script>\n?/g, '');
}

let browser;
after(() => browser?.close());

/// The most memory that a process of a page has had so far, in megabytes.
export async function mostMemory() {
  const session = await browser.newBrowserCDPSession();
  const { processInfo } = await session.send('SystemInfo.getProcessInfo');
  await session.detach();
  const pages = processInfo.filter(({ type }) => type === 'renderer');
  const most = pages.map(({ id }) => Number(/VmHWM:\s+(\d+)/.exec(readFileSync(`/proc/${id}/status`, 'utf8'))[1]));
  return (Math.max(...most) * 1024) / 1e6;
}

/// Keeps how long the page was busy at a time, in milliseconds.
export const watchingTasks = () => {
  globalThis.busy = [];
  const watch = (list) => globalThis.busy.push(...list.getEntries().map(({ startTime, duration }) => ({ startTime, duration })));
  new PerformanceObserver(watch).observe({ type: 'longtask', buffered: true });
};

/// The longest of them since it was asked before, and the longest one of the page itself: the browser reads the file of the
/// page before. Those below 50 do not count.
export function longestTasks(page) {
  return page.evaluate(() => {
    const [{ startTime: start }] = performance.getEntriesByName('zulm:start');
    const tasks = globalThis.busy.splice(0);
    const longest = (some) => Math.round(Math.max(0, ...some.map(({ duration }) => duration)));
    return { any: longest(tasks), own: longest(tasks.filter(({ startTime }) => startTime >= start)) };
  });
}

export async function longestTask(page) {
  return (await longestTasks(page)).any;
}

/// The milliseconds until the table shows what fits a filter.
export async function timeToFind(page, words) {
  const field = page.getByLabel('Filter entries');
  await field.fill('');
  await page.evaluate(() => (globalThis.asked = performance.now()));
  await field.fill(words);
  await page.waitForFunction(
    () => / of [^…]*$/.test(document.querySelector('.entries-status').textContent),
    null,
    { timeout: 120_000, polling: 20 },
  );
  return page.evaluate(() => performance.now() - globalThis.asked);
}

/// A page that keeps what went wrong in it and what it asked for. `before` runs in it before its own script.
export async function open(path, { size = [1280, 800], theme = 'dark', hash = '', before, ...more } = {}) {
  browser ??= await chromium.launch({
    executablePath: process.env.CHROMIUM ?? '/usr/bin/chromium',
    args: ['--no-sandbox', '--disable-gpu', '--force-color-profile=srgb'],
    ignoreDefaultArgs: ['--hide-scrollbars'], // readers see them
  });
  const [width, height] = size;
  const context = await browser.newContext({ viewport: { width, height }, colorScheme: theme, ...more });
  const page = await context.newPage();
  if (before) await page.addInitScript(before);
  const problems = [];
  const requests = [];
  page.on('pageerror', (error) => problems.push(String(error)));
  page.on('console', (message) => message.type() === 'error' && problems.push(message.text()));
  page.on('request', (request) => requests.push(request.url()));
  await page.goto(pathToFileURL(path).href + hash);
  return { page, problems, requests, close: () => context.close() };
}

export async function opened(page) {
  await page.waitForFunction(() => globalThis.zulmViewer?.state().isOpen, null, { timeout: 60_000 });
}

/// Until the movie shows the picture at that time, or there is no movie.
export async function ready(page) {
  await page.waitForFunction(() => !['loading'].includes(zulmViewer.state().movie), null, { timeout: 60_000 });
}

export function state(page) {
  return page.evaluate(() => zulmViewer.state());
}

/// Goes there and lets the page draw.
export async function seek(page, time) {
  await page.evaluate(
    (time) =>
      new Promise((done) => {
        zulmViewer.seek(time);
        requestAnimationFrame(() => requestAnimationFrame(done));
      }),
    time,
  );
}

/// Lets the page draw what it has been asked for.
export function drawn(page) {
  return page.evaluate(() => new Promise((done) => requestAnimationFrame(() => requestAnimationFrame(done))));
}

/// Makes the text that many per cent of its usual size.
export async function enlarge(page, text) {
  await page.evaluate((text) => (document.documentElement.style.fontSize = text === 100 ? '' : `${(16 * text) / 100}px`), text);
  await drawn(page);
}

/// How many pixels of the overlay are about of that colour.
export function coloured(page, colour) {
  return page.evaluate(([red, green, blue]) => {
    const canvas = document.getElementById('overlay');
    const { data } = canvas.getContext('2d').getImageData(0, 0, canvas.width, canvas.height);
    let count = 0;
    for (let i = 0; i < data.length; i += 4)
      if (data[i + 3] > 200 && Math.hypot(data[i] - red, data[i + 1] - green, data[i + 2] - blue) < 24) ++count;
    return count;
  }, colour);
}

/// Reads a value until it is the wanted one, and returns it. `waitForFunction` does not wait for promises.
export async function waitUntil(read, isWanted = Boolean, words = String) {
  const end = Date.now() + 30_000;
  for (;;) {
    const value = await read();
    if (isWanted(value)) return value;
    if (Date.now() > end) assert.fail(`after 30 seconds: ${words(value)}`);
    await new Promise((done) => setTimeout(done, 50));
  }
}

/// The visible words of an element.
export function textOf(page, selector) {
  return page.locator(selector).innerText();
}
