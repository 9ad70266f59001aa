// The lanes of a recording: one for each thing that was recorded.

import { clickLabel, type Click } from '../model/clicks';
import { StreamRows } from '../entries/rows';
import { brief, shown, titleOf } from '../model/format';
import { Extremes } from '../model/extremes';
import { keyCap } from '../model/keys';
import type { Rect } from '../model/geometry';
import type { Note } from '../model/notes';
import { countBefore, countUntil, lastAt } from '../model/search';
import { rectAt, type HiddenStream, type Session } from '../model/session';
import type { Track } from '../model/track';
import { breath } from '../ui/breath';
import { drawArea, drawBands, drawDensity, drawLine, type Curve, type Lane, type LaneCanvas } from './lane';

export interface LaneOptions {
  showsKeys: () => boolean;
  /// What of the screen the movie shows.
  region: () => Rect;
  /// The notes in the order of their times.
  notes: () => readonly Note[];
}

/// A lane before it is told from others of its name.
type NamelessLane = Omit<Lane, 'id'>;

/// Returns all lanes but that of the notes, which `withNotes` adds. The page goes on meanwhile.
export async function lanesOf(session: Session, options: LaneOptions): Promise<Lane[]> {
  const makers = [
    () => slideLane(session),
    () => textLane(session, 'topmostAppName', 'name', 'Application'),
    () => textLane(session, 'topmostWindowTitle', 'title', 'Window'),
    () => windowLane(session),
    () => clickLane(session),
    () => keyLane(session, options),
    () => scrollLane(session),
    () => speedLane(session),
    () => trailLane(session, options),
    () => hoverLane(session),
    () => opacityLane(session),
    () => cpuLane(session),
    ...session.hidden.slice(0, mostHidden).map((hidden) => () => hiddenLane(hidden, options)),
  ];
  const lanes: NamelessLane[] = [];
  for (const make of makers) {
    const lane = make();
    if (!lane) continue;
    lanes.push(lane);
    await breath();
  }
  return identified(lanes);
}

/// Two hidden streams may have one name.
function identified(lanes: NamelessLane[]): Lane[] {
  const names = lanes.map(({ title, isHidden }) => (isHidden ? `${title} (hidden)` : title));
  return lanes.map((lane, i) => {
    const sooner = names.slice(0, i).filter((name) => name === names[i]).length;
    return { ...lane, id: sooner > 0 ? `${names[i]} ${sooner + 1}` : names[i]! };
  });
}

const mostHidden = 12;

const noteEnd = 0.6; // seconds after which a note is no longer that of the playhead

/// Returns the lanes with the notes as they are now.
export function withNotes(lanes: Lane[], session: Session, options: LaneOptions): Lane[] {
  const notes = notesLane(session, options);
  const others = lanes.filter(({ id }) => id !== notesTitle);
  return notes ? [{ ...notes, id: notesTitle }, ...others] : others;
}

const notesTitle = 'Notes';

function notesLane({ duration }: Session, { notes }: LaneOptions): NamelessLane | undefined {
  const all = notes();
  if (all.length === 0) return undefined;
  const times = Float64Array.from(all, ({ time }) => time);
  return {
    title: notesTitle,
    height: 23,
    draw: (canvas) =>
      drawBands(canvas, times, (index) => {
        const { bands, bandEdges } = canvas.palette;
        const [start, end] = [times[index]!, times[index + 1] ?? duration];
        return { start, end, text: shown(all[index]!.text), colour: bands[2]!, edge: bandEdges[2]! };
      }),
    valueAt: (time) => {
      const index = lastAt(times, time);
      return index >= 0 && time - times[index]! < noteEnd ? shown(all[index]!.text) : '';
    },
  };
}

/// When a stream that no reader finds has entries.
function hiddenLane({ stream, track }: HiddenStream, { showsKeys }: LaneOptions): NamelessLane | undefined {
  if (!track || track.count === 0) return undefined;
  const rows = new StreamRows(track, showsKeys);
  return {
    title: titleOf(stream.kind),
    isHidden: true,
    height: 18,
    draw: (canvas) => drawDensity(canvas, track.times, canvas.palette.faint),
    valueAt: (time) => {
      const index = track.at(time);
      return index >= 0 ? rows.summary(track.row(index)) : '';
    },
  };
}

function filled(session: Session, kind: string): Track | undefined {
  const track = session.track(kind);
  return track && track.count > 0 ? track : undefined;
}

/// Each name has a colour of its own, as long as there are enough.
class NameColours {
  private readonly places = new Map<string, number>();

