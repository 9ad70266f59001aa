// Sorts rows away from the page.

import { orderOf, picked, placesOf, rankedKeys } from './sorting';

export type SortRequest =
  | { id: number; keys: Float64Array; isDescending: boolean }
  /// Each row's value, by its place among the distinct ones.
  | { id: number; values: unknown[]; places: Uint32Array; isDescending: boolean }
  /// Asks for these rows in the order that was sorted last; null asks for all.
  | { id: number; matches: Uint32Array | null };

export interface Sorted {
  id: number;
  shown: Uint32Array<ArrayBuffer>;
  places: Int32Array<ArrayBuffer>;
}

let order = new Uint32Array();

self.onmessage = ({ data }: MessageEvent<SortRequest>) => {
  if ('keys' in data) return void (order = orderOf(data.keys, data.isDescending));
  if ('values' in data) return void (order = orderOf(rankedKeys(data.values, data.places), data.isDescending));
  const chosen = picked(order, data.matches);
  const shown = chosen === order ? order.slice() : chosen;
  const places = placesOf(shown, order.length);
  self.postMessage({ id: data.id, shown, places } satisfies Sorted, { transfer: [shown.buffer, places.buffer] });
};
