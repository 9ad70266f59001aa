// A place in the movie as readers write it: "1:23.5", "83.5", or a picture by its number, "#120" or "120f".

export type Place = { time: number } | { frame: number };

export function placeOf(text: string): Place | undefined {
  const words = text.trim().replace(',', '.');
  const frame = /^(?:#\s*(\d+)|(\d+)\s*f)$/i.exec(words);
  if (frame) return { frame: Number(frame[1] ?? frame[2]) };
  const time = /^(?:(?:(\d+):)?(\d+):)?(\d+(?:\.\d*)?|\.\d+)\s*s?$/i.exec(words);
  if (!time) return undefined;
  const [hours, minutes, seconds] = [time[1] ?? 0, time[2] ?? 0, time[3]!].map(Number);
  return { time: hours! * 3600 + minutes! * 60 + seconds! };
}
