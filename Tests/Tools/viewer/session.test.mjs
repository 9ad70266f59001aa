// The page of the demo's movie: what it draws is what was recorded.

import assert from 'node:assert/strict';
import { execFileSync } from 'node:child_process';
import { mkdirSync, readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { folder, emptyPage, open, opened, ready, recordedSession, seek, state, textOf, waitUntil, zulm } from './support.mjs';

const recording = recordedSession();
const dump = zulm('dump', '--format', 'json', 'Recording.mp4');
const streams = new Map(JSON.parse(dump).files[0].streams.map(({ kind, entries }) => [kind, entries]));

const times = [0.5, 1.55, 2.9, 4.25, 5.6, 8.05, 10.4, 13.1, 14.45, 18.7];

function lastBefore(kind, time) {
  return streams
    .get(kind)
    .filter(({ timestamp }) => timestamp <= time)
    .at(-1);
}

/// Those of the stream, in its order.
function storedImages() {
  const bytes = readFileSync(join(folder, 'streams/cursorImage.dat'));
  const [start, end] = [Buffer.from('\x89PNG\r\n', 'latin1'), Buffer.from('IEND', 'latin1')];
  const images = [];
  for (let at = bytes.indexOf(start); at >= 0; at = bytes.indexOf(start, at + 1))
    images.push(bytes.subarray(at, bytes.indexOf(end, at) + 8));
  return images;
}

/// The image that the cursor has at a time, and its hot spot.
function cursorAt(time) {
  const images = storedImages();
  const shown = lastBefore('cursorImage', time);
  const withImages = streams.get('cursorImage').filter(({ image }) => image !== null);
  const index = withImages.findLastIndex(({ id, timestamp }) => id === shown.id && timestamp <= time);
  const { hotspotOffsetX: x, hotspotOffsetY: y } = withImages[index];
  return { image: images[index].toString('base64'), hotSpot: { x, y } };
}

/// What an image holds around a place, and what the page drew around another one, each with its alpha multiplied in.
function patches(page, image, hotSpot, drawn, opacity, reach) {
  return page.evaluate(
    async ({ image, hotSpot, drawn, opacity, reach }) => {
      const bytes = Uint8Array.from(atob(image), (character) => character.charCodeAt(0));
      const bitmap = await createImageBitmap(new Blob([bytes]));
      const canvas = new OffscreenCanvas(bitmap.width, bitmap.height);
      canvas.getContext('2d').drawImage(bitmap, 0, 0);
      const side = 2 * reach + 1;
      const patch = (context, x, y, opacity) => {
        const { data } = context.getImageData(x - reach, y - reach, side, side);
        return Array.from(data, (value, i) =>
          Math.round((i % 4 === 3 ? value : (value * data[i - (i % 4) + 3]) / 255) * opacity),
        );
      };
      const overlay = document.getElementById('overlay').getContext('2d');
      return {
        recorded: patch(canvas.getContext('2d'), hotSpot.x, hotSpot.y, opacity),
        shown: patch(overlay, drawn.x, drawn.y, 1),
      };
    },
    { image, hotSpot, drawn, opacity, reach },
  );
}

/// Gives the stage the movie's own size, so that a pixel of it is one of the screen.
async function showAtFullSize(page) {
  await page.evaluate(() => document.documentElement.style.setProperty('--side-width', '300px'));
  const stage = await page.locator('#stage').boundingBox();
  const { width, height } = page.viewportSize();
  await page.setViewportSize({ width: width + 1280 - stage.width, height: height + 720 - stage.height });
  await page.waitForFunction(() => document.getElementById('overlay').width === 1280);
}

test('the cursor has its hot spot where it was recorded', async () => {
  const { page, problems, close } = await open(recording.page, { size: [1700, 1300] });
  await opened(page);
  await ready(page);
  assert.equal((await state(page)).movie, 'ready');
  await showAtFullSize(page);
  for (const layer of ['2', '3', '4', '5']) await page.keyboard.press(layer); // nothing but the cursor
  let compared = 0;
  for (const time of times) {
    await seek(page, time);
    const { x, y } = lastBefore('cursorLocation', time);
    const drawn = { x: x - 160, y: y - 90 };
    assert.deepEqual((await state(page)).hotSpot, drawn, `at ${time}`);
    const { image, hotSpot } = cursorAt(time);
    const { opacity } = lastBefore('cursorOpacity', time);
    const { recorded } = await waitUntil(
      () => patches(page, image, hotSpot, drawn, opacity, 3),
      ({ recorded, shown }) => recorded.every((value, i) => Math.abs(value - shown[i]) <= 3),
      ({ recorded, shown }) => `at ${time}: ${recorded} is ${shown}`,
    );
    assert.ok(
      recorded.some((value) => value > 60),
      `the cursor can be seen at ${time}`,
    );
    ++compared;
  }
  assert.equal(compared, 10);
  assert.deepEqual(problems, []);
  await close();
});

/// Of a subtitle file.
function cues(text) {
  const seconds = (clock) =>
    clock.split(/[:,]/).reduce((sum, part, i) => sum + Number(part) * [3600, 60, 1, 0.001][i], 0);
  return text
    .trim()
    .split('\n\n')
    .map((cue) => cue.split('\n'))
    .map(([, span, ...lines]) => ({
      times: span.split(' --> ').map(seconds),
      text: lines.join('\n').replaceAll('\u2060', ''),
    }));
}

test('captions are those of the tool, masked until the reader asks', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  const compare = async (...options) => {
    const all = cues(zulm('convert', '--to', 'srt', ...options, 'Recording.mp4'));
    for (const {
      times: [, end],
      text,
    } of all) {
      await seek(page, end - 0.005); // when all its keys have been pressed
      assert.equal((await state(page)).caption, text, `at ${end}`);
      assert.equal(await page.locator('#caption').getAttribute('data-text'), text);
    }
    return all.map(({ text }) => text).join();
  };
  const masked = await compare();
  assert.ok(!masked.includes('HALLO') && masked.includes('•'));
  assert.ok(!(await page.content()).includes('HALLO'));
  await page.keyboard.press('t');
  assert.ok((await compare('--show-keys')).includes('HALLO'));
  await seek(page, 2.3);
  assert.equal((await state(page)).caption, 'HA');
  await close();
});

