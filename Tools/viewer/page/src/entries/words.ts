// Looking for a word in millions of numbers: without making texts of them.

/// Whether the digits of a whole number, or the time on a clock, hold some letters of ASCII.
export class DigitSearch {
  private readonly wanted: Uint8Array;
  private readonly letters = new Uint8Array(64);
  private start = 64;

  constructor(word: string) {
    this.wanted = Uint8Array.from(word, (letter) => letter.charCodeAt(0));
  }

  isInNumber(value: number): boolean {
    this.start = 64;
    this.number(Math.abs(value));
    if (value < 0) this.letter(minus);
    return this.isFound();
  }

  /// `seconds` is finite and not negative.
  isInClock(seconds: number): boolean {
    const units = Math.round(seconds * 1000);
    const whole = Math.floor(units / 1000);
    const hours = Math.floor(whole / 3600);
    this.start = 64;
    this.digits(units % 1000, 3);
    this.letter(point);
    this.digits(whole % 60, 2);
    this.letter(colon);
    const minutes = Math.floor(whole / 60) % 60;
    if (hours === 0) this.number(minutes);
    else {
      this.digits(minutes, 2);
      this.letter(colon);
      this.number(hours);
    }
    return this.isFound();
  }

  private letter(code: number): void {
    this.letters[--this.start] = code;
  }

  private digits(value: number, count: number): void {
    for (; count > 0; --count) {
      const rest = Math.floor(value / 10);
      this.letter(zero + value - 10 * rest);
      value = rest;
    }
  }

  private number(value: number): void {
    do {
      this.digits(value, 1);
      value = Math.floor(value / 10);
    } while (value > 0);
  }

  private isFound(): boolean {
    const { wanted, letters, start } = this;
    for (let from = start; from + wanted.length <= 64; ++from) {
      let k = 0;
      while (k < wanted.length && letters[from + k] === wanted[k]) ++k;
      if (k === wanted.length) return true;
    }
    return false;
  }
}

const [minus, point, zero, colon] = [45, 46, 48, 58] as const;

export type RowTest = (row: number) => boolean;

export const never: RowTest = () => false;

/// Looks at every text once, however often it comes.
export function cachedTest(column: ArrayLike<unknown>, textOf: (value: unknown) => string, word: string): RowTest {
  const known = new Map<unknown, boolean>();
  return (row) => {
    const value = column[row];
    let answer = known.get(value);
    if (answer === undefined) known.set(value, (answer = textOf(value).toLowerCase().includes(word)));
    return answer;
  };
}

/// Looks at the times of entries as a clock shows them.
export function clockTest(times: Float64Array, textOf: (time: number) => string, word: string): RowTest {
  const isOrdinary = (time: number) => time >= 0 && time < Infinity;
  const search = /^[\d:.]+$/.test(word) ? new DigitSearch(word) : undefined;
  return (row) => {
    const time = times[row]!;
    if (isOrdinary(time)) return search?.isInClock(time) ?? false;
    return textOf(time).toLowerCase().includes(word);
  };
}

/// Looks at a column of numbers. `textOf` says how a number that is not whole is shown.
export function numberTest(column: ArrayLike<number>, textOf: (value: number) => string, word: string): RowTest {
  const isWhole = column instanceof Int32Array || column instanceof Uint32Array;
  if (isWhole) {
    if (!/^-?\d*$/.test(word)) return never;
    const search = new DigitSearch(word);
    return (row) => search.isInNumber(column[row]!);
  }
  if (!/^[-+.\deinfatyN–]+$/i.test(word)) return never;
  return (row) => textOf(column[row]!).toLowerCase().includes(word);
}
