"""The pages of the API reference: one for each public header, from Doxygen's XML."""
import html
import os
import re
import xml.etree.ElementTree as ElementTree
from pathlib import Path

# The folder of the headers, the folder of the pages, the title, and what it is.
LIBRARIES = [
    ("include/ssoclient/", "ssoclient", "Client", "libssoclient.so: one operation at a time"),
    ("access/include/ssoclient/access/", "access", "Access", "libssoclient-access.so: token sources and token gates"),
    ("gssapi/include/ssoclient/", "gssapi", "GSSAPI", "libssoclient-gssapi.so: the Kerberos login"),
    ("tarnik/include/tarnik/", "tarnik", "Tarnik", "libtarnik.so: the platform library"),
]


class ApiError(Exception):
    pass


def is_described(element):
    return any("".join(element.find(tag).itertext()).strip() for tag in ("briefdescription", "detaileddescription"))


class Entity:
    """A class, an enumeration, a function, a type, a constant or a macro."""

    def __init__(self, element, kind, name, scope):
        self.element = element
        self.kind = kind
        self.name = name
        self.scope = scope
        location = element.find("location")
        self.file = location.get("file")
        self.line = int(location.get("line"))
        self.members = []
        self.anchor = ""

    @property
    def qualified(self):
        return f"{self.scope}::{self.name}" if self.scope else self.name

    def has_description(self):
        return is_described(self.element)


def library_of(path):
    for library in LIBRARIES:
        if path.startswith(library[0]):
            return library
    raise ApiError(f"{path} belongs to no library")


def page_of(path):
    """The page of a header, such as "api/access/token_gate.md"."""
    folder, name, _, _ = library_of(path)
    return f"api/{name}/{path[len(folder):].removesuffix('.h')}.md"


class Reference:
    def __init__(self, folder):
        self.entities = {}  # by header
        self.targets = {}  # the page and the anchor of each qualified name
        self.folder = Path(folder)
        for compound in ElementTree.parse(self.folder / "index.xml").getroot().findall("compound"):
            kind = compound.get("kind")
            if kind in ("class", "struct", "namespace"):
                root = ElementTree.parse(self.folder / f"{compound.get('refid')}.xml").getroot()
                self.read(root.find("compounddef"), kind)
            if kind == "file":
                root = ElementTree.parse(self.folder / f"{compound.get('refid')}.xml").getroot()
                self.read_macros(root)
        self.assign_anchors()

    def read_macros(self, root):
        for element in root.iter("memberdef"):
            if element.get("kind") != "define" or element.find("initializer") is None:
                continue  # such as an include guard
            macro = Entity(element, "define", element.findtext("name"), "")
            if not macro.has_description():  # of which Doxygen does not warn
                raise ApiError(f"{macro.file}:{macro.line}: {macro.name} is not documented.")
            self.entities.setdefault(macro.file, []).append(macro)

    def read(self, element, kind):
        name = element.findtext("compoundname")
        members = [Entity(member, member.get("kind"), member.findtext("name"), name)
                   for member in element.iter("memberdef") if member.get("prot") != "private"]
        if kind == "namespace":
            if members and not is_described(element):
                raise ApiError(f"The namespace {name} is not documented in docs/site/namespaces.dox.")
            for member in members:
                if member.has_description():
                    self.entities.setdefault(member.file, []).append(member)
            return
        if element.get("prot") == "private":
            return
        scope = self.namespace_of(name)
        entity = Entity(element, kind, name[len(scope) + 2:], scope)
        if not entity.has_description():
            return  # only declared
        # What has no comment overrides a function that has one, or is a destructor or deleted.
        entity.members = sorted((m for m in members if m.has_description()), key=lambda m: m.line)
        self.entities.setdefault(entity.file, []).append(entity)

    def namespace_of(self, name):
        parts = name.split("::")
        for count in range(len(parts) - 1, 0, -1):
            identifier = "namespace" + "_1_1".join(parts[:count])
            if (self.folder / f"{identifier}.xml").exists():
                return "::".join(parts[:count])
        raise ApiError(f"{name} is in no namespace")

    def assign_anchors(self):
        for path, entities in self.entities.items():
            entities.sort(key=lambda entity: entity.line)
            page, used = page_of(path), {}
            for entity in entities:
                self.name(page, entity, entity.name, used)
                for member in entity.members:
                    self.name(page, member, f"{entity.name}.{member.name}", used)
                    self.name_values(page, member, member.scope)
                self.name_values(page, entity, entity.scope)

    def name_values(self, page, entity, scope):
        for value in entity.element.findall("enumvalue"):
            name = value.findtext("name")
            if not is_described(value):  # of which Doxygen does not warn
                raise ApiError(f"{entity.file}:{entity.line}: {entity.name}::{name} is not documented.")
            self.targets[f"{scope}::{entity.name}::{name}"] = (page, f"{entity.anchor}.{name}")

    def name(self, page, entity, name, used):
        name = re.sub(r"[^\w.~=<>!-]", "-", name.replace("::", "."))
        used[name] = used.get(name, 0) + 1
        entity.anchor = name if used[name] == 1 else f"{name}-{used[name]}"
        self.targets.setdefault(entity.qualified, (page, entity.anchor))

    def find(self, text, scope):
        """The page and the anchor of what a text in a comment names, or none."""
        name = re.sub(r"\(\)$", "", text)
        if not re.fullmatch(r"~?\w+(::\w+)*", name):
            return None
        parts = scope.split("::") if scope else []
        for count in range(len(parts), -1, -1):
            found = self.targets.get("::".join(parts[:count] + [name]))
            if found:
                return found
        matches = {target for qualified, target in self.targets.items() if qualified.endswith("::" + name)}
        return matches.pop() if len(matches) == 1 else None