test('a dropped movie is decoded to what the tool prints', async () => {
  const empty = join(folder, 'empty.html');
  writeFileSync(empty, emptyPage(readFileSync(recording.page, 'utf8')));
  const { page, problems, close } = await open(empty);
  assert.ok(await page.locator('#welcome-open').isVisible());
  const bytes = readFileSync(recording.movie).toString('base64');
  await page.evaluate((base64) => {
    const data = new DataTransfer();
    const bytes = Uint8Array.from(atob(base64), (character) => character.charCodeAt(0));
    data.items.add(new File([bytes], 'Recording.mp4', { type: 'video/mp4' }));
    for (const type of ['dragenter', 'dragover', 'drop'])
      document.body.dispatchEvent(new DragEvent(type, { dataTransfer: data, bubbles: true, cancelable: true }));
  }, bytes);
  await opened(page);
  await ready(page);
  assert.equal((await state(page)).movie, 'ready');
  assert.equal(await page.evaluate(() => zulmViewer.dump()), dump);
  assert.deepEqual(problems, []);
  await close();
});

test('nothing leaves the page', async () => {
  const { page, requests, problems, close } = await open(recording.page);
  await opened(page);
  await ready(page);
  await page.keyboard.press('Space');
  await page.waitForFunction(() => zulmViewer.state().time > 0.7);
  await page.keyboard.press('Space');
  for (const url of requests) assert.match(url, /^(file|blob|data):/);
  assert.deepEqual(
    [...new Set(requests.filter((url) => url.startsWith('file:')).map((url) => url.split('/').at(-1)))],
    ['Recording.html', 'Recording.mp4'],
  );
  assert.deepEqual(problems, []);
  const refused = await page.evaluate(() =>
    fetch('https://127.0.0.1/').then(
      () => false,
      () => true,
    ),
  );
  assert.ok(refused && problems.some((text) => text.includes('Content Security Policy')), problems.join());
  await close();
});

