"""The visitor front end as a real program: its own database, its own links, on loopback.

The environment says where things are: VELK_BUILD the build folder, VELK_ROOT the root that it was
built for. Tests that use the root lock it; see CMakeLists.txt."""

import contextlib
import glob
import html.parser
import http.client
import os
import pathlib
import re
import shutil
import signal
import socket
import sqlite3
import subprocess
import sys
import tempfile
import time
import unittest
import urllib.parse

BUILD = pathlib.Path(os.environ["VELK_BUILD"])
ROOT = pathlib.Path(os.environ["VELK_ROOT"])
SOURCE = pathlib.Path(__file__).resolve().parents[2]
PROGRAM = str(BUILD / "bin" / "velksharing-web")
COMMAND_LINE = str(BUILD / "bin" / "velksharing")
PASSWORD = "open sesame"
DATABASE = ROOT / "etc/private/session/sharing.db"

# Root's own files are shared with nobody where ids can be switched.
OWNER = "nobody" if os.geteuid() == 0 else __import__("pwd").getpwuid(os.geteuid()).pw_name


def main():
    """Runs the tests of the file that calls it; leaves an installed root alone."""
    if BUILD not in ROOT.parents:
        print("the root is not in the build folder")
        sys.exit(77)
    unittest.main(verbosity=2)


def preloaded(name):
    """One of the libraries that are loaded before a program, for LD_PRELOAD."""
    return str(BUILD / "lib" / f"libweb_{name}.so")


def remove_database():
    for path in glob.glob(str(ROOT / "etc/private/session/sharing.db*")):
        os.remove(path)
    for path in glob.glob(str(ROOT / "etc/private/autoblock.db*")):
        os.remove(path)


def in_database(sql, *values):
    with contextlib.closing(sqlite3.connect(DATABASE, timeout=10)) as database, database:
        return database.execute(sql, values).fetchall()


def wait_until(what, seconds=10):
    """Waits until what() is true, and gives it."""
    end = time.monotonic() + seconds
    while True:
        found = what()
        if found:
            return found
        if time.monotonic() > end:
            raise AssertionError("this did not happen in time")
        time.sleep(0.02)


class FrontEndTest(unittest.TestCase):
    """Each test has an empty database, a folder, and no program running after it."""

    def setUp(self):
        remove_database()
        self.addCleanup(remove_database)
        self.folder = pathlib.Path(tempfile.mkdtemp(prefix="velk-web-"))
        self.addCleanup(shutil.rmtree, self.folder)
        # The owner of the links is another account, and so may web servers be.
        self.folder.chmod(0o755)

    def start(self, *options, **how):
        """A front end that serves HTTP on a free port; workers=1 unless the options tell."""
        return self.keep(FrontEnd(["--listen", "127.0.0.1:0", *options], self.folder, **how))

    def keep(self, program):
        self.addCleanup(program.kill)
        return program

    def share(self, path, *options, password=PASSWORD):
        """A link to this path.
        @return its hash."""
        return self.make_link("--path", str(path), *options, password=password)

    @staticmethod
    def make_link(*options, password=PASSWORD):
        """@return its hash."""
        words = [COMMAND_LINE, "link", "create", "--project", "files", "--owner", OWNER, *options]
        if password is not None:
            words.append("--password-stdin")
        return subprocess.run(words, input=(password or "") + "\n", check=True, text=True,
                              stdout=subprocess.PIPE).stdout.strip()

    def make_file(self, name, size):
        """A file of random bytes that everybody may read.
        @return its path."""
        path = self.folder / "shared" / name
        path.parent.mkdir(exist_ok=True)
        path.parent.chmod(0o755)
        path.write_bytes(os.urandom(size))
        path.chmod(0o644)
        return path


class FrontEnd:
    """A running velksharing-web. Its messages and its access log are in files of the folder."""

    def __init__(self, options, folder, workers=1, **popen):
        self.log = folder / "messages"
        self.access_log = folder / "access.log"
        config = folder / "web.conf"
        config.touch()
        words = [PROGRAM, "--config", str(config), "--workers", str(workers),
                 "--access-log", str(self.access_log), *options]
        with open(self.log, "ab") as log:
            self.process = subprocess.Popen(words, stderr=log, **popen)
        self.address = wait_until(self._find_address)
        self.port = int(self.address.rpartition(":")[2]) if ":" in self.address else None

    def _find_address(self):
        if self.process.poll() is not None:
            raise AssertionError("it does not run: " + self.log.read_text())
        found = re.findall(r"(?:HTTP|FastCGI) on (.*)", self.log.read_text())
        return found and found[-1]

    def signal(self, number):
        self.process.send_signal(number)

    def stop(self, seconds=20):
        """Asks it to end.
        @return its exit status."""
        self.signal(signal.SIGTERM)
        return self.process.wait(seconds)

    def kill(self):
        if self.process.poll() is not None:
            return
        workers = self.workers()
        self.process.kill()
        self.process.wait()
        for worker in workers:  # which notice it by themselves
            wait_until(lambda worker=worker: not is_alive(worker), 40)

    def workers(self):
        path = f"/proc/{self.process.pid}/task/{self.process.pid}/children"
        return [int(pid) for pid in pathlib.Path(path).read_text().split()]

    def visits(self, count):
        """The access log's lines, split into words, as soon as there are so many."""
        wait_until(lambda: self.access_log.exists() and
                   len(self.access_log.read_text().splitlines()) >= count)
        return [line.split(" ") for line in self.access_log.read_text().splitlines()]


