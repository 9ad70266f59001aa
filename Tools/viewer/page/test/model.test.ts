import assert from 'node:assert/strict';
import { test } from 'node:test';
import type { Column, Entries, Table } from '#decoder';
import { withNotes } from '../src/lanes/lanes';
import { appearancesIn } from '../src/model/appearances';
import { clickLabel, clicksAround, clicksIn } from '../src/model/clicks';
import { bytes, clock, plural, spokenTime, titleOf } from '../src/model/format';
import { idleIn, idleTime } from '../src/model/idle';
import { heatHeight, heatOf, heatWidth } from '../src/model/heat';
import { placementOf } from '../src/model/geometry';
import { linkTo, timeInLink } from '../src/model/link';
import { markerAfter, markerBefore } from '../src/model/markers';
import { countBefore, countUntil, lastAt } from '../src/model/search';
import { Session, type Decoded } from '../src/model/session';
import { Track } from '../src/model/track';

export function entries(kind: string, time: number[], columns: Record<string, Column> = {}): Entries {
  return { kind, time: Float64Array.from(time), columns };
}

function session(list: Entries[], tables: Partial<Decoded> = {}): Session {
  const decoded: Decoded = {
    name: 'Test.mp4',
    container: 'movie',
    duration: 20,
    length: 8,
    streams: [],
    entries: list,
    keys: undefined,
    clicks: undefined,
    idle: undefined,
    appearances: undefined,
    hidden: [],
    info: {},
    verify: {},
    ...tables,
  };
  return new Session(decoded);
}

test('searching counts what lies before a time', () => {
  const times = [1, 2, 2, 3];
  assert.equal(countBefore(times, 2), 1);
  assert.equal(countUntil(times, 2), 3);
  assert.equal(lastAt(times, 0.5), -1);
  assert.equal(lastAt(times, 9), 3);
  assert.equal(countBefore([], 1), 0);
});

test('a track brings its entries into the order of their times, and leaves out those without', () => {
  const track = new Track(
    entries('scrollAction', [3, Number.NaN, 1, 2, Infinity], { y: Int32Array.of(30, 0, 10, 20, 0) }),
  );
  assert.deepEqual([...track.times], [1, 2, 3]);
  assert.deepEqual(
    [0, 1, 2].map((i) => track.number('y', i)),
    [10, 20, 30],
  );
  assert.equal(track.row(0), 2);
  assert.equal(track.at(2.5), 1);
});

test('an appearance is what the library knows at the time of an entry', () => {
  const arrow = Uint8Array.of(1);
  const shown = appearancesIn({
    kind: 'states',
    time: Float64Array.of(0, 1),
    columns: {
      cursor_id: ['9', '7'],
      picture: [null, arrow],
      hotspot_x: Float64Array.of(NaN, 5),
      hotspot_y: Float64Array.of(NaN, 3),
    },
  });
  assert.deepEqual(
    shown.map(({ id, image }) => [id, image.length]),
    [
      ['9', 0],
      ['7', 1],
    ],
  );
  assert.deepEqual(shown[1]!.hotSpot, { x: 5, y: 3 });
  assert.deepEqual(appearancesIn(undefined), []);
});

const clickTable: Table = {
  kind: 'clicks',
  time: Float64Array.of(1, 2, 4),
  columns: {
    end: Float64Array.of(2.5, 3, 5),
    button: ['left', 'right', 'middle'],
    modifiers: ['shift+cmd', '', ''],
  },
};

test('a click has its button and its modifiers', () => {
  const clicks = clicksIn(clickTable);
  assert.deepEqual(
    clicks.map(({ button, start, end }) => [button, start, end]),
    [
      ['left', 1, 2.5],
      ['right', 2, 3],
      ['middle', 4, 5],
    ],
  );
  assert.equal(clickLabel(clicks[0]!), '⇧⌘ left');
  const starts = Float64Array.from(clicks, ({ start }) => start);
  assert.deepEqual(
    clicksAround(clicks, starts, 2.2, 0.6).map(({ button }) => button),
    ['right', 'left'],
  );
  assert.deepEqual(clicksAround(clicks, starts, 3.5, 0.2), []);
});

