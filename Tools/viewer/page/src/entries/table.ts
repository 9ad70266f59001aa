// A table that stays smooth however long it is: only the rows in sight are elements.

import { countUntil } from '../model/search';
import { make, setText } from '../ui/dom';
import { measured } from '../ui/marks';
import { uiScale } from '../ui/scale';
import type { Rows } from './rows';
import type { SortOrder } from './sorter';
import { Thumbnails } from './thumbnails';

const rowLines = 24; // pixels of a row where text has its usual size
const tallest = 16_000_000; // pixels: browsers do not lay out much more

/// What was cut is told where the pointer rests.
function showWhole(cell: HTMLElement): void {
  if (cell.scrollWidth > cell.clientWidth) cell.title = cell.textContent ?? '';
  else cell.removeAttribute('title');
}

const sampled = 200; // rows, all along the stream
const letter = 0.45; // times the size of the text, with room for the widest digits

/// What a column needs, in multiples of the usual size: a number is never cut, a text may be.
function leastWidth(rows: Rows, column: number): number {
  const { name, title, isNumber } = rows.columns[column]!;
  if (column === 0) return 4.75;
  if (name === 'kind') return 8;
  const head = Math.max(3.5, title.length * letter);
  if (!isNumber) return Math.max(7, head);
  let longest = title.length;
  const step = Math.max(1, Math.floor(rows.count / sampled));
  for (let row = 0; row < rows.count; row += step) longest = Math.max(longest, rows.cell(row, column).length);
  return Math.max(head, Math.min(longest, 22) * letter);
}

export class Table {
  onActivate: (row: number) => void = () => {};
  /// Told when other rows are selected.
  onSelect: () => void = () => {};
  /// Asked to sort by a column.
  onSort: (column: number) => void = () => {};
  private rows: Rows | undefined;
  /// The rows to show; null is all of them.
  private chosen: Uint32Array | null = null;
  /// The place of each row, if they have another order than their own.
  private places: Int32Array | null = null;
  private readonly thumbnails = new Thumbnails();
  private readonly head = make('div', { class: 'table-head', role: 'row', 'aria-rowindex': 1 });
  private readonly space = make('div', { class: 'table-space', role: 'rowgroup' });
  private readonly scroller = make('div', { class: 'table', role: 'grid', tabindex: 0, 'aria-label': 'Entries' });
  private pool: HTMLElement[] = [];
  private rowHeight = rowLines;
  private current = -1;
  /// Places of the chosen rows, the second one where the selection was begun.
  private selected = -1;
  private anchor = -1;
  /// Whether the reader selected them, and did not only come by.
  private isSelection = false;
  /// Pixels above the first row in sight if every row had its height, and where the scroll bar was put for them.
  private top = 0;
  private barTop = 0;

  constructor() {
    this.scroller.append(make('div', { role: 'rowgroup', class: 'table-top' }, this.head), this.space);
    this.scroller.addEventListener('scroll', () => measured('zulm:table', () => this.scrolled()));
    this.scroller.addEventListener('wheel', (event) => this.wheel(event), { passive: false });
    this.scroller.addEventListener('keydown', (event) => this.press(event));
    this.space.addEventListener('click', (event) => this.click(event));
    this.space.addEventListener('pointerover', ({ target }) => showWhole(target as HTMLElement));
    const observer = new ResizeObserver(() => this.resize());
    observer.observe(this.scroller);
    observer.observe(this.head); // is as high as its text
  }

  show(rows: Rows): void {
    [this.rows, this.chosen, this.places, this.current] = [rows, null, null, -1];
    this.thumbnails.clear();
    this.place(-1, -1, false);
    const least = rows.columns.map((_, column) => leastWidth(rows, column));
    const widths = rows.columns.map(({ name, isNumber }, i) =>
      i === 0 || name === 'kind' ? `${least[i]}rem` : `minmax(${least[i]}rem, ${isNumber ? 1 : 2}fr)`,
    );
    this.scroller.style.setProperty('--columns', widths.join(' '));
    this.scroller.style.setProperty('--least', `${least.reduce((sum, width) => sum + width + 0.625, 1)}rem`);
    this.head.replaceChildren(
      ...rows.columns.map(({ title, isNumber }, column) =>
        make(
          'div',
          { role: 'columnheader', class: isNumber ? 'is-number' : undefined, title },
          rows.isSortable(column) ? this.sortButton(title, column) : title,
        ),
      ),
    );
    for (const element of this.pool) element.remove();
    this.pool = [];
    this.scroller.setAttribute('aria-colcount', String(rows.columns.length));
    this.top = 0;
    this.resize();
  }

