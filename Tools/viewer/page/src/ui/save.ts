// Files that the page hands to its reader.

export function saveBlob(name: string, contents: Blob): void {
  const url = URL.createObjectURL(contents);
  Object.assign(document.createElement('a'), { href: url, download: name }).click();
  setTimeout(() => URL.revokeObjectURL(url), 10_000);
}

export function saveText(name: string, text: string, type: string): void {
  saveBlob(name, new Blob([text], { type }));
}