  of(name: string): number {
    if (!this.places.has(name)) this.places.set(name, this.places.size);
    return this.places.get(name)!;
  }
}

interface BandName {
  text: string;
  index: number;
  time: number;
}

/// A band for each entry, in one of the colours of bands.
function bandLane(
  session: Session,
  kind: string,
  title: string,
  textOf: (track: Track, index: number) => string,
  colourOf: (name: BandName) => number,
): NamelessLane | undefined {
  const track = filled(session, kind);
  return (
    track && {
      title,
      height: 23,
      draw: (canvas) =>
        drawBands(canvas, track.times, (index) => {
          const [time, text] = [track.times[index]!, textOf(track, index)];
          const { bands, bandEdges } = canvas.palette;
          const place = colourOf({ text, index, time }) % bands.length;
          const end = track.endOf(index, session.duration);
          return { start: time, end, text, colour: bands[place]!, edge: bandEdges[place]! };
        }),
      valueAt: (time) => {
        const index = track.at(time);
        return index >= 0 ? textOf(track, index) : '';
      },
    }
  );
}

const textsOf = (column: string) => (track: Track, index: number) => track.text(column, index);

function textLane(session: Session, kind: string, column: string, title: string): NamelessLane | undefined {
  const colours = new NameColours();
  return bandLane(session, kind, title, textsOf(column), ({ text, time }) =>
    colours.of(appAt(session, time) || text),
  );
}

function appAt(session: Session, time: number): string {
  const track = session.track('topmostAppName');
  const index = track?.at(time) ?? -1;
  return index >= 0 ? track!.text('name', index) : '';
}

function slideLane(session: Session): NamelessLane | undefined {
  const kinds: [string, string][] = [
    ['slideTitles', 'title'],
    ['slideText', 'text'],
    ['slideComment', 'comment'],
  ];
  const [kind, column] = kinds.find(([kind]) => filled(session, kind)) ?? ['', ''];
  return bandLane(session, kind, 'Slides', textsOf(column), ({ index }) => index % 2);
}

function rectText(track: Track, index: number): string {
  const { x, y, width, height } = rectAt(track, index);
  return `${width}×${height} at ${x}, ${y}`;
}

/// Shown on its own only where there are no names for its windows.
function windowLane(session: Session): NamelessLane | undefined {
  if (filled(session, 'topmostAppName') || filled(session, 'topmostWindowTitle')) return undefined;
  const colours = new NameColours();
  return bandLane(session, 'topmostWindow', 'Window', rectText, ({ text }) => colours.of(text));
}

const roomForClicks = 6; // pixels to a click, from which on each is drawn

function clickLane({ clicks }: Session): NamelessLane | undefined {
  if (clicks.length === 0) return undefined;
  const starts = Float64Array.from(clicks, ({ start }) => start);
  return {
    title: 'Clicks',
    height: 20,
    draw: (canvas) => {
      const end = countBefore(starts, canvas.range.to);
      const first = countUntil(starts, canvas.range.from);
      if (end - first > canvas.width / roomForClicks) return drawDensity(canvas, starts, canvas.palette.accent);
      for (let i = Math.max(0, first - 4); i < end;) {
        drawClick(canvas, clicks[i]!);
        i = Math.max(i + 1, countBefore(starts, canvas.time(canvas.x(starts[i]!) + 1.5)));
      }
    },
    valueAt: (time) => {
      const click = clicks[lastAt(starts, time)];
      return click && (time < click.end || time - click.start < 0.6) ? clickLabel(click) : '';
    },
  };
}

function drawClick(canvas: LaneCanvas, click: Click): void {
  const {
    context,
    top,
    height,
    palette: { accent, second },
  } = canvas;
  const [x, right] = [canvas.x(click.start), canvas.x(click.end)];
  const middle = top + height / 2;
  context.fillStyle = click.button === 'left' ? accent : second;
  if (right - x > 4) {
    context.globalAlpha = 0.35;
    context.fillRect(x, middle - 3, right - x, 6);
    context.globalAlpha = 1;
  }
  context.fillRect(x - 0.75, top + 4, 1.5, height - 8);
  context.fill(clickShape(click.button, x, middle));
}

/// A disc for the left button, a square for the right one, a triangle for all others.
function clickShape(button: string, x: number, y: number): Path2D {
  const shape = new Path2D();
  if (button === 'left') shape.arc(x, y, 3.5, 0, 2 * Math.PI);
  else if (button === 'right') shape.rect(x - 3.5, y - 3.5, 7, 7);
  else for (const [dx, dy] of [[-4.5, 3.5], [4.5, 3.5], [0, -4.5]] as const) shape.lineTo(x + dx, y + dy);
  return shape;
}

