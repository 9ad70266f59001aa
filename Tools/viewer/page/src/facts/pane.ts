// What is known of a recording as a whole, and what is wrong with it.

import type { StreamSummary } from '#decoder';
import type { Adjustment } from '../adjust/adjustment';
import { doubtsAbout } from '../model/checks';
import { brief, bytes, clock, count, memoryText, plural, shown, titleOf } from '../model/format';
import { decimal } from '../model/decimals';
import type { Size } from '../model/geometry';
import { idleTime } from '../model/idle';
import type { Finding, Session } from '../model/session';
import { byId, make } from '../ui/dom';
import { setIcon } from '../ui/icons';

type Fact = [string, string];

function section(title: string, ...content: Node[]): HTMLElement {
  return make('section', { class: 'facts' }, make('h3', {}, title), ...content);
}

function list(facts: Fact[]): HTMLElement {
  return make('dl', {}, ...facts.flatMap(([name, value]) => [make('dt', {}, shown(name)), make('dd', {}, shown(value))]));
}

export interface FactsEvents {
  onAdjust: () => void;
}

export function showFacts(session: Session, duration: number, adjustment: Adjustment, events: FactsEvents): void {
  const adjust = make('button', { class: 'button is-small is-outlined', type: 'button' }, 'Adjust…');
  adjust.addEventListener('click', events.onAdjust);
  byId('pane-facts').replaceChildren(
    section('Recording', list(recordingFacts(session, duration))),
    section('Screen', list(screenFacts(session, adjustment)), adjust),
    section('Activity', list(activityFacts(session))),
    ...optional('Made by', creatorFacts(session)),
    ...optional('Machine', machineFacts(session)),
    section('Streams', streamTable(session), ...hiddenNote(session)),
  );
}

function optional(title: string, facts: Fact[]): Node[] {
  return facts.length > 0 ? [section(title, list(facts))] : [];
}

function recordingFacts({ name, container, info }: Session, duration: number): Fact[] {
  const facts: Fact[] = [
    ['Name', name],
    ['Container', container],
    ['Length', clock(duration)],
  ];
  if (typeof info.bytes === 'number') facts.push(['Size', bytes(info.bytes)]);
  return facts;
}

function screenFacts({ region, scaleFactor }: Session, adjustment: Adjustment): Fact[] {
  const text = region ? `${region.width} × ${region.height} at ${region.x}, ${region.y}` : 'not recorded';
  const facts: Fact[] = [
    ['Recorded region', adjustment.region ? `${text}, set by hand` : text],
    ['Scale factor', brief(scaleFactor)],
  ];
  if (adjustment.offset !== 0) facts.push(['Offset of times', `${decimal(adjustment.offset)} s, set by hand`]);
  return facts;
}

function activityFacts(session: Session): Fact[] {
  const keys = session.track('keyboardAction')?.count ?? 0;
  const idle = idleTime(session.idle);
  const images = new Set(session.appearances.filter(({ image }) => image.length > 0).map(({ id }) => id)).size;
  return [
    ['Clicks', count(session.clicks.length)],
    ['Keys', count(keys)],
    ['Cursor images', count(images)],
    ['Idle', idle > 0 ? `${clock(idle, 0)} in ${plural(session.idle.length, 'stretch', 'stretches')}` : 'never'],
  ];
}

function creatorFacts({ info }: Session): Fact[] {
  return (info.creators ?? []).map(({ name = '', version = '', platform_version = '' }) => [
    name || 'Unknown',
    [version && `version ${version}`, platform_version && `platform ${platform_version}`].filter(Boolean).join(', '),
  ]);
}

const machineNames: Record<string, string> = {
  processorCount: 'Processors',
  activeProcessorCount: 'Active processors',
  osVersion: 'System',
  ram: 'Memory',
};

/// Texts such as "ProcessorCount:8" carry their own name in front.
function machineFacts(session: Session): Fact[] {
  const track = session.track('systemData');
  if (!track || track.count === 0) return [];
  return Object.entries(machineNames).map(([column, name]) => [
    name,
    memoryText(track.text(column, 0).replace(/^[A-Za-z]+:/, '')) || '–',
  ]);
}