test('playing goes on in time, with the movie', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  await ready(page);
  await page.keyboard.press('Space');
  await page.waitForFunction(() => zulmViewer.state().time > 0.7);
  assert.ok((await state(page)).playing);
  await page.keyboard.press('Space');
  await waitUntil(
    () => page.evaluate(() => [document.getElementById('movie').currentTime, zulmViewer.state().time]),
    ([movie, time]) => Math.abs(movie - time) < 0.1, // when the last picture has come
    ([movie, time]) => `${movie} and ${time}`,
  );
  await close();
});

test('keys go to frames, markers and the ends', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  const timeAfter = async (key) => {
    await page.keyboard.press(key);
    await page.waitForFunction(() => zulmViewer.state().isSettled);
    return (await state(page)).time;
  };
  assert.equal(await timeAfter(']'), 1.5);
  assert.equal(await timeAfter(']'), 4.2);
  assert.equal(await timeAfter('['), 1.5);
  assert.equal(await timeAfter('ArrowRight'), 2.5);
  assert.equal(await timeAfter('ArrowLeft'), 1.5);
  assert.ok(Math.abs((await timeAfter('.')) - 1.5 - 1 / 30) < 1e-5); // browsers round times of pictures
  assert.ok(Math.abs((await timeAfter(',')) - 1.5) < 1e-5);
  assert.equal(await timeAfter('Home'), 0);
  assert.ok((await timeAfter('End')) >= 19.9);
  await page.keyboard.press('?');
  assert.ok(await page.locator('#help-dialog').isVisible());
  await page.keyboard.press('Escape');
  assert.ok(!(await page.locator('#help-dialog').isVisible()));
  await close();
});

test('lanes are zoomed, moved and lead to their time', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  const lanes = await page.locator('.lanes-body').boundingBox();
  const range = () => textOf(page, '.zoom-text');
  const clickAt = async (part) => {
    await page.mouse.click(lanes.x + lanes.width * part, lanes.y + 40);
    return (await state(page)).time;
  };
  assert.equal(await range(), 'all');
  assert.ok(Math.abs((await clickAt(0.25)) - 5) < 0.05);
  await page.keyboard.down('Control');
  await page.mouse.wheel(0, -1000); // at the pointer
  await page.keyboard.up('Control');
  await page.waitForFunction(() => document.querySelector('.zoom-text').textContent !== 'all');
  assert.ok(Math.abs((await clickAt(0.25)) - 5) < 0.05);
  const before = await clickAt(0.5);
  await page.mouse.move(lanes.x + lanes.width * 0.5, lanes.y + 40);
  await page.mouse.down();
  await page.mouse.move(lanes.x + lanes.width * 0.3, lanes.y + 40, { steps: 4 });
  await page.mouse.up();
  assert.equal((await state(page)).time, before); // moved the lanes, not the time
  assert.ok(Math.abs((await clickAt(0.3)) - before) < 0.05);
  await page.keyboard.press('0');
  assert.equal(await range(), 'all');
  await page.keyboard.press('End');
  await page.keyboard.press('+');
  assert.ok((await clickAt(0.98)) > 19.5); // stays where the playhead is
  await close();
});

test('everything is saved as the tool prints it, once the reader agrees', async () => {
  const { page, close } = await open(recording.page, { acceptDownloads: true });
  await opened(page);
  await page.getByLabel('Save all entries as a JSON file').click();
  const [download] = await Promise.all([
    page.waitForEvent('download'),
    page.getByRole('button', { name: 'Save', exact: true }).click(),
  ]);
  assert.equal(download.suggestedFilename(), 'Recording.mp4.json');
  assert.deepEqual(
    JSON.parse(readFileSync(await download.path(), 'utf8')).files[0].streams,
    JSON.parse(dump).files[0].streams,
  );
  await close();
});

