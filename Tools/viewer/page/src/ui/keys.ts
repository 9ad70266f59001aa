// What keys do, wherever nobody is writing.

import type { App } from '../app';
import { layers } from '../stage/layers';
import { switchFullScreen } from './controls';

export function setUpKeys(app: App): void {
  const actions: Record<string, (event: KeyboardEvent) => void> = {
    ' ': () => app.player.toggle(),
    ArrowLeft: ({ shiftKey }) => app.step(shiftKey ? -10 : -1),
    ArrowRight: ({ shiftKey }) => app.step(shiftKey ? 10 : 1),
    ',': () => app.stepFrame(-1),
    '.': () => app.stepFrame(1),
    '[': () => app.stepMarker(-1),
    ']': () => app.stepMarker(1),
    Home: () => app.seek(0),
    End: () => app.seek(app.player.duration),
    '+': () => app.zoom(0.5),
    '=': () => app.zoom(0.5),
    '-': () => app.zoom(2),
    '0': () => app.zoom(0),
    '/': () => app.findEntries(),
    n: () => app.stepMatch(1),
    N: () => app.stepMatch(-1),
    k: () => app.switchKeys(),
    m: () => void (app.player.muted = !app.player.muted),
    f: () => void switchFullScreen(),
    '?': () => app.help(),
  };
  for (const { id, key } of layers) actions[key] = () => app.switchLayer(id);
  document.addEventListener('keydown', (event) => {
    const isTaken = event.ctrlKey || event.metaKey || event.altKey || event.defaultPrevented;
    const action = actions[event.key];
    if (!action || isTaken || usesKey(event) || (!app.session && event.key !== '?')) return;
    event.preventDefault();
    action(event);
  });
}

/// Whether the element that has the keys does something with this one itself.
function usesKey({ target, key }: KeyboardEvent): boolean {
  const element = target as Element;
  if (element.closest('dialog[open]')) return true;
  if (element.matches('input:not([type="checkbox"]), textarea, select')) return true;
  return key === ' ' && element.matches('button, input, summary');
}
