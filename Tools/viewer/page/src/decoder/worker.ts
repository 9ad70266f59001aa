// Decodes a recording away from the page, so that the page goes on whatever the file holds.

import { Recording, ZulmError, type Entries } from '#decoder';
import { shortestIdle } from '../model/idle';
import type { Decoded } from '../model/session';
import { prepare } from '../model/prepared';
import { Track } from '../model/track';
import { PackedFile } from './packed';
import type { Reply, Request } from './protocol';
import { buffersIn, wrapped } from './wire';

/// What was opened can be opened again. In between none of its memory is taken.
type Reopen = () => Promise<Recording>;

const recordings = new Map<number, Reopen>();
let packed = new PackedFile();

/// In words for a person.
function wordsOf(error: unknown): string {
  if (error instanceof ZulmError) return error.message;
  return `the decoder stopped (${error instanceof Error ? error.message : String(error)})`;
}

const decodingPart = 0.7; // of the time of opening: the library works

/// Calls `tell` with the part of its work that is done.
function decode(
  opened: Recording,
  name: string,
  reports: boolean,
  tell: (part: number) => void,
): { decoded: Decoded; problems: string[] } {
  const problems: string[] = [];
  const attempt = <Result>(what: string, action: () => Result): Result | undefined => {
    try {
      return action();
    } catch (error) {
      problems.push(`${what}: ${wordsOf(error)}`);
      return undefined;
    }
  };
  const entries: Entries[] = [];
  for (const { kind, known } of opened.streams) {
    const read = known ? attempt(kind, () => opened.entries(kind)) : undefined;
    if (read) entries.push(read);
    tell((entries.length / opened.streams.length) * 0.8);
  }
  const keys = attempt('captions', () => ({
    clear: opened.insights('captions', { shows_keys: true }),
    masked: opened.insights('captions', { shows_keys: false }),
  }));
  const clicks = attempt('clicks', () => opened.insights('clicks'));
  const last = () => Number(opened.insights('activity').columns.end?.[0] ?? 0);
  const idle = attempt('idle times', () => opened.insights('idle', { least: shortestIdle }));
  const cursors = entries.find(({ kind }) => kind === 'cursorImage');
  const appearances = cursors && attempt('cursors', () => opened.at(new Track(cursors).times));
  const hidden = opened.hidden.map((stream, index) => ({
    stream: { ...stream },
    entries: stream.known ? attempt(`hidden ${stream.kind}`, () => opened.hiddenEntries(index)) : undefined,
  }));
  const decoded: Decoded = {
    name,
    container: opened.container,
    duration: opened.duration,
    length: opened.duration || attempt('length', last) || 0,
    streams: opened.streams.map((stream) => ({ ...stream })),
    entries,
    keys: keys && keys.clear.time.length > 0 ? keys : undefined,
    clicks,
    idle,
    appearances,
    hidden,
    info: (reports && attempt('facts', () => opened.info())) || {},
    verify: (reports && attempt('check', () => opened.verify())) || {},
  };
  return { decoded, problems };
}

/// What was asked something after it was opened. It stays open, since more questions follow.
let asked: { id: number; recording: Promise<Recording> } | undefined;

function closeAsked(): void {
  asked?.recording.then((recording) => recording.close()).catch(() => {}); // who asked is told
  asked = undefined;
}

/// What is opened after it is not shown yet.
function keep(id: number): void {
  for (const other of recordings.keys()) if (other < id) recordings.delete(other);
  if (asked?.id !== id) closeAsked();
}

function forget(id: number): void {
  recordings.delete(id);
  if (asked?.id === id) closeAsked();
}

function reopening(source: Blob | number, name: string): Reopen {
  if (source instanceof Blob) return () => Recording.open(source, name);
  const file = packed;
  packed = new PackedFile();
  return async () => Recording.open(await file.unpacked(source), name);
}

function opened(id: number): Promise<Recording> {
  const reopen = recordings.get(id);
  if (!reopen) throw new ZulmError('the recording has to be opened again');
  return reopen();
}

/// Asks what was opened under this number: all questions ask the same one. What has failed is opened anew for the next.
async function using<Result>(id: number, use: (recording: Recording) => Result): Promise<Result> {
  if (asked?.id !== id) {
    const recording = opened(id);
    closeAsked();
    asked = { id, recording };
  }
  const mine = asked;
  try {
    return use(await mine.recording);
  } catch (error) {
    if (asked === mine) closeAsked();
    throw error;
  }
}

/// Closes it before the rest is worked out, which takes memory too.
async function open(id: number, name: string, reports: boolean): Promise<{ decoded: Decoded; problems: string[] }> {
  const tell = (part: number) => self.postMessage({ id, type: 'progress', part } satisfies Reply);
  const recording = await opened(id);
  tell(0.1);
  const { decoded, problems } = decode(recording, name, reports, (part) => tell(0.1 + part * decodingPart));
  recording.close();
  tell(0.1 + decodingPart);
  decoded.prepared = prepare(decoded.entries);
  return { decoded: wrapped(decoded), problems };
}

async function answer(request: Exclude<Request, { type: 'piece' }>): Promise<[Reply, ArrayBuffer[]]> {
  const { id } = request;
  if (request.type === 'keep' || request.type === 'forget') {
    if (request.type === 'keep') keep(request.opened);
    else forget(request.opened);
    return [{ id, type: 'kept' }, []];
  }
  if (request.type === 'dump')
    return [{ id, type: 'dumped', text: await using(request.opened, (recording) => recording.dump()) }, []];
  if (request.type === 'insights') {
    const { opened, asked } = request;
    const compute = (recording: Recording) => asked.map(({ name, parameters }) => recording.insights(name, parameters));
    return [{ id, type: 'computed', tables: await using(opened, compute) }, []];
  }
  const { source, name, reports } = request;
  recordings.set(id, reopening(source, name));
  try {
    const result = await open(id, name, reports);
    return [{ id, type: 'opened', ...result }, [...buffersIn(result.decoded)]];
  } catch (error) {
    forget(id);
    throw error;
  }
}

self.onmessage = async ({ data }: MessageEvent<Request>) => {
  if (data.type === 'piece') return packed.take(data.text);
  try {
    const [reply, buffers] = await answer(data);
    self.postMessage(reply, { transfer: buffers });
  } catch (error) {
    self.postMessage({ id: data.id, type: 'failed', message: wordsOf(error) } satisfies Reply);
  }
};
