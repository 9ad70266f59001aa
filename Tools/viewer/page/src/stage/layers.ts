// What is drawn over the movie, each layer on its own, in pixels of the movie.

import { clickLabel, clicksAround, type Click } from '../model/clicks';
import {
  cursorImageRect,
  pixelsPerUnit,
  rectToVideo,
  screenToVideo,
  type Placement,
  type Point,
  type Rect,
} from '../model/geometry';
import { heatHeight, heatWidth } from '../model/heat';
import { countUntil } from '../model/search';
import { rectAt, type Session } from '../model/session';
import type { InsightTables } from '../insights/tables';
import type { CursorImages } from './cursors';

export interface Layer {
  id: LayerId;
  name: string;
  /// The key that switches it.
  key: string;
  isOn: boolean;
}

export type LayerId = 'cursor' | 'trail' | 'clicks' | 'captions' | 'hover' | 'window' | 'heat' | 'zooms' | 'groups' | 'path';

export const layers: Layer[] = [
  { id: 'cursor', name: 'Cursor', key: '1', isOn: true },
  { id: 'clicks', name: 'Clicks', key: '2', isOn: true },
  { id: 'captions', name: 'Keys', key: '3', isOn: true },
  { id: 'trail', name: 'Trail', key: '4', isOn: true },
  { id: 'window', name: 'Window on top', key: '5', isOn: true },
  { id: 'hover', name: 'Hover rectangle', key: '6', isOn: false },
  { id: 'heat', name: 'Heat map', key: '7', isOn: false },
  { id: 'zooms', name: 'Suggested zoom', key: '8', isOn: false },
  { id: 'groups', name: 'Groups of clicks', key: '9', isOn: false },
  { id: 'path', name: 'Smooth path', key: 'p', isOn: false },
];

export interface Scene {
  session: Session;
  placement: Placement;
  time: number;
  /// Pixels of the movie to a pixel of the page.
  unit: number;
  images: CursorImages;
  insights: InsightTables;
  clickStarts: Float64Array;
  accent: string;
  font: string;
  isStill: boolean;
}

type Context = CanvasRenderingContext2D;

const shade = 'rgb(0 0 0 / 55%)';

export function drawHeat(context: Context, { placement }: Scene, picture: CanvasImageSource): void {
  context.imageSmoothingEnabled = true;
  context.drawImage(picture, 0, 0, heatWidth, heatHeight, 0, 0, placement.frame.width, placement.frame.height);
}

export function drawWindow(context: Context, scene: Scene): void {
  const track = scene.session.track('topmostWindow');
  const index = track?.at(scene.time) ?? -1;
  if (index < 0) return;
  const rect = rectToVideo(rectAt(track!, index), scene.placement);
  outline(context, scene, rect, 1.5, []);
  const title = [textAt(scene, 'topmostAppName', 'name'), textAt(scene, 'topmostWindowTitle', 'title')];
  tag(context, scene, rect, title.filter(Boolean).join(' — '));
}

function textAt({ session, time }: Scene, kind: string, column: string): string {
  const track = session.track(kind);
  const index = track?.at(time) ?? -1;
  return index >= 0 ? track!.text(column, index) : '';
}

function outline(context: Context, { accent, unit }: Scene, rect: Rect, width: number, dash: number[]): void {
  context.setLineDash(dash.map((length) => length * unit));
  for (const [colour, extra] of [
    [shade, 1.5],
    [accent, 0],
  ] as const) {
    context.strokeStyle = colour;
    context.lineWidth = (width + extra) * unit;
    context.strokeRect(rect.x, rect.y, rect.width, rect.height);
  }
  context.setLineDash([]);
}

/// A name on the upper edge of a rectangle, kept inside the picture.
export function tag(context: Context, { unit, accent, font, placement }: Scene, rect: Rect, text: string): void {
  if (!text) return;
  const size = 11 * unit;
  context.font = `600 ${size}px ${font}`;
  context.textBaseline = 'middle';
  const room = Math.max(0, Math.min(rect.width, placement.frame.width) - 24 * unit);
  const shown = shortened(context, text, room);
  if (!shown) return;
  const width = context.measureText(shown).width + 14 * unit;
  const height = 20 * unit;
  const x = Math.max(0, Math.min(rect.x, placement.frame.width - width));
  const y = rect.y >= height ? rect.y - height : Math.max(0, rect.y);
  context.fillStyle = accent;
  context.beginPath();
  context.roundRect(x, y, width, height, rect.y >= height ? [4 * unit, 4 * unit, 0, 0] : [0, 0, 4 * unit, 0]);
  context.fill();
  context.fillStyle = '#fff';
  context.fillText(shown, x + 7 * unit, y + height / 2 + 0.5 * unit);
}

export function shortened(context: Context, text: string, room: number): string {
  if (context.measureText(text).width <= room) return text;
  let [low, high] = [0, text.length];
  while (low < high) {
    const middle = (low + high + 1) >> 1;
    if (context.measureText(text.slice(0, middle) + '…').width <= room) low = middle;
    else high = middle - 1;
  }
  return low > 0 ? text.slice(0, low).trimEnd() + '…' : '';
}

export function drawHover(context: Context, scene: Scene): void {
  const track = scene.session.track('hoverRect');
  const index = track?.at(scene.time) ?? -1;
  if (index < 0) return;
  const rect = rectToVideo(rectAt(track!, index), scene.placement);
  context.globalAlpha = 0.12;
  context.fillStyle = scene.accent;
  context.fillRect(rect.x, rect.y, rect.width, rect.height);
  context.globalAlpha = 1;
  outline(context, scene, rect, 1, [4, 3]);
}

