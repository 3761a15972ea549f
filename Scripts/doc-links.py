#!/usr/bin/python3
"""Follows every link of a folder of HTML within it: doc-links.py FOLDER. Links to other places are not followed, and
of a page in a folder "reference" not to the place in it: Doxygen links to headings that it leaves out."""

import html.parser
import pathlib
import sys
import urllib.parse


class Page(html.parser.HTMLParser):
    def __init__(self, path):
        super().__init__()
        self.links, self.anchors = [], {"", "top"}
        self.feed(path.read_text())

    def handle_starttag(self, tag, attributes):
        for name, value in attributes:
            if name in ("id", "name") and value:
                self.anchors.add(value)
            if name in ("href", "src") and value is not None and tag != "base":
                self.links.append(value)


def main(name):
    folder = pathlib.Path(name).resolve()
    pages = {path: Page(path) for path in folder.rglob("*.html")}
    broken = set()
    for path, page in pages.items():
        for link in page.links:
            parts = urllib.parse.urlsplit(link)
            if parts.scheme or parts.netloc:
                continue
            target = (path.parent / urllib.parse.unquote(parts.path)).resolve() if parts.path else path
            if target.is_dir():
                target /= "index.html"
            anchor = urllib.parse.unquote(parts.fragment)
            anchors = pages[target].anchors if target in pages and "reference" not in target.parts else {anchor}
            if not target.exists() or anchor not in anchors:
                broken.add(f"{path.relative_to(folder)}: {link}")
    print(*sorted(broken), f"{sum(len(page.links) for page in pages.values())} links followed", sep="\n")
    return 1 if broken or not pages else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1]))
