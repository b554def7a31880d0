"""A web application that knows nothing of links: every page of it is a secret of the folder in which
it lies."""

import http.server
import posixpath
import re
import threading
import urllib.parse


def secret_of(folder):
    return b"<the secret of %s>" % folder.encode()


def readings(path):
    """What programs make of a path: as it came, decoded once, and decoded and tidied until nothing
    changes any more."""
    found = [path, urllib.parse.unquote(path, "latin-1")]
    tidy = None
    while tidy != path:
        tidy, path = path, urllib.parse.unquote(path, "latin-1")
    tidy = re.sub(r";[^/]*", "", tidy.replace("\\", "/"))
    return found + [re.sub("/+", "/", posixpath.normpath(tidy))]


def folder_of(path):
    return "/other" if path == "/other" or path.startswith("/other/") else "/"


class Application:
    """Serves on a free port of loopback, and remembers whatever gets through to it."""

    def __init__(self, test):
        self.requests = []  # path and fields of each
        self.server = http.server.ThreadingHTTPServer(("127.0.0.1", 0), self._handler())
        self.port = self.server.server_address[1]
        thread = threading.Thread(target=self.server.serve_forever, args=(0.05,))
        thread.start()
        test.addCleanup(thread.join)
        test.addCleanup(self.server.server_close)
        test.addCleanup(self.server.shutdown)

    def _handler(self):
        requests = self.requests

        class Handler(http.server.BaseHTTPRequestHandler):
            protocol_version = "HTTP/1.1"

            def answer(self):
                self.rfile.read(int(self.headers.get("Content-Length", 0)))
                requests.append((self.path, self.headers.items()))
                path = self.path.partition("?")[0]
                folders = {folder_of(reading) for reading in readings(path)}
                page = b"\n".join(map(secret_of, sorted(folders)))
                self.send_response(200)
                self.send_header("Content-Type", "text/plain")
                self.send_header("Content-Length", str(len(page)))
                self.end_headers()
                if self.command != "HEAD":
                    self.wfile.write(page)

            do_GET = do_HEAD = do_POST = do_PUT = do_DELETE = do_OPTIONS = answer

            def log_message(self, *_):
                pass

        return Handler
