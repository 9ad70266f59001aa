// Numbers in links and fields.

/// Seconds, or other numbers, with as many digits as make a difference, and without an exponent.
export function decimal(value: number): string {
  const text = value.toFixed(6).replace(/\.?0+$/, '');
  return text === '-0' ? '0' : text;
}

/// Undefined if one of the texts is no plain number.
export function decimalsOf(texts: string[]): number[] | undefined {
  const numbers = texts.map((text) => (/^-?\d+(\.\d+)?$/.test(text) ? Number(text) : NaN));
  return numbers.every(Number.isFinite) ? numbers : undefined; // many digits are infinite
}
