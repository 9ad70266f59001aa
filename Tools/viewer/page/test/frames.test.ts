import assert from 'node:assert/strict';
import { test } from 'node:test';
import { FrameLengths, nextFrame, previousFrame } from '../src/stage/frames';

/// A movie whose pictures begin at these times; counts how often it had to look for one.
class Movie {
  looked = 0;
  constructor(
    readonly starts: number[],
    readonly end: number,
  ) {}
  readonly show = (time: number): Promise<number> => {
    ++this.looked;
    return Promise.resolve(this.starts.filter((start) => start <= time).at(-1)!);
  };
}

const steady = (rate: number, seconds: number) =>
  new Movie(
    Array.from({ length: rate * seconds }, (_, i) => i / rate),
    seconds,
  );

async function walk(movie: Movie, lengths: FrameLengths, from: number, steps: number): Promise<number[]> {
  const seen = [from];
  for (let i = 0; i < steps; ++i) seen.push((await nextFrame(seen[i]!, movie.end, lengths, movie.show))!);
  return seen;
}

test('each step leads to the next picture, whatever the rate', async () => {
  for (const rate of [1, 5, 10, 24, 25, 30, 50, 60, 144, 240]) {
    const movie = steady(rate, 20);
    assert.deepEqual(await walk(movie, new FrameLengths(), 0, 15), movie.starts.slice(0, 16), `${rate} a second`);
  }
});

test('a steady rate needs one look for a step, once it is known', async () => {
  const movie = steady(10, 20);
  const lengths = new FrameLengths();
  await walk(movie, lengths, 0, 4);
  movie.looked = 0;
  await walk(movie, lengths, 0.4, 10);
  assert.equal(movie.looked, 10);
  assert.ok(Math.abs(lengths.length - 0.1) < 1e-9);
});

test('no picture is left out where their lengths vary', async () => {
  const starts = [0, 0.1, 0.2, 0.3, 0.4, 0.5, 5, 5.017, 5.033, 5.05, 9, 9.5, 9.504, 9.508, 9.6];
  const movie = new Movie(starts, 30);
  assert.deepEqual(await walk(movie, new FrameLengths(), 0, 14), starts);
});

test('what is on the screen after a step is the picture of the step', async () => {
  const movie = new Movie([0, 0.1, 3, 3.02, 3.04], 4);
  let shown = 0;
  const show = async (time: number) => (shown = await movie.show(time));
  const lengths = new FrameLengths();
  for (let from = 0; from < 3.04; from = shown) assert.equal(await nextFrame(from, 4, lengths, show), shown);
});

test('steps end at both ends, and where something else was asked for', async () => {
  const movie = steady(30, 2);
  const lengths = new FrameLengths();
  assert.equal(await nextFrame(movie.starts.at(-1)!, 2, lengths, movie.show), undefined);
  assert.equal(await previousFrame(0, lengths, movie.show), undefined);
  assert.equal(await nextFrame(1, 2, lengths, () => Promise.resolve(NaN)), undefined);
  assert.equal(await previousFrame(1, lengths, () => Promise.resolve(NaN)), undefined);
});

test('steps back lead to each picture', async () => {
  const starts = [0, 0.1, 3, 3.02, 3.04];
  const movie = new Movie(starts, 4);
  const lengths = new FrameLengths();
  for (let i = starts.length - 1; i > 0; --i)
    assert.equal(await previousFrame(starts[i]!, lengths, movie.show), starts[i - 1]);
});

test('the length of a picture grows as well as it shrinks', () => {
  const lengths = new FrameLengths();
  for (let i = 0; i < 12; ++i) lengths.played(i / 10, (i + 1) / 10);
  assert.ok(Math.abs(lengths.length - 0.1) < 1e-9, 'played at 10 a second');
  lengths.played(2, 2 + 1 / 60);
  assert.ok(Math.abs(lengths.length - 1 / 60) < 1e-9, 'a shorter one was seen');
  for (let i = 0; i < 3; ++i) lengths.played(i / 30, (i + 1) / 30);
  assert.ok(Math.abs(lengths.length - 1 / 60) < 1e-9, 'three may have left some out');
});
