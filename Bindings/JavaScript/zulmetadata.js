// Recordings in JavaScript: everything that the format means is known to the core alone, which is C++ as WebAssembly.
// Its interface is that of zulmetadata_c.h.

import { coreBytes } from './core.js';

export class ZulmError extends Error {
  name = 'ZulmError';
}

// As zulmetadata_c.h and WasmHost.cpp have them.
const StreamField = { kind: 0, uuid: 4, version: 8, entries: 16, bytes: 24, offset: 32, first: 40, last: 48, isKnown: 56 };
const ColumnField = { name: 0, type: 4, values: 8, pool: 12, ends: 16, distinct: 20 };
const NumberColumns = { 0: Int32Array, 1: BigUint64Array, 2: Float64Array, 5: Uint32Array };
const TEXTS = 3;
const NOTHING = 0xffffffff;

const utf8 = new TextDecoder('utf-8', { ignoreBOM: true }); // a text keeps its first character

let compiled; // once for all recordings

function compiledCore() {
  compiled ??= coreBytes().then((bytes) => WebAssembly.compile(bytes));
  compiled.catch(() => (compiled = undefined)); // the next one tries again
  return compiled;
}

/** Returns what can be read at any position. A worker reads slices of a Blob; elsewhere a Blob is loaded as a whole. */
async function readerOf(source) {
  if (source instanceof Uint8Array) return readerOfBytes(source);
  if (typeof source?.read === 'function' && Number.isSafeInteger(source.size)) return source;
  if (!(source instanceof Blob)) throw new ZulmError('a recording is opened from a Blob, a Uint8Array or a source of bytes');
  if (typeof FileReaderSync === 'undefined') return readerOfBytes(new Uint8Array(await source.arrayBuffer()));
  const reader = new FileReaderSync();
  const read = (position, size) => new Uint8Array(reader.readAsArrayBuffer(source.slice(position, position + size)));
  return { size: source.size, read };
}

function readerOfBytes(bytes) {
  return { size: bytes.length, read: (position, size) => bytes.subarray(position, position + size) };
}

/** A core of its own for every recording: its memory goes with it, and nothing that happens in it reaches another. */
class Core {
  static async over(reader) {
    const core = new Core();
    const instance = await WebAssembly.instantiate(await compiledCore(), core.#imports(reader));
    core.exports = instance.exports;
    core.exports._initialize();
    return core;
  }

  /** The core asks for bytes. All else that its libraries could ask for is not there. */
  #imports(reader) {
    const readAt = (position, place, size) => {
      try {
        const bytes = reader.read(position, size >>> 0);
        if (!(bytes instanceof Uint8Array) || bytes.length > size >>> 0)
          throw new TypeError('read(position, size) must return a Uint8Array of at most that size');
        new Uint8Array(this.memory).set(bytes, place >>> 0);
        return bytes.length;
      } catch (error) {
        this.readError = error; // the file was changed or taken away
        return -1;
      }
    };
    const notThere = () => -52; // ENOSYS
    const noFile = () => 8; // EBADF
    const noEnvironment = (count, size) => {
      const view = new DataView(this.memory);
      view.setUint32(count, 0, true);
      view.setUint32(size, 0, true);
      return 0;
    };
    const exit = (code) => {
      throw new WebAssembly.RuntimeError(`ended with ${code}`);
    };
    return {
      zulm: { readAt },
      env: {
        emscripten_notify_memory_growth() {},
        __syscall_fstat64: notThere,
        __syscall_stat64: notThere,
        __syscall_fstatat64: notThere,
        __syscall_lstat64: notThere,
      },
      wasi_snapshot_preview1: {
        proc_exit: exit,
        fd_close: noFile,
        fd_write: noFile,
        fd_seek: noFile,
        fd_read: noFile,
        environ_sizes_get: noEnvironment,
        environ_get: () => 0,
      },
    };
  }

  get memory() {
    return this.exports.memory.buffer;
  }

  /** Calls a function that returns a pointer, or null and a message. */
  call(name, ...values) {
    this.readError = undefined;
    const result = this.exports[name](...values) >>> 0;
    if (result === 0) throw new ZulmError(this.textAt(this.exports.zulm_last_error()), { cause: this.readError });
    return result;
  }

  withText(text, use) {
    const bytes = new TextEncoder().encode(`${text}\0`);
    const place = this.exports.malloc(bytes.length) >>> 0;
    if (place === 0) throw new ZulmError('out of memory');
    new Uint8Array(this.memory).set(bytes, place);
    try {
      return use(place);
    } finally {
      this.exports.free(place);
    }
  }

