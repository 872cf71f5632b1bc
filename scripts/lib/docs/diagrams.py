"""Draws the Mermaid diagrams of the documentation as SVG: flowcharts, laid out by Graphviz, and sequence diagrams.

Only the part of Mermaid that the documentation uses is read; any other line is an error. The colours are classes of
the site's style sheet, so that a diagram fits light and dark pages.
"""
import html
import re
import subprocess

CHARACTER = 7.3  # pixels, on average, of text of 14 pixels
LINE = 18
MARGIN = 8
# A drawing that is wider than a page is laid out from top to bottom instead.
WIDEST = 760


class DiagramError(Exception):
    pass


def escape(text):
    return html.escape(text, quote=True)


def wrap(text, width):
    """The lines of a text of at most `width` characters, unless a word is longer."""
    lines = [""]
    for word in text.split():
        if lines[-1] and len(lines[-1]) + 1 + len(word) > width:
            lines.append("")
        lines[-1] = f"{lines[-1]} {word}".strip()
    return lines


def text_at(x, y, lines, kind, anchor="middle"):
    """Lines of text, of which the middle is at y."""
    top = y - (len(lines) - 1) * LINE / 2 + 5
    spans = "".join(
        f'<tspan x="{x:.1f}" y="{top + i * LINE:.1f}">{escape(line)}</tspan>' for i, line in enumerate(lines))
    return f'<text class="{kind}" text-anchor="{anchor}">{spans}</text>'


def drawing(width, height, parts, description):
    """A figure that becomes smaller with the page, and scrolls before it becomes too small to read."""
    arrow = ('<defs><marker id="arrow" viewBox="0 0 10 10" refX="9" refY="5" markerWidth="8" markerHeight="8" '
             'orient="auto-start-reverse"><path class="tip" d="M0,0.5 L10,5 L0,9.5 z"/></marker></defs>')
    style = f"max-width:{width:.0f}px;min-width:{width * 0.7:.0f}px"
    return (f'<figure class="diagram" tabindex="0" aria-label="Diagram"><svg role="img" '
            f'aria-label="{escape(description)}" viewBox="0 0 {width:.0f} {height:.0f}" style="{style}">'
            f'{arrow}{"".join(parts)}</svg></figure>')


# Flowcharts

NODE = r'(\w+)(?:\["([^"]+)"\]|\[([^\]]+)\])?'
EDGE = re.compile(rf"^{NODE} (?:(-->)|(-\.->)|-- (.+?) -->|-\. (.+?) \.->) {NODE}$")


def read_flowchart(lines):
    labels, edges = {}, []

    def node(name, quoted, plain):
        label = quoted or plain
        if label:
            labels[name] = label
        labels.setdefault(name, name)
        return name

    for line in lines:
        match = EDGE.match(line)
        if match:
            tail = node(*match.group(1, 2, 3))
            head = node(*match.group(8, 9, 10))
            edges.append((tail, head, match.group(6) or match.group(7) or "", bool(match.group(5) or match.group(7))))
            continue
        match = re.fullmatch(NODE, line)
        if not match or not (match.group(2) or match.group(3)):
            raise DiagramError(f"not a line of a flowchart that is understood: {line}")
        node(*match.group(1, 2, 3))
    return labels, edges


def lay_out(labels, edges, direction):
    """The layout by Graphviz: the size, and the lines of its "plain" format."""
    texts = {name: wrap(label, 24) for name, label in labels.items()}
    lines = ["digraph {", f'rankdir={"TB" if direction == "TD" else direction}; nodesep=0.3; ranksep=0.45;',
             'node [shape=box fixedsize=true]; edge [fontname="Helvetica" fontsize=14 arrowhead=none];']
    for name, text in texts.items():
        width = max(len(line) for line in text) * CHARACTER + 24
        lines.append(f'{name} [label="" width={width / 72:.3f} height={(len(text) * LINE + 18) / 72:.3f}];')
    for tail, head, label, _ in edges:
        shown = "\\n".join(wrap(label, 18)).replace('"', "'")
        lines.append(f'{tail} -> {head} [label="{shown}"];' if label else f"{tail} -> {head};")
    lines.append("}")
    result = subprocess.run(["dot", "-Tplain"], input="\n".join(lines), capture_output=True, text=True, check=True)
    plain = [line.split(" ") for line in result.stdout.replace("\\\n", "").splitlines()]
    return texts, float(plain[0][2]) * 72, float(plain[0][3]) * 72, plain


def draw_flowchart(direction, lines):
    labels, edges = read_flowchart(lines)
    texts, width, height, plain = lay_out(labels, edges, direction)
    if direction == "LR" and width > WIDEST:
        texts, width, height, plain = lay_out(labels, edges, "TD")

    def point(x, y):
        return float(x) * 72 + MARGIN, height - float(y) * 72 + MARGIN

    paths, boxes, captions = [], [], []
    remaining = list(edges)
    for words in plain:
        if words[0] == "node":
            x, y = point(words[2], words[3])
            w, h = float(words[4]) * 72, float(words[5]) * 72
            boxes.append(f'<rect class="box" x="{x - w / 2:.1f}" y="{y - h / 2:.1f}" width="{w:.1f}" '
                         f'height="{h:.1f}" rx="5"/>' + text_at(x, y, texts[words[1]], "label"))
        elif words[0] == "edge":
            edge = next(e for e in remaining if (e[0], e[1]) == (words[1], words[2]))
            remaining.remove(edge)
            count = int(words[3])
            points = [point(words[4 + 2 * i], words[5 + 2 * i]) for i in range(count)]
            curve = f"M{points[0][0]:.1f},{points[0][1]:.1f} C" + " ".join(f"{x:.1f},{y:.1f}" for x, y in points[1:])
            dashed = " dashed" if edge[3] else ""
            paths.append(f'<path class="edge{dashed}" d="{curve}" marker-end="url(#arrow)"/>')
            if edge[2]:
                x, y = point(*words[-4:-2])
                captions.append(text_at(x, y, wrap(edge[2], 18), "caption"))
    description = "; ".join(
        f"{labels[tail]} to {labels[head]}" + (f" ({label})" if label else "") for tail, head, label, _ in edges)
    return drawing(width + 2 * MARGIN, height + 2 * MARGIN, paths + boxes + captions, description)


