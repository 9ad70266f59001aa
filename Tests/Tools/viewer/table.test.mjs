// The table of entries: its order, its pictures, and what is found in it.

import assert from 'node:assert/strict';
import { test } from 'node:test';
import { enlarge, open, opened, recordedSession, seek, state, waitUntil } from './support.mjs';

const recording = recordedSession();

async function withStream(kind, work) {
  const { page, problems, close } = await open(recording.page);
  await opened(page);
  await page.waitForFunction((kind) => document.querySelector(`option[value="${kind}"]`), kind);
  await page.getByLabel('Stream', { exact: true }).selectOption(kind);
  await work(page);
  assert.deepEqual(problems, []);
  await close();
}

/// The cells of a column, as far as they are in sight, from top to bottom.
function cells(page, column) {
  return page.evaluate((column) => {
    const rows = [...document.querySelectorAll('.table-row')].filter(({ hidden }) => !hidden);
    const top = (row) => row.getBoundingClientRect().top;
    return rows.sort((a, b) => top(a) - top(b)).map((row) => row.children[column].textContent);
  }, column);
}

/// Until the column is in order; the table sorts beside the page.
async function sorted(page, column, direction) {
  await page.waitForFunction(
    ({ column, direction }) => {
      const head = document.querySelectorAll('.table-head > *')[column];
      if ((head.getAttribute('aria-sort') ?? '') !== direction) return false;
      return !document.querySelector('.entries-status').textContent.includes('Sorting');
    },
    { column, direction },
  );
}

test('a column sorts upwards, downwards and not at all', () =>
  withStream('cursorLocation', async (page) => {
    const before = await cells(page, 0);
    const button = page.getByRole('button', { name: 'Sort by X' });
    const isOrdered = (values, sign) => values.every((value, i) => i === 0 || sign * (value - values[i - 1]) >= 0);
    const first = (await cells(page, 1))[0];
    await button.click();
    await sorted(page, 1, 'ascending');
    await page.waitForFunction(
      (first) => document.querySelector('.table-row').children[1].textContent !== first,
      first,
    );
    const upwards = (await cells(page, 1)).map(Number);
    assert.ok(isOrdered(upwards, 1), String(upwards));
    await button.click();
    await sorted(page, 1, 'descending');
    await page.waitForFunction(
      (least) => Number(document.querySelector('.table-row').children[1].textContent) > least,
      upwards.at(-1),
    );
    const downwards = (await cells(page, 1)).map(Number);
    assert.ok(isOrdered(downwards, -1), String(downwards));
    await button.focus();
    await page.keyboard.press('Enter');
    await sorted(page, 1, '');
    await page.waitForFunction(
      (time) => document.querySelector('.table-row').children[0].textContent === time,
      before[0],
    );
  }));

test('a row of a sorted table leads to its time, and a filter keeps the order', () =>
  withStream('cursorLocation', async (page) => {
    await page.getByRole('button', { name: 'Sort by Y' }).click();
    await page.getByRole('button', { name: 'Sort by Y' }).click();
    await sorted(page, 2, 'descending');
    await page.getByLabel('Filter entries').fill('y<300 y>200');
    await page.waitForFunction(() => / of /.test(document.querySelector('.entries-status').textContent));
    await page.waitForFunction(() => {
      const values = [...document.querySelectorAll('.table-row')]
        .filter(({ hidden }) => !hidden)
        .map((row) => Number(row.children[2].textContent));
      return values.length > 2 && values[0] < 300 && values.every((y, i) => i === 0 || y <= values[i - 1]);
    });
    const row = page.locator('.table-row').nth(2);
    const { id, time } = await row.evaluate((row) => ({ id: row.dataset.row, time: row.children[0].textContent }));
    await row.click();
    const [minutes, seconds] = time.split(':').map(Number);
    assert.ok(Math.abs((await state(page)).time - 60 * minutes - seconds) < 0.001);
    await page.waitForFunction(
      (id) => document.querySelector(`.table-row[data-row="${id}"]`)?.classList.contains('is-selected'),
      id,
    );
  }));

test('texts sort as people do, and all streams by their names', () =>
  withStream('topmostAppName', async (page) => {
    await page.getByRole('button', { name: 'Sort by Name' }).click();
    await sorted(page, 1, 'ascending');
    await page.waitForFunction(() => {
      const names = [...document.querySelectorAll('.table-row')]
        .filter(({ hidden }) => !hidden)
        .map((row) => row.children[1].textContent);
      return names.every((name, i) => i === 0 || names[i - 1].localeCompare(name, 'en') <= 0);
    });
    await page.getByLabel('Stream', { exact: true }).selectOption('');
    assert.equal(await page.locator('[aria-sort]').count(), 0, 'another stream comes as it is');
    await page.getByRole('button', { name: 'Sort by Stream' }).click();
    await page.getByRole('button', { name: 'Sort by Stream' }).click();
    await sorted(page, 1, 'descending');
    await page.waitForFunction(() => document.querySelector('.table-row').children[1].textContent === 'Topmost window title');
    assert.equal(await page.getByRole('button', { name: 'Sort by Entry' }).count(), 0);
  }));

/// The number of the first row that is whole, below the head.
function firstRow(page) {
  return page.evaluate(() => {
    const { bottom } = document.querySelector('.table-head').getBoundingClientRect();
    const rows = [...document.querySelectorAll('.table-row')].filter(({ hidden }) => !hidden);
    const tops = rows.map((row) => ({ row: Number(row.dataset.row), top: row.getBoundingClientRect().top }));
    return Math.min(...tops.filter(({ top }) => top > bottom - 1).map(({ row }) => row));
  });
}

test('the table shows the same rows after the size of the text changes', () =>
  withStream('cursorLocation', async (page) => {
    await page.evaluate(() => (document.querySelector('.table').scrollTop = 100 * document.querySelector('.table-row').offsetHeight));
    await waitUntil(() => firstRow(page), (row) => row === 100);
    for (const text of [200, 100, 150]) {
      await enlarge(page, text);
      await waitUntil(() => firstRow(page), (row) => row === 100);
    }
  }));

test('cursors are shown in the table as they look', () =>
  withStream('cursorImage', async (page) => {
    await page.waitForFunction(() => {
      const rows = [...document.querySelectorAll('.table-row')].filter(({ hidden }) => !hidden);
      return rows.length > 2 && rows.every((row) => row.querySelector('.thumbnail.is-decoded'));
    });
    const shown = await page.evaluate(() =>
      [...document.querySelectorAll('.table-row')]
        .filter(({ hidden, querySelector }) => !hidden)
        .map((row) => {
          const canvas = row.querySelector('.thumbnail');
          const { data } = canvas.getContext('2d').getImageData(0, 0, canvas.width, canvas.height);
          const id = [...row.children].find((cell) => /^\d+$/.test(cell.textContent))?.textContent;
          return { id, seen: data.some((value, i) => i % 4 === 3 && value > 0), picture: data.join() };
        }),
    );
    assert.ok(shown.every(({ seen }) => seen), 'every row has a picture, also those that use an earlier image');
    assert.ok(new Set(shown.map(({ picture }) => picture)).size > 1, 'not all cursors look alike');
    await seek(page, 8);
    await page.getByLabel('Stream', { exact: true }).selectOption('cursorLocation');
    await page.waitForFunction(() => document.querySelectorAll('.thumbnail').length === 0);
  }));
