// The recording that a page carries inside.

import type { FileCheck, FileInfo } from '../model/session';

/// A file that was compressed, in base64.
export interface PackedText {
  text: string;
  /// The size of the file in bytes.
  size: number;
}

export interface EmbeddedRecording {
  name: string;
  /// Relative to the page, or a data: address; null where there is no movie.
  movie: string | null;
  metadata: PackedText;
  info: FileInfo;
  verify: FileCheck;
}

interface PageHead {
  schema: string;
  schema_version: number;
  metadata_size: number;
}

export function embeddedRecording(): EmbeddedRecording | undefined {
  const text = document.getElementById('zulm-recording')?.textContent;
  if (!text) return undefined;
  const page = JSON.parse(text) as Partial<EmbeddedRecording> & Partial<PageHead>;
  const packed = document.getElementById('zulm-metadata');
  const size = page.metadata_size;
  if (page.schema !== 'zulm.view' || page.schema_version !== 2 || !packed || !Number.isSafeInteger(size))
    throw new Error('the recording in this page was written by another version');
  const metadata = { text: packed.textContent ?? '', size: size! };
  packed.remove(); // it is large, and read once
  return {
    name: page.name ?? 'Recording',
    movie: page.movie ?? null,
    metadata,
    info: page.info ?? {},
    verify: page.verify ?? {},
  };
}
