// Time that goes on: by the pictures of the movie where there is one, by the clock where there is none or it has ended.

import type { Size } from '../model/geometry';
import type { Range } from '../lanes/axis';
import { exactLength, FrameLengths, inside, nextFrame, previousFrame } from './frames';

export type MovieState = 'none' | 'loading' | 'ready' | 'failed';

const rounding = 0.000001; // seconds that browsers round times of pictures by
const patience = 200; // milliseconds for a picture after the movie has found its place
const calm = 0.1; // seconds without another picture, after which time goes on without it
const slow = 0.05; // seconds: pictures that last longer are not all that moves

export class Player {
  playing = false;
  movie: MovieState = 'none';
  /// Told about everything but the passing of time.
  onChange: () => void = () => {};
  /// Told as soon as the movie shows another picture, before the page is drawn.
  onPicture: () => void = () => {};
  private position = 0;
  private lastTick = 0;
  private length = 0;
  private isGuessed = false;
  private speed = 1;
  private lengths = new FrameLengths();
  /// When the picture that is shown begins; NaN until there is one.
  private picture = NaN;
  /// When it was drawn, in milliseconds of the page, and how many pictures the browser had left out by then.
  private shownAt = 0;
  private droppedBefore = 0;
  /// Where the movie is to go, and where it is on its way to; undefined while it goes nowhere.
  private wanted: number | undefined;
  private sought: number | undefined;
  private hasSought = false;
  private arrived: (() => void)[] = [];
  private timer: ReturnType<typeof setTimeout> | undefined;
  private steps = 0;
  private isStepping = false;
  private stepping = Promise.resolve();
  /// Where skipping led last. The picture of that place may begin earlier, so nothing is skipped before it.
  private skippedTo = -Infinity;
  /// The number of times that the reader went somewhere.
  private journeys = 0;
  private followsPicture = false;
  /// How many times as fast as usual time goes back; 0 while it goes on, or stands still.
  private backward = 0;
  private target = 0;
  /// What playing does not leave.
  loop: Range | undefined;
  /// Told while time goes on, before anything is drawn. Returns where to go on instead, if anywhere.
  skip: (time: number) => number | undefined = () => undefined;

  constructor(readonly video: HTMLVideoElement) {
    this.watchFrames();
    video.addEventListener('loadedmetadata', () => this.movieLoaded());
    video.addEventListener('error', () => this.movieFailed());
    video.addEventListener('seeked', () => this.seeked());
    video.addEventListener('pause', () => this.moviePaused());
    video.addEventListener('loadeddata', () => this.onChange());
  }

  /// `duration` is what the movie says that it lasts, or what the metadata lasts if `isGuessed`.
  load(url: string | null, duration: number, isGuessed: boolean): void {
    this.pause();
    this.isGuessed = isGuessed;
    [this.position, this.length, this.steps, this.followsPicture] = [0, duration, 0, false];
    ++this.journeys;
    [this.lengths, this.picture] = [new FrameLengths(), NaN];
    this.movie = url === null ? 'none' : 'loading';
    this.arrive();
    if (url === null) this.video.removeAttribute('src');
    else this.video.src = url;
    this.video.load();
    this.onChange();
  }

  /// Of what is recorded beside the movie, which stays the same.
  setLength(duration: number, isGuessed: boolean): void {
    [this.length, this.isGuessed] = [duration, isGuessed];
    this.onChange();
  }

  get duration(): number {
    const length = this.movieLength();
    return this.isGuessed && length > 0 ? length : Math.max(this.length, length);
  }

  /// The size of the movie's pictures, where they can be shown.
  get size(): Size | undefined {
    const { videoWidth: width, videoHeight: height } = this.video;
    return this.movie === 'ready' ? { width, height } : undefined;
  }

  get time(): number {
    return this.position;
  }

  /// Whether the movie shows the picture of `time`.
  get isSettled(): boolean {
    return this.movie !== 'loading' && this.wanted === undefined && !this.isStepping;
  }

  /// Resolves when the movie shows the picture of `time`.
  async settled(): Promise<void> {
    await this.arrival();
    await this.stepping;
  }

  get rate(): number {
    return this.speed;
  }

  set rate(rate: number) {
    this.speed = rate;
    this.video.playbackRate = rate;
    this.onChange();
  }

  get muted(): boolean {
    return this.video.muted;
  }

  set muted(muted: boolean) {
    this.video.muted = muted;
    this.onChange();
  }

  /// Below 0 while time goes back.
  get speedShown(): number {
    return this.isBackward ? -this.backward : this.speed;
  }

