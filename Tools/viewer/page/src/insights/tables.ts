// What the library computes from the recording, asked for when it is first drawn.

import type { Table } from '#decoder';
import { shiftedTable } from '../adjust/adjustment';
import { Track } from '../model/track';
import { wordsOf } from '../ui/words';

export type TableName = 'zooms' | 'camera' | 'cursor_path';

export interface TableEvents {
  ask: (name: TableName, parameters: Record<string, number>) => Promise<Table>;
  onLoaded: () => void;
  onProblem: (text: string) => void;
}

const usualRate = 30; // rows in a second, of what has no rows of its own
const mostRows = 1_000_000;

export class InsightTables {
  private tracks = new Map<TableName, Track | undefined>();
  private offset = 0;
  private rate = usualRate;

  constructor(private readonly events: TableEvents) {}

  /// Forgets everything about the recording before. `offset` is added to all times.
  start(duration: number, offset: number): void {
    this.tracks = new Map();
    this.offset = offset;
    this.rate = Math.min(usualRate, mostRows / Math.max(1, duration));
  }

  /// Undefined until it is there.
  track(name: TableName): Track | undefined {
    if (!this.tracks.has(name)) void this.load(name);
    return this.tracks.get(name);
  }

  private async load(name: TableName): Promise<void> {
    const { tracks } = this;
    tracks.set(name, undefined);
    try {
      const table = await this.events.ask(name, name === 'zooms' ? {} : { rate: this.rate });
      if (tracks !== this.tracks) return;
      tracks.set(name, new Track(shiftedTable(table, this.offset)));
      this.events.onLoaded();
    } catch (error) {
      if (tracks === this.tracks)
        this.events.onProblem(`A layer cannot be shown: ${wordsOf(error)}.`);
    }
  }
}
