#!/usr/bin/python3
"""Collects the pages of the site: pages.py SOURCE WORK

Writes WORK/pages, WORK/theme and WORK/mkdocs.yml. The pages are the Markdown files of the repository; a link in them
may lead to any file or folder of the repository, and what is no page becomes one that shows the file. Diagrams are
drawn, and the marks <!-- figures: NAME --> are replaced by what figures.py makes of them. It also compares the figures
in the text that have a mark <!-- measured: NAME [MEMBER] -->. WORK/api/xml has the output of Doxygen.
"""
import os
import re
import shutil
import sys
from pathlib import Path

import yaml

import api
import diagrams
import figures

# Pages that are not called as their files are. The others in docs keep their names.
NAMES = {
    "docs/overview.md": "index.md",
    "README.md": "getting-started.md",
    "SECURITY.md": "security-policy.md",
    "CONTRIBUTING.md": "contributing.md",
    "CHANGELOG.md": "changelog.md",
    "docs/decisions/README.md": "decisions/index.md",
}
# Folders of which the pages are reached from their index.
UNLISTED = ("docs/decisions/",)
LANGUAGES = {".cpp": "cpp", ".h": "cpp", ".py": "python", ".sh": "bash", ".json": "json", ".txt": "text",
             ".cmake": "cmake", ".yml": "yaml"}
FENCE = re.compile(r"^( *)(```+)(\w*)[^\n]*\n(.*?)^\1\2`*[ ]*$\n?", re.M | re.S)
CODE = re.compile(r"(?<!`)(`+)(?!`)(?:(?!\n\s*\n).)+?(?<!`)\1(?!`)", re.S)
LINK = re.compile(r"(!?)\[((?:[^\[\]]|\[[^\]]*\])*)\]\(([^()\s]+)\)")
MARK = re.compile(r"^<!-- figures: (.+) -->$", re.M)


