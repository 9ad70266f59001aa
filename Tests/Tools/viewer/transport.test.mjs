// Going through a movie: back and forth, faster, past idle times, to a time or a picture, and into the picture.

import assert from 'node:assert/strict';
import { readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { after, attached, ffmpeg, look, numberedRecording, pixelsOf, positionsOf, readPicture, settled } from './numbered.mjs';
import { emptyPage, folder, open, opened, ready, state, textOf } from './support.mjs';

const numbered = numberedRecording('Numbered', { rate: 10, seconds: 60 });

async function shown(path, work, options = {}) {
  const { page, problems, close } = await open(path, { size: [760, 560], ...options });
  await opened(page);
  await ready(page);
  await settled(page);
  await work(page);
  assert.deepEqual(problems, []);
  await close();
}

const speed = (page, wanted) => page.waitForFunction((wanted) => zulmViewer.state().speed === wanted, wanted);

test('L plays on faster with each press, J plays back, K stops', () =>
  shown(numbered.page, async (page) => {
    await page.evaluate(() => zulmViewer.seek(1));
    for (const wanted of [1, 2, 4, 8, 16, 16]) {
      await page.evaluate(() => zulmViewer.seek(1));
      await page.keyboard.press('l');
      await speed(page, wanted);
      assert.ok((await state(page)).playing);
    }
    assert.equal(await textOf(page, '#rate'), '16×');
    assert.equal(await page.evaluate(() => document.getElementById('movie').playbackRate), 16);
    await page.keyboard.press('k');
    await page.waitForFunction(() => !zulmViewer.state().playing);
    await speed(page, 1);
    await page.evaluate(() => zulmViewer.seek(5.5));
    await settled(page);
    await page.keyboard.press('j');
    await speed(page, -1);
    assert.equal(await textOf(page, '#rate'), '−1×');
    await page.keyboard.press('j');
    await speed(page, -2);
    await page.waitForFunction(() => zulmViewer.state().time < 4.5, null, { timeout: 30_000 });
    await page.keyboard.press('k');
    await page.waitForFunction(() => !zulmViewer.state().playing && zulmViewer.state().isSettled);
    const { number, time } = await look(page);
    assert.ok(number < 46, `${number}`);
    const late = after(time, numbered.times[number]);
    assert.ok(late > -0.02 && late < 0.12, `the cursor is ${late} s after picture ${number}`);
    await page.evaluate(() => zulmViewer.seek(0.5));
    await page.keyboard.press('j');
    await page.waitForFunction(() => !zulmViewer.state().playing && zulmViewer.state().time === 0, null, { timeout: 30_000 });
  }));

test('a time or the number of a picture can be typed', () =>
  shown(numbered.page, async (page) => {
    const type = async (text) => {
      await page.keyboard.press('g');
      await page.locator('#clock-field').fill(text);
      await page.keyboard.press('Enter');
    };
    await type('0:02.55');
    await page.waitForFunction(() => zulmViewer.state().time === 2.55);
    assert.ok(await page.locator('#clock-time').isVisible());
    await type('#34');
    await page.waitForFunction(() => zulmViewer.state().isSettled && Math.abs(zulmViewer.state().time - 3.4) < 0.01);
    await settled(page);
    assert.equal((await look(page)).number, 34);
    await page.locator('#clock-time').click();
    await page.locator('#clock-field').fill('nonsense');
    await page.keyboard.press('Enter');
    assert.ok(await page.locator('#clock-field').isVisible());
    assert.ok(!(await page.evaluate(() => document.getElementById('clock-field').checkValidity())));
    await page.keyboard.press('Escape');
    await page.locator('#clock-time').waitFor({ state: 'visible' });
    assert.ok(Math.abs((await state(page)).time - 3.4) < 0.01);
  }));

test('playing goes past idle times', async () => {
  const moving = Array.from({ length: 61 }, (_, i) => [i / 60, 10 * i, 100]);
  const again = Array.from({ length: 61 }, (_, i) => [11 + i / 60, 600 - 10 * i, 300]);
  const plain = join(folder, 'idle-plain.mp4');
  ffmpeg('-f', 'lavfi', '-i', 'color=c=gray:s=640x360:r=10', '-t', '12', '-pix_fmt', 'yuv420p', plain);
  const idle = attached('Idle', plain, { cursorLocation: positionsOf([...moving, ...again]) });
  await shown(idle.page, async (page) => {
    await page.evaluate(() => {
      zulmViewer.seek(0.9);
      globalThis.seen = [];
      const look = () => {
        globalThis.seen.push(zulmViewer.state().time);
        requestAnimationFrame(look);
      };
      look();
    });
    await page.keyboard.press('s');
    await page.locator('#more-button').click();
    assert.ok(await page.locator('#skip-idle').isChecked());
    await page.keyboard.press('Escape');
    await page.keyboard.press('l');
    await page.waitForFunction(() => zulmViewer.state().time > 10.6, null, { timeout: 20_000 });
    const skipped = await page.evaluate(() => seen.filter((time) => time > 4 && time < 10).length);
    assert.equal(skipped, 0, 'nothing between is shown');
    await page.keyboard.press('k');
  });
});

/// Where the cursor is seen in the frame, in parts of its width.
async function cursorIn(page) {
  const clip = await page.locator('#frame').boundingBox();
  const { width, height, data, channels } = pixelsOf(await page.screenshot({ clip }));
  let [sum, count] = [0, 0];
  for (let i = 0; i < width * height; ++i) {
    const at = i * channels;
    if (data[at] > 150 && data[at + 1] < 100 && data[at + 2] > 150) [sum, count] = [sum + (i % width) / width, count + 1];
  }
  return { x: sum / count, count };
}

test('the movie is zoomed by the wheel, by keys and from the menu, and moved by dragging', () =>
  shown(numbered.page, async (page) => {
    for (const layer of ['2', '3', '4', '5']) await page.keyboard.press(layer); // nothing but the cursor
    await page.evaluate(() => zulmViewer.seek(1)); // the cursor is at 340 of 1280
    await settled(page);
    const whole = await cursorIn(page);
    assert.ok(Math.abs(whole.x - 340 / 1280) < 0.01, `${whole.x}`);
    const box = await page.locator('#frame').boundingBox();
    await page.mouse.move(box.x + box.width * whole.x, box.y + (box.height * 200) / 720);
    await page.keyboard.down('Control');
    await page.mouse.wheel(0, -300);
    await page.keyboard.up('Control');
    await page.waitForFunction(() => zulmViewer.state().zoom > 1.5);
    await settled(page);
    const near = await cursorIn(page);
    const { zoom } = await state(page);
    assert.ok(Math.abs(near.x - whole.x) < 0.02, `${near.x} is what ${whole.x} was`);
    assert.ok(Math.abs(near.count / whole.count / zoom ** 2 - 1) < 0.25, `${near.count} pixels of ${whole.count} at ${zoom}`);
    assert.equal(await textOf(page, '#stage-zoom'), `${Math.round(zoom * 100)} %`);
    await page.mouse.move(box.x + box.width * 0.7, box.y + box.height * 0.7);
    await page.mouse.down();
    await page.mouse.move(box.x + box.width * 0.6, box.y + box.height * 0.7, { steps: 4 });
    await page.mouse.up();
    await settled(page);
    const moved = await cursorIn(page);
    assert.ok(Math.abs(near.x - moved.x - 0.1) < 0.02, `from ${near.x} to ${moved.x}`);
    assert.ok(!(await state(page)).playing, 'dragging plays nothing');
    await page.locator('#stage').focus();
    await page.keyboard.press('ArrowRight');
    await settled(page);
    assert.ok((await cursorIn(page)).x < moved.x - 0.05);
    assert.equal((await state(page)).time, 1);
    await page.locator('#stage-zoom').click();
    await page.waitForFunction(() => zulmViewer.state().zoom === 1);
    await page.keyboard.press('z');
    await page.waitForFunction(() => zulmViewer.state().zoom === 1.5);
    await page.keyboard.press('Z');
    await page.waitForFunction(() => zulmViewer.state().zoom === 1);
    await page.locator('#more-button').click();
    await page.getByRole('button', { name: 'Zoom the movie in z' }).click();
    await page.waitForFunction(() => zulmViewer.state().zoom === 1.5);
    await page.getByRole('button', { name: 'Show the whole picture', exact: true }).last().click();
    await page.waitForFunction(() => zulmViewer.state().zoom === 1);
  }));

async function still(page) {
  await page.locator('#more-button').click();
  const [download] = await Promise.all([page.waitForEvent('download'), page.locator('#save-still').click()]);
  return { name: download.suggestedFilename(), png: readFileSync(await download.path()) };
}

test('a picture is saved as large as the movie, with everything over it', async () => {
  const empty = join(folder, 'still.html');
  writeFileSync(empty, emptyPage(readFileSync(numbered.page, 'utf8')));
  const { page, problems, close } = await open(empty, { acceptDownloads: true });
  await page.locator('#file-input').setInputFiles(numbered.movie);
  await opened(page);
  await ready(page);
  await page.evaluate(() => zulmViewer.seek(2.5));
  await settled(page);
  await page.keyboard.press('z'); // the whole picture is saved nevertheless
  const { name, png } = await still(page);
  assert.equal(name, 'Numbered.mp4 2.5.png');
  const pixels = pixelsOf(png);
  assert.deepEqual([pixels.width, pixels.height], [1280, 720]);
  const { number, time } = readPicture(pixels, { x: 0, y: 0, width: 1280, height: 720 });
  assert.equal(number, 25);
  assert.ok(Math.abs(time - 2.5) < 0.01, `${time}`);
  assert.deepEqual(problems, []);
  await close();
});

test('where the browser keeps the movie from the page, the page says what to do', () =>
  shown(numbered.page, async (page) => {
    await page.locator('#more-button').click();
    await page.locator('#save-still').click();
    await page.locator('#notice').waitFor({ state: 'visible' });
    assert.match(await textOf(page, '#notice-text'), /does not let a page read a movie beside it\. Choose the movie under Facts/);
  }));
