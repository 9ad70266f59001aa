// The recording that a page carries inside.

import type { FileCheck, FileInfo } from '../model/session';

export interface EmbeddedRecording {
  name: string;
  /// Relative to the page, or a data: address; null where there is no movie.
  movie: string | null;
  metadata: string;
  info: FileInfo;
  verify: FileCheck;
}

export function embeddedRecording(): EmbeddedRecording | undefined {
  const text = document.getElementById('zulm-recording')?.textContent;
  if (!text) return undefined;
  const page = JSON.parse(text) as Partial<EmbeddedRecording> & { schema?: string; schema_version?: number };
  if (page.schema !== 'zulm.view' || page.schema_version !== 1 || typeof page.metadata !== 'string')
    throw new Error('the recording in this page was written by another version');
  return {
    name: page.name ?? 'Recording',
    movie: page.movie ?? null,
    metadata: page.metadata,
    info: page.info ?? {},
    verify: page.verify ?? {},
  };
}
