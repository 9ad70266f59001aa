// The words of an error in a sentence of the page.

/// Returns the words without the full stop. With the name of a file, the words do not begin with that name, and a clause
/// about the file gets its subject.
export function wordsOf(error: unknown, name = ''): string {
  const words = (error instanceof Error ? error.message : String(error)).replace(/\.$/, '');
  const clause = name && words.startsWith(`${name}: `) ? words.slice(name.length + 2) : words;
  return /^(begins|is) /.test(clause) ? `it ${clause}` : clause;
}
