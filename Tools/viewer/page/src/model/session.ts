// A recording that has been read: its tracks, and what follows from them.

import type { Entries, StreamSummary, Table } from '#decoder';
import { appearancesIn, type Appearance } from './appearances';
import { clicksIn, type Click } from './clicks';
import { hasArea, type Point, type Rect } from './geometry';
import { idleIn, type Stretch } from './idle';
import { markersOf } from './markers';
import { Extremes } from './extremes';
import { mergedOf, type Merged } from './merged';
import type { Prepared } from './prepared';
import { speedOf, type Speed } from './speed';
import { Track } from './track';

export interface Finding {
  severity?: string;
  message?: string;
  /// The stream's kind, or the type of the atom.
  place?: string;
  [key: string]: unknown;
}

/// What the tool's reports say; everything may be missing.
export interface FileInfo {
  path?: string;
  container?: string;
  bytes?: number;
  duration?: number | null;
  streams?: { kind: string; uuid: string; version: number; entries: number; bytes: number; offset: number }[];
  creators?: { name?: string; version?: string; platform_version?: string }[];
  foreign_atoms?: unknown[];
}

export interface FileCheck {
  damaged?: boolean;
  damage_count?: number;
  notice_count?: number;
  findings?: Finding[];
  streams?: { kind?: string; findings?: Finding[] }[];
}

/// What comes from the decoder.
export interface Decoded {
  name: string;
  container: string;
  duration: number | undefined;
  /// Seconds that the recording lasts as the library sees it, which leaves damaged times out.
  length: number;
  streams: StreamSummary[];
  entries: Entries[];
  /// The keys as captions show them.
  keys: { clear: Table; masked: Table } | undefined;
  clicks: Table | undefined;
  idle: Table | undefined;
  /// What holds at the times of the stream cursorImage.
  appearances: Table | undefined;
  hidden: { stream: StreamSummary; entries: Entries | undefined }[];
  info: FileInfo;
  verify: FileCheck;
  /// What the decoder's worker has worked out already.
  prepared?: Prepared | undefined;
}

/// A stream that no reader finds. Nothing of it is drawn over the movie, where readers would not draw it either.
export interface HiddenStream {
  stream: StreamSummary;
  /// Undefined where its entries cannot be decoded.
  track: Track | undefined;
  reason: string;
}

export class Session {
  readonly name: string;
  readonly container: string;
  readonly streams: StreamSummary[];
  readonly hidden: HiddenStream[];
  readonly info: FileInfo;
  readonly verify: FileCheck;
  readonly region: Rect | undefined;
  readonly scaleFactor: number;
  /// Seconds that the movie lasts by its own word.
  readonly movieDuration: number | undefined;
  /// Seconds that the movie lasts, or else the metadata.
  readonly duration: number;
  readonly appearances: Appearance[];
  readonly clicks: Click[];
  readonly markers: Float64Array;
  readonly idle: Stretch[];
  /// Of the cursor.
  readonly speed: Speed;
  readonly speedExtremes: Extremes;
  private readonly tracks = new Map<string, Track>();
  private readonly prepared: Prepared | undefined;
  private readonly clearKeys: Track | undefined;
  private readonly maskedKeys: Track | undefined;

  /// `region` is what the reader says that the movie shows.
  constructor(decoded: Decoded, region?: Rect) {
    this.name = decoded.name;
    this.container = decoded.container;
    this.streams = decoded.streams;
    this.info = decoded.info;
    this.verify = decoded.verify;
    this.prepared = decoded.prepared;
    for (const entries of decoded.entries)
      this.tracks.set(entries.kind, new Track(entries, this.prepared?.order[entries.kind]));
    this.clearKeys = decoded.keys && new Track(decoded.keys.clear);
    this.maskedKeys = decoded.keys && new Track(decoded.keys.masked);
    this.hidden = decoded.hidden.map(({ stream, entries }) => ({
      stream,
      track: entries && new Track(entries),
      reason: this.streams.some(({ uuid }) => uuid === stream.uuid)
        ? 'A later stream of its kind takes its place.'
        : 'It comes after damage, where readers do not look.',
    }));
    this.region = region ?? this.recordedRegion();
    this.scaleFactor = this.lastNumber('recordingScaleFactor', 'scaleFactor') ?? 1;
    const { duration } = decoded;
    this.movieDuration = duration && Number.isFinite(duration) && duration > 0 ? duration : undefined;
    this.duration = Math.max(this.movieDuration ?? decoded.length, shortest);
    this.appearances = appearancesIn(decoded.appearances);
    this.clicks = clicksIn(decoded.clicks);
    this.markers = markersOf(this).filter((time) => time >= 0 && time <= this.duration);
    this.idle = idleIn(decoded.idle, this.duration);
    this.speed = decoded.prepared?.speed ?? speedOf(this.track('cursorLocation'));
    this.speedExtremes = new Extremes(this.speed.values, decoded.prepared?.speedBounds);
  }

  track(kind: string): Track | undefined {
    return this.tracks.get(kind);
  }

  /// The extremes of the cursor's positions.
  positionExtremes(column: 'x' | 'y'): Extremes {
    const values = this.track('cursorLocation')?.values(column) ?? [];
    return new Extremes(values, column === 'x' ? this.prepared?.xBounds : this.prepared?.yBounds);
  }

  /// The entries of all tracks by time.
  merged(): Merged {
    return this.prepared?.merged ?? mergedOf(this.allTracks());
  }

  allTracks(): Track[] {
    return [...this.tracks.values()];
  }

  cursorAt(time: number): Point | undefined {
    const track = this.track('cursorLocation');
    const index = track?.at(time) ?? -1;
    return track && index >= 0 ? { x: track.number('x', index), y: track.number('y', index) } : undefined;
  }

  /// The opacity of the cursor, from 0 to 1.
  opacityAt(time: number): number {
    const track = this.track('cursorOpacity');
    const index = track?.at(time) ?? -1;
    const opacity = index >= 0 ? track!.number('opacity', index) : 1;
    return Number.isFinite(opacity) ? Math.max(0, Math.min(1, opacity)) : 1;
  }

  /// The keys as captions show them, or undefined if the recording has none.
  keys(showsKeys: boolean): Track | undefined {
    return showsKeys ? this.clearKeys : this.maskedKeys;
  }

  private recordedRegion(): Rect | undefined {
    const track = this.track('recordingRegion');
    for (let i = (track?.count ?? 0) - 1; i >= 0; --i) {
      const rect = rectAt(track!, i);
      if (hasArea(rect)) return rect;
    }
    return undefined;
  }

  private lastNumber(kind: string, column: string): number | undefined {
    const track = this.track(kind);
    return track?.count ? track.number(column, track.count - 1) : undefined;
  }
}

const shortest = 0.1; // seconds, so that there is something to show

export function rectAt(track: Track, index: number): Rect {
  return {
    x: track.number('x', index),
    y: track.number('y', index),
    width: track.number('width', index),
    height: track.number('height', index),
  };
}
