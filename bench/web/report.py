"""From measurements to the tables, which read well in a terminal and are Markdown, too."""

import datetime
import os
import platform
import re
import statistics

from program import run
from subject import Role

HEADS = ['server', 'conc.', 'requests/s (min–max)', 'p50 ms', 'p99 ms', 'CPU µs', 'errors', 'RSS MB',
         'PSS MB']
OTHERS = (Role.APACHE, Role.APACHE_RELAXED, Role.HELLO, Role.STATIC)
WANTED_RATIOS = {
    Role.CHECKED: {Role.APACHE: 1.5, Role.APACHE_RELAXED: 1.5, Role.HELLO: 0.25},
    Role.GATE: {Role.APACHE: 1.5},
}
CROWD = 8            # visitors at once, of the target for p99
LONGEST_P99 = 20     # ms
LARGEST_WORKER = 25  # MB


def context():
    """When, where and with what it was measured: one line."""
    nginx = run(['sh', '-c', 'nginx -v 2>&1'])
    versions = [re.search(r'/([\d.]+)', text)[1] for text in (nginx, run(['apache2', '-v']))]
    return (f'{datetime.date.today()}, {os.cpu_count()} CPUs, Linux {platform.release()}, '
            f'nginx {versions[0]}, Apache {versions[1]}, as '
            f'{"root" if os.geteuid() == 0 else "a plain user"}, '
            f'load before {os.getloadavg()[0]:.2f}')


class Report:
    """`rounds` holds a dictionary for each, from (subject, concurrency) to its measurement."""

    def __init__(self, rounds):
        self._rounds = rounds
        self._subjects = list(dict.fromkeys(subject for subject, _ in rounds[0]))
        self._concurrencies = sorted({concurrency for _, concurrency in rounds[0]})

    def errors(self):
        return sum(measured.errors for each in self._rounds for measured in each.values())

    def tables(self):
        """All figures, and what is to be reached by them."""
        rows = [self._row(subject, concurrency)
                for subject in self._subjects for concurrency in self._concurrencies]
        tables = [_table([*HEADS, *(f'× {role.value}' for role in OTHERS)], rows)]
        targets = [target for subject in self._subjects for target in self._targets_of(subject)]
        if targets:
            tables.append(_table(['target', 'wanted', 'reached (min–max)', 'enough'], targets))
        return tables

    def _row(self, subject, concurrency):
        def median(figure):
            return _number(statistics.median(self._figures(subject, concurrency, figure)))

        speeds = self._figures(subject, concurrency, 'requests_per_second')
        return [subject.name, str(concurrency), _spread(speeds, _number),
                median('p50'), median('p99'), median('processor'),
                str(sum(self._figures(subject, concurrency, 'errors'))),
                median('resident'), median('proportional'),
                *(self._times(subject, concurrency, role) for role in OTHERS)]

    def _targets_of(self, subject):
        rows = self._target_ratios(subject)
        if subject.role is Role.CHECKED:
            rows += [self._target_p99(subject), self._target_memory(subject)]
        return rows

    def _target_ratios(self, subject):
        rows = []
        for role, wanted in WANTED_RATIOS.get(subject.role, {}).items():
            other = self._other(role)
            if other is None:
                continue
            for concurrency in self._concurrencies:
                ratios = self._ratios(subject, concurrency, other)
                rows.append([f'{subject.name}: × {role.value} at {concurrency}', f'≥ {wanted}',
                             _spread(ratios, _ratio),
                             _yes_or_no(statistics.median(ratios) >= wanted)])
        return rows

    def _target_p99(self, subject):
        p99 = self._figures(subject, CROWD, 'p99')
        return [f'{subject.name}: p99 at {CROWD}, ms', f'≤ {LONGEST_P99}',
                _spread(p99, _number), _yes_or_no(statistics.median(p99) <= LONGEST_P99)]

    def _target_memory(self, subject):
        largest = max(max(self._figures(measured, concurrency, 'resident'))
                      for measured in self._subjects if measured.serving is subject.serving
                      for concurrency in self._concurrencies)
        return [f'{subject.name}: RSS of the largest worker in all rounds, MB',
                f'≤ {LARGEST_WORKER}', _number(largest), _yes_or_no(largest <= LARGEST_WORKER)]

    def _figures(self, subject, concurrency, figure):
        """Of all rounds."""
        return [getattr(each[subject, concurrency], figure) for each in self._rounds]

    def _times(self, subject, concurrency, role):
        other = self._other(role)
        if other is None:
            return ''
        return _ratio(statistics.median(self._ratios(subject, concurrency, other)))

    def _other(self, role):
        """None when it was not measured."""
        return next((subject for subject in self._subjects if subject.role is role), None)

    def _ratios(self, subject, concurrency, other):
        """Times the requests per second of the other one in the same round."""
        return [ours / theirs for ours, theirs in zip(
            self._figures(subject, concurrency, 'requests_per_second'),
            self._figures(other, concurrency, 'requests_per_second'))]


def _table(heads, rows):
    widths = [max(len(row[column]) for row in [heads, *rows]) for column in range(len(heads))]
    rule = ['-' * widths[0], *('-' * (width - 1) + ':' for width in widths[1:])]
    lines = []
    for row in [heads, rule, *rows]:
        cells = [row[0].ljust(widths[0]), *(cell.rjust(width)
                                            for cell, width in zip(row[1:], widths[1:]))]
        lines.append('| ' + ' | '.join(cells) + ' |')
    return '\n'.join(lines)


def _spread(figures, text):
    """The median, and where there are several figures the lowest and the highest."""
    middle = text(statistics.median(figures))
    return middle if len(figures) == 1 else f'{middle} ({text(min(figures))}–{text(max(figures))})'


def _number(figure):
    """With as many digits as one reads."""
    places = 0 if figure >= 99.95 else 1 if figure >= 9.95 else 2
    return f'{figure:,.{places}f}'


def _ratio(figure):
    return f'{figure:.2f}'


def _yes_or_no(is_enough):
    return 'yes' if is_enough else 'no'
