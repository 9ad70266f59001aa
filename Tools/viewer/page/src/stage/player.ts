// Time that goes on: by the movie where there is one, by the clock where there is none or it has ended.

export type MovieState = 'none' | 'loading' | 'ready' | 'failed';

const usualFrame = 1 / 30; // seconds, until the movie has shown shorter ones

export class Player {
  playing = false;
  movie: MovieState = 'none';
  /// Told about everything but the passing of time.
  onChange: () => void = () => {};
  private position = 0;
  private wanted: number | undefined;
  private lastTick = 0;
  private length = 0;
  private speed = 1;
  private shortestFrame = usualFrame;
  private lastPicture = NaN;

  constructor(readonly video: HTMLVideoElement) {
    this.watchFrames();
    video.addEventListener('loadedmetadata', () => this.movieLoaded());
    video.addEventListener('error', () => this.movieFailed());
    video.addEventListener('seeked', () => this.seeked());
    video.addEventListener('pause', () => this.moviePaused());
    video.addEventListener('loadeddata', () => this.onChange());
  }

  /// Seconds from one picture of the movie to the next, as far as it has been seen.
  get frameLength(): number {
    return this.shortestFrame;
  }

  /// `duration` is what the metadata lasts; a longer movie makes it more.
  load(url: string | null, duration: number): void {
    this.pause();
    [this.position, this.wanted, this.length] = [0, undefined, duration];
    [this.shortestFrame, this.lastPicture] = [usualFrame, NaN];
    this.movie = url === null ? 'none' : 'loading';
    if (url === null) this.video.removeAttribute('src');
    else this.video.src = url;
    this.video.load();
    this.onChange();
  }

  get duration(): number {
    return Math.max(this.length, this.movieLength());
  }

  get time(): number {
    return this.position;
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

  play(): void {
    if (this.playing) return;
    if (this.position >= this.duration - 0.01) this.seek(0);
    this.playing = true;
    this.lastTick = performance.now();
    this.playMovie();
    this.onChange();
  }

  pause(): void {
    if (!this.playing) return;
    this.playing = false;
    this.video.pause();
    this.onChange();
  }

  toggle(): void {
    if (this.playing) this.pause();
    else this.play();
  }

  seek(time: number): void {
    this.position = Math.max(0, Math.min(time, this.duration));
    if (this.movie === 'ready') this.seekMovie(Math.min(this.position, this.movieLength()));
    if (this.playing) this.playMovie();
    this.onChange();
  }

  /// Once for each picture on the screen.
  tick(now: number): void {
    const passed = (now - this.lastTick) / 1000;
    this.lastTick = now;
    if (!this.playing) return;
    if (this.isMovieRunning()) this.position = this.video.currentTime;
    else if (this.wanted === undefined) this.position += Math.max(0, passed) * this.speed;
    if (this.position < this.duration) return;
    this.position = this.duration;
    this.pause();
  }

  private watchFrames(): void {
    this.video.requestVideoFrameCallback?.((_, { mediaTime }) => {
      const passed = Math.abs(mediaTime - this.lastPicture);
      if (passed > 1 / 250 && passed < 0.98 * this.shortestFrame) this.shortestFrame = passed;
      this.lastPicture = mediaTime;
      this.watchFrames();
    });
  }

  private movieLength(): number {
    return this.movie === 'ready' && Number.isFinite(this.video.duration) ? this.video.duration : 0;
  }

  private isMovieRunning(): boolean {
    return this.movie === 'ready' && this.wanted === undefined && !this.video.ended && !this.video.paused;
  }

  private playMovie(): void {
    if (this.movie !== 'ready' || this.position >= this.movieLength()) return;
    this.video.playbackRate = this.speed;
    this.video.play().catch(() => {}); // the clock goes on without it
  }

  /// One at a time: while the movie looks for a picture, only the last wish counts.
  private seekMovie(time: number): void {
    const isBusy = this.wanted !== undefined;
    this.wanted = time;
    if (!isBusy) this.video.currentTime = time;
  }

  private seeked(): void {
    const { wanted } = this;
    if (wanted !== undefined && Math.abs(this.video.currentTime - wanted) > 0.0005 && wanted < this.movieLength())
      this.video.currentTime = wanted;
    else this.wanted = undefined;
    this.onChange();
  }

  private movieLoaded(): void {
    this.movie = this.video.videoWidth > 0 ? 'ready' : 'failed';
    if (this.movie === 'ready' && this.position > 0) this.seekMovie(Math.min(this.position, this.movieLength()));
    if (this.playing) this.playMovie();
    this.onChange();
  }

  private movieFailed(): void {
    if (!this.video.hasAttribute('src')) return;
    [this.movie, this.wanted] = ['failed', undefined];
    this.onChange();
  }

  private moviePaused(): void {
    const isStrange = this.playing && !this.video.ended && this.wanted === undefined;
    if (isStrange) this.pause(); // by a media key, say
  }
}
