#!/usr/bin/python3
"""Checks a site: check_links.py FOLDER

Every link to a page, a place in a page, an image, a style sheet or a script leads to something in the folder, and
nothing is loaded from elsewhere. Links to other sites are not followed.
"""
import re
import sys
from html.parser import HTMLParser
from pathlib import Path
from urllib.parse import unquote, urlsplit

LOADED = {("script", "src"), ("img", "src"), ("iframe", "src"), ("source", "src"), ("link", "href")}


class Page(HTMLParser):
    def __init__(self, text):
        super().__init__()
        self.links = []  # (URL, whether it is loaded with the page)
        self.anchors = set()
        self.feed(text)

    def handle_starttag(self, tag, attributes):
        for name, value in attributes:
            if name == "id" or (tag == "a" and name == "name"):
                self.anchors.add(value)
            elif name in ("href", "src") and value is not None:
                self.links.append((value, (tag, name) in LOADED))


def dead_link(root, pages, path, url, is_loaded):
    """Why a link is wrong, or none."""
    parts = urlsplit(url)
    if parts.scheme in ("http", "https", "mailto") or parts.netloc:
        return "is loaded from elsewhere" if is_loaded else None
    if parts.scheme == "data":
        return None
    if parts.scheme or parts.path.startswith("/"):
        return "leads out of the site"
    target = (path.parent / unquote(parts.path)).resolve() if parts.path else path
    if target.is_dir():
        target = target / "index.html"
    if not target.is_file() or root not in target.parents:
        return "leads to nothing"
    if parts.fragment and target in pages:
        fragment = unquote(parts.fragment)
        if fragment not in pages[target].anchors and fragment != "__toc":
            return "leads to a place that the page does not have"
    return None


def main(folder):
    root = Path(folder).resolve()
    # The page for errors is shown at any path, and therefore has absolute links.
    (root / "404.html").unlink(missing_ok=True)
    pages = {path: Page(path.read_text()) for path in sorted(root.rglob("*.html"))}
    failures, count = [], 0
    for path, page in pages.items():
        for url, is_loaded in page.links:
            count += 1
            why = dead_link(root, pages, path, url, is_loaded)
            if why:
                failures.append(f"{path.relative_to(root)}: {url} {why}")
    for path in root.rglob("*.css"):
        for url in re.findall(r"""url\(["']?([^"')]+)""", path.read_text()):
            if re.match("(https?:)?//", url):
                failures.append(f"{path.relative_to(root)}: {url} is loaded from elsewhere")
    for failure in failures:
        print(failure, file=sys.stderr)
    print(f"{count} links in {len(pages)} pages")
    return 1 if failures or count < 1000 else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1]))
