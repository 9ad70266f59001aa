// For everybody: no serious fault that axe finds, at any size, in both themes; nothing that leaves the screen.

import assert from 'node:assert/strict';
import { readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { attached, positionsOf } from './numbered.mjs';
import { axeSource, emptyPage, enlarge, folder, open, opened, ready, recordedSession, seek, waitUntil } from './support.mjs';

const recording = recordedSession();
const empty = join(folder, 'empty.html');
writeFileSync(empty, emptyPage(readFileSync(recording.page, 'utf8')));

async function faults(page) {
  await page.evaluate(axeSource);
  const { violations, passes } = await page.evaluate(() => axe.run());
  assert.ok(passes.length > 10, `only ${passes.length} rules were checked`);
  return violations
    .filter(({ impact }) => impact === 'serious' || impact === 'critical')
    .map(
      ({ id, nodes }) => `${id}: ${nodes.map(({ html, failureSummary }) => `${html} ${failureSummary}`).join('; ')}`,
    );
}

/// And waits until the library has said what is in the selection.
async function selectAll(page) {
  await page.keyboard.press('i');
  await page.waitForFunction(() => document.querySelector('.range-facts').textContent.includes('idle'));
}

const views = {
  welcome: { path: empty, show: async () => {} },
  entries: { path: recording.page, show: (page) => seek(page, 3.2) },
  facts: { path: recording.page, show: (page) => page.getByRole('tab', { name: 'Facts' }).click() },
  check: { path: recording.page, show: (page) => page.getByRole('tab', { name: 'Check' }).click() },
  layers: { path: recording.page, show: (page) => page.locator('#layers-button').click() },
  more: { path: recording.page, show: (page) => page.locator('#more-button').click() },
  selection: { path: recording.page, show: (page) => selectAll(page) },
  adjusting: {
    path: recording.page,
    show: async (page) => {
      await page.getByRole('tab', { name: 'Facts' }).click();
      await page.getByRole('button', { name: 'Adjust…' }).click();
    },
  },
  help: { path: recording.page, show: (page) => page.locator('#help-button').click() },
  about: { path: recording.page, show: (page) => page.locator('#about-button').click() },
};

for (const [name, { path, show }] of Object.entries(views))
  test(`axe finds no serious fault: ${name}`, async () => {
    for (const [theme, size] of [
      ['dark', [1280, 800]],
      ['light', [360, 740]],
    ]) {
      const { page, close } = await open(path, { theme, size });
      if (path !== empty) {
        await opened(page);
        await ready(page);
      }
      await show(page);
      await page.waitForTimeout(200);
      assert.deepEqual(await faults(page), [], `${theme} ${size}`);
      await close();
    }
  });

/// Controls that are cut by the edge of the screen, or that lie below another thing; those of the table scroll with it.
function hiddenControls() {
  const width = document.documentElement.clientWidth;
  const controls = [...document.querySelectorAll('button, select, input, [role="tab"]')];
  return controls
    .filter((element) => element.checkVisibility({ visibilityProperty: true }) && element.getBoundingClientRect().width > 0)
    .flatMap((element) => {
      element.scrollIntoView({ block: 'center', inline: 'nearest' });
      const { left, right, top, bottom, width: wide, height } = element.getBoundingClientRect();
      const points = [0.15, 0.5, 0.85].map((part) => document.elementFromPoint(left + wide * part, (top + bottom) / 2));
      const isCovered = points.some((seen) => !seen || !(element.contains(seen) || seen.contains(element)));
      const isSquare = !element.matches('.is-icon') || Math.abs(wide - height) < 2;
      const isCut = left < 0 || right > width + 0.5 || element.scrollWidth > element.clientWidth + 1;
      const name = element.id || element.getAttribute('aria-label') || element.textContent;
      return isCovered || !isSquare || (isCut && !element.matches('input')) ? [`${name} at ${left} to ${right}, ${top}`] : [];
    });
}

for (const [size, text] of [
  [[360, 740], 100],
  [[500, 900], 100],
  [[768, 1024], 100],
  [[1024, 768], 100],
  [[1280, 800], 100],
  [[3840, 2160], 100],
  [[1440, 900], 200],
  [[720, 450], 100], // 1440 by 900, everything twice as large
  [[500, 900], 200],
  [[1280, 800], 200],
  [[1024, 768], 200],
  [[360, 740], 200],
])
  test(`nothing is cut or covered at ${size.join(' by ')}, text at ${text} %`, async () => {
    const { page, close } = await open(recording.page, { size });
    await opened(page);
    await ready(page);
    await enlarge(page, text);
    const { width, stage } = await page.evaluate(() => ({
      width: document.documentElement.scrollWidth,
      stage: document.getElementById('frame').getBoundingClientRect().width,
    }));
    assert.ok(width <= size[0], `${width} pixels`);
    assert.ok(stage > size[0] * (text > 100 ? 0.25 : 0.3), `the movie is ${stage} pixels wide`);
    assert.deepEqual(await page.evaluate(hiddenControls), []);
    await selectAll(page);
    assert.deepEqual(await page.evaluate(hiddenControls), [], 'with a selection');
    const rows = await page.evaluate(() => {
      const { clientHeight } = document.querySelector('.table');
      return (clientHeight - document.querySelector('.table-head').offsetHeight) / document.querySelector('.table-row').offsetHeight;
    });
    assert.ok(rows >= 3, `the table has room for ${rows} rows`);
    await page.evaluate(() => scrollTo(0, 0));
    await seek(page, 4.35);
    const [movie, caption] = [await page.locator('#frame').boundingBox(), await page.locator('#caption').boundingBox()];
    const covered = (caption.width * caption.height) / (movie.width * movie.height);
    assert.ok(covered < 0.12, `the caption covers ${(100 * covered).toFixed(0)} % of the movie`);
    for (const id of ['frame-back', 'frame-forward', 'full-screen', 'clock-total'])
      assert.ok(await page.locator(`#${id}`).isVisible(), id);
    await close();
  });

test('the movie stays in sight where the page scrolls', async () => {
  for (const [size, text] of [
    [[360, 740], 100],
    [[720, 450], 100],
    [[1024, 768], 200],
    [[360, 740], 200],
  ]) {
    const { page, close } = await open(recording.page, { size });
    await opened(page);
    await ready(page);
    await enlarge(page, text);
    await page.evaluate(() => scrollTo(0, document.documentElement.scrollHeight));
    await page.waitForFunction(() => scrollY > 100);
    const { y, height } = await page.locator('#frame').boundingBox();
    assert.ok(y >= 0 && height > 100 && y + height < size[1] * 0.7, `${y} to ${y + height}`);
    await close();
  }
});

test('whoever goes from control to control by the keys sees each of them', async () => {
  for (const [size, text] of [
    [[1024, 768], 100],
    [[360, 740], 100],
    [[1024, 768], 200],
    [[360, 740], 200],
  ]) {
    const { page, close } = await open(recording.page, { size, hash: '#t=4.35&range=3-9' });
    await opened(page);
    await ready(page);
    await enlarge(page, text);
    const covered = [];
    for (let i = 0; i < 60; ++i) {
      await page.keyboard.press('Tab');
      const name = await page.evaluate(() => {
        const element = document.activeElement;
        const { left, right, top, bottom } = element.getBoundingClientRect();
        const parts = [0.1, 0.3, 0.5, 0.7, 0.9];
        const isSeen = parts.flatMap((x) => parts.map((y) => [x, y])).some(([x, y]) => {
          const seen = document.elementFromPoint(left + (right - left) * x, top + (bottom - top) * y);
          return seen && (element.contains(seen) || seen.contains(element));
        });
        return isSeen ? '' : `${element.outerHTML} ${top}`;
      });
      if (name) covered.push(name);
    }
    assert.deepEqual(covered, [], `${size} at ${text} %`);
    await close();
  }
});

test('full screen is full of the movie', async () => {
  const { page, close } = await open(recording.page, { size: [500, 900] });
  await opened(page);
  await ready(page);
  await page.locator('#full-screen').click();
  await page.waitForFunction(() => document.fullscreenElement);
  await page.waitForFunction(() => document.getElementById('stage').offsetHeight > innerHeight * 0.6);
  await close();
});

test('full screen has a scrubber', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  await ready(page);
  assert.equal(await page.locator('#scrubber').isVisible(), false);
  await page.locator('#full-screen').click();
  await page.waitForFunction(() => document.fullscreenElement);
  const box = await page.locator('#scrubber').boundingBox();
  assert.ok(box.y > 0 && box.y + box.height <= page.viewportSize().height);
  await page.mouse.click(box.x + box.width / 2, box.y + box.height / 2);
  await page.waitForFunction(() => Math.abs(zulmViewer.state().time - 10) < 0.2); // the movie looks for the picture
  await page.keyboard.press('Space');
  await page.waitForFunction(() => zulmViewer.state().playing);
  await close();
});

