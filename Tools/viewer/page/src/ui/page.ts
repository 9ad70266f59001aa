// What buttons, keys and scripts may ask of the page.

import type { Decoder } from '../decoder/client';
import type { Session } from '../model/session';
import type { Selection } from '../range/selection';
import type { Player } from '../stage/player';
import type { Stage } from '../stage/stage';

export interface Page {
  readonly player: Player;
  readonly stage: Stage;
  readonly decoder: Decoder;
  readonly selection: Selection;
  /// Whether playing goes on after times in which nothing was done.
  skipsIdle: boolean;
  readonly session: Session | undefined;
  /// Whether a recording is open and all of it was drawn.
  readonly isShown: boolean;
  /// The number of files that were opened or refused.
  readonly finished: number;
  seek(time: number): void;
  step(seconds: number): void;
  stepFrame(direction: 1 | -1): void;
  stepMarker(direction: 1 | -1): void;
  stepMatch(direction: 1 | -1): void;
  /// 0 shows all.
  zoom(factor: number): void;
  /// Moves the lanes by a part of what is in sight.
  pan(part: number): void;
  switchLayer(id: string): void;
  switchKeys(): void;
  findEntries(): void;
  arrangeLanes(): void;
  writeNote(): void;
  /// 0 shows the whole picture.
  zoomMovie(factor: number): void;
  switchLoop(): void;
  switchSkipping(): void;
  saveStill(): void;
  /// Selects a part of what the lanes show.
  selectSome(): void;
}
