// One row of the timeline, and the ways in which rows are drawn.

import type { Extremes } from '../model/extremes';
import { countBefore, countUntil } from '../model/search';
import { shortened } from '../stage/layers';
import type { Palette } from '../ui/palette';
import type { Range } from './axis';

export interface Lane {
  /// Tells it from all others, in every recording.
  id: string;
  title: string;
  /// Of a stream that no reader finds.
  isHidden?: boolean;
  /// What each colour of its lines stands for.
  legend?: { text: string; colour: 'accent' | 'second' }[];
  /// In pixels of the page.
  height: number;
  draw(canvas: LaneCanvas): void;
  /// What holds at a time, in a few letters.
  valueAt(time: number): string;
}

/// A lane's place on the canvas, in pixels of the page.
export class LaneCanvas {
  constructor(
    readonly context: CanvasRenderingContext2D,
    readonly palette: Palette,
    readonly range: Range,
    readonly width: number,
    readonly top: number,
    readonly height: number,
  ) {}

  x(time: number): number {
    return ((time - this.range.from) / (this.range.to - this.range.from)) * this.width;
  }

  time(x: number): number {
    return this.range.from + (x / this.width) * (this.range.to - this.range.from);
  }
}

const columnWidth = 1;

/// Calls `take` for each column of the canvas with the entries of its time, and the one that holds where it has none.
export function columns(
  canvas: LaneCanvas,
  times: Float64Array,
  take: (x: number, first: number, end: number) => void,
): void {
  let first = countBefore(times, canvas.range.from);
  for (let x = 0; x < canvas.width; x += columnWidth) {
    const end = nextBefore(times, first, canvas.time(x + columnWidth));
    if (end > first) take(x, first, end);
    else if (first > 0) take(x, first - 1, first);
    first = end;
  }
}

/// Like `countBefore`, for an answer that is at `start` or not far behind it.
function nextBefore(times: Float64Array, start: number, time: number): number {
  let reach = 1;
  while (start + reach < times.length && times[start + reach]! < time) reach *= 2;
  let low = start;
  let high = Math.min(times.length, start + reach);
  while (low < high) {
    const middle = (low + high) >>> 1;
    if (times[middle]! < time) low = middle + 1;
    else high = middle;
  }
  return low;
}

export interface Curve {
  times: Float64Array;
  extremes: Extremes;
  /// The values at the lower and the upper edge.
  low: number;
  high: number;
  /// Grows with the value; by itself it is the value itself.
  shape?: (value: number) => number;
}

/// From the lower edge to the greatest value.
export function drawArea(canvas: LaneCanvas, curve: Curve, colour: string, alpha: number): void {
  const { context } = canvas;
  const bottom = canvas.top + canvas.height - 1;
  const top = new Path2D();
  const area = new Path2D();
  let last = -2;
  columns(canvas, curve.times, (x, first, end) => {
    const y = yOf(canvas, curve, curve.extremes.of(first, end)[1]);
    if (x !== last + columnWidth) top.moveTo(x, y);
    else top.lineTo(x, y);
    area.rect(x, y, columnWidth, bottom - y);
    last = x;
  });
  const isCrowded =
    countBefore(curve.times, canvas.range.to) - countBefore(curve.times, canvas.range.from) > 4 * canvas.width;
  context.globalAlpha = isCrowded ? 2.2 * alpha : alpha;
  context.fillStyle = colour;
  context.fill(area);
  context.globalAlpha = 1;
  if (isCrowded) return;
  context.strokeStyle = colour;
  context.lineWidth = 1;
  context.stroke(top);
}

/// A line that covers everything between the least and the greatest value of each column.
export function drawLine(canvas: LaneCanvas, curve: Curve, colour: string): void {
  const { context } = canvas;
  const line = new Path2D();
  let last = -2;
  columns(canvas, curve.times, (x, first, end) => {
    const [least, greatest] = curve.extremes.of(first, end).map((value) => yOf(canvas, curve, value)) as [
      number,
      number,
    ];
    if (x !== last + columnWidth) line.moveTo(x, least);
    else line.lineTo(x, least);
    if (greatest !== least) line.lineTo(x, greatest);
    last = x;
  });
  context.globalAlpha = 0.7;
  context.strokeStyle = colour;
  context.lineWidth = 1.2;
  context.lineJoin = 'round';
  context.stroke(line);
  context.globalAlpha = 1;
}

function yOf({ top, height }: LaneCanvas, { low, high, shape = (value) => value }: Curve, value: number): number {
  const [from, to] = [shape(low), shape(high)];
  const part = Math.max(0, Math.min(1, (shape(value) - from) / (to - from || 1)));
  return top + height - 2 - part * (height - 4);
}

/// How many entries each column holds, as ticks that grow with their number.
export function drawDensity(canvas: LaneCanvas, times: Float64Array, colour: string): void {
  const { context } = canvas;
  context.fillStyle = colour;
  const step = 2;
  const most = Math.max(3, (times.length * step * 4) / canvas.width);
  let first = countBefore(times, canvas.range.from);
  for (let x = 0; x < canvas.width; x += step) {
    const end = nextBefore(times, first, canvas.time(x + step));
    if (end > first) {
      const height = Math.min(1, 0.3 + (0.7 * (end - first)) / most) * (canvas.height - 6);
      context.fillRect(x, canvas.top + canvas.height - 3 - height, 1.5, height);
    }
    first = end;
  }
}

export interface Band {
  start: number;
  end: number;
  text: string;
  colour: string;
  /// Of its outline, which can be told from the page.
  edge: string;
}

/// Bands with names, which are cut where they do not fit, or left out where `isWhole`. What is narrower than two pixels
/// stands for everything in them.
export function drawBands(
  canvas: LaneCanvas,
  times: Float64Array,
  band: (index: number) => Band,
  isWhole = false,
): void {
  const { context, palette } = canvas;
  const end = countBefore(times, canvas.range.to);
  context.font = `500 11px ${palette.font}`;
  context.textBaseline = 'middle';
  for (let i = Math.max(0, countUntil(times, canvas.range.from) - 1); i < end;) {
    const { start, end: stop, text, colour, edge } = band(i);
    const x = Math.max(-4, canvas.x(start));
    const right = Math.min(canvas.width + 4, canvas.x(stop));
    const width = Math.max(1, right - x - 1);
    context.fillStyle = colour;
    context.beginPath();
    context.roundRect(x + 0.5, canvas.top + 3.5, Math.max(0.5, width - 1), canvas.height - 7, Math.min(3, width / 2));
    context.fill();
    context.strokeStyle = edge;
    context.lineWidth = 1;
    context.stroke();
    const room = { left: Math.max(0, x) + 6, right: right - 7 };
    if (width > 24 && text) drawBandText(canvas, text, room, isWhole);
    // Of those that begin within these two pixels, the last one may hold for long.
    i = right - x > 2 ? i + 1 : Math.max(i + 1, countBefore(times, canvas.time(x + 2)) - 1);
  }
}

function drawBandText(canvas: LaneCanvas, text: string, room: { left: number; right: number }, isWhole: boolean): void {
  const { context, top, height, palette } = canvas;
  const shown = shortened(context, text, room.right - room.left);
  if (shown !== text && (isWhole || shown.length < 5)) return; // says nothing
  context.fillStyle = palette.bandText;
  context.fillText(shown, room.left, top + height / 2 + 0.5);
}