test('a link tells the time, in both directions', async () => {
  const { page, close } = await open(recording.page, { hash: '#t=12.5' });
  await opened(page);
  assert.equal((await state(page)).time, 12.5);
  await seek(page, 3.25);
  await page.waitForFunction(() => location.hash === '#t=3.25');
  await page.evaluate(() => (location.hash = '#t=7'));
  await page.waitForFunction(() => zulmViewer.state().time === 7);
  await close();
});

test('entries are filtered, lead to their time and are copied masked', async () => {
  const { page, close } = await open(recording.page);
  await page.context().grantPermissions(['clipboard-read', 'clipboard-write']);
  await opened(page);
  await page.getByLabel('Stream', { exact: true }).selectOption('cursorAction');
  await page.getByLabel('Filter entries').fill('action=right');
  assert.match(await textOf(page, '.entries-status'), /^2 of 13$/);
  await page.getByLabel('Next match').click();
  assert.equal((await state(page)).time, 8);
  await page.getByLabel('Next match').click();
  assert.equal((await state(page)).time, 8.15);
  await page.getByLabel('Previous match').click();
  assert.equal((await state(page)).time, 8);
  const clipboard = () => page.evaluate(() => navigator.clipboard.readText());
  await page.getByLabel('Copy as JSON').click();
  await page.waitForFunction(() => document.querySelector('.entries-status').textContent.includes('copied'));
  assert.deepEqual(JSON.parse(await clipboard()), [
    { action: 'right down', rawActionValue: 4, timestamp: 8 },
    { action: 'right up', rawActionValue: 8, timestamp: 8.15 },
  ]);
  await page.getByLabel('Filter entries').fill('');
  await page.getByLabel('Stream', { exact: true }).selectOption('keyboardAction');
  await page.getByLabel('Copy as CSV').click();
  await page.waitForFunction(() => document.querySelector('.entries-status').textContent.includes('copied as CSV'));
  const copied = (await clipboard()).split('\n').slice(1, -1);
  assert.equal(copied.length, 12);
  for (const line of copied) assert.match(line, /^•,•,/);
  await page.locator('.table-row', { hasText: '0:05.500' }).click();
  assert.equal((await state(page)).time, 5.5);
  await close();
});

test('what is selected is copied, and a row alone with the keys of the system', async () => {
  const { page, close } = await open(recording.page);
  await page.context().grantPermissions(['clipboard-read', 'clipboard-write']);
  await opened(page);
  const clipboard = () => page.evaluate(() => navigator.clipboard.readText());
  await page.getByLabel('Stream', { exact: true }).selectOption('cursorAction');
  await page.getByLabel('Filter entries').fill('kind=cursoraction action=right');
  assert.match(await textOf(page, '.entries-status'), /^2 of 13$/);
  await page.getByLabel('Filter entries').fill('');
  await page.locator('.table-row', { hasText: '0:08.150' }).click();
  assert.match(await textOf(page, '.entries-status'), /1 selected/);
  await page.getByLabel('Copy as JSON').click();
  await page.waitForFunction(() => document.querySelector('.entries-status').textContent.includes('1 entry copied'));
  assert.deepEqual(JSON.parse(await clipboard()), [{ action: 'right up', rawActionValue: 8, timestamp: 8.15 }]);
  await page.locator('.table-row', { hasText: '0:08.000' }).click();
  await page.keyboard.press('Control+c');
  await page.waitForFunction(() => document.querySelector('.entries-status').textContent.includes('as CSV'));
  assert.equal(await clipboard(), 'action,rawActionValue,timestamp\nright down,4,8\n');
  await page.keyboard.press('Escape'); // selects nothing
  await page.getByLabel('Copy as CSV').click();
  await page.waitForFunction(() => document.querySelector('.entries-status').textContent.includes('13 entries copied'));
  await close();
});

