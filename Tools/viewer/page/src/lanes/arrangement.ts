// How the reader wants the lanes: in which order, how high, which of them at all, and which always in sight.

export const leastHeight = 14; // pixels of the page
export const mostHeight = 240;

interface Choice {
  isHidden?: boolean;
  isPinned?: boolean;
  height?: number;
}

interface Sized {
  id: string;
  height: number;
}

export interface Arranged<Some> {
  pinned: Some[];
  others: Some[];
}

export class Arrangement {
  private order: string[] = [];
  private choices: Record<string, Choice> = {};

  /// Takes what `text` returned once. Anything else is as if nothing had been chosen.
  static read(text: string | null): Arrangement {
    const arrangement = new Arrangement();
    try {
      const { order, lanes } = JSON.parse(text ?? '{}') as { order?: unknown; lanes?: unknown };
      if (Array.isArray(order)) arrangement.order = order.filter((id) => typeof id === 'string');
      for (const [id, choice] of Object.entries(lanes ?? {})) arrangement.choices[id] = believable(choice as unknown);
    } catch {
      // somebody else wrote it
    }
    return arrangement;
  }

  text(): string {
    return JSON.stringify({ order: this.order, lanes: this.choices });
  }

  /// The lanes in their order, with their heights.
  sorted<Some extends Sized>(lanes: Some[]): Some[] {
    const ids = orderOf(lanes.map(({ id }) => id), this.order);
    const sorted = [...lanes].sort((a, b) => ids.indexOf(a.id) - ids.indexOf(b.id));
    return sorted.map((lane) => ({ ...lane, height: this.choices[lane.id]?.height ?? lane.height }));
  }

  /// Those to be seen.
  arranged<Some extends Sized>(lanes: Some[]): Arranged<Some> {
    const seen = this.sorted(lanes).filter(({ id }) => !this.isHidden(id));
    return { pinned: seen.filter(({ id }) => this.isPinned(id)), others: seen.filter(({ id }) => !this.isPinned(id)) };
  }

  isHidden(id: string): boolean {
    return this.choices[id]?.isHidden ?? false;
  }

  isPinned(id: string): boolean {
    return this.choices[id]?.isPinned ?? false;
  }

  hide(id: string, isHidden: boolean): void {
    this.choose(id, { isHidden });
  }

  pin(id: string, isPinned: boolean): void {
    this.choose(id, { isPinned });
  }

  /// Undefined is the usual height.
  resize(id: string, height: number | undefined): void {
    const { height: _, ...rest } = this.choices[id] ?? {};
    this.choices[id] = height === undefined ? rest : { ...rest, height: clampedHeight(height) };
  }

  /// Puts a lane to the place of another one; the lanes between them make room.
  move(lanes: Sized[], id: string, target: string): void {
    const ids = orderOf(lanes.map((lane) => lane.id), this.order);
    const [from, to] = [ids.indexOf(id), ids.indexOf(target)];
    if (from < 0 || to < 0) return;
    ids.splice(from, 1);
    ids.splice(to, 0, id);
    this.order = ids;
  }

  private choose(id: string, choice: Choice): void {
    this.choices[id] = { ...this.choices[id], ...choice };
  }
}

function clampedHeight(height: number): number {
  return Math.round(Math.max(leastHeight, Math.min(height, mostHeight)));
}

function believable(choice: unknown): Choice {
  const { isHidden, isPinned, height } = (choice ?? {}) as Record<string, unknown>;
  return {
    ...(isHidden === true ? { isHidden } : {}),
    ...(isPinned === true ? { isPinned } : {}),
    ...(typeof height === 'number' && Number.isFinite(height) ? { height: clampedHeight(height) } : {}),
  };
}

/// Lanes that nobody has moved stay after the lane that they come after.
function orderOf(ids: string[], wanted: string[]): string[] {
  const order = wanted.filter((id, i) => ids.includes(id) && wanted.indexOf(id) === i);
  ids.forEach((id, i) => {
    if (!order.includes(id)) order.splice(i === 0 ? 0 : order.indexOf(ids[i - 1]!) + 1, 0, id);
  });
  return order;
}
