// The entries of every stream: look, filter, go there, copy.

import { count, plural, titleOf } from '../model/format';
import { partition } from '../model/search';
import type { HiddenStream, Session } from '../model/session';
import { announce, byId, make, setText } from '../ui/dom';
import { setIcon } from '../ui/icons';
import { wordsOf } from '../ui/words';
import { asCSV, asJSON, copyable, copyText, csvOf } from './copy';
import { filterRows, testOf } from './filter';
import { AllRows, StreamRows, type Rows } from './rows';
import { Sorter, type SortOrder } from './sorter';
import { Table } from './table';

export interface EntriesEvents {
  showsKeys: () => boolean;
  onSeek: (time: number) => void;
  onSave: () => void;
  onProblem: (text: string) => void;
  /// Another stream or filter was chosen.
  onChange: () => void;
}

const mostCopied = 500_000;
const mostAtOnce = 5_000; // entries that are copied without letting the page go on
const hiddenPrefix = 'hidden:'; // no kind's name has a colon

export class EntriesPane {
  private session: Session | undefined;
  private rows: Rows | undefined;
  private matches: Uint32Array | null = null;
  private isDone = true;
  private search = 0;
  private time = -1;
  private order: SortOrder | undefined;
  private isSorting = false;
  private readonly sorter = new Sorter();
  private readonly table = new Table();
  private readonly stream = make('select', { 'aria-label': 'Stream', class: 'select' });
  private readonly query = make('input', {
    type: 'search',
    class: 'field',
    placeholder: 'Filter: words, x>800, action=left',
    'aria-label': 'Filter entries',
    spellcheck: 'false',
    autocomplete: 'off',
  });
  private readonly status = make('output', { class: 'entries-status', 'aria-live': 'polite' });
  private readonly note = make('p', { class: 'entries-note', hidden: true });

  constructor(private readonly events: EntriesEvents) {
    const find = make(
      'div',
      { class: 'find' },
      this.query,
      this.tool('up', 'Previous match', () => this.step(-1)),
      this.tool('down', 'Next match', () => this.step(1)),
    );
    const tools = make(
      'div',
      { class: 'entries-tools' },
      this.status,
      this.tool('copy', 'Copy as JSON', () => void this.copy('JSON', asJSON), 'JSON'),
      this.tool('copy', 'Copy as CSV', () => void this.copy('CSV', asCSV), 'CSV'),
      this.tool('save', 'Save all entries as a JSON file', () => this.events.onSave()),
    );
    byId('pane-entries').append(
      make('div', { class: 'entries-head' }, this.stream, find, tools, this.note),
      this.table.element,
    );
    this.stream.addEventListener('change', () => this.choose(this.stream.value));
    this.query.addEventListener('input', () => {
      this.filter();
      this.events.onChange();
    });
    this.query.addEventListener('keydown', (event) => {
      if (event.key !== 'Enter') return;
      event.preventDefault();
      this.step(event.shiftKey ? -1 : 1);
    });
    this.table.onActivate = (row) => this.go(row);
    this.table.onSelect = () => this.showStatus();
    this.table.onSort = (column) => void this.sort(column);
    this.table.element.addEventListener('copy', (event) => this.copyHere(event));
  }

  private tool(icon: string, name: string, action: () => void, text = ''): HTMLButtonElement {
    const button = make(
      'button',
      {
        type: 'button',
        class: text ? 'button is-small' : 'button is-icon is-small',
        'aria-label': name,
        title: name,
      },
      text,
    );
    setIcon(button, icon);
    button.addEventListener('click', action);
    return button;
  }

  show(session: Session): void {
    this.session = session;
    const option = (value: string, text: string) => make('option', { value }, text);
    const streams = session
      .allTracks()
      .map(({ kind, entries }) => option(kind, `${titleOf(kind)} (${count(entries.time.length)})`));
    const hidden = session.hidden.flatMap(({ stream, track }, i) =>
      track ? [option(hiddenPrefix + i, `${titleOf(stream.kind)}, hidden (${count(stream.entries)})`)] : [],
    );
    const all = session.allTracks().reduce((sum, { count }) => sum + count, 0);
    this.stream.replaceChildren(option('', `All streams (${count(all)})`), ...streams, ...hidden);
    this.query.value = '';
    this.choose('');
  }

