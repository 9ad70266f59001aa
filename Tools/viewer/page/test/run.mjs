// Bundles the tests as the page is bundled, and runs them with Node's own runner.

import { spawnSync } from 'node:child_process';
import { mkdtempSync, readdirSync, rmSync } from 'node:fs';
import { tmpdir } from 'node:os';
import { join } from 'node:path';
import { fileURLToPath } from 'node:url';
import { build } from 'esbuild';

const folder = fileURLToPath(new URL('.', import.meta.url));
const tests = readdirSync(folder).filter((name) => name.endsWith('.test.ts'));
const output = mkdtempSync(join(tmpdir(), 'zulm-page-'));
try {
  await build({
    entryPoints: tests.map((name) => join(folder, name)),
    outdir: output,
    outExtension: { '.js': '.mjs' },
    bundle: true,
    platform: 'node',
    format: 'esm',
    target: 'node18',
    logLevel: 'warning',
    sourcemap: 'inline',
    alias: { '#decoder': join(folder, 'decoder.ts') },
  });
  const files = tests.map((name) => join(output, name.replace(/\.ts$/, '.mjs')));
  const { status } = spawnSync(process.execPath, ['--enable-source-maps', '--test', ...files], { stdio: 'inherit' });
  process.exitCode = status ?? 1;
} finally {
  rmSync(output, { recursive: true });
}
