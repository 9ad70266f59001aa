// Notes at times, and links that carry what is shown.

import assert from 'node:assert/strict';
import { readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { folder, open, opened, ready, recordedSession, seek, state } from './support.mjs';

const recording = recordedSession();

async function opening(options, work) {
  const { page, problems, close } = await open(recording.page, options);
  await opened(page);
  await ready(page);
  await page.waitForFunction(() => document.querySelector('.entries-status').textContent !== '');
  await work(page);
  assert.deepEqual(problems, []);
  await close();
}

async function note(page, time, text) {
  await seek(page, time);
  const before = await page.locator('.notes li').count();
  await page.getByLabel('Note at the playhead').fill(text);
  await page.keyboard.press('Enter');
  await page.waitForFunction((count) => document.querySelectorAll('.notes li').length === count, before + 1);
}

function notes(page) {
  return page.evaluate(() =>
    [...document.querySelectorAll('.notes li')].map((item) => [
      item.querySelector('.note-time').textContent,
      item.querySelector('textarea').value,
    ]),
  );
}

test('a note stands at its time, in the list and in a lane, and in the next visit', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  await page.keyboard.press('b');
  await page.waitForFunction(() => document.activeElement.getAttribute('aria-label') === 'Note at the playhead');
  await note(page, 12.5, 'the second dialog');
  await note(page, 3.25, 'begins <b>here</b>');
  const wanted = [
    ['0:03.250', 'begins <b>here</b>'],
    ['0:12.500', 'the second dialog'],
  ];
  assert.deepEqual(await notes(page), wanted);
  await page.waitForFunction(() => document.querySelector('.lane-label[data-lane="Notes"]'));
  await page.getByRole('button', { name: 'Go to 0:12.500' }).click();
  await page.waitForFunction(() => zulmViewer.state().time === 12.5);
  await page.waitForFunction(() =>
    document.querySelector('.lane-label[data-lane="Notes"] .lane-value').textContent.includes('second dialog'),
  );
  await page.reload();
  await opened(page);
  await page.waitForFunction(() => document.querySelectorAll('.notes li').length === 2);
  assert.deepEqual(await notes(page), wanted);
  await page.getByRole('tab', { name: 'Notes' }).click();
  await page.getByLabel('Note at 0:03.250', { exact: true }).fill('begins later');
  await page.getByRole('button', { name: 'Remove the note at 0:12.500' }).click();
  await page.waitForFunction(() => document.querySelectorAll('.notes li').length === 1);
  assert.deepEqual(await notes(page), [['0:03.250', 'begins later']]);
  await close();
});

test('whoever writes notes that the browser does not keep is told once', async () => {
  const before = () => {
    const refuse = () => {
      throw new Error('no storage');
    };
    Object.defineProperty(globalThis, 'localStorage', { get: refuse });
  };
  await opening({ before }, async (page) => {
    await page.getByRole('tab', { name: 'Notes' }).click();
    await note(page, 2, 'first');
    await page.waitForFunction(() => document.getElementById('notice-text').textContent.includes('does not keep notes'));
    await page.locator('#notice-close').click();
    await note(page, 4, 'second');
    assert.equal(await page.locator('#notice').isVisible(), false);
    assert.deepEqual(await notes(page), [
      ['0:02.000', 'first'],
      ['0:04.000', 'second'],
    ]);
  });
});