  get isBackward(): boolean {
    return this.backward > 0;
  }

  play(): void {
    if (this.playing && !this.isBackward) return;
    this.backward = 0;
    const { from, to } = this.loop ?? { from: 0, to: this.duration };
    const isOutside = this.loop !== undefined && this.position < from;
    if (isOutside || this.position >= to - 0.01) this.seek(from);
    [this.playing, this.followsPicture] = [true, true];
    this.lastTick = performance.now();
    this.playMovie();
    this.onChange();
  }

  /// Time goes back, by the pictures that the movie can show on its way.
  playBackward(speed: number): void {
    this.video.pause();
    if (!this.isBackward) this.target = this.position;
    [this.playing, this.followsPicture, this.backward] = [true, false, speed];
    this.lastTick = performance.now();
    this.onChange();
  }

  pause(): void {
    if (!this.playing) return;
    [this.playing, this.backward] = [false, 0];
    this.video.pause();
    this.onChange();
  }

  toggle(): void {
    if (this.playing) this.pause();
    else this.play();
  }

  seek(time: number): void {
    this.position = this.target = this.limited(time);
    [this.steps, this.skippedTo, this.followsPicture] = [0, -Infinity, this.playing && !this.isBackward];
    ++this.journeys;
    if (this.movie === 'ready') this.seekMovie(inside(this.position));
    if (this.playing) this.playMovie();
    this.onChange();
  }

  /// To the next picture or the one before. Where the movie has none, by as long as a picture lasts.
  stepFrame(direction: 1 | -1): void {
    this.pause();
    const expected = this.limited(this.position + direction * this.lengths.length);
    if (this.movie !== 'ready' || Number.isNaN(this.picture) || this.position > this.movieLength())
      return this.seek(expected);
    this.position = expected; // until the movie has shown it
    this.steps += direction;
    if (!this.isStepping) this.stepping = this.takeSteps();
    this.onChange();
  }

  /// Once for each picture on the screen.
  tick(now: number): void {
    const passed = (now - this.lastTick) / 1000;
    this.lastTick = now;
    if (!this.playing) return;
    if (this.isBackward) return this.goBack(passed);
    if (this.isMovieRunning()) this.position = this.runningTime(now);
    else if (this.wanted === undefined) this.position += Math.max(0, passed) * this.speed;
    if (this.goElsewhere()) return;
    if (this.position < this.duration) return;
    this.position = this.duration;
    this.pause();
  }

  /// Back to the beginning of the loop, or to the end of what is skipped.
  private goElsewhere(): boolean {
    const { loop, position } = this;
    if (loop && position >= loop.to) {
      this.seek(loop.from);
      return true;
    }
    const target = position < this.skippedTo ? undefined : this.skip(position);
    if (target === undefined || (loop && target >= loop.to)) return false;
    this.seek(target);
    this.skippedTo = this.position;
    return true;
  }

  /// Shows the picture that the clock has reached as soon as the one before has been found.
  private goBack(passed: number): void {
    this.target = this.limited(this.target - Math.max(0, passed) * this.backward);
    if (this.loop && this.target <= this.loop.from) [this.target, this.picture] = [this.loop.to, NaN]; // to be looked for
    if (this.movie !== 'ready' || this.target > this.movieLength()) this.position = this.target;
    else if (this.wanted === undefined && !(this.target >= this.picture)) this.seekMovie(inside(this.target));
    if (this.target > 0) return;
    this.pause();
    this.seek(0);
  }

  /// Finds out when a picture begins, if all are as long as those that were seen; the first one has the number 0.
  /// Resolves with undefined if the reader went elsewhere meanwhile.
  async frameTime(frame: number): Promise<number | undefined> {
    let { journeys } = this;
    await this.stepping;
    if (journeys !== this.journeys) return undefined;
    if (this.movie === 'ready' && !this.lengths.isKnown) {
      this.pause();
      this.seek(0);
      ({ journeys } = this);
      await this.arrival();
      this.steps = 1;
      if (!Number.isNaN(this.picture)) await (this.stepping = this.takeSteps());
    }
    return journeys === this.journeys ? frame * exactLength(this.lengths.length) : undefined;
  }

  private limited(time: number): number {
    return Math.max(0, Math.min(time, this.duration));
  }

  /// What is drawn belongs to the picture, in which much may move if it lasts long. Where the movie has no other picture
  /// for a while, time goes on alone; but not where the browser only has no time to show it.
  private runningTime(now: number): number {
    const { currentTime } = this.video;
    const { length } = this.lengths;
    if (Number.isNaN(this.picture)) return currentTime; // the browser does not tell
    const isStill = (now - this.shownAt) / 1000 > Math.max(calm, 3 * length) && this.dropped() === this.droppedBefore;
    if (isStill) return Math.max(this.picture, currentTime);
    const most = length > slow ? 0.95 * length : 0;
    return this.picture + Math.max(rounding, Math.min(currentTime - this.picture, most));
  }

