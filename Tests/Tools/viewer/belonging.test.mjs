// How a recording belongs to its movie: layers of what the library suggests, an offset and a region that the reader
// sets, and files that are dropped together.

import assert from 'node:assert/strict';
import { readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { ffmpeg, pixelsOf, settled } from './numbered.mjs';
import { coloured, emptyPage, folder, open, opened, ready, recordedSession, seek, state, textOf, waitUntil, zulm } from './support.mjs';

const recording = recordedSession();
const empty = join(folder, 'empty.html');
writeFileSync(empty, emptyPage(readFileSync(recording.page, 'utf8')));
const insights = JSON.parse(zulm('insights', '--json', 'Recording.mp4'));

async function shown(work, options = {}) {
  const { page, problems, close } = await open(recording.page, options);
  await opened(page);
  await ready(page);
  await work(page);
  assert.deepEqual(problems, []);
  await close();
}

const appears = (page, colour) =>
  waitUntil(() => coloured(page, colour), (count) => count > 20, (count) => `${count} pixels of the colour ${colour}`);

const disappears = (page, colour) =>
  waitUntil(() => coloured(page, colour), (count) => count < 5, (count) => `${count} pixels of the colour ${colour}`);

/// The objects anywhere in a document that have all these members.
function objectsWith(value, ...names) {
  if (value === null || typeof value !== 'object') return [];
  const found = !Array.isArray(value) && names.every((name) => name in value) ? [value] : [];
  return [...found, ...Object.values(value).flatMap((other) => objectsWith(other, ...names))];
}

const layers = { 8: [255, 176, 32], 9: [143, 29, 87], p: [47, 191, 155] };

for (const [key, colour] of Object.entries(layers))
  test(`the layer of key ${key} is drawn when it is switched on`, () =>
    shown(async (page) => {
      const zoom = objectsWith(insights, 'start', 'end', 'factor', 'places')[0];
      await seek(page, zoom.places.findLast(({ reason }) => reason === 'clicks').start + 0.7);
      assert.ok((await coloured(page, colour)) < 5);
      await page.keyboard.press(key);
      await appears(page, colour);
      await page.keyboard.press(key);
      await disappears(page, colour);
    }));

test('a link switches on what the library computes', async () => {
  const zoom = objectsWith(insights, 'start', 'end', 'factor', 'places')[0];
  const { page, problems, close } = await open(recording.page, { hash: `#t=${zoom.start + 2}&layers=cursor,zooms` });
  await opened(page);
  await ready(page);
  await appears(page, layers[8]);
  assert.deepEqual(problems, []);
  await close();
});

test('the suggested zoom shows what the camera of the library shows', () =>
  shown(async (page) => {
    const zoom = objectsWith(insights, 'start', 'end', 'factor', 'places')[0];
    await page.keyboard.press('8');
    await seek(page, zoom.start + 2);
    await appears(page, layers[8]);
    await seek(page, zoom.start - 0.5); // there is no zoom yet
    await disappears(page, layers[8]);
    await seek(page, zoom.start + 2);
    await appears(page, layers[8]);
    const left = await page.evaluate(([red, green, blue]) => {
      const canvas = document.getElementById('overlay');
      const { data, width, height } = canvas.getContext('2d').getImageData(0, 0, canvas.width, canvas.height);
      const [xs, ys] = [[], []];
      for (let i = 0; i < data.length; i += 4)
        if (Math.hypot(data[i] - red, data[i + 1] - green, data[i + 2] - blue) < 24) {
          xs.push((i / 4) % width);
          ys.push(Math.floor(i / 4 / width));
        }
      const span = (values, size) => values.reduce((most, value) => Math.max(most, value), 0) - values.reduce((least, value) => Math.min(least, value), size);
      return [span(xs, width) / width, span(ys, height) / height];
    }, layers[8]);
    for (const part of left) assert.ok(Math.abs(part - 1 / zoom.factor) < 0.06, `${part} of the picture at ${zoom.factor}`);
  }));

test('an offset moves everything, and is kept in the link', () =>
  shown(async (page) => {
    await seek(page, 5);
    const before = (await state(page)).hotSpot;
    await page.getByRole('tab', { name: 'Facts' }).click();
    await page.getByRole('button', { name: 'Adjust…' }).click();
    await page.keyboard.press('Escape');
    await page.getByRole('tab', { name: 'Entries' }).click();
    await page.getByLabel('Stream', { exact: true }).selectOption('cursorLocation');
    await page.getByLabel('Filter entries').fill('x>100');
    await page.getByRole('button', { name: 'Sort by Y' }).click();
    await page.evaluate(() => document.activeElement.blur());
    await page.keyboard.press('+');
    const kept = () => page.evaluate(() => [
        document.querySelector('.zoom-text').textContent,
        document.querySelector('.entries-head select').value,
        document.querySelector('[aria-sort]')?.textContent,
        document.querySelector('.entries-status').textContent,
      ].join());
    await page.waitForFunction(() => / of /.test(document.querySelector('.entries-status').textContent));
    const chosen = await kept();
    await page.getByRole('tab', { name: 'Facts' }).click();
    await page.getByRole('button', { name: 'Adjust…' }).click();
    await page.getByLabel('Offset in seconds').fill('nothing');
    await page.getByRole('button', { name: 'Apply' }).click();
    assert.ok(await page.locator('#adjust-dialog').isVisible(), 'a word is no number');
    await page.getByLabel('Offset in seconds').fill('−1.5');
    await page.getByRole('button', { name: 'Apply' }).click();
    await page.locator('#adjust-dialog').waitFor({ state: 'hidden' });
    await page.waitForFunction(() => /offset=-1\.5/.test(location.hash));
    assert.match(await textOf(page, '#pane-facts'), /Offset of times\s+-1\.5 s, set by hand/);
    await waitUntil(kept, (now) => now === chosen); // the times alone are others
    await seek(page, 3.5);
    assert.deepEqual((await state(page)).hotSpot, before);
    const { hash } = new URL(page.url());
    await page.getByRole('button', { name: 'Adjust…' }).click();
    await page.getByRole('button', { name: 'As recorded' }).click();
    await page.waitForFunction(() => !/offset/.test(location.hash));
    await seek(page, 5);
    assert.deepEqual((await state(page)).hotSpot, before);
    const linked = await open(recording.page, { hash });
    await opened(linked.page);
    await seek(linked.page, 3.5);
    assert.deepEqual((await state(linked.page)).hotSpot, before);
    await linked.page.evaluate(() => (location.hash = '#t=3.5&range=3-4'));
    await linked.page.waitForFunction(() => zulmViewer.state().selection?.to === 4);
    await linked.close();
  }));

test('what is selected is counted at the times of the movie', () =>
  shown(
    async (page) => {
      await page.waitForFunction(() => /· \d+ click/.test(document.querySelector('.range-facts').textContent));
      const facts = await textOf(page, '.range-facts');
      const plain = await open(recording.page, { hash: '#t=0&range=2-6' });
      await opened(plain.page);
      await plain.page.waitForFunction(() => /· \d+ click/.test(document.querySelector('.range-facts').textContent));
      assert.equal(facts, await textOf(plain.page, '.range-facts'));
      await plain.close();
    },
    { hash: '#t=0&range=3-7&offset=1' },
  ));

test('a region set by hand says where things belong', () =>
  shown(async (page) => {
    await seek(page, 5);
    const { hotSpot, frame } = await state(page);
    await page.getByRole('tab', { name: 'Facts' }).click();
    await page.getByRole('button', { name: 'Adjust…' }).click();
    const fill = async (...values) => {
      for (const [i, name] of ['Left', 'Top', 'Width', 'Height'].entries())
        await page.getByLabel(name, { exact: true }).fill(values[i]);
      await page.getByRole('button', { name: 'Apply' }).click();
    };
    await fill('0', '0', '', '');
    assert.ok(await page.locator('#adjust-dialog').isVisible(), 'a region has four numbers');
    await fill('160', '90', '640', '360');
    await page.waitForFunction(() => /region=160,90,640,360/.test(location.hash));
    const half = (await state(page)).hotSpot;
    assert.deepEqual((await state(page)).frame, frame);
    assert.ok(Math.abs(half.x - 2 * hotSpot.x) < 1e-6 && Math.abs(half.y - 2 * hotSpot.y) < 1e-6, `${half.x} of ${hotSpot.x}`);
    assert.match(await textOf(page, '#pane-facts'), /640 × 360 at 160, 90, set by hand/);
  }));

test('a recording is shown over another movie', async () => {
  const other = join(folder, 'Other.mp4');
  ffmpeg('-f', 'lavfi', '-i', 'color=c=0x20a040:s=640x360:r=10', '-t', '18', '-pix_fmt', 'yuv420p', other);
  await shown(async (page) => {
    const before = await page.evaluate(() => zulmViewer.dump());
    await page.getByRole('tab', { name: 'Facts' }).click();
    await page.getByRole('button', { name: 'Adjust…' }).click();
    await page.getByLabel('Another movie').setInputFiles(other);
    await page.getByLabel('Offset in seconds').fill('-2');
    await page.getByRole('button', { name: 'Apply' }).click();
    await page.waitForFunction(() => zulmViewer.state().movie === 'ready' && zulmViewer.state().frame.width === 640);
    assert.equal((await state(page)).duration, 18);
    await settled(page);
    const clip = await page.locator('#frame').boundingBox();
    const { width, height, data, channels } = pixelsOf(await page.screenshot({ clip }));
    const middle = (Math.floor(height * 0.9) * width + Math.floor(width * 0.9)) * channels;
    assert.ok(data[middle + 1] > 2 * data[middle], 'the picture is green');
    assert.equal(await page.evaluate(() => zulmViewer.dump()), before);
    await page.keyboard.press('End');
    await page.keyboard.press('i');
    assert.equal((await state(page)).selection, null, 'nothing comes after the end');
    await page.getByRole('button', { name: 'Adjust…' }).click();
    await page.getByRole('button', { name: 'As recorded' }).click();
    await page.waitForFunction(() => zulmViewer.state().movie === 'ready' && zulmViewer.state().frame.width === 1280);
    await page.waitForFunction(() => !/offset/.test(location.hash));
    assert.notEqual((await state(page)).duration, 18);
  });
});

/// Drops files of the folder on the page.
async function drop(page, ...names) {
  const files = names.map((name) => ({ name: name.split('/').at(-1), base64: readFileSync(join(folder, name)).toString('base64') }));
  await page.evaluate((files) => {
    const data = new DataTransfer();
    for (const { name, base64 } of files) {
      const bytes = Uint8Array.from(atob(base64), (character) => character.charCodeAt(0));
      data.items.add(new File([bytes], name));
    }
    document.body.dispatchEvent(new DragEvent('drop', { dataTransfer: data, bubbles: true, cancelable: true }));
  }, files);
}

const streamsOf = (dump) => JSON.parse(dump).files[0].streams.map(({ kind, entries }) => [kind, entries]);

test('a plain movie and stream files that are dropped together are one recording', async () => {
  const { page, problems, close } = await open(empty);
  const names = ['streams/cursorLocation.dat', 'streams/cursorAction.dat', 'streams/recordingRegion.dat'];
  await drop(page, names[0], 'plain.mp4', names[1], names[2]);
  await opened(page);
  await ready(page);
  assert.equal((await state(page)).movie, 'ready');
  zulm('attach', 'plain.mp4', ...names, '-o', 'Joined.mp4', '--force');
  assert.deepEqual(streamsOf(await page.evaluate(() => zulmViewer.dump())), streamsOf(zulm('dump', '--format', 'json', 'Joined.mp4')));
  assert.equal(await textOf(page, '#recording-name'), 'plain.mp4');
  await page.keyboard.press('i');
  await page.waitForFunction(() => document.querySelector('.range-facts').textContent.includes('click'));
  assert.deepEqual(problems, []);
  await close();
});

test('stream files alone are one recording; two movies are none', async () => {
  const { page, problems, close } = await open(empty);
  await drop(page, 'streams/cursorLocation.dat', 'streams/cursorAction.dat');
  await opened(page);
  assert.equal((await state(page)).movie, 'none');
  assert.deepEqual(
    streamsOf(await page.evaluate(() => zulmViewer.dump())).map(([kind]) => kind).sort(),
    ['cursorAction', 'cursorLocation'],
  );
  assert.equal(await textOf(page, '#recording-name'), 'cursorLocation.dat and 1 more');
  await drop(page, 'plain.mp4', 'Recording.mp4');
  await page.locator('#notice').waitFor({ state: 'visible' });
  assert.match(await textOf(page, '#notice-text'), /open one movie at a time/);
  assert.equal(await textOf(page, '#recording-name'), 'cursorLocation.dat and 1 more');
  assert.deepEqual(problems, []);
  await close();
});
