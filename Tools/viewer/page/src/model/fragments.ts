// The parts of a link after "#": "t=3&range=1.5-3". Each part stands alone, and parts of others are kept.

export function partOf(hash: string, name: string): string | undefined {
  const part = partsOf(hash).find((part) => part.startsWith(`${name}=`));
  return part?.slice(name.length + 1);
}

/// `hash` with another part of that name, or without one if `value` is undefined.
export function withPart(hash: string, name: string, value: string | undefined): string {
  const others = partsOf(hash).filter((part) => part !== name && !part.startsWith(`${name}=`));
  const parts = value === undefined ? others : [...others, `${name}=${value}`];
  return parts.length > 0 ? `#${parts.join('&')}` : '';
}

function partsOf(hash: string): string[] {
  return hash.replace(/^#/, '').split('&').filter(Boolean);
}

/// Seconds, or other numbers, with as many digits as make a difference, and without an exponent.
export function decimal(value: number): string {
  const text = value.toFixed(6).replace(/\.?0+$/, '');
  return text === '-0' ? '0' : text;
}

/// Undefined if one of the texts is no plain number.
export function decimalsOf(texts: string[]): number[] | undefined {
  return texts.every((text) => /^-?\d+(\.\d+)?$/.test(text)) ? texts.map(Number) : undefined;
}
