// Elements of the page.

export function byId<Kind extends HTMLElement = HTMLElement>(id: string): Kind {
  const element = document.getElementById(id);
  if (!element) throw new Error(`the page has no element ${id}`);
  return element as Kind;
}

type Attributes = Record<string, string | number | boolean | undefined>;

/// Attributes that are false or undefined are left out. Texts never become markup.
export function make<Tag extends keyof HTMLElementTagNameMap>(
  tag: Tag,
  attributes: Attributes = {},
  ...children: (Node | string)[]
): HTMLElementTagNameMap[Tag] {
  const element = document.createElement(tag);
  for (const [name, value] of Object.entries(attributes))
    if (value !== undefined && value !== false) element.setAttribute(name, value === true ? '' : String(value));
  element.append(...children);
  return element;
}

/// Changes nothing if the text is the same, so that the page is laid out less often.
export function setText(element: HTMLElement, text: string): void {
  if (element.textContent !== text) element.textContent = text;
}

/// Says it to people who listen. The same text is said again.
export function announce(text: string): void {
  const announcer = byId('announcer');
  setText(announcer, announcer.textContent === text ? `${text}\u00a0` : text);
}

/// A canvas as large as its place on the page, in the screen's own pixels.
export function fitCanvas(canvas: HTMLCanvasElement, width: number, height: number): number {
  const ratio = window.devicePixelRatio || 1;
  const [w, h] = [Math.max(1, Math.round(width * ratio)), Math.max(1, Math.round(height * ratio))];
  if (canvas.width !== w) canvas.width = w;
  if (canvas.height !== h) canvas.height = h;
  return ratio;
}
