#!/usr/bin/env python3
"""Writes performance.md and its plots from the JSON of the programs peers and all_pairs.

usage: render_report.py PEERS.json PAIRS.json EXPLANATIONS.txt FOLDER
"""

import html
import json
import math
import pathlib
import re
import sys

PEERS = ["libyuv", "swscale", "opencv"]
SECTIONS = [
    ("Conversions at the same size", r"(to|from)_"),
    ("Copies and repacks", r"(copy|repack)$"),
    ("Rotations and mirrors", r"(rotate|mirror)_"),
    ("Brightness, contrast and saturation", r"adjusted$"),
    ("Bilinear resizes", r"bilinear_"),
    ("Nearest resizes", r"nearest_"),
    ("Small and thin pictures, creation of engines included", r"small"),
]


def duration(nanoseconds):
    for unit, size in (("ms", 1e6), ("µs", 1e3), ("ns", 1)):
        if nanoseconds >= size:
            return f"{nanoseconds / size:.3g} {unit}"
    return f"{nanoseconds:.2g} ns"


def geometric_mean(values):
    return math.exp(sum(map(math.log, values)) / len(values))


def table(header, rows):
    lines = ["| " + " | ".join(header) + " |", "|" + "---|" * len(header)]
    lines += ["| " + " | ".join(row) + " |" for row in rows]
    return lines + [""]


class Results:
    """The jobs of the program peers, with the entries of all contenders by name."""

    def __init__(self, data):
        self.context = data["context"]
        self.jobs = data["jobs"]
        self.entries = {}
        for entry in data["benchmarks"]:
            self.entries.setdefault(entry["job"], {})[entry["contender"]] = entry
        self.compared = [job for job in self.jobs if job["ratio"] > 0]

    def time(self, job, contender):
        entry = self.entries[job["name"]].get(contender, {})
        return duration(entry["cpu_time"]) if "cpu_time" in entry else "-"


def read_explanations(path):
    lines = pathlib.Path(path).read_text(encoding="utf-8").splitlines()
    pairs = [line.split("\t", 1) for line in lines if line and not line.startswith("#")]
    return [(re.compile(pattern), reason) for pattern, reason in pairs]


def explain(explanations, name):
    return next((reason for pattern, reason in explanations if pattern.search(name)), "")


def operating_system():
    release = pathlib.Path("/etc/os-release")
    if release.exists():
        match = re.search(r'^PRETTY_NAME="?([^"\n]*)', release.read_text(), re.M)
        if match:
            return match.group(1)
    return sys.platform


def instruction_sets():
    known = ["ssse3", "avx2", "avx512bw", "avx512vbmi", "avx512_vnni", "asimd", "neon"]
    flags = set(pathlib.Path("/proc/cpuinfo").read_text().split())
    return ", ".join(name for name in known if name in flags)


def method(results):
    context = results.context
    missing = [peer for peer in PEERS if context[peer] == "missing"]
    lines = [
        "# Performance",
        "",
        "Written by `scripts/benchmark`, which builds and runs `benchmarks/peers` and",
        "`benchmarks/all_pairs`. Ratios are the time of the fastest peer divided by ours: above 1",
        "this library is faster.",
        "",
        "## Method",
        "",
        "- One process, one thread, CPU time of the whole process. Each round gives every contender",
        f"  a slice of at least {context['slice_ns'] / 1e6:g} ms, one after the other; the median of"
        f" {context['rounds']:g} rounds counts. Turns change from round to round, and each slice",
        "  begins with an untimed call, so that all find the caches as they leave them.",
        "- Engines, contexts and intermediate pictures are made outside the timed region, except",
        "  for small pictures, where engines (and swscale's contexts) are created and destroyed",
        "  inside it.",
        "- `kestrel` is what the documentation recommends: a tiled engine, block mode 2 for jobs",
        "  with adjustments. `untiled` is the engine of an all-zero parameter record.",
        "- For libyuv and OpenCV all sensible sequences of their calls are tried and the fastest is",
        "  timed; for swscale the same with its scalers. None goes through a layout with less chroma",
        "  than source and destination both have.",
        "- A contender whose picture is wrong is left out. The source is a smooth analytic picture,",
        "  so every sample is known: 99 % of the samples must be within 6 levels (plus a quantum of",
        "  narrow channels, plus what the picture changes over two pixels), the mean error within",
        "  half of that.",
        "- swscale is left out where rows are not multiples of 16 bytes: it faults there. It neither",
        "  turns pictures nor mirrors them sideways. OpenCV converts video range only.",
        "- `memcpy` copies as many bytes as the destination has: it is no peer, but shows the memory's",
        "  speed.",
        "",
        "## Machine",
        "",
    ]
    lines += table(
        ["What", "Which"],
        [
            ["CPU", f"{context['cpu']}, {context['cores']:g} cores"],
            ["Instruction sets", instruction_sets()],
            ["System", operating_system()],
            ["Compiler", context["compiler"]],
        ]
        + [[peer, context[peer]] for peer in PEERS],
    )
    if missing:
        lines += [f"**Missing in this run: {', '.join(missing)}.**", ""]
    return lines


