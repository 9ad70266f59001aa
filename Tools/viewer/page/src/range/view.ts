// The selected range on the timeline, with edges that can be dragged.

import { make } from '../ui/dom';
import { dragging } from '../lanes/gestures';
import type { Range } from '../lanes/axis';

const room = 20; // pixels that an edge takes beside the range

export interface RangePlace {
  xOf: (time: number) => number;
  timeAt: (x: number) => number;
  width: number;
}

export class SelectionView {
  /// Over the ruler and the lanes.
  readonly element = make('div', { class: 'range', hidden: true });
  /// In the overview, by parts of its width.
  readonly strip = make('div', { class: 'range-strip', hidden: true });
  private readonly edges = { from: make('div', { class: 'range-edge is-from' }), to: make('div', { class: 'range-edge is-to' }) };
  private range: Range | undefined;
  private place: RangePlace | undefined;

  constructor(onSelect: (one: number, other: number) => void) {
    this.element.append(this.edges.from, this.edges.to);
    for (const name of ['from', 'to'] as const) this.drag(this.edges[name], name, onSelect);
  }

  /// The other edge stays.
  private drag(edge: HTMLElement, name: 'from' | 'to', onSelect: (one: number, other: number) => void): void {
    let [fixed, start] = [0, 0];
    dragging(edge, {
      start: (_, event) => {
        const { from, to } = this.range ?? { from: 0, to: 0 };
        [fixed, start] = name === 'from' ? [to, from] : [from, to];
        start = (this.place?.xOf(start) ?? 0) - event.clientX;
      },
      move: (_, __, event) => this.place && onSelect(fixed, this.place.timeAt(event.clientX + start)),
      click: () => {},
    });
  }

  show(range: Range | undefined, duration: number): void {
    this.range = range;
    this.element.hidden = this.strip.hidden = !range;
    if (!range) return;
    this.strip.style.left = `${(range.from / duration) * 100}%`;
    this.strip.style.width = `${((range.to - range.from) / duration) * 100}%`;
  }

  draw(place: RangePlace): void {
    this.place = place;
    if (!this.range) return;
    const far = 16; // pixels out of sight, so that edges there are not seen
    const within = (x: number) => Math.max(-far, Math.min(x, place.width + far));
    const [left, right] = [within(place.xOf(this.range.from)), within(place.xOf(this.range.to))];
    this.element.style.transform = `translateX(${left}px)`;
    this.element.style.width = `${right - left}px`;
    this.edges.from.classList.toggle('is-inside', left < room);
    this.edges.to.classList.toggle('is-inside', right > place.width - room);
  }
}
