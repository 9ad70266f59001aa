"""Writes the search index of a site: index_pages.py FOLDER

The index has one row for each heading: its page and place, its words, and the text below it. It is a script and not
JSON, because a page that is opened as a file may load nothing else.
"""

import html.parser
import json
import pathlib
import sys


class Sections(html.parser.HTMLParser):
    """Collects the headings of a page with their text."""

    def __init__(self, page):
        super().__init__()
        self.rows = []
        self.page = page
        self.is_inside = self.is_heading = self.is_mark = False

    def handle_starttag(self, tag, attributes):
        values = dict(attributes)
        self.is_inside = self.is_inside or tag == "main"
        self.is_mark = values.get("class") == "headerlink"
        if self.is_inside and tag in ("h1", "h2", "h3"):
            self.is_heading = True
            place = f"{self.page}#{values['id']}" if tag != "h1" and "id" in values else self.page
            self.rows.append([place, "", ""])

    def handle_endtag(self, tag):
        if tag == "a":
            self.is_mark = False
        if tag in ("h1", "h2", "h3"):
            self.is_heading = False
        if tag == "main":
            self.is_inside = False

    def handle_data(self, data):
        if self.is_inside and self.rows and not self.is_mark:
            self.rows[-1][1 if self.is_heading else 2] += data


def main():
    folder = pathlib.Path(sys.argv[1])
    rows = []
    for file in sorted(folder.glob("*.html")):
        sections = Sections(file.name)
        sections.feed(file.read_text(encoding="utf-8"))
        title = sections.rows[0][1].strip()
        rows += [[place, title, heading.strip(), " ".join(text.split())] for place, heading, text in sections.rows]
    (folder / "search-index.js").write_text(f"const sections = {json.dumps(rows, ensure_ascii=False)};\n",
                                            encoding="utf-8")


main()
