// Where the pictures of a movie begin, as far as that is known. Only showing a picture tells when it began.

const usual = 1 / 30; // seconds, until pictures have been seen
const near = 0.001; // seconds: no picture is shorter, and movies round their times by less
const remembered = 8;

/// Shows the picture at a time. Resolves with when it began, or with NaN if something else was shown meanwhile.
export type Show = (time: number) => Promise<number>;

/// How long pictures last around the one that is shown.
export class FrameLengths {
  private measured: number[] = []; // of pictures that follow each other
  private longer: number[] = []; // the last runs of the movie that were longer than `length`
  private expected = usual;

  /// The shortest length seen of late, in seconds.
  get length(): number {
    return this.expected;
  }

  /// Whether `length` was seen, and is no guess.
  get isKnown(): boolean {
    return this.measured.length > 0;
  }

  /// Nothing lies between two pictures that begin at these times.
  follow(first: number, next: number): void {
    this.measured = [...this.measured, next - first].slice(-remembered);
    this.expected = Math.min(...this.measured);
    this.longer = [];
  }

  /// The movie showed these two one after the other while it ran. It may have left out some between them.
  played(first: number, next: number): void {
    const passed = next - first;
    if (passed < near) return;
    if (passed < 0.98 * this.expected) [this.expected, this.measured, this.longer] = [passed, [], []];
    else if (passed < 1.5 * this.expected) this.longer = [];
    else if (this.longer.push(passed) >= remembered) this.expected = Math.min(...this.longer.splice(0));
  }

  /// Whether all pictures of late were that long.
  isUsual(length: number): boolean {
    const slack = Math.max(1.1 * near, 0.02 * length);
    return this.measured.length >= 3 && this.measured.every((other) => Math.abs(other - length) < slack);
  }
}

/// Browsers round times to microseconds, which would add up over thousands of pictures. Returns the length that pictures
/// have at a whole rate, or at 1000/1001 of one, if that is the length seen.
export function exactLength(length: number): number {
  const rates = [Math.round(1 / length), (Math.round(1.001 / length) * 1000) / 1001];
  const rate = rates.find((rate) => Math.abs(1 / rate - length) < 0.000002);
  return rate ? 1 / rate : length;
}

/// A time at which the picture is shown that begins at `time`, or the one that holds then. Browsers and movies round
/// the beginning of a picture, each in its own way.
export function inside(time: number): number {
  return time + near / 2;
}

/// Shows the picture after the one that begins at `from`. Undefined if there is none before `end`.
export async function nextFrame(
  from: number,
  end: number,
  lengths: FrameLengths,
  show: Show,
): Promise<number | undefined> {
  let same = from; // the picture is still the first one here
  let shown = from;
  for (let reach = 1.5 * lengths.length; shown <= from; reach *= 2) {
    const time = Math.min(from + reach, end - near);
    if (time <= same) return undefined;
    shown = await show(time);
    if (shown <= from) same = time;
  }
  if (Number.isNaN(shown)) return undefined;
  let next = shown;
  const look = async (time: number) => {
    shown = await show(time);
    if (shown <= from) same = time;
    else next = shown; // NaN ends everything below
  };
  while (!lengths.isUsual(next - from) && next - same > 2 * near) {
    await look(next - near);
    if (same > next - 2 * near) break;
    await look((same + next) / 2);
  }
  if (shown !== next) shown = await show(inside(next));
  if (Number.isNaN(shown)) return undefined;
  lengths.follow(from, next);
  return next;
}

/// Shows the picture before the one that begins at `from`. Undefined if that is the first.
export async function previousFrame(from: number, lengths: FrameLengths, show: Show): Promise<number | undefined> {
  const back = lengths.isUsual(lengths.length) ? lengths.length / 2 : near;
  if (from < near) return undefined;
  const shown = await show(Math.max(0, from - back));
  if (!(shown < from)) return undefined;
  lengths.follow(shown, from);
  return shown;
}