const roomForKeys = 12; // pixels to a key, from which on each shows what it is

function keyLane(session: Session, { showsKeys }: LaneOptions): NamelessLane | undefined {
  const keys = () => session.keys(showsKeys())!;
  if (!session.keys(false)?.count) return undefined;
  return {
    title: 'Keys',
    height: 23,
    draw: (canvas) => {
      const track = keys();
      const first = countBefore(track.times, canvas.range.from);
      const end = countBefore(track.times, canvas.range.to);
      if (end - first <= canvas.width / roomForKeys) drawKeys(canvas, track, first, end);
      else drawDensity(canvas, track.times, canvas.palette.accent);
    },
    valueAt: (time) => {
      const track = keys();
      const index = track.at(time);
      return index >= 0 && time - track.times[index]! < 1 ? keyCap(track.text('label', index)) : '';
    },
  };
}

function drawKeys(canvas: LaneCanvas, track: Track, first: number, end: number): void {
  const {
    context,
    palette: { accent, accentSoft, text },
  } = canvas;
  context.font = `600 11px ${canvas.palette.font}`;
  context.textBaseline = 'middle';
  for (let i = first; i < end; ++i) {
    const x = canvas.x(track.times[i]!);
    const room = (i + 1 < end ? canvas.x(track.times[i + 1]!) : canvas.width) - x;
    const label = keyCap(track.text('label', i)).trim() || '␣';
    const width = Math.max(9, context.measureText(label).width + 6);
    context.fillStyle = accent;
    context.fillRect(x - 0.75, canvas.top + 4, 1.5, canvas.height - 8);
    if (width > room - 1) continue;
    context.fillStyle = accentSoft;
    context.beginPath();
    context.roundRect(x, canvas.top + 4, width, canvas.height - 8, [0, 3, 3, 0]);
    context.fill();
    context.fillStyle = text;
    context.fillText(label, x + 3, canvas.top + canvas.height / 2 + 0.5);
  }
}

/// A column's values as they are drawn; what is no number counts as 0.
function valuesOf(track: Track, value: (index: number) => number): Float32Array {
  return Float32Array.from({ length: track.count }, (_, i) => {
    const number = value(i);
    return Number.isFinite(number) ? number : 0;
  });
}

/// Without the few that would flatten everything else.
function usualGreatest(values: Float32Array): number {
  const step = Math.max(1, Math.floor(values.length / 20000));
  const some = Float32Array.from({ length: Math.ceil(values.length / step) }, (_, i) => values[i * step]!)
    .filter((value) => value > 0)
    .sort();
  return some.length > 0 ? some[Math.floor(some.length * 0.995)]! : 1;
}

function scrollLane(session: Session): NamelessLane | undefined {
  const track = filled(session, 'scrollAction');
  if (!track) return undefined;
  const distances = valuesOf(track, (i) => track.number('y', i) || track.number('x', i));
  const extremes = new Extremes(distances);
  const most = Math.max(usualGreatest(distances.map(Math.abs)), 1);
  return {
    title: 'Scroll',
    height: 24,
    draw: (canvas) => drawScroll(canvas, track.times, extremes, most),
    valueAt: (time) => {
      const index = track.at(time);
      if (index < 0 || time - track.times[index]! > 0.5) return '';
      const [x, y] = [track.number('x', index), track.number('y', index)];
      return [x && `${x > 0 ? '→' : '←'} ${Math.abs(x)} px`, y && `${y > 0 ? '↑' : '↓'} ${Math.abs(y)} px`]
        .filter(Boolean)
        .join('  ');
    },
  };
}

function drawScroll(canvas: LaneCanvas, times: Float64Array, extremes: Extremes, most: number): void {
  const {
    context,
    range,
    top,
    height,
    palette: { grid, third },
  } = canvas;
  const middle = top + height / 2;
  context.fillStyle = grid;
  context.fillRect(0, middle - 0.5, canvas.width, 1);
  context.fillStyle = third;
  let first = countBefore(times, range.from);
  for (let x = 0; x < canvas.width; x += 2) {
    const end = countBefore(times, canvas.time(x + 2));
    if (end > first) {
      const [least, greatest] = extremes
        .of(first, end)
        .map((value) => Math.sign(value) * Math.min(1, Math.abs(value) / most)) as [number, number];
      const up = (Math.max(0, greatest) * (height - 6)) / 2;
      const down = (Math.max(0, -least) * (height - 6)) / 2;
      context.fillRect(x, middle - up, 1.6, up + down);
    }
    first = end;
  }
}

