#!/usr/bin/env python3
"""Measures the web front end beside Apache and beside a program that does nothing; README.md tells
how. script/bench web builds what it needs and calls it."""

import argparse
import contextlib
import random
import re
import sys
from pathlib import Path

import load
import program
import report
import servers
from shared import Shared

CONCURRENCIES = (1, 8, 64)
VISITORS = 64


def options():
    parser = argparse.ArgumentParser(prog='script/bench web', description=__doc__)
    parser.add_argument('--build', type=Path, required=True, help='folder of the build')
    parser.add_argument('--quick', action='store_true',
                        help='each once for a second, with few links: whether it still works')
    parser.add_argument('--rounds', type=_positive, default=5)
    parser.add_argument('--seconds', type=_positive, default=3, help='of each measurement')
    parser.add_argument('--links', type=_positive, default=100_000, help='in the database')
    parser.add_argument('--rows', type=_pattern, default='', metavar='REGEX',
                        help='only those whose name it is found in')
    chosen = parser.parse_args()
    if chosen.quick:
        chosen.rounds, chosen.seconds, chosen.links = 1, 1, 1000
    return chosen


def main():
    chosen = options()
    program.prepare()
    print(report.context(), end='\n\n', flush=True)
    folder = chosen.build.resolve() / 'web-bench'
    with Shared(chosen.build.resolve(), folder, chosen.links) as shared, \
            contextlib.ExitStack() as running:
        subjects = [subject for subject in
                    servers.start_all(running, chosen.build.resolve(), folder, shared)
                    if chosen.rows.search(subject.name)]
        if not subjects:
            raise RuntimeError(f'no row has a name with "{chosen.rows.pattern}" in it')
        for subject in subjects:
            subject.admit(VISITORS, shared.credentials)
        rounds = [measure_round(subjects, folder, chosen) for _ in range(chosen.rounds)]
        for subject in subjects:
            subject.check_visitors()
    finished = report.Report(rounds)
    print(*finished.tables(), sep='\n\n')
    return 1 if finished.errors() > 0 else 0


def measure_round(subjects, folder, chosen):
    """Every subject at every concurrency, in random order: what slows the machine down for a while
    does not hit one alone."""
    cases = [(subject, concurrency) for subject in subjects for concurrency in CONCURRENCIES]
    measured = dict.fromkeys(cases)
    for subject, concurrency in random.sample(cases, len(cases)):
        if not chosen.quick:
            load.warm_up(subject, folder, concurrency)
        measured[subject, concurrency] = load.measure(subject, folder, concurrency, chosen.seconds)
    return measured


def _positive(text):
    number = int(text)
    if number < 1:
        raise argparse.ArgumentTypeError('takes a number above 0')
    return number


def _pattern(text):
    try:
        return re.compile(text)
    except re.error as error:
        raise argparse.ArgumentTypeError(f'is no regular expression: {error}') from error


if __name__ == '__main__':
    try:
        sys.exit(main())
    except KeyboardInterrupt:
        sys.exit(130)
    except (RuntimeError, OSError) as error:
        print(f'script/bench web: {error}', file=sys.stderr)
        sys.exit(1)
