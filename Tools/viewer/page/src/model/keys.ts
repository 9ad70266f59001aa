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

/// What a key types that has a name.
function namedCharacter(key: Key): string {
  if (key.name === 'space') return ' ';
  const digit = key.code - 48;
  if (digit >= 0 && digit <= 9)
    return has(key, '<Shift>') && has(key, '(IsVK)') ? shiftedDigits[digit]! : String(digit);
  return punctuation[key.name] ?? '';
}

function unnamedCharacter(key: Key): string {
  const number = `[key ${key.code}]`;
  if (key.code > 0xff)
    return key.code < 0x110000 && (key.code < 0xd800 || key.code > 0xdfff) ? String.fromCodePoint(key.code) : number;
  if (key.code <= 32 || (key.code >= 0x7f && key.code < 0xa0)) return number;
  const text = String.fromCharCode(key.code);
  const isLetter = text >= 'A' && text <= 'Z';
  const isUpper = has(key, '<Shift>') !== has(key, '<Alpha>');
  return isLetter && has(key, '(IsVK)') && !isUpper && !isShortcut(key) ? text.toLowerCase() : text;
}

/// A code that is not marked as a key's may be a character's.
function mayBeCharacter(key: Key): boolean {
  return key.code >= 32 && key.code !== 0x7f && !has(key, '(IsVK)');
}

export function labelOf(key: Key, showsKeys: boolean): KeyLabel {
  const character = key.name.length > 1 ? namedCharacter(key) : unnamedCharacter(key);
  if (!character && (showsKeys || !mayBeCharacter(key)))
    return { text: `${signs(key)}[${key.name}]`, isTyped: false, endsLine: key.name === 'returnKey' };
  const shown = showsKeys ? character : mask;
  return isShortcut(key)
    ? { text: signs(key) + shown, isTyped: false, endsLine: false }
    : { text: shown, isTyped: true, endsLine: false };
}

export function keyLabel(track: Track, index: number, showsKeys: boolean): KeyLabel {
  const key = {
    code: track.number('characterCode', index) >>> 0,
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