function speedLane(session: Session): NamelessLane | undefined {
  if (!filled(session, 'cursorLocation')) return undefined;
  const { times, values } = session.speed;
  const curve = { times, extremes: session.speedExtremes, low: 0, high: usualGreatest(values), shape: Math.sqrt };
  return {
    title: 'Cursor speed',
    height: 30,
    draw: (canvas) => drawArea(canvas, curve, canvas.palette.accent, 0.28),
    valueAt: (time) => {
      const index = lastAt(times, time);
      return index >= 0 ? `${Math.round(values[index]!)} px/s` : '';
    },
  };
}

function curveOf(track: Track, values: Float32Array, low: number, high: number): Curve {
  return { times: track.times, extremes: new Extremes(values), low, high };
}

function trailLane(session: Session, { region }: LaneOptions): NamelessLane | undefined {
  const track = filled(session, 'cursorLocation');
  if (!track) return undefined;
  const [xs, ys] = [session.positionExtremes('x'), session.positionExtremes('y')];
  return {
    title: 'Cursor',
    legend: [
      { text: 'x', colour: 'accent' },
      { text: 'y', colour: 'second' },
    ],
    height: 32,
    draw: (canvas) => {
      const { x, y, width, height } = region();
      const { times } = track;
      drawLine(canvas, { times, extremes: xs, low: x, high: x + width }, canvas.palette.accent);
      drawLine(canvas, { times, extremes: ys, low: y + height, high: y }, canvas.palette.second);
    },
    valueAt: (time) => {
      const index = track.at(time);
      return index >= 0 ? `${track.number('x', index)}, ${track.number('y', index)}` : '';
    },
  };
}

/// The entries whose values are not those of the entry before.
function changesOf(track: Track, names: string[]): number[] {
  const columns = names.map((name) => track.values(name));
  const changes: number[] = [];
  for (let i = 0; i < track.count; ++i)
    if (i === 0 || columns.some((values) => values[i] !== values[i - 1])) changes.push(i);
  return changes;
}

/// Rectangles that stay the same are one.
function hoverLane(session: Session): NamelessLane | undefined {
  const track = filled(session, 'hoverRect');
  if (!track) return undefined;
  const firsts = changesOf(track, ['x', 'y', 'width', 'height']);
  const times = Float64Array.from(firsts, (index) => track.times[index]!);
  const textOf = (place: number) => (place >= 0 ? rectText(track, firsts[place]!) : '');
  return {
    title: 'Hover',
    height: 18,
    draw: (canvas) =>
      drawBands(
        canvas,
        times,
        (index) => ({
          start: times[index]!,
          end: times[index + 1] ?? session.duration,
          text: textOf(index),
          colour: index % 2 ? canvas.palette.line : canvas.palette.grid,
          edge: canvas.palette.edge,
        }),
        true,
      ),
    valueAt: (time) => textOf(lastAt(times, time)),
  };
}

function opacityLane(session: Session): NamelessLane | undefined {
  const track = filled(session, 'cursorOpacity');
  if (!track) return undefined;
  const curve = curveOf(
    track,
    valuesOf(track, (i) => track.number('opacity', i)),
    0,
    1,
  );
  return {
    title: 'Opacity',
    height: 20,
    draw: (canvas) => drawArea(canvas, curve, canvas.palette.third, 0.16),
    valueAt: (time) => `${Math.round(session.opacityAt(time) * 100)} %`,
  };
}

function cpuLane(session: Session): NamelessLane | undefined {
  const track = filled(session, 'cpuUsage');
  if (!track) return undefined;
  const values = valuesOf(track, (i) => track.number('cpuUsage', i));
  const greatest = values.reduce((most, value) => Math.max(most, value), 0);
  const high = greatest <= 1 ? 1 : Math.max(100, greatest); // a part of one, or percent
  const curve = curveOf(track, values, 0, high);
  return {
    title: 'CPU usage',
    height: 28,
    draw: (canvas) => drawArea(canvas, curve, canvas.palette.second, 0.22),
    valueAt: (time) => {
      const index = track.at(time);
      if (index < 0) return '';
      const percent = track.number('cpuUsage', index) * (high === 1 ? 100 : 1);
      return `${brief(Math.round(percent * 10) / 10)} %`;
    },
  };
}
