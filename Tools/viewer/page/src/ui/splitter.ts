// Edges between panes that can be moved, with the pointer or arrow keys.

import { byId } from './dom';

interface Limits {
  least: number;
  most: () => number;
}

function setUpSplitter(
  id: string,
  property: string,
  isVertical: boolean,
  pane: Element,
  { least, most }: Limits,
): void {
  const splitter = byId(id);
  const sizeOf = () => pane.getBoundingClientRect()[isVertical ? 'width' : 'height'];
  const set = (size: number) => {
    const value = Math.round(Math.max(least, Math.min(size, most())));
    document.documentElement.style.setProperty(property, `${value}px`);
    tell();
  };
  const tell = () => {
    splitter.setAttribute('aria-valuemin', String(least));
    splitter.setAttribute('aria-valuemax', String(Math.round(most())));
    splitter.setAttribute('aria-valuenow', String(Math.round(sizeOf())));
    splitter.setAttribute('aria-valuetext', `${Math.round(sizeOf())} pixels`);
  };
  new ResizeObserver(tell).observe(splitter.parentElement!);
  new ResizeObserver(tell).observe(pane);
  let from = 0;
  let size = 0;
  const place = (event: PointerEvent) => (isVertical ? event.clientX : event.clientY);
  splitter.addEventListener('pointerdown', (event) => {
    splitter.setPointerCapture(event.pointerId);
    [from, size] = [place(event), sizeOf()];
  });
  splitter.addEventListener('pointermove', (event) => {
    if (splitter.hasPointerCapture(event.pointerId)) set(size + from - place(event));
  });
  splitter.addEventListener('dblclick', () => document.documentElement.style.removeProperty(property));
  splitter.addEventListener('keydown', (event) => {
    const [more, less] = isVertical ? ['ArrowLeft', 'ArrowRight'] : ['ArrowUp', 'ArrowDown'];
    if (event.key !== more && event.key !== less) return;
    set(sizeOf() + (event.key === more ? 24 : -24));
    event.preventDefault();
    event.stopPropagation();
  });
}

export function setUpSplitters(): void {
  const side = document.querySelector('.side')!;
  const lanes = byId('timeline');
  setUpSplitter('side-splitter', '--side-width', true, side, { least: 240, most: () => window.innerWidth * 0.6 });
  setUpSplitter('lanes-splitter', '--lanes-height', false, lanes, {
    least: 120,
    most: () => window.innerHeight * 0.7,
  });
}
