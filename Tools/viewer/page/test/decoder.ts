// Stands in for the decoder where it has not been built: every file is the synthetic recording.

import type { Column, Entries, StreamSummary } from '../../../../Bindings/JavaScript/zulmetadata';
import { syntheticEntries } from './synthetic';

export type { Column, Entries, StreamSummary };

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

  /// Every key is a caption here.
  keyCaptions(showsKeys: boolean): Entries {
    const { kind, time, columns } = this.entries('keyboardAction');
    const label = (columns.characterString as string[]).map((name) => (showsKeys ? name : '•'));
    const first = Int32Array.from(label, (_, i) => i);
    const end = time.map((pressed) => pressed + 1.5);
    return { kind, time, columns: { label, isTyped: first.map(() => 1), first, end } };
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
