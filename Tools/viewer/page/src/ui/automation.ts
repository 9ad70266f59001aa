// For scripts that drive the page: where it is, what it shows, and what was decoded.

import { screenToVideo } from '../model/geometry';
import { captionText } from '../model/keys';
import type { Page } from './page';

export interface ViewerState {
  isOpen: boolean;
  /// Files that were opened or refused so far.
  finished: number;
  time: number;
  duration: number;
  playing: boolean;
  /// Below 0 while time goes back.
  speed: number;
  selection: { from: number; to: number } | null;
  /// How many times larger than the whole picture the movie is shown.
  zoom: number;
  /// Whether the picture of `time` is shown.
  isSettled: boolean;
  movie: string;
  frame: { width: number; height: number };
  /// In pixels of the movie.
  hotSpot: { x: number; y: number } | null;
  opacity: number;
  caption: string;
}

declare global {
  var zulmViewer: {
    seek(time: number): void;
    state(): ViewerState;
    dump(): Promise<string>;
  };
}

function stateOf({ session, isShown, player, stage, selection, finished }: Page): ViewerState {
  const position = session?.cursorAt(player.time);
  return {
    isOpen: isShown,
    finished,
    time: player.time,
    duration: player.duration,
    playing: player.playing,
    speed: player.speedShown,
    selection: selection.range ?? null,
    zoom: stage.zoom.scale,
    isSettled: player.isSettled,
    movie: player.movie,
    frame: stage.placement.frame,
    hotSpot: position ? screenToVideo(position, stage.placement) : null,
    opacity: session?.opacityAt(player.time) ?? 1,
    caption: captionText(stage.captionAt(player.time)),
  };
}

export function setUpAutomation(page: Page): void {
  globalThis.zulmViewer = {
    seek: (time) => page.seek(time),
    state: () => stateOf(page),
    dump: () => page.decoder.dump(),
  };
}
