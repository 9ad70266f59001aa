// What is drawn grows with the page's text.

export function uiScale(): number {
  return parseFloat(getComputedStyle(document.documentElement).fontSize) / 16 || 1;
}
