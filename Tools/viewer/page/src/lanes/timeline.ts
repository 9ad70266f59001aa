// The lanes below the movie, with one time axis, one playhead and an overview of the whole recording.

import { clock, spokenTime } from '../model/format';
import type { Session } from '../model/session';
import { byId, fitCanvas, make, setText } from '../ui/dom';
import { setIcon } from '../ui/icons';
import { palette } from '../ui/palette';
import { uiScale } from '../ui/scale';
import { store, stored } from '../ui/storage';
import { Arrangement } from './arrangement';
import { clampedRange, tickDigits, ticks, tickStep, zoomed, type Range } from './axis';
import { arrangeLanes } from './dialog';
import { dragging } from './gestures';
import { LaneLabel, type LabelEvents } from './labels';
import { LaneCanvas, type Lane } from './lane';
import { lanesOf, withNotes, type LaneOptions } from './lanes';
import { Overview } from './overview';
import { SelectionView } from '../range/view';

export interface TimelineEvents extends LaneOptions {
  onSeek: (time: number) => void;
  onRange: (range: Range) => void;
  /// Asks for a selection between two times, in any order.
  onSelect: (one: number, other: number) => void;
  /// Moves the end of the selection that is at the playhead.
  onExtend: (time: number) => void;
}

const rulerHeight = 26;
const laneGap = 1;
const headHeight = 62; // of the overview and the ruler
const arrangementKey = 'zulm-lanes';

export class Timeline {
  range: Range = { from: 0, to: 1 };
  private session: Session | undefined;
  private selected: Range | undefined;
  private duration = 1;
  /// All of the recording, in their usual order.
  lanes: Lane[] = [];
  arrangement = Arrangement.read(stored(arrangementKey));
  private pinned: LaneLabel[] = [];
  private others: LaneLabel[] = [];
  private isStale = true;
  private shownTime = -1;
  private time = 0;
  private readonly overview: Overview;
  private readonly pinnedLabels = make('div', { class: 'pinned-labels' });
  private readonly otherLabels = make('div');
  private readonly labels = make('div', { class: 'lane-labels' }, this.pinnedLabels, this.otherLabels);
  private readonly pinnedCanvas = make('canvas', { class: 'pinned-canvas', 'aria-hidden': 'true' });
  private readonly selection: SelectionView;
  private readonly lanesCanvas = make('canvas', { class: 'lanes-canvas', 'aria-hidden': 'true' });
  private readonly rulerCanvas = make('canvas', { class: 'ruler-canvas', 'aria-hidden': 'true' });
  private readonly ruler = make('div', {
    class: 'ruler',
    role: 'slider',
    tabindex: 0,
    'aria-label': 'Time',
    'aria-valuemin': 0,
  });
  private readonly body = make('div', { class: 'lanes-body' });
  private readonly scroller = make(
    'div',
    { class: 'lanes-scroll', tabindex: 0, role: 'group', 'aria-label': 'Lanes' },
    this.labels,
    this.body,
  );
  private readonly playhead = make('div', { class: 'playhead', 'aria-hidden': 'true' });
  private readonly pointerLine = make('div', { class: 'pointer-line', 'aria-hidden': 'true', hidden: true });
  private readonly tip = make('output', { class: 'tip', 'aria-live': 'off', hidden: true });
  /// Where the pointer rests.
  private pointed: PointerEvent | undefined;
  private readonly zoomText = make('span', { class: 'zoom-text' });

  constructor(private readonly events: TimelineEvents) {
    this.selection = new SelectionView(events.onSelect);
    this.overview = new Overview((range) => this.setRange(range), this.selection.strip);
    this.build();
    let anchor: number | undefined;
    dragging(this.ruler, {
      start: (x, { shiftKey }) => {
        anchor = shiftKey ? this.timeAt(x) : undefined;
        if (!shiftKey) this.events.onSeek(this.timeAt(x));
      },
      click: (x, { shiftKey }) => shiftKey && this.events.onSelect(this.time, this.timeAt(x)),
      move: (x) => (anchor === undefined ? this.events.onSeek(this.timeAt(x)) : this.events.onSelect(anchor, this.timeAt(x))),
    });
    byId('timeline').addEventListener('keydown', (event) => this.selectByKey(event));
    this.setUpLanes();
    new ResizeObserver(() => this.resized()).observe(this.body);
  }