class Pages:
    def __init__(self, source, work):
        self.source = Path(source).resolve()
        self.pages = Path(work) / "pages"
        self.names = dict(NAMES)
        for path in sorted(self.source.glob("docs/**/*.md")):
            relative = path.relative_to(self.source).as_posix()
            self.names.setdefault(relative, relative.removeprefix("docs/"))
        self.waiting = list(self.names)
        self.errors = []
        self.drawn = 0

    def page_for(self, path):
        """The page that shows a file or a folder of the repository; makes it if there is none."""
        if path not in self.names:
            whole = self.source / path
            if whole.is_dir() and f"{path}/README.md" in self.names:
                return self.names[f"{path}/README.md"]
            self.names[path] = f"source/{path}.md" if whole.suffix != ".md" else f"source/{path}"
            self.waiting.append(path)
        return self.names[path]

    def link(self, match, path):
        image, text, target = match.groups()
        if re.match(r"[a-z]+:", target) or target.startswith("#"):
            return match.group(0)
        target, _, anchor = target.partition("#")
        found = os.path.normpath(os.path.join(os.path.dirname(path), target)).rstrip("/")
        if found in (".", "..") or found.startswith("../") or not (self.source / found).exists():
            self.errors.append(f"{path}: the link to {match.group(3)} is dead")
            return match.group(0)
        if image:
            page = found.removeprefix("docs/")
            (self.pages / page).parent.mkdir(parents=True, exist_ok=True)
            shutil.copyfile(self.source / found, self.pages / page)
        else:
            page = self.page_for(found)
        url = os.path.relpath(page, os.path.dirname(self.names[path]) or ".")
        return f"{image}[{text}]({url}{'#' + anchor if anchor else ''})"

    def prose(self, text, path):
        """Text between blocks of code: links are rewritten, except in code."""
        spans = []

        def hide(match):
            spans.append(match.group(0))
            return f"\0{len(spans) - 1}\0"

        marked = CODE.sub(hide, text)
        marked = LINK.sub(lambda match: self.link(match, path), marked)
        marked = MARK.sub(lambda match: self.figures(match.group(1), path), marked)
        marked = figures.MEASURED.sub(lambda match: self.measured(match, path), marked)
        return re.sub(r"\0(\d+)\0", lambda match: spans[int(match.group(1))], marked)

    def figures(self, name, path):
        try:
            return figures.section(self.source, self.pages, name)
        except figures.FigureError as error:
            self.errors.append(f"{path}: {error}")
            return ""

    def measured(self, match, path):
        """A figure in the text, without its mark."""
        try:
            figures.compare(self.source, match)
        except figures.FigureError as error:
            self.errors.append(f"{path}: {error}")
        return match.group(0)[:match.group(0).index("<!--")].rstrip()

    def markdown(self, text, path):
        result, end = [], 0
        for fence in FENCE.finditer(text):
            result.append(self.prose(text[end:fence.start()], path))
            if fence.group(3) == "mermaid":
                try:
                    result.append(diagrams.draw(fence.group(4)) + "\n")
                    self.drawn += 1
                except diagrams.DiagramError as error:
                    self.errors.append(f"{path}: {error}")
            else:
                result.append(fence.group(0))
            end = fence.end()
        return "".join(result + [self.prose(text[end:], path)])

    def listing(self, path):
        """A folder: its files and folders."""
        whole = self.source / path
        lines = [f"# {path}/", ""]
        for child in sorted(whole.iterdir(), key=lambda child: (child.is_file(), child.name)):
            if child.name.startswith("."):
                continue
            url = os.path.relpath(self.page_for(f"{path}/{child.name}"), os.path.dirname(self.names[path]))
            lines.append(f"- [{child.name}{'/' if child.is_dir() else ''}]({url})")
        return "\n".join(lines) + "\n"

    def file(self, path):
        text = (self.source / path).read_text(errors="replace").rstrip("\n")
        language = LANGUAGES.get(Path(path).suffix, "")
        if not language and text.startswith("#!"):
            language = "bash" if "sh" in text.splitlines()[0] else "python"
        if Path(path).name == "CMakeLists.txt":
            language = "cmake"
        fence = "`" * max(3, 1 + max((len(run) for run in re.findall("`+", text)), default=0))
        return f"# {path}\n\n{fence}{language or 'text'}\n{text}\n{fence}\n"

    def write(self):
        while self.waiting:
            path = self.waiting.pop()
            whole = self.source / path
            if whole.is_dir():
                text = self.listing(path)
            elif whole.suffix == ".md":
                text = self.markdown(whole.read_text(), path)
            else:
                text = self.file(path)
            target = self.pages / self.names[path]
            target.parent.mkdir(parents=True, exist_ok=True)
            target.write_text(text)


def pages_in(navigation):
    for item in navigation:
        for value in item.values():
            yield from pages_in(value) if isinstance(value, list) else [value]


def main(source, work):
    for name in ("pages", "theme"):
        shutil.rmtree(Path(work) / name, ignore_errors=True)
    pages = Pages(source, work)
    pages.write()
    shutil.copytree(Path(source) / "docs/site/theme", Path(work) / "theme")
    config = yaml.safe_load((Path(source) / "docs/site/mkdocs.yml").read_text())
    listed = set(pages_in(config["nav"]))
    for path, name in pages.names.items():
        if path.startswith("docs/") and path.endswith(".md") and not path.startswith(UNLISTED) and name not in listed:
            pages.errors.append(f"{path} is not in the navigation of docs/site/mkdocs.yml")
    config["nav"].append({"API reference": api.write_pages(Path(work) / "api/xml", pages.pages)})
    (Path(work) / "mkdocs.yml").write_text(yaml.safe_dump(config, sort_keys=False))
    for error in pages.errors:
        print(error, file=sys.stderr)
    print(f"{len(pages.names)} pages of the repository, {pages.drawn} diagrams")
    return 1 if pages.errors else 0


if __name__ == "__main__":
    sys.exit(main(*sys.argv[1:]))
