// Small pictures of cursors in the table.

import type { Appearance } from '../model/appearances';
import { CursorImages } from '../stage/cursors';
import { make } from '../ui/dom';

const side = 18; // pixels of the page

/// Draws the picture into the canvas, as large as it fits; nothing until it was decoded.
function draw(canvas: HTMLCanvasElement, picture: ImageBitmap | null | undefined): void {
  const ratio = window.devicePixelRatio || 1;
  canvas.width = canvas.height = Math.round(side * ratio);
  if (!picture) return;
  const scale = Math.min(1, side / Math.max(picture.width, picture.height)) * ratio;
  const [width, height] = [picture.width * scale, picture.height * scale];
  const context = canvas.getContext('2d');
  context?.drawImage(picture, (canvas.width - width) / 2, (canvas.height - height) / 2, width, height);
}

export class Thumbnails {
  private readonly images = new CursorImages();
  private readonly shown = new Map<HTMLCanvasElement, Appearance>();

  constructor() {
    this.images.onDecoded = () => {
      for (const [canvas, appearance] of this.shown) this.show(canvas, appearance);
    };
  }

  /// Puts a picture before the text of a cell that has none.
  place(cell: HTMLElement, appearance: Appearance | undefined): void {
    if (!appearance || appearance.image.length === 0) return;
    const canvas = make('canvas', { class: 'thumbnail', 'aria-hidden': 'true' });
    cell.prepend(canvas);
    this.shown.set(canvas, appearance);
    this.show(canvas, appearance);
  }

  remove(cell: HTMLElement): void {
    const canvas = cell.querySelector('canvas');
    if (!canvas) return;
    this.shown.delete(canvas);
    canvas.remove();
  }

  clear(): void {
    this.images.clear();
    this.shown.clear();
  }

  private show(canvas: HTMLCanvasElement, appearance: Appearance): void {
    const picture = this.images.image(appearance);
    canvas.classList.toggle('is-decoded', picture instanceof ImageBitmap);
    draw(canvas, picture);
  }
}