  private sortButton(title: string, column: number): HTMLElement {
    const button = make('button', { type: 'button', class: 'sort', 'aria-label': `Sort by ${title}` }, title);
    button.addEventListener('click', () => this.onSort(column));
    return button;
  }

  /// Tells by which column the rows are sorted.
  showOrder(order: SortOrder | undefined): void {
    [...this.head.children].forEach((cell, column) => {
      if (order?.column !== column) cell.removeAttribute('aria-sort');
      else cell.setAttribute('aria-sort', order.isDescending ? 'descending' : 'ascending');
    });
  }

  /// Rows in another order than their own come with the place of each of them.
  choose(chosen: Uint32Array | null, places: Int32Array | null = null): void {
    const { current } = this;
    const row = current >= 0 && current < this.shownCount ? this.rowAt(current) : -1;
    [this.chosen, this.places] = [chosen, places];
    this.current = row >= 0 ? this.placeOf(row) : -1;
    this.place(-1, -1, false);
    this.resize();
  }

  get shownCount(): number {
    return this.chosen?.length ?? this.rows?.count ?? 0;
  }

  get selectedCount(): number {
    return this.isSelection ? Math.abs(this.selected - this.anchor) + 1 : 0;
  }

  /// The number of rows that `wanted` returns.
  get wantedCount(): number {
    return this.selectedCount || this.shownCount;
  }

  /// The rows that are selected, or all that are shown.
  *wanted(): Generator<number> {
    const first = this.isSelection ? Math.min(this.selected, this.anchor) : 0;
    const end = this.isSelection ? first + this.selectedCount : this.shownCount;
    for (let place = first; place < end; ++place) yield this.rowAt(place);
  }

  /// The rows that are selected, or the one at the playhead.
  wantedHere(): Iterable<number> {
    if (this.isSelection) return this.wanted();
    return this.current >= 0 && this.current < this.shownCount ? [this.rowAt(this.current)] : [];
  }

  /// Marks the row that holds at the playhead; keeps it in sight where `follows`.
  setCurrent(row: number, follows: boolean): void {
    const place = this.placeOf(row);
    if (place === this.current) return;
    this.current = place;
    if (follows && place >= 0 && !this.places) this.reveal(place);
    this.draw();
  }

  /// Marks a row that the reader went to.
  visit(row: number): void {
    const place = this.placeOf(row);
    this.place(place, place, false);
    this.reveal(place);
    this.draw();
  }

  private place(selected: number, anchor: number, isSelection: boolean): void {
    [this.selected, this.anchor, this.isSelection] = [selected, anchor, isSelection];
    this.onSelect();
  }

  refresh(): void {
    for (const element of this.pool) delete element.dataset.row;
    this.draw();
  }

  get element(): HTMLElement {
    return this.scroller;
  }

  /// Below the head, which stays.
  private get room(): number {
    return this.scroller.clientHeight - this.head.offsetHeight;
  }

  private rowAt(place: number): number {
    return this.chosen ? this.chosen[place]! : place;
  }

  /// Of the row itself or the last one before it that is shown.
  private placeOf(row: number): number {
    if (this.places) return this.places[row] ?? -1;
    if (!this.chosen) return row;
    return countUntil(this.chosen, row) - 1;
  }

  private resize(): void {
    const { top, rowHeight } = this;
    this.rowHeight = rowLines * uiScale();
    this.space.style.height = `${Math.min(tallest, this.shownCount * this.rowHeight)}px`;
    this.scroller.setAttribute('aria-rowcount', String(this.shownCount + 1));
    this.scrollTo((top / rowHeight) * this.rowHeight); // the first row stays
    this.refresh();
  }

  /// Rows to a pixel of scrolling.
  private get density(): number {
    const { room } = this;
    const whole = this.shownCount * this.rowHeight;
    return whole <= tallest ? 1 : (whole - room) / (tallest - room);
  }

  private scrollTo(top: number): void {
    const { scroller, density } = this;
    this.top = Math.max(0, Math.min(top, this.shownCount * this.rowHeight - this.room));
    scroller.scrollTop = this.top / density;
    this.barTop = scroller.scrollTop;
  }

  /// By the scroll bar or the browser: it says where to be as exactly as it can.
  private scrolled(): void {
    const { scrollTop } = this.scroller;
    if (scrollTop !== this.barTop) [this.barTop, this.top] = [scrollTop, scrollTop * this.density];
    this.draw();
  }

