// Menus that a button below the movie opens.

import { byId } from './dom';

export function setUpMenu(buttonId: string, menuId: string): void {
  const button = byId(buttonId);
  const menu = byId(menuId);
  const show = (isOpen: boolean) => {
    menu.hidden = !isOpen;
    button.setAttribute('aria-expanded', String(isOpen));
  };
  button.addEventListener('click', () => show(menu.hidden));
  document.addEventListener('pointerdown', ({ target }) => {
    if (!button.parentElement!.contains(target as Element)) show(false);
  });
  document.addEventListener('keydown', (event) => {
    if (event.key !== 'Escape' || menu.hidden) return;
    event.preventDefault(); // closes the menu, and does nothing else
    if (menu.contains(document.activeElement)) button.focus();
    show(false);
  });
}