class PageWriter:
    def __init__(self, reference, path):
        self.reference = reference
        self.path = path
        self.page = page_of(path)
        self.scope = ""

    def link(self, text):
        code = f"<code>{html.escape(text)}</code>"
        target = self.reference.find(text, self.scope)
        if not target:
            return code
        url = os.path.relpath(target[0], os.path.dirname(self.page)).removesuffix(".md") + ".html"
        return f'<a href="{"" if target[0] == self.page else url}#{html.escape(target[1])}">{code}</a>'

    def inline(self, element):
        """The content of a paragraph, whose lists and examples are returned as blocks of their own."""
        blocks, text = [], [html.escape(element.text or "", quote=False)]

        def end_paragraph():
            content = " ".join("".join(text).split())
            if content:
                blocks.append(f"<p>{content}</p>")
            text.clear()

        for child in element:
            if child.tag == "computeroutput":
                text.append(self.link("".join(child.itertext())))
            elif child.tag == "ref":
                text.append(html.escape("".join(child.itertext()), quote=False))
            elif child.tag == "ulink":
                text.append(f'<a href="{html.escape(child.get("url"))}">{html.escape("".join(child.itertext()))}</a>')
            elif child.tag in ("itemizedlist", "orderedlist"):
                end_paragraph()
                tag = "ul" if child.tag == "itemizedlist" else "ol"
                items = "".join(f"<li>{''.join(b for p in item for b in self.inline(p))}</li>" for item in child)
                blocks.append(f"<{tag}>{items}</{tag}>")
            elif child.tag in ("programlisting", "verbatim", "preformatted"):
                end_paragraph()
                blocks.append(f"<pre><code>{html.escape(self.code(child))}</code></pre>")
            else:
                raise ApiError(f"{self.path}: <{child.tag}> in a comment is not understood")
            text.append(html.escape(child.tail or "", quote=False))
        end_paragraph()
        return blocks

    def code(self, element):
        if element.tag != "programlisting":
            return "".join(element.itertext())
        lines = []
        for line in element.findall("codeline"):
            for space in line.iter("sp"):
                space.text = " "
            lines.append("".join(line.itertext()))
        return "\n".join(lines)

    def description(self, element):
        blocks = []
        for tag in ("briefdescription", "detaileddescription"):
            for paragraph in element.find(tag):
                blocks += self.inline(paragraph)
        return "".join(blocks)

    def signature(self, entity):
        element = entity.element
        if entity.kind == "enum":
            strong = "enum class" if element.get("strong") == "yes" else "enum"
            return f"{strong} {entity.name}"
        if entity.kind in ("class", "struct"):
            bases = ", ".join(f"{base.get('prot')} {'virtual ' if base.get('virt') == 'virtual' else ''}{base.text}"
                              for base in element.findall("basecompoundref") if base.get("prot") != "private")
            return f"{entity.kind} {entity.name}" + (f" : {bases}" if bases else "")
        if entity.kind == "define":
            return f"#define {entity.name} {''.join(element.find('initializer').itertext())}"
        text = element.findtext("definition")
        # Doxygen writes the whole scope before the name.
        text = text.replace(f"{entity.scope}::{entity.name}", entity.name)
        if entity.kind in ("function", "friend"):
            text += element.findtext("argsstring") or ""
        else:
            initializer = element.find("initializer")
            value = "" if initializer is None else "".join(initializer.itertext()).strip()
            text += value if value.startswith("{") else f" {value}"
        text = re.sub(r"\s+", " ", text.strip()).replace("=0", "= 0").replace("=default", "= default")
        if element.get("explicit") == "yes" and not text.startswith("explicit"):
            text = f"explicit {text}"
        template = element.find("templateparamlist")
        if template is not None:
            names = ", ".join(" ".join("".join(p.itertext()).split()) for p in template)
            text = f"template <{names}>\n{text}"
        return self.broken(text)

    def broken(self, text):
        """Breaks a long declaration after the commas of its parameters."""
        last = text.splitlines()[-1]
        if len(last) <= 76 or "(" not in last:
            return text
        head, _, rest = last.partition("(")
        parameters, depth, current = [], 0, ""
        for character in rest:
            depth += (character in "(<{") - (character in ")>}")
            current += character
            if character == "," and depth == 0:
                parameters.append(current.strip())
                current = ""
        return "\n".join(text.splitlines()[:-1] + [f"{head}("] + [f"    {p}" for p in parameters + [current.strip()]])

    def fields(self, entities):
        rows = []
        for entity in entities:
            rows.append(f'<dt id="{html.escape(entity.anchor)}"><code>{html.escape(self.signature(entity))}</code></dt>'
                        f"<dd>{self.description(entity.element)}</dd>")
        return f'<dl class="fields">{"".join(rows)}</dl>'

    def values(self, entity):
        rows = []
        for value in entity.element.findall("enumvalue"):
            name = value.findtext("name")
            rows.append(f'<dt id="{html.escape(entity.anchor)}.{name}"><code>{name}</code></dt>'
                        f"<dd>{self.description(value)}</dd>")
        return f'<dl class="fields">{"".join(rows)}</dl>'

    def heading(self, level, entity, title):
        return f'<div class="anchor" id="{html.escape(entity.anchor)}"></div>\n\n{"#" * level} {title}'

    def block(self, entity):
        parts = [f"```cpp\n{self.signature(entity)}\n```", self.description(entity.element)]
        if entity.kind == "enum":
            parts.append(self.values(entity))
        return parts

    def entity(self, entity, previous):
        """What a namespace declares; overloads that follow one another have one heading."""
        self.scope = entity.qualified if entity.kind in ("class", "struct") else entity.scope
        parts = []
        if previous is None or (previous.name, previous.kind) != (entity.name, "function"):
            parts.append(self.heading(2, entity, entity.name))
        else:
            parts.append(f'<div class="anchor" id="{html.escape(entity.anchor)}"></div>')
        parts += self.block(entity)
        fields = [member for member in entity.members if member.kind == "variable"]
        if fields:
            parts.append(self.fields(fields))
        before = None
        for member in entity.members:
            if member in fields:
                continue
            if before is None or before.name != member.name:
                parts.append(self.heading(3, member, self.title(member)))
            else:
                parts.append(f'<div class="anchor" id="{html.escape(member.anchor)}"></div>')
            parts += self.block(member)
            before = member
        return parts

    def title(self, member):
        return re.sub(r"([<>*_\\])", r"\\\1", member.name)

    def write(self):
        include = self.path.split("/include/")[-1].removeprefix("include/")
        _, _, _, what = library_of(self.path)
        scopes = sorted({entity.scope for entity in self.reference.entities[self.path] if entity.scope})
        namespaces = f" Namespace: {', '.join(f'<code>{name}</code>' for name in scopes)}." if scopes else ""
        parts = [f"# {os.path.basename(self.path)}", f"```cpp\n#include <{include}>\n```",
                 f"<p>Library: {html.escape(what.split(':')[0])}.{namespaces}</p>"]
        previous = None
        for entity in self.reference.entities[self.path]:
            parts += self.entity(entity, previous)
            previous = entity
        return "\n\n".join(part for part in parts if part) + "\n"