test('while a recording loads nobody is asked for one', async () => {
  const before = () => {
    globalThis.Worker = class {
      postMessage({ type }) {
        const reply = { id: 0, type: 'progress', part: 0.4 }; // and no other: it takes forever
        if (type === 'open') setTimeout(() => this.onmessage({ data: reply }));
      }
      terminate() {}
    };
  };
  const { page, close } = await open(recording.page, { before, size: [360, 740] });
  assert.equal(await page.locator('#welcome-title').innerText(), 'Opening Recording.mp4…');
  assert.ok(await page.locator('.welcome progress').isVisible());
  await page.waitForFunction(() => document.getElementById('opening-progress').value === 0.4);
  assert.equal(await page.locator('#welcome-open').isVisible(), false);
  await close();
});

test('heads of columns are whole', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  for (const kind of ['cursorImage', 'keyboardAction', 'systemData']) {
    await page.getByLabel('Stream', { exact: true }).selectOption(kind);
    const cut = await page.evaluate(() =>
      [...document.querySelectorAll('.table-head > *')]
        .filter(({ scrollWidth, clientWidth }) => scrollWidth > clientWidth)
        .map(({ textContent }) => textContent),
    );
    assert.deepEqual(cut, [], kind);
  }
  await close();
});

test('with large text on a small screen the facts are still read in words', async () => {
  const { page, close } = await open(recording.page, { size: [360, 740] });
  await opened(page);
  await enlarge(page, 200);
  await page.getByRole('tab', { name: 'Facts' }).click();
  await waitUntil(() => page.locator('#pane-facts').innerText(), (text) => text.includes('Length'));
  const broken = await page.evaluate(() => {
    const words = [...document.querySelectorAll('.facts dd')].filter(({ textContent }) => textContent.length < 12);
    const linesOf = (element) => {
      const range = document.createRange();
      range.selectNodeContents(element);
      return new Set([...range.getClientRects()].map(({ top }) => Math.round(top))).size;
    };
    return words.filter((element) => linesOf(element) > 1).map(({ textContent }) => textContent);
  });
  assert.deepEqual(broken, []);
  await close();
});

