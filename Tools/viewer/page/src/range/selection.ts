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

  /// What lies beyond the new end is selected no longer.
  setDuration(duration: number): void {
    this.duration = duration;
    const { selected } = this;
    if (selected && selected.to > duration) this.select(selected.from, selected.to);
  }

  /// Between two times in any order.
  select(one: number, other: number): void {
    const within = (time: number) => Math.max(0, Math.min(time, this.duration));
    const [from, to] = [within(Math.min(one, other)), within(Math.max(one, other))];
    this.anchor = within(one);
    this.selected = to - from >= shortest ? { from, to } : undefined;
    this.changed();
  }

  /// The heat map tells of the range no longer.
  dropHeat(): void {
    if (!this.hasHeat) return;
    this.hasHeat = false;
    this.onChange();
  }

  clear(): void {
    this.selected = undefined;
    this.changed();
  }

  /// The range begins at `time`. Its end stays if it is later. Returns false if nothing is left to select.
  setIn(time: number): boolean {
    const { to } = this.selected ?? { to: this.duration };
    return this.selectSome(time, to > time ? to : this.duration);
  }

  /// The range ends at `time`, as `setIn` begins it.
  setOut(time: number): boolean {
    const { from } = this.selected ?? { from: 0 };
    return this.selectSome(from < time ? from : 0, time);
  }

  private selectSome(from: number, to: number): boolean {
    if (to - from < shortest) return false;
    this.select(from, to);
    return true;
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
