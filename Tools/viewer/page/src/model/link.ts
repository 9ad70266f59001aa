// Links to a time: "#t=12.5".

export function timeInLink(hash: string): number | undefined {
  const text = /^#(?:.*&)?t=(\d+(?:\.\d+)?)(?:&|$)/.exec(hash)?.[1];
  return text === undefined ? undefined : Number(text);
}

export function linkTo(time: number): string {
  return `#t=${Number(time.toFixed(6))}`; // a shorter one could lead to the picture before
}
