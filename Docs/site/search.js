// Finds sections of the pages that have every word that is typed, headings first.
const field = document.getElementById('search');
const list = document.getElementById('found');

function rankOf([, title, heading, text], words) {
    const head = `${title} ${heading}`.toLowerCase();
    const body = text.toLowerCase();
    if (!words.every((word) => head.includes(word) || body.includes(word)))
        return 0;
    return 1 + words.filter((word) => head.includes(word)).length * 10;
}

function show() {
    const words = field.value.toLowerCase().split(/\s+/).filter(Boolean);
    const ranked = words.length === 0 ? [] : sections.map((section) => [rankOf(section, words), section]);
    const best = ranked.filter(([rank]) => rank > 0).sort((one, other) => other[0] - one[0]).slice(0, 12);
    list.replaceChildren(...best.map(([, [place, title, heading]]) => {
        const link = document.createElement('a');
        link.href = place;
        link.textContent = heading === title ? title : `${title}: ${heading}`;
        const item = document.createElement('li');
        item.append(link);
        return item;
    }));
    list.hidden = words.length === 0;
    if (words.length > 0 && best.length === 0)
        list.textContent = 'Nothing is found.';
}

field.addEventListener('input', show);
field.addEventListener('keydown', (event) => {
    if (event.key === 'Enter')
        list.querySelector('a')?.click();
    if (event.key === 'Escape') {
        field.value = '';
        show();
    }
});
document.addEventListener('keydown', (event) => {
    if (event.key === '/' && document.activeElement !== field) {
        event.preventDefault();
        field.focus();
    }
});
list.addEventListener('click', () => {
    field.value = '';
    show();
});
