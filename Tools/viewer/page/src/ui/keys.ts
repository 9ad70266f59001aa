// What keys do, wherever nobody is writing.

import { shuttleBack, shuttleOn, shuttleStop } from '../transport/shuttle';
import { editClock } from '../transport/clock';
import { layers } from '../stage/layers';
import { switchFullScreen } from './controls';
import { showHelp } from './dialogs';
import { announce } from './dom';
import type { Page } from './page';

export function setUpKeys(page: Page): void {
  const actions: Record<string, (event: KeyboardEvent) => void> = {
    ' ': () => page.player.toggle(),
    ArrowLeft: ({ shiftKey }) => page.step(shiftKey ? -10 : -1),
    ArrowRight: ({ shiftKey }) => page.step(shiftKey ? 10 : 1),
    ',': () => page.stepFrame(-1),
    '.': () => page.stepFrame(1),
    '[': () => page.stepMarker(-1),
    ']': () => page.stepMarker(1),
    Home: () => page.seek(0),
    End: () => page.seek(page.player.duration),
    '+': () => page.zoom(0.5),
    '=': () => page.zoom(0.5),
    '-': () => page.zoom(2),
    '0': () => page.zoom(0),
    '<': () => page.pan(-0.25),
    '>': () => page.pan(0.25),
    a: () => page.arrangeLanes(),
    b: () => page.writeNote(),
    '/': () => page.findEntries(),
    n: () => page.stepMatch(1),
    N: () => page.stepMatch(-1),
    j: () => shuttleBack(page.player),
    k: () => shuttleStop(page.player),
    l: () => shuttleOn(page.player),
    i: () => page.selection.setIn(page.player.time) || announce('Nothing comes after the playhead'),
    o: () => page.selection.setOut(page.player.time) || announce('Nothing comes before the playhead'),
    r: () => page.switchLoop(),
    s: () => page.switchSkipping(),
    g: () => editClock(page),
    z: () => page.zoomMovie(1.5),
    Z: () => page.zoomMovie(1 / 1.5),
    t: () => page.switchKeys(),
    Escape: () => page.selection.clear(),
    m: () => void (page.player.muted = !page.player.muted),
    f: () => void switchFullScreen(),
    '?': showHelp,
  };
  for (const { id, key } of layers) actions[key] = () => page.switchLayer(id);
  watchPointer();
  document.addEventListener('keydown', (event) => {
    const isTaken = event.ctrlKey || event.metaKey || event.altKey || event.defaultPrevented;
    const action = actions[event.key];
    if (!action || isTaken || usesKey(event) || (!page.session && event.key !== '?')) return;
    event.preventDefault();
    action(event);
  });
}

/// The button that was clicked last. It keeps the focus, but its reader has the hand on the mouse.
let clicked: EventTarget | null = null;

function watchPointer(): void {
  document.addEventListener('pointerdown', ({ target }) => {
    clicked = (target as Element).closest('button, summary, input');
  });
  document.addEventListener('focusin', ({ target }) => {
    if (target !== clicked) clicked = null;
  });
  document.addEventListener('keyup', (event) => {
    if (event.key === ' ' && clicked !== null && event.target === clicked) event.preventDefault(); // is no click
  });
}

/// Whether the element that has the keys does something with this one itself.
function usesKey({ target, key }: KeyboardEvent): boolean {
  const element = target as Element;
  if (element.closest('dialog[open]')) return true;
  if (element.matches('input[type="range"]')) return /^(Arrow|Home|End|Page)/.test(key);
  if (element.matches('input:not([type="checkbox"]), textarea, select')) return true;
  if (key === 'Escape' && element.closest('.table')) return true;
  return key === ' ' && element !== clicked && element.matches('button, input, summary');
}