function streamRow({ kind, uuid, entries, first, last, bytes: size, known }: StreamSummary, reason = ''): HTMLElement {
  const time = (value: number | undefined) => (value === undefined ? '–' : clock(value, 2));
  const cells = [known ? count(entries) : 'unknown', time(first), time(last), count(size)];
  const name = make('th', { scope: 'row', title: reason || uuid }, titleOf(kind));
  if (reason) name.append(' ', make('span', { class: 'tag' }, 'hidden'));
  return make('tr', { class: reason ? 'is-hidden' : undefined }, name, ...cells.map((text) => make('td', {}, text)));
}

/// Hidden streams stand below all that readers find.
function streamTable({ streams, hidden }: Session): HTMLElement {
  const head = make(
    'tr',
    {},
    ...['Stream', 'Entries', 'First', 'Last', 'Bytes'].map((title) => make('th', { scope: 'col' }, title)),
  );
  const rows = [
    ...streams.map((stream) => streamRow(stream)),
    ...hidden.map(({ stream, reason }) => streamRow(stream, reason)),
  ];
  return make(
    'div',
    { class: 'table-scroll', tabindex: 0, role: 'group', 'aria-label': 'Streams' },
    make('table', {}, make('thead', {}, head), make('tbody', {}, ...rows)),
  );
}

function hiddenNote({ hidden }: Session): Node[] {
  if (hidden.length === 0) return [];
  return [...new Set(hidden.map(({ reason }) => reason))].map((reason) =>
    make('p', { class: 'quiet hidden-note' }, make('span', { class: 'tag' }, 'hidden'), ` No reader finds it. ${reason}`),
  );
}

function allFindings({ verify }: Session): Finding[] {
  const ofStreams = (verify.streams ?? []).flatMap(({ kind, findings }) =>
    (findings ?? []).map((finding) => ({ kind, ...finding })),
  );
  return [...(verify.findings ?? []), ...ofStreams];
}

function sentence(finding: Finding): string {
  const text = finding.message ?? finding.text ?? finding.description;
  return typeof text === 'string' ? text : JSON.stringify(finding);
}

/// What `verify` found, and what else is doubtful.
export function showCheck(session: Session, movie: Size | undefined): void {
  const findings = [...allFindings(session), ...doubtsAbout(session, movie)];
  const isDamaged = session.verify.damaged === true;
  const verdict = make(
    'p',
    { class: `verdict ${isDamaged ? 'is-bad' : 'is-good'}` },
    make(
      'span',
      {},
      isDamaged
        ? 'This recording is damaged.'
        : findings.length
          ? 'Nothing is damaged.'
          : 'Nothing is wrong with this recording.',
    ),
  );
  setIcon(verdict, isDamaged ? 'bad' : 'good');
  const items = findings.map((finding) => {
    const place = [
      finding.place ?? finding.kind,
      typeof finding.offset === 'number' && `at offset ${count(finding.offset)}`,
    ]
      .filter(Boolean)
      .join(' ');
    return make(
      'li',
      { class: `finding is-${finding.severity ?? 'notice'}` },
      make('p', { class: 'quiet' }, shown(place)),
      make('p', {}, shown(sentence(finding))),
    );
  });
  byId('pane-verify').replaceChildren(
    verdict,
    ...(items.length ? [make('ul', { class: 'findings' }, ...items)] : []),
    coverage(session),
  );
  const badge = byId('finding-count');
  badge.hidden = findings.length === 0;
  badge.classList.toggle('is-bad', isDamaged);
  badge.textContent = String(findings.length);
}

function coverage(session: Session): HTMLElement {
  const streams = [...session.streams, ...session.hidden.map(({ stream }) => stream)];
  const entries = streams.reduce((sum, stream) => sum + stream.entries, 0);
  return make(
    'p',
    { class: 'quiet' },
    `${plural(streams.length, 'stream')} with ${plural(entries, 'entry', 'entries')} were checked.`,
  );
}
