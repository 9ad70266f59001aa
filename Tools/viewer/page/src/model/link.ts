// Links into a recording: "#t=12.5&zoom=10-20&stream=cursorAction". Each part stands by itself; parts that nobody here
// knows are kept.

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

const seconds = String.raw`\d+(?:\.\d+)?`;

export function timeInLink(hash: string): number | undefined {
  const text = partsOf(hash).get('t') ?? '';
  return new RegExp(`^${seconds}$`).test(text) ? Number(text) : undefined;
}

/// A range of time such as "10-20".
export function rangeIn(text: string | undefined): { from: number; to: number } | undefined {
  const [, from, to] = new RegExp(`^(${seconds})-(${seconds})$`).exec(text ?? '') ?? [];
  return Number(from) < Number(to) ? { from: Number(from), to: Number(to) } : undefined;
}

export function secondsText(time: number): string {
  return String(Number(time.toFixed(6))); // a shorter one could lead to the picture before
}

export function linkTo(time: number): string {
  return hashOf(new Map([['t', secondsText(time)]]));
}

/// What the page shows, apart from what it shows by itself.
export interface View {
  time: number;
  /// Undefined if the lanes show everything.
  zoom: { from: number; to: number } | undefined;
  /// Empty for all streams.
  stream: string;
  filter: string;
  /// Undefined if those are on that are at first.
  layers: string[] | undefined;
}

/// The link to a view. What is in `hash` already and no part of a view stays in it.
export function linkToView(hash: string, { time, zoom, stream, filter, layers }: View): string {
  const parts = partsOf(hash);
  const put = (name: string, value: string | undefined) =>
    void (value === undefined ? parts.delete(name) : parts.set(name, value));
  put('t', secondsText(time));
  put('zoom', zoom && `${secondsText(zoom.from)}-${secondsText(zoom.to)}`);
  put('stream', stream || undefined);
  put('filter', filter || undefined);
  put('layers', layers?.join(','));
  return hashOf(parts);
}
