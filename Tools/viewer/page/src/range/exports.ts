// A selected range for other programs: an edit list of zulm, and a list for the concat demuxer of ffmpeg.

import { decimal } from '../model/decimals';
import type { Range } from '../lanes/axis';

/// As `zulm cut --edits` and `zulm retime --edits` read it. Texts are exact.
export function editListOf({ from, to }: Range): string {
  const pieces = [{ start: decimal(from), end: decimal(to) }];
  return `${JSON.stringify({ schema: 'zulm.edits', schema_version: 1, pieces })}\n`;
}

/// `movie` is the name of the file. The demuxer ends a name in quotation marks at the next one.
export function concatListOf({ from, to }: Range, movie: string): string {
  const name = movie.replaceAll("'", "'\\''");
  return `ffconcat version 1.0\nfile '${name}'\ninpoint ${decimal(from)}\noutpoint ${decimal(to)}\n`;
}
