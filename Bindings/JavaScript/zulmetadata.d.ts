/** Describes a stream without its entries. */
export interface StreamSummary {
  /** The name of the kind, such as "cursorLocation", or the identifier if the kind has no name. */
  kind: string;
  /** The identifier of the kind. */
  uuid: string;
  /** The version of the entries. */
  version: number;
  /** The number of whole entries; 0 if they cannot be decoded. */
  entries: number;
  /** The size that the file declares for the stream, in bytes, header included. */
  bytes: number;
  /** The position of the stream's header in the file. */
  offset: number;
  /** The time in seconds of the first entry whose time is finite. */
  first?: number;
  /** The time in seconds of the last entry whose time is finite. */
  last?: number;
  /** True if the kind and its version are known, so that `entries()` can decode the stream. */
  known: boolean;
}

/** One value for each entry. Texts and bytes that are equal share one object. */
export type Column = Float64Array | Int32Array | Uint32Array | BigUint64Array | string[] | (Uint8Array | null)[];

/** The entries of a stream, by columns. */
export interface Entries {
  /** The kind of the stream. */
  kind: string;
  /** The times in seconds, as they are stored. */
  time: Float64Array;
  /**
   * The values, by the names that `zulm dump` uses and in its order, as `zulm dump --format json` prints them.
   *
   * Whole numbers are an Int32Array, codes and flags of keys a Uint32Array, identifiers of cursor images a
   * BigUint64Array, and other numbers a Float64Array. Texts are whole and always valid: U+FFFD takes the place of bytes
   * that are not UTF-8, and a missing text is empty. An image is the stored PNG or TIFF file, or null if the entry has
   * none.
   */
  columns: Record<string, Column>;
}

/** Rows that were computed from a recording, by columns. */
export interface Table {
  /** What the rows are, such as "clicks". */
  kind: string;
  /** The times in seconds: of a state, or when something begins. */
  time: Float64Array;
  /** The values by their names. A number that is not known is NaN, a text or a picture null. */
  columns: Record<string, Column | (string | null)[]>;
}

/** A stream for a movie that was cut. */
export interface RetimedStream {
  /** The kind of the stream. */
  kind: string;
  /** The whole stream, header included. */
  bytes: Uint8Array;
  /** True if these are the bytes of the recording: the kind holds at all times, or is not known. */
  isCopied: boolean;
  /** The number of entries of pieces, at their new times. */
  moved: number;
  /** The number of entries that say what held already at the beginning of a piece. */
  carried: number;
  /** The number of presses and releases of buttons that were down at an edge. */
  added: number;
  /** The number of entries whose time is not finite. */
  leftOut: number;
}

/** A source of bytes that you write yourself, for example over an archive or a cache. */
export interface ByteSource {
  /** The number of bytes. */
  readonly size: number;
  /**
   * Returns the `size` bytes at `position`, or fewer if the source ends before. It must return them at once, not a
   * promise. What it throws ends the operation with a `ZulmError`.
   */
  read(position: number, size: number): Uint8Array;
  /** Called once, when the recording is closed or could not be opened. */
  close?(): void;
}

/** An open recording. It reads what it is asked for, and keeps nothing of the file but a few blocks. */
export class Recording {
  /**
   * Opens a movie (mp4, mov), a RIFF file (avi, wav) or a stream file. The first bytes decide which; the extension of
   * the name counts only if they say nothing. Rejects with a `ZulmError` for anything else.
   *
   * A worker reads a `Blob` in slices, so it can be of any size; elsewhere a `Blob` is loaded as a whole. A `ByteSource`
   * is always read in slices. In Node, `openFile` of `zulmetadata/node` reads a file in slices.
   *
   * @param name what reports call the recording; by default the name of the file, or "recording" if it has none.
   */
  static open(source: Blob | Uint8Array | ByteSource, name?: string): Promise<Recording>;

  /** "movie", "RIFF" or "stream". */
  readonly container: string;
  /** The duration in seconds, if the movie declares one. */
  readonly duration?: number;
  /** The streams, in the order of their identifiers. */
  readonly streams: StreamSummary[];
  /**
   * The streams that readers do not find, in the order of the file: a later stream of the same kind hides them, or
   * they lie after damage.
   */
  readonly hidden: StreamSummary[];

  /**
   * Called with a sentence if a file is damaged so that states, insights or retimed streams lack something. What it
   * throws passes through.
   */
  onWarning?: (sentence: string) => void;

  /** Returns the entries of the stream of this kind or identifier. Throws a `ZulmError` if there is none. */
  entries(kind: string): Entries;
  /** Returns the entries of a hidden stream, by its index in `hidden`. */
  hiddenEntries(index: number): Entries;
  /** Returns the entries of a kind with a finite time, in the order of their times. */
  track(kind: string): Entries;
  /**
   * Returns what holds at one time or at each of several, in seconds. The columns are "x" and "y" of the cursor,
   * "cursor_id", "hotspot_x", "hotspot_y" and "picture" of what it looks like, "opacity", "buttons" and "modifiers"
   * (names with "+" between two, such as "shift+ctrl"), "window_x" to "window_height", "title", "application",
   * "slide_title", "slide_text", "slide_comment", "hover_x" to "hover_height", "region_x" to "region_height", "scale" and
   * "cpu". With "linear", the default, the cursor moves between two entries, but rests while nothing was recorded; with
   * "none" it is where the last entry says.
   */
  at(times: number | Iterable<number>, options?: { interpolate?: 'linear' | 'none' }): Table;
  /**
   * Returns what follows from the recording. `parameters` change the defaults that Docs/insights.md lists, by their
   * names in lower case with underscores, such as `{ least: 3 }`. Docs/insights.md lists the columns, too.
   *
   * Captions have one row for each key: `label`, its text; `is_typed`, 1 for a character without modifiers, which makes
   * words with its neighbours; `first`, the row that begins its caption; `end`, until when its caption is shown. Unless
   * `shows_keys` is true, a bullet takes the place of what was typed; `shows_shortcuts` shows characters with Control,
   * Windows or Command nevertheless.
   */
  insights(
    name:
      | 'clicks'
      | 'captions'
      | 'idle'
      | 'chapters'
      | 'zooms'
      | 'cursor_path'
      | 'cursor_speed'
      | 'camera'
      | 'activity'
      | 'applications',
    parameters?: Record<string, number | boolean>,
  ): Table;
  /**
   * Returns the streams for a movie that was cut by an edit list: the text of a list, or the object that a JSON
   * document describes. Lists of other programs are read, too. Throws a `ZulmError` for a list that cannot be.
   *
   * @param options `name` is the file of the list; its extension says the form if the text does not. `frameRate`, such
   * as 25 or "30000/1001", is for lists that count frames.
   */
  retime(edits: string | object, options?: { name?: string; frameRate?: number | string }): RetimedStream[];
  /** Returns the file's object of `zulm info --json`. */
  info(): object;
  /** Returns the file's object of `zulm verify --json`, in which images are known by the size that they state. */
  verify(): object;
  /** Returns what `zulm dump --format json` prints, for all streams or for these kinds only. */
  dump(kinds?: string[]): string;
  /** Frees everything and closes the source. What was returned before stays valid. */
  close(): void;
}

/** Says in words for a person why something could not be done. */
export class ZulmError extends Error {}
