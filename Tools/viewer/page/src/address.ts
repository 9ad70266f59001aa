// The address of the page, which tells what the page shows, and follows it.

import { partsOfAdjustment, type Adjustment } from './adjust/adjustment';
import { linkToView, rangeText, withParts, type TimeRange, type View } from './model/link';
import { layers } from './stage/layers';

const delay = 300; // milliseconds: browsers allow few changes

/// What the page shows, with all that a link can hold.
export interface WholeView extends Omit<View, 'layers'> {
  range: TimeRange | undefined;
  adjustment: Adjustment;
}

function layersOn(): string[] {
  return layers.filter(({ isOn }) => isOn).map(({ id }) => id);
}

export class Address {
  private readonly usualLayers = layersOn();
  private timer: ReturnType<typeof setTimeout> | undefined;

  /// `view` returns what the page shows, or undefined if the address is to stay as it is.
  constructor(private readonly view: () => WholeView | undefined) {}

  /// The address of a view, from "#" on. Parts that nobody here knows stay in it.
  linkTo({ range, adjustment, ...view }: WholeView): string {
    const on = layersOn();
    const changes: [string, string | undefined][] = [['range', range && rangeText(range)], ...partsOfAdjustment(adjustment)];
    const layers = on.join() === this.usualLayers.join() ? undefined : on;
    return linkToView(withParts(location.hash, changes), { ...view, layers });
  }

  /// Writes the address soon.
  write(): void {
    clearTimeout(this.timer);
    this.timer = setTimeout(() => {
      const view = this.view();
      const link = view && this.linkTo(view);
      if (link !== undefined && link !== location.hash) history.replaceState(null, '', link);
    }, delay);
  }
}

/// Switches on the layers that a link names. A link without a name that is known changes nothing.
export function followLayers(text: string | undefined): void {
  const wanted = text?.split(',') ?? [];
  if (text !== '' && !layers.some(({ id }) => wanted.includes(id))) return;
  for (const layer of layers) layer.isOn = wanted.includes(layer.id);
}
