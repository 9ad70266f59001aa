// The movie, and what was recorded drawn over it.

import { fitted, placementOf, type Placement } from '../model/geometry';
import { heatHeight, heatOf, heatWidth } from '../model/heat';
import { captionAt, captionText, keyCap, type CaptionPart } from '../model/keys';
import type { Session } from '../model/session';
import { byId, fitCanvas, make } from '../ui/dom';
import { palette } from '../ui/palette';
import { uiScale } from '../ui/scale';
import { drawGroup, drawPath, drawZoom } from '../insights/draw';
import type { InsightTables } from '../insights/tables';
import { CursorImages } from './cursors';
import {
  drawClicks,
  drawCursor,
  drawHeat,
  drawHover,
  drawTrail,
  drawWindow,
  layers,
  type LayerId,
  type Scene,
} from './layers';
import type { Player } from './player';
import { drawCaption, pngOf } from './still';
import { StageZoom } from './zoom';

const reducedMotion = matchMedia('(prefers-reduced-motion: reduce)');

export class Stage {
  readonly images = new CursorImages();
  readonly zoom = new StageZoom();
  placement: Placement = placementOf(undefined, 1, undefined);
  showsKeys = false;
  /// Called when something that was missing can be drawn.
  onReady: () => void = () => {};
  private session: Session | undefined;
  private clickStarts = new Float64Array();
  private shownCaption = '';
  /// The heat map that was asked for last, and the one that is there.
  private askedHeat = '';
  private heat: HTMLCanvasElement | undefined;
  private heatRange = { from: 0, to: 0 };
  private width = 0;
  private laidFor = '';
  private readonly element = byId('stage');
  private readonly frame = byId('frame');
  private readonly picture = byId<HTMLCanvasElement>('picture');
  private readonly canvas = byId<HTMLCanvasElement>('overlay');
  private readonly caption = byId('caption');

  constructor(
    private readonly player: Player,
    private readonly insights: InsightTables,
  ) {
    new ResizeObserver(() => this.lay()).observe(this.element);
  }

  show(session: Session): void {
    this.session = session;
    this.clickStarts = Float64Array.from(session.clicks, ({ start }) => start);
    [this.askedHeat, this.heat] = ['', undefined];
    this.images.clear();
    this.lay();
  }

  /// Called when the movie may have changed.
  fit(): void {
    const { movie, size } = this.player;
    if (`${movie} ${size?.width} ${size?.height}` === this.laidFor) this.drawPicture();
    else this.lay();
  }

  /// Gives the frame the shape of the movie, or of the recorded region where there is none.
  lay(): void {
    if (!this.session) return;
    const { movie, size } = this.player;
    this.laidFor = `${movie} ${size?.width} ${size?.height}`;
    this.placement = placementOf(this.session.region, this.session.scaleFactor, size);
    const place = fitted(this.placement.frame, {
      width: this.element.clientWidth,
      height: this.element.clientHeight,
    });
    Object.assign(this.frame.style, {
      left: `${place.x}px`,
      top: `${place.y}px`,
      width: `${place.width}px`,
      height: `${place.height}px`,
    });
    this.width = place.width;
    this.frame.classList.toggle('has-movie', movie === 'ready');
    const { scale, x, y } = this.zoom;
    this.player.video.style.transform = scale > 1 ? `scale(${scale}) translate(${-100 * x}%, ${-100 * y}%)` : '';
    fitCanvas(this.picture, place.width, place.height);
    fitCanvas(this.canvas, place.width, place.height);
    this.drawPicture();
    this.shownCaption = '';
    this.draw(this.player.time);
  }

  /// Draws the movie's picture onto a canvas: the browser shows both canvases at once, but the movie itself when it likes.
  drawPicture(): void {
    const { video, movie } = this.player;
    if (movie !== 'ready' || !('requestVideoFrameCallback' in video)) return void (this.picture.hidden = true);
    if (video.readyState < HTMLMediaElement.HAVE_CURRENT_DATA) return; // the picture before stays
    this.picture.hidden = false;
    const { scale, x, y } = this.zoom;
    const { videoWidth, videoHeight } = video;
    this.picture
      .getContext('2d', { alpha: false })
      ?.drawImage(
        video,
        x * videoWidth,
        y * videoHeight,
        videoWidth / scale,
        videoHeight / scale,
        0,
        0,
        this.picture.width,
        this.picture.height,
      );
  }

  /// The heat map tells of this range of time.
  setHeatRange(from: number, to: number): void {
    this.heatRange = { from, to };
  }

  draw(time: number): void {
    const { session, canvas } = this;
    const context = canvas.getContext('2d');
    if (!session || !context || this.width <= 0) return;
    const { frame } = this.placement;
    context.setTransform(1, 0, 0, 1, 0, 0);
    context.clearRect(0, 0, canvas.width, canvas.height);
    const { scale, x, y } = this.zoom;
    const [across, down] = [(scale * canvas.width) / frame.width, (scale * canvas.height) / frame.height];
    context.setTransform(across, 0, 0, down, -x * scale * canvas.width, -y * scale * canvas.height);
    this.drawLayers(context, this.sceneAt(session, time, (frame.width / this.width / scale) * uiScale()));
    this.showCaption(time);
  }

