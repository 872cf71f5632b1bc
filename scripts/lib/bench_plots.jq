# Draws one plot of the figures of scripts/bench as SVG: horizontal bars, each with its label and its value. $plot is the
# name of the plot; prints the names of all plots if it is empty. A bar is {label, value, text, colour}.
def colours: {ours: "#1f6fb4", other: "#8a8f98", peer: "#b5651d", missed: "#b3261e"};
def escaped: gsub("&"; "&amp;") | gsub("<"; "&lt;") | gsub(">"; "&gt;") | gsub("\""; "&quot;");
# Positions have one digit after the point.
def position: . * 10 | round / 10;

def with_prefix($subject): select(.name | startswith($subject + "/"));
def value_text: "\(.value) \(.unit | if . == "us" then "µs" else . end)";
def own_bar: {label: .title, value, text: value_text, colour: "ours"};
def reference_bar: {label: .reference, value: .reference_value, text: (.value = .reference_value | value_text), colour: "other"};
def pair: [own_bar + {starts: true}, reference_bar];
def all($subject): [.figures[] | with_prefix($subject)];

def check_token:
  all("check_token") as $ours | all("peer_check") as $peers
  | [range($ours | length) as $i | ($ours[$i] | pair[]),
      ($peers[$i] | {label: "xmlsec1", value, text: value_text, colour: "peer"})];
# Bars of ratios with an aim, as a share of the aim: 1 is the aim itself, and less is better.
def aimed_ratio:
  (.aim.ratio_at_most // .aim.ratio_at_least) as $aim
  | (if .aim.ratio_at_most then .ratio / $aim else $aim / .ratio end) as $share
  | {label: "\(.group): \(.title)", value: $share,
      text: "\(.ratio) (aim: at \(if .aim.ratio_at_most then "most" else "least" end) \($aim))",
      colour: (if $share > 1 then "missed" else "ours" end)};

def plots: {
  check_token: {title: "Time to check a token", scale: "log", bars: check_token},
  token_memory: {title: "Memory of a token, divided by the length of its text", scale: "linear",
    bars: [all("token_memory")[] | {label: .title, value: .ratio, text: "\(.ratio)", colour: "ours"}]},
  signed_requests: {title: "Time to make a signed request", scale: "linear", bars: [all("signed_request")[] | pair[]]},
  exchange: {title: "Time to acquire a token by password, over TLS", scale: "linear",
    bars: [(all("exchange") + all("source"))[] | pair[]]},
  token_source: {title: "Time of a call that the cache of a token source answers", scale: "linear",
    bars: ((all("cached_token") | map(own_bar)) + (all("cached_token")[:1] | map(reference_bar)))},
  token_gate: {title: "Time to check a token at a gate", scale: "log", bars: [all("gate")[] | pair[]]},
  ratios: {title: "Ratios beside their aims (the line)", scale: "linear", mark: 1,
    bars: [.figures[] | select(.aim.ratio_at_most or .aim.ratio_at_least) | aimed_ratio]}
};

def row: 22;
def top: 54;
# The usual widths of a letter, for the labels and for the texts after the bars.
def label_width: [.bars[].label | length * 7.4] | max + 24 | position;
def text_width: [.bars[].text | length * 7.4] | max + 20 | position;

def length_of($scale; $width; $least; $most):
  if $scale == "log" then (log10 - ($least | log10) + 0.3) / (($most | log10) - ($least | log10) + 0.3)
  else . / $most end
  | . * $width | position;

def svg:
  . as $shown
  | ([.bars[].value, (.mark // empty)] | max) as $most
  | ([.bars[].value] | min) as $least
  | label_width as $left
  | (800 - $left - text_width) as $width
  # A gap before each bar that begins a group.
  | (reduce .bars[] as $bar ([];
      . + [if . == [] then top else last + row + (if $bar.starts then 8 else 0 end) end])) as $ys
  | ($ys[-1] + row + 14) as $height
  | (.title + (if .scale == "log" then " (logarithmic)" else "" end)) as $title
  | "<svg xmlns=\"http://www.w3.org/2000/svg\" viewBox=\"0 0 800 \($height)\" role=\"img\""
      + " font-family=\"sans-serif\" font-size=\"14\">",
    "<title>\($title | escaped)</title>",
    "<desc>\([.bars[] | "\(.label): \(.text)"] | join("; ") | escaped)</desc>",
    "<rect width=\"800\" height=\"\($height)\" rx=\"8\" fill=\"#ffffff\"/>",
    "<text x=\"16\" y=\"32\" font-size=\"18\" fill=\"#1c1e21\">\($title | escaped)</text>",
    (if .mark then (.mark | length_of($shown.scale; $width; $least; $most)) as $x
      | "<path d=\"M\($left + $x | position) \(top - 4)V\($height - 12)\" stroke=\"#1c1e21\" stroke-dasharray=\"4 3\"/>"
    else empty end),
    (range(.bars | length) as $i | .bars[$i] as $bar | $ys[$i] as $y
      | ($bar.value | length_of($shown.scale; $width; $least; $most)) as $length
      | "<text x=\"\($left - 8)\" y=\"\($y + 15)\" text-anchor=\"end\" fill=\"#1c1e21\">\($bar.label | escaped)</text>",
        "<rect x=\"\($left)\" y=\"\($y + 2)\" width=\"\([$length, 1] | max)\" height=\"\(row - 5)\" fill=\"\(colours[$bar.colour])\"/>",
        "<text x=\"\($left + $length + 6 | position)\" y=\"\($y + 15)\" fill=\"#1c1e21\" stroke=\"#ffffff\" stroke-width=\"4\" paint-order=\"stroke\">\($bar.text | escaped)</text>"),
    "</svg>";

if $plot == "" then {figures: []} | plots | keys_unsorted[]
else plots[$plot] | svg end
