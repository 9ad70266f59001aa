// The metadata in a page: a file that was compressed, as text.

const distance = 16; // bytes over which the file is compared with itself, as PackedBytes.h has it
const pieceSize = 1 << 22; // characters at a time, whole groups of base64

/// Pieces of a text in base64 that can be read one by one.
export function* piecesOf(text: string): Generator<string> {
  for (let start = 0; start < text.length; start += pieceSize) yield text.slice(start, start + pieceSize);
}

function bytesOf(base64: string): Uint8Array<ArrayBuffer> {
  const text = atob(base64);
  const bytes = new Uint8Array(text.length);
  for (let i = 0; i < text.length; ++i) bytes[i] = text.charCodeAt(i);
  return bytes;
}

/// Replaces the differences from `start` to `end` by the bytes themselves.
function addUp(bytes: Uint8Array, start: number, end: number): void {
  for (let i = Math.max(start, distance); i < end; ++i) bytes[i]! += bytes[i - distance]!;
}

export class PackedFile {
  private readonly pieces: Uint8Array<ArrayBuffer>[] = [];

  /// Takes the next piece of the text.
  take(text: string): void {
    this.pieces.push(bytesOf(text));
  }

  /// The file, which has this size.
  async unpacked(size: number): Promise<Uint8Array<ArrayBuffer>> {
    const bytes = new Uint8Array(size);
    let used = 0;
    for await (const piece of this.inflated()) {
      if (used + piece.length > size) throw new Error('the metadata in this page is damaged');
      bytes.set(piece, used);
      addUp(bytes, used, used + piece.length);
      used += piece.length;
    }
    if (used < size) throw new Error('the metadata in this page is cut short');
    return bytes;
  }

  private async *inflated(): AsyncGenerator<Uint8Array> {
    const pieces = this.pieces.values();
    const source = new ReadableStream<Uint8Array<ArrayBuffer>>({
      pull(controller) {
        const { value, done } = pieces.next();
        if (done) controller.close();
        else controller.enqueue(value);
      },
    });
    const reader = source.pipeThrough(new DecompressionStream('deflate')).getReader();
    for (let part = await reader.read(); !part.done; part = await reader.read()) yield part.value;
  }
}