  private sceneAt(session: Session, time: number, unit: number): Scene {
    return {
      session,
      placement: this.placement,
      time,
      unit,
      images: this.images,
      insights: this.insights,
      clickStarts: this.clickStarts,
      accent: '#3d7bff',
      font: palette().font,
      isStill: reducedMotion.matches,
    };
  }

  /// The movie's picture and everything over it, as large as the movie. Rejects if the browser does not let the page
  /// read the picture.
  async still(): Promise<Blob> {
    const { frame } = this.placement;
    const canvas = make('canvas', { width: Math.round(frame.width), height: Math.round(frame.height) });
    const context = canvas.getContext('2d');
    const { session, player } = this;
    if (!session || !context) throw new Error('nothing is open');
    await player.settled();
    if (player.movie === 'ready') context.drawImage(player.video, 0, 0, canvas.width, canvas.height);
    this.drawLayers(context, this.sceneAt(session, player.time, Math.max(1, frame.width / 1280)));
    drawCaption(context, this.captionAt(player.time), frame, palette().font);
    return pngOf(canvas);
  }

  private drawLayers(context: CanvasRenderingContext2D, scene: Scene): void {
    const isOn = (id: LayerId) => layers.some((layer) => layer.id === id && layer.isOn);
    byId('heat-legend').hidden = !isOn('heat');
    const heat = isOn('heat') ? this.heatPicture() : undefined;
    if (heat) drawHeat(context, scene, heat);
    if (isOn('zooms')) drawZoom(context, scene);
    if (isOn('window')) drawWindow(context, scene);
    if (isOn('hover')) drawHover(context, scene);
    if (isOn('trail') && !scene.isStill) drawTrail(context, scene);
    if (isOn('path')) drawPath(context, scene);
    if (isOn('groups')) drawGroup(context, scene);
    if (isOn('clicks')) drawClicks(context, scene);
    if (isOn('cursor')) drawCursor(context, scene);
  }

  /// Returns the map that is there, and makes the one that is wanted.
  private heatPicture(): HTMLCanvasElement | undefined {
    const { from, to } = this.heatRange;
    const { x, y, width, height } = this.placement.region;
    const wanted = [from, to, x, y, width, height].join();
    if (wanted !== this.askedHeat) {
      this.askedHeat = wanted;
      void this.makeHeat(wanted, from, to);
    }
    return this.heat;
  }

  private async makeHeat(wanted: string, from: number, to: number): Promise<void> {
    const { session, placement } = this;
    const isObsolete = () => session !== this.session || wanted !== this.askedHeat;
    const heat = await heatOf(session?.track('cursorLocation'), placement, from, to, isObsolete);
    if (isObsolete()) return;
    const picture = make('canvas', { width: heatWidth, height: heatHeight });
    picture.getContext('2d')?.putImageData(new ImageData(heatColours(heat), heatWidth, heatHeight), 0, 0);
    this.heat = picture;
    this.onReady();
  }

  /// What is typed at the moment, as far as the reader may see it.
  captionAt(time: number): CaptionPart[] {
    const isOn = layers.some(({ id, isOn }) => id === 'captions' && isOn);
    return isOn ? captionAt(this.session?.keys(this.showsKeys), time) : [];
  }

  private showCaption(time: number): void {
    const parts = this.captionAt(time);
    const text = captionText(parts);
    if (text === this.shownCaption) return;
    this.shownCaption = text;
    const least = Math.min(12 * uiScale(), this.width * 0.06); // large texts leave the picture in sight
    this.caption.style.fontSize = `${Math.max(least, Math.min(34, this.width * 0.024))}px`;
    this.caption.hidden = parts.length === 0;
    this.caption.dataset.text = text;
    this.caption.replaceChildren(...parts.map(captionPart));
  }
}

/// Running text as it is, other keys as caps.
function captionPart({ text, isTyped }: CaptionPart): Node {
  return isTyped ? make('span', {}, text) : make('kbd', {}, keyCap(text));
}

const heatStops: [number, number, number, number][] = [
  [40, 70, 220, 0],
  [50, 110, 255, 110],
  [40, 200, 190, 150],
  [250, 210, 70, 180],
  [250, 80, 50, 205],
];

function heatColours(heat: Float32Array): Uint8ClampedArray<ArrayBuffer> {
  const pixels = new Uint8ClampedArray(heat.length * 4);
  heat.forEach((value, i) => {
    const place = Math.min(0.9999, value) * (heatStops.length - 1);
    const [from, to] = [heatStops[Math.floor(place)]!, heatStops[Math.floor(place) + 1]!];
    for (let k = 0; k < 4; ++k) pixels[i * 4 + k] = from[k]! + (to[k]! - from[k]!) * (place % 1);
  });
  return pixels;
}
