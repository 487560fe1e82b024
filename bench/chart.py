"""Bars of ratios as an SVG: a group of bars for each comparison, the goal as a line across them."""
from html import escape
from typing import NamedTuple

WIDTH, LABEL, BAR, GAP, TOP = 760, 110, 16, 34, 56
COLOURS = {True: "#2f7d4f", False: "#b5562e", None: "#5b6b7f"}  # goal met, not met, none


class Group(NamedTuple):
    title: str
    sense: str   # "at least" or "at most"
    goal: float  # or None
    bars: list   # of (label, ratio)


def svg(title, groups):
    height = TOP + sum(GAP + BAR * len(group.bars) for group in groups) + 10
    lines = [
        f'<svg xmlns="http://www.w3.org/2000/svg" width="{WIDTH}" height="{height}" viewBox="0 0 {WIDTH} {height}" '
        'font-family="sans-serif" font-size="12">',
        f'<rect width="{WIDTH}" height="{height}" fill="#ffffff"/>',
        f'<text x="10" y="22" font-size="16" font-weight="bold">{escape(title)}</text>',
        '<text x="10" y="40" fill="#555555">each group has a scale of its own; the dashed line is the goal: '
        f'<tspan fill="{COLOURS[True]}">met</tspan>, <tspan fill="{COLOURS[False]}">not met</tspan></text>',
    ]
    y = TOP
    for group in groups:
        lines += _group(group, y)
        y += GAP + BAR * len(group.bars)
    return "\n".join([*lines, "</svg>"]) + "\n"


def _group(group, y):
    goal = "" if group.goal is None else f" (goal {group.sense} {group.goal:g})"
    lines = [f'<text x="10" y="{y + 14}" font-weight="bold">{escape(group.title + goal)}</text>']
    highest = max([ratio for _, ratio in group.bars] + [group.goal or 0])
    scale = (WIDTH - LABEL - 60) / highest
    y += 20
    for index, (label, ratio) in enumerate(group.bars):
        top = y + index * BAR
        lines += [
            f'<text x="{LABEL - 6}" y="{top + 12}" text-anchor="end">{escape(label)}</text>',
            f'<rect x="{LABEL}" y="{top + 2}" width="{ratio * scale:.1f}" height="{BAR - 4}" fill="{COLOURS[_met(group, ratio)]}"/>',
            f'<text x="{LABEL + ratio * scale + 4:.1f}" y="{top + 12}">{ratio:.2f}</text>',
        ]
    if group.goal is not None:
        x = LABEL + group.goal * scale
        lines.append(f'<line x1="{x:.1f}" x2="{x:.1f}" y1="{y}" y2="{y + BAR * len(group.bars)}" stroke="#222222" '
                     'stroke-dasharray="3 2"/>')
    return lines


def _met(group, ratio):
    if group.goal is None:
        return None
    return ratio <= group.goal if group.sense == "at most" else ratio >= group.goal
