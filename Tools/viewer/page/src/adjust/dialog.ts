// The dialog in which a reader says how the recording belongs to the movie.

import { decimal, decimalsOf } from '../model/decimals';
import { fillDialog } from '../ui/dialogs';
import { byId, make } from '../ui/dom';
import { asRecorded, regionOf, type Adjustment } from './adjustment';

export interface AdjustEvents {
  /// The movie is undefined if it stays, and null if it is to be that of the recording.
  onAdjust: (adjustment: Adjustment, movie?: File | null) => void;
}

const regionNames = ['Left', 'Top', 'Width', 'Height'];

export function showAdjusting({ offset, region }: Adjustment, events: AdjustEvents): void {
  const dialog = byId<HTMLDialogElement>('adjust-dialog');
  const field = (name: string, value: string) => make('input', { class: 'field', value, 'aria-label': name, inputmode: 'decimal' });
  const offsetField = field('Offset in seconds', decimal(offset));
  const numbers = region && [region.x, region.y, region.width, region.height];
  const regionFields = regionNames.map((name, i) => field(name, numbers ? decimal(numbers[i]!) : ''));
  const labelled = regionFields.map((input, i) => make('label', {}, regionNames[i]!, input));
  const movie = make('input', { type: 'file', accept: '.mp4,.mov,.avi,.webm,.mkv,video/*', 'aria-label': 'Another movie' });
  const form = make(
    'form',
    { method: 'dialog', class: 'adjust' },
    make('p', {}, 'If the movie was cut or coded again, say here how the recording belongs to it. The file stays as it is.'),
    row('Offset', 'Seconds that are added to every time: −12.5 if the movie lacks the first 12.5 seconds.', offsetField),
    row('Region', 'What the movie shows, in units of the display. Empty: as recorded.', ...labelled),
    row('Movie', 'Another movie to show the recording over.', movie),
    make(
      'div',
      { class: 'dialog-actions' },
      action('As recorded', '', () => finish(asRecorded, null)),
      make('button', { class: 'button is-primary', type: 'submit' }, 'Apply'),
    ),
  );
  const finish = (adjustment: Adjustment, movie?: File | null) => {
    dialog.close();
    events.onAdjust(adjustment, movie);
  };
  form.addEventListener('submit', (event) => {
    event.preventDefault();
    const written = readFields(offsetField, regionFields);
    if (written) finish(written, movie.files?.[0]);
  });
  form.addEventListener('input', () => [offsetField, ...regionFields].forEach((input) => input.setCustomValidity('')));
  fillDialog(dialog, 'adjust-title', 'How the recording belongs to the movie', form);
  dialog.showModal();
}

function row(title: string, text: string, ...fields: HTMLElement[]): HTMLElement {
  return make(
    'fieldset',
    {},
    make('legend', {}, title),
    make('p', { class: 'quiet' }, text),
    make('div', { class: 'adjust-fields' }, ...fields),
  );
}

function action(name: string, kind: string, act: () => void): HTMLButtonElement {
  const button = make('button', { class: `button ${kind}`, type: 'button' }, name);
  button.addEventListener('click', act);
  return button;
}

/// Undefined, after a field has said why, if something cannot be read.
function readFields(offset: HTMLInputElement, region: HTMLInputElement[]): Adjustment | undefined {
  const valueOf = ({ value }: HTMLInputElement) => value.trim().replace('−', '-').replace(',', '.');
  const complain = (input: HTMLInputElement, text: string) => {
    input.setCustomValidity(text);
    input.reportValidity();
    return undefined;
  };
  const [seconds] = decimalsOf([valueOf(offset) || '0']) ?? [];
  if (seconds === undefined) return complain(offset, 'Write a number of seconds such as -12.5.');
  const texts = region.map(valueOf);
  if (texts.every((text) => text === '')) return { offset: seconds, region: undefined };
  const rect = regionOf(decimalsOf(texts));
  return rect ? { offset: seconds, region: rect } : complain(region[0]!, 'Write four numbers, with a width and a height above 0.');
}
