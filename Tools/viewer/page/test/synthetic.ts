// A recording of any length, with what a real one has: 60 cursor positions a second with rests, cursor images that come
// back, bursts of keys, clicks that were released, windows, slides and a busy machine.

import type { Column, Entries } from '#decoder';

/// Numbers that look random and are the same every time.
export function randomNumbers(seed: number): () => number {
  let state = seed >>> 0;
  return () => {
    state = (state + 0x6d2b79f5) >>> 0;
    let mixed = Math.imul(state ^ (state >>> 15), state | 1);
    mixed ^= mixed + Math.imul(mixed ^ (mixed >>> 7), mixed | 61);
    return ((mixed ^ (mixed >>> 14)) >>> 0) / 4294967296;
  };
}

const region = { x: 0, y: 0, width: 1920, height: 1080 };

const scenes = [
  { app: 'Editor', titles: ['main.cpp', 'Session.cpp', 'README.md'], window: [80, 60, 1400, 920] },
  { app: 'Terminal', titles: ['make test — 120×40', 'git log'], window: [620, 300, 1180, 700] },
  { app: 'Browser', titles: ['Reference — ranges', 'Weather', 'Release notes'], window: [160, 40, 1600, 1000] },
  { app: 'Slides', titles: ['Review 2026'], window: [0, 0, 1920, 1080] },
  { app: 'Mail', titles: ['Inbox', 'Re: Numbers'], window: [300, 140, 1200, 800] },
];

function entries(kind: string, time: number[] | Float64Array, columns: Record<string, Column>): Entries {
  return { kind, time: Float64Array.from(time), columns };
}

function cursorLocation(duration: number): Entries {
  const count = Math.round(duration * 60);
  const time = Float64Array.from({ length: count }, (_, i) => i / 60);
  const x = new Int32Array(count);
  const y = new Int32Array(count);
  const random = randomNumbers(7);
  let [px, py, tx, ty, rest] = [960, 540, 960, 540, 0];
  for (let i = 0; i < count; ++i) {
    if (rest > 0) --rest;
    else if (Math.hypot(tx - px, ty - py) < 2) {
      rest = random() < 0.1 ? 60 * (4 + random() * 14) : 60 * random() * 1.6;
      [tx, ty] = [random() * (region.width - 1), random() * (region.height - 1)];
    } else {
      px += (tx - px) * 0.09;
      py += (ty - py) * 0.09;
    }
    [x[i], y[i]] = [Math.trunc(px), Math.trunc(py)];
  }
  return entries('cursorLocation', time, { x, y });
}

function cursorAction(duration: number): Entries {
  const random = randomNumbers(11);
  const time: number[] = [0];
  const action = ['mouse init'];
  const rawActionValue = [256];
  for (let t = 2; t < duration - 1; t += 1 + random() * 9) {
    const isRight = random() < 0.15;
    const modifier = random() < 0.1 ? ' + cmd' : random() < 0.1 ? ' + shift' : '';
    const button = isRight ? 'right' : 'left';
    const held = random() < 0.12 ? 0.6 + random() : 0.09;
    time.push(t, t + held);
    action.push(`${button} down${modifier}`, `${button} up${modifier}`);
    rawActionValue.push(isRight ? 4 : 1, isRight ? 8 : 2);
  }
  return entries('cursorAction', time, { action, rawActionValue: Int32Array.from(rawActionValue) });
}

function keyboardAction(duration: number): Entries {
  const random = randomNumbers(13);
  const time: number[] = [];
  const codes: number[] = [];
  const names: string[] = [];
  const flags: string[] = [];
  const push = (t: number, code: number, name: string, modifiers = 'NONE') => {
    time.push(t);
    codes.push(code);
    names.push(name);
    flags.push(modifiers);
  };
  const words = 'the quick recorder keeps every key that was pressed and shows it over the movie'
    .toUpperCase()
    .split(' ');
  for (let t = 1.5; t < duration - 2;) {
    const burst = Math.min(duration - 2, t + 4 + random() * 8);
    while (t < burst) {
      for (const letter of words[Math.floor(random() * words.length)]!)
        push((t += 0.07 + random() * 0.06), letter.charCodeAt(0), letter, '(IsVK)');
      push((t += 0.09), 32, 'space', '(IsVK)');
    }
    if (random() < 0.5) push((t += 0.2), 13, 'returnKey', '(IsVK)');
    if (random() < 0.4) push((t += 0.5), 83, 'S', '<Cmd>(IsVK)');
    t += 3 + random() * 6;
  }
  return entries('keyboardAction', time, {
    characterCode: Uint32Array.from(codes),
    characterString: names,
    eventFlagsCode: new Uint32Array(codes.length),
    eventFlagsString: flags,
  });
}

function windows(duration: number): Entries[] {
  const random = randomNumbers(17);
  const time: number[] = [];
  const chosen: { app: string; title: string; window: number[] }[] = [];
  for (let t = 0; t < duration; t += 6 + random() * 40) {
    const scene = scenes[Math.floor(random() * scenes.length)]!;
    time.push(t);
    chosen.push({ ...scene, title: scene.titles[Math.floor(random() * scene.titles.length)]! });
  }
  const side = (index: number) => Int32Array.from(chosen, ({ window }) => window[index]!);
  return [
    entries('topmostWindow', time, { x: side(0), y: side(1), width: side(2), height: side(3) }),
    entries('topmostAppName', time, { name: chosen.map(({ app }) => app) }),
    entries('topmostWindowTitle', time, { title: chosen.map(({ title }) => title) }),
  ];
}