test('the entries beside the movie need no scrolling sideways', async () => {
  for (const size of [
    [1024, 768],
    [1440, 900],
  ]) {
    const { page, close } = await open(recording.page, { size });
    await opened(page);
    await page.waitForFunction(() => document.querySelector('.entries-status').textContent.includes('entries'));
    const { wide, room } = await page.evaluate(() => {
      const { scrollWidth, clientWidth } = document.querySelector('.table');
      return { wide: scrollWidth, room: clientWidth };
    });
    assert.ok(wide <= room, `${wide} pixels in ${room} at ${size[0]}`);
    await close();
  }
});

test('whoever wants less motion gets no trail', async () => {
  const drawn = async (reducedMotion) => {
    const { page, close } = await open(recording.page, { reducedMotion });
    await opened(page);
    for (const layer of ['1', '2', '3', '5']) await page.keyboard.press(layer);
    await seek(page, 1);
    const painted = await page.evaluate(() => {
      const canvas = document.getElementById('overlay');
      const { data } = canvas.getContext('2d').getImageData(0, 0, canvas.width, canvas.height);
      return data.some((value) => value > 0);
    });
    await close();
    return painted;
  };
  assert.equal(await drawn('no-preference'), true);
  assert.equal(await drawn('reduce'), false);
});

/// The largest contrast of anything drawn in a part of the lanes with the page below it.
function contrastIn({ left, top, width, height }) {
  const canvas = document.querySelector('.lanes-canvas');
  const ratio = canvas.width / canvas.clientWidth;
  const [x, y, w, h] = [left, top, width, height].map((value) => Math.round(value * ratio));
  const { data } = canvas.getContext('2d').getImageData(x, y, w, h);
  const light = (r, g, b) =>
    [r, g, b]
      .map((value) => (value / 255 <= 0.03928 ? value / 255 / 12.92 : ((value / 255 + 0.055) / 1.055) ** 2.4))
      .reduce((sum, value, i) => sum + value * [0.2126, 0.7152, 0.0722][i], 0);
  const page = light(...getComputedStyle(document.querySelector('.timeline')).backgroundColor.match(/[\d.]+/g).map(Number));
  let most = 1;
  for (let i = 0; i < data.length; i += 4) {
    if (data[i + 3] < 250) continue;
    const drawn = light(data[i], data[i + 1], data[i + 2]);
    most = Math.max(most, (Math.max(drawn, page) + 0.05) / (Math.min(drawn, page) + 0.05));
  }
  return most;
}

