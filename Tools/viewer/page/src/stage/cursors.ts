// Cursor images, decoded when they are needed.

import { bitmapOf } from '../images/client';
import type { Appearance } from '../model/appearances';

const atOnce = 8;

export class CursorImages {
  private readonly images = new Map<Uint8Array, ImageBitmap | 'decoding' | 'failed'>();
  private recording = 0;
  onDecoded: () => void = () => {};

  /// Returns undefined while the image is being decoded, and null if there is none that a browser can show.
  image({ image }: Appearance): ImageBitmap | null | undefined {
    if (image.length === 0) return null;
    const known = this.images.get(image);
    if (known === undefined) this.decode(image);
    return known instanceof ImageBitmap ? known : known === 'failed' ? null : undefined;
  }

  /// So that they are there when they are needed.
  async prepare(appearances: Appearance[]): Promise<void> {
    const images = [...new Set(appearances.map(({ image }) => image))].filter(({ length }) => length > 0);
    const { recording } = this;
    for (let i = 0; i < Math.min(images.length, 512) && recording === this.recording; i += atOnce)
      await Promise.all(images.slice(i, i + atOnce).map((image) => this.images.has(image) || this.decode(image)));
  }

  clear(): void {
    for (const image of this.images.values()) if (image instanceof ImageBitmap) image.close();
    this.images.clear();
    ++this.recording;
  }

  private async decode(bytes: Uint8Array): Promise<void> {
    const { recording } = this;
    this.images.set(bytes, 'decoding');
    const image = await bitmapOf(bytes).catch(() => 'failed' as const);
    if (recording === this.recording) {
      this.images.set(bytes, image);
      this.onDecoded();
    } else if (image instanceof ImageBitmap) {
      image.close();
    }
  }
}
