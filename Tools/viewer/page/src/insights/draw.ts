// Layers of what the library suggests: zooms, groups of clicks, and a smoothed path of the cursor.

import { rectToVideo, screenToVideo, type Point } from '../model/geometry';
import { countBefore } from '../model/search';
import { rectAt } from '../model/session';
import type { Track } from '../model/track';
import type { Click } from '../model/clicks';
import { tag, type Scene } from '../stage/layers';

type Context = CanvasRenderingContext2D;

const zoomColour = '#ffb020';
const groupColour = '#e0569b';
const pathColour = '#2fbf9b';
const shade = 'rgb(0 0 0 / 55%)';

/// What the camera would show at the time. Everything around it is darker.
export function drawZoom(context: Context, scene: Scene): void {
  const camera = scene.insights.track('camera');
  const index = camera?.at(scene.time) ?? -1;
  const zoom = index >= 0 ? camera!.number('zoom', index) : 1;
  if (!(zoom > 1.001)) return;
  const { frame } = scene.placement;
  const rect = rectToVideo(rectAt(camera!, index), scene.placement);
  context.beginPath();
  context.rect(0, 0, frame.width, frame.height);
  context.rect(rect.x, rect.y, rect.width, rect.height);
  context.fillStyle = 'rgb(0 0 0 / 35%)';
  context.fill('evenodd');
  for (const [colour, width] of [
    [shade, 3.5],
    [zoomColour, 2],
  ] as const) {
    context.strokeStyle = colour;
    context.lineWidth = width * scene.unit;
    context.strokeRect(rect.x, rect.y, rect.width, rect.height);
  }
  const edge = { ...rect, y: rect.y + rect.height }; // the upper one is the window's
  tag(context, { ...scene, accent: '#8a5a00' }, edge, `Zoom ${zoom.toFixed(2)}×`);
}

/// The clicks for which one place of a zoom was made, in their order.
export function clicksOfGroup(zooms: Track, clicks: Click[], starts: Float64Array, time: number): Click[] {
  const index = zooms.at(time);
  if (index < 0 || zooms.number('is_typing', index) === 1) return [];
  const next = index + 1;
  const isSameZoom = next < zooms.count && zooms.number('zoom_start', next) === zooms.number('zoom_start', index);
  const end = isSameZoom ? zooms.times[next]! : zooms.number('zoom_end', index);
  if (!(time < end)) return [];
  return clicks.slice(countBefore(starts, zooms.times[index]!), countBefore(starts, end));
}

export function drawGroup(context: Context, scene: Scene): void {
  const zooms = scene.insights.track('zooms');
  if (!zooms) return;
  const group = clicksOfGroup(zooms, scene.session.clicks, scene.clickStarts, scene.time);
  const places = group.map(({ x, y }) => screenToVideo({ x, y }, scene.placement)).filter(({ x, y }) => isFinite(x + y));
  line(context, scene, places, groupColour, 2);
  places.forEach((place, i) => drawNumber(context, scene, place, i + 1));
}

function drawNumber(context: Context, { unit, font }: Scene, { x, y }: Point, number: number): void {
  const radius = 10 * unit;
  context.beginPath();
  context.arc(x, y, radius, 0, 2 * Math.PI);
  context.fillStyle = '#8f1d57';
  context.fill();
  context.strokeStyle = '#fff';
  context.lineWidth = 1.5 * unit;
  context.stroke();
  context.font = `600 ${11 * unit}px ${font}`;
  context.textBaseline = 'middle';
  context.textAlign = 'center';
  context.fillStyle = '#fff';
  context.fillText(String(number), x, y + 0.5 * unit);
  context.textAlign = 'start';
}

const before = 1.2; // seconds of the path that are drawn
const after = 0.8;

export function drawPath(context: Context, scene: Scene): void {
  const path = scene.insights.track('cursor_path');
  if (!path || path.count === 0) return;
  const placeAt = (i: number) => screenToVideo({ x: path.number('x', i), y: path.number('y', i) }, scene.placement);
  const first = countBefore(path.times, scene.time - before);
  const end = countBefore(path.times, scene.time + after);
  line(context, scene, Array.from({ length: Math.max(0, end - first) }, (_, i) => placeAt(first + i)), pathColour, 2.5);
  const here = placeAt(Math.max(0, path.at(scene.time)));
  context.beginPath();
  context.arc(here.x, here.y, 5 * scene.unit, 0, 2 * Math.PI);
  context.fillStyle = pathColour;
  context.strokeStyle = shade;
  context.lineWidth = scene.unit;
  context.fill();
  context.stroke();
}

function line(context: Context, { unit }: Scene, places: Point[], colour: string, width: number): void {
  context.lineJoin = context.lineCap = 'round';
  context.beginPath();
  for (const { x, y } of places) context.lineTo(x, y);
  for (const [style, extra] of [
    [shade, 1.5],
    [colour, 0],
  ] as const) {
    context.strokeStyle = style;
    context.lineWidth = (width + extra) * unit;
    context.stroke();
  }
}
