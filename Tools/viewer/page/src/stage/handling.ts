// The pointer and the keys on the stage: a click plays, and a picture that is zoomed can be moved.

import { announce, byId, setText } from '../ui/dom';
import type { Page } from '../ui/page';
import type { StageZoom } from './zoom';

const slop = 4; // pixels that a hand may tremble
const step = 0.1; // of what is in sight, by a key

export function setUpStage(page: Page): void {
  const { zoom } = page.stage;
  const stage = byId('stage');
  const chip = byId('stage-zoom');
  chip.addEventListener('click', () => zoom.reset());
  zoom.onChange = () => {
    chip.hidden = !zoom.isZoomed;
    setText(chip, `${Math.round(zoom.scale * 100)} %`);
    stage.classList.toggle('is-zoomed', zoom.isZoomed);
    stage.tabIndex = zoom.isZoomed ? 0 : -1;
    page.stage.lay();
  };
  stage.addEventListener('wheel', (event) => zoomByWheel(event, zoom), { passive: false });
  stage.addEventListener('keydown', (event) => panByKey(event, zoom));
  setUpDragging(page, zoom);
}

export function zoomStage(zoom: StageZoom, factor: number): void {
  if (factor === 0) zoom.reset();
  else zoom.by(factor);
  announce(`Movie at ${Math.round(zoom.scale * 100)} percent`);
}

function zoomByWheel(event: WheelEvent, zoom: StageZoom): void {
  if (!event.ctrlKey && !event.metaKey) return;
  event.preventDefault();
  const box = byId('frame').getBoundingClientRect();
  const part = (value: number, size: number) => Math.max(0, Math.min(value / Math.max(1, size), 1));
  const lines = event.deltaMode === WheelEvent.DOM_DELTA_LINE ? 16 : 1;
  const strength = Math.abs(event.deltaY) < 40 ? 0.01 : 0.0022; // fingers on a trackpad, or a notch
  zoom.by(
    Math.exp(-event.deltaY * lines * strength),
    part(event.clientX - box.left, box.width),
    part(event.clientY - box.top, box.height),
  );
}

function panByKey(event: KeyboardEvent, zoom: StageZoom): void {
  const ways: Record<string, [number, number]> = {
    ArrowLeft: [-step, 0],
    ArrowRight: [step, 0],
    ArrowUp: [0, -step],
    ArrowDown: [0, step],
  };
  const way = ways[event.key];
  if (!way || !zoom.isZoomed || event.target !== event.currentTarget || event.shiftKey) return;
  event.preventDefault();
  zoom.pan(...way);
}

function setUpDragging(page: Page, zoom: StageZoom): void {
  const frame = byId('frame');
  let [x, y, way] = [0, 0, 0];
  frame.addEventListener('pointerdown', (event) => {
    if (event.button !== 0) return;
    [x, y, way] = [event.clientX, event.clientY, 0];
    if (zoom.isZoomed) frame.setPointerCapture(event.pointerId);
  });
  frame.addEventListener('pointermove', (event) => {
    if (!frame.hasPointerCapture(event.pointerId)) return;
    const box = frame.getBoundingClientRect();
    const [right, down] = [event.clientX - x, event.clientY - y];
    way += Math.abs(right) + Math.abs(down);
    [x, y] = [event.clientX, event.clientY];
    zoom.pan(-right / Math.max(1, box.width), -down / Math.max(1, box.height));
  });
  frame.addEventListener('click', () => {
    if (way <= slop) page.player.toggle();
    way = 0;
  });
}
