// Files that are no recordings, or damaged: their errors are told in words, and the page lives on.

import assert from 'node:assert/strict';
import { readdirSync, readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { emptyPage, folder, open, opened, recordedSession, setting, state, textOf, zulm } from './support.mjs';

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
