// Buttons that went down, until they came up.

import { lastAt } from './search';
import type { Track } from './track';

export interface Click {
  start: number;
  end: number;
  button: string;
  modifiers: string[];
}

const modifierSigns: Record<string, string> = { shift: '⇧', ctrl: '⌃', cmd: '⌘', option: '⌥' };

export function clicksOf(track: Track | undefined, end: number): Click[] {
  const clicks: Click[] = [];
  const held = new Map<string, Click>();
  for (let i = 0; i < (track?.count ?? 0); ++i) {
    const [what = '', ...modifiers] = track!.text('action', i).split(' + ');
    const [button = '', phase] = what.split(' ');
    const time = track!.times[i]!;
    if (phase === 'down') {
      const click = { start: time, end, button, modifiers };
      held.set(button, click);
      clicks.push(click);
    } else if (phase === 'up') {
      const click = held.get(button);
      if (click) click.end = time;
      held.delete(button);
    }
  }
  for (const click of held.values()) click.end = Math.min(click.end, click.start + 1); // never came up
  return clicks;
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
