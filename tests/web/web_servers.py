"""Debian's web servers with the configurations of packaging/. Each runs as an ordinary child on a free
port of loopback, with a folder of its own."""

import os
import socket
import subprocess

from server_support import PROGRAM, SOURCE, accepts, preloaded, wait_until

PACKAGING = SOURCE / "packaging"

# What the configurations of packaging/ name.
SOCKET = "/run/velksharing-web.sock"
INSTALLED_PROGRAM = "/usr/local/sbin/velksharing-web"


def free_port():
    with socket.socket() as probe:
        probe.bind(("127.0.0.1", 0))
        return probe.getsockname()[1]


def adapted(file, *changes):
    """A configuration of packaging/, with each text in the place of another."""
    text = (PACKAGING / file).read_text()
    for old, new in changes:
        if old not in text:
            raise AssertionError(f"{file} has no {old}")
        text = text.replace(old, str(new))
    return text


class WebServer:
    """A web server on a port of its own, which serves what the configuration says."""

    def __init__(self, test, folder):
        """It ends with the test."""
        self.test = test
        self.folder = folder
        self.port = free_port()

    def serve_links(self, socket, *changes):
        """The pages of links, by FastCGI on this socket, with the configuration of packaging/."""
        self.start(adapted(self.FILE, (SOCKET, socket), *self.CHANGES, *changes))

    def run(self, *words, **environment):
        self.messages = self.folder / "web server messages"
        with open(self.messages, "wb") as messages:
            self.process = subprocess.Popen(words, cwd=self.folder, stderr=messages,
                                            env={**os.environ, **environment})
        self.test.addCleanup(self.process.wait)
        self.test.addCleanup(self.process.terminate)
        wait_until(self._listens)

    def _listens(self):
        self.test.assertIsNone(self.process.poll(), self.messages.read_text())
        return accepts(self.port)

    def write(self, name, text):
        path = self.folder / name
        path.write_text(text)
        return str(path)


class NginxServer(WebServer):
    FILE = "nginx/velksharing.conf"
    UPSTREAM_FILE = "nginx/velksharing-upstream.conf"
    CHANGES = []

    def serve_links(self, socket, *changes):
        self.start(adapted(self.FILE, *self.CHANGES, *changes), self.upstream(socket))

    def upstream(self, socket):
        return adapted(self.UPSTREAM_FILE, (SOCKET, socket))

    def start(self, configuration, outside=""):
        """@param configuration of a server. @param outside what stands beside it."""
        snippet = self.write("velksharing.conf", configuration)
        empty = self.folder / "empty"
        empty.mkdir()
        temporary = "".join(f"{kind}_temp_path {self.folder}/{kind};\n" for kind in (
            "client_body", "fastcgi", "proxy", "scgi", "uwsgi"))
        config = self.write("nginx.conf", f"""
daemon off; worker_processes 1; pid {self.folder}/nginx.pid; error_log {self.folder}/nginx.log;
events {{ }}
http {{
  access_log off; {temporary}
  {outside}
  server {{ listen 127.0.0.1:{self.port}; root {empty}; include {snippet}; }}
}}""")
        self.run("/usr/sbin/nginx", "-e", f"{self.folder}/nginx.log", "-c", config)


class LighttpdServer(WebServer):
    FILE = "lighttpd/velksharing.conf"
    CGI_FILE = "lighttpd/velksharing-cgi.conf"
    CHANGES = []

    def start(self, configuration):
        config = self.write("lighttpd.conf", f"""
server.bind = "127.0.0.1"
server.port = {self.port}
server.document-root = "{self.folder}"
server.errorlog = "{self.folder}/lighttpd.log"
server.upload-dirs = ( "{self.folder}" )
{configuration}""")
        self.run("/usr/sbin/lighttpd", "-D", "-f", config)

    def start_cgi(self):
        self.start(adapted(self.CGI_FILE, (INSTALLED_PROGRAM, PROGRAM)))


class ApacheServer(WebServer):
    FILE = "apache/velksharing.conf"
    CGI_FILE = "apache/velksharing-cgi.conf"
    CHANGES = []

    def start(self, configuration, modules=("proxy", "proxy_fcgi")):
        user = "User www-data\nGroup www-data\n" if os.geteuid() == 0 else ""
        self.run(*self._words(modules, user + configuration))

    def start_cgi(self):
        """Programs run as the account that serves, which Apache refuses to be root."""
        environment = {"LD_PRELOAD": preloaded("not_root")} if os.geteuid() == 0 else {}
        configuration = adapted(self.CGI_FILE, (INSTALLED_PROGRAM, PROGRAM))
        self.run(*self._words(("alias", "cgid"), configuration), **environment)

    def _words(self, modules, configuration):
        loaded = "".join(f"LoadModule {module}_module /usr/lib/apache2/modules/mod_{module}.so\n"
                         for module in ("mpm_event", "authz_core", *modules))
        config = self.write("apache.conf", f"""
ServerRoot {self.folder}
ServerName localhost
Listen 127.0.0.1:{self.port}
PidFile {self.folder}/apache.pid
ErrorLog {self.folder}/apache.log
DefaultRuntimeDir {self.folder}
Mutex posixsem
DocumentRoot {self.folder}
{loaded}{configuration}""")
        return "/usr/sbin/apache2", "-D", "FOREGROUND", "-f", config


class CaddyServer(WebServer):
    def start(self, configuration):
        config = self.write("Caddyfile", f"""
{{
	admin off
	auto_https off
	grace_period 1s
}}
{configuration}""")
        self.run("/usr/bin/caddy", "run", "--config", config, "--adapter", "caddyfile",
                 HOME=str(self.folder), XDG_DATA_HOME=str(self.folder),
                 XDG_CONFIG_HOME=str(self.folder))