  /// In a table that is too long for the browser a pixel of the scroll bar is many rows, but not a pixel of the wheel.
  private wheel(event: WheelEvent): void {
    if (this.density === 1 || event.ctrlKey || event.shiftKey || Math.abs(event.deltaX) > Math.abs(event.deltaY)) return;
    event.preventDefault();
    const unit = [1, 16, this.room][event.deltaMode] ?? 1;
    measured('zulm:table', () => {
      this.scrollTo(this.top + event.deltaY * unit);
      this.draw();
    });
  }

  private reveal(place: number): void {
    const { top, room } = this;
    const y = place * this.rowHeight;
    if (room <= 0 || (y >= top && y + this.rowHeight <= top + room)) return;
    const isNear = y > top - room && y < top + 2 * room;
    this.scrollTo(isNear ? (y < top ? y : y + this.rowHeight - room) : y - room / 2);
  }

  private draw(): void {
    const { rows, scroller, top } = this;
    if (!rows || this.room <= 0) return;
    const first = Math.max(0, Math.floor(top / this.rowHeight) - 4);
    const end = Math.min(this.shownCount, first + Math.ceil(this.room / this.rowHeight) + 9);
    while (this.pool.length < end - first) this.pool.push(this.newRow(rows.columns));
    this.pool.forEach((element, i) => {
      const place = first + i;
      element.hidden = place >= end;
      if (place >= end) return;
      element.style.transform = `translateY(${scroller.scrollTop + place * this.rowHeight - top}px)`;
      this.fill(element, rows, place);
    });
  }

  private newRow(columns: Rows['columns']): HTMLElement {
    const cells = columns.map(({ isNumber }) =>
      make('div', { role: 'gridcell', class: isNumber ? 'is-number' : undefined }),
    );
    const row = make('div', { class: 'table-row', role: 'row' }, ...cells);
    this.space.append(row);
    return row;
  }

  private fill(element: HTMLElement, rows: Rows, place: number): void {
    const row = this.rowAt(place);
    element.classList.toggle('is-current', place === this.current);
    const [low, high] = [Math.min(this.selected, this.anchor), Math.max(this.selected, this.anchor)];
    const isSelected = this.selected >= 0 && place >= low && place <= high;
    element.classList.toggle('is-selected', isSelected);
    element.setAttribute('aria-selected', String(isSelected));
    if (place === this.selected) this.scroller.setAttribute('aria-activedescendant', (element.id = 'row-selected'));
    else element.removeAttribute('id');
    if (element.dataset.row === String(row)) return;
    element.dataset.row = String(row);
    element.setAttribute('aria-rowindex', String(place + 2));
    [...element.children].forEach((cell, column) => {
      const isPicture = column === rows.pictureColumn;
      if (isPicture) this.thumbnails.remove(cell as HTMLElement);
      setText(cell as HTMLElement, rows.cell(row, column));
      if (isPicture) this.thumbnails.place(cell as HTMLElement, rows.appearance(row));
    });
  }

  private click(event: MouseEvent): void {
    const element = (event.target as Element).closest<HTMLElement>('.table-row');
    if (element?.dataset.row === undefined || !this.rows) return;
    const row = Number(element.dataset.row);
    const place = this.placeOf(row);
    if (!event.shiftKey) this.onActivate(row);
    this.place(place, event.shiftKey && this.anchor >= 0 ? this.anchor : place, true);
    this.draw();
  }

  private press(event: KeyboardEvent): void {
    if (this.head.contains(event.target as Node)) return;
    const page = Math.max(1, Math.floor(this.room / this.rowHeight) - 1);
    const last = this.shownCount - 1;
    const from = this.selected >= 0 ? this.selected : Math.max(0, this.current);
    const places: Record<string, number> = {
      ArrowUp: from - 1,
      ArrowDown: this.selected >= 0 ? from + 1 : from,
      PageUp: from - page,
      PageDown: from + page,
      Home: 0,
      End: last,
    };
    if (event.key === 'Enter' && this.selected >= 0) this.onActivate(this.rowAt(this.selected));
    else if (event.key === 'Escape' && this.isSelection) this.place(-1, -1, false);
    else if (event.key === 'a' && (event.ctrlKey || event.metaKey) && last >= 0) this.place(last, 0, true);
    else if (event.key in places && last >= 0) {
      const place = Math.max(0, Math.min(places[event.key]!, last));
      this.place(place, event.shiftKey && this.anchor >= 0 ? this.anchor : place, true);
      this.reveal(place);
    } else return;
    this.draw();
    this.draw(); // once more where scrolling brought other rows
    event.preventDefault();
    event.stopPropagation();
  }
}
