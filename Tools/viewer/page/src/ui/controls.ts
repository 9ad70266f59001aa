// The buttons below the movie.

import { clock, spokenTime } from '../model/format';
import { layers } from '../stage/layers';
import { byId, make, setText } from './dom';
import { shuttleNext } from '../transport/shuttle';
import { setUpClock } from '../transport/clock';
import { setUpStage } from '../stage/handling';
import { setIcon } from './icons';
import { setUpMenu } from './menu';
import type { Page } from './page';

export interface Controls {
  showState(): void;
  showTime(time: number, duration: number): void;
}

export function setUpControls(page: Page): Controls {
  const on = (id: string, action: () => void) => byId(id).addEventListener('click', action);
  on('play', () => page.player.toggle());
  on('frame-back', () => page.stepFrame(-1));
  on('frame-forward', () => page.stepFrame(1));
  on('marker-back', () => page.stepMarker(-1));
  on('marker-forward', () => page.stepMarker(1));
  on('rate', () => shuttleNext(page.player));
  on('sound', () => (page.player.muted = !page.player.muted));
  on('keys-button', () => page.switchKeys());
  on('full-screen', () => void switchFullScreen());
  const scrubber = byId<HTMLInputElement>('scrubber');
  scrubber.addEventListener('input', () => page.seek(scrubber.valueAsNumber));
  on('skip-idle', () => page.switchSkipping());
  on('movie-in', () => page.zoomMovie(1.5));
  on('movie-out', () => page.zoomMovie(1 / 1.5));
  on('movie-fit', () => page.zoomMovie(0));
  on('save-still', () => page.saveStill());
  on('select-some', () => page.selectSome());
  setUpMenu('more-button', 'more-menu');
  byId('skip').addEventListener('click', (event) => {
    event.preventDefault(); // the address holds other things
    byId('timeline').focus();
  });
  setUpClock(page);
  setUpStage(page);
  document.addEventListener('fullscreenchange', () => showTime(page.player.time, page.player.duration));
  const boxes = setUpLayers(page);
  return { showState: () => showState(page, boxes), showTime };
}

export async function switchFullScreen(): Promise<void> {
  try {
    if (document.fullscreenElement) await document.exitFullscreen();
    else await document.querySelector('.stage-area')!.requestFullscreen();
  } catch {
    // not allowed here: nothing changes
  }
}

function setUpLayers(page: Page): HTMLInputElement[] {
  const menu = byId('layers-menu');
  const boxes = layers.map(({ id, name, key }) => {
    const box = make('input', { type: 'checkbox', class: 'switch', role: 'switch' });
    box.addEventListener('change', () => page.switchLayer(id));
    menu.append(make('label', { class: 'menu-item' }, make('span', {}, name), make('kbd', {}, key), box));
    return box;
  });
  setUpMenu('layers-button', 'layers-menu');
  return boxes;
}

function showState({ player, stage, skipsIdle }: Page, boxes: HTMLInputElement[]): void {
  setIcon(byId('play'), player.playing ? 'pause' : 'play');
  byId('play').setAttribute('aria-label', player.playing ? 'Pause' : 'Play');
  const speed = `${player.speedShown}`.replace('-', '−');
  setText(byId('rate'), `${speed}×`);
  byId('rate').setAttribute('aria-label', `Speed ${speed}`);
  byId<HTMLInputElement>('skip-idle').checked = skipsIdle;
  setIcon(byId('sound'), player.muted ? 'soundOff' : 'sound');
  byId('sound').setAttribute('aria-pressed', String(!player.muted));
  byId<HTMLButtonElement>('sound').disabled = player.movie !== 'ready';
  setIcon(byId('keys-button'), stage.showsKeys ? 'shown' : 'masked');
  byId('keys-button').setAttribute('aria-pressed', String(stage.showsKeys));
  byId('keys-button').setAttribute('aria-label', 'Show typed keys');
  layers.forEach(({ isOn }, i) => (boxes[i]!.checked = isOn));
}

function showTime(time: number, duration: number): void {
  setText(byId('clock-time'), clock(time));
  setText(byId('clock-total'), ` / ${clock(duration, 0)}`);
  const scrubber = byId<HTMLInputElement>('scrubber');
  if (!document.fullscreenElement) return;
  scrubber.max = String(duration);
  scrubber.value = String(time);
  scrubber.setAttribute('aria-valuetext', spokenTime(time));
}
