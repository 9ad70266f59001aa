// The page and the renderer have the cursor at the same place, whatever the time is.

import assert from 'node:assert/strict';
import { execFileSync } from 'node:child_process';
import { mkdtempSync, readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { test } from 'node:test';
import { attached, ffmpeg, imagesOf, imageEntry, pixelsOf, positionsOf, regionOf, settled } from '../viewer/numbered.mjs';
import { folder, open, opened, ready, setting } from '../viewer/support.mjs';

const size = { width: 640, height: 360 };
const seconds = 10;
const count = 200;
const most = 0.5; // pixels
const layers = ['2', '3', '4', '5']; // of the page, which would be drawn over the cursor or beside it

/// Numbers from 0 up to 1 that look random, and are the same in every run.
function* numbers(seed) {
  for (let state = seed; ; ) {
    state = (Math.imul(state, 1664525) + 1013904223) >>> 0;
    yield state / 2 ** 32;
  }
}
const random = numbers(21);
const next = () => random.next().value;
const within = (value, least, largest) => Math.min(largest, Math.max(least, value));

/// A black movie, and a cursor that trembles and rests. Nothing else is drawn.
function recording() {
  ffmpeg('-f', 'lavfi', '-i', `color=c=black:s=${size.width}x${size.height}:r=30:d=${seconds}`, '-c:v', 'libx264', '-pix_fmt', 'yuv420p', join(folder, 'black.mp4'));
  ffmpeg('-f', 'lavfi', '-i', 'color=c=white:s=11x13,format=rgba', '-frames:v', '1', join(folder, 'cursor.png'));
  const positions = [];
  for (let time = 0, x = 300, y = 200; time < seconds; time += next() < 0.02 ? 0.4 : 1 / 60) {
    positions.push([time, x, y]);
    x = within(x + Math.round(next() * 18 - 9), 30, size.width - 40);
    y = within(y + Math.round(next() * 14 - 7), 30, size.height - 30);
  }
  return attached('Trembling', 'black.mp4', {
    cursorLocation: positionsOf(positions),
    cursorImage: imagesOf(imageEntry(0, 1, [3, 4], readFileSync(join(folder, 'cursor.png')))),
    recordingRegion: regionOf([0, 0, 0, size.width, size.height]),
  });
}

const bare = {
  schema: 'zulm.style',
  schema_version: 1,
  background: { color: '#000000' },
  frame: { padding: 0, corner_radius: 0, shadow_opacity: 0 },
  cursor: { size: 1, smooth: false },
  clicks: { show: false },
  keys: { display: 'hidden' },
  zoom: { auto: false },
};

/// Returns where the middle of the cursor is in the frames that the renderer writes.
function fromRenderer({ movie }, times) {
  const style = join(folder, 'bare.json');
  const frames = mkdtempSync(join(folder, 'frames-'));
  writeFileSync(style, JSON.stringify(bare));
  execFileSync(setting('ZULM_RENDER'), ['render', movie, '--frames', frames, '--at', times.join(','), '--style', style]);
  return times.map((time) => {
    const picture = pixelsOf(readFileSync(join(frames, `frame-${time.toFixed(3).padStart(9, '0')}.png`)));
    let [sum, x, y] = [0, 0, 0];
    for (let i = 0; i < picture.width * picture.height; ++i) {
      const light = picture.data[i * picture.channels + 1];
      if (light < 3) continue; // the movie is not quite black
      sum += light;
      x += light * ((i % picture.width) + 0.5);
      y += light * (Math.floor(i / picture.width) + 0.5);
    }
    return { x: x / sum, y: y / sum };
  });
}

/// Returns the same from the page, in pixels of the movie.
async function fromPage({ page: path }, times) {
  const { page, problems, close } = await open(path, { size: [1500, 1000] });
  await opened(page);
  await ready(page);
  for (const key of layers) await page.keyboard.press(key);
  const places = [];
  for (const time of times) {
    await page.evaluate((time) => zulmViewer.seek(time), time);
    await settled(page);
    const shown = await page.evaluate((width) => {
      const canvas = document.getElementById('overlay');
      const { data } = canvas.getContext('2d').getImageData(0, 0, canvas.width, canvas.height);
      let [sum, x, y] = [0, 0, 0];
      for (let i = 3, at = 0; i < data.length; i += 4, ++at) {
        sum += data[i];
        x += data[i] * ((at % canvas.width) + 0.5);
        y += data[i] * (Math.floor(at / canvas.width) + 0.5);
      }
      const scale = width / canvas.width;
      return { time: zulmViewer.state().time, x: (x / sum) * scale, y: (y / sum) * scale };
    }, size.width);
    assert.ok(Math.abs(shown.time - time) < 1e-6, `${time}: the page is at ${shown.time}`);
    places.push(shown);
  }
  assert.deepEqual(problems, []);
  await close();
  return places;
}

test(`at ${count} times the cursor is at most ${most} pixels away`, async () => {
  const recorded = recording();
  const milliseconds = new Set();
  while (milliseconds.size < count) milliseconds.add(Math.round(50 + next() * (seconds * 1000 - 150)));
  const times = [...milliseconds].sort((a, b) => a - b).map((number) => number / 1000);
  const rendered = fromRenderer(recorded, times);
  const shown = await fromPage(recorded, times);
  const away = times.map((_, i) => Math.max(Math.abs(rendered[i].x - shown[i].x), Math.abs(rendered[i].y - shown[i].y)));
  const worst = Math.max(...away);
  console.log(`at most ${worst.toFixed(3)} pixels at ${times[away.indexOf(worst)]} s`);
  times.forEach((time, i) => assert.ok(away[i] <= most, `${time} s: ${JSON.stringify([rendered[i], shown[i]])}`));
});
