// A picture of the movie with everything over it, at the movie's own size.

import { keyCap, type CaptionPart } from '../model/keys';
import type { Size } from '../model/geometry';

const usual = 0.024; // the size of a caption's letters, of the picture's width
const edge = 0.05; // from the lower edge of the picture, of its height

/// As the page shows it below the middle, in pixels of the movie.
export function drawCaption(context: CanvasRenderingContext2D, parts: CaptionPart[], frame: Size, font: string): void {
  if (parts.length === 0) return;
  const size = Math.max(12, Math.min(34, frame.width * usual));
  context.font = `600 ${size}px ${font}`;
  context.textBaseline = 'middle';
  const pieces = parts.map(({ text, isTyped }) => {
    const shown = isTyped ? text : keyCap(text);
    return { shown, isTyped, width: context.measureText(shown).width + (isTyped ? 0 : 0.8 * size) };
  });
  const gap = 0.3 * size;
  const width = pieces.reduce((sum, piece) => sum + piece.width, gap * (pieces.length - 1));
  const height = 2 * size;
  let x = (frame.width - width) / 2;
  const y = frame.height * (1 - edge) - height;
  box(context, x - 0.7 * size, y, width + 1.4 * size, height, size / 2, 'rgb(16 18 24 / 84%)');
  for (const { shown, isTyped, width } of pieces) {
    if (!isTyped) box(context, x, y + 0.3 * size, width, height - 0.6 * size, size / 4, 'rgb(255 255 255 / 14%)');
    context.fillStyle = '#fff';
    context.fillText(shown, x + (isTyped ? 0 : 0.4 * size), y + height / 2);
    x += width + gap;
  }
}

function box(
  context: CanvasRenderingContext2D,
  x: number,
  y: number,
  width: number,
  height: number,
  radius: number,
  colour: string,
): void {
  context.fillStyle = colour;
  context.beginPath();
  context.roundRect(x, y, width, height, radius);
  context.fill();
}

/// Rejects if the browser does not let the page read the pictures of the movie.
export function pngOf(canvas: HTMLCanvasElement): Promise<Blob> {
  return new Promise((done, failed) => {
    canvas.toBlob((blob) => {
      if (blob) done(blob);
      else failed(new Error('the browser cannot make a picture of that size'));
    }, 'image/png');
  });
}
