"""Programs that are started for the measurement, and end with it."""

import contextlib
import os
import pwd
import re
import signal
import socket
import subprocess
import time
from pathlib import Path

HERE = Path(__file__).resolve().parent
PATIENCE = 20  # seconds for a server to start, or to end
UNPRIVILEGED = 'www-data'
KIB_PER_MB = 1_000_000 / 1024


def free_port():
    with socket.socket() as probe:
        probe.bind(('127.0.0.1', 0))
        return probe.getsockname()[1]


class Program:
    """A server as a child process: ready when the block begins, gone when it ends."""

    def __init__(self, words, output, *, port=None, path=None):
        """`output` is a file for what it prints; it listens on a port, or on a socket at `path`."""
        self._words = [str(word) for word in words]
        self._output = Path(output)
        self._port = port
        self._path = path
        self._process = None

    def __enter__(self):
        with self._output.open('wb') as output:
            # It also ends when this process is killed. A group of its own, for some servers send
            # signals to their whole group.
            self._process = subprocess.Popen(
                ['setpriv', '--pdeathsig', 'TERM', *self._words], start_new_session=True,
                stdin=subprocess.DEVNULL, stdout=output, stderr=output)
        try:
            self._wait_until_ready()
        except BaseException:
            self.__exit__()
            raise
        return self

    def __exit__(self, *_):
        self._process.terminate()
        try:
            self._process.wait(PATIENCE)
        except subprocess.TimeoutExpired:
            self._process.kill()
            self._process.wait()

    def memory_of_workers(self):
        """(resident, proportional) in MB, each of the worker process that has most of it."""
        resident = proportional = 0
        for pid in self._workers():
            with contextlib.suppress(FileNotFoundError, ProcessLookupError):
                sizes = _memory(pid)
                resident = max(resident, sizes['Rss'])
                proportional = max(proportional, sizes['Pss'])
        return resident / KIB_PER_MB, proportional / KIB_PER_MB

    def processor_seconds_of_workers(self):
        """What its worker processes have used so far, in the kernel and outside of it."""
        ticks = 0
        for pid in self._workers():
            with contextlib.suppress(FileNotFoundError, ProcessLookupError):
                fields = Path(f'/proc/{pid}/stat').read_text().rpartition(')')[2].split()
                ticks += int(fields[11]) + int(fields[12])
        return ticks / os.sysconf('SC_CLK_TCK')

    def _workers(self):
        pid = self._process.pid
        return Path(f'/proc/{pid}/task/{pid}/children').read_text().split()

    def _wait_until_ready(self):
        give_up = time.monotonic() + PATIENCE
        while not self._answers():
            if self._process.poll() is not None or time.monotonic() > give_up:
                said = self._output.read_text(errors='replace').strip()
                raise RuntimeError(f'{self._words[0]} does not start: {said}')
            time.sleep(0.05)

    def _answers(self):
        family, address = ((socket.AF_UNIX, str(self._path)) if self._path
                           else (socket.AF_INET, ('127.0.0.1', self._port)))
        with socket.socket(family) as probe:
            return probe.connect_ex(address) == 0


def _memory(pid):
    """Sizes in KiB, by their names in the kernel's table."""
    sizes = {}
    for line in Path(f'/proc/{pid}/smaps_rollup').read_text().splitlines()[1:]:
        name, value = line.split(':')
        sizes[name] = int(value.split()[0])
    return sizes


def prepare():
    """Servers are found, which plain users have no path to. SIGTERM ends this process as Ctrl-C
    does: programs that run are ended, too."""
    os.environ['PATH'] += os.pathsep + '/usr/sbin'
    signal.signal(signal.SIGTERM, signal.default_int_handler)


def this_user():
    return pwd.getpwuid(os.geteuid()).pw_name


def plain_user():
    """The account of whoever started this; where that is root, one that may do nothing."""
    return UNPRIVILEGED if os.geteuid() == 0 else this_user()


def run(words):
    """Runs a program to its end and returns what it printed."""
    words = [str(word) for word in words]
    ended = subprocess.run(words, stdin=subprocess.DEVNULL, capture_output=True, text=True)
    if ended.returncode != 0:
        raise RuntimeError(f'{words[0]} failed: {ended.stderr.strip()}')
    return ended.stdout.strip()


def configure(name, folder, values):
    """Fills in NAME.in, in which @word@ stands for a value, and returns the file."""
    template = (HERE / (name + '.in')).read_text()
    file = folder / name
    file.write_text(re.sub(r'@(\w+)@', lambda found: str(values[found[1]]), template))
    return file
