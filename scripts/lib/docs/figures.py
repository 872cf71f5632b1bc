"""What is inserted in pages at the marks <!-- figures: NAME -->: the figures of docs/figures/bench.json as tables, with
the plots of scripts/lib/bench_plots; and what the tree itself says about its tests. What a page itself says before a mark
<!-- measured: NAME [MEMBER] --> is compared with docs/figures/bench.json."""
import html
import json
import re
import subprocess
import xml.etree.ElementTree as ElementTree
from pathlib import Path

# The plots of each group
PLOTS = {
    "checking a token": ["check_token"],
    "memory of a token": ["token_memory"],
    "signed requests": ["signed_requests"],
    "a token by password": ["exchange"],
    "a token from the cache": ["token_source"],
    "token gate": ["token_gate"],
    "a source of a thousand keys": [],
}
UNITS = {"us": "µs", "ns": "ns", "bytes": "bytes", "times": "times"}
AIMS = {"ratio_at_most": "ratio at most", "ratio_at_least": "ratio at least", "value_at_most": "at most",
        "value_at_least": "at least"}
# What a page says before a mark: a number and its unit; without a unit, a ratio or how many there are in a second
MEASURED = re.compile(r"(?:(\d[\d,.]*)(?: (ns|µs|ms|KB|times))?\s)?<!-- measured: (\S+)(?: (\S+))? -->")
FACTORS = {"ns": 1e-9, "us": 1e-6, "µs": 1e-6, "ms": 1e-3, "bytes": 1, "KB": 1000, "times": 1, None: 1}
# Pages round.
TOLERANCE = 0.05


class FigureError(Exception):
    pass


def is_reached(figure):
    (kind, limit), = figure["aim"].items()
    value = figure["ratio"] if kind.startswith("ratio") else figure["value"]
    return value <= limit if kind.endswith("most") else value >= limit


def quantity(value, unit):
    text = f"{value:,.0f}" if value >= 1000 else f"{value:g}"
    return f"{text} {UNITS[unit]}"


def row(figure):
    aim, compared = "", ""
    if "aim" in figure:
        (kind, limit), = figure["aim"].items()
        aim = f"{AIMS[kind]} {limit:g}: {'reached' if is_reached(figure) else '**missed**'}"
    if "reference" in figure:
        compared = f"{figure['reference']}: {quantity(figure['reference_value'], figure['unit'])}"
    ratio = f"{figure['ratio']:.2f}" if "ratio" in figure else ""
    cells = [figure["title"], quantity(figure["value"], figure["unit"]), compared, ratio, aim]
    return f"| {' | '.join(cells)} |"


def plot(pages, name):
    """The plot as an image, whose description is that of the drawing."""
    text = (pages / f"figures/{name}.svg").read_text()
    description = ElementTree.fromstring(text).findtext("{http://www.w3.org/2000/svg}desc") or ""
    if not description:
        raise FigureError(f"The plot {name} has no description.")
    return f'<p><img class="plot" src="figures/{name}.svg" alt="{html.escape(description, quote=True)}"></p>'


def draw_plots(source, pages):
    if not (pages / "figures").exists():
        subprocess.run([source / "scripts/lib/bench_plots", source / "docs/figures/bench.json", pages / "figures"],
                       check=True)


def measured(source, pages, group):
    data = json.loads((source / "docs/figures/bench.json").read_text())
    draw_plots(source, pages)
    if group == "all":
        return plot(pages, "ratios")
    if group == "machine":
        machine = data["machine"]
        return (f"Measured on {data['date']} with version {data['version']}, on {machine['cores']} cores of "
                f"{machine['processor']}, {data['system']}, with {data['compiler']} and OpenSSL {data['openssl']}.")
    figures = [figure for figure in data["figures"] if figure["group"] == group]
    if group not in PLOTS or not figures:
        raise FigureError(f"There are no figures of the group '{group}'.")
    lines = [plot(pages, name) for name in PLOTS[group]]
    lines += ["", "| what | measured | compared with | ratio | aim |", "|---|---|---|---|---|"]
    return "\n".join(lines + [row(figure) for figure in figures])


def compare(source, match):
    """Compares what a page says with the figure that its mark names: by its value, or by another member, or by how often
    it is possible in a second ("rate", "reference_rate")."""
    number, unit, name, member = match.groups()
    member = member or "value"
    kept = member.replace("rate", "value") if member.endswith("rate") else member
    data = json.loads((source / "docs/figures/bench.json").read_text())
    found = [figure for figure in data["figures"] if figure["name"] == name and kept in figure]
    if not found or number is None:
        raise FigureError(f"There is no figure '{name}' with {member}, or no number before its mark.")
    measured = found[0][kept] * (1 if member == "ratio" else FACTORS[found[0]["unit"]])
    if member.endswith("rate"):
        measured = 1 / measured
    said = float(number.rstrip(".,").replace(",", "")) * FACTORS[unit]
    if abs(said - measured) > TOLERANCE * measured:
        raise FigureError(f"The page says {number} for {name}, but its {member} was measured as {measured:g}.")


def count_in(source, pattern, expression, exclude=""):
    return sum(len(re.findall(expression, path.read_text(), re.M)) for path in source.glob(pattern)
               if not exclude or exclude not in path.as_posix())


def tests(source):
    """The counts of the tests, from their sources."""
    case = r"^(?:TYPED_)?TEST(?:_F|_P)?\("
    roots = ["tests", "tarnik/tests", "gssapi/tests", "access/tests", "devsts/tests",
             "tools/ssoclient/tests"]
    everything = sum(count_in(source, f"{root}/**/*.cpp", case) for root in roots)
    rows = [
        ("test cases, each with many inputs where rules have tables", everything),
        ("of them, attacks on token gates (`access/tests/gate_attacks`)",
         count_in(source, "access/tests/gate_attacks/*.cpp", case)),
        ("of them, with failing allocations, threads, descriptors or crypto calls",
         count_in(source, "tests/faults/**/*.cpp", case) + count_in(source, "access/tests/faults/**/*.cpp", case)),
        ("of them, secrets, token files and the terminal of the program `ssoclient`",
         count_in(source, "tools/ssoclient/tests/input/*.cpp", case) +
         count_in(source, "tools/ssoclient/tests/commands/terminal_test.cpp", case)),
        ("fuzzers (`fuzz`)", len(list(source.glob("fuzz/**/*_fuzz.cpp")))),
        ("seeds of the fuzzers", sum(path.is_file() for path in source.glob("fuzz/seeds/**/*"))),
        ("planted faults that the fuzzers must find (`fuzz/planted`)", len(list(source.glob("fuzz/planted/*.patch")))),
    ]
    if not all(count for _, count in rows):
        raise FigureError(f"Something was not counted: {rows}")
    return "\n".join(["| what | number |", "|---|---|"] + [f"| {what} | {count:,} |" for what, count in rows])


def coverage(source):
    """The lines that the fuzzers must reach, as scripts/fuzz --coverage requires them."""
    text = (source / "scripts/lib/fuzz_coverage.sh").read_text()
    minima = re.findall(r"(\S+)=(\d+)", re.search(r"^minima=\((.*?)\)", text, re.M | re.S).group(1))
    return "\n".join(["| folder | at least |", "|---|---|"] + [f"| `{folder}` | {share} % |" for folder, share in minima])


def section(source, pages, name):
    if name == "tests":
        return tests(source)
    if name == "fuzz coverage":
        return coverage(source)
    return measured(source, pages, name)
