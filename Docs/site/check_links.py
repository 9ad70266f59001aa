"""Reports the links of a site that lead nowhere: check_links.py FOLDER

Follows every link to a file and to a place in a page, and reports pages that no link leads to. It needs no network:
links to other sites are only counted.
"""

import html.parser
import pathlib
import sys
import urllib.parse

ADDRESSES = {"a": "href", "link": "href", "img": "src", "script": "src"}


class Page(html.parser.HTMLParser):
    def __init__(self, file):
        super().__init__()
        self.links = []
        self.places = {"", "top"}
        self.feed(file.read_text(encoding="utf-8"))

    def handle_starttag(self, tag, attributes):
        values = dict(attributes)
        self.places.update(value for value in (values.get("id"), values.get("name")) if value)
        address = values.get(ADDRESSES.get(tag))
        if address is not None:
            self.links.append(address)


def main():
    root = pathlib.Path(sys.argv[1]).resolve()
    pages = {file: Page(file) for file in sorted(root.rglob("*.html"))}
    broken = inside = outside = 0
    reached = {root / "index.html"}
    for file, page in pages.items():
        for address in page.links:
            parts = urllib.parse.urlsplit(address)
            if parts.scheme == "javascript":
                continue
            if parts.scheme or parts.netloc:
                outside += 1
                continue
            inside += 1
            target = (file.parent / urllib.parse.unquote(parts.path)).resolve() if parts.path else file
            place = urllib.parse.unquote(parts.fragment)
            if target != file:
                reached.add(target)
            if not target.is_file():
                print(f"{file.relative_to(root)}: {address} leads to no file")
                broken += 1
            elif target in pages and place not in pages[target].places:
                print(f"{file.relative_to(root)}: {address} leads to no place in its page")
                broken += 1
    for file in {file for file in pages if file.parent == root} - reached:  # Doxygen's menus are made by a script
        print(f"{file.relative_to(root)}: nothing leads to it")
        broken += 1
    print(f"{len(pages)} pages, {inside} links inside, {outside} to other sites, {broken} broken")
    sys.exit(1 if broken or not pages else 0)


main()
