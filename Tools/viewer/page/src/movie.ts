// The file of the movie that is shown: its address, its name, and what is told about it.

import { assumption } from './model/checks';
import { shown } from './model/format';
import type { Rect } from './model/geometry';
import type { MovieFile } from './opening';
import type { MovieState } from './stage/player';
import { byId, setText } from './ui/dom';
import { wordsOf } from './ui/words';

export class Movie {
  private current: MovieFile = { url: null, name: '' };
  /// The movie of the recording; undefined while it is the one that is shown.
  private own: MovieFile | undefined;

  get url(): string | null {
    return this.current.url;
  }

  /// Whether the reader has chosen another movie than that of the recording.
  get isAnother(): boolean {
    return this.own !== undefined;
  }

  /// Takes the movie of a recording.
  set({ url, name }: MovieFile): void {
    release(this.current);
    if (this.own) release(this.own);
    this.own = undefined;
    this.current = { url, name: name.startsWith('data:') ? '' : name };
  }

  /// Takes another movie for the same recording.
  replace(file: File): void {
    if (this.own) release(this.current);
    else this.own = this.current;
    this.current = { url: URL.createObjectURL(file), name: file.name };
  }

  /// Goes back to the movie of the recording.
  restore(): void {
    if (!this.own) return;
    release(this.current);
    [this.current, this.own] = [this.own, undefined];
  }

  /// Whether the file was chosen by the reader, and does not lie beside the page.
  private get isChosen(): boolean {
    return this.url?.startsWith('blob:') ?? false;
  }

  /// Returns the name of the file without its folder.
  fileName(otherwise: string): string {
    const [name = ''] = this.current.name.split(/[\\/]/).slice(-1);
    return this.isChosen || !name ? name || otherwise : decodedName(name);
  }

  /// Tells below the stage why there are no pictures.
  tell(state: MovieState, region: Rect | undefined): void {
    const note = byId('stage-note');
    note.hidden = state === 'ready' || state === 'loading';
    const name = this.current.name || 'The movie';
    const reason =
      state === 'none'
        ? 'There is no movie with this recording.'
        : this.isChosen
          ? `This browser can show no pictures of ${name}.`
          : `${name} is not beside this page, or has no pictures that this browser can show.`;
    const stand = region ? 'The recorded region stands for it.' : assumption(undefined);
    setText(note, shown(`${reason} ${stand}`));
  }
}

function release({ url }: MovieFile): void {
  if (url?.startsWith('blob:')) URL.revokeObjectURL(url);
}

/// A page writes names in addresses with percent signs.
function decodedName(name: string): string {
  try {
    return decodeURIComponent(name);
  } catch {
    return name;
  }
}

/// Returns why a picture could not be saved.
export function stillProblem(error: unknown): string {
  return error instanceof DOMException && error.name === 'SecurityError'
    ? 'the browser does not let a page read a movie beside it. Choose the movie under Facts, Adjust, or drop it on the page, and save the picture then'
    : wordsOf(error);
}
