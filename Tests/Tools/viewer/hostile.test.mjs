// Files that are no recordings, or damaged: their errors are told in words, and the page lives on.

import assert from 'node:assert/strict';
import { readdirSync, readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { attached, ffmpeg, positionsOf, regionOf } from './numbered.mjs';
import { emptyPage, folder, open, opened, ready, recordedSession, setting, state, textOf, zulm } from './support.mjs';

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
    assert.match(await textOf(page, '.verdict'), /Nothing is damaged\./);
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