  private build(): void {
    const root = byId('timeline');
    const tool = (icon: string, name: string, action: () => void) => {
      const button = make('button', {
        type: 'button',
        class: 'button is-icon is-small',
        'aria-label': name,
        title: name,
      });
      setIcon(button, icon);
      button.addEventListener('click', action);
      return button;
    };
    const tools = make(
      'div',
      { class: 'timeline-tools' },
      tool('minus', 'Zoom out', () => this.zoom(2)),
      tool('plus', 'Zoom in', () => this.zoom(0.5)),
      tool('fit', 'Show all', () => this.showAll()),
      tool('lanes', 'Arrange the lanes', () => arrangeLanes(this)),
      this.zoomText,
    );
    this.ruler.append(this.rulerCanvas);
    this.body.append(this.pinnedCanvas, this.lanesCanvas);
    root.append(
      make('div', { class: 'timeline-row' }, tools, this.overview.element),
      make('div', { class: 'timeline-row' }, make('div', { class: 'ruler-label' }, 'Time'), this.ruler),
      this.scroller,
      make('div', { class: 'playhead-holder', 'aria-hidden': 'true' }, this.selection.element, this.pointerLine, this.playhead),
      this.tip,
    );
  }

  /// Makes the lanes that `show` takes. The page goes on meanwhile.
  lanesOf(session: Session): Promise<Lane[]> {
    return lanesOf(session, this.events);
  }

  show(session: Session, lanes: Lane[], duration: number): void {
    this.session = session;
    this.duration = duration;
    this.lanes = withNotes(lanes, session, this.events);
    this.placeLanes();
    this.overview.show(session, duration);
    this.ruler.setAttribute('aria-valuemax', duration.toFixed(3));
    this.setRange({ from: 0, to: duration });
  }

  /// Orders the lanes as the reader wants them.
  private placeLanes(): void {
    const { pinned, others } = this.arrangement.arranged(this.lanes);
    const events: LabelEvents = {
      onMove: (id, target) => this.change(() => this.arrangement.move(this.lanes, id, target)),
      onResize: (id, height) => this.change(() => this.arrangement.resize(id, height)),
    };
    const labels = (lanes: Lane[], isPinned: boolean) =>
      lanes.map((lane) => new LaneLabel(lane, isPinned, laneGap, events));
    [this.pinned, this.others] = [labels(pinned, true), labels(others, false)];
    this.pinnedLabels.replaceChildren(...this.pinned.map(({ element }) => element));
    this.otherLabels.replaceChildren(...this.others.map(({ element }) => element));
    const height = headHeight + heightOf(this.pinned) + heightOf(this.others);
    document.documentElement.style.setProperty('--lanes-content', `${height / 16}rem`);
    this.invalidate();
  }

  /// Called after the notes changed.
  refreshLanes(): void {
    if (!this.session) return;
    this.lanes = withNotes(this.lanes, this.session, this.events);
    this.placeLanes();
  }

  /// What the lanes show; undefined if it is everything.
  get zoomed(): Range | undefined {
    return this.range.to - this.range.from < this.duration ? this.range : undefined;
  }

  private change(how: () => void): void {
    how();
    this.rearrange();
  }

  /// Called after the arrangement was changed.
  rearrange(): void {
    store(arrangementKey, this.arrangement.text());
    this.placeLanes();
  }

  resetLanes(): void {
    this.arrangement = new Arrangement();
    store(arrangementKey, null);
    this.placeLanes();
  }

  /// A movie may be longer than what was recorded beside it.
  setDuration(duration: number): void {
    if (!this.session || duration === this.duration) return;
    const showedAll = this.range.to - this.range.from >= this.duration;
    this.duration = duration;
    this.overview.show(this.session, duration);
    this.selection.show(this.selected, duration);
    this.ruler.setAttribute('aria-valuemax', duration.toFixed(3));
    this.setRange(showedAll ? { from: 0, to: duration } : this.range);
  }

