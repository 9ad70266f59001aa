// Files that belong together: a movie, and the stream files that were recorded beside it.

export interface Joined {
  name: string;
  /// What the library reads.
  contents: Blob;
  /// What the browser plays.
  movie: File | undefined;
}

const isStream = ({ name }: File) => /\.dat$/i.test(name);
const isRiff = ({ name }: File) => /\.(avi|wav)$/i.test(name);

/// Throws a sentence for a person if they do not belong together.
export function joined(files: File[]): Joined {
  const streams = files.filter(isStream);
  const [movie, another] = files.filter((file) => !isStream(file));
  if (another) throw new Error('open one movie at a time, alone or with its stream files');
  if (files.length === 1) return { name: files[0]!.name, contents: files[0]!, movie: files[0] };
  if (movie && isRiff(movie)) throw new Error('stream files can be opened with an MP4 or MOV movie only');
  const name = movie?.name ?? `${streams[0]!.name} and ${streams.length - 1} more`;
  return { name, contents: new Blob([movie ?? emptyMovie(), ...streamAtoms(streams)]), movie };
}

const headerSize = 16;

/// The header of an atom in its long form.
function atomHeader(type: string, contents: number): Uint8Array<ArrayBuffer> {
  const header = new DataView(new ArrayBuffer(headerSize));
  header.setUint32(0, 1);
  [...type].forEach((letter, i) => header.setUint8(4 + i, letter.charCodeAt(0)));
  header.setBigUint64(8, BigInt(headerSize + contents));
  return new Uint8Array(header.buffer);
}

/// As `zulm attach` appends streams to a movie.
function streamAtoms(streams: File[]): BlobPart[] {
  const atoms = streams.flatMap((stream) => [atomHeader('DATA', stream.size), stream]);
  const size = streams.reduce((sum, stream) => sum + headerSize + stream.size, 0);
  return [atomHeader('ZULM', size), ...atoms];
}

/// An atom that says what kind of file it is.
function emptyMovie(): BlobPart {
  return new TextEncoder().encode('\0\0\0\x14ftypisom\0\0\x02\0isom');
}