def summary(results, explanations):
    ratios = [job["ratio"] for job in results.compared]
    alone = [job["name"] for job in results.jobs if job["ratio"] <= 0]
    below_target = [job for job in results.compared if job["ratio"] < job["target"]]
    slower = sorted((j for j in results.compared if j["ratio"] < 1), key=lambda j: j["ratio"])
    lines = ["## Summary", ""]
    if ratios:
        lines += [
            f"Geometric mean of {len(ratios)} jobs: **{geometric_mean(ratios):.2f}**. Lowest"
            f" {min(ratios):.2f}, highest {max(ratios):.2f}. {len(slower)} jobs are below 1.0,"
            f" {len(below_target)} below their target.",
            "",
        ]
    if alone:
        lines += ["Not compared (no peer, or none of ours right): " + ", ".join(alone) + ".", ""]
    lines += [
        "![Ratio to the fastest peer](performance-ratios.svg)",
        "",
        "Of memcpy: our time in times that `memcpy` takes for as many bytes as the destination has."
        " [Where the time goes](performance-floors.md) has profiles, and what keeps these jobs from"
        " their targets.",
        "",
    ]
    missed = sorted((j for j in below_target if j["ratio"] >= 1), key=lambda j: j["group"])
    for title, jobs in (("Below 1.0", slower), ("Above 1.0 and below target", missed)):
        lines += [f"### {title}", ""]
        rows = [explained(results, explanations, job) for job in jobs]
        header = ["Job", "Ratio", "Target", "Of memcpy", "Fastest peer", "Why"]
        lines += table(header, rows) if rows else ["None.", ""]
    return lines


def explained(results, explanations, job):
    entries = results.entries[job["name"]]
    ours = entries.get("kestrel", {}).get("cpu_time", 0)
    copy = entries.get("memcpy", {}).get("cpu_time", 0)
    return [
        job["name"],
        f"{job['ratio']:.2f}",
        f"{job['target']:g}",
        f"{ours / copy:.1f}" if ours > 0 and copy > 0 else "-",
        f"{job['fastest_peer']}: {entries[job['fastest_peer']]['calls']}",
        explain(explanations, job["name"]) or "not explained yet",
    ]


def all_jobs(results):
    lines = ["## All jobs", "", "Sizes in names are those of the source.", ""]
    for title, pattern in SECTIONS:
        jobs = [job for job in results.jobs if re.match(pattern, job["group"])]
        if not jobs:
            continue
        rows = []
        for job in jobs:
            cells = [f"{job['name']} to {job['destination']}"]
            for contender in ["kestrel", "kestrel-untiled"] + PEERS + ["memcpy"]:
                cells.append(results.time(job, contender))
            ratio = f"{job['ratio']:.2f}" if job["ratio"] > 0 else "-"
            rows.append(cells + [ratio, f"{job['target']:g}"])
        lines += [f"### {title}", ""]
        header = ["Job", "kestrel", "untiled"] + PEERS + ["memcpy", "Ratio", "Target"]
        lines += table(header, rows)
    wrong = [
        f"- {entry['job']}, {name}: {entry['error_message']}"
        for entries in results.entries.values()
        for name, entry in entries.items()
        if entry.get("error_message", "").startswith("disqualified")
    ]
    lines += ["### Left out for a wrong picture", ""]
    return lines + (wrong or ["None."]) + [""]