  private dropped(): number {
    return this.video.getVideoPlaybackQuality?.().droppedVideoFrames ?? 0;
  }

  private async takeSteps(): Promise<void> {
    this.isStepping = true;
    await this.arrival();
    while (this.steps !== 0) await this.takeStep();
    this.isStepping = false;
    this.onChange();
  }

  private async takeStep(): Promise<void> {
    const direction = Math.sign(this.steps);
    const { journeys, lengths, picture } = this;
    this.steps -= direction;
    const show = async (time: number) => {
      if (journeys !== this.journeys) return NaN;
      this.seekMovie(time);
      await this.arrival();
      return journeys === this.journeys ? this.picture : NaN;
    };
    const end = this.movieLength();
    const found = direction > 0 ? await nextFrame(picture, end, lengths, show) : await previousFrame(picture, lengths, show);
    if (journeys !== this.journeys || this.steps !== 0) return;
    const isBeyond = direction > 0 && found === undefined && this.duration > end + lengths.length;
    if (!isBeyond) this.position = this.limited((found ?? picture) + rounding);
    this.onChange();
  }

  private watchFrames(): void {
    this.video.requestVideoFrameCallback?.((_, { mediaTime }) => {
      this.showsPicture(mediaTime);
      this.watchFrames();
    });
  }

  private showsPicture(began: number): void {
    if (this.isMovieRunning()) this.lengths.played(this.picture, began);
    this.picture = began;
    [this.shownAt, this.droppedBefore] = [performance.now(), this.dropped()];
    this.hasSought = true;
    if (this.isBackward) this.position = this.limited(began + rounding);
    else if (this.followsPicture && this.wanted === undefined && !this.video.ended)
      this.position = this.limited(began + rounding);
    if (this.wanted !== undefined && !this.video.seeking) this.arriveOrGoOn();
    this.onPicture();
  }

  private movieLength(): number {
    return this.movie === 'ready' && Number.isFinite(this.video.duration) ? this.video.duration : 0;
  }

  private isMovieRunning(): boolean {
    return (
      this.movie === 'ready' && this.playing && this.wanted === undefined && !this.video.ended && !this.video.paused
    );
  }

  private playMovie(): void {
    if (this.movie !== 'ready' || this.isBackward || this.position >= this.movieLength()) return;
    this.video.playbackRate = this.speed;
    this.video.play().catch(() => {}); // the clock goes on without it
  }

  /// One at a time: while the movie looks for a picture, only the last wish counts.
  private seekMovie(time: number): void {
    this.wanted = Math.min(time, this.movieLength());
    if (this.sought === undefined) this.goOn();
  }

  private goOn(): void {
    clearTimeout(this.timer);
    this.sought = this.wanted!;
    this.hasSought = false;
    this.video.currentTime = this.sought;
  }

  private seeked(): void {
    if (this.sought === undefined) return;
    if (this.wanted !== this.sought || this.hasSought) return this.arriveOrGoOn();
    clearTimeout(this.timer);
    this.timer = setTimeout(() => this.arriveOrGoOn(), patience); // not every browser shows the same picture again
  }

  private arriveOrGoOn(): void {
    if (this.wanted !== this.sought) return this.goOn();
    this.arrive();
    this.onChange();
  }

  private arrive(): void {
    clearTimeout(this.timer);
    [this.wanted, this.sought] = [undefined, undefined];
    for (const tell of this.arrived.splice(0)) tell();
  }

  /// When the movie goes nowhere any more.
  private arrival(): Promise<void> {
    return this.wanted === undefined ? Promise.resolve() : new Promise((done) => this.arrived.push(done));
  }

  private movieLoaded(): void {
    this.movie = this.video.videoWidth > 0 ? 'ready' : 'failed';
    if (this.movie === 'ready' && this.position > 0) this.seekMovie(inside(this.position));
    if (this.playing) this.playMovie();
    this.onChange();
  }

  private movieFailed(): void {
    if (!this.video.hasAttribute('src')) return;
    this.movie = 'failed';
    this.arrive();
    this.onChange();
  }

  private moviePaused(): void {
    const isStrange = this.playing && !this.isBackward && !this.video.ended && this.wanted === undefined;
    if (isStrange) this.pause(); // by a media key, say
  }
}