  setRange(range: Range): void {
    this.range = clampedRange(range, this.duration);
    this.isStale = true;
    this.shownTime = -1;
    const length = this.range.to - this.range.from;
    setText(
      this.zoomText,
      length >= this.duration ? 'all' : length >= 10 ? clock(length, 0) : `${length.toFixed(2)} s`,
    );
    this.events.onRange(this.range);
  }

  showAll(): void {
    this.setRange({ from: 0, to: this.duration });
  }

  showSelection(range: Range | undefined): void {
    this.selected = range;
    this.selection.show(range, this.duration);
    this.drawSelection();
  }

  private drawSelection(): void {
    this.selection.draw({
      width: this.width,
      xOf: (time) => this.xOf(time),
      timeAt: (x) => this.timeAt(x),
    });
  }

  /// A part of what is in sight, whose edges can be dragged then.
  selectSome(): void {
    const { from, to } = this.range;
    const part = (to - from) / 4;
    const start = Math.max(from, Math.min(this.time, to - part));
    this.events.onSelect(start, start + part);
  }

  private selectByKey(event: KeyboardEvent): void {
    const step = tickStep(this.range, this.width / uiScale(), 84) / 5;
    const times: Record<string, number> = {
      ArrowLeft: this.time - step,
      ArrowRight: this.time + step,
      Home: 0,
      End: this.duration,
    };
    const time = times[event.key];
    if (time === undefined || !event.shiftKey || event.ctrlKey || event.altKey || event.metaKey) return;
    event.preventDefault();
    this.events.onExtend(Math.max(0, Math.min(time, this.duration)));
  }

  /// By a part of what is in sight.
  pan(part: number): void {
    const { from, to } = this.range;
    const way = part * (to - from);
    this.setRange({ from: from + way, to: to + way });
  }

  /// Around the playhead where that is in sight.
  zoom(factor: number): void {
    const { from, to } = this.range;
    const anchor = this.time >= from && this.time <= to ? this.time : (from + to) / 2;
    this.setRange(zoomed(this.range, anchor, factor, this.duration));
  }

  /// Brings a time into sight that is out of it.
  reveal(time: number): void {
    this.time = time;
    const { from, to } = this.range;
    const length = to - from;
    if (time < from || time > to) this.setRange({ from: time - length * 0.1, to: time + length * 0.9 });
  }

  /// What stands above the lanes is as wide as they are, beside their scroll bar.
  private resized(): void {
    const bar = this.scroller.offsetWidth - this.scroller.clientWidth;
    byId('timeline').style.setProperty('--scroll-bar', `${bar}px`);
    this.invalidate();
  }

  invalidate(): void {
    this.isStale = true;
    this.shownTime = -1;
    this.overview.invalidate();
    this.events.onRange(this.range);
  }

  /// Only the playhead moves, until the range is another one.
  draw(time: number): void {
    if (!this.session) return;
    if (this.isStale) {
      this.drawLanes();
      this.drawSelection();
      if (this.pointed) this.point(this.pointed);
    }
    this.overview.draw(this.range, time);
    this.time = time;
    if (time === this.shownTime) return;
    this.shownTime = time;
    const x = this.xOf(time);
    this.playhead.hidden = x < -1 || x > this.width + 1;
    this.playhead.style.transform = `translateX(${x}px)`;
    for (const { lane, value } of [...this.pinned, ...this.others]) setText(value, lane.valueAt(time));
    this.ruler.setAttribute('aria-valuenow', time.toFixed(3));
    this.ruler.setAttribute('aria-valuetext', spokenTime(time));
  }

  private get width(): number {
    return this.body.clientWidth;
  }

  private xOf(time: number): number {
    return ((time - this.range.from) / (this.range.to - this.range.from)) * this.width;
  }