test('space plays, whichever button was clicked last', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  await ready(page);
  await page.locator('#marker-forward').click();
  assert.equal((await state(page)).time, 1.5);
  await page.keyboard.press('Space');
  await page.waitForFunction(() => zulmViewer.state().playing && zulmViewer.state().time < 4);
  await page.keyboard.press('Space');
  assert.equal((await state(page)).playing, false);
  await page.keyboard.press('Tab'); // from here on the keys decide where they are
  await page.locator('#marker-forward').focus();
  const { time } = await state(page);
  await page.keyboard.press('Space');
  assert.equal((await state(page)).playing, false);
  assert.ok((await state(page)).time > time);
  await close();
});

test('another file begins at its own start', async () => {
  const { page, close } = await open(recording.page, { hash: '#t=12.5' });
  await opened(page);
  await page.setInputFiles('#file-input', join(folder, 'streams/cursorLocation.dat'));
  await page.waitForFunction(() => zulmViewer.state().finished === 2);
  assert.equal((await state(page)).time, 0);
  await page.waitForFunction(() => !location.hash.includes('12.5'));
  await close();
});

test('a stream that a later one of its kind hides can be looked at', async () => {
  const later = readFileSync(join(folder, 'streams/cursorLocation.dat')).subarray(0, 24 + 16 * 100);
  mkdirSync(join(folder, 'later'), { recursive: true });
  writeFileSync(join(folder, 'later/cursorLocation.dat'), later);
  zulm('attach', 'Recording.mp4', 'later/cursorLocation.dat', '--replace', '-o', 'Two.mp4', '--force');
  writeFileSync(join(folder, 'empty.html'), emptyPage(readFileSync(recording.page, 'utf8')));
  const { page, problems, close } = await open(join(folder, 'empty.html'));
  await page.setInputFiles('#file-input', join(folder, 'Two.mp4'));
  await opened(page);
  await seek(page, 10); // behind the end of the stream that readers find
  const [{ x, y }, region] = [streams.get('cursorLocation')[99], streams.get('recordingRegion')[0]];
  assert.deepEqual((await state(page)).hotSpot, { x: x - region.x, y: y - region.y });
  const choice = page.getByLabel('Stream', { exact: true });
  await choice.selectOption({ label: 'Cursor location (100)' });
  assert.equal(await textOf(page, '.entries-status'), '100 entries');
  await choice.selectOption({ label: 'Cursor location, hidden (1,200)' });
  assert.equal(await textOf(page, '.entries-status'), '1,200 entries');
  assert.match(await textOf(page, '.entries-note'), /^No reader finds this stream\. A later stream of its kind/);
  assert.equal(await page.locator('.lane-label.is-hidden').innerText(), 'Cursor location\nhidden');
  await page.getByRole('tab', { name: 'Facts' }).click();
  assert.match(await textOf(page, '.facts tr.is-hidden'), /^Cursor location hidden\s+1,200\s/);
  await page.getByRole('tab', { name: /^Check/ }).click();
  assert.match(await textOf(page, '.finding.is-notice >> nth=1'), /^cursorLocation at offset [\d,]+\n+this stream hides an earlier stream/);
  assert.deepEqual(problems, []);
  await close();
});

/// A stream of cursor images, one a second.
function cursorStream(pictures) {
  const header = readFileSync(join(folder, 'streams/cursorImage.dat')).subarray(0, 24);
  const entries = pictures.map((picture, i) => {
    const entry = Buffer.alloc(44 + picture.length);
    entry.writeUInt32LE(40 + picture.length, 0);
    entry.writeDoubleLE(i, 4);
    entry.writeBigInt64LE(BigInt(i + 1), 12);
    [20 + picture.length, picture.length, 5, 3].forEach((value, k) => entry.writeUInt32LE(value, 20 + 4 * k));
    picture.copy(entry, 36);
    return entry;
  });
  return Buffer.concat([header, ...entries]);
}

