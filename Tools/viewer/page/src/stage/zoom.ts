// Which part of the movie's picture fills the stage.

const most = 16;

export class StageZoom {
  /// How many times larger than the whole picture.
  scale = 1;
  /// The upper left corner, in parts of the picture.
  x = 0;
  y = 0;
  onChange: () => void = () => {};

  /// Zooms around a point of the stage, in parts of it. That point does not move.
  by(factor: number, x = 0.5, y = 0.5): void {
    const scale = Math.max(1, Math.min(this.scale * factor, most));
    const shift = 1 / this.scale - 1 / scale;
    this.scale = scale;
    this.moveTo(this.x + x * shift, this.y + y * shift);
  }

  reset(): void {
    this.scale = 1;
    this.moveTo(0, 0);
  }

  /// By parts of what is in sight.
  pan(x: number, y: number): void {
    this.moveTo(this.x + x / this.scale, this.y + y / this.scale);
  }

  get isZoomed(): boolean {
    return this.scale > 1;
  }

  private moveTo(x: number, y: number): void {
    const inside = (value: number) => Math.max(0, Math.min(value, 1 - 1 / this.scale));
    [this.x, this.y] = [inside(x), inside(y)];
    this.onChange();
  }
}
