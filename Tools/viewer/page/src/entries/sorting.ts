// The order of rows by a column: equal ones stay as they are, and what is no number comes last.

const digit = 16; // bits at a time
const buckets = 1 << digit;

/// Replaces each number by a whole number of 64 bits, in two halves, such that the order stays.
function sortable(keys: Float64Array, isDescending: boolean): Uint32Array {
  const halves = new Uint32Array(keys.buffer, keys.byteOffset, 2 * keys.length);
  for (let i = 0; i < keys.length; ++i) {
    if (keys[i] === 0) keys[i] = 0; // the negative one is the same
    const [low, high] = [2 * i, 2 * i + 1];
    if (Number.isNaN(keys[i])) halves[low] = halves[high] = 0xffffffff;
    else {
      const flip = halves[high]! & 0x80000000 ? 0xffffffff : 0;
      halves[low] = (halves[low]! ^ flip) >>> 0;
      halves[high] = (halves[high]! ^ (flip | 0x80000000)) >>> 0;
      if (isDescending) [halves[low], halves[high]] = [~halves[low]! >>> 0, ~halves[high]! >>> 0];
    }
  }
  return halves;
}

const collator = new Intl.Collator('en', { numeric: true, sensitivity: 'base' });

function compared(a: unknown, b: unknown): number {
  if (typeof a === 'bigint' && typeof b === 'bigint') return a < b ? -1 : a > b ? 1 : 0;
  return collator.compare(String(a), String(b));
}

/// What is no number has its place in the order of all values as its key. Null comes last.
export function rankedKeys(values: unknown[], places: Uint32Array): Float64Array {
  const order = Array.from(values, (_, place) => place).sort((a, b) => compared(values[a], values[b]));
  const ranks = new Float64Array(values.length);
  order.forEach((place, rank) => (ranks[place] = values[place] === null ? NaN : rank));
  return Float64Array.from(places, (place) => ranks[place]!);
}

/// Rows by their keys, which are lost.
export function orderOf(keys: Float64Array, isDescending: boolean): Uint32Array<ArrayBuffer> {
  const halves = sortable(keys, isDescending);
  let rows = new Uint32Array(keys.length);
  let other = new Uint32Array(keys.length);
  for (let i = 0; i < rows.length; ++i) rows[i] = i;
  for (let pass = 0; pass < 4; ++pass)
    if (distribute(halves, rows, other, pass >> 1, (pass & 1) * digit)) [rows, other] = [other, rows];
  return rows;
}

/// Orders rows by one digit. Returns false if all rows have the same digit, and does nothing then.
function distribute(halves: Uint32Array, from: Uint32Array, to: Uint32Array, half: number, shift: number): boolean {
  const starts = new Uint32Array(buckets + 1);
  const digitOf = (row: number) => (halves[2 * row + half]! >>> shift) & (buckets - 1);
  for (let i = 0; i < from.length; ++i) ++starts[digitOf(i) + 1]!;
  if (from.length === 0 || starts[digitOf(0) + 1] === from.length) return false;
  for (let k = 1; k <= buckets; ++k) starts[k]! += starts[k - 1]!;
  for (let i = 0; i < from.length; ++i) to[starts[digitOf(from[i]!)]!++] = from[i]!;
  return true;
}

/// The rows of `order` that are in `matches`.
export function picked(order: Uint32Array<ArrayBuffer>, matches: Uint32Array | null): Uint32Array<ArrayBuffer> {
  if (!matches) return order;
  const isWanted = new Uint8Array(order.length);
  for (const row of matches) isWanted[row] = 1;
  return order.filter((row) => isWanted[row] === 1);
}

/// The place of each of `count` rows, or -1 if it is not shown.
export function placesOf(shown: Uint32Array, count: number): Int32Array<ArrayBuffer> {
  const places = new Int32Array(count).fill(-1);
  for (let i = 0; i < shown.length; ++i) places[shown[i]!] = i;
  return places;
}