  /// Shows the same recording at other times, with the stream, the filter and the order that the reader chose.
  showAgain(session: Session): void {
    const { order, chosenStream, filterText } = this;
    this.show(session);
    this.look(chosenStream, filterText);
    if (order) void this.sortBy(order);
  }

  /// Empty for all streams.
  get chosenStream(): string {
    return this.stream.value;
  }

  get filterText(): string {
    return this.query.value;
  }

  /// Shows the entries of a stream that fit a filter, each only if it is given. A stream that is not there is none.
  look(stream: string | undefined, filter: string | undefined): void {
    if ((stream ?? this.chosenStream) === this.chosenStream && (filter ?? this.filterText) === this.filterText) return;
    if (filter !== undefined) this.query.value = filter;
    const isThere = [...this.stream.options].some(({ value }) => value === stream);
    if (stream !== undefined && isThere) this.stream.value = stream;
    if (filter !== undefined || (stream !== undefined && isThere)) this.choose(this.stream.value);
  }

  focusFilter(): void {
    this.query.focus();
    this.query.select();
  }

  /// Shows the entries between two times.
  showBetween(from: number, to: number): void {
    this.query.value = `time>=${from} time<${to}`;
    this.filter();
  }

  /// After the reader has asked for what was typed, or no longer.
  refresh(): void {
    this.showNote();
    this.table.refresh();
    if (this.query.value) this.filter();
  }

  setTime(time: number): void {
    if (time === this.time || !this.rows) return;
    this.time = time;
    this.table.setCurrent(this.rows.rowAt(time), true);
  }

  private choose(kind: string): void {
    const { session, events } = this;
    if (!session) return;
    const hidden = this.hiddenStream(kind);
    const track = hidden ? hidden.track : session.track(kind);
    this.rows = track
      ? new StreamRows(track, events.showsKeys, kind === 'cursorImage' ? session.appearances : [])
      : new AllRows(session.allTracks(), events.showsKeys, session.merged(), session.appearances);
    [this.order, this.isSorting] = [undefined, false];
    this.table.show(this.rows);
    this.showNote();
    this.filter();
    const { time } = this;
    this.time = -1;
    this.setTime(Math.max(0, time));
    this.events.onChange();
  }

  private hiddenStream(choice: string): HiddenStream | undefined {
    return choice.startsWith(hiddenPrefix) ? this.session?.hidden[Number(choice.slice(hiddenPrefix.length))] : undefined;
  }

  /// What the reader should know of the stream that is shown.
  private showNote(): void {
    const hidden = this.hiddenStream(this.stream.value);
    const kind = hidden?.stream.kind ?? this.stream.value;
    const notes = hidden ? [`No reader finds this stream. ${hidden.reason}`] : [];
    if (!this.events.showsKeys() && kind === 'keyboardAction')
      notes.push('What was typed is masked, here and in copies. Press t to see it.');
    this.note.hidden = notes.length === 0;
    setText(this.note, notes.join(' '));
  }

  private filter(): void {
    const { rows } = this;
    if (!rows) return;
    const search = ++this.search;
    const test = testOf(this.query.value);
    if (!test) return this.showMatches(rows, null, true);
    void filterRows(
      rows,
      test,
      () => search !== this.search,
      (matches, isDone) => this.showMatches(rows, matches, isDone),
    );
  }

  private showMatches(rows: Rows, matches: Uint32Array | null, isDone: boolean): void {
    [this.rows, this.matches, this.isDone] = [rows, matches, isDone];
    if (!this.order) this.table.choose(matches);
    else if (isDone && !this.isSorting) void this.showSorted();
    this.showStatus();
  }

  /// First upwards, then downwards, then as they come.
  private sort(column: number): Promise<void> {
    const { order } = this;
    const isNext = order?.column === column;
    return this.sortBy(isNext && order.isDescending ? undefined : { column, isDescending: isNext });
  }

