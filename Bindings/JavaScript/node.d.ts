import type { Recording } from './zulmetadata.js';

/**
 * Opens a recording in Node and reads it in slices, so it can be of any size.
 *
 * @param file a path, a `file:` URL, or an open `FileHandle`. A file that is named is closed by `Recording.close()`. A
 *   handle stays yours; keep it open until the recording is closed. Reads do not move its position.
 * @param name what reports call the recording; by default the path. If the file has no extension that is known, its
 *   first bytes decide what it is.
 *
 * Rejects with a `ZulmError` if the file cannot be opened or is not a recording.
 */
export function openFile(file: string | URL | { readonly fd: number }, name?: string): Promise<Recording>;
