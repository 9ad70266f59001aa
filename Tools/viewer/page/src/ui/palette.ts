// The style sheet's colours, for what is drawn on a canvas.

export interface Palette {
  text: string;
  muted: string;
  faint: string;
  line: string;
  grid: string;
  surface: string;
  accent: string;
  accentSoft: string;
  second: string;
  third: string;
  idle: string;
  bands: string[];
  bandEdges: string[];
  /// Tells what it outlines from the page.
  edge: string;
  bandText: string;
  font: string;
}

let current: Palette | undefined;

export function palette(): Palette {
  if (current) return current;
  const style = getComputedStyle(document.documentElement);
  const colour = (name: string) => style.getPropertyValue(`--${name}`).trim();
  return (current = {
    text: colour('text'),
    muted: colour('muted'),
    faint: colour('faint'),
    line: colour('line'),
    grid: colour('grid'),
    surface: colour('surface'),
    accent: colour('accent'),
    accentSoft: colour('accent-soft'),
    second: colour('second'),
    third: colour('third'),
    idle: colour('idle'),
    bands: [1, 2, 3, 4, 5, 6].map((number) => colour(`band-${number}`)),
    bandEdges: [1, 2, 3, 4, 5, 6].map((number) => colour(`band-edge-${number}`)),
    edge: colour('edge'),
    bandText: colour('band-text'),
    font: colour('font'),
  });
}

export function forgetPalette(): void {
  current = undefined;
}
