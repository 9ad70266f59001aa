// What a key is called on the screen, and keys joined into captions, as the tool's own subtitles have them.

import type { Track } from './track';

export interface KeyLabel {
  text: string;
  /// Part of running text, not a key with a name or a shortcut.
  isTyped: boolean;
  endsLine: boolean;
}

export interface Caption {
  start: number;
  end: number;
  text: string;
  keys: { time: number; label: KeyLabel }[];
}

export const mask = '•';

const pause = 1; // seconds: keys further apart make two captions
const hold = 1.5; // seconds that a caption stays behind its last key
const lineLength = 42;

/// In the order in which they are written in front of a key.
const modifierSigns: [string, string][] = [
  ['<Ctrl>', '⌃'],
  ['<Alt>', '⌥'],
  ['<Win>', '⊞'],
  ['<Shift>', '⇧'],
  ['<Cmd>', '⌘'],
];

const shiftedDigits = ')!@#$%^&*(';
const punctuation: Record<string, string> = { plus: '+', comma: ',', minus: '-', period: '.' };

interface Key {
  code: number;
  name: string;
  modifiers: string;
}

function has(key: Key, modifier: string): boolean {
  return key.modifiers.includes(modifier);
}

function isShortcut(key: Key): boolean {
  return ['<Ctrl>', '<Alt>', '<Win>', '<Cmd>'].some((modifier) => has(key, modifier));
}

function signs(key: Key): string {
  return modifierSigns.map(([name, sign]) => (has(key, name) ? sign : '')).join('');
}

/// What a virtual key with a name types; empty if it types nothing.
function typedByVirtualKey(key: Key): string {
  if (key.name === 'space') return ' ';
  const digit = key.code - 48;
  if (digit >= 0 && digit <= 9) return has(key, '<Shift>') ? shiftedDigits[digit]! : String(digit);
  if (!/^[A-Z]$/.test(key.name)) return punctuation[key.name] ?? '';
  const isUpper = has(key, '<Shift>') !== has(key, '<Alpha>');
  return isUpper || isShortcut(key) ? key.name : key.name.toLowerCase();
}

/// What a key types; empty for a special key. A number may stand for any character.
function typedBy(key: Key): string {
  if (key.name.startsWith('key ')) return `[${key.name}]`;
  if (has(key, '(IsVK)')) return typedByVirtualKey(key);
  return [...key.name].length === 1 ? key.name : '';
}

export function labelOf(key: Key, showsKeys: boolean): KeyLabel {
  const character = typedBy(key);
  if (!character)
    return { text: `${signs(key)}[${key.name}]`, isTyped: false, endsLine: key.name === 'returnKey' };
  const shown = showsKeys ? character : mask;
  return isShortcut(key)
    ? { text: signs(key) + shown, isTyped: false, endsLine: false }
    : { text: shown, isTyped: true, endsLine: false };
}

export function keyLabel(track: Track, index: number, showsKeys: boolean): KeyLabel {
  const key = {
    code: track.number('characterCode', index),
    name: track.text('characterString', index),
    modifiers: track.text('eventFlagsString', index),
  };
  return labelOf(key, showsKeys);
}

function length(text: string): number {
  return [...text].length;
}

/// What is shown of keys that belong together.
function joined(text: string, last: KeyLabel | undefined, label: KeyLabel): string {
  return text + (text === '' || (label.isTyped && last?.isTyped) ? '' : ' ') + label.text;
}

export function captionsOf(track: Track | undefined, showsKeys: boolean): Caption[] {
  const captions: Caption[] = [];
  let last: KeyLabel | undefined;
  let lastTime = 0;
  for (let i = 0; i < (track?.count ?? 0); ++i) {
    const time = track!.times[i]!;
    const label = keyLabel(track!, i, showsKeys);
    let caption = captions[captions.length - 1];
    const isNew =
      !caption || last?.endsLine || time - lastTime >= pause || length(caption.text) + length(label.text) > lineLength;
    if (isNew) captions.push((caption = { start: time, end: 0, text: '', keys: [] }));
    caption!.text = joined(caption!.text, last, label);
    caption!.keys.push({ time, label });
    caption!.end = time + hold;
    [last, lastTime] = [label, time];
  }
  return captions;
}

/// What of the `index`th caption is on the screen at `time`: its keys appear as they are pressed.
export function captionAt(captions: Caption[], index: number, time: number): Caption | undefined {
  const caption = captions[index];
  const next = captions[index + 1]?.start ?? Infinity;
  if (!caption || time < caption.start || time >= Math.min(caption.end, next)) return undefined;
  const keys = caption.keys.filter((key) => key.time <= time);
  if (keys.length === caption.keys.length) return caption;
  const text = keys.reduce((text, { label }, i) => joined(text, keys[i - 1]?.label, label), '');
  return { ...caption, keys, text };
}
