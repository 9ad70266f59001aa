// How fast the cursor was.

import type { Table } from '#decoder';

/// A speed from each of its times on, in units of the screen to a second.
export interface Speed {
  times: Float64Array;
  values: Float32Array;
}

/// Takes the speeds as the library tells them. To draw them, less precise numbers do.
export function speedIn(table: Table | undefined): Speed {
  return {
    times: table?.time ?? new Float64Array(),
    values: Float32Array.from((table?.columns.speed as Float64Array | undefined) ?? []),
  };
}
