// Where the core is: a file beside this one.

/** @returns {Promise<BufferSource>} */
export async function coreBytes() {
  const address = new URL('zulmetadata.wasm', import.meta.url);
  if (address.protocol === 'file:' && globalThis.process?.versions?.node) {
    const { readFile } = await import('node:fs/promises');
    return readFile(address);
  }
  const response = await fetch(address);
  if (!response.ok) throw new Error(`${address}: ${response.status} ${response.statusText}`);
  return response.arrayBuffer();
}
