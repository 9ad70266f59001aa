// Files that are no recordings, or damaged: their errors are told in words, and the page lives on.

import assert from 'node:assert/strict';
import { readdirSync, readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { deflateSync } from 'node:zlib';
import { attached, ffmpeg, imageEntry, imagesOf, positionsOf, regionOf, stream } from './numbered.mjs';
import { coloured, drawn, emptyPage, folder, open, opened, ready, recordedSession, seek, setting, state, textOf, waitUntil, zulm } from './support.mjs';

const recording = recordedSession();
const empty = join(folder, 'empty.html');
writeFileSync(empty, emptyPage(readFileSync(recording.page, 'utf8')));

/// Waits until the page has shown the file or has said why it cannot.
async function give(page, path) {
  const { finished } = await state(page);
  await page.evaluate(() => (document.getElementById('notice').hidden = true));
  await page.setInputFiles('#file-input', path);
  await page.waitForFunction((finished) => zulmViewer.state().finished > finished, finished, { timeout: 60_000 });
}

test('a file that is no recording is refused in words, and the next one opens', async () => {
  const text = join(folder, 'Letter.mp4');
  writeFileSync(text, 'Dear reader, this is no movie.\n'.repeat(40));
  const { page, problems, close } = await open(empty);
  await give(page, text);
  assert.match(await textOf(page, '#notice-text'), /^Letter\.mp4 cannot be shown: .{10,}/);
  assert.equal((await state(page)).isOpen, false);
  await give(page, recording.movie);
  await opened(page);
  assert.equal(await page.locator('#notice').isVisible(), false);
  await give(page, text);
  assert.match(await textOf(page, '#notice-text'), /^Letter\.mp4 cannot be shown/);
  assert.equal(await textOf(page, '#recording-name'), 'Recording.mp4'); // stays open
  assert.equal(await page.evaluate(() => zulmViewer.dump()), zulm('dump', '--format', 'json', 'Recording.mp4'));
  assert.deepEqual(problems, []);
  await close();
});

test('a wrong file does not end what is opening', async () => {
  const { page, problems, close } = await open(recording.page);
  await page.setInputFiles('#file-input', { name: 'Letter.mp4', mimeType: 'video/mp4', buffer: Buffer.from('Dear reader') });
  await opened(page);
  await page.waitForFunction(() => zulmViewer.state().finished === 2 && !document.body.matches('.is-busy'));
  assert.match(await textOf(page, '#notice-text'), /^Letter\.mp4 cannot be shown/);
  assert.equal(await textOf(page, '#recording-name'), 'Recording.mp4');
  assert.equal(await page.evaluate(() => zulmViewer.dump()), zulm('dump', '--format', 'json', 'Recording.mp4'));
  assert.deepEqual(problems, []);
  await close();
});

test('files of other people are refused in words that name what is wrong', async () => {
  const whole = readFileSync(recording.movie);
  const files = {
    'Empty.mp4': ['', /^Empty\.mp4 cannot be shown: it is empty\.$/],
    Empty: ['', /^Empty cannot be shown: it is empty\.$/],
    'Letter.txt': ['Dear reader\n'.repeat(9), /: it begins neither like a movie, nor a RIFF file, nor a stream\.$/],
    '<img src=x onerror=fail()>.mp4': ['\0'.repeat(99), /^<img src=x onerror=fail\(\)>\.mp4 cannot be shown: \S/],
    'Half.mp4': [
      whole.subarray(0, whole.length / 2),
      /: it holds nothing that was recorded beside a movie, and is damaged: mdat at offset \d+, it says that it has /,
    ],
  };
  const { page, problems, close } = await open(empty);
  for (const [name, [bytes, words]] of Object.entries(files)) {
    writeFileSync(join(folder, name), bytes);
    await give(page, join(folder, name));
    assert.match(await textOf(page, '#notice-text'), words);
  }
  await give(page, recording.movie);
  await opened(page);
  assert.deepEqual(problems, []);
  await close();
});

test('a movie that was cut is shown with what is wrong with it', async () => {
  const cut = join(folder, 'Cut.mp4');
  const bytes = readFileSync(recording.movie);
  writeFileSync(cut, bytes.subarray(0, bytes.length - 9000));
  const { page, problems, close } = await open(empty);
  await give(page, cut);
  await opened(page);
  await page.getByRole('tab', { name: /^Check/ }).click();
  assert.match(await textOf(page, '.verdict'), /damaged/);
  assert.ok((await page.locator('.finding').count()) > 0);
  assert.deepEqual(
    problems.filter((problem) => !/movie|media/i.test(problem)),
    [],
  );
  await close();
});

test('every damaged file is shown or refused, and the page lives on', async () => {
  const data = join(setting('ZULM_TEST_DATA'), 'invalid');
  const files = readdirSync(data).filter((name) => /\.(dat|mp4|mov|avi|wav|zcap)$/.test(name));
  assert.ok(files.length > 50, `${files.length} files`);
  const { page, problems, close } = await open(empty);
  const told = { shown: 0, refused: 0 };
  for (const name of files) {
    await give(page, join(data, name));
    const isRefused =
      (await page.locator('#notice').isVisible()) && (await textOf(page, '#notice-text')).includes('cannot be shown');
    ++told[isRefused ? 'refused' : 'shown'];
    if (isRefused) assert.match(await textOf(page, '#notice-text'), / cannot be shown: \S.{6,}/, name);
    else assert.equal(await textOf(page, '#recording-name'), name);
  }
  console.log(`${files.length} damaged files: ${told.shown} shown, ${told.refused} refused in words`);
  await give(page, recording.movie);
  assert.equal(await textOf(page, '#recording-name'), 'Recording.mp4');
  assert.deepEqual(
    problems.filter((problem) => !/movie|media|ERR_/i.test(problem)),
    [],
  );
  await close();
});

/// A grey movie of 8 seconds with these streams, by page and as a file.
function greyMovie(name, streams) {
  const plain = join(folder, 'grey.mp4');
  const picture = ['-f', 'lavfi', '-i', 'color=c=gray:s=640x360:r=10', '-t', '8', '-pix_fmt', 'yuv420p'];
  ffmpeg(...picture, '-c:v', 'libx264', '-preset', 'ultrafast', plain);
  return attached(name, plain, streams);
}

async function findings(page) {
  await page.getByRole('tab', { name: /^Check/ }).click();
  await page.locator('.verdict').waitFor();
  return (await page.locator('.finding').allInnerTexts()).join('\n');
}

const path = Array.from({ length: 80 }, (_, i) => [i / 10, 8 * i, 4 * i]);

test('one bad time does not stretch the axis, and is told', async () => {
  const bad = [...path, [1e9, 5, 5], [-5, 5, 5]];
  const recording = greyMovie('Bad', { cursorLocation: positionsOf(bad), recordingRegion: regionOf([0, 0, 0, 640, 360]) });
  for (const file of [recording.page, empty]) {
    const { page, close } = await open(file);
    if (file === empty) await give(page, recording.movie);
    await opened(page);
    await ready(page);
    assert.equal((await state(page)).duration, 8);
    assert.equal(await page.locator('.ruler').getAttribute('aria-valuemax'), '8.000');
    const told = await findings(page);
    assert.match(told, /1 entry lies after the end of the movie/);
    assert.match(told, /1 entry lies before the beginning of the movie/);
    assert.doesNotMatch(await page.locator('#pane-facts').textContent(), /\d{4}:/, 'nor how long the person was idle');
    assert.match(await textOf(page, '.verdict'), /Nothing is damaged\./);
    await seek(page, 4);
    for (const layer of ['8', 'p']) await page.keyboard.press(layer);
    await waitUntil(() => coloured(page, [47, 191, 155]), (count) => count > 20); // the smooth path
    assert.equal(await page.locator('#notice').isVisible(), false);
    await close();
  }
  const { page, close } = await open(empty);
  await give(page, join(folder, 'Bad/cursorLocation.dat')); // no movie says how long it is
  await opened(page);
  const { duration } = await state(page);
  assert.ok(duration >= 7.9 && duration < 8, `${duration} seconds`);
  assert.match(await findings(page), /1 entry lies [\d,]+ seconds after all others/);
  await close();
});

test('a rest at the end is idle, in the page that was written and in a file that is dropped', async () => {
  const still = greyMovie('Still', { cursorLocation: positionsOf(path.slice(0, 30)), recordingRegion: regionOf([0, 0, 0, 640, 360]) });
  for (const file of [still.page, empty]) {
    const { page, close } = await open(file, { hash: '#t=0&range=2-8' });
    if (file === empty) await give(page, still.movie);
    await opened(page);
    await page.locator('#pane-facts dd').first().waitFor({ state: 'attached' });
    assert.match(await page.locator('#pane-facts').textContent(), /Idle0:05 in 1 stretch/);
    if (file !== empty) await page.waitForFunction(() => /idle 0:05\.1/.test(document.querySelector('.range-facts').textContent));
    await close();
  }
});

test('regions that cannot be right are told', async () => {
  const told = async (name, regions) => {
    const streams = { cursorLocation: positionsOf(path), ...(regions && { recordingRegion: regionOf(...regions) }) };
    const { page, close } = await open(greyMovie(name, streams).page);
    await opened(page);
    await ready(page);
    const text = await findings(page);
    await close();
    return text;
  };
  assert.equal(await told('Right', [[0, 0, 0, 1280, 720]]), '');
  assert.match(await told('Square', [[0, 0, 0, 640, 640]]), /The region of 640 × 640 has another shape than the movie of 640 × 360/);
  assert.match(
    await told('Two', [[0, 0, 0, 640, 360], [3, 0, 0, 1280, 720]]),
    /2 different regions were recorded\. The page uses the last one, 1,280 × 720 at 0, 0/,
  );
  assert.match(await told('Without', undefined), /No region was recorded/);
});

test('a stream alone claims no region, and its stage and lane agree', async () => {
  greyMovie('Alone', { cursorLocation: positionsOf(path) });
  const { page, close } = await open(empty);
  await give(page, join(folder, 'Alone/cursorLocation.dat'));
  await opened(page);
  assert.equal(await textOf(page, '#stage-note'), 'There is no movie with this recording. The page assumes a screen of 1,920 × 1,080.');
  assert.deepEqual((await state(page)).frame, { width: 1920, height: 1080 });
  assert.match(await findings(page), /No region was recorded/);
  await close();
});

/// A PNG whose header says that size, of which nothing but zeros is stored.
function emptyPicture(side) {
  const chunk = (type, data) => {
    const bytes = Buffer.concat([Buffer.alloc(4), Buffer.from(type, 'latin1'), data, Buffer.alloc(4)]);
    bytes.writeUInt32BE(data.length, 0);
    bytes.writeUInt32BE(checksum(bytes.subarray(4, -4)), bytes.length - 4);
    return bytes;
  };
  const header = Buffer.from([...Array(8).fill(0), 1, 0, 0, 0, 0]); // one bit of grey
  header.writeUInt32BE(side, 0);
  header.writeUInt32BE(side, 4);
  const rows = deflateSync(Buffer.alloc(side * (side / 8 + 1)), { level: 9 });
  const start = Buffer.from('\x89PNG\r\n\x1a\n', 'latin1');
  return Buffer.concat([start, chunk('IHDR', header), chunk('IDAT', rows), chunk('IEND', Buffer.alloc(0))]);
}

function checksum(bytes) {
  let sum = 0xffffffff;
  for (const byte of bytes) {
    sum ^= byte;
    for (let k = 0; k < 8; ++k) sum = (sum >>> 1) ^ (sum & 1 ? 0xedb88320 : 0);
  }
  return (sum ^ 0xffffffff) >>> 0;
}

test('cursor images that are larger than any cursor are never decoded', async () => {
  const [small, large] = [emptyPicture(1024), emptyPicture(16384)];
  assert.ok(large.length < 60_000);
  const images = [small, large].map((picture, i) => imageEntry(i, i + 1, [3, 3], picture));
  const { page: path } = greyMovie('Large', { cursorImage: imagesOf(...images), cursorLocation: positionsOf([[0, 50, 50]]) });
  const { page, problems, close } = await open(path, {
    before: () => {
      const decode = globalThis.createImageBitmap;
      globalThis.decoded = [];
      globalThis.createImageBitmap = (source) => (decoded.push(source.size), decode(source));
    },
  });
  await opened(page);
  await ready(page);
  await seek(page, 1.5);
  await page.waitForFunction(() => {
    const canvas = document.getElementById('overlay');
    const { data } = canvas.getContext('2d').getImageData(0, 0, canvas.width, canvas.height);
    return data.some((value, i) => i % 4 === 3 && value > 200); // an arrow stands for it
  });
  await page.waitForFunction(() => decoded.length > 0 && document.querySelector('.table-row'));
  await drawn(page);
  assert.deepEqual(await page.evaluate(() => [...new Set(decoded)]), [small.length]); // the table shows it as well
  assert.deepEqual(problems, []);
  await close();
});

const titlesOf = (...titles) =>
  stream(
    0x07,
    0,
    titles.map((title, i) => {
      const text = Buffer.from(title);
      const bytes = Buffer.alloc(12 + text.length);
      bytes.writeUInt32LE(8 + text.length, 0);
      bytes.writeDoubleLE(i, 4);
      text.copy(bytes, 12);
      return bytes;
    }),
  );

test('signs that turn or hide a text are shown, and nothing after them is lost', async () => {
  const streams = { topmostWindowTitle: titlesOf('invoice\u202Efdp.exe', 'first\0second') };
  const { page: path } = greyMovie('Turned', streams);
  const { page, close } = await open(path);
  await opened(page);
  await page.getByLabel('Stream', { exact: true }).selectOption('topmostWindowTitle');
  const cells = async () => (await page.locator('.table-row:visible').allInnerTexts()).join('\n');
  await waitUntil(cells, (text) => /invoice\[U\+202E\]fdp\.exe/.test(text) && /first␀second/.test(text));
  await seek(page, 0.5);
  assert.equal(await textOf(page, '.lane-label:has-text("Window") .lane-value'), 'invoice[U+202E]fdp.exe');
  await page.getByLabel('Filter entries').fill('second');
  await page.waitForFunction(() => /^1 of 2/.test(document.querySelector('.entries-status').textContent));
  await close();

  const name = join(folder, 'evil\u202E4pm.exe.dat');
  writeFileSync(name, streams.topmostWindowTitle);
  const next = await open(empty);
  await give(next.page, name);
  assert.equal(await textOf(next.page, '#recording-name'), 'evil[U+202E]4pm.exe.dat');
  assert.ok(!(await next.page.title()).includes('\u202E'));
  await next.close();
});

test('nobody is told where the recording lay', async () => {
  const { page } = greyMovie('Told', { cursorLocation: positionsOf(path) });
  zulm('view', join(folder, 'Told.mp4'), '-o', page, '--embed', '--force');
  const text = readFileSync(page, 'utf8');
  const recorded = JSON.parse(/id="zulm-recording">([^<]*)</.exec(text)[1]);
  assert.deepEqual([recorded.name, recorded.info.path, recorded.verify.path], ['Told.mp4', 'Told.mp4', 'Told.mp4']);
  assert.ok(!text.includes(folder));
});

test('nothing may run but the script of the page', () => {
  const [, rules] = /script-src ([^;]*);/.exec(readFileSync(empty, 'utf8'));
  assert.match(rules, /^'sha256-[\w+/=]+' 'wasm-unsafe-eval'$/);
});

test('streams that were replaced are not called damaged', async () => {
  greyMovie('Before', { cursorLocation: positionsOf(path), recordingRegion: regionOf([0, 0, 0, 640, 360]) });
  zulm('attach', 'Before.mp4', 'Before/cursorLocation.dat', '--replace', '-o', 'Replaced.mp4', '--force');
  const { page, close } = await open(empty);
  await give(page, join(folder, 'Replaced.mp4'));
  await opened(page);
  assert.ok(!/damage/.test(await findings(page)));
  assert.equal(await textOf(page, '.verdict'), 'Nothing is damaged.');
  assert.equal(await page.locator('#finding-count.is-bad').count(), 0, 'no alarm is raised');
  assert.doesNotMatch(await page.locator('#pane-facts').textContent(), /damage/);
  await close();
});
