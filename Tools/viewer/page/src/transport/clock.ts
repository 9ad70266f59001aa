// The clock below the movie, into which a time or the number of a picture can be typed.

import { clock } from '../model/format';
import { announce, byId } from '../ui/dom';
import type { Page } from '../ui/page';
import { placeOf } from './place';

export function setUpClock(page: Page): void {
  const button = byId('clock-time');
  const field = byId<HTMLInputElement>('clock-field');
  const close = (isDone: boolean) => {
    if (field.hidden) return;
    field.hidden = true;
    button.hidden = false;
    if (isDone) button.focus();
  };
  button.addEventListener('click', () => editClock(page));
  field.addEventListener('blur', () => close(false));
  field.addEventListener('input', () => field.setCustomValidity(''));
  field.addEventListener('keydown', (event) => {
    if (event.key === 'Escape') close(true);
    else if (event.key !== 'Enter') return;
    event.preventDefault();
    event.stopPropagation();
    if (event.key === 'Enter' && go(page, field)) close(true);
  });
}

export function editClock({ session, player }: Page): void {
  if (!session) return;
  const field = byId<HTMLInputElement>('clock-field');
  byId('clock-time').hidden = true;
  field.hidden = false;
  field.setCustomValidity('');
  field.value = clock(player.time);
  field.focus();
  field.select();
}

/// Whether the field says a place.
function go(page: Page, field: HTMLInputElement): boolean {
  const place = placeOf(field.value);
  if (!place) {
    field.setCustomValidity('Write a time such as 1:23.5, or the number of a picture such as #120.');
    field.reportValidity();
    return false;
  }
  if ('time' in place) page.seek(place.time);
  else void goToFrame(page, place.frame);
  return true;
}

async function goToFrame(page: Page, frame: number): Promise<void> {
  const time = await page.player.frameTime(frame);
  if (time === undefined) return;
  page.seek(time);
  announce(`Picture ${frame} at ${clock(page.player.time)}`);
}
