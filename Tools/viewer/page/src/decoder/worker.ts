// Decodes a recording away from the page, so that the page goes on whatever the file holds.

import { Recording, ZulmError, type Entries } from '#decoder';
import { shortestIdle } from '../model/idle';
import type { Decoded } from '../model/session';
import { Track } from '../model/track';
import type { Reply, Request } from './protocol';

const recordings = new Map<number, Recording>();

/// In words for a person.
function wordsOf(error: unknown): string {
  if (error instanceof ZulmError) return error.message;
  return `the decoder stopped (${error instanceof Error ? error.message : String(error)})`;
}

function bytesOf(base64: string): Uint8Array {
  const text = atob(base64);
  const bytes = new Uint8Array(text.length);
  for (let i = 0; i < text.length; ++i) bytes[i] = text.charCodeAt(i);
  return bytes;
}

function decode(opened: Recording, name: string, reports: boolean): { decoded: Decoded; problems: string[] } {
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
  }
  const keys = attempt('captions', () => ({
    clear: opened.insights('captions', { shows_keys: true }),
    masked: opened.insights('captions', { shows_keys: false }),
  }));
  const clicks = attempt('clicks', () => opened.insights('clicks'));
  const idle = attempt('idle times', () => opened.insights('idle', { least: shortestIdle }));
  const cursors = entries.find(({ kind }) => kind === 'cursorImage');
  const appearances = cursors && attempt('cursors', () => opened.at(new Track(cursors).times));
  const hidden = opened.hidden.map((stream, index) => ({
    stream: { ...stream },
    entries: stream.known ? attempt(`hidden ${stream.kind}`, () => opened.hiddenEntries(index)) : undefined,
  }));
  const decoded = {
    name,
    container: opened.container,
    duration: opened.duration,
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

/// What can be handed over instead of copied.
function transferable({ entries, keys, hidden }: Decoded): ArrayBuffer[] {
  const buffers = new Set<ArrayBuffer>();
  const all = [...entries, ...Object.values(keys ?? {}), ...hidden.flatMap(({ entries }) => entries ?? [])];
  for (const { time, columns } of all)
    for (const column of [time, ...Object.values(columns)])
      if (ArrayBuffer.isView(column) && column.buffer instanceof ArrayBuffer) buffers.add(column.buffer);
  return [...buffers];
}

function keep(id: number): void {
  for (const [other, recording] of recordings) {
    if (other === id) continue;
    recording.close();
    recordings.delete(other);
  }
}

function kept(id: number): Recording {
  const recording = recordings.get(id);
  if (!recording) throw new ZulmError('the recording has to be opened again');
  return recording;
}

async function answer(request: Request): Promise<[Reply, ArrayBuffer[]]> {
  const { id } = request;
  if (request.type === 'keep') {
    keep(request.opened);
    return [{ id, type: 'kept' }, []];
  }
  if (request.type === 'dump') return [{ id, type: 'dumped', text: kept(request.opened).dump() }, []];
  if (request.type === 'insights')
    return [{ id, type: 'computed', table: kept(request.opened).insights(request.name, request.parameters) }, []];
  const { source, name, reports } = request;
  const recording = await Recording.open(typeof source === 'string' ? bytesOf(source) : source, name);
  recordings.set(id, recording);
  const { decoded, problems } = decode(recording, name, reports);
  return [{ id, type: 'opened', decoded, problems }, transferable(decoded)];
}

self.onmessage = async ({ data }: MessageEvent<Request>) => {
  try {
    const [reply, buffers] = await answer(data);
    self.postMessage(reply, { transfer: buffers });
  } catch (error) {
    self.postMessage({ id: data.id, type: 'failed', message: wordsOf(error) } satisfies Reply);
  }
};
