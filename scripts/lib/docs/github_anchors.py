"""A Markdown extension: headings have the ids that GitHub gives them, so that links work there and on the site."""
import re

from markdown.extensions import Extension
from markdown.treeprocessors import Treeprocessor


def slug(text):
    """The id of a heading with this text, without markup."""
    return re.sub(r"[^\w\- ]", "", text.strip().lower()).replace(" ", "-")


class AnchorProcessor(Treeprocessor):
    def run(self, root):
        used = {}
        for element in root.iter():
            if not re.fullmatch("h[1-6]", element.tag):
                continue
            name = slug("".join(element.itertext()))
            count = used.get(name, 0)
            used[name] = count + 1
            element.set("id", f"{name}-{count}" if count else name)


class AnchorExtension(Extension):
    def extendMarkdown(self, md):
        # After the inline patterns (20) and before the table of contents (5), which keeps ids.
        md.treeprocessors.register(AnchorProcessor(md), "github_anchors", 15)


def makeExtension(**options):
    return AnchorExtension(**options)
