// From the recorded screen to the pixels of the movie.

export interface Point {
  x: number;
  y: number;
}

export interface Size {
  width: number;
  height: number;
}

export interface Rect extends Point, Size {}

/// How a recording's coordinates lie in its movie.
export interface Placement {
  /// What of the screen was recorded, in the units of every other coordinate.
  region: Rect;
  /// The movie's own size in pixels.
  frame: Size;
}

/// What is assumed where neither a movie nor a region says it.
export const assumedScreen: Size = { width: 1920, height: 1080 };

export function hasArea(size: Size | undefined): size is Size {
  return size !== undefined && size.width > 0 && size.height > 0;
}

/// The recorded region fills the movie, whatever size the movie has. Without a region the movie shows the screen from
/// its corner, with `scaleFactor` pixels to a unit; without a movie the region is shown as large as it was recorded.
export function placementOf(region: Rect | undefined, scaleFactor: number, movie: Size | undefined): Placement {
  const scale = Number.isFinite(scaleFactor) && scaleFactor > 0 ? scaleFactor : 1;
  if (hasArea(region))
    return {
      region,
      frame: hasArea(movie) ? movie : { width: region.width * scale, height: region.height * scale },
    };
  const frame = hasArea(movie) ? movie : assumedScreen;
  return { region: { x: 0, y: 0, width: frame.width / scale, height: frame.height / scale }, frame };
}

/// Pixels of the movie to a unit of the screen.
export function pixelsPerUnit({ region, frame }: Placement): Point {
  return { x: frame.width / region.width, y: frame.height / region.height };
}

/// The pixel of the movie, with the upper left corner of its first pixel at 0, 0, that shows a point of the screen.
export function screenToVideo(point: Point, placement: Placement): Point {
  const scale = pixelsPerUnit(placement);
  return { x: (point.x - placement.region.x) * scale.x, y: (point.y - placement.region.y) * scale.y };
}

export function rectToVideo(rect: Rect, placement: Placement): Rect {
  const scale = pixelsPerUnit(placement);
  const corner = screenToVideo(rect, placement);
  return { x: corner.x, y: corner.y, width: rect.width * scale.x, height: rect.height * scale.y };
}

/// Where an image of the cursor goes, so that its hot spot lies on `location`. An image's pixel is a unit of the screen.
export function cursorImageRect(location: Point, hotSpot: Point, image: Size, placement: Placement): Rect {
  const { width, height } = image;
  return rectToVideo({ x: location.x - hotSpot.x, y: location.y - hotSpot.y, width, height }, placement);
}

/// The largest rectangle with the shape of `frame` in the middle of `room`.
export function fitted(frame: Size, room: Size): Rect {
  const scale = Math.max(0, Math.min(room.width / frame.width, room.height / frame.height));
  const size = { width: frame.width * scale, height: frame.height * scale };
  return { x: (room.width - size.width) / 2, y: (room.height - size.height) / 2, ...size };
}
