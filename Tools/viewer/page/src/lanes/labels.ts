// The names beside the lanes. A name is dragged to another place, its lower edge to another height.

import { make } from '../ui/dom';
import { uiScale } from '../ui/scale';
import type { Lane } from './lane';

export interface LabelEvents {
  onMove: (id: string, target: string) => void;
  /// Undefined is the usual height.
  onResize: (id: string, height: number | undefined) => void;
}

const slop = 4; // pixels that a hand may tremble

export class LaneLabel {
  readonly value = make('span', { class: 'lane-value' });
  readonly element: HTMLElement;

  constructor(
    readonly lane: Lane,
    isPinned: boolean,
    gap: number,
    private readonly events: LabelEvents,
  ) {
    const { title, legend = [], height, isHidden, id } = lane;
    const edge = make('div', { class: 'lane-edge', 'aria-hidden': 'true' });
    this.element = make(
      'div',
      { class: isHidden ? 'lane-label is-hidden' : 'lane-label', 'data-lane': id },
      ...(isPinned ? [make('span', { class: 'lane-pin', role: 'img', 'aria-label': 'pinned' })] : []),
      make(
        'span',
        { class: 'lane-title', title },
        title,
        ...legend.flatMap(({ text, colour }) => [' ', make('span', { class: `legend is-${colour}` }, text)]),
      ),
      isHidden ? make('span', { class: 'tag' }, 'hidden') : this.value,
      edge,
    );
    this.element.style.height = `${(height + gap) / 16}rem`;
    this.setUpMoving();
    this.setUpEdge(edge);
  }

  private setUpMoving(): void {
    const { element, lane } = this;
    let from = 0;
    let target: HTMLElement | undefined;
    const drop = () => {
      target?.classList.remove('is-target');
      target = undefined;
      element.classList.remove('is-moving');
    };
    element.addEventListener('pointerdown', (event) => {
      if (event.button !== 0 || event.pointerType === 'touch') return;
      element.setPointerCapture(event.pointerId);
      from = event.clientY;
    });
    element.addEventListener('pointermove', (event) => {
      if (!element.hasPointerCapture(event.pointerId) || Math.abs(event.clientY - from) < slop) return;
      target?.classList.remove('is-target');
      element.classList.add('is-moving');
      target = labelAt(event);
      target?.classList.add('is-target');
    });
    element.addEventListener('pointerup', () => {
      const wanted = target?.dataset.lane;
      drop();
      if (wanted !== undefined && wanted !== lane.id) this.events.onMove(lane.id, wanted);
    });
    element.addEventListener('pointercancel', drop);
  }

  private setUpEdge(edge: HTMLElement): void {
    const { lane } = this;
    let from = 0;
    edge.addEventListener('pointerdown', (event) => {
      event.stopPropagation();
      if (event.button !== 0) return;
      edge.setPointerCapture(event.pointerId);
      from = event.clientY;
    });
    const heightAt = (event: PointerEvent) => lane.height + (event.clientY - from) / uiScale();
    edge.addEventListener('pointermove', (event) => {
      if (edge.hasPointerCapture(event.pointerId)) this.element.style.height = `${heightAt(event) / 16}rem`;
    });
    edge.addEventListener('pointerup', (event) => {
      event.stopPropagation();
      if (event.clientY !== from) this.events.onResize(lane.id, heightAt(event));
    });
    edge.addEventListener('dblclick', () => this.events.onResize(lane.id, undefined));
  }
}

function labelAt({ clientX, clientY }: PointerEvent): HTMLElement | undefined {
  return document.elementFromPoint(clientX, clientY)?.closest<HTMLElement>('.lane-label') ?? undefined;
}
