// What buttons, keys and scripts may ask of the page.

import type { Decoder } from '../decoder/client';
import type { Session } from '../model/session';
import type { Player } from '../stage/player';
import type { Stage } from '../stage/stage';

export interface Page {
  readonly player: Player;
  readonly stage: Stage;
  readonly decoder: Decoder;
  readonly session: Session | undefined;
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
}