  withNumbers(numbers, use) {
    const place = this.exports.malloc(Math.max(numbers.byteLength, 8)) >>> 0;
    if (place === 0) throw new ZulmError('out of memory');
    new Float64Array(this.memory, place, numbers.length).set(numbers);
    try {
      return use(place);
    } finally {
      this.exports.free(place);
    }
  }

  textAt(place) {
    const bytes = new Uint8Array(this.memory, place >>> 0);
    return utf8.decode(bytes.subarray(0, bytes.indexOf(0)));
  }

  takeText(text) {
    const start = this.exports.zulm_text_bytes(text) >>> 0;
    const size = this.exports.zulm_text_size(text) >>> 0;
    const result = utf8.decode(new Uint8Array(this.memory, start, size));
    this.exports.zulm_free_text(text);
    return result;
  }

  /** Numbers out of the core's memory, to keep. */
  copied(Numbers, place, count) {
    return new Numbers(this.memory, place, count).slice();
  }

  /** Returns all streams that `name` returns by their numbers; `name` with `_count` says how many there are. */
  streamsOf(recording, name) {
    const count = this.exports[`${name}_count`](recording) >>> 0;
    return Array.from({ length: count }, (_, index) => this.streamAt(this.exports[name](recording, index) >>> 0));
  }

  streamAt(place) {
    const view = new DataView(this.memory, place);
    const pointer = (offset) => view.getUint32(offset, true);
    const count = (offset) => Number(view.getBigUint64(offset, true));
    const summary = {
      kind: this.textAt(pointer(StreamField.kind)),
      uuid: this.textAt(pointer(StreamField.uuid)),
      version: view.getInt32(StreamField.version, true),
      entries: count(StreamField.entries),
      bytes: count(StreamField.bytes),
      offset: count(StreamField.offset),
      known: view.getInt32(StreamField.isKnown, true) !== 0,
    };
    for (const end of ['first', 'last']) {
      const time = view.getFloat64(StreamField[end], true);
      if (!Number.isNaN(time)) summary[end] = time;
    }
    return summary;
  }

  takeEntries(entries, kind) {
    const { exports } = this;
    const count = exports.zulm_entry_count(entries) >>> 0;
    const columns = Array.from({ length: exports.zulm_column_count(entries) >>> 0 }, (_, index) =>
      this.columnAt(exports.zulm_column(entries, index) >>> 0, count),
    );
    const time = this.copied(Float64Array, exports.zulm_entry_times(entries) >>> 0, count);
    exports.zulm_free_entries(entries);
    return { kind, time, columns: Object.fromEntries(columns) };
  }

  /** Entries that were computed, and in `warnings` what is missing among them. */
  takeTable(entries, kind) {
    this.warnings = Array.from({ length: this.exports.zulm_warning_count(entries) >>> 0 }, (_, index) =>
      this.textAt(this.exports.zulm_warning(entries, index)),
    );
    return this.takeEntries(entries, kind);
  }

  columnAt(place, count) {
    const view = new DataView(this.memory, place);
    const field = (offset) => view.getUint32(offset, true);
    const name = this.textAt(field(ColumnField.name));
    const values = field(ColumnField.values);
    const type = field(ColumnField.type);
    if (type in NumberColumns) return [name, this.copied(NumberColumns[type], values, count)];
    const make = type === TEXTS ? (bytes) => utf8.decode(bytes) : (bytes) => bytes.slice();
    return [name, this.#spread(values, count, this.#distinctAt(view, make))];
  }

  #distinctAt(column, make) {
    const count = column.getUint32(ColumnField.distinct, true);
    const ends = new BigUint64Array(this.memory, column.getUint32(ColumnField.ends, true), count);
    const pool = new Uint8Array(this.memory, column.getUint32(ColumnField.pool, true));
    const values = new Array(count);
    for (let index = 0, start = 0; index < count; ++index) {
      const end = Number(ends[index]);
      values[index] = make(pool.subarray(start, end));
      start = end;
    }
    return values;
  }

  #spread(place, count, distinct) {
    const indices = new Uint32Array(this.memory, place, count);
    const values = new Array(count);
    for (let index = 0; index < count; ++index)
      values[index] = indices[index] === NOTHING ? null : distinct[indices[index]];
    return values;
  }
}

export class Recording {
  #core;
  #handle;
  #name;
  #reader;
  onWarning;

  static async open(source, name = source?.name || 'recording') {
    const reader = await readerOf(source);
    try {
      return new Recording(await Core.over(reader), reader, name);
    } catch (error) {
      reader.close?.();
      throw error;
    }
  }

