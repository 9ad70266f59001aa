// Files from the reader: dropped on the page, or chosen.

import { byId } from './dom';

export function setUpDrop(onFile: (file: File) => void): void {
  const veil = byId('drop-veil');
  const input = byId<HTMLInputElement>('file-input');
  const hasFiles = (event: DragEvent) => event.dataTransfer?.types.includes('Files') ?? false;
  let depth = 0;
  const show = (isOver: boolean) => veil.classList.toggle('is-shown', isOver);
  window.addEventListener('dragenter', (event) => {
    if (hasFiles(event)) show(++depth > 0);
  });
  window.addEventListener('dragleave', (event) => {
    if (hasFiles(event)) show((depth = Math.max(0, depth - 1)) > 0);
  });
  window.addEventListener('dragover', (event) => {
    if (hasFiles(event)) event.preventDefault();
  });
  window.addEventListener('drop', (event) => {
    event.preventDefault();
    show((depth = 0) > 0);
    const file = event.dataTransfer?.files[0];
    if (file) onFile(file);
  });
  input.addEventListener('change', () => {
    const file = input.files?.[0];
    input.value = '';
    if (file) onFile(file);
  });
  for (const id of ['open-button', 'welcome-open']) byId(id).addEventListener('click', () => input.click());
}
