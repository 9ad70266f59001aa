// Help, about and questions.

import licences from '#licences';
import { byId, make } from './dom';
import { setIcon } from './icons';

const keys: [string, string][] = [
  ['space', 'Play or pause'],
  ['← →', 'One second back or on; ten with Shift'],
  [', .', 'One frame back or on'],
  ['j k l', 'Play back, stop, play on; again is faster, up to 16 times'],
  ['g', 'Go to a time such as 1:23.5, or to a picture such as #120'],
  ['[ ]', 'Previous or next marker: click, window, slide'],
  ['Home End', 'To the start or the end'],
  ['+ − 0', 'Zoom the lanes in or out, show all'],
  ['< >', 'Move the lanes back or on'],
  ['a', 'Arrange the lanes: hide, move, resize, pin'],
  ['b', 'Write a note at the playhead'],
  ['/', 'Filter the entries'],
  ['n N', 'Next or previous match'],
  ['Ctrl C', 'Copy the selected entries as CSV; Esc selects none'],
  ['i o', 'The selection begins or ends here'],
  ['Shift ← →', 'In the timeline: select; with Home or End up to there'],
  ['r Esc', 'Play the selection again and again; select nothing'],
  ['s', 'Skip times in which nothing was done'],
  ['z Z', 'Zoom the movie in or out; arrow keys move it'],
  ['t', 'Show or mask the keys that were typed'],
  ['1 – 7', 'Switch a layer: cursor, clicks, keys, trail, window, hover, heat map'],
  ['8 9 p', 'Switch a layer: suggested zoom, groups of clicks, smooth path'],
  ['m', 'Sound on or off'],
  ['f', 'Full screen'],
  ['?', 'This help'],
];

const gestures: [string, string][] = [
  ['Wheel', 'Scroll; with Ctrl zoom the lanes at the pointer, with Shift move them'],
  ['Drag', 'Move the lanes, or the playhead where all is in sight'],
  ['Click', 'Go there, in a lane or in the table'],
  ['Drag', 'The name of a lane to another place, or the edge below it to another height'],
  ['Link', 'The address holds the time, the range, the zoom, the stream, the filter and the layers'],
  ['Shift drag', 'Select a range of time, in the lanes or the ruler'],
  ['Ctrl wheel', 'Over the movie: zoom it; drag moves it then'],
];

function rows(entries: [string, string][]): HTMLElement {
  return make(
    'dl',
    { class: 'keys' },
    ...entries.flatMap(([key, text]) => [
      make('dt', {}, ...key.split(' ').map((part) => (part === '–' ? part : make('kbd', {}, part)))),
      make('dd', {}, text),
    ]),
  );
}

export function fillDialog(dialog: HTMLDialogElement, id: string, title: string, ...content: Node[]): void {
  const close = make('button', { type: 'button', class: 'button is-icon', 'aria-label': 'Close' });
  setIcon(close, 'close');
  close.addEventListener('click', () => dialog.close());
  dialog.replaceChildren(
    make('div', { class: 'dialog-head' }, make('h2', { id }, title), close),
    make('div', { class: 'dialog-body' }, ...content),
  );
  dialog.onclick = (event) => {
    if (event.target === dialog) dialog.close(); // beside it
  };
}

function aboutContent(): Node[] {
  return [
    make(
      'p',
      {},
      'Shows what was recorded beside a movie: read by the ZULMetaData library itself, compiled to WebAssembly and held inside this page.',
    ),
    make(
      'p',
      {},
      'The page works without a network. Its security policy forbids every connection: recordings stay on this computer.',
    ),
    make('h3', {}, 'What is inside'),
    make(
      'ul',
      { class: 'licences' },
      ...licences.map(({ name, licence, text }) =>
        make(
          'li',
          {},
          make(
            'details',
            {},
            make('summary', {}, make('b', {}, name), ` ${licence}`),
            make('pre', { tabindex: 0 }, text),
          ),
        ),
      ),
    ),
  ];
}

export function setUpDialogs(): void {
  const help = byId<HTMLDialogElement>('help-dialog');
  const about = byId<HTMLDialogElement>('about-dialog');
  fillDialog(help, 'help-title', 'Keys and gestures', rows(keys), make('h3', {}, 'Pointer'), rows(gestures));
  byId('help-button').addEventListener('click', showHelp);
  byId('about-button').addEventListener('click', () => {
    fillDialog(about, 'about-title', 'About this page', ...aboutContent());
    about.showModal();
  });
}

export function showHelp(): void {
  byId<HTMLDialogElement>('help-dialog').showModal();
}

/// Whether the reader agrees.
export function ask(title: string, text: string, yes: string): Promise<boolean> {
  const dialog = byId<HTMLDialogElement>('confirm-dialog');
  return new Promise((done) => {
    const button = (name: string, answer: boolean, kind: string) => {
      const element = make('button', { type: 'button', class: `button ${kind}` }, name);
      element.addEventListener('click', () => {
        done(answer);
        dialog.close();
      });
      return element;
    };
    fillDialog(
      dialog,
      'confirm-title',
      title,
      make('p', {}, text),
      make('div', { class: 'dialog-actions' }, button('Cancel', false, ''), button(yes, true, 'is-primary')),
    );
    dialog.addEventListener('close', () => done(false), { once: true });
    dialog.showModal();
  });
}
