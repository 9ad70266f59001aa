// Links into a recording: "#t=12.5&range=1.5-3&zoom=10-20&stream=cursorAction". Each part stands by itself; parts that nobody here
// knows are kept.

import { decimal, decimalsOf } from './decimals';

export type LinkParts = Map<string, string>;

export function partsOf(hash: string): LinkParts {
  const parts = new Map<string, string>();
  for (const part of hash.replace(/^#/, '').split('&')) {
    const [, name, value = ''] = /^([\w-]+)=(.*)$/.exec(part) ?? [];
    if (name) parts.set(name, plain(value));
  }
  return parts;
}

function plain(text: string): string {
  try {
    return decodeURIComponent(text);
  } catch {
    return text; // a percent sign that stands for itself
  }
}

export function hashOf(parts: LinkParts): string {
  const coded = (value: string) => encodeURIComponent(value).replaceAll('%2C', ',').replaceAll('%3A', ':');
  return `#${[...parts].map(([name, value]) => `${name}=${coded(value)}`).join('&')}`;
}

/// `hash` with these parts; one of undefined value is taken out of it.
export function withParts(hash: string, changes: Iterable<[string, string | undefined]>): string {
  const parts = partsOf(hash);
  for (const [name, value] of changes) {
    if (value === undefined) parts.delete(name);
    else parts.set(name, value);
  }
  return hashOf(parts);
}

export function timeInLink(hash: string): number | undefined {
  const [time] = decimalsOf([partsOf(hash).get('t') ?? '']) ?? [];
  return time !== undefined && time >= 0 ? time : undefined;
}

export interface TimeRange {
  from: number;
  to: number;
}

/// A range of time such as "10-20".
export function rangeIn(text: string | undefined): TimeRange | undefined {
  const [from, to, ...rest] = decimalsOf(text?.split('-') ?? []) ?? [];
  return rest.length === 0 && from !== undefined && to !== undefined && from < to ? { from, to } : undefined;
}

export function rangeText({ from, to }: TimeRange): string {
  return `${decimal(from)}-${decimal(to)}`;
}

export function linkTo(time: number): string {
  return withParts('', [['t', decimal(time)]]); // fewer digits could lead to the picture before
}

/// What the page shows, apart from what it shows by itself.
export interface View {
  time: number;
  /// Undefined if the lanes show everything.
  zoom: TimeRange | undefined;
  /// Empty for all streams.
  stream: string;
  filter: string;
  /// Undefined if those are on that are at first.
  layers: string[] | undefined;
}

/// The link to a view. What is in `hash` already and no part of a view stays in it.
export function linkToView(hash: string, { time, zoom, stream, filter, layers }: View): string {
  return withParts(hash, [
    ['t', decimal(time)],
    ['zoom', zoom && rangeText(zoom)],
    ['stream', stream || undefined],
    ['filter', filter || undefined],
    ['layers', layers?.join(',')],
  ]);
}
