// Stands in for the decoder if that has not been built: every file is the synthetic recording.

import type { Column, Entries, StreamSummary, Table } from '../../../../Bindings/JavaScript/zulmetadata';
import { syntheticEntries } from './synthetic';

export type { Column, Entries, StreamSummary, Table };

export class ZulmError extends Error {}

export class Recording {
  readonly container = 'movie';
  readonly duration = 3600;
  private readonly all = syntheticEntries(this.duration);

  static async open(source: Blob | Uint8Array, name?: string): Promise<Recording> {
    if (source instanceof Blob && name?.endsWith('.txt')) throw new ZulmError(`${name} is no recording`);
    return new Recording();
  }

  get streams(): StreamSummary[] {
    return this.all.map(({ kind, time }, i) => ({
      kind,
      uuid: `00000000-0000-0000-0000-${String(i).padStart(12, '0')}`,
      version: 1,
      entries: time.length,
      bytes: 24 + time.length * 16,
      offset: 64,
      first: time[0]!,
      last: time[time.length - 1]!,
      known: true,
    }));
  }

  readonly hidden: StreamSummary[] = [];

  hiddenEntries(): Entries {
    throw new ZulmError('nothing is hidden');
  }

  entries(kind: string): Entries {
    return this.all.find((entries) => entries.kind === kind)!;
  }

  /// Every key is a caption here, and nobody is ever idle or clicks.
  insights(name: string, { shows_keys: showsKeys }: { shows_keys?: boolean } = {}): Table {
    if (name !== 'captions') return { kind: name, time: new Float64Array(), columns: {} };
    const { time, columns } = this.entries('keyboardAction');
    const label = (columns.characterString as string[]).map((key) => (showsKeys ? key : '•'));
    const first = Int32Array.from(label, (_, i) => i);
    const end = time.map((pressed) => pressed + 1.5);
    return { kind: name, time, columns: { label, is_typed: first.map(() => 1), first, end } };
  }

  /// Every entry shows its own picture here.
  at(times: Float64Array): Table {
    const { columns } = this.entries('cursorImage');
    return {
      kind: 'states',
      time: times,
      columns: {
        cursor_id: Array.from(columns.id as BigUint64Array, String),
        picture: columns.image!,
        hotspot_x: columns.hotspotOffsetX!,
        hotspot_y: columns.hotspotOffsetY!,
      },
    };
  }

  info(): object {
    return { container: 'movie', bytes: 52428800, duration: 3600, streams: [], creators: [], warnings: [] };
  }

  verify(): object {
    return { damaged: false, findings: [], streams: [] };
  }

  dump(): string {
    return '';
  }

  close(): void {}
}
