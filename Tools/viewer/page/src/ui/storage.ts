// What the browser keeps from one visit to the next. Pages from a disk may have no storage: then it holds for this one.

export function stored(key: string): string | null {
  try {
    return localStorage.getItem(key);
  } catch {
    return null;
  }
}

/// Null forgets it. Returns false if the browser does not keep it longer than for this visit.
export function store(key: string, value: string | null): boolean {
  try {
    if (value === null) localStorage.removeItem(key);
    else localStorage.setItem(key, value);
    return true;
  } catch {
    return false;
  }
}