  private async sortBy(wanted: SortOrder | undefined): Promise<void> {
    const { rows } = this;
    if (!rows) return;
    [this.order, this.isSorting] = [wanted, wanted !== undefined];
    this.table.showOrder(wanted);
    this.showStatus();
    if (!wanted) return this.table.choose(this.matches);
    await this.sorter.sort(rows, wanted, () => wanted !== this.order);
    if (wanted !== this.order) return;
    this.isSorting = false;
    if (this.isDone) await this.showSorted();
  }

  private async showSorted(): Promise<void> {
    const { rows, matches, order } = this;
    const { shown, places } = await this.sorter.shown(matches);
    if (rows !== this.rows || matches !== this.matches || order !== this.order) return;
    this.table.choose(shown, places);
    this.showStatus();
    if (order && rows) announce(`Sorted by ${rows.columns[order.column]!.title}`);
  }

  private showStatus(): void {
    const { rows, matches, isDone } = this;
    if (!rows) return;
    const found = matches ? `${count(matches.length)} of ${count(rows.count)}` : plural(rows.count, 'entry', 'entries');
    if (this.isSorting) return setText(this.status, 'Sorting …');
    const { selectedCount } = this.table;
    const selected = selectedCount > 0 ? `, ${count(selectedCount)} selected` : '';
    setText(this.status, `${found}${isDone ? '' : ' …'}${selected}`);
  }

  /// Goes to the next match, or entry, after or before the playhead.
  step(direction: 1 | -1): void {
    const { rows, matches, session } = this;
    if (!rows || !session) return;
    const length = matches?.length ?? rows.count;
    const timeOf = (place: number) => rows.time(matches ? matches[place]! : place);
    const near = 0.0005;
    const place = rows.isByTime
      ? direction > 0
        ? partition(length, (i) => timeOf(i) <= this.time + near)
        : partition(length, (i) => timeOf(i) < this.time - near) - 1
      : nearest(length, timeOf, this.time + direction * near, direction);
    if (place < 0 || place >= length) return announce(direction > 0 ? 'No further match' : 'No match before');
    const row = matches ? matches[place]! : place;
    this.go(row);
    this.table.visit(row);
  }

  private go(row: number): void {
    const time = this.rows?.time(row) ?? NaN;
    if (Number.isFinite(time)) this.events.onSeek(time);
  }

  /// By the keys of the system, where the browser asks what to copy. It does not wait for many.
  private copyHere(event: ClipboardEvent): void {
    if (!this.rows || !event.clipboardData) return;
    if (this.table.selectedCount > mostAtOnce) {
      event.preventDefault();
      return void this.copy('CSV', asCSV);
    }
    const rows = [...this.table.wantedHere()];
    if (rows.length === 0) return;
    event.clipboardData.setData('text/plain', copyable(csvOf(this.rows, rows)));
    event.preventDefault();
    setText(this.status, `${plural(rows.length, 'entry', 'entries')} copied as CSV`);
  }

  private async copy(name: string, write: (rows: Rows, chosen: number[]) => Promise<string>): Promise<void> {
    if (!this.rows) return;
    const entries = plural(this.table.wantedCount, 'entry', 'entries');
    if (this.table.wantedCount > mostCopied)
      return this.events.onProblem(`${entries} are too many to copy: filter them first, or save them as a file.`);
    try {
      await copyText(await write(this.rows, [...this.table.wanted()]));
      setText(this.status, `${entries} copied as ${name}`);
    } catch (error) {
      this.events.onProblem(`The entries could not be copied: ${wordsOf(error)}.`);
    }
  }
}

/// The place whose time is the next one after or before `time`, or -1. The times may have any order.
function nearest(length: number, timeOf: (place: number) => number, time: number, direction: 1 | -1): number {
  let best = -1;
  for (let place = 0; place < length; ++place) {
    const distance = (timeOf(place) - time) * direction;
    if (distance > 0 && (best < 0 || distance < (timeOf(best) - time) * direction)) best = place;
  }
  return best;
}
