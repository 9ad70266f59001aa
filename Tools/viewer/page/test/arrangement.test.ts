import assert from 'node:assert/strict';
import { test } from 'node:test';
import { Arrangement } from '../src/lanes/arrangement';

const lanes = ['Slides', 'Clicks', 'Keys', 'Scroll'].map((id) => ({ id, height: 20 }));
const ids = (some: { id: string }[]) => some.map(({ id }) => id).join(' ');

test('a lane takes the place of another one, in both directions', () => {
  const arrangement = new Arrangement();
  arrangement.move(lanes, 'Scroll', 'Clicks');
  assert.equal(ids(arrangement.sorted(lanes)), 'Slides Scroll Clicks Keys');
  arrangement.move(lanes, 'Slides', 'Clicks');
  assert.equal(ids(arrangement.sorted(lanes)), 'Scroll Clicks Slides Keys');
});

test('lanes that another recording lacks keep their place', () => {
  const arrangement = new Arrangement();
  arrangement.move(lanes, 'Keys', 'Slides');
  const more = [...lanes.slice(0, 1), { id: 'Window', height: 9 }, ...lanes.slice(2)];
  assert.equal(ids(arrangement.sorted(more)), 'Keys Slides Window Scroll');
  assert.equal(ids(arrangement.sorted(lanes)), 'Keys Slides Clicks Scroll');
});

test('what was hidden, pinned and resized is so in the next visit', () => {
  const first = new Arrangement();
  first.hide('Clicks', true);
  first.pin('Scroll', true);
  first.resize('Keys', 1000);
  first.resize('Slides', 33.4);
  const { pinned, others } = Arrangement.read(first.text()).arranged(lanes);
  assert.equal(ids(pinned), 'Scroll');
  assert.deepEqual(others, [{ id: 'Slides', height: 33 }, { id: 'Keys', height: 240 }]);
  first.resize('Keys', undefined);
  assert.equal(first.sorted(lanes).find(({ id }) => id === 'Keys')?.height, 20);
});

test('a text that nobody wrote changes nothing', () => {
  for (const text of [null, '', '7', '{"order": 5}', '{"order": [1, "Keys", "Keys"], "lanes": {"Keys": {"height": "x"}}}'])
    assert.equal(Arrangement.read(text).sorted(lanes).length, 4);
});
