"""Pictures as SVG text: heat maps of pairs of types, and charts of lines on logarithmic axes."""

import math

# For four lines; colour-blind readers can tell them apart too.
LINE_COLOURS = ("#0072b2", "#d55e00", "#7f7f7f", "#009e73")

# For four limits: black lines of strokes and gaps.
DASHES = ("8 3", "2 3", "8 3 2 3", "1 5")


def svg(width, height, lines):
    head = (
        f'<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 {width} {height}" '
        'font-family="sans-serif" font-size="11" text-anchor="middle">',
        f'<rect width="{width}" height="{height}" fill="#ffffff"/>',
    )
    return "\n".join([*head, *lines, "</svg>", ""])


def colour(value, pale_at, red_at):
    """From pale green, at `pale_at` or less, to red, at `red_at` or more."""
    share = min(max(math.log(value / pale_at) / math.log(red_at / pale_at), 0), 1)
    pale, red = (229, 245, 224), (203, 24, 29)
    return "#" + "".join(f"{round(p + share * (r - p)):02x}" for p, r in zip(pale, red))


def words_in_row(y, words):
    """Pairs of a word and the place of its middle."""
    spans = "".join(f'<tspan x="{x}">{word}</tspan>' for word, x in words)
    return f'<text y="{y}">{spans}</text>'


def heat_map(title, types, values, scale, digits):
    """`values` by pairs of types: a row for the first type, a column for the second."""
    cell_width, cell_height, left, top = 62, 24, 78, 58
    count = len(types)
    width, height = left + count * cell_width + 8, top + count * cell_height + 8
    lines = [f'<text x="{width // 2}" y="20" font-size="14">{title}</text>']
    columns = {name: left + i * cell_width for i, name in enumerate(types)}
    middles = {name: x + cell_width // 2 for name, x in columns.items()}
    lines.append(words_in_row(top - 8, middles.items()))
    for i, type1 in enumerate(types):
        row = {type2: values[type1, type2] for type2 in types if (type1, type2) in values}
        cells = (f'<rect x="{columns[type2]}" width="{cell_width - 1}" height="{cell_height - 1}" '
                 f'fill="{colour(value, *scale)}"/>' for type2, value in row.items())
        numbers = ((f"{value:.{digits}f}", middles[type2]) for type2, value in row.items())
        lines += [f'<g transform="translate(0 {top + i * cell_height})">',
                  f'<text x="{left - 6}" y="16" text-anchor="end">{type1}</text>',
                  "".join(cells), words_in_row(16, numbers), "</g>"]
    return svg(width, height, lines)


class LogAxis:
    """From a number to a place between `begin` and `end`."""

    def __init__(self, least, most, begin, end):
        self.least, self.most, self.begin, self.end = least, most, begin, end

    def __call__(self, value):
        share = math.log(value / self.least) / math.log(self.most / self.least)
        return round(self.begin + share * (self.end - self.begin), 1)

    def ticks(self, base):
        power = math.ceil(math.log(self.least, base) - 1e-9)
        while base**power <= self.most * (1 + 1e-9):
            yield base**power
            power += 1


LINE_LOOKS = tuple(f'stroke="{colour}" stroke-width="2"' for colour in LINE_COLOURS)
LIMIT_LOOKS = tuple(f'stroke="#000000" stroke-dasharray="{dashes}"' for dashes in DASHES)


def chart(title, lines_of_chart, limits, axes, x_base):
    """Lists of lines and of limits, each one of points."""
    x_axis, y_axis = axes
    middle = (x_axis.begin + x_axis.end) / 2
    yield f'<text x="{middle}" y="{y_axis.end - 10}" font-size="13">{title}</text>'
    for tick in x_axis.ticks(x_base):
        x = x_axis(tick)
        yield f'<path d="M{x} {y_axis.begin}V{y_axis.end}" stroke="#e5e5e5"/>'
        yield f'<text x="{x}" y="{y_axis.begin + 15}">{tick}</text>'
    for tick in y_axis.ticks(10):
        y = y_axis(tick)
        yield f'<path d="M{x_axis.begin} {y}H{x_axis.end}" stroke="#e5e5e5"/>'
        yield f'<text x="{x_axis.begin - 6}" y="{y + 4}" text-anchor="end">{tick}</text>'
    looks = [*zip(limits, LIMIT_LOOKS), *reversed(list(zip(lines_of_chart, LINE_LOOKS)))]
    for points, look in looks:
        places = " ".join(f"{x_axis(x)},{y_axis(y)}" for x, y in points)
        yield f'<polyline points="{places}" fill="none" {look}/>'


def legend(names, looks, left, right, y):
    """Names in a row, each beside a piece of its line."""
    step = min(250, (right - left) // max(len(names), 1))
    for i, (name, look) in enumerate(zip(names, looks)):
        x = left + i * step
        yield f'<path d="M{x} {y}h24" {look}/>'
        yield f'<text x="{x + 30}" y="{y + 4}" text-anchor="start">{name}</text>'


def charts(title, names_of_lines, all_charts, x_text, y_text, names_of_limits=(), x_base=4):
    """`all_charts` is a list of titles, lists of lines and lists of limits; two charts are side by
    side."""
    chart_width, chart_height, left, gap = 340, 220, 62, 64
    top = 88 + 18 * bool(names_of_limits)
    points = [point for _, lines, limits in all_charts for line in [*lines, *limits]
              for point in line]
    least_x, most_x = (pick(x for x, _ in points) for pick in (min, max))
    least_y, most_y = (pick(y for _, y in points) for pick in (min, max))
    rows = -(-len(all_charts) // 2)
    width, height = left + 2 * chart_width + gap + 12, top + rows * (chart_height + gap)
    lines = [f'<text x="{width // 2}" y="20" font-size="14">{title}</text>']
    lines.extend(legend(names_of_lines, LINE_LOOKS, left, width, 42))
    lines.extend(legend(names_of_limits, LIMIT_LOOKS, left, width, 60))
    for i, (chart_title, lines_of_chart, limits) in enumerate(all_charts):
        x = left + i % 2 * (chart_width + gap)
        y = top + i // 2 * (chart_height + gap)
        x_axis = LogAxis(least_x, most_x, x, x + chart_width)
        y_axis = LogAxis(10 ** math.floor(math.log10(least_y)), 10 ** math.ceil(math.log10(most_y)),
                         y + chart_height, y)
        lines.extend(chart(chart_title, lines_of_chart, limits, (x_axis, y_axis), x_base))
        lines.append(f'<text x="{x + chart_width // 2}" y="{y + chart_height + 31}">{x_text}</text>')
        lines.append(f'<text x="{x - 34}" y="{y - 10}">{y_text}</text>')
    return svg(width, height, lines)