test('bands, rests and other clicks can be told without fine colours', async () => {
  const rested = attached('Rested', 'plain.mp4', { cursorLocation: positionsOf([[0, 200, 200], [10, 300, 300]]) });
  for (const theme of ['light', 'dark']) {
    const { page, close } = await open(recording.page, { theme });
    await opened(page);
    const placeOf = async (title) => {
      const label = await page.locator('.lane-label', { hasText: title }).boundingBox();
      const body = await page.locator('.lanes-body').boundingBox();
      return { top: label.y - body.y, height: label.height - 1, width: body.width };
    };
    for (const title of ['Application', 'Hover']) {
      const contrast = async () => {
        const { top, width } = await placeOf(title);
        return page.evaluate(contrastIn, { left: width * 0.3, top: top + 2, width: width * 0.3, height: 3 }); // above the names
      };
      await waitUntil(contrast, (contrast) => contrast >= 3, (contrast) => `${theme}: ${title} ${contrast.toFixed(2)}`);
      assert.ok((await placeOf(title)).height > 10);
    }
    // At half its height a disc is as wide as a square, near its top it is not.
    const { top, width } = await placeOf('Clicks');
    const rows = await page.evaluate(
      ({ top, places }) => {
        const canvas = document.querySelector('.lanes-canvas');
        const ratio = canvas.width / canvas.clientWidth;
        const context = canvas.getContext('2d');
        const filled = (x, y) => {
          const { data } = context.getImageData(Math.round((x - 8) * ratio), Math.round(y * ratio), Math.round(16 * ratio), 1);
          return data.filter((value, i) => i % 4 === 3 && value > 200).length / ratio;
        };
        return places.map((x) => filled(x, top + 10 - 3));
      },
      { top, places: [1.5, 8].map((time) => (time / 20) * width) },
    );
    assert.ok(rows[0] <= 5 && rows[1] >= 6, `a left click is ${rows[0]} wide near its top, a right one ${rows[1]}`);
    await close();

    const rest = await open(rested.page, { theme });
    await opened(rest.page);
    const contrast = async () => {
      const { width } = await rest.page.locator('.lanes-body').boundingBox();
      return rest.page.evaluate(contrastIn, { left: width * 0.2, top: 0, width: 40, height: 3 });
    };
    await waitUntil(contrast, (contrast) => contrast >= 3, (contrast) => `${theme}: a rest ${contrast.toFixed(2)}`);
    await rest.close();
  }
});

test('forced colours keep what is selected and what has the keys', async () => {
  const { page, close } = await open(recording.page, { forcedColors: 'active' });
  await opened(page);
  await page.locator('.table-row:visible').nth(3).click();
  const colours = (selector) =>
    page.evaluate((selector) => {
      const { backgroundColor, outlineStyle, outlineWidth, color } = getComputedStyle(document.querySelector(selector));
      return { backgroundColor, outlineStyle, outlineWidth, color };
    }, selector);
  const plain = await colours('.table-row:not(.is-selected)');
  const selected = await colours('.table-row.is-selected');
  assert.notEqual(selected.backgroundColor, plain.backgroundColor);
  await page.keyboard.press('Shift+Tab');
  const focused = await colours(':focus');
  assert.ok(focused.outlineStyle === 'solid' && parseFloat(focused.outlineWidth) >= 2, JSON.stringify(focused));
  await close();
});

test('splitters tell their place, Escape closes the menu, keys move the lanes', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  const value = async (name) => Number(await page.locator('#side-splitter').getAttribute(`aria-value${name}`));
  const width = async () => (await page.locator('.side').boundingBox()).width;
  assert.ok(Math.abs((await value('now')) - (await width())) <= 1);
  assert.equal(await value('max'), 768);
  await page.locator('#side-splitter').focus();
  await page.keyboard.press('ArrowLeft');
  assert.ok(Math.abs((await value('now')) - (await width())) <= 1);
  await page.locator('#layers-button').click();
  await page.locator('#play').focus();
  await page.keyboard.press('Escape');
  await page.locator('#layers-menu').waitFor({ state: 'hidden' });
  for (let i = 0; i < 3; ++i) await page.keyboard.press('+');
  await page.keyboard.press('>');
  await page.keyboard.press('>');
  const shown = () => page.locator('.overview-window').evaluate((element) => parseFloat(element.style.left));
  await page.waitForFunction(() => parseFloat(document.querySelector('.overview-window').style.left) > 5);
  const before = await shown();
  await page.keyboard.press('<');
  await page.waitForFunction((before) => parseFloat(document.querySelector('.overview-window').style.left) < before, before);
  await close();
});

test('units and words are those of the reader', async () => {
  const { page, close } = await open(recording.page);
  await opened(page);
  await page.keyboard.press('t');
  await seek(page, 3.6);
  const labels = (await page.locator('.lane-labels').innerText()).replaceAll('\n', ' ');
  assert.match(labels, /CPU usage [\d.]+ %/);
  assert.match(labels, /Scroll [↑↓] \d+ px/);
  assert.equal(await page.locator('#caption kbd').innerText(), 'Return');
  assert.deepEqual(await page.locator('.legend').allInnerTexts(), ['x', 'y']);
  assert.equal(await page.locator('#heat-legend').isVisible(), false);
  await page.keyboard.press('7');
  await page.locator('#heat-legend').waitFor({ state: 'visible' });
  await page.getByRole('tab', { name: 'Facts' }).click();
  await waitUntil(() => page.locator('#pane-facts').innerText(), (text) => /Memory\s+[\d.]+ GB/.test(text));
  assert.doesNotMatch(await page.locator('body').innerText(), /keystroke/i);
  await close();
});
