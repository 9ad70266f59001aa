const mostSide = 1024; // pixels: no cursor is larger, and a file that says so only wants memory

export function requireCursorSize(width: number, height: number): void {
  const isSide = (side: number) => side >= 1 && side <= mostSide;
  if (!isSide(width) || !isSide(height)) throw new Error(`its size is ${width} × ${height}`);
}
