// What is known of the selected range, and what can be done with it.

import type { Table } from '#decoder';
import { copyText } from '../entries/copy';
import { clock, count, plural, shown } from '../model/format';
import { decimal } from '../model/decimals';
import { Track } from '../model/track';
import { announce, byId, make, setText } from '../ui/dom';
import { setIcon } from '../ui/icons';
import { saveText } from '../ui/save';
import { wordsOf } from '../ui/words';
import { concatListOf, editListOf } from './exports';
import type { Range } from '../lanes/axis';
import type { Selection } from './selection';

export interface RangeEvents {
  /// Asks the library about the activity and the applications in a range of the movie's time.
  insights: (range: Range) => Promise<Table[]>;
  movieName: () => string;
  hasMovie: () => boolean;
  link: () => string;
  onZoom: (range: Range) => void;
  onFilter: (range: Range) => void;
  onProblem: (text: string) => void;
}

const patience = 120; // milliseconds that a selection stays the same before anybody is asked about it
const mostNames = 3;

export class RangeBar {
  private readonly times = make('b', { class: 'range-times' });
  private readonly facts = make('output', { class: 'range-facts', 'aria-live': 'off' });
  private readonly loop: HTMLButtonElement;
  private readonly heat: HTMLButtonElement;
  private readonly concat: HTMLButtonElement;
  private timer: ReturnType<typeof setTimeout> | undefined;
  private asked = 0;
  private isAsking = false;
  /// Lines of a name and a value.
  private lines: [string, string][] = [];
  private told: Range | undefined;
  readonly element = make('section', { class: 'range-bar', 'aria-label': 'Selection', hidden: true });

  constructor(
    private readonly selection: Selection,
    private readonly events: RangeEvents,
  ) {
    const tool = (icon: string, name: string, title: string, action: (range: Range) => unknown, text = '') => {
      const attributes = { type: 'button', class: `button is-small${text ? '' : ' is-icon'}`, title, 'aria-label': name };
      const button = make('button', attributes, text);
      setIcon(button, icon);
      button.addEventListener('click', () => selection.range && action(selection.range));
      return button;
    };
    this.loop = tool('loop', 'Loop', 'Play the selection again and again  r', () => this.switchLoop());
    this.heat = tool('heat', 'Heat map', 'Heat map of the selection', () => this.switchHeat());
    this.concat = tool('save', 'Save as a list for ffmpeg', 'Save a list for the concat demuxer of ffmpeg', (range) => this.saveConcat(range), 'ffmpeg');
    this.element.append(
      make('div', { class: 'range-words' }, this.times, this.facts),
      make(
        'div',
        { class: 'range-tools' },
        this.loop,
        this.heat,
        tool('fit', 'Show in the lanes', 'Show the selection in the lanes', (range) => events.onZoom(range)),
        tool('search', 'Filter the entries', 'Show its entries', (range) => events.onFilter(range)),
        tool('copy', 'Copy', 'Copy what is said here', () => this.copy(this.text(), 'The selection is copied')),
        tool('link', 'Copy a link', 'Copy a link to it', () => this.copy(events.link(), 'The link is copied')),
        tool('save', 'Edits: save as an edit list', 'Save an edit list for zulm cut and zulm retime', (range) => this.saveEdits(range), 'Edits'),
        this.concat,
        tool('close', 'Select nothing', 'Select nothing  Esc', () => selection.clear()),
      ),
    );
    byId('timeline').append(this.element);
    new ResizeObserver(() => this.makeRoom()).observe(this.element);
  }

  /// What lies over the lanes ends above the bar.
  private makeRoom(): void {
    const { offsetHeight } = this.element;
    document.documentElement.style.setProperty('--range-bar', `${offsetHeight}px`);
  }

  show(): void {
    const { range, loops, hasHeat } = this.selection;
    this.element.hidden = !range;
    this.makeRoom();
    this.loop.setAttribute('aria-pressed', String(loops));
    this.heat.setAttribute('aria-pressed', String(hasHeat));
    this.concat.disabled = !this.events.hasMovie();
    if (range === this.told) return;
    this.told = range;
    const asked = ++this.asked;
    clearTimeout(this.timer);
    if (!range) return;
    setText(this.times, `${clock(range.from)} – ${clock(range.to)}`);
    this.lines = [
      ['From', clock(range.from)],
      ['To', clock(range.to)],
      ['Length', `${decimal(range.to - range.from)} s`],
    ];
    setText(this.facts, `${decimal(range.to - range.from)} s`);
    this.element.classList.add('is-asking');
    this.timer = setTimeout(() => void this.ask(range, asked), patience);
  }

  /// What was told before is not true any more.
  forget(): void {
    this.told = undefined;
  }

  /// One question at a time: while the library works, only the last selection counts.
  private async ask(range: Range, asked: number): Promise<void> {
    if (this.isAsking) return;
    this.isAsking = true;
    try {
      const tables = await this.events.insights(range);
      if (asked === this.asked) this.tell(...(tables.map((table) => new Track(table)) as [Track, Track]));
    } catch (error) {
      if (asked === this.asked) this.events.onProblem(`The selection cannot be looked at: ${wordsOf(error)}.`);
    } finally {
      this.isAsking = false;
      if (asked === this.asked) this.element.classList.remove('is-asking');
      else if (this.told) void this.ask(this.told, this.asked);
    }
  }

  private tell(activity: Track, applications: Track): void {
    const number = (name: string) => activity.number(name, 0);
    const names = Array.from({ length: applications.count }, (_, i) => ({
      name: shown(String(applications.entries.columns.name![i] || 'No name')),
      time: `${clock(Number(applications.entries.columns.duration![i]), 1)}`,
    }));
    const known: [string, string][] = [
      ['Clicks', count(number('clicks'))],
      ['Keys', count(number('keys'))],
      ['Idle', `${clock(number('idle'), 1)}`],
      ['Distance', `${count(Math.round(number('distance')))} px`],
    ];
    this.lines.push(...known, ...names.map(({ name, time }): [string, string] => [`Application ${name}`, time]));
    const more = names.length > mostNames ? ` and ${names.length - mostNames} more` : '';
    const words = [
      this.lines[2]![1],
      plural(number('clicks'), 'click'),
      plural(number('keys'), 'key'),
      `idle ${known[2]![1]}`,
      known[3]![1],
      names.slice(0, mostNames).map(({ name, time }) => `${name} ${time}`).join(', ') + more,
    ];
    setText(this.facts, words.filter(Boolean).join(' · '));
    this.facts.title = this.text();
  }

  private text(): string {
    return this.lines.map(([name, value]) => `${name}\t${value}\n`).join('');
  }

  private async copy(text: string, done: string): Promise<void> {
    try {
      await copyText(text);
      announce(done);
    } catch (error) {
      this.events.onProblem(`The selection could not be copied: ${wordsOf(error)}.`);
    }
  }

  switchLoop(): void {
    if (!this.selection.range) return announce('Nothing is selected');
    this.selection.loops = !this.selection.loops;
    announce(this.selection.loops ? 'The selection repeats' : 'The selection does not repeat');
    this.selection.onChange();
  }

  private switchHeat(): void {
    this.selection.hasHeat = !this.selection.hasHeat;
    this.selection.onChange();
  }

  private saveEdits(range: Range): void {
    saveText(`${this.events.movieName()}.edits.json`, editListOf(range), 'application/json');
  }

  private saveConcat(range: Range): void {
    saveText(`${this.events.movieName()}.ffconcat`, concatListOf(range, this.events.movieName()), 'text/plain');
  }
}
