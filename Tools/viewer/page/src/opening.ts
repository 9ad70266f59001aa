// From a file, or from the page itself, to a recording that can be shown.

import { adjustmentIn, shifted, type Adjustment } from './adjust/adjustment';
import type { Decoder } from './decoder/client';
import { embeddedRecording, type EmbeddedRecording, type PackedText } from './decoder/embedded';
import type { Lane } from './lanes/lane';
import { shown } from './model/format';
import { joined, type Joined } from './model/joining';
import { linkTo } from './model/link';
import { Session, type Decoded } from './model/session';
import { breath } from './ui/breath';
import { byId, setText } from './ui/dom';
import { mark } from './ui/marks';
import { wordsOf } from './ui/words';

/// A recording that is ready to be shown.
export interface Arrival {
  /// The decoder's number for it.
  id: number;
  decoded: Decoded;
  adjustment: Adjustment;
  session: Session;
  lanes: Lane[];
  movie: MovieFile;
  /// The new address of the page; undefined if the address stays.
  address: string | undefined;
  /// What could not be read.
  problems: string[];
}

export interface MovieFile {
  /// Null if there is none.
  url: string | null;
  name: string;
}

export interface OpeningEvents {
  /// Makes the lanes of a recording that comes.
  lanesOf: (session: Session) => Promise<Lane[]>;
  /// Shows the recording. What was shown before is whole until then.
  onArrival: (arrival: Arrival) => void;
  onProblem: (text: string) => void;
}

/// What is known about a recording before it is read.
interface Coming {
  source: Blob | PackedText;
  name: string;
  movie: MovieFile;
  address?: string;
  /// Adds what the page knows.
  complete?: (decoded: Decoded) => Decoded;
}

/// A recording that is being read. `isShown` resolves when that has ended.
interface Running {
  number: number;
  name: string;
  isShown: Promise<boolean>;
}

export class Opening {
  /// The number of files that were opened or refused.
  finished = 0;
  private started = 0;
  private lastShown = 0;
  private running: Running[] = [];

  constructor(
    private readonly decoder: Decoder,
    private readonly events: OpeningEvents,
  ) {
    decoder.onProgress = (part) => (byId<HTMLProgressElement>('opening-progress').value = part);
  }

  /// Opens the recording that the page holds, if there is one.
  openEmbedded(): void {
    let embedded: EmbeddedRecording | undefined;
    try {
      embedded = embeddedRecording();
    } catch (error) {
      return this.events.onProblem(`This page's recording cannot be read: ${wordsOf(error)}.`);
    }
    if (!embedded) return;
    const { metadata, name, movie, info, verify } = embedded;
    const complete = (decoded: Decoded) => ({ ...decoded, info, verify, duration: info.duration ?? decoded.duration });
    void this.open({ source: metadata, name, movie: { url: movie, name: movie ?? '' }, complete });
  }

  /// Opens one recording: a movie, or stream files, or both.
  async openFiles(files: File[]): Promise<void> {
    let recording: Joined;
    try {
      recording = joined(files);
    } catch (error) {
      ++this.finished;
      return this.events.onProblem(`The files cannot be opened: ${wordsOf(error)}.`);
    }
    const { contents, name, movie } = recording;
    const url = movie ? URL.createObjectURL(movie) : null;
    const isShown = await this.open({ source: contents, name, movie: { url, name: movie?.name ?? '' }, address: linkTo(0) });
    if (url !== null && !isShown) URL.revokeObjectURL(url);
  }

  /// Returns whether the recording was shown.
  private async open(coming: Coming): Promise<boolean> {
    byId('notice').hidden = true;
    const isShown = this.read(++this.started, coming);
    const running = { number: this.started, name: coming.name, isShown };
    this.running.push(running);
    this.showState();
    const result = await isShown;
    this.running = this.running.filter((other) => other !== running);
    this.showState();
    ++this.finished;
    return result;
  }

  private async read(number: number, coming: Coming): Promise<boolean> {
    const { source, name } = coming;
    let id: number | undefined;
    try {
      if (source instanceof Blob && source.size === 0) throw new Error('it is empty');
      const { id: opened, decoded, problems } = await this.decoder.open(source, name);
      id = opened;
      mark('zulm:decoded');
      if (decoded.streams.length === 0 && decoded.hidden.length === 0) throw new Error(whyNothing(decoded));
      const adjustment = adjustmentIn(coming.address ?? location.hash);
      const completed = coming.complete?.(decoded) ?? decoded;
      const session = await sessionOf(completed, adjustment);
      const lanes = await this.events.lanesOf(session);
      if (await this.isOvertaken(number)) return this.giveUp(id);
      const { movie, address } = coming;
      this.lastShown = number;
      this.events.onArrival({ id, decoded: completed, adjustment, session, lanes, movie, address, problems });
      return true;
    } catch (error) {
      if (!(await this.isOvertaken(number))) this.events.onProblem(`${name} cannot be shown: ${wordsOf(error, name)}.`);
      return this.giveUp(id);
    }
  }

  /// A later recording takes the place of this one, unless the later one cannot be shown.
  private async isOvertaken(number: number): Promise<boolean> {
    const later = () => this.running.find((other) => other.number > number);
    for (let other = later(); other && this.lastShown <= number; other = later()) await other.isShown;
    return this.lastShown > number;
  }

  private giveUp(id: number | undefined): false {
    if (id !== undefined) this.decoder.forget(id);
    return false;
  }

  private showState(): void {
    const { running } = this;
    document.body.classList.toggle('is-busy', running.length > 0);
    const latest = running[running.length - 1];
    setText(byId('welcome-title'), latest ? `Opening ${shown(latest.name)}…` : 'Drop a recording here');
    byId('opening-progress').removeAttribute('value');
  }
}

/// Returns the session at the times of the movie. The page goes on meanwhile.
export async function sessionOf(decoded: Decoded, { offset, region }: Adjustment): Promise<Session> {
  const moved = await shifted(decoded, offset);
  await breath();
  const session = new Session(moved, region);
  await breath();
  return session;
}

const firstAtoms = /^(ftyp|mdat|moov|free|skip|wide|RIFF)$/;

/// Says why no reader finds a stream in a file. A file that was cut short has lost its streams.
function whyNothing({ verify }: Decoded): string {
  const finding = verify.findings?.find(({ severity }) => severity === 'damage');
  if (finding?.offset === 0 && !firstAtoms.test(finding.place ?? ''))
    return 'it begins neither like a movie, nor a RIFF file, nor a stream';
  const nothing = 'it holds nothing that was recorded beside a movie';
  return finding ? `${nothing}, and is damaged: ${finding.place} at offset ${finding.offset}, ${finding.message}` : nothing;
}
