// The dialog in which the lanes are arranged: with the keyboard, or if there is no room to drag.

import { fillDialog } from '../ui/dialogs';
import { announce, byId, make } from '../ui/dom';
import { setIcon } from '../ui/icons';
import type { Arrangement } from './arrangement';
import type { Lane } from './lane';

export interface LanesPage {
  readonly lanes: Lane[];
  readonly arrangement: Arrangement;
  /// Called after the arrangement was changed.
  rearrange(): void;
  resetLanes(): void;
}

const step = 6; // pixels that a lane grows by

function tool(icon: string, name: string, action: () => void, isPressed?: boolean): HTMLButtonElement {
  const button = make('button', {
    type: 'button',
    class: 'button is-icon is-small',
    'aria-label': name,
    title: name,
    ...(isPressed === undefined ? {} : { 'aria-pressed': String(isPressed) }),
  });
  setIcon(button, icon);
  button.addEventListener('click', action);
  return button;
}

class LanesDialog {
  private readonly list = make('ul', { class: 'lane-list' });

  constructor(private readonly page: LanesPage) {}

  show(): void {
    const reset = make('button', { type: 'button', class: 'button' }, 'As they were');
    reset.addEventListener('click', () => {
      this.page.resetLanes();
      this.fill();
    });
    const about = make('p', { class: 'quiet' }, 'Beside the lanes, drag a name to move its lane, and the edge below it to resize it.');
    const dialog = byId<HTMLDialogElement>('lanes-dialog');
    fillDialog(dialog, 'lanes-title', 'Lanes', about, this.list, make('div', { class: 'dialog-actions' }, reset));
    this.fill();
    dialog.showModal();
  }

  private fill(): void {
    const { arrangement, lanes } = this.page;
    const sorted = arrangement.sorted(lanes);
    this.list.replaceChildren(...sorted.map((lane, i) => this.row(lane, sorted[i - 1], sorted[i + 1])));
  }

  private row({ id, title, height }: Lane, before: Lane | undefined, after: Lane | undefined): HTMLElement {
    const { arrangement, lanes } = this.page;
    const act = (name: string, action: () => void, told: string) => () => {
      action();
      this.page.rearrange();
      this.fill();
      this.button(id, name)?.focus();
      announce(`${title} ${told}`);
    };
    const box = make('input', { type: 'checkbox', class: 'switch', role: 'switch', 'aria-label': `Show ${title}` });
    box.checked = !arrangement.isHidden(id);
    box.addEventListener('change', () => {
      arrangement.hide(id, !box.checked);
      this.page.rearrange();
      announce(`${title} ${box.checked ? 'shown' : 'hidden'}`);
    });
    const isPinned = arrangement.isPinned(id);
    const name = {
      pin: `Pin ${title}`,
      up: `Move ${title} up`,
      down: `Move ${title} down`,
      lower: `Make ${title} lower`,
      higher: `Make ${title} higher`,
    };
    const pin = act(name.pin, () => arrangement.pin(id, !isPinned), isPinned ? 'unpinned' : 'pinned');
    const move = (told: keyof typeof name, other: Lane | undefined) =>
      act(name[told], () => other && arrangement.move(lanes, id, other.id), `moved ${told}`);
    const resize = (told: 'lower' | 'higher', by: number) =>
      act(name[told], () => arrangement.resize(id, height + by), `is ${told}`);
    const [up, down] = [tool('up', name.up, move('up', before)), tool('down', name.down, move('down', after))];
    [up.disabled, down.disabled] = [!before, !after];
    const tools = make(
      'span',
      { class: 'lane-tools' },
      tool('pin', name.pin, pin, isPinned),
      up,
      down,
      tool('minus', name.lower, resize('lower', -step)),
      tool('plus', name.higher, resize('higher', step)),
    );
    const row = make('li', { 'data-lane': id }, box, make('span', { class: 'lane-name' }, title), tools);
    row.addEventListener('keydown', (event) => {
      const button = event.altKey && { ArrowUp: up, ArrowDown: down }[event.key];
      if (!button) return;
      event.preventDefault();
      button.click();
    });
    return row;
  }

  private button(lane: string, name: string): HTMLElement | undefined {
    const row = [...this.list.children].find((row) => (row as HTMLElement).dataset.lane === lane);
    const buttons = [...(row?.querySelectorAll<HTMLButtonElement>('button') ?? [])];
    const wanted = buttons.find((button) => button.getAttribute('aria-label') === name);
    return wanted?.disabled ? buttons.find(({ disabled }) => !disabled) : wanted;
  }
}

export function arrangeLanes(page: LanesPage): void {
  new LanesDialog(page).show();
}
