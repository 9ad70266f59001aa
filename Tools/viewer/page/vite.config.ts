// One HTML file with everything inside: the script, the styles and the decoder, which runs in a worker made from text.
//
// ZULM_DECODER names the JavaScript module that decodes recordings; without it the page is built around the
// synthetic recording of the tests.

import { createHash } from 'node:crypto';
import { readdirSync, readFileSync } from 'node:fs';
import { fileURLToPath } from 'node:url';
import { defineConfig, type Plugin } from 'vite';

const decoder = process.env.ZULM_DECODER ?? fileURLToPath(new URL('test/decoder.ts', import.meta.url));

function policy(script: string, style: string): string {
  const hash = (text: string) => `'sha256-${createHash('sha256').update(text).digest('base64')}'`;
  return [
    "default-src 'none'",
    `script-src ${hash(script)} 'wasm-unsafe-eval'`,
    `style-src ${hash(style)}`,
    'worker-src blob:',
    "connect-src 'none'",
    'img-src blob: data:',
    "media-src 'self' file: blob: data:",
    "base-uri 'none'",
    "form-action 'none'",
  ].join('; ');
}

interface Licence {
  name: string;
  licence: string;
  text: string;
}

const at = (path: string) => fileURLToPath(new URL(path, import.meta.url));

/// Returns the licences of what is compiled into the decoder: a line with its name and its licence, then the text.
function licencesOfDecoder(): Licence[] {
  const texts = ['zulmetadata', 'json', 'fmt', 'emscripten', 'musl', 'llvm'].map((name) =>
    readFileSync(at(`licences/${name}.txt`), 'utf8'),
  );
  return texts.map((text) => {
    const [, name = '', licence = '', rest = ''] = /^(.*?): (.*)\n\n([^]*)$/.exec(text) ?? [];
    return { name, licence, text: rest.trim() };
  });
}

/// Returns the licence of every package that is in the page, as the package itself has it. Packages that only build the
/// page are left out.
function licencesOfPackages(): Licence[] {
  const lock = JSON.parse(readFileSync(at('package-lock.json'), 'utf8')) as {
    packages: Record<string, { version: string; license: string; dev?: boolean }>;
  };
  return Object.entries(lock.packages)
    .filter(([path, { dev }]) => path !== '' && !dev)
    .map(([path, { version, license }]) => {
      const file = readdirSync(at(path)).find((name) => /^licen[cs]e/i.test(name));
      if (!file) throw new Error(`${path} has no licence`);
      const text = readFileSync(at(`${path}/${file}`), 'utf8').trim();
      return { name: `${path.replace(/^node_modules\//, '')} ${version}`, licence: license, text };
    });
}

/// The module '#licences'.
function licences(): Plugin {
  return {
    name: 'licences',
    resolveId: (id) => (id === '#licences' ? '\0licences' : undefined),
    load: (id) =>
      id === '\0licences'
        ? `export default ${JSON.stringify([...licencesOfDecoder(), ...licencesOfPackages()])}`
        : undefined,
  };
}

/// Puts the script and the styles into the page, with a policy that lets nothing else run.
function inline(): Plugin {
  return {
    name: 'inline',
    enforce: 'post',
    generateBundle(_, bundle) {
      const files = Object.values(bundle);
      const page = files.find((file) => file.fileName.endsWith('.html'));
      const chunk = files.find((file) => file.type === 'chunk');
      const sheet = files.find((file) => file.fileName.endsWith('.css'));
      if (page?.type !== 'asset' || chunk?.type !== 'chunk' || sheet?.type !== 'asset')
        throw new Error('the page needs exactly one script and one style sheet');
      const script = `\n${chunk.code.trim().replaceAll('</script', '<\\/script').replaceAll('<!--', '<\\!--')}\n`;
      const style = `\n${String(sheet.source).trim()}\n`;
      page.source = String(page.source)
        .replace(/\s*<script type="module"[^>]*><\/script>/, '')
        .replace(/\s*<link rel="stylesheet"[^>]*>/, () => `\n<style>${style}</style>`)
        .replace('POLICY', () => policy(script, style))
        .replace('</body>', () => `<script type="module">${script}</script>\n</body>`);
      for (const file of [chunk, sheet]) delete bundle[file.fileName];
      if (Object.keys(bundle).length !== 1)
        throw new Error(`not everything is inside the page: ${Object.keys(bundle).join(', ')}`);
    },
  };
}

export default defineConfig({
  base: './',
  publicDir: false,
  resolve: { alias: { '#decoder': decoder } },
  worker: { format: 'iife' }, // pages that are opened from a folder may not start modules as workers
  build: {
    target: 'es2022',
    assetsInlineLimit: Number.MAX_SAFE_INTEGER,
    cssCodeSplit: false,
    modulePreload: false,
    chunkSizeWarningLimit: 8192,
  },
  plugins: [licences(), inline()],
});