def pairs_section(pairs):
    everything = []
    rows = []
    for group in pairs["classes"]:
        worst = group["pairs"][0]
        rows.append([
            group["scale"],
            group["turn"],
            str(len(group["pairs"])),
            f"{group['median_ns_per_pixel']:.3f}",
            f"{worst['ns_per_pixel']:.3f}",
            f"{group['worst_ratio']:.1f}",
            f"{worst['src']} to {worst['dst']}",
        ])
        everything += [(pair, group) for pair in group["pairs"]]
    everything.sort(key=lambda item: -item[0]["ns_per_pixel"])
    lines = [
        "## Every pair of formats",
        "",
        "All pairs of public formats (YUV in BT.601 full range) from 640x480, at the same size and to",
        "480x360; as it is, turned by 90 degrees and mirrored; tiled engines. 1- and 4-bit indexed",
        "destinations are accepted and left alone. Nanoseconds per destination pixel, median of"
        f" {pairs['context']['rounds']:g} rounds.",
        "",
    ]
    lines += table(
        ["Scale", "Turn", "Pairs", "Median", "Worst", "Worst / median", "Worst pair"], rows)
    lines += ["The worst ten:", ""]
    lines += table(
        ["Pair", "Scale", "Turn", "ns per pixel"],
        [[f"{pair['src']} to {pair['dst']}", group["scale"], group["turn"],
          f"{pair['ns_per_pixel']:.3f}"] for pair, group in everything[:10]],
    )
    return lines + ["![Time of every pair against the median](performance-pairs.svg)", ""]


def svg(width, height, parts):
    return "\n".join(
        [f'<svg xmlns="http://www.w3.org/2000/svg" width="{width}" height="{height}"'
         f' viewBox="0 0 {width} {height}" font-family="sans-serif" font-size="10">',
         f'<rect width="{width}" height="{height}" fill="#fff"/>'] + parts + ["</svg>", ""])


def text(x, y, content, anchor="start", extra=""):
    return f'<text x="{x:.1f}" y="{y:.1f}" text-anchor="{anchor}"{extra}>{html.escape(content)}</text>'


def ratio_bars(results):
    """Bars from 1 to the ratio on a logarithmic scale; a mark shows the target."""
    left, row, right, top = 330, 13, 60, 40
    ratios = [job["ratio"] for job in results.compared] or [1]
    low = min(0.5, min(ratios)) / 1.1
    high = max(8, max(ratios)) * 1.1
    width, height = 1000, top + row * len(results.compared) + 20

    def x(ratio):
        return left + (width - left - right) * math.log(ratio / low) / math.log(high / low)

    parts = [text(left, 14, "Time of the fastest peer / ours (logarithmic); the mark is the target",
                  extra=' font-size="12"')]
    for tick in (0.02, 0.05, 0.1, 0.2, 0.5, 1, 2, 4, 8, 16, 32, 64):
        if low <= tick <= high:
            colour = "#000" if tick == 1 else "#ddd"
            parts.append(f'<path d="M{x(tick):.1f} {top - 8}V{height - 20}" stroke="{colour}"/>')
            parts.append(text(x(tick), top - 12, f"{tick:g}", "middle"))
    for i, job in enumerate(results.compared):
        y = top + i * row
        start, end = sorted((x(1), x(job["ratio"])))
        colour = "#2a7f3f" if job["ratio"] >= job["target"] else (
            "#c9a227" if job["ratio"] >= 1 else "#b03a2e")
        parts.append(text(left - 6, y + 9, job["name"], "end"))
        parts.append(f'<rect x="{start:.1f}" y="{y}" width="{end - start:.1f}" height="{row - 3}"'
                     f' fill="{colour}"/>')
        mark = x(job["target"])
        parts.append(f'<path d="M{mark:.1f} {y - 1}v{row - 1}" stroke="#000"/>')
        parts.append(text(max(end, mark) + 4, y + 9, f"{job['ratio']:.2f}"))
    return svg(width, height, parts)


