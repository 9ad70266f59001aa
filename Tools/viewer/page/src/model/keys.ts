// Captions of keys as they appear on the screen. The library says what a key is called, and which keys make a caption.

import type { Track } from './track';

export const mask = '•';

/// A run of typed text, or one other key.
export interface CaptionPart {
  text: string;
  isTyped: boolean;
}

/// Returns what is on the screen at `time`: the keys of a caption appear as they are pressed.
export function captionAt(keys: Track | undefined, time: number): CaptionPart[] {
  const parts: CaptionPart[] = [];
  const index = keys?.at(time) ?? -1;
  if (!keys || index < 0 || time >= keys.number('end', index)) return parts;
  for (let i = keys.number('first', index); i <= index; ++i) {
    const [text, isTyped] = [keys.text('label', i), keys.number('is_typed', i) === 1];
    const last = parts[parts.length - 1];
    if (isTyped && last?.isTyped) last.text += text;
    else parts.push({ text, isTyped });
  }
  return parts;
}

export function captionText(parts: CaptionPart[]): string {
  return parts.map(({ text }) => text).join(' ');
}

/// What is written on keys whose names are for programs. All others begin with a capital letter.
const engraved: Record<string, string> = {
  returnKey: 'Return',
  back: 'Backspace',
  capital: 'Caps Lock',
  escape: 'Esc',
  prior: 'Page Up',
  next: 'Page Down',
  left: '←',
  up: '↑',
  right: '→',
  down: '↓',
  snapshot: 'Print Screen',
  function: 'Fn',
  numlock: 'Num Lock',
  scroll: 'Scroll Lock',
  plus: '+',
  comma: ',',
  minus: '-',
  period: '.',
  closeParenthesis: ')',
  openParenthesis: '(',
  exclamation: '!',
  atSymbol: '@',
  pound: '#',
  percent: '%',
  carat: '^',
  ampersand: '&',
  star: '*',
  unknown: 'unknown key',
};

/// Returns the label as it is on a keyboard: "⌘[returnKey]" is "⌘Return".
export function keyCap(label: string): string {
  return label.replace(/\[(.+)\]$/, (_, name: string) => engraved[name] ?? name.charAt(0).toUpperCase() + name.slice(1));
}
