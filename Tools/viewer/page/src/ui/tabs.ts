// Tabs that arrow keys move between.

import { byId } from './dom';

export function setUpTabs(onShow: () => void): void {
  const tabs = [...document.querySelectorAll<HTMLElement>('[role="tab"]')];
  const choose = (chosen: HTMLElement) => {
    for (const tab of tabs) {
      const isChosen = tab === chosen;
      tab.setAttribute('aria-selected', String(isChosen));
      tab.tabIndex = isChosen ? 0 : -1;
      byId(tab.getAttribute('aria-controls')!).hidden = !isChosen;
    }
    onShow();
  };
  tabs.forEach((tab, i) => {
    tab.addEventListener('click', () => choose(tab));
    tab.addEventListener('keydown', (event) => {
      const way = event.key === 'ArrowRight' ? 1 : event.key === 'ArrowLeft' ? -1 : 0;
      if (way === 0) return;
      const next = tabs[(i + way + tabs.length) % tabs.length]!;
      next.focus();
      choose(next);
      event.preventDefault();
      event.stopPropagation();
    });
  });
}

export function showTab(id: string): void {
  if (byId(id).getAttribute('aria-selected') !== 'true') byId(id).click();
}
