// Icons of 20 by 20, in the colour of their text.

const paths: Record<string, string> = {
  open: '<path d="M2.5 5.5v10h13l2-7.5h-12l-2 6M2.5 8V4.5h5l1.5 2h6V8"/>',
  theme: '<circle cx="10" cy="10" r="6.5"/><path d="M10 3.5a6.5 6.5 0 0 1 0 13z" fill="currentColor"/>',
  help: '<path d="M7.3 7.6a2.7 2.7 0 1 1 4.1 2.3c-.9.6-1.4 1-1.4 2.1"/><circle cx="10" cy="14.6" r=".5" fill="currentColor"/><circle cx="10" cy="10" r="7.5"/>',
  about: '<circle cx="10" cy="10" r="7.5"/><path d="M10 9v5"/><circle cx="10" cy="6.3" r=".5" fill="currentColor"/>',
  close: '<path d="m5 5 10 10M15 5 5 15"/>',
  play: '<path d="M6.5 4.2v11.6L16 10z" fill="currentColor"/>',
  pause: '<path d="M6 4.5h2.6v11H6zM11.4 4.5H14v11h-2.6z" fill="currentColor"/>',
  frameBack: '<path d="M13 5 7.5 10l5.500 5z" fill="currentColor"/><path d="M5.500 5v10"/>',
  frameForward: '<path d="m7 5 5.500 5L7 15z" fill="currentColor"/><path d="M14.500 5v10"/>',
  markerBack: '<path d="m10 5-5 5 5 5M16 5l-5 5 5 5"/>',
  markerForward: '<path d="m10 5 5 5-5 5M4 5l5 5-5 5"/>',
  sound:
    '<path d="M3 8v4h2.800L10 15.500v-11L5.800 8zM13 7.500a3.500 3.500 0 0 1 0 5M15.200 5.300a6.600 6.600 0 0 1 0 9.400"/>',
  soundOff: '<path d="M3 8v4h2.800L10 15.500v-11L5.800 8zM13.200 8l4 4M17.200 8l-4 4"/>',
  masked:
    '<path d="M3 3.500 17 16.500M8.300 5.200A7.800 7.800 0 0 1 17.500 10a9 9 0 0 1-2.100 2.900M5.300 6.600A9 9 0 0 0 2.500 10a7.900 7.900 0 0 0 10 4.500"/>',
  shown: '<path d="M2.500 10a8 8 0 0 1 15 0 8 8 0 0 1-15 0z"/><circle cx="10" cy="10" r="2.400"/>',
  layers: '<path d="m10 3 7.500 4L10 11 2.500 7zM2.500 10.300l7.500 4 7.500-4M2.500 13.300l7.500 4 7.500-4"/>',
  fullScreen: '<path d="M3.500 7.500v-4h4M12.500 3.500h4v4M16.500 12.500v4h-4M7.500 16.500h-4v-4"/>',
  search: '<circle cx="9" cy="9" r="5"/><path d="m13 13 4 4"/>',
  up: '<path d="m5 12 5-5 5 5"/>',
  down: '<path d="m5 8 5 5 5-5"/>',
  copy: '<path d="M7 7V3.500h9.500V13H13M3.500 7H13v9.500H3.500z"/>',
  save: '<path d="M10 3v9M6 8.500l4 4 4-4M3.500 16.500h13"/>',
  fit: '<path d="M3 6v8M17 6v8M6 10h8M6 10l2-2M6 10l2 2M14 10l-2-2M14 10l-2 2"/>',
  plus: '<path d="M10 4.500v11M4.500 10h11"/>',
  minus: '<path d="M4.500 10h11"/>',
  pin: '<path d="M7 3h6l-1 5 3 3H5l3-3zM10 11v6"/>',
  lanes: '<path d="M3 5h14M3 10h9M3 15h12"/>',
  more: '<circle cx="4.500" cy="10" r="1.200" fill="currentColor"/><circle cx="10" cy="10" r="1.200" fill="currentColor"/><circle cx="15.500" cy="10" r="1.200" fill="currentColor"/>',
  loop: '<path d="M5 12.500H4a2 2 0 0 1-2-2V8.500a3 3 0 0 1 3-3h9M11.500 3l2.500 2.500L11.500 8M15 7.500h1a2 2 0 0 1 2 2v2a3 3 0 0 1-3 3H6M8.500 17 6 14.500 8.500 12"/>',
  heat: '<path d="M10 2.500c1 3 4.500 4.500 4.500 9a4.500 4.500 0 0 1-9 0c0-2 1-3 1.800-4 .4 1.300 1 2 1.700 2.200C9 7.500 9 4.500 10 2.500z"/>',
  link: '<path d="M8.500 11.500a3 3 0 0 0 4.300 0l3-3a3 3 0 0 0-4.300-4.300l-1 1M11.500 8.500a3 3 0 0 0-4.300 0l-3 3a3 3 0 0 0 4.300 4.300l1-1"/>',
  good: '<circle cx="10" cy="10" r="7.500"/><path d="m6.500 10.200 2.400 2.400 4.600-5"/>',
  bad: '<path d="M10 3 18 16.500H2z"/><path d="M10 8v4"/><circle cx="10" cy="14.300" r=".5" fill="currentColor"/>',
};

const names = new Map<Element, string>();

export function setIcon(element: Element, name: string): void {
  if (names.get(element) === name) return;
  names.set(element, name);
  element.querySelector(':scope > svg')?.remove();
  const holder = document.createElement('template');
  holder.innerHTML = `<svg viewBox="0 0 20 20" aria-hidden="true">${paths[name] ?? ''}</svg>`;
  element.prepend(holder.content);
}

export function placeIcons(): void {
  for (const element of document.querySelectorAll('[data-icon]')) setIcon(element, element.getAttribute('data-icon')!);
}
