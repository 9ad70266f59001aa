// Files from the reader: dropped on the page, or chosen.

import { byId } from './dom';

export function setUpDrop(onFiles: (files: File[]) => void): void {
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
    const files = [...(event.dataTransfer?.files ?? [])];
    if (files.length > 0) onFiles(files);
  });
  input.addEventListener('change', () => {
    const files = [...(input.files ?? [])];
    input.value = '';
    if (files.length > 0) onFiles(files);
  });
  for (const id of ['open-button', 'welcome-open']) byId(id).addEventListener('click', () => input.click());
}