HEAT = [(0.5, "#1a5e9a"), (0.8, "#5b9bd0"), (1.25, "#c6dbef"), (2, "#fdd49e"), (3, "#fc8d59"),
        (4.5, "#e34a33"), (6, "#b30000"), (math.inf, "#4d004b")]


def heat_map(pairs):
    """One square for each scale: sources across, destinations down, the worst of the turns."""
    formats = pairs["formats"]
    cell, left, top, gap = 8, 130, 60, 20
    side = cell * len(formats)
    scales = list(dict.fromkeys(group["scale"] for group in pairs["classes"]))
    place = {name: i for i, name in enumerate(formats)}
    width = left + len(scales) * (side + gap)
    height = top + side + 190
    parts = [text(left, 16, "Time per pixel against the median pair of the class (worst turn)",
                  extra=' font-size="12"')]
    for i, name in enumerate(formats):
        parts.append(text(left - 4, top + i * cell + 7, name, "end", ' font-size="8"'))
    for s, scale in enumerate(scales):
        x0 = left + s * (side + gap)
        parts.append(text(x0 + side / 2, top - 8, scale, "middle"))
        worst = [[0.0] * len(formats) for _ in formats]
        for group in pairs["classes"]:
            if group["scale"] != scale:
                continue
            for pair in group["pairs"]:
                row, column = place[pair["dst"]], place[pair["src"]]
                ratio = pair["ns_per_pixel"] / group["median_ns_per_pixel"]
                worst[row][column] = max(worst[row][column], ratio)
        paths = {}
        for row, line in enumerate(worst):
            for column, ratio in enumerate(line):
                if ratio > 0:
                    colour = next(colour for limit, colour in HEAT if ratio <= limit)
                    paths.setdefault(colour, []).append(
                        f"M{x0 + column * cell} {top + row * cell}h{cell}v{cell}h-{cell}z")
        parts += [f'<path fill="{colour}" d="{"".join(d)}"/>' for colour, d in paths.items()]
        for i, name in enumerate(formats):
            x, y = x0 + i * cell + 7, top + side + 4
            parts.append(text(x, y, name, "end",
                              f' font-size="8" transform="rotate(-90 {x} {y})"'))
        parts.append(text(x0 + side / 2, top + side + 130, "source", "middle"))
    y = top + side + 150
    lower = "0"
    for i, (limit, colour) in enumerate(HEAT):
        x = left + i * 110
        label = f"above {lower}" if limit == math.inf else f"{lower} to {limit:g}"
        parts.append(f'<rect x="{x}" y="{y}" width="14" height="14" fill="{colour}"/>')
        parts.append(text(x + 18, y + 11, label))
        lower = f"{limit:g}"
    return svg(width, height, parts)


def main(arguments):
    if len(arguments) != 4:
        sys.exit(__doc__)
    results = Results(json.loads(pathlib.Path(arguments[0]).read_text(encoding="utf-8")))
    pairs = json.loads(pathlib.Path(arguments[1]).read_text(encoding="utf-8"))
    explanations = read_explanations(arguments[2])
    folder = pathlib.Path(arguments[3])
    folder.mkdir(parents=True, exist_ok=True)
    page = method(results) + summary(results, explanations) + all_jobs(results)
    page += pairs_section(pairs)
    for name, content in (
        ("performance.md", "\n".join(page).rstrip() + "\n"),
        ("performance-ratios.svg", ratio_bars(results)),
        ("performance-pairs.svg", heat_map(pairs)),
    ):
        (folder / name).write_text(content, encoding="utf-8")
        print(folder / name)


main(sys.argv[1:])
