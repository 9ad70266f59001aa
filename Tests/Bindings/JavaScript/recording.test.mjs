// The module against the tool: both are the same library.

import assert from 'node:assert/strict';
import { join } from 'node:path';
import { after, test } from 'node:test';
import { bytesOf, load, recordedSession, reportsOf, temporaryFolder, zulm } from './support.mjs';

const { Recording, ZulmError } = await load('zulmetadata.js');
const folder = temporaryFolder(after);
const { movie, streams } = recordedSession(folder);

const open = (file) => Recording.open(bytesOf(file), file);

const entriesOf = (dump) => JSON.parse(dump).files[0].streams;

/** An entry of a dump out of columns, as far as it is the same in both. */
function entryAt({ time, columns }, index) {
  const entry = {};
  for (const [name, column] of Object.entries(columns)) {
    const value = column[index];
    if (name === 'image') entry.image = value && value.length;
    else entry[name] = typeof value === 'bigint' ? String(value) : value;
  }
  return { ...entry, timestamp: time[index] };
}

function comparable(printed) {
  const { timestamp_f32, image, ...entry } = printed;
  return 'image' in printed ? { image: image && image.bytes, ...entry } : entry;
}

for (const file of [movie, ...streams])
  test(`tells what the tool tells of ${file.split('/').pop()}`, async () => {
    const recording = await open(file);
    assert.equal(recording.dump(), zulm('dump', '--format', 'json', file).stdout);
    assert.deepEqual(recording.info(), reportsOf('info', [file]).get(file));
    assert.deepEqual(recording.verify(), reportsOf('verify', [file]).get(file));
    recording.close();
  });

test('gives every entry of every stream in columns', async () => {
  const recording = await open(movie);
  for (const { kind, entries: printed } of entriesOf(recording.dump())) {
    const entries = recording.entries(kind);
    assert.equal(entries.kind, kind);
    assert.equal(entries.time.length, printed.length);
    for (const column of Object.values(entries.columns)) assert.equal(column.length, printed.length);
    for (let index = 0; index < printed.length; ++index)
      assert.deepEqual(entryAt(entries, index), comparable(printed[index]), `${kind} ${index}`);
  }
  assert.equal(recording.streams.length, 17);
});

test('gives columns of the types that are promised', async () => {
  const recording = await open(movie);
  const types = (kind) =>
    Object.fromEntries(
      Object.entries(recording.entries(kind).columns).map(([name, column]) => [name, column.constructor.name]),
    );
  assert.deepEqual(types('cursorLocation'), { x: 'Int32Array', y: 'Int32Array' });
  assert.deepEqual(types('cpuUsage'), { cpuUsage: 'Float64Array' });
  assert.deepEqual(types('slideTitles'), { title: 'Array' });
  assert.deepEqual(types('cursorImage'), {
    image: 'Array',
    id: 'BigUint64Array',
    hotspotOffsetX: 'Int32Array',
    hotspotOffsetY: 'Int32Array',
  });
  const images = recording.entries('cursorImage').columns.image;
  assert.deepEqual([...images[0].subarray(0, 4)], [0x89, 0x50, 0x4e, 0x47]); // a PNG file
  assert.equal(images.at(-1), null);
});

test('joins keys into the captions that the tool writes', async () => {
  const recording = await open(movie);
  for (const showsKeys of [true, false]) {
    const { time, columns } = recording.insights('captions', { shows_keys: showsKeys });
    assert.ok(time.length > 0 && time.every((at, index) => index === 0 || at >= time[index - 1]));
    const texts = new Map();
    columns.label.forEach((label, index) => {
      const first = columns.first[index];
      const joint = index === first || (columns.is_typed[index - 1] && columns.is_typed[index]) ? '' : ' ';
      texts.set(first, (texts.get(first) ?? '') + joint + label);
      assert.ok(columns.end[index] > time[index]);
    });
    const { stdout } = zulm('convert', '--to', 'vtt', ...(showsKeys ? ['--show-keys'] : []), movie);
    const printed = stdout.split('\n\n').slice(1).map((cue) => cue.trim().split('\n')[1]);
    assert.deepEqual([...texts.values()], printed.filter(Boolean));
  }
});

