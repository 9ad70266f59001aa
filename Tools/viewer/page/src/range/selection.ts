// The range of time that the reader has selected.

import type { Range } from '../lanes/axis';

const shortest = 0.001; // seconds

export class Selection {
  private selected: Range | undefined;
  private anchor = 0;
  private duration = 0;
  /// Whether playing stays in the range.
  loops = false;
  /// Whether the heat map tells of the range.
  hasHeat = false;
  onChange: () => void = () => {};

  get range(): Range | undefined {
    return this.selected;
  }

  /// Selects nothing in a recording of that length.
  start(duration: number): void {
    [this.duration, this.selected, this.loops, this.hasHeat] = [duration, undefined, false, false];
  }

  setDuration(duration: number): void {
    this.duration = duration;
  }

  /// Between two times in any order.
  select(one: number, other: number): void {
    const within = (time: number) => Math.max(0, Math.min(time, this.duration));
    const [from, to] = [within(Math.min(one, other)), within(Math.max(one, other))];
    this.anchor = within(one);
    this.selected = to - from >= shortest ? { from, to } : undefined;
    this.changed();
  }

  clear(): void {
    this.selected = undefined;
    this.changed();
  }

  /// The range begins at `time`. Its end stays if it is later.
  setIn(time: number): void {
    const { to } = this.selected ?? { to: this.duration };
    this.select(time, to > time ? to : this.duration);
  }

  setOut(time: number): void {
    const { from } = this.selected ?? { from: 0 };
    this.select(from < time ? from : 0, time);
  }

  /// The selection ends at `time`. A new one begins at `start`.
  extend(start: number, time: number): void {
    this.select(this.selected ? this.anchor : start, time);
  }

  private changed(): void {
    if (!this.selected) [this.loops, this.hasHeat] = [false, false];
    this.onChange();
  }
}
