import assert from 'node:assert/strict';
import { test } from 'node:test';
import { Player } from '../src/stage/player';
import { afterIdle } from '../src/transport/skipping';

/// A movie of twenty seconds that shows its pictures as soon as they are asked for.
class Movie extends EventTarget {
  paused = true;
  ended = false;
  seeking = false;
  muted = false;
  playbackRate = 1;
  duration = 20;
  videoWidth = 640;
  videoHeight = 360;
  src = '';
  seeks: number[] = [];
  private now = 0;
  private waiting: VideoFrameRequestCallback[] = [];

  constructor(private readonly rate: number) {
    super();
  }

  get currentTime(): number {
    return this.now;
  }

  set currentTime(time: number) {
    this.seeks.push(time);
    this.now = time;
    this.show();
    this.dispatchEvent(new Event('seeked'));
  }

  /// Time goes on by that many seconds.
  run(seconds: number): void {
    this.now += seconds;
    this.show();
  }

  requestVideoFrameCallback(callback: VideoFrameRequestCallback): void {
    this.waiting.push(callback);
  }

  hasAttribute(): boolean {
    return true;
  }

  load(): void {
    this.dispatchEvent(new Event('loadedmetadata'));
  }

  async play(): Promise<void> {
    this.paused = false;
  }

  pause(): void {
    this.paused = true;
  }

  private show(): void {
    const mediaTime = Number((Math.floor(this.now * this.rate + 1e-9) / this.rate).toFixed(6)); // as browsers round
    for (const callback of this.waiting.splice(0)) callback(0, { mediaTime } as VideoFrameCallbackMetadata);
  }
}

function playerOf(rate: number): { movie: Movie; player: Player } {
  const movie = new Movie(rate);
  const player = new Player(movie as unknown as HTMLVideoElement);
  player.load('movie', 20, false);
  return { movie, player };
}

function play(movie: Movie, player: Player, seconds: number): void {
  player.play();
  for (let passed = 0; passed < seconds; passed += 1 / 60) {
    movie.run(1 / 60);
    player.tick(performance.now());
  }
}

for (const rate of [0.5, 10, 25, 30, 60])
  test(`an idle stretch is skipped once, wherever the picture begins: ${rate} a second`, () => {
    const { movie, player } = playerOf(rate);
    player.skip = (time) => afterIdle([{ start: 1, end: 11.213 }], time);
    play(movie, player, 4);
    assert.equal(movie.seeks.length, 1, movie.seeks.join());
    assert.ok(player.time > 11.2, String(player.time));
  });

test('a stretch is skipped again after the reader went back', () => {
  const { movie, player } = playerOf(30);
  player.skip = (time) => afterIdle([{ start: 1, end: 11.213 }], time);
  play(movie, player, 2);
  player.seek(3);
  play(movie, player, 1);
  assert.equal(movie.seeks.length, 3, movie.seeks.join());
  assert.ok(player.time > 11, String(player.time));
});

test('a loop inside an idle stretch is played as a loop', () => {
  const { movie, player } = playerOf(30);
  player.skip = (time) => afterIdle([{ start: 1, end: 11.213 }], time);
  player.loop = { from: 3, to: 5 };
  player.seek(3);
  play(movie, player, 5);
  assert.ok(movie.seeks.every((time) => time < 3.1), movie.seeks.join());
  assert.ok(movie.seeks.length < 5);
});

for (const [name, rate] of [['29.97', 30000 / 1001], ['60', 60], ['30', 30]] as const)
  test(`the number of a picture leads to it, however late: ${name} a second`, async () => {
    const { player } = playerOf(rate);
    const time = await player.frameTime(100_000);
    assert.ok(Math.abs(time! - 100_000 / rate) < 0.0001, `${time} is not ${100_000 / rate}`);
  });

test('who goes elsewhere is not taken to a picture', async () => {
  const { player } = playerOf(30);
  const time = player.frameTime(100);
  player.seek(7);
  assert.equal(await time, undefined);
});
