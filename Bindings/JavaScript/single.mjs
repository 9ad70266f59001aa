// Makes zulmetadata.single.js in the folder of the package: the module with its core inside, for pages that may not
// load anything.

import { readFileSync, writeFileSync } from 'node:fs';
import { join } from 'node:path';

const folder = process.argv[2];
const module = readFileSync(join(folder, 'zulmetadata.js'), 'utf8');
const core = readFileSync(join(folder, 'zulmetadata.wasm')).toString('base64');

const bringsCore = "import { coreBytes } from './core.js';\n";
if (!module.includes(bringsCore)) throw new Error('zulmetadata.js does not import its core as expected');

const holdsCore = `const core = '${core}';

async function coreBytes() {
  const characters = atob(core);
  const bytes = new Uint8Array(characters.length);
  for (let i = 0; i < bytes.length; ++i) bytes[i] = characters.charCodeAt(i);
  return bytes;
}
`;
writeFileSync(join(folder, 'zulmetadata.single.js'), module.replace(bringsCore, () => holdsCore));
