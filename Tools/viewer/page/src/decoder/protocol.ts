// What the page and its decoder say to each other.

import type { Decoded } from '../model/session';

export type Request =
  | { id: number; type: 'open'; source: Blob | string; name: string; reports: boolean }
  | { id: number; type: 'dump'; kinds?: string[] };

export type Reply =
  | { id: number; type: 'opened'; decoded: Decoded; problems: string[] }
  | { id: number; type: 'dumped'; text: string }
  | { id: number; type: 'failed'; message: string };