def accepts(port):
    try:
        socket.create_connection(("127.0.0.1", port), timeout=1).close()
        return True
    except OSError:
        return False


def is_alive(pid):
    try:
        return pathlib.Path(f"/proc/{pid}/stat").read_text().rpartition(")")[2].split()[0] != "Z"
    except FileNotFoundError:
        return False


class Answer:
    def __init__(self, response):
        self.status = response.status
        self.headers = response.headers
        self.body = response.read()


class Visitor:
    """A visitor with a browser's memory for cookies, on a connection of each request's own."""

    def __init__(self, port, base="/sharing"):
        self.port = port
        self.base = base
        self.cookies = {}

    def request(self, method, path, body=None, headers=None, timeout=30):
        connection = http.client.HTTPConnection("127.0.0.1", self.port, timeout=timeout)
        try:
            connection.request(method, path, body, self._headers(headers))
            answer = Answer(connection.getresponse())
        finally:
            connection.close()
        for cookie in answer.headers.get_all("Set-Cookie") or []:
            name, _, value = cookie.partition(";")[0].partition("=")
            self.cookies[name] = value
        return answer

    def _headers(self, headers):
        headers = dict(headers or {})
        if self.cookies:
            headers["Cookie"] = "; ".join(f"{name}={value}" for name, value in self.cookies.items())
        return headers

    def get(self, path, headers=None, **how):
        return self.request("GET", path, headers=headers, **how)

    def form_token(self, link, headers=None):
        """The token of the login form."""
        page = self.get(f"{self.base}/{link}", headers)
        return re.search(rb'name="csrf" value="([^"]*)"', page.body).group(1).decode()

    def submit(self, path, fields, headers=None, **how):
        """Sends a form."""
        headers = {"Content-Type": "application/x-www-form-urlencoded", **(headers or {})}
        return self.request("POST", path, urllib.parse.urlencode(fields), headers, **how)

    def log_in(self, link, password=PASSWORD, headers=None):
        """Fills the login form in, and sends it."""
        fields = {"password": password, "csrf": self.form_token(link, headers)}
        return self.submit(f"{self.base}/{link}", fields, headers)


def exchange(port, raw, timeout=10):
    """Sends bytes, and gives all that comes until the other end closes."""
    with socket.create_connection(("127.0.0.1", port), timeout=timeout) as connection:
        try:
            connection.sendall(raw)
        except ConnectionError:
            pass  # the answer may be there already
        received = b""
        try:
            while piece := connection.recv(65536):
                received += piece
        except ConnectionError:
            pass
        return received


def statuses(received):
    """Of all answers in these bytes."""
    return [int(status) for status in re.findall(rb"HTTP/1\.[01] (\d{3})", received)]


def ask(port, target, *fields, method="GET", body=b""):
    """A request of exactly these bytes, and what comes back."""
    head = [method.encode() + b" " + raw(target) + b" HTTP/1.1", *map(raw, fields)]
    if not any(field.lower().startswith(b"host:") for field in head):
        head.append(b"Host: localhost")
    if body:
        head.append(b"Content-Length: %d" % len(body))
    head.append(b"Connection: close")
    return exchange(port, b"\r\n".join(head) + b"\r\n\r\n" + body)


def raw(text):
    return text.encode("latin-1")


class Addresses(html.parser.HTMLParser):
    """All addresses in a page to which a browser could go, or from which it could load."""

    NAMES = ("href", "src", "action", "formaction", "content", "data", "poster", "srcset", "cite",
             "background", "ping", "manifest", "xlink:href")

    def __init__(self, page):
        super().__init__()
        self.found = []
        self.feed(page.decode("utf-8", "replace"))

    def handle_starttag(self, tag, attributes):
        for name, value in attributes:
            if name in self.NAMES:
                # <meta http-equiv="refresh" content="0; url=…">
                self.found.append(re.sub(r"(?i)^\s*\d+\s*;\s*url\s*=\s*", "", value or ""))