test('sums every stream up', async () => {
  const recording = await open(movie);
  assert.equal(recording.container, 'movie');
  assert.equal(recording.duration, 20);
  const printed = reportsOf('info', [movie]).get(movie).streams;
  assert.deepEqual(
    recording.streams,
    printed.map(({ kind, uuid, version, entries, bytes, offset, first_time: first, last_time: last }) => ({
      ...{ kind, uuid, version, entries, bytes, offset, known: true },
      ...{ first, last },
    })),
  );
});

test('dumps the streams that are asked for', async () => {
  const recording = await open(movie);
  const args = ['--stream', 'slideTitles', '--stream', 'cpuUsage'];
  assert.equal(recording.dump(['slideTitles', 'cpuUsage']), zulm('dump', '--format', 'json', ...args, movie).stdout);
  assert.deepEqual(entriesOf(recording.dump([])), []);
});

test('takes kinds by their identifiers too', async () => {
  const recording = await open(movie);
  const { kind, uuid } = recording.streams.find(({ kind }) => kind === 'slideText');
  assert.deepEqual(recording.entries(uuid).columns, recording.entries(kind).columns);
});

test('gives what a later stream of its kind hides', async () => {
  const [file] = streams.filter((path) => path.endsWith('/slideText.dat'));
  const two = join(folder, 'Two.mp4');
  assert.equal(zulm('attach', movie, file, '--replace', '-o', two).status, 0);
  const recording = await open(two);
  assert.deepEqual(
    recording.hidden.map(({ kind, entries }) => [kind, entries]),
    [['slideText', 3]],
  );
  assert.deepEqual(recording.hiddenEntries(0), recording.entries('slideText'));
  assert.throws(() => recording.hiddenEntries(1), /hides no stream 1$/);
  assert.deepEqual((await open(movie)).hidden, []);
});

test('recognises containers without a name', async () => {
  for (const file of [movie, streams[0]]) {
    const recording = await Recording.open(bytesOf(file));
    assert.equal(recording.info().path, 'recording');
    assert.ok(recording.streams.length > 0);
  }
});

test('reads blobs, and calls them by their names', async () => {
  const recording = await Recording.open(new File([bytesOf(movie)], 'Mine.mp4'));
  assert.equal(recording.info().path, 'Mine.mp4');
  assert.equal((await Recording.open(new Blob([bytesOf(movie)]))).streams.length, 17);
});

test('says in words what it cannot do', async () => {
  const said = (message) => (error) => error instanceof ZulmError && error.message === message;
  await assert.rejects(
    Recording.open(new Uint8Array(100), 'notes.txt'),
    said('notes.txt: begins neither like a movie, nor a RIFF file, nor a stream'),
  );
  await assert.rejects(Recording.open('Recording.mp4'), said('a recording is opened from a Blob, a Uint8Array or a source of bytes'));
  const recording = await Recording.open(bytesOf(movie), 'Mine.mp4');
  assert.throws(() => recording.entries('caretPosition'), said('Mine.mp4: holds no stream caretPosition'));
  assert.throws(() => recording.dump(['nothing']), said('Mine.mp4: holds no stream nothing'));
  recording.close();
  assert.throws(() => recording.info(), said('Mine.mp4: is closed'));
});

test('has no captions without keys', async () => {
  const recording = await open(streams.find((path) => path.endsWith('/slideText.dat')));
  assert.equal(recording.insights('captions').time.length, 0);
});

test('keeps what it gave out when it is closed', async () => {
  const recording = await open(movie);
  const { columns } = recording.entries('cursorImage');
  const copy = structuredClone(columns);
  recording.close();
  assert.deepEqual(columns, copy);
});

test('is one file where nothing may be loaded', async () => {
  const single = await load('zulmetadata.single.js');
  const recording = await single.Recording.open(bytesOf(movie), movie);
  assert.equal(recording.dump(), (await open(movie)).dump());
});
