// Dragging with a mouse, a pen or fingers.

export interface Gestures {
  /// All in pixels from the element's left edge.
  start?: (x: number, event: PointerEvent) => void;
  /// `way` is how far it is from the start.
  move?: (x: number, way: number, event: PointerEvent) => void;
  /// Went down and up again in the same place.
  click?: (x: number, event: PointerEvent) => unknown;
  /// Two fingers: around `x`, `factor` times as much is to be seen.
  pinch?: (x: number, factor: number) => void;
}

const slop = 4; // pixels that a hand may tremble

export function dragging(element: HTMLElement, gestures: Gestures): void {
  const fingers = new Map<number, number>();
  let from = 0;
  let isDrag = false;
  let wasPinch = false;
  const xOf = (event: PointerEvent) => event.clientX - element.getBoundingClientRect().left;

  element.addEventListener('pointerdown', (event) => {
    if (event.button !== 0) return;
    fingers.set(event.pointerId, xOf(event));
    element.setPointerCapture(event.pointerId);
    if (fingers.size > 1) return void (wasPinch = true);
    [from, isDrag, wasPinch] = [xOf(event), false, false];
    gestures.start?.(from, event);
  });

  element.addEventListener('pointermove', (event) => {
    const before = fingers.get(event.pointerId);
    if (before === undefined) return;
    const x = xOf(event);
    const other = [...fingers].find(([id]) => id !== event.pointerId)?.[1];
    fingers.set(event.pointerId, x);
    if (other !== undefined) {
      const [was, is] = [Math.abs(before - other), Math.abs(x - other)];
      if (was > 8 && is > 8) gestures.pinch?.((x + other) / 2, was / is);
    } else if (!wasPinch) {
      isDrag ||= Math.abs(x - from) > slop;
      if (isDrag || !gestures.click) gestures.move?.(x, x - from, event);
    }
  });

  const end = (event: PointerEvent) => {
    if (!fingers.delete(event.pointerId) || fingers.size > 0) return;
    if (!isDrag && !wasPinch && event.type === 'pointerup') gestures.click?.(xOf(event), event);
  };
  element.addEventListener('pointerup', end);
  element.addEventListener('pointercancel', end);
  element.addEventListener('lostpointercapture', ({ pointerId }) => fingers.delete(pointerId)); // it may have gone
}
