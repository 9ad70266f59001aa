// J, K and L: back, stop and on, faster with each press.

import type { Player } from '../stage/player';

const rates = [0.25, 0.5, 1, 1.5, 2, 4, 8, 16]; // browsers refuse faster ones

const speeds = [1, 2, 4, 8, 16];

function faster(speed: number): number {
  return speeds.find((other) => other > speed) ?? speeds[speeds.length - 1]!;
}

export function shuttleOn(player: Player): void {
  const isRunning = player.playing && !player.isBackward;
  player.rate = isRunning ? faster(player.rate) : 1;
  player.play();
}

export function shuttleBack(player: Player): void {
  player.playBackward(player.isBackward ? faster(-player.speedShown) : 1);
}

export function shuttleStop(player: Player): void {
  player.pause();
  player.rate = 1;
}

const next = (rate: number) => rates[(rates.indexOf(rate) + 1) % rates.length]!;

/// By the button of the speed, which has all rates. Time that goes back keeps going back.
export function shuttleNext(player: Player): void {
  if (player.isBackward) player.playBackward(next(-player.speedShown));
  else player.rate = next(player.rate);
}