  private timeAt(x: number): number {
    const time = this.range.from + (x / Math.max(1, this.width)) * (this.range.to - this.range.from);
    return Math.max(0, Math.min(time, this.duration));
  }

  private drawLanes(): void {
    this.isStale = false;
    const scale = uiScale();
    this.drawBlock(this.pinnedCanvas, this.pinned, scale);
    this.drawBlock(this.lanesCanvas, this.others, scale);
    this.drawRuler(scale);
  }

  /// Lanes below one another.
  private drawBlock(element: HTMLCanvasElement, labels: LaneLabel[], scale: number): void {
    const width = this.width / scale;
    const height = heightOf(labels);
    element.hidden = labels.length === 0;
    element.style.height = `${height * scale}px`;
    const ratio = fitCanvas(element, this.width, height * scale) * scale;
    const context = element.getContext('2d');
    if (!context || width <= 0 || labels.length === 0) return;
    context.setTransform(ratio, 0, 0, ratio, 0, 0);
    context.clearRect(0, 0, width, height);
    this.drawBackground(new LaneCanvas(context, palette(), this.range, width, 0, height));
    let top = 0;
    for (const { lane } of labels) {
      lane.draw(new LaneCanvas(context, palette(), this.range, width, top, lane.height));
      context.fillStyle = palette().line;
      context.fillRect(0, top + lane.height, width, laneGap);
      top += lane.height + laneGap;
    }
  }

  private drawBackground(canvas: LaneCanvas): void {
    const { context, width, height, range } = canvas;
    for (const { start, end } of this.session?.idle ?? [])
      if (end > range.from && start < range.to) drawIdle(canvas, canvas.x(start), canvas.x(end), height);
    context.fillStyle = palette().grid;
    for (const time of ticks(range, tickStep(range, width, 84)))
      context.fillRect(Math.round(canvas.x(time)), 0, 1, height);
  }

  private drawRuler(scale: number): void {
    const width = this.width / scale;
    const ratio = fitCanvas(this.rulerCanvas, this.width, rulerHeight * scale) * scale;
    const context = this.rulerCanvas.getContext('2d');
    if (!context) return;
    context.setTransform(ratio, 0, 0, ratio, 0, 0);
    context.clearRect(0, 0, width, rulerHeight);
    const canvas = new LaneCanvas(context, palette(), this.range, width, 0, rulerHeight);
    const step = tickStep(this.range, width, 84);
    context.font = `11px ${palette().font}`;
    context.textBaseline = 'middle';
    for (const time of ticks(this.range, step / 5)) {
      context.fillStyle = palette().line;
      context.fillRect(Math.round(canvas.x(time)), rulerHeight - 5, 1, 5);
    }
    for (const time of ticks(this.range, step)) {
      const x = Math.round(canvas.x(time));
      context.fillStyle = palette().faint;
      context.fillRect(x, rulerHeight - 9, 1, 9);
      const text = clock(time, tickDigits(step));
      if (x + 4 + context.measureText(text).width > width) continue;
      context.fillStyle = palette().muted;
      context.fillText(text, x + 4, 10);
    }
  }

  /// A click goes there; dragging moves the lanes, or the time where all of it is in sight.
  private setUpLanes(): void {
    let started: Range = this.range;
    let anchor: number | undefined;
    const isWhole = () => started.to - started.from >= this.duration;
    dragging(this.body, {
      start: (x, { shiftKey }) => {
        started = this.range;
        anchor = shiftKey ? this.timeAt(x) : undefined;
      },
      click: (x, { shiftKey }) =>
        shiftKey ? this.events.onSelect(this.time, this.timeAt(x)) : this.events.onSeek(this.timeAt(x)),
      move: (x, way) => {
        if (anchor !== undefined) return this.events.onSelect(anchor, this.timeAt(x));
        if (isWhole()) return this.events.onSeek(this.timeAt(x));
        const shift = (way / this.width) * (started.to - started.from);
        this.setRange({ from: started.from - shift, to: started.to - shift });
      },
      pinch: (x, factor) => this.setRange(zoomed(this.range, this.timeAt(x), factor, this.duration)),
    });
    for (const element of [this.body, this.ruler, this.overview.element])
      element.addEventListener('wheel', (event) => this.wheel(event), { passive: false });
    this.body.addEventListener('pointermove', (event) => this.point(event));
    this.body.addEventListener('pointerleave', () => this.pointNowhere());
    this.scroller.addEventListener('scroll', () => this.pointed && this.point(this.pointed));
  }

