// Numbers and times in words.

export function clock(seconds: number, digits = 3): string {
  const sign = seconds < 0 ? '−' : '';
  const scale = 10 ** digits;
  const units = Math.round(Math.abs(seconds) * scale);
  const whole = Math.floor(units / scale);
  const fraction = digits > 0 ? '.' + String(units % scale).padStart(digits, '0') : '';
  const hours = Math.floor(whole / 3600);
  const minutes = Math.floor(whole / 60) % 60;
  const rest = String(whole % 60).padStart(2, '0');
  return hours > 0
    ? `${sign}${hours}:${String(minutes).padStart(2, '0')}:${rest}${fraction}`
    : `${sign}${minutes}:${rest}${fraction}`;
}

/// Returns a time as a screen reader says it: "1 hour 2 minutes 3.5 seconds".
export function spokenTime(seconds: number): string {
  const total = Math.round(seconds * 10) / 10;
  const unit = (count: number, name: string) => (count ? `${count} ${name}${count === 1 ? '' : 's'}` : '');
  const parts = [
    unit(Math.floor(total / 3600), 'hour'),
    unit(Math.floor(total / 60) % 60, 'minute'),
    unit(Math.round((total % 60) * 10) / 10, 'second'),
  ].filter(Boolean);
  return parts.join(' ') || '0 seconds';
}

export function count(value: number): string {
  return value.toLocaleString('en-GB');
}

export function plural(value: number, one: string, many = one + 's'): string {
  return `${count(value)} ${value === 1 ? one : many}`;
}

/// As the tool has them.
export function bytes(value: number): string {
  const units = ['bytes', 'kB', 'MB', 'GB', 'TB'];
  let unit = 0;
  for (; value >= 1000 && unit < units.length - 1; ++unit) value /= 1000;
  return unit === 0 ? plural(value, 'byte') : `${value.toFixed(1)} ${units[unit]}`;
}

/// Memory such as "24105MB" in gigabytes.
export function memoryText(text: string): string {
  const megabytes = /^(\d+)\s*MB$/i.exec(text)?.[1];
  const gigabytes = Number(megabytes) / 1000;
  return megabytes ? `${Number(gigabytes.toFixed(gigabytes < 10 ? 1 : 0))} GB` : text;
}

/// A kind's name as a title: "cursorLocation" is "Cursor location".
export function titleOf(kind: string): string {
  if (/^[0-9a-f]{8}-/.test(kind)) return kind;
  const words = kind
    .replace(/([a-z])([A-Z])/g, '$1 $2')
    .toLowerCase()
    .replace(/^cpu\b/, 'CPU');
  return words.charAt(0).toUpperCase() + words.slice(1);
}

/// A text as it is shown: signs that turn the direction of what follows, or that are not seen, show themselves.
export function shown(text: string): string {
  return text.replace(hiding, (sign) => {
    const code = sign.charCodeAt(0);
    return code < 0x20 ? String.fromCharCode(0x2400 + code) : `[U+${code.toString(16).toUpperCase().padStart(4, '0')}]`;
  });
}

/// All but tabs and ends of lines, which only make room.
const hiding = /[\0-\x08\v\f\x0e-\x1f\x7f-\x9f\u061c\u200e\u200f\u2028-\u202e\u2066-\u2069\ufeff]/g;

/// A number with as few digits as tell it apart on the screen.
export function brief(value: number): string {
  if (!Number.isFinite(value)) return '–';
  return Number.isInteger(value) ? String(value) : String(Number(value.toPrecision(5)));
}