test('markers are clicks, windows and slides', () => {
  const { markers } = session(
    [
      entries('topmostAppName', [0, 7], { name: ['Editor', 'Terminal'] }),
      entries('topmostWindowTitle', [0, 7.01], { title: ['a', 'b'] }),
      entries('slideTitles', [9], { title: ['One'] }),
    ],
    { clicks: clickTable },
  );
  assert.deepEqual([...markers], [0, 1, 2, 4, 7, 9]);
  assert.equal(markerAfter(markers, 4), 7);
  assert.equal(markerBefore(markers, 1), 0);
  assert.equal(markerAfter(markers, 9), undefined);
});

test('idle times are what the library tells', () => {
  const table: Table = {
    kind: 'idle',
    time: Float64Array.of(1, 8, 19),
    columns: { end: Float64Array.of(6, 18.5, 1e9) },
  };
  const stretches = idleIn(table, 20);
  assert.deepEqual(stretches, [
    { start: 1, end: 6 },
    { start: 8, end: 18.5 },
  ]);
  assert.equal(idleTime(stretches), 15.5);
  assert.deepEqual(idleIn(undefined, 20), []);
  const early = { kind: 'idle', time: Float64Array.of(-10), columns: { end: Float64Array.of(4) } };
  assert.deepEqual(idleIn(early, 20), [{ start: 0, end: 4 }], 'an offset moved it before the movie');
});

test('hidden characters of a note show themselves in its lane', () => {
  const notes = () => [{ time: 1, text: 'invoice\u202efdp.exe' }];
  const region = () => ({ x: 0, y: 0, width: 10, height: 10 });
  const [lane] = withNotes([], session([]), { showsKeys: () => false, region, notes });
  assert.equal(lane?.title, 'Notes');
  assert.equal(lane?.valueAt(1.2), 'invoice[U+202E]fdp.exe');
});

test('the last region with an area is the recorded one, and the movie says how long it is', () => {
  const recording = session([
    entries('recordingRegion', [0, 1], {
      x: Int32Array.of(1, 9),
      y: Int32Array.of(2, 9),
      width: Int32Array.of(3, 0),
      height: Int32Array.of(4, 9),
    }),
    entries('cpuUsage', [0, 25.5]),
  ]);
  assert.deepEqual(recording.region, { x: 1, y: 2, width: 3, height: 4 });
  assert.equal(recording.duration, 20);
});

test('a movie without a duration lasts as long as the library says', () => {
  assert.equal(session([], { duration: 20 }).duration, 20);
  assert.equal(session([], { duration: undefined }).duration, 8);
  assert.equal(session([], { duration: undefined }).movieDuration, undefined);
});

test('the place where the cursor stayed longest is the warmest', async () => {
  const track = new Track(
    entries('cursorLocation', [0, 1, 4], { x: Int32Array.of(320, 960, 100), y: Int32Array.of(270, 810, 100) }),
  );
  const placement = placementOf({ x: 0, y: 0, width: 1280, height: 1080 }, 1, undefined);
  const heat = await heatOf(track, placement, 0, 4);
  const at = (x: number, y: number) => heat[Math.floor(y * heatHeight) * heatWidth + Math.floor(x * heatWidth)]!;
  assert.equal(at(0.75, 0.75), 1);
  assert.ok(at(0.25, 0.25) > 0.4 && at(0.25, 0.25) < 0.7);
  assert.equal(at(0.5, 0.1), 0);
});

test('links tell a time', () => {
  assert.equal(timeInLink('#t=12.5'), 12.5);
  assert.equal(timeInLink('#x=1&t=3'), 3);
  assert.equal(timeInLink('#t=abc'), undefined);
  assert.equal(timeInLink(''), undefined);
  assert.equal(linkTo(12.5000001), '#t=12.5');
  assert.equal(linkTo(1.533334), '#t=1.533334', 'the picture after the one of 1.533');
});

test('numbers and times in words', () => {
  assert.equal(clock(3725.5), '1:02:05.500');
  assert.equal(clock(59.9999), '1:00.000');
  assert.equal(clock(61, 0), '1:01');
  assert.equal(clock(-1.25, 2), '−0:01.25');
  assert.equal(spokenTime(3661.5), '1 hour 1 minute 1.5 seconds');
  assert.equal(spokenTime(0), '0 seconds');
  assert.equal(bytes(1), '1 byte');
  assert.equal(bytes(1536), '1.5 kB');
  assert.equal(plural(1234, 'entry', 'entries'), '1,234 entries');
  assert.equal(titleOf('topmostAppName'), 'Topmost app name');
  assert.equal(titleOf('cpuUsage'), 'CPU usage');
});
