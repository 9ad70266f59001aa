// Buttons that went down, until they came up.

import type { Table } from '#decoder';
import { lastAt } from './search';
import { Track } from './track';

export interface Click {
  start: number;
  end: number;
  button: string;
  modifiers: string[];
  /// Where the cursor was; not a number if that is not known.
  x: number;
  y: number;
}

const modifierSigns: Record<string, string> = { shift: '⇧', ctrl: '⌃', cmd: '⌘', alt: '⌥' };

/// Takes the clicks as the library tells them.
export function clicksIn(table: Table | undefined): Click[] {
  const track = table && new Track(table);
  return Array.from(track?.times ?? [], (start, i) => ({
    start,
    end: track!.number('end', i),
    button: track!.text('button', i),
    modifiers: track!.text('modifiers', i).split('+').filter(Boolean),
    x: track!.number('x', i),
    y: track!.number('y', i),
  }));
}

/// Such as "⇧⌘ left".
export function clickLabel({ button, modifiers }: Click): string {
  const signs = modifiers.map((modifier) => modifierSigns[modifier] ?? modifier).join('');
  return signs ? `${signs} ${button}` : button;
}

/// Those that are held at `time` or were pressed at most `age` seconds before.
export function clicksAround(clicks: Click[], starts: Float64Array, time: number, age: number): Click[] {
  const found: Click[] = [];
  for (let i = lastAt(starts, time); i >= 0 && found.length < 8; --i) {
    const click = clicks[i]!;
    if (time - click.start <= age || time < click.end) found.push(click);
    else if (time - click.start > 60) break;
  }
  return found;
}
