/** What a stream holds, without its entries. */
export interface StreamSummary {
  /** The name of its kind, such as "cursorLocation", or its identifier where that has no name. */
  kind: string;
  /** Its identifier. */
  uuid: string;
  version: number;
  /** Whole entries; 0 where they cannot be decoded. */
  entries: number;
  /** What the file says it takes, header included. */
  bytes: number;
  /** Of its header, from the start of the file. */
  offset: number;
  /** Seconds, of the first and the last entry with a finite time. */
  first?: number;
  last?: number;
  /** Whether `entries()` can decode it: the kind and its version are known. */
  known: boolean;
}

/** One value per entry. Texts and bytes that are the same share one object. */
export type Column = Float64Array | Int32Array | BigInt64Array | Uint32Array | string[] | (Uint8Array | null)[];

/** The entries of a stream, by columns. */
export interface Entries {
  kind: string;
  /** Seconds, as they are stored. */
  time: Float64Array;
  /**
   * By the names that `zulm dump` uses, in its order. Whole numbers are Int32Array, identifiers of cursor images
   * BigInt64Array, other numbers Float64Array with the values that `zulm dump --format json` prints; texts are always
   * valid, with U+FFFD in place of what is not, and empty where there is none. An image is its stored file, PNG or
   * TIFF, and null where an entry has none.
   */
  columns: Record<string, Column>;
}

/** A recording that is open. Reads what it is asked for, and keeps nothing of the file but a few blocks. */
export class Recording {
  /**
   * Recognises movies (mp4, mov), RIFF files (avi, wav) and bare stream files, by the extension of the name where that
   * tells it, else by the first bytes. Rejects with a `ZulmError` for anything else.
   *
   * In a worker a `Blob` is read in slices, so that it may be of any size. Elsewhere it is loaded as a whole.
   *
   * @param name what reports call it; the file's own name where none is given, "recording" where it has none either.
   */
  static open(source: Blob | Uint8Array, name?: string): Promise<Recording>;

  /** "movie", "RIFF" or "stream". */
  readonly container: string;
  /** Seconds, where the movie tells. */
  readonly duration?: number;
  /** In the order of their identifiers. */
  readonly streams: StreamSummary[];
  /**
   * Streams that the file holds and no reader finds, in its order: a later one of the kind took their place, or they lie
   * behind damage.
   */
  readonly hidden: StreamSummary[];

  /** Of the stream of this kind, or with this identifier. Throws a `ZulmError` where there is none. */
  entries(kind: string): Entries;
  /** Of a hidden stream, by its place among `hidden`. */
  hiddenEntries(index: number): Entries;
  /** The file's object of `zulm info --json`. */
  info(): object;
  /** The file's object of `zulm verify --json`. */
  verify(): object;
  /** What `zulm dump --format json` prints, of all streams or of these kinds alone. */
  dump(kinds?: string[]): string;
  /** Frees everything. Whatever was given out stays valid. */
  close(): void;
}

/** Why something could not be done, in words for a person. */
export class ZulmError extends Error {}