test('notes belong to the recording, and move with it', async () => {
  const { page, close } = await open(recording.page, { hash: '#t=0&offset=-1.5' });
  await opened(page);
  await page.keyboard.press('b');
  await note(page, 5, 'here');
  await page.evaluate(() => (location.hash = '#offset=2'));
  await page.waitForFunction(() => document.querySelector('.note-time').textContent === '0:08.500');
  await page.goto(page.url().replace(/#.*/, ''));
  await page.reload();
  await opened(page);
  await page.waitForFunction(() => document.querySelectorAll('.notes li').length === 1);
  assert.deepEqual(await notes(page), [['0:06.500', 'here']]);
  await close();
});

test('notes are saved in three forms, and each is read again', () =>
  opening({}, async (page) => {
    await page.keyboard.press('b');
    await note(page, 1.5, 'one, "two"');
    await note(page, 65 / 4, 'größer – ≥');
    const wanted = await notes(page);
    const saved = {};
    for (const name of ['JSON', 'CSV', 'Markdown']) {
      const [download] = await Promise.all([
        page.waitForEvent('download'),
        page.getByRole('button', { name: `Save the notes as ${name}` }).click(),
      ]);
      saved[name] = join(folder, `${name}-${download.suggestedFilename()}`);
      writeFileSync(saved[name], readFileSync(await download.path()));
    }
    assert.deepEqual(JSON.parse(readFileSync(saved.JSON, 'utf8')).notes, [
      { time: 1.5, text: 'one, "two"' },
      { time: 16.25, text: 'größer – ≥' },
    ]);
    assert.match(readFileSync(saved.CSV, 'utf8'), /^time,text\n1\.5,"one, ""two"""\n/);
    assert.match(readFileSync(saved.Markdown, 'utf8'), /\n- `0:16\.250` größer – ≥\n$/);
    for (const file of Object.values(saved)) {
      for (let left = await page.locator('.notes li').count(); left > 0; --left) {
        await page.getByRole('button', { name: /^Remove the note/ }).first().click();
        await page.waitForFunction((left) => document.querySelectorAll('.notes li').length === left - 1, left);
      }
      await page.setInputFiles('#pane-notes input[type="file"]', file);
      await page.waitForFunction((count) => document.querySelectorAll('.notes li').length === count, wanted.length);
      assert.deepEqual(await notes(page), wanted);
    }
    const other = join(folder, 'other.json');
    writeFileSync(other, '{"nothing": 1}');
    await page.setInputFiles('#pane-notes input[type="file"]', other);
    await page.waitForFunction(() => document.getElementById('notice-text').textContent.startsWith('other.json holds no notes'));
    assert.deepEqual(await notes(page), wanted);
  }));

const shown = (page) =>
  page.evaluate(() => ({
    stream: document.querySelector('.entries-head select').value,
    filter: document.querySelector('.entries-head input').value,
    zoom: document.querySelector('.zoom-text').textContent,
    heat: [...document.querySelectorAll('#layers-menu input')].at(6).checked,
    cursor: [...document.querySelectorAll('#layers-menu input')].at(0).checked,
  }));

test('a link carries time, zoom, stream, filter and layers', async () => {
  const hash = '#range=1-2&t=12.5&zoom=10-15&stream=cursorAction&filter=action%3Dleft&layers=cursor,heat';
  await opening({ hash }, async (page) => {
    await page.waitForFunction(() => document.querySelector('.entries-head select').value === 'cursorAction');
    assert.equal((await state(page)).time, 12.5);
    const wanted = { stream: 'cursorAction', filter: 'action=left', zoom: '5.00 s', heat: true, cursor: true };
    assert.deepEqual(await shown(page), wanted);
    assert.match(await page.locator('.entries-status').innerText(), / of 13$/);
    await seek(page, 11);
    await page.waitForFunction(() => /[#&]t=11(&|$)/.test(location.hash));
    const link = await page.evaluate(() => location.hash);
    assert.equal(link, hash.replace('t=12.5', 't=11'), 'all parts stay, also the one that is not known here');
  });
});

test('the address follows what is chosen, and only that', () =>
  opening({}, async (page) => {
    await seek(page, 2);
    await page.waitForFunction(() => location.hash === '#t=2');
    await page.keyboard.press('7');
    await page.waitForFunction(() => /layers=[a-z,]*heat/.test(location.hash));
    await page.keyboard.press('7');
    await page.waitForFunction(() => !location.hash.includes('layers'));
    await page.getByLabel('Stream', { exact: true }).selectOption('keyboardAction');
    await page.getByLabel('Filter entries').fill('a & b');
    await page.waitForFunction(() => location.hash === '#t=2&stream=keyboardAction&filter=a%20%26%20b');
    await page.getByLabel('Filter entries').fill('');
    await page.getByLabel('Stream', { exact: true }).selectOption('');
    await page.evaluate(() => document.activeElement.blur());
    await page.keyboard.press('+');
    await page.waitForFunction(() => /^#t=2&zoom=[\d.]+-[\d.]+$/.test(location.hash));
    await page.evaluate(() => (location.hash = '#t=5&zoom=4-8&stream=cursorImage'));
    await page.waitForFunction(() => zulmViewer.state().time === 5);
    await page.waitForFunction(() => document.querySelector('.entries-head select').value === 'cursorImage');
    assert.equal((await shown(page)).zoom, '4.00 s');
  }));

test('a link to what is not there shows everything', () =>
  opening({ hash: '#t=900&zoom=9-1&stream=nothing&layers=unknown&filter=' }, async (page) => {
    const { time, duration } = await state(page);
    assert.ok(time <= duration);
    assert.deepEqual(await shown(page), { stream: '', filter: '', zoom: 'all', heat: false, cursor: true });
  }));
