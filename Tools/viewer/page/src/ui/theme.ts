// Dark or light: as the system has it, until the reader says otherwise.

import { announce, byId } from './dom';
import { forgetPalette } from './palette';
import { store, stored } from './storage';

const key = 'zulm-theme';
const darkSystem = matchMedia('(prefers-color-scheme: dark)');

type Choice = 'system' | 'dark' | 'light';

function storedChoice(): Choice {
  const choice = stored(key);
  return choice === 'dark' || choice === 'light' ? choice : 'system';
}

let choice = storedChoice();

function apply(onChange: () => void): void {
  const isDark = choice === 'system' ? darkSystem.matches : choice === 'dark';
  document.documentElement.dataset.theme = isDark ? 'dark' : 'light';
  const next = isDark ? 'light' : 'dark';
  byId('theme-button').setAttribute('aria-label', `Switch to the ${next} theme`);
  byId('theme-button').title = `Switch to the ${next} theme`;
  forgetPalette();
  onChange();
}

export function setUpTheme(onChange: () => void): void {
  darkSystem.addEventListener('change', () => apply(onChange));
  byId('theme-button').addEventListener('click', () => {
    choice = document.documentElement.dataset.theme === 'dark' ? 'light' : 'dark';
    store(key, choice);
    apply(onChange);
    announce(`${choice} theme`);
  });
  apply(onChange);
}
