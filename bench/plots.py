"""Writes two kinds of plots as SVG files, without a plotting library: lines over logarithmic axes,
and stacked bars."""

import math

COLORS = ('#d1495b', '#30638e', '#edae49', '#00798c', '#6a994e', '#8d99ae')
FONT = 'font-family="sans-serif" font-size="13"'


def write_growth(path, lines):
    """`lines` maps the name of each program to its points: (number of entries, processor time in
    milliseconds)."""
    width, height, left, bottom, top, right = 720, 420, 70, 360, 30, 600
    xs = [x for points in lines.values() for x, _ in points]
    ys = [y for points in lines.values() for _, y in points]
    x_range = (math.log10(min(xs)), math.log10(max(xs)))
    y_range = (math.floor(math.log10(min(ys))), math.ceil(math.log10(max(ys))))

    def at(x, y):
        return (left + (right - left) * (math.log10(x) - x_range[0]) / (x_range[1] - x_range[0]),
                bottom - (bottom - top) * (math.log10(y) - y_range[0]) / (y_range[1] - y_range[0]))

    parts = []
    for exponent in range(y_range[0], y_range[1] + 1):
        y = at(min(xs), 10 ** exponent)[1]
        parts.append(line((left, y), (right, y), '#ddd'))
        parts.append(text(left - 8, y + 4, f'{10 ** exponent:g} ms', 'end'))
    for x in sorted(set(xs)):
        parts.append(text(at(x, min(ys))[0], bottom + 22, f'{x:,}', 'middle'))
    parts.append(text((left + right) / 2, bottom + 46, 'entries', 'middle'))
    ends = sorted(lines.items(), key=lambda item: -item[1][-1][1])
    label = top
    for color, (name, points) in zip(COLORS, ends):
        parts += [line(at(*a), at(*b), color, 2) for a, b in zip(points, points[1:])]
        parts += ['<circle cx="%.1f" cy="%.1f" r="3" fill="%s"/>' % (*at(*point), color)
                  for point in points]
        label = max(at(*points[-1])[1] + 4, label + 16)
        parts.append(text(right + 8, label, f'{name} {points[-1][1]:.0f} ms', 'start', color))
    write(path, width, height, 'Processor time of a whole run against the number of entries', parts)


def write_parts(path, bars):
    """`bars` maps the name of each package to a second map: from the name of each part of a run to
    its share of the processor time (0 to 1)."""
    width, left, right, row, top = 720, 120, 700, 34, 60
    parts = []
    names = list(next(iter(bars.values())))
    for index, (color, name) in enumerate(zip(COLORS, names)):
        x = left + index * 97
        parts.append(f'<rect x="{x}" y="30" width="12" height="12" fill="{color}"/>')
        parts.append(text(x + 16, 41, name.replace("the tool's own code", 'own code'), 'start'))
    for index, (package, shares) in enumerate(bars.items()):
        y, x = top + index * row, left
        parts.append(text(left - 8, y + 17, package, 'end'))
        for color, name in zip(COLORS, names):
            length = (right - left) * shares[name]
            parts.append(f'<rect x="{x:.1f}" y="{y}" width="{length:.1f}" height="24" '
                         f'fill="{color}"/>')
            if shares[name] >= 0.05:
                parts.append(text(x + length / 2, y + 17, f'{100 * shares[name]:.0f} %', 'middle',
                                  '#fff'))
            x += length
    write(path, width, top + len(bars) * row + 10, 'Where the processor time of a run goes', parts)


def line(start, end, color, stroke=1):
    return ('<line x1="%.1f" y1="%.1f" x2="%.1f" y2="%.1f" stroke="%s" stroke-width="%d"/>' %
            (*start, *end, color, stroke))


def text(x, y, content, anchor, color='#333'):
    return (f'<text x="{x:.1f}" y="{y:.1f}" {FONT} text-anchor="{anchor}" fill="{color}">'
            f'{content}</text>')


def write(path, width, height, title, parts):
    with open(path, 'w', encoding='utf-8') as file:
        file.write(f'<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 {width} {height}">\n'
                   f'<title>{title}</title>\n'
                   f'<rect width="{width}" height="{height}" fill="#fff"/>\n' +
                   text(width / 2, 18, title, 'middle') + '\n' + '\n'.join(parts) + '\n</svg>\n')
