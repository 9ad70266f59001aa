// The whole recording in one strip, with the part that the lanes show.

import type { Session } from '../model/session';
import { fitCanvas, make } from '../ui/dom';
import { palette } from '../ui/palette';
import { uiScale } from '../ui/scale';
import { clampedRange, type Range } from './axis';
import { dragging } from './gestures';
import { drawArea, LaneCanvas, type Curve } from './lane';

const height = 34;
const grip = 7; // pixels beside an edge that still hold it

type Hold = 'from' | 'to' | 'window';

export class Overview {
  readonly element = make('div', {
    class: 'overview',
    'aria-hidden': 'true',
    title: 'Drag to choose what the lanes show',
  });
  private readonly canvas = make('canvas');
  private readonly window = make('div', { class: 'overview-window' });
  private readonly playhead = make('div', { class: 'overview-playhead' });
  private session: Session | undefined;
  private curve: Curve | undefined;
  private duration = 1;
  private range: Range = { from: 0, to: 1 };
  private isStale = true;

  /// `strip` shows the selection.
  constructor(
    private readonly onRange: (range: Range) => void,
    strip: HTMLElement,
  ) {
    this.element.append(this.canvas, strip, this.window, this.playhead);
    this.setUpDragging();
  }

  show(session: Session, duration: number): void {
    if (session !== this.session) {
      this.curve = { times: session.speed.times, extremes: session.speedExtremes, low: 0, high: 4900, shape: Math.sqrt };
    }
    [this.session, this.duration, this.isStale] = [session, duration, true];
  }

  invalidate(): void {
    this.isStale = true;
  }

  draw(range: Range, time: number): void {
    if (this.isStale) this.drawStrip();
    const part = (value: number) => (value / this.duration) * 100;
    if (range !== this.range) {
      this.range = range;
      this.window.style.left = `${part(range.from)}%`;
      this.window.style.width = `${part(range.to - range.from)}%`;
    }
    this.playhead.style.transform = `translateX(${(time / this.duration) * this.element.clientWidth}px)`;
  }

  private drawStrip(): void {
    this.isStale = false;
    const scale = uiScale();
    const width = this.element.clientWidth / scale;
    const ratio = fitCanvas(this.canvas, this.element.clientWidth, height * scale) * scale;
    const context = this.canvas.getContext('2d');
    if (!context || width <= 0) return;
    context.setTransform(ratio, 0, 0, ratio, 0, 0);
    context.clearRect(0, 0, width, height);
    const canvas = new LaneCanvas(context, palette(), { from: 0, to: this.duration }, width, 2, height - 4);
    for (const { start, end } of this.session?.idle ?? []) {
      const [x, wide] = [canvas.x(start), Math.max(1, canvas.x(end) - canvas.x(start))];
      context.fillStyle = palette().idle;
      context.fillRect(x, 0, wide, height);
      context.fillStyle = palette().edge;
      context.fillRect(x, 0, wide, 2);
    }
    if (this.curve) drawArea(canvas, this.curve, palette().faint, 0.35);
    context.fillStyle = palette().accent;
    for (const { start } of this.session?.clicks ?? []) context.fillRect(canvas.x(start), height - 7, 1, 5);
  }

  private setUpDragging(): void {
    let hold: Hold = 'window';
    let started: Range = this.range;
    const timeOf = (x: number) => (x / Math.max(1, this.element.clientWidth)) * this.duration;
    const xOf = (time: number) => (time / this.duration) * this.element.clientWidth;
    dragging(this.element, {
      start: (x) => {
        const { from, to } = this.range;
        hold = Math.abs(x - xOf(from)) < grip ? 'from' : Math.abs(x - xOf(to)) < grip ? 'to' : 'window';
        const isOutside = hold === 'window' && (timeOf(x) < from || timeOf(x) > to);
        const half = (to - from) / 2;
        started = isOutside
          ? clampedRange({ from: timeOf(x) - half, to: timeOf(x) + half }, this.duration)
          : this.range;
        if (isOutside) this.onRange(started);
      },
      move: (_, way) => {
        const shift = timeOf(way);
        const from = hold === 'to' ? started.from : started.from + shift;
        const to = hold === 'from' ? started.to : started.to + shift;
        if (to > from) this.onRange({ from, to });
      },
    });
  }
}
