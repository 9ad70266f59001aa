// What the page and its decoder say to each other.

import type { Table } from '#decoder';
import type { Decoded } from '../model/session';

export type InsightName = 'zooms' | 'camera' | 'cursor_path' | 'activity' | 'applications';

export interface Insight {
  name: InsightName;
  parameters: Record<string, number>;
}

/// What was opened is named by the request that opened it; of all that was, `keep` closes the others.
export type Request =
  /// A piece of the text of a page. All pieces come before the request that opens them.
  | { id: number; type: 'piece'; text: string }
  /// A file, or the size of the one that the pieces hold.
  | { id: number; type: 'open'; source: Blob | number; name: string; reports: boolean }
  | { id: number; type: 'keep'; opened: number }
  /// It will not be shown.
  | { id: number; type: 'forget'; opened: number }
  | { id: number; type: 'dump'; opened: number }
  | { id: number; type: 'insights'; opened: number; asked: Insight[] };

export type Reply =
  | { id: number; type: 'opened'; decoded: Decoded; problems: string[] }
  /// How much of the work of opening is done, from 0 to 1. More replies follow.
  | { id: number; type: 'progress'; part: number }
  | { id: number; type: 'kept' }
  | { id: number; type: 'dumped'; text: string }
  | { id: number; type: 'computed'; tables: Table[] }
  | { id: number; type: 'failed'; message: string };
