// The page's side of the decoder.

import type { Table } from '#decoder';
import { breath } from '../ui/breath';
import type { Decoded } from '../model/session';
import type { PackedText } from './embedded';
import { piecesOf } from './packed';
import type { Insight, Reply, Request } from './protocol';
import { unwrapped } from './wire';
import DecoderWorker from './worker?worker&inline';

type Wish = Request extends infer One ? (One extends Request ? Omit<One, 'id'> : never) : never;

export class DecoderError extends Error {}

export class Decoder {
  /// Called with the part of the work of opening that is done, from 0 to 1.
  onProgress: (part: number) => void = () => {};
  private worker: Worker | undefined;
  private lastId = 0;
  private kept = 0;
  private readonly waiting = new Map<number, { done: (reply: Reply) => void; failed: (error: Error) => void }>();

  /// So that it is there when it is needed.
  prepare(): void {
    this.running();
  }

  /// A file is read in slices, as far as needed; a text holds the file itself, whose reports are known.
  async open(source: Blob | PackedText, name: string): Promise<{ id: number; decoded: Decoded; problems: string[] }> {
    const isFile = source instanceof Blob;
    if (!isFile)
      for (const text of piecesOf(source.text)) {
        this.running().postMessage({ type: 'piece', id: 0, text });
        await breath();
      }
    const reply = await this.ask({ type: 'open', source: isFile ? source : source.size, name, reports: isFile });
    if (reply.type !== 'opened') throw unexpected();
    await breath(); // the reply was large
    return { ...reply, decoded: await unwrapped(reply.decoded) };
  }

  /// What was opened under this number is what the page shows from now on. Frees everything that was opened before it.
  keep(id: number): void {
    this.kept = id;
    this.ask({ type: 'keep', opened: id }).catch(() => {}); // nothing is left to free
  }

  /// Frees what was opened under this number.
  forget(id: number): void {
    this.ask({ type: 'forget', opened: id }).catch(() => {}); // nothing is left to free
  }

  /// All entries of what is kept, as the tool prints them.
  async dump(): Promise<string> {
    const reply = await this.ask({ type: 'dump', opened: this.kept });
    if (reply.type !== 'dumped') throw unexpected();
    return reply.text;
  }

  /// What the library computes from what is kept.
  async insights(...asked: Insight[]): Promise<Table[]> {
    const reply = await this.ask({ type: 'insights', opened: this.kept, asked });
    if (reply.type !== 'computed') throw unexpected();
    return reply.tables;
  }

  private ask(wish: Wish): Promise<Reply> {
    const id = ++this.lastId;
    return new Promise((done, failed) => {
      this.waiting.set(id, { done, failed });
      this.running().postMessage({ ...wish, id });
    });
  }

  private running(): Worker {
    if (this.worker) return this.worker;
    const worker = new DecoderWorker();
    worker.onmessage = ({ data }: MessageEvent<Reply>) => this.receive(data);
    worker.onerror = (event) => this.giveUp(event.message || 'it could not be started');
    return (this.worker = worker);
  }

  private receive(reply: Reply): void {
    if (reply.type === 'progress') return this.onProgress(reply.part);
    const asked = this.waiting.get(reply.id);
    this.waiting.delete(reply.id);
    if (reply.type === 'failed') asked?.failed(new DecoderError(reply.message));
    else asked?.done(reply);
  }

  /// The next question starts another one.
  private giveUp(reason: string): void {
    this.worker?.terminate();
    this.worker = undefined;
    for (const { failed } of this.waiting.values()) failed(new DecoderError(`the decoder stopped (${reason})`));
    this.waiting.clear();
  }
}

function unexpected(): DecoderError {
  return new DecoderError('the decoder answered something else');
}
