// Notes at times: write, go there, take along.

import { clock, plural, shown } from '../model/format';
import { joined, notesIn, notesText, sortedNotes, type Note, type NotesFormat } from '../model/notes';
import type { Session } from '../model/session';
import { announce, byId, make, setText } from '../ui/dom';
import { setIcon } from '../ui/icons';
import { saveText } from '../ui/save';
import { store, stored } from '../ui/storage';

export interface NotesEvents {
  time: () => number;
  onSeek: (time: number) => void;
  onProblem: (text: string) => void;
  /// Called after a note came, went or changed.
  onChange: () => void;
}

const formats: [NotesFormat, string, string][] = [
  ['json', 'JSON', 'application/json'],
  ['csv', 'CSV', 'text/csv'],
  ['md', 'Markdown', 'text/markdown'],
];

const mostBytes = 8_000_000; // of a file of notes

export class NotesPane {
  private isWarned = false;
  private session: Session | undefined;
  /// At times of the movie. The browser keeps them at times of the recording.
  private notes: Note[] = [];
  private offset = 0;
  private readonly list = make('ol', { class: 'notes' });
  private readonly status = make('output', { class: 'notes-status', 'aria-live': 'polite' });
  private readonly field = make('input', {
    class: 'field',
    'aria-label': 'Note at the playhead',
    placeholder: 'Note at the playhead',
    autocomplete: 'off',
  });
  private readonly file = make('input', { type: 'file', accept: '.json,.csv,.md,text/*', hidden: true, 'aria-label': 'Notes to import' });

  constructor(private readonly events: NotesEvents) {
    const form = make('form', { class: 'find' }, this.field, button('plus', 'Add the note', undefined, 'submit'));
    form.addEventListener('submit', (event) => {
      event.preventDefault();
      this.add();
    });
    const exports = formats.map(([format, name, type]) =>
      button('save', `Save the notes as ${name}`, () => this.save(format, type), 'button', name),
    );
    const load = button('open', 'Import notes', () => this.file.click(), 'button', 'Import');
    const tools = make('div', { class: 'entries-tools' }, this.status, ...exports, load, this.file);
    this.file.addEventListener('change', () => void this.import());
    byId('pane-notes').append(make('div', { class: 'entries-head' }, form, tools), this.list);
  }

  /// Those of the recording, in the order of their times.
  get all(): readonly Note[] {
    return this.notes;
  }

  /// `offset` is added to the times of the recording.
  show(session: Session, offset: number): void {
    [this.session, this.offset] = [session, offset];
    this.notes = moved(this.remembered(), offset);
    this.fill();
  }

  /// Notes belong to the recording, and move with it.
  setOffset(offset: number): void {
    if (offset === this.offset) return;
    this.notes = moved(this.notes, offset - this.offset);
    this.offset = offset;
    this.fill();
    this.events.onChange();
  }

  focusField(): void {
    this.field.focus();
  }

  private get key(): string {
    const { name, info } = this.session ?? {};
    return `zulm-notes:${name} ${info?.bytes ?? ''}`;
  }

  private remembered(): Note[] {
    const text = stored(this.key);
    try {
      return text === null ? [] : notesIn(text);
    } catch {
      return []; // somebody else wrote it
    }
  }

  private change(notes: Note[], told: string): void {
    this.notes = sortedNotes(notes);
    this.fill();
    this.keep(told);
  }

  private keep(told: string): void {
    const notes = moved(this.notes, -this.offset);
    const isKept = store(this.key, notes.length > 0 ? notesText(notes, this.session?.name ?? '', 'json') : null);
    if (!isKept && !this.isWarned) {
      this.isWarned = true;
      this.events.onProblem('This browser does not keep notes for the next visit. Save them as a file before you leave.');
    }
    announce(told);
    this.events.onChange();
  }

  private add(): void {
    const text = this.field.value.trim();
    if (!this.session || text === '') return;
    const time = Number(this.events.time().toFixed(3));
    this.field.value = '';
    this.change([...this.notes, { time, text }], `Note at ${clock(time)} added`);
  }

  private fill(): void {
    this.list.replaceChildren(...this.notes.map((note) => this.row(note)));
    setText(this.status, plural(this.notes.length, 'note'));
  }

  private row(note: Note): HTMLElement {
    const at = clock(note.time);
    const time = make('button', { type: 'button', class: 'button is-small note-time', 'aria-label': `Go to ${at}` }, at);
    time.addEventListener('click', () => this.events.onSeek(note.time));
    const field = make('textarea', { class: 'field', rows: 1, 'aria-label': `Note at ${at}`, spellcheck: 'false' });
    field.value = shown(note.text);
    field.addEventListener('change', () => this.rewrite(note, field.value.trim()));
    const remove = button('close', `Remove the note at ${at}`, () => {
      this.change(this.notes.filter((other) => other !== note), `Note at ${at} removed`);
      this.field.focus();
    });
    return make('li', {}, time, field, remove);
  }

  /// An empty note is removed. Any other keeps its element: the button that the reader presses next has to stay there.
  private rewrite(note: Note, text: string): void {
    if (!text) return this.change(this.notes.filter((other) => other !== note), 'Note removed');
    if (text === shown(note.text)) return; // the field shows hidden characters, which the note keeps
    note.text = text;
    this.keep('Note changed');
  }

  private save(format: NotesFormat, type: string): void {
    const name = this.session?.name ?? 'Recording';
    saveText(`${name} notes.${format}`, notesText(this.notes, name, format), type);
  }

  private async import(): Promise<void> {
    const [file] = this.file.files ?? [];
    const { session } = this;
    this.file.value = '';
    if (!file) return;
    try {
      if (file.size > mostBytes) throw new Error('it is larger than any file of notes');
      const notes = notesIn(await file.text());
      if (session !== this.session) return; // they are about the recording before
      const all = joined(this.notes, notes);
      this.change(all, `${plural(all.length - this.notes.length, 'note')} imported`);
    } catch (error) {
      const reason = error instanceof Error && error.message.startsWith('it ') ? error.message : 'it holds no notes';
      this.events.onProblem(
        `${reason.replace('it', () => file.name)}. Choose a JSON, CSV or Markdown file that was saved by a page like this one.`,
      );
    }
  }
}

function moved(notes: Note[], offset: number): Note[] {
  return notes.map(({ time, text }) => ({ time: Number((time + offset).toFixed(6)), text }));
}

function button(
  icon: string,
  name: string,
  action?: () => void,
  type: 'button' | 'submit' = 'button',
  text = '',
): HTMLButtonElement {
  const kind = text ? 'button is-small' : 'button is-icon is-small';
  const element = make('button', { type, class: kind, 'aria-label': name, title: name }, text);
  setIcon(element, icon);
  if (action) element.addEventListener('click', action);
  return element;
}