  /// Alone it scrolls what the browser scrolls.
  private wheel(event: WheelEvent): void {
    const lines = event.deltaMode === WheelEvent.DOM_DELTA_LINE ? 16 : 1;
    const isZoom = event.ctrlKey || event.metaKey;
    const isPan = !isZoom && (event.shiftKey || Math.abs(event.deltaX) > Math.abs(event.deltaY));
    if (!isZoom && !isPan) return;
    event.preventDefault();
    if (isPan) {
      const way = (event.deltaX || event.deltaY) * lines;
      const shift = (way / Math.max(1, this.width)) * (this.range.to - this.range.from);
      return this.setRange({ from: this.range.from + shift, to: this.range.to + shift });
    }
    const x = event.clientX - this.body.getBoundingClientRect().left;
    const strength = Math.abs(event.deltaY) < 40 ? 0.01 : 0.0022; // fingers on a trackpad, or a notch
    const isOverview = event.currentTarget === this.overview.element;
    const anchor = isOverview ? (x / Math.max(1, this.width)) * this.duration : this.timeAt(x);
    this.setRange(zoomed(this.range, anchor, Math.exp(event.deltaY * lines * strength), this.duration));
  }

  private pointNowhere(): void {
    this.pointed = undefined;
    this.pointerLine.hidden = this.tip.hidden = true;
  }

  /// Pinned lanes lie over those that scroll.
  private laneAt(place: number): Lane | undefined {
    const { top, bottom } = this.pinnedCanvas.getBoundingClientRect();
    const isPinned = place >= top && place < bottom;
    const y = (place - (isPinned ? top : this.lanesCanvas.getBoundingClientRect().top)) / uiScale();
    let end = 0;
    return (isPinned ? this.pinned : this.others).find(({ lane }) => y < (end += lane.height + laneGap))?.lane;
  }

  /// What the lane under the pointer tells at that time.
  private point(event: PointerEvent): void {
    if (event.pointerType === 'touch' || event.buttons !== 0) return this.pointNowhere();
    this.pointed = event;
    const box = this.body.getBoundingClientRect();
    const x = event.clientX - box.left;
    const lane = this.laneAt(event.clientY);
    const time = this.timeAt(x);
    this.pointerLine.hidden = this.tip.hidden = false;
    this.pointerLine.style.transform = `translateX(${x}px)`;
    const value = lane?.valueAt(time);
    this.tip.replaceChildren(
      make('b', {}, clock(time)),
      ...(lane ? [` ${lane.title}`] : []),
      ...(value ? [make('i', {}, value)] : []),
    );
    const root = byId('timeline').getBoundingClientRect();
    const left = Math.min(event.clientX - root.left + 12, root.width - this.tip.offsetWidth - 8);
    this.tip.style.transform = `translate(${Math.max(4, left)}px, ${event.clientY - root.top - this.tip.offsetHeight - 10}px)`;
  }
}

function heightOf(labels: LaneLabel[]): number {
  return labels.reduce((sum, { lane }) => sum + lane.height + laneGap, 0);
}

const idleEdge = 3; // pixels

/// Shaded, with edges that can be told from the page.
function drawIdle({ context, width }: LaneCanvas, start: number, end: number, height: number): void {
  const [left, right] = [Math.max(-1, start), Math.min(width + 1, end)];
  context.fillStyle = palette().idle;
  context.fillRect(left, 0, right - left, height);
  context.fillStyle = palette().edge;
  context.fillRect(left, 0, right - left, idleEdge);
  for (const x of [start, end - 1]) context.fillRect(x, 0, 1, height);
}
