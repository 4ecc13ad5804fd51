"""Line plots as SVG, by hand: both axes logarithmic, or linear where zero matters."""

import math

WIDTH, HEIGHT, LEFT, RIGHT, TOP, BOTTOM = 640, 360, 70, 20, 40, 50
COLOURS = ["#1f6fb4", "#c8501e", "#3a8a3a"]


def _ticks(low, high, logarithmic):
    if logarithmic:
        first, last = math.floor(math.log10(low)), math.ceil(math.log10(high))
        return [10.0 ** power for power in range(first, last + 1)]
    step = 10 ** math.floor(math.log10(max(high, 1e-9)))
    step = step if high / step > 2.5 else step / 4
    return [step * i for i in range(math.ceil(high / step) + 1)]


def lines(title, across, up, series, logarithmic=True):
    """An SVG text. `series` names lists of points."""
    points = [point for all_ in series.values() for point in all_]
    xs, ys = (_ticks(min(values), max(values), logarithmic) for values in zip(*points))

    def place(value, ticks, start, length):
        low, high = ticks[0], ticks[-1]
        if logarithmic:
            value, low, high = math.log10(value), math.log10(low), math.log10(high)
        return start + length * (value - low) / (high - low)

    def x(value):
        return place(value, xs, LEFT, WIDTH - LEFT - RIGHT)

    def y(value):
        return place(value, ys, HEIGHT - BOTTOM, TOP + BOTTOM - HEIGHT)

    out = [f'<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 {WIDTH} {HEIGHT}" font-family="sans-serif" font-size="12">',
           f'<rect width="{WIDTH}" height="{HEIGHT}" fill="white"/>',
           f'<text x="{WIDTH / 2}" y="22" text-anchor="middle" font-size="15">{title}</text>',
           f'<text x="{WIDTH / 2}" y="{HEIGHT - 10}" text-anchor="middle">{across}</text>',
           f'<text x="14" y="{HEIGHT / 2}" text-anchor="middle" transform="rotate(-90 14 {HEIGHT / 2})">{up}</text>']
    for tick in xs:
        out.append(f'<path d="M{x(tick):.1f} {TOP}V{HEIGHT - BOTTOM}" stroke="#ddd"/>'
                   f'<text x="{x(tick):.1f}" y="{HEIGHT - BOTTOM + 16}" text-anchor="middle">{tick:,.10g}</text>')
    for tick in ys:
        out.append(f'<path d="M{LEFT} {y(tick):.1f}H{WIDTH - RIGHT}" stroke="#ddd"/>'
                   f'<text x="{LEFT - 6}" y="{y(tick) + 4:.1f}" text-anchor="end">{tick:,.10g}</text>')
    for index, (name, all_) in enumerate(series.items()):
        colour = COLOURS[index % len(COLOURS)]
        track = " ".join(f"{x(a):.1f},{y(b):.1f}" for a, b in all_)
        out.append(f'<polyline points="{track}" fill="none" stroke="{colour}" stroke-width="2"/>')
        out.append(f'<text x="{LEFT + 10}" y="{TOP + 16 + 16 * index}" fill="{colour}">{name}</text>')
    return "\n".join(out) + "\n</svg>\n"
