// A range of time that the reader selects: what is said of it, and what other programs make of it.

import assert from 'node:assert/strict';
import { execFileSync } from 'node:child_process';
import { mkdirSync, readFileSync, renameSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { ffmpeg } from './numbered.mjs';
import { drawn, folder, open, opened, ready, recordedSession, seek, state, textOf, waitUntil, zulm } from './support.mjs';

const recording = recordedSession();

async function shown(work, options = {}) {
  const { page, problems, close } = await open(recording.page, options);
  await opened(page);
  await ready(page);
  await work(page);
  assert.deepEqual(problems, []);
  await close();
}

/// Waits until that range is selected, to a hundredth of a second.
function selected(page, from, to, near = 0.01) {
  return page.waitForFunction(
    ([from, to, near]) => {
      const { selection } = zulmViewer.state();
      return selection && Math.abs(selection.from - from) < near && Math.abs(selection.to - to) < near;
    },
    [from, to, near],
  );
}

/// Waits until the library has answered.
async function factsOf(page) {
  await page.waitForFunction(() => document.querySelector('.range-facts').textContent.includes('idle'));
  return textOf(page, '.range-facts');
}

async function select(page, from, to) {
  await seek(page, from);
  await page.keyboard.press('i');
  await seek(page, to);
  await page.keyboard.press('o');
  await selected(page, from, to);
}

test('dragging with Shift selects, in the lanes and in the ruler; edges can be moved; Escape selects nothing', () =>
  shown(async (page) => {
    for (const name of ['.lanes-body', '.ruler']) {
      const box = await page.locator(name).boundingBox();
      const y = box.y + Math.min(12, box.height / 2);
      const at = (time) => box.x + (box.width * time) / 20;
      const before = (await state(page)).time;
      await page.keyboard.down('Shift');
      await page.mouse.move(at(12), y);
      await page.mouse.down();
      await page.mouse.move(at(8), y, { steps: 3 });
      await page.mouse.move(at(6), y, { steps: 3 });
      await page.mouse.up();
      await page.keyboard.up('Shift');
      await selected(page, 6, 12, 0.05);
      assert.equal((await state(page)).time, before, 'the playhead stays');
      const range = await page.locator('.range').boundingBox();
      assert.ok(Math.abs(range.x - at(6)) < 2 && Math.abs(range.x + range.width - at(12)) < 2, `${range.x}`);
      const edge = await page.locator('.range-edge.is-to').boundingBox();
      await page.mouse.move(edge.x + 3, edge.y + 8);
      await page.mouse.down();
      await page.mouse.move(edge.x + 3 + (box.width * 2) / 20, edge.y + 8, { steps: 4 });
      await page.mouse.up();
      await selected(page, 6, 14, 0.05);
      await page.keyboard.press('Escape');
      await page.waitForFunction(() => zulmViewer.state().selection === null);
      assert.ok(!(await page.locator('.range-bar').isVisible()));
    }
  }));

test('the bar shows its selection in the lanes and lets it go; the menu and clicks with Shift select', () =>
  shown(async (page) => {
    const selectNothing = async () => {
      await page.getByRole('button', { name: 'Select nothing' }).click();
      await page.waitForFunction(() => zulmViewer.state().selection === null);
    };
    await select(page, 4, 8);
    await page.getByRole('button', { name: 'Show in the lanes' }).click();
    await page.waitForFunction(() => Math.abs(parseFloat(document.querySelector('.zoom-text').textContent) - 4) < 0.02);
    await selectNothing();
    await seek(page, 5);
    await page.locator('#more-button').click();
    await page.locator('#select-some').click();
    await selected(page, 5, 6, 0.05);
    for (const name of ['.lanes-body', '.ruler']) {
      await selectNothing();
      const { x, y, width, height } = await page.locator(name).boundingBox();
      await page.keyboard.down('Shift');
      await page.mouse.click(x + width * 0.75, y + Math.min(12, height / 2));
      await page.keyboard.up('Shift');
      await selected(page, 5, 7, 0.05);
      assert.ok(Math.abs((await state(page)).time - 5) < 0.01, 'the playhead stays');
    }
  }));

test('Shift with arrow keys selects in the timeline', () =>
  shown(async (page) => {
    await seek(page, 4);
    await page.locator('.ruler').focus();
    await page.keyboard.press('Shift+ArrowRight');
    await page.waitForFunction(() => zulmViewer.state().selection?.from === 4);
    const step = (await state(page)).selection.to - 4;
    assert.ok(step > 0.05 && step < 2, `${step}`);
    await page.keyboard.press('Shift+ArrowLeft');
    await page.keyboard.press('Shift+ArrowLeft');
    await selected(page, 4 - step, 4);
    await page.keyboard.press('Shift+End');
    await selected(page, 4, (await state(page)).duration);
  }));

test('in and out points select, and the library tells what happened between them', () =>
  shown(async (page) => {
    await select(page, 1, 9);
    const facts = await factsOf(page);
    const keys = JSON.parse(zulm('dump', '--format', 'json', '--stream', 'keyboardAction', 'Recording.mp4')).files[0].streams[0].entries;
    const between = keys.filter(({ timestamp }) => timestamp >= 1 && timestamp < 9).length;
    assert.match(facts, new RegExp(`^8 s · \\d+ clicks · ${between} keys · idle [\\d:.]+ · [\\d,]+ px · \\S.* [\\d:.]+`));
    assert.equal(await textOf(page, '.range-times'), '0:01.000 – 0:09.000');
    await seek(page, 9);
    await page.keyboard.press('i');
    await selected(page, 9, (await state(page)).duration);
  }));

test('parts of a range add up to the whole', () =>
  shown(async (page) => {
    const numbers = async (from, to) => {
      await select(page, from, to);
      const [, clicks, keys, px] = /· (\d+) clicks? · (\d+) keys? · idle \S+ · ([\d,]+) px/.exec(await factsOf(page));
      await page.keyboard.press('Escape');
      await page.waitForFunction(() => zulmViewer.state().selection === null);
      return [clicks, keys, px].map((text) => Number(text.replaceAll(',', '')));
    };
    const [first, second, whole] = [await numbers(2, 7), await numbers(7, 16), await numbers(2, 16)];
    assert.deepEqual([first[0] + second[0], first[1] + second[1]], [whole[0], whole[1]]);
    assert.ok(Math.abs(first[2] + second[2] - whole[2]) <= 1, `${first[2]} and ${second[2]} is not ${whole[2]}`);
    assert.ok(whole[0] > 0 && whole[1] > 0 && whole[2] > 100, whole.join());
  }));

test('a selection loops', () =>
  shown(async (page) => {
    await select(page, 3, 3.6);
    await page.keyboard.press('r');
    assert.equal(await page.getByLabel('Loop').getAttribute('aria-pressed'), 'true');
    await page.evaluate(() => {
      globalThis.times = [];
      const look = () => {
        globalThis.times.push(zulmViewer.state().time);
        requestAnimationFrame(look);
      };
      zulmViewer.seek(3.2);
      look();
    });
    await page.keyboard.press('Space');
    const wraps = () => times.filter((time, i) => i > 0 && time < times[i - 1] - 0.2).length >= 2;
    await page.waitForFunction(wraps, null, { timeout: 30_000 });
    const [least, most] = await page.evaluate(() => [Math.min(...times.slice(3)), Math.max(...times.slice(3))]);
    assert.ok(least > 2.9 && most < 4.5, `${least} to ${most}`); // a busy browser leaves out pictures
    const staysBeyond = () => times.some((time, i) => time >= 3.6 && times[i + 1] >= 3.6);
    assert.ok(!(await page.evaluate(staysBeyond)), 'the first picture after the end leads back');
    await page.keyboard.press('Space');
  }));

test('the heat map can tell of the selection alone', () =>
  shown(async (page) => {
    await seek(page, 10);
    for (const layer of ['1', '2', '3', '4', '5']) await page.keyboard.press(layer); // nothing that is decoded first
    await page.keyboard.press('7');
    const picture = () => page.evaluate(() => document.getElementById('overlay').toDataURL());
    await page.locator('#heat-legend').waitFor({ state: 'visible' });
    await select(page, 1, 2);
    await seek(page, 10);
    await factsOf(page); // the bar has its size
    await drawn(page);
    const whole = await picture();
    await page.getByRole('button', { name: 'Heat map' }).click();
    await page.waitForFunction((whole) => document.getElementById('overlay').toDataURL() !== whole, whole);
    await page.getByRole('button', { name: 'Heat map' }).click();
    await page.waitForFunction((whole) => document.getElementById('overlay').toDataURL() === whole, whole);
    const heat = page.getByRole('button', { name: 'Heat map' });
    await heat.click();
    await page.keyboard.press('7');
    await page.locator('#heat-legend').waitFor({ state: 'hidden' });
    assert.equal(await heat.getAttribute('aria-pressed'), 'false', 'the map is hidden, whatever it told of');
    await heat.click();
    await page.locator('#heat-legend').waitFor({ state: 'visible' });
    await heat.click();
    await page.locator('#heat-legend').waitFor({ state: 'hidden' }); // as it was before
  }));

test('a link holds the selection', async () => {
  const { page, close } = await open(recording.page, { hash: '#t=2&range=1.5-3' });
  await opened(page);
  await selected(page, 1.5, 3, 1e-9);
  assert.equal((await state(page)).time, 2);
  await page.context().grantPermissions(['clipboard-read', 'clipboard-write']);
  await page.getByLabel('Copy a link').click();
  const copied = () => page.evaluate(() => navigator.clipboard.readText());
  await waitUntil(copied, (text) => /Recording\.html#t=2&range=1\.5-3$/.test(text));
  await factsOf(page);
  await page.getByLabel('Copy', { exact: true }).click();
  await waitUntil(copied, (text) => text.startsWith('From'));
  assert.match(await copied(), /^From\t0:01\.500\nTo\t0:03\.000\nLength\t1\.5 s\nClicks\t\d+\nKeys\t\d+\nIdle\t\S+\nDistance\t[\d,]+ px\n/);
  await page.evaluate(() => (location.hash = '#t=5&range=4-6'));
  await selected(page, 4, 6, 1e-9);
  await page.keyboard.press('Escape');
  await page.waitForFunction(() => location.hash === '#t=5');
  await close();
});

test('the entries of a selection are those in the table', () =>
  shown(async (page) => {
    await select(page, 1, 3);
    await page.getByLabel('Filter the entries').click();
    assert.equal(await page.getByLabel('Filter entries').inputValue(), 'time>=1 time<3');
    await page.waitForFunction(() => / of /.test(document.querySelector('.entries-status').textContent));
  }));

async function saved(page, name) {
  const [download] = await Promise.all([page.waitForEvent('download'), page.getByLabel(name).click()]);
  const path = join(folder, download.suggestedFilename());
  await download.saveAs(path);
  return download.suggestedFilename();
}

function duration(movie) {
  const parameters = ['-v', 'error', '-show_entries', 'format=duration', '-of', 'csv=p=0', join(folder, movie)];
  return Number(execFileSync('ffprobe', parameters, { encoding: 'utf8' }));
}

test('zulm and ffmpeg cut by the lists that are saved', () =>
  shown(
    async (page) => {
      await select(page, 2, 5);
      const edits = await saved(page, 'Save as an edit list');
      assert.equal(edits, 'Recording.mp4.edits.json');
      assert.deepEqual(JSON.parse(readFileSync(join(folder, edits), 'utf8')), {
        schema: 'zulm.edits',
        schema_version: 1,
        pieces: [{ start: '2', end: '5' }],
      });
      zulm('cut', 'Recording.mp4', '--edits', edits, '-o', 'Cut.mp4', '--force');
      assert.ok(Math.abs(duration('Cut.mp4') - 3) < 0.1, `${duration('Cut.mp4')}`);
      const times = (movie) =>
        JSON.parse(zulm('dump', '--format', 'json', '--stream', 'cursorAction', movie))
          .files[0].streams[0].entries.map(({ timestamp }) => timestamp);
      const kept = times('Recording.mp4').filter((time) => time >= 2 && time < 5);
      assert.ok(kept.length > 0);
      for (const time of kept)
        assert.ok(times('Cut.mp4').some((other) => Math.abs(other - (time - 2)) < 1e-6), `${time} in ${times('Cut.mp4')}`);
      const list = await saved(page, 'Save as a list for ffmpeg');
      assert.equal(list, 'Recording.mp4.ffconcat');
      const text = readFileSync(join(folder, list), 'utf8');
      assert.equal(text, "ffconcat version 1.0\nfile 'Recording.mp4'\ninpoint 2\noutpoint 5\n");
      mkdirSync(join(folder, 'intra'), { recursive: true }); // where ffmpeg can begin with any picture
      renameSync(join(folder, list), join(folder, 'intra', list));
      const coding = ['-c:v', 'libx264', '-preset', 'ultrafast', '-g', '1'];
      ffmpeg('-i', recording.movie, ...coding, join(folder, 'intra', 'Recording.mp4'));
      ffmpeg('-f', 'concat', '-safe', '0', '-i', join(folder, 'intra', list), ...coding, join(folder, 'ByList.mp4'));
      assert.ok(Math.abs(duration('ByList.mp4') - 3) < 0.3, `${duration('ByList.mp4')}`);
      zulm('retime', 'Recording.mp4', '--movie', 'ByList.mp4', '--edits', `intra/${list}`, '-o', 'Retimed.mp4', '--force');
      assert.deepEqual(times('Retimed.mp4'), times('Cut.mp4'));
    },
    { acceptDownloads: true },
  ));
