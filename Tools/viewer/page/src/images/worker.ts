// Decodes TIFF files away from the page: one that is made to take forever takes only this.

import { pixelsOfTIFF } from './tiff';

self.onmessage = ({ data }: MessageEvent<Uint8Array>) => {
  try {
    const pixels = pixelsOfTIFF(data);
    self.postMessage(pixels, { transfer: [pixels.data.buffer] });
  } catch (error) {
    self.postMessage(String(error));
  }
};