function hoverRect(locations: Entries): Entries {
  const rows = Array.from({ length: Math.floor(locations.time.length / 6) }, (_, i) => i * 6);
  const snapped = (name: string, step: number) =>
    Int32Array.from(rows, (row) => Math.floor(Number(locations.columns[name]![row]) / step) * step);
  return entries(
    'hoverRect',
    rows.map((row) => locations.time[row]!),
    {
      x: snapped('x', 160),
      y: snapped('y', 90),
      width: new Int32Array(rows.length).fill(160),
      height: new Int32Array(rows.length).fill(90),
    },
  );
}

function scrollAction(duration: number): Entries {
  const random = randomNumbers(19);
  const time: number[] = [];
  const y: number[] = [];
  for (let t = 4; t < duration - 3; t += 8 + random() * 30) {
    const direction = random() < 0.75 ? -1 : 1;
    for (let i = 0; i < 24; ++i) {
      time.push(t + i / 16);
      y.push(Math.round(direction * 60 * Math.exp(-i / 9)));
    }
  }
  return entries('scrollAction', time, { x: new Int32Array(y.length), y: Int32Array.from(y) });
}

function slides(duration: number): Entries[] {
  const time: number[] = [];
  for (let t = 30; t < duration; t += 150) time.push(t);
  return [
    entries('slideTitles', time, {
      title: time.map((_, i) => `${i + 1}. ${['Where we are', 'Numbers', 'What comes next', 'Questions'][i % 4]}`),
    }),
    entries('slideText', time, { text: time.map((_, i) => `Text of slide ${i + 1}`) }),
    entries('slideComment', time, { comment: time.map((_, i) => (i % 3 ? '' : 'Mention the source')) }),
  ];
}

function machine(duration: number): Entries[] {
  const random = randomNumbers(23);
  const time = Array.from({ length: Math.floor(duration * 2) }, (_, i) => i / 2);
  let usage = 20;
  const cpuUsage = Float64Array.from(time, () => {
    usage += (random() - 0.5) * 14 + (22 - usage) * 0.04 + (random() < 0.01 ? 50 : 0);
    return (usage = Math.max(2, Math.min(98, usage)));
  });
  return [
    entries('cpuUsage', time, { cpuUsage }),
    entries(
      'cursorOpacity',
      [0, 600, 600.2, 640, 640.2].filter((t) => t < duration),
      {
        opacity: Float64Array.from([1, 0.6, 0.3, 0.7, 1]),
      },
    ),
    entries('recordingRegion', [0], {
      x: Int32Array.of(region.x),
      y: Int32Array.of(region.y),
      width: Int32Array.of(region.width),
      height: Int32Array.of(region.height),
    }),
    entries('recordingScaleFactor', [0], { scaleFactor: Int32Array.of(1) }),
    entries('systemData', [0], {
      processorCount: ['ProcessorCount:8'],
      activeProcessorCount: ['ActiveProcessorCount:8'],
      osVersion: ['OSVersion:Version 13.5 (Build 22G74)'],
      ram: ['RAM:16384MB'],
    }),
  ];
}

/// An arrow of 24 by 24 pixels, black in white, as a PNG file.
const arrow = Uint8Array.from(
  atob(
    'iVBORw0KGgoAAAANSUhEUgAAABgAAAAYCAQAAABKfvVzAAAAZElEQVR42sXTSQ7AIAwDQP//06YUoUBZYp/qKxmBQgI+gRPS' +
      'JKRJ3mKHNGCQDmQSQCQjkMgMBPIFKVlBQk7gSHbgStYuRfKfpjBZY6Hc1lYkjmE8Qbwjju25BUhzneztqwS/pwBGSRf3Fj6W' +
      'QgAAAABJRU5ErkJggg==',
  ),
  (character) => character.charCodeAt(0),
);

function cursorImage(duration: number): Entries {
  const random = randomNumbers(29);
  const time: number[] = [];
  const id: bigint[] = [];
  const image: (Uint8Array | null)[] = [];
  for (let t = 0; t < duration; t += 3 + random() * 6) {
    const known = id.length;
    const isNew = known < 200;
    time.push(t);
    id.push(BigInt(isNew ? known + 1 : 1 + Math.floor(random() * 200)));
    image.push(isNew ? arrow : null);
  }
  return entries('cursorImage', time, {
    image,
    id: BigUint64Array.from(id),
    hotspotOffsetX: Int32Array.from(image, (bytes) => (bytes ? 1 : 0)),
    hotspotOffsetY: Int32Array.from(image, (bytes) => (bytes ? 1 : 0)),
  });
}

export function syntheticEntries(duration: number): Entries[] {
  const locations = cursorLocation(duration);
  return [
    cursorAction(duration),
    cursorImage(duration),
    locations,
    keyboardAction(duration),
    ...windows(duration),
    hoverRect(locations),
    scrollAction(duration),
    ...slides(duration),
    ...machine(duration),
  ];
}