# Sequence diagrams

STEP = 46
MESSAGE = re.compile(r"^(\w+)(--?>>)(\w+): (.+)$")


def read_sequence(lines):
    """The names of the participants by their identifiers, and the events: messages, and the ends of loops."""
    names, events = {}, []
    for line in lines:
        if match := re.fullmatch(r"participant (\w+)(?: as (.+))?", line):
            names[match.group(1)] = match.group(2) or match.group(1)
        elif match := MESSAGE.match(line):
            unknown = {match.group(1), match.group(3)} - set(names)
            if unknown:
                raise DiagramError(f"no such participant: {', '.join(unknown)}")
            events.append(("message", *match.groups()))
        elif match := re.fullmatch(r"loop (.+)", line):
            events.append(("loop", match.group(1)))
        elif line == "end":
            events.append(("end",))
        else:
            raise DiagramError(f"not a line of a sequence diagram that is understood: {line}")
    return names, events


def name_lines(name):
    """A long name in lines, which end before a capital letter or a blank."""
    parts = re.findall(r"[A-Z]+[^A-Z ]*| [^ ]+", name) if len(name) > 13 else [name]
    lines = [""]
    for part in parts:
        if lines[-1] and len(lines[-1]) + len(part) > 13:
            lines.append("")
        lines[-1] = (lines[-1] + part).strip()
    return lines


def box_width(name):
    return max(len(line) for line in name_lines(name)) * CHARACTER + 20


def lifelines(names, events):
    """The x of each participant: neighbours are as far apart as their names and the messages between them need."""
    order = list(names)
    gaps = [max(60, (box_width(names[a]) + box_width(names[b])) / 2 + 10) for a, b in zip(order, order[1:])]
    for event in events:
        if event[0] == "message" and event[1] != event[3]:
            first, last = sorted((order.index(event[1]), order.index(event[3])))
            needed = max(len(line) for line in wrap(event[4], message_width(last - first))) * CHARACTER * 0.92 + 16
            missing = needed - sum(gaps[first:last])
            for i in range(first, last):
                gaps[i] += max(0, missing) / (last - first)
    x = box_width(names[order[0]]) / 2 + MARGIN
    positions = {}
    for name, gap in zip(order, gaps + [0]):
        positions[name] = x
        x += gap
    return positions, positions[order[-1]] + box_width(names[order[-1]]) / 2 + MARGIN


def message_width(span):
    """The characters in a line of a message between participants that are so far apart."""
    return 20 if span == 1 else 24 * span


def draw_sequence(lines):
    names, events = read_sequence(lines)
    positions, width = lifelines(names, events)
    order = list(names)
    head = max(len(name_lines(name)) for name in names.values()) * LINE + 14
    marks, frames, starts, y = [], [], [], head + 34
    for event in events:
        if event[0] == "loop":
            starts.append((y, event[1]))
            y += 34
        elif event[0] == "end":
            top, caption = starts.pop()
            frames.append(f'<rect class="loop" x="6" y="{top}" width="{width - 12:.1f}" height="{y - top - 6}" rx="5"/>'
                          + text_at(16, top + 14, [f"Repeated {caption}"], "caption", "start"))
            y += 12
        else:
            _, source, arrow, target, text = event
            shown = wrap(text, message_width(abs(order.index(source) - order.index(target))))
            a, b = positions[source], positions[target]
            y += (len(shown) - 1) * LINE
            marks.append(text_at((a + b) / 2, y - 9 - (len(shown) - 1) * LINE / 2, shown, "caption"))
            dashed = " dashed" if arrow == "-->>" else ""
            marks.append(f'<path class="edge{dashed}" d="M{a:.1f},{y + 8} L{b + (-2 if b > a else 2):.1f},{y + 8}" '
                         'marker-end="url(#arrow)"/>')
            y += STEP
    heads = []
    for name, x in positions.items():
        w = box_width(names[name])
        heads.append(f'<path class="lifeline" d="M{x:.1f},{head + 8} V{y - 8}"/>')
        heads.append(f'<rect class="box" x="{x - w / 2:.1f}" y="8" width="{w:.1f}" height="{head}" rx="5"/>'
                     + text_at(x, 8 + head / 2, name_lines(names[name]), "label"))
    description = "; ".join(
        f"{names[e[1]]} to {names[e[3]]}: {e[4]}" if e[0] == "message" else f"repeated {e[1]}:"
        for e in events if e[0] != "end")
    return drawing(width, y, frames + heads + marks, description)


def draw(source):
    """The figure of a diagram in Mermaid's notation."""
    lines = [line.strip() for line in source.splitlines() if line.strip()]
    if match := re.fullmatch(r"flowchart (TD|LR)", lines[0]):
        return draw_flowchart(match.group(1), lines[1:])
    if lines[0] == "sequenceDiagram":
        return draw_sequence(lines[1:])
    raise DiagramError(f"neither a flowchart nor a sequence diagram: {lines[0]}")