test('cursor images in TIFF are drawn like those in PNG', async () => {
  const source = ['-f', 'lavfi', '-i', 'testsrc2=s=40x32,format=rgba,colorchannelmixer=aa=0.7', '-frames:v', '1'];
  const picture = (name, ...options) => {
    execFileSync('ffmpeg', ['-v', 'error', '-y', ...source, '-pix_fmt', 'rgba', ...options, join(folder, name)]);
    return readFileSync(join(folder, name));
  };
  const compressions = ['raw', 'lzw', 'deflate', 'packbits'];
  const pictures = [
    picture('cursor.png'),
    ...compressions.map((name) => picture(`${name}.tiff`, '-compression_algo', name)),
  ];
  const streams = join(folder, 'tiff');
  mkdirSync(streams, { recursive: true });
  writeFileSync(join(streams, 'cursorImage.dat'), cursorStream(pictures));
  const location = readFileSync(join(folder, 'streams/cursorLocation.dat')).subarray(0, 24 + 16);
  writeFileSync(join(streams, 'cursorLocation.dat'), location);
  zulm('attach', 'plain.mp4', 'tiff/cursorImage.dat', 'tiff/cursorLocation.dat', '-o', 'Tiff.mp4', '--force');
  zulm('view', 'Tiff.mp4', '-o', 'Tiff.html');
  const { page, problems, close } = await open(join(folder, 'Tiff.html'));
  await opened(page);
  await ready(page);
  await seek(page, 0.5);
  const layer = await waitUntil(
    () =>
      page.evaluate(() => {
        const canvas = document.getElementById('overlay');
        const { data } = canvas.getContext('2d').getImageData(0, 0, canvas.width, canvas.height);
        return data.some((value, i) => i % 4 === 3 && value > 100) && canvas.toDataURL();
      }),
    Boolean,
    () => 'the cursor in PNG is not drawn',
  );
  for (const [i, name] of compressions.entries()) {
    await seek(page, i + 1.5);
    const picture = () => page.evaluate(() => document.getElementById('overlay').toDataURL());
    await waitUntil(picture, (picture) => picture === layer, () => `${name} is drawn in another way`);
  }
  await page.keyboard.press('1');
  await page.waitForFunction((layer) => document.getElementById('overlay').toDataURL() !== layer, layer);
  assert.deepEqual(problems, []);
  await close();
});

test('the page holds the licence of everything in it', async () => {
  const { page, close } = await open(recording.page);
  await page.locator('#about-button').click();
  const names = await page.locator('#about-dialog summary').allInnerTexts();
  for (const name of ['JSON for Modern C++', '{fmt}', 'Emscripten', 'musl', 'LLVM', 'tiff', 'fflate', 'iobuffer'])
    assert.ok(
      names.some((text) => text.startsWith(name)),
      `${name} in ${names.join()}`,
    );
  for (const text of await page.locator('#about-dialog pre').allTextContents()) assert.ok(text.length > 40, text);
  await close();
});

test('the movie may be missing: the recorded region stands for it', async () => {
  const lonely = join(folder, 'lonely');
  zulm('view', 'Recording.mp4', '-o', 'lonely.html');
  const text = readFileSync(join(folder, 'lonely.html'), 'utf8').replace(
    '"movie":"Recording.mp4"',
    '"movie":"Missing.mp4"',
  );
  writeFileSync(`${lonely}.html`, text);
  const { page, close } = await open(`${lonely}.html`);
  await opened(page);
  await page.waitForFunction(() => zulmViewer.state().movie === 'failed');
  assert.match(await textOf(page, '#stage-note'), /^Missing\.mp4 is not beside this page/);
  await page.keyboard.press('Space');
  await page.waitForFunction(() => zulmViewer.state().time > 0.5);
  assert.deepEqual((await state(page)).frame, { width: 1280, height: 720 });
  await close();
});

test('an embedded movie needs no other file', async () => {
  zulm('view', 'Recording.mp4', '-o', 'Embedded.html', '--embed');
  const { page, requests, close } = await open(join(folder, 'Embedded.html'));
  await opened(page);
  await ready(page);
  assert.equal((await state(page)).movie, 'ready');
  assert.equal(requests.filter((url) => url.startsWith('file:')).length, 1);
  await close();
});
