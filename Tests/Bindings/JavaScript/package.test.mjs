// What is published.

import assert from 'node:assert/strict';
import { readFileSync } from 'node:fs';
import { join } from 'node:path';
import { spawnSync } from 'node:child_process';
import { test } from 'node:test';
import { load, packageFolder } from './support.mjs';

const core = new WebAssembly.Module(readFileSync(join(packageFolder, 'zulmetadata.wasm')));

test('holds what it says', () => {
  const { stdout } = spawnSync('npm', ['pack', '--dry-run', '--json'], { cwd: packageFolder, encoding: 'utf8' });
  const [{ files }] = JSON.parse(stdout);
  const manifest = JSON.parse(readFileSync(join(packageFolder, 'package.json'), 'utf8'));
  assert.deepEqual(files.map(({ path }) => path).sort(), [...manifest.files, 'package.json'].sort());
});

test('asks the page for bytes and for nothing else of its own', () => {
  const asked = WebAssembly.Module.imports(core).map(({ module, name }) => `${module}.${name}`);
  const known = /^(zulm\.readAt|env\.(emscripten_notify_memory_growth|__syscall_\w*stat\w*)|wasi_snapshot_preview1\.\w+)$/;
  assert.deepEqual(asked.filter((name) => !known.test(name)), []);
});

test('exports the functions that its types describe, and no others', async () => {
  const types = readFileSync(join(packageFolder, 'zulmetadata.d.ts'), 'utf8');
  const described = [...types.matchAll(/^export class (\w+)/gm)].map(([, name]) => name);
  for (const name of ['zulmetadata.js', 'zulmetadata.single.js'])
    assert.deepEqual(Object.keys(await load(name)).sort(), described.sort());
  const functions = readFileSync(join(packageFolder, 'node.d.ts'), 'utf8').matchAll(/^export function (\w+)/gm);
  assert.deepEqual(Object.keys(await load('node.js')), [...functions].map(([, name]) => name));
});

test('describes every member of a recording', async () => {
  const { Recording } = await load('zulmetadata.js');
  const types = readFileSync(join(packageFolder, 'zulmetadata.d.ts'), 'utf8');
  for (const name of Object.getOwnPropertyNames(Recording.prototype).filter((name) => name !== 'constructor'))
    assert.match(types, new RegExp(`^  ${name}\\(`, 'm'));
});