  constructor(core, reader, name) {
    if (!(core instanceof Core)) throw new TypeError('Recording.open() opens recordings');
    this.#core = core;
    this.#name = name;
    this.#guarded(() => {
      this.#handle = core.withText(name, (place) => core.call('zulm_open_host', reader.size, place));
      this.container = core.textAt(core.exports.zulm_container(this.#handle));
      const duration = core.exports.zulm_duration(this.#handle);
      if (!Number.isNaN(duration)) this.duration = duration;
      this.streams = core.streamsOf(this.#handle, 'zulm_stream');
      this.hidden = core.streamsOf(this.#handle, 'zulm_hidden');
    });
    this.#reader = reader; // a recording that is open closes it
  }

  entries(kind) {
    return this.#guarded((core) => {
      const entries = core.withText(kind, (place) => core.call('zulm_read_entries', this.#handle, place));
      return core.takeEntries(entries, kind);
    });
  }

  hiddenEntries(index) {
    return this.#guarded((core) => {
      const stream = this.hidden[index];
      if (!stream) throw new ZulmError(`${this.#name}: hides no stream ${index}`);
      return core.takeEntries(core.call('zulm_read_hidden', this.#handle, index), stream.kind);
    });
  }

  track(kind) {
    const entries = this.entries(kind);
    const { time, columns } = entries;
    if (time.every((value, row) => Number.isFinite(value) && !(value < time[row - 1]))) return entries;
    const rows = Uint32Array.from(time.keys()).filter((row) => Number.isFinite(time[row]));
    rows.sort((a, b) => time[a] - time[b] || a - b);
    const sorted = (values) => values.constructor.from(rows, (row) => values[row]);
    return {
      kind,
      time: sorted(time),
      columns: Object.fromEntries(Object.entries(columns).map(([name, values]) => [name, sorted(values)])),
    };
  }

  at(times, { interpolate = 'linear' } = {}) {
    if (interpolate !== 'linear' && interpolate !== 'none')
      throw new TypeError(`interpolate is 'linear' or 'none', not '${interpolate}'`);
    const numbers = Float64Array.from(typeof times === 'number' ? [times] : times);
    return this.#computed((core) =>
      core.withNumbers(numbers, (place) =>
        core.takeTable(
          core.call('zulm_states', this.#handle, place, numbers.length, interpolate === 'linear' ? 1 : 0),
          'states',
        ),
      ),
    );
  }

  insights(name, parameters = {}) {
    const list = Object.entries(parameters).map(([key, value]) => `${key}=${Number(value)}`);
    return this.#computed((core) =>
      core.withText(name, (namePlace) =>
        core.withText(list.join(), (listPlace) =>
          core.takeTable(core.call('zulm_insight', this.#handle, namePlace, listPlace), name),
        ),
      ),
    );
  }

  retime(edits, { name = 'edits', frameRate = '' } = {}) {
    const text = typeof edits === 'string' ? edits : JSON.stringify(edits);
    const { columns } = this.#computed((core) =>
      core.withText(text, (textPlace) =>
        core.withText(name, (namePlace) =>
          core.withText(frameRate, (ratePlace) =>
            core.takeTable(core.call('zulm_retime', this.#handle, textPlace, namePlace, ratePlace), 'retimed'),
          ),
        ),
      ),
    );
    return columns.kind.map((kind, row) => ({
      kind,
      bytes: columns.bytes[row],
      isCopied: columns.is_copied[row] === 1,
      moved: columns.moved[row],
      carried: columns.carried[row],
      added: columns.added[row],
      leftOut: columns.left_out[row],
    }));
  }

  info() {
    return this.#guarded((core) => JSON.parse(core.takeText(core.call('zulm_info', this.#handle))));
  }

  verify() {
    return this.#guarded((core) => JSON.parse(core.takeText(core.call('zulm_verify', this.#handle))));
  }

  dump(kinds) {
    return this.#guarded((core) => {
      if (!kinds) return core.takeText(core.call('zulm_dump', this.#handle, 0));
      return core.withText(kinds.join(), (list) => core.takeText(core.call('zulm_dump', this.#handle, list)));
    });
  }

  close() {
    this.#core = undefined; // and with it all memory
    const reader = this.#reader;
    this.#reader = undefined;
    reader?.close?.();
  }

  /** Returns the table that `work` takes, and passes its warnings on. */
  #computed(work) {
    const table = this.#guarded(work);
    for (const sentence of this.#core.warnings) this.onWarning?.(`${this.#name}: ${sentence}`);
    return table;
  }

  /** Nothing but a `ZulmError` comes out; a core that broke is not used again. */
  #guarded(work) {
    if (!this.#core) throw new ZulmError(`${this.#name}: is closed`);
    try {
      return work(this.#core);
    } catch (error) {
      if (error instanceof ZulmError) throw error;
      this.close();
      throw new ZulmError(`${this.#name}: the decoder has failed: ${error.message}`, { cause: error });
    }
  }
}