def first_sentence(blocks):
    text = re.sub(r"</?a\b[^>]*>", "", re.sub(r"^<p>(.*?)</p>.*$", r"\1", blocks, flags=re.S))
    return re.split(r"(?<=[.:]) (?=[A-Z<])", text)[0].rstrip(":")


def index_page(reference):
    """The contents: each header of each library, with what it declares."""
    parts = ["# API reference",
             "Each page is one installed header. Names in `Tarnik::Detail` are for the libraries themselves."]
    for folder, name, title, what in LIBRARIES:
        parts.append(f"## {title}")
        rows = []
        for path in sorted(p for p in reference.entities if p.startswith(folder)):
            writer = PageWriter(reference, path)
            writer.page = "api/index.md"
            url = page_of(path).removeprefix("api/").removesuffix(".md") + ".html"
            names, seen = [], set()
            for entity in reference.entities[path]:
                if entity.name not in seen:
                    seen.add(entity.name)
                    target = f"{url}#{html.escape(entity.anchor)}"
                    names.append(f'<a href="{target}"><code>{html.escape(entity.name)}</code></a>')
            writer.scope = reference.entities[path][0].scope
            about = first_sentence(writer.description(reference.entities[path][0].element))
            rows.append(f'<dt><a href="{url}">{path[len(folder):]}</a></dt><dd><p>{about}</p>'
                        f'<p>{" ".join(names)}</p></dd>')
        library, _, content = what.partition(": ")
        parts.append(f"<p><code>{library}</code>: {html.escape(content)}.</p>")
        parts.append(f'<dl class="fields headers">{"".join(rows)}</dl>')
    return "\n\n".join(parts) + "\n"


def write_pages(xml_folder, pages):
    """Writes the pages below `pages`, and returns their part of the navigation."""
    reference = Reference(xml_folder)
    if len(reference.entities) < 50:
        raise ApiError(f"Only {len(reference.entities)} headers were found.")
    navigation = [{"Contents": "api/index.md"}]
    for path in reference.entities:
        target = Path(pages) / page_of(path)
        target.parent.mkdir(parents=True, exist_ok=True)
        target.write_text(PageWriter(reference, path).write())
    (Path(pages) / "api/index.md").write_text(index_page(reference))
    for folder, _, title, _ in LIBRARIES:
        paths = sorted(p for p in reference.entities if p.startswith(folder))
        navigation.append({title: [{path[len(folder):]: page_of(path)} for path in paths]})
    return navigation
