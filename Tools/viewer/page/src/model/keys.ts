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
    const [text, isTyped] = [keys.text('label', i), keys.number('isTyped', i) === 1];
    const last = parts[parts.length - 1];
    if (isTyped && last?.isTyped) last.text += text;
    else parts.push({ text, isTyped });
  }
  return parts;
}

export function captionText(parts: CaptionPart[]): string {
  return parts.map(({ text }) => text).join(' ');
}

/// Returns the label without the brackets around the name of a key.
export function keyCap(label: string): string {
  return label.replace(/\[(.*)\]$/, '$1');
}
