// Movies whose pictures carry their number, with a cursor that tells the time: what is seen says by itself whether
// picture and overlay belong together.

import assert from 'node:assert/strict';
import { execFileSync } from 'node:child_process';
import { mkdirSync, readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';
import { inflateSync } from 'node:zlib';
import { folder, zulm } from './support.mjs';

const size = { width: 1280, height: 720 };
const bits = 10;
const block = { side: 96, step: 120, left: 44, top: 560 };
const sweep = { seconds: 4, left: 40, pixels: 1200, y: 200 }; // the cursor's way, over and over

/// The bytes of a stream file: `kind` is the last byte of the first word of its identifier.
export function stream(kind, entrySize, entries, version = 1) {
  const header = Buffer.from('2b7b6a007a1f11e283d00017f200be7f0100000000000000', 'hex');
  header[3] = kind;
  header.writeUInt32LE(version, 16);
  header.writeUInt32LE(entrySize, 20);
  return Buffer.concat([header, ...entries]);
}

/// An entry of fixed size: its time, then whole numbers.
export function entry(time, ...numbers) {
  const bytes = Buffer.alloc(8 + 4 * numbers.length);
  bytes.writeDoubleLE(time, 0);
  numbers.forEach((number, i) => bytes.writeInt32LE(number, 8 + 4 * i));
  return bytes;
}

export const positionsOf = (positions) =>
  stream(0xf2, 16, positions.map(([time, x, y]) => entry(time, x, y)));
export const regionOf = (...regions) => stream(0xf6, 24, regions.map((numbers) => entry(...numbers)));

/// The bytes of an entry of the stream of cursor images.
export function imageEntry(time, id, hotSpot, picture) {
  const bytes = Buffer.alloc(44 + picture.length);
  bytes.writeUInt32LE(40 + picture.length, 0);
  bytes.writeDoubleLE(time, 4);
  bytes.writeBigInt64LE(BigInt(id), 12);
  [20 + picture.length, picture.length, ...hotSpot].forEach((value, k) => bytes.writeUInt32LE(value, 20 + 4 * k));
  picture.copy(bytes, 36);
  return bytes;
}

export const imagesOf = (...entries) => stream(0xf1, 0, entries, 2);

/// Puts streams into a movie, and writes its page.
export function attached(name, plain, streams) {
  const names = Object.entries(streams).map(([kind, bytes]) => {
    mkdirSync(join(folder, name), { recursive: true });
    writeFileSync(join(folder, name, `${kind}.dat`), bytes);
    return `${name}/${kind}.dat`;
  });
  zulm('attach', plain, ...names, '-o', `${name}.mp4`, '--force');
  zulm('view', `${name}.mp4`, '-o', `${name}.html`, '--force');
  return { movie: join(folder, `${name}.mp4`), page: join(folder, `${name}.html`) };
}

export function ffmpeg(...parameters) {
  execFileSync('ffmpeg', ['-v', 'error', '-y', ...parameters], { stdio: ['ignore', 'ignore', 'inherit'] });
}

/// `retime` is an expression of the number N of a picture, in seconds; without it, pictures come at the rate.
export function numberedRecording(name, { rate, seconds, retime }) {
  const plain = join(folder, `${name}-plain.mp4`);
  const boxes = Array.from({ length: bits }, (_, bit) => {
    const x = block.left + bit * block.step;
    const place = `x=${x}:y=${block.top}:w=${block.side}:h=${block.side}`;
    return `drawbox=${place}:color=white:t=fill:enable='mod(floor(n/${2 ** bit})\\,2)'`;
  });
  const retimed = retime ? [`settb=1/90000,setpts='(${retime})/TB'`] : [];
  const filters = [`color=c=black:s=${size.width}x${size.height}:r=${rate}:d=${seconds}`, ...boxes, ...retimed];
  const coding = ['-c:v', 'libx264', '-preset', 'ultrafast', '-pix_fmt', 'yuv420p', '-g', '30'];
  ffmpeg('-f', 'lavfi', '-i', filters.join(','), '-fps_mode', 'passthrough', '-enc_time_base', '-1', ...coding, plain);
  const square = join(folder, 'square.png');
  ffmpeg('-f', 'lavfi', '-i', 'color=c=magenta:s=21x21,format=rgba', '-frames:v', '1', square);
  const times = frameTimes(plain);
  const count = Math.ceil((times.at(-1) + 0.1) * sweep.pixels / sweep.seconds);
  const positions = Array.from({ length: count }, (_, i) => {
    const time = (i * sweep.seconds) / sweep.pixels;
    return [time, sweep.left + (i % sweep.pixels), sweep.y];
  });
  const recording = attached(name, plain, {
    cursorLocation: positionsOf(positions),
    cursorImage: imagesOf(imageEntry(0, 1, [10, 10], readFileSync(square))),
    recordingRegion: regionOf([0, 0, 0, size.width, size.height]),
  });
  return { ...recording, times };
}

/// When each picture of a movie begins.
function frameTimes(movie) {
  const parameters = ['-v', 'error', '-select_streams', 'v', '-show_entries', 'packet=pts_time', '-of', 'csv=p=0'];
  const lines = execFileSync('ffprobe', [...parameters, movie], { encoding: 'utf8' }).trim().split('\n');
  return lines.map((line) => parseFloat(line)).sort((a, b) => a - b);
}

/// The number of the picture, and the time that the cursor tells, modulo the length of its way; NaN for what is not seen.
export function readPicture({ width, data, channels }, box) {
  const scale = box.width / size.width;
  const at = (x, y) => (Math.round(box.y + y * scale) * width + Math.round(box.x + x * scale)) * channels;
  let number = 0;
  for (let bit = 0; bit < bits; ++bit) {
    const place = at(block.left + bit * block.step + block.side / 2, block.top + block.side / 2);
    if (data[place + 1] > 128) number += 2 ** bit;
  }
  let [sum, count] = [0, 0];
  const line = Math.round(box.y + sweep.y * scale);
  for (let x = Math.ceil(box.x); x < box.x + box.width; ++x) {
    const place = (line * width + x) * channels;
    if (data[place] > 150 && data[place + 1] < 100 && data[place + 2] > 150) [sum, count] = [sum + x, count + 1];
  }
  const x = (sum / count + 0.5 - box.x) / scale;
  return { number, time: ((x - 0.5 - sweep.left) / sweep.pixels) * sweep.seconds };
}

/// How many seconds the overlay is after the beginning of the picture.
export function after(time, start) {
  const difference = (time - start) % sweep.seconds;
  return difference > sweep.seconds / 2
    ? difference - sweep.seconds
    : difference < -sweep.seconds / 2
      ? difference + sweep.seconds
      : difference;
}

/// The samples of a PNG of 8 bits with three or four channels, as browsers write them.
export function pixelsOf(png) {
  const [width, height] = [png.readUInt32BE(16), png.readUInt32BE(20)];
  const channels = { 2: 3, 6: 4 }[png[25]];
  assert.ok(png[24] === 8 && channels, 'a picture of another form');
  const parts = [];
  for (let at = 8; at < png.length; at += 12 + png.readUInt32BE(at))
    if (png.toString('latin1', at + 4, at + 8) === 'IDAT') parts.push(png.subarray(at + 8, at + 8 + png.readUInt32BE(at)));
  const raw = inflateSync(Buffer.concat(parts));
  const line = width * channels;
  const data = Buffer.alloc(line * height);
  for (let y = 0; y < height; ++y) unfilter(raw.subarray(y * (line + 1)), data, y * line, line, channels);
  return { width, height, channels, data };
}

function unfilter(raw, data, start, line, channels) {
  const type = raw[0];
  for (let i = 0; i < line; ++i) {
    const left = i >= channels ? data[start + i - channels] : 0;
    const up = start > 0 ? data[start - line + i] : 0;
    const corner = start > 0 && i >= channels ? data[start - line + i - channels] : 0;
    const guess = [0, left, up, (left + up) >> 1, paeth(left, up, corner)][type];
    data[start + i] = raw[i + 1] + guess;
  }
}

function paeth(left, up, corner) {
  const [a, b, c] = [left, up, corner].map((value) => Math.abs(left + up - corner - value));
  return a <= b && a <= c ? left : b <= c ? up : corner;
}

/// What is on the screen: the picture's number and the time of the cursor.
export async function look(page) {
  const clip = await page.locator('#frame').boundingBox();
  return readPicture(pixelsOf(await page.screenshot({ clip })), { ...clip, x: 0, y: 0 });
}

/// Waits until the page shows what it was asked for.
export async function settled(page) {
  await page.waitForFunction(() => zulmViewer.state().isSettled !== false);
  await page.evaluate(() => new Promise((done) => requestAnimationFrame(() => requestAnimationFrame(done))));
}

/// Plays for some seconds and keeps what the browser puts on the screen. Resolves with how far the cursor is from the
/// picture, in pictures, for each of these.
export async function watch(page, { times }, seconds) {
  const session = await page.context().newCDPSession(page);
  const seen = [];
  session.on('Page.screencastFrame', ({ data, sessionId }) => {
    seen.push(Buffer.from(data, 'base64'));
    session.send('Page.screencastFrameAck', { sessionId }).catch(() => {});
  });
  await session.send('Page.startScreencast', { format: 'png', everyNthFrame: 1 });
  await page.keyboard.press('Space');
  await page.waitForTimeout(seconds * 1000);
  await page.keyboard.press('Space');
  await session.send('Page.stopScreencast');
  const box = await page.locator('#frame').boundingBox();
  const differences = seen
    .map((png) => readPicture(pixelsOf(png), box))
    .filter(({ time, number }) => Number.isFinite(time) && number > 0 && number + 1 < times.length)
    .map(({ number, time }) => after(time, times[number]) / (times[number + 1] - times[number]));
  return differences.sort((a, b) => Math.abs(a) - Math.abs(b));
}

/// How far most of the differences are from nothing.
export function differencesOf(differences) {
  const at = (part) => Math.abs(differences[Math.floor((differences.length - 1) * part)]).toFixed(2);
  return { median: at(0.5), nearlyAll: at(0.95), worst: at(1) };
}
