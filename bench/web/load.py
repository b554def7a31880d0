"""Asks for a page as fast as it comes, by wrk, and tells how fast that was."""

import json
import subprocess
import time
from dataclasses import dataclass

from program import HERE, run

MOMENT_OF_MEMORY = 0.7  # of the time, when connections and threads are all there


@dataclass(frozen=True)
class Measurement:
    requests_per_second: float  # right answers only
    p50: float                  # in ms
    p99: float                  # in ms
    processor: float            # µs of the workers for each answer
    errors: int                 # answers that were not the page, and connections that broke
    resident: float             # MB of the largest worker
    proportional: float         # the same, shared memory divided among its processes


def warm_up(subject, folder, concurrency):
    run(_words(subject, folder, concurrency, 1))


def measure(subject, folder, concurrency, seconds):
    used_before = subject.serving.processor_seconds_of_workers()
    wrk = subprocess.Popen(_words(subject, folder, concurrency, seconds),
                           stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, text=True)
    try:
        time.sleep(seconds * MOMENT_OF_MEMORY)
        resident, proportional = subject.serving.memory_of_workers()
        output = wrk.communicate()[0]
    finally:
        wrk.kill()
        wrk.wait()
    if wrk.returncode != 0:
        raise RuntimeError(f'wrk failed: {output}')
    used = subject.serving.processor_seconds_of_workers() - used_before
    figures = json.loads(output.splitlines()[-1])
    right = figures['answers'] - figures['wrong']
    return Measurement(
        requests_per_second=right / figures['microseconds'] * 1e6,
        p50=figures['p50'] / 1000, p99=figures['p99'] / 1000,
        processor=used / figures['answers'] * 1e6,
        errors=figures['wrong'] + figures['broken'],
        resident=resident, proportional=proportional)


def _words(subject, folder, concurrency, seconds):
    cookies = folder / 'cookies'
    subject.write_cookies(cookies)
    return ['wrk', '--threads', '1', '--connections', str(concurrency),
            '--duration', f'{seconds}s', '--timeout', '10s', '--script', str(HERE / 'wrk.lua'),
            subject.address, '--', str(cookies), str(subject.length)]