const trailLength = 1.2; // seconds
const trailSteps = 72;

export function drawTrail(context: Context, scene: Scene): void {
  const track = scene.session.track('cursorLocation');
  const last = track?.at(scene.time) ?? -1;
  if (!track || last < 1) return;
  const first = Math.max(0, countUntil(track.times, scene.time - trailLength) - 1);
  const step = Math.max(1, Math.ceil((last - first) / trailSteps));
  context.lineCap = 'round';
  context.strokeStyle = scene.accent;
  let before = placeOf(scene, track.number('x', first), track.number('y', first));
  for (let i = first + step; i <= last; i += step) {
    const next = placeOf(scene, track.number('x', i), track.number('y', i));
    const age = (scene.time - track.times[i]!) / trailLength;
    context.globalAlpha = 0.75 * Math.max(0, 1 - age);
    context.lineWidth = (1 + 3 * Math.max(0, 1 - age)) * scene.unit;
    context.beginPath();
    context.moveTo(before.x, before.y);
    context.lineTo(next.x, next.y);
    context.stroke();
    before = next;
  }
  context.globalAlpha = 1;
}

function placeOf({ placement }: Scene, x: number, y: number): Point {
  return screenToVideo({ x, y }, placement);
}

const rippleLength = 0.6; // seconds

export function drawClicks(context: Context, scene: Scene): void {
  for (const click of clicksAround(scene.session.clicks, scene.clickStarts, scene.time, rippleLength)) {
    const isHeld = scene.time < click.end;
    const position = scene.session.cursorAt(isHeld ? scene.time : click.start);
    if (position) drawRipple(context, scene, click, screenToVideo(position, scene.placement), isHeld);
  }
}

function drawRipple(context: Context, scene: Scene, click: Click, centre: Point, isHeld: boolean): void {
  const { unit, accent } = scene;
  const age = scene.isStill ? 0.4 : Math.min(1, (scene.time - click.start) / rippleLength);
  const eased = 1 - (1 - age) ** 3;
  if (isHeld) disc(context, centre, 13 * unit, accent, 0.32);
  ring(context, centre, (9 + 21 * eased) * unit, (1 - age) * 3 * unit + 0.5 * unit, accent, isHeld ? 1 : 1 - age);
  if (click.button === 'left' && click.modifiers.length === 0) return;
  context.globalAlpha = isHeld ? 1 : 1 - age * age;
  chip(context, scene, clickLabel(click), centre);
  context.globalAlpha = 1;
}

function disc(context: Context, centre: Point, radius: number, colour: string, alpha: number): void {
  context.globalAlpha = alpha;
  context.fillStyle = colour;
  context.beginPath();
  context.arc(centre.x, centre.y, radius, 0, 2 * Math.PI);
  context.fill();
  context.globalAlpha = 1;
}

function ring(context: Context, centre: Point, radius: number, width: number, colour: string, alpha: number): void {
  context.globalAlpha = Math.max(0, alpha);
  for (const [style, extra] of [
    [shade, 1.6],
    [colour, 1],
  ] as const) {
    context.strokeStyle = style;
    context.lineWidth = width * extra;
    context.beginPath();
    context.arc(centre.x, centre.y, radius, 0, 2 * Math.PI);
    context.stroke();
  }
  context.globalAlpha = 1;
}

const usualCursor = 32; // units of the screen from the hot spot to the right edge

function chip(context: Context, { unit, font, placement }: Scene, text: string, centre: Point): void {
  context.font = `600 ${11 * unit}px ${font}`;
  context.textBaseline = 'middle';
  const width = context.measureText(text).width + 12 * unit;
  const height = 19 * unit;
  const besideCursor = Math.max(20 * unit, usualCursor * pixelsPerUnit(placement).x);
  const x = Math.max(0, Math.min(centre.x + besideCursor, placement.frame.width - width));
  const y = Math.max(0, Math.min(centre.y + 18 * unit, placement.frame.height - height));
  context.fillStyle = 'rgb(16 18 24 / 85%)';
  context.beginPath();
  context.roundRect(x, y, width, height, height / 2);
  context.fill();
  context.fillStyle = '#fff';
  context.fillText(text, x + 6 * unit, y + height / 2 + 0.5 * unit);
}

export function drawCursor(context: Context, scene: Scene): void {
  const { session, time, images, placement } = scene;
  const position = session.cursorAt(time);
  if (!position) return;
  const appearance = session.appearances[session.track('cursorImage')?.at(time) ?? -1];
  const image = appearance ? images.image(appearance) : null;
  context.globalAlpha = session.opacityAt(time);
  if (image) {
    const rect = cursorImageRect(position, appearance!.hotSpot, image, placement);
    context.imageSmoothingQuality = 'high';
    context.drawImage(image, rect.x, rect.y, rect.width, rect.height);
  } else if (image === null) drawArrow(context, scene, screenToVideo(position, placement));
  context.globalAlpha = 1;
}

const arrow: [number, number][] = [
  [0, 0],
  [0, 17],
  [4, 13.4],
  [6.6, 19.4],
  [9.2, 18.3],
  [6.7, 12.5],
  [12, 12.2],
];

/// Stands for a cursor whose image is not known.
function drawArrow(context: Context, { placement }: Scene, tip: Point): void {
  const scale = pixelsPerUnit(placement);
  context.beginPath();
  for (const [x, y] of arrow) context.lineTo(tip.x + x * scale.x, tip.y + y * scale.y);
  context.closePath();
  context.fillStyle = '#000';
  context.strokeStyle = '#fff';
  context.lineWidth = 1.2 * scale.x;
  context.lineJoin = 'round';
  context.fill();
  context.stroke();
}
