// How much room the page has for its text.

import { uiScale } from './scale';

const textSize = 16; // pixels, at a scale of 1
// Times the size of the text.
const widths = { 'is-compact': 68.7, 'is-narrow': 47.45, 'is-close': 34, 'is-slim': 30, 'is-tiny': 16 };
const heights = { 'is-low': 26, 'is-flat': 17 };

function tell(): void {
  const { classList } = document.documentElement;
  const unit = textSize * uiScale();
  for (const [name, limit] of Object.entries(widths)) classList.toggle(name, innerWidth < limit * unit);
  for (const [name, limit] of Object.entries(heights)) classList.toggle(name, innerHeight < limit * unit);
}

/// Keeps the classes of the document true when the window or the size of the text changes.
export function setUpRoom(): void {
  addEventListener('resize', tell);
  new ResizeObserver(tell).observe(document.querySelector('.brand-mark')!); // is as large as the text
  tell();
}
