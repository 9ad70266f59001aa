// What is doubtful about a recording beside what the library finds in its bytes.

import { assumedScreen, hasArea, type Rect, type Size } from './geometry';
import { count, plural } from './format';
import { countBefore, countUntil } from './search';
import { rectAt, type Finding, type Session } from './session';

const sameShape = 0.01; // how much the shapes of two rectangles may differ

function notice(place: string, message: string): Finding {
  return { severity: 'notice', place, message };
}

/// `movie` is the size of its pictures, or undefined if they cannot be shown.
export function doubtsAbout(session: Session, movie: Size | undefined): Finding[] {
  return [...timeDoubts(session), ...regionDoubts(session, movie)];
}

function timeDoubts(session: Session): Finding[] {
  const { duration, movieDuration } = session;
  return session.allTracks().flatMap(({ kind, times }) => {
    const [before, after] = [countBefore(times, 0), times.length - countUntil(times, duration)];
    const findings: Finding[] = [];
    if (before > 0)
      findings.push(notice(kind, `${lie(before)} before the beginning of the movie, the first at ${times[0]} seconds`));
    if (after > 0 && movieDuration === undefined) {
      const gap = times[times.length - after]! - duration;
      findings.push(notice(kind, `${lie(after)} ${count(Math.round(gap))} seconds after all others`));
    }
    return findings;
  });
}

function lie(entries: number): string {
  return `${plural(entries, 'entry', 'entries')} ${entries === 1 ? 'lies' : 'lie'}`;
}

const placed = ['cursorLocation', 'topmostWindow', 'hoverRect'];

function regionDoubts(session: Session, movie: Size | undefined): Finding[] {
  const kind = 'recordingRegion';
  const { region } = session;
  if (!region && !placed.some((kind) => session.track(kind)?.count)) return [];
  if (!region) return [notice(kind, `No region was recorded. ${assumption(movie)}`)];
  const findings: Finding[] = [];
  const regions = new Set(allRegions(session).map((rect) => `${sizeText(rect)} at ${rect.x}, ${rect.y}`));
  if (regions.size > 1)
    findings.push(
      notice(
        kind,
        `${regions.size} different regions were recorded. The page uses the last one, ${sizeText(region)} at ${region.x}, ${region.y}`,
      ),
    );
  if (movie && Math.abs((region.width * movie.height) / (region.height * movie.width) - 1) > sameShape)
    findings.push(
      notice(kind, `The region of ${sizeText(region)} has another shape than the movie of ${sizeText(movie)}`),
    );
  return findings;
}

/// What the page does without a region.
export function assumption(movie: Size | undefined): string {
  return movie
    ? 'The page assumes that the movie shows the display from its upper left corner.'
    : `The page assumes a screen of ${sizeText(assumedScreen)}.`;
}

function allRegions(session: Session): Rect[] {
  const track = session.track('recordingRegion')!;
  return Array.from({ length: track.count }, (_, i) => rectAt(track, i)).filter(hasArea);
}

function sizeText({ width, height }: Size): string {
  return `${count(width)} × ${count(height)}`;
}
