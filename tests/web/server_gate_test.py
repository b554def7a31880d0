#!/usr/bin/env python3
"""An application that its web server puts behind links, with the configurations of packaging/. What
belongs to whom:

    wiki    the link that guards all of the application
    other   guards a folder of it
    abroad  guards a site of another name"""

import html
import json
import re
import subprocess

from guarded_application import Application, secret_of
from hostile_spellings import ways_out
from server_support import *
from web_servers import *

WIKI = secret_of("/")
OTHER = secret_of("/other")
PAGE = "/some/page?a=1&b=%2Fx"

# What an answer to somebody who stays out may be.
CLOSED = (303, 400, 401, 403, 404, 405, 500, 502, 503, 504)


class GateTests:
    """The same for all web servers; the classes below say which, and how each is told."""

    WORKERS = 2

    def setUp(self):
        super().setUp()
        self.application = Application(self)
        self.socket = self.folder / "socket"
        self.web_server = self.WEB_SERVER(self, self.folder)
        self.port = self.web_server.port
        self.site = f"http://127.0.0.1:{self.port}"
        self.start_web_server()
        self.wiki = self.guard(f"{self.site}/")

    def guard(self, *prefixes, options=(), password=PASSWORD):
        """A link that does nothing else.
        @return its hash."""
        named = [word for prefix in prefixes for word in ("--protects", prefix)]
        return self.make_link(*named, *options, password=password)

    def start_front_end(self, *options):
        words = [*self.listen(), "--set", f"auth_address={self.AUTH_ADDRESS}", *options]
        self.server = self.keep(FrontEnd(words, self.folder, workers=self.WORKERS))

    def listen(self):
        return "--fastcgi", str(self.socket), "--set", "socket_mode=666"

    # Visitors.

    def visitor(self, *links):
        """One who is in by these links."""
        visitor = Visitor(self.port)
        for link in links:
            self.assertEqual(visitor.log_in(link).status, 303)
        return visitor

    def stranger(self):
        return Visitor(self.port)

    def expect_in(self, visitor, path=PAGE, secret=WIKI):
        answer = visitor.get(path)
        self.assertEqual((answer.status, answer.body), (200, secret))
        return answer

    def expect_out(self, visitor, path=PAGE, headers=None):
        """Not the bytes, and the application does not even hear of it."""
        before = len(self.application.requests)
        answer = visitor.get(path, headers, timeout=60)
        self.assertIn(answer.status, CLOSED)
        self.assertNotIn(b"the secret", answer.body)
        self.assertEqual(self.application.requests[before:], [])
        return answer

    def expect_login(self, visitor, path=PAGE):
        """@return the address of the login page to which the visitor is led."""
        answer = self.expect_out(visitor, path)
        self.assertEqual(answer.headers["Cache-Control"], "no-store")
        return self.login_address(answer)

    def login_address(self, answer):
        self.assertEqual(answer.status, 303)
        return answer.headers["Location"]

    # What all of it is for.

    def test_a_visitor_logs_in_and_gets_to_the_page_that_was_asked_for(self):
        self.start_front_end()
        visitor = self.stranger()
        login = self.expect_login(visitor)
        self.assertTrue(login.startswith(f"/sharing/{self.wiki}?return="), login)
        page = visitor.get(login)
        token = re.search(rb'name="csrf" value="([^"]*)"', page.body)[1].decode()
        action = html.unescape(re.search(rb'<form[^>]* action="([^"]*)"', page.body)[1].decode())
        answer = visitor.submit(action, {"csrf": token, "password": "wrong"})
        self.assertEqual(answer.status, 401)
        self.expect_out(visitor)
        answer = visitor.submit(action, {"csrf": token, "password": PASSWORD})
        self.assertEqual(answer.status, 303)
        self.assertEqual(urllib.parse.urljoin(self.site, answer.headers["Location"]),
                         self.site + PAGE)
        self.expect_in(visitor)
        self.assertEqual(self.application.requests[-1][0], PAGE)
        answer = visitor.submit("/some/form", {"a": "b"})
        self.assertEqual((answer.status, answer.body), (200, WIKI))

    def test_a_program_brings_its_session_in_a_field(self):
        self.start_front_end()
        session = self.visitor(self.wiki).cookies["sharing_sid"]
        answer = self.stranger().get(PAGE, {"X-Velk-Sharing": session})
        self.assertEqual((answer.status, answer.body), (200, WIKI))
        self.expect_out(self.stranger(), headers={"X-Velk-Sharing": "A" * 32})

    def test_every_method_is_asked_about(self):
        self.start_front_end()
        for method in ("GET", "HEAD", "POST", "PUT", "DELETE", "OPTIONS", "TRACE", "PATCH", "PROPFIND"):
            received = ask(self.port, PAGE, method=method)
            self.assertTrue(set(statuses(received)) <= {*CLOSED, 411, 501}, (method, received[:200]))
        received = ask(self.port, PAGE, method="POST", body=b"a=b")
        self.assertNotIn(200, statuses(received))
        self.assertEqual(self.application.requests, [])

    def test_what_no_link_guards_is_open_to_nobody(self):
        self.start_front_end()
        visitor = self.visitor(self.wiki)
        self.command("link", "set", self.wiki, "--protects", "/elsewhere/")
        self.assertEqual(self.expect_out(visitor).status, 403)

    def test_an_open_link_lets_nobody_in_who_does_not_have_it(self):
        link = self.guard(f"{self.site}/open/", password=None)
        self.start_front_end()
        answer = self.expect_out(self.stranger(), "/open/x")
        self.assertEqual(answer.status, 403)
        self.assertNotIn(link, str(answer.headers) + answer.body.decode())

    # Which link.

    def test_either_of_two_links_that_guard_the_same_lets_in(self):
        second = self.guard(f"{self.site}/")
        self.start_front_end()
        self.expect_in(self.visitor(self.wiki))
        self.expect_in(self.visitor(second))

    def test_the_longest_prefix_counts(self):
        other = self.guard(f"{self.site}/other/")
        self.start_front_end()
        wiki_visitor, other_visitor = self.visitor(self.wiki), self.visitor(other)
        self.expect_in(other_visitor, "/other/page", OTHER)
        self.expect_in(wiki_visitor, "/others")
        self.expect_out(wiki_visitor, "/other/page")
        self.expect_out(other_visitor, "/others")
        self.assertIn(f"/sharing/{other}?", self.expect_login(self.stranger(), "/other/page"))

    def test_the_configuration_may_name_the_link(self):
        link = self.guard()
        self.start_front_end("--set", f"protect={self.site}/other/ {link}")
        self.expect_in(self.visitor(link), "/other/page", OTHER)
        self.expect_out(self.visitor(link))

    def test_asking_costs_no_use(self):
        link = self.guard(f"{self.site}/other/", options=("--uses", "1"))
        self.start_front_end()
        visitor = self.visitor(link)
        for _ in range(5):
            self.expect_in(visitor, "/other/x", OTHER)
        self.assertEqual(json.loads(self.command("link", "show", link, "--json"))["use_count"], 1)

    # The link ends.

    def test_who_is_in_by_a_link_that_is_disabled_is_out_at_once(self):
        self.assert_out_after("disable")
        self.command("link", "enable", self.wiki)
        self.expect_in(self.inside)

    def test_who_is_in_by_a_link_that_is_deleted_is_out_at_once(self):
        self.assert_out_after("delete")

    def assert_out_after(self, what):
        self.start_front_end()
        self.inside = self.visitor(self.wiki)
        self.expect_in(self.inside)
        self.command("link", what, self.wiki)
        for _ in range(4):  # whichever worker answers
            self.assertEqual(self.expect_out(self.inside).status, 403)

    def test_who_logs_out_is_out(self):
        self.start_front_end()
        visitor = self.visitor(self.wiki)
        self.expect_in(visitor)
        in_database("DELETE FROM token")
        self.expect_out(visitor)

    # The front end fails.

    def test_without_the_front_end_nobody_gets_in(self):
        self.expect_out(self.stranger())
        self.start_front_end()
        wait_until(lambda: self.stranger().get(PAGE).status in (303, 401), 15)
        visitor = self.visitor(self.wiki)
        self.expect_in(visitor)
        self.server.kill()
        self.expect_out(visitor)
        self.start_front_end()
        wait_until(lambda: visitor.get(PAGE).status == 200, 15)

    def test_while_the_front_end_stands_still_nobody_gets_in(self):
        self.start_front_end()
        visitor = self.visitor(self.wiki)
        wait_until(lambda: len(self.server.workers()) == self.WORKERS)
        processes = [self.server.process.pid, *self.server.workers()]
        self.signal(processes, signal.SIGSTOP)
        self.addCleanup(self.signal, processes, signal.SIGCONT)
        wait_until(lambda: all(is_stopped(pid) for pid in processes))
        self.expect_out(visitor)
        self.signal(processes, signal.SIGCONT)
        wait_until(lambda: visitor.get(PAGE).status == 200, 15)

    @staticmethod
    def signal(processes, number):
        for pid in processes:
            if is_alive(pid):
                os.kill(pid, number)

    def test_a_worker_that_dies_lets_nobody_in(self):
        self.start_front_end()
        visitor = self.visitor(self.wiki)
        for _ in range(3):
            os.kill(wait_until(self.server.workers)[0], signal.SIGKILL)
            self.expect_out(self.stranger())
        wait_until(lambda: visitor.get(PAGE).status == 200, 15)

    def test_without_a_usable_database_nobody_gets_in(self):
        self.start_front_end()
        visitor = self.visitor(self.wiki)
        for table in ("entry", "session", "token"):
            in_database(f"ALTER TABLE {table} RENAME TO gone")
            for _ in range(2 * self.WORKERS):
                self.expect_out(visitor)
            in_database(f"ALTER TABLE gone RENAME TO {table}")
            wait_until(lambda: visitor.get(PAGE).status == 200)

    def test_with_a_broken_database_nobody_gets_in(self):
        DATABASE.write_bytes(os.urandom(65536))
        self.start_front_end()
        self.expect_out(self.stranger())

    def test_a_front_end_that_is_told_otherwise_lets_nobody_in(self):
        self.start_front_end()
        visitor = self.visitor(self.wiki)
        self.expect_in(visitor)
        everything = {"off", "parameter", "authorizer", "x-forwarded", "x-original-url"}
        for setting in sorted(everything - {self.AUTH_ADDRESS}):
            self.server.kill()
            self.start_front_end("--set", f"auth_address={setting}", "--set", "trusted_proxy=unix")
            wait_until(lambda: self.stranger().get("/sharing-health").status == 200, 15)
            self.assertEqual(self.expect_out(visitor).status, 403)

    # Visitors who mean harm.

    def visitor_of_others(self):
        """One who is in by links that guard something else, under other names, too."""
        other = self.guard(f"{self.site}/other/")
        abroad = self.guard(f"http://other.example:{self.port}/", "http://other.example/",
                            f"https://127.0.0.1:{self.port}/")
        visitor = self.visitor(other)
        visitor.log_in(abroad, headers={"Host": f"other.example:{self.port}"})
        self.assertIn(f"sharing_sid_{abroad}", visitor.cookies)
        self.expect_in(visitor, "/other/x", OTHER)
        self.expect_out(visitor, "/x")
        return visitor

    def forgeries(self):
        """Fields by which visitors might say what they ask for."""
        port = self.port
        for address in (f"{self.site}/other/x", f"http://other.example:{port}/x"):
            for name in ("X-Original-URL", "X-Original-Uri", "X-Forwarded-Uri", "X-Forwarded-Url",
                         "X-Rewrite-URL", "VELK-SHARING-AUTH", "VELK_SHARING_AUTH", "Request-Uri",
                         "REQUEST_URI", "X-Forwarded-Path", "Referer", "Location"):
                yield [f"{name}: {address}"]
        for name in ("X-Original-URL", "X-Original-URI", "X-Forwarded-Uri", "X-Forwarded-Prefix",
                     "X-Rewrite-URL", "REQUEST_URI", "X-Accel-Redirect", "X-Sendfile"):
            yield [f"{name}: /other/x"]
        for host in ("other.example", f"other.example:{port}"):
            for name in ("X-Forwarded-Host", "X-Host", "X-Forwarded-Server", "SERVER_NAME",
                         "Server-Name", "HTTP_HOST", "X-Original-Host"):
                yield [f"{name}: {host}"]
            yield [f"X-Forwarded-Host: {host}", "X-Forwarded-Uri: /x", "X-Forwarded-Proto: http"]
            yield [f"Forwarded: host={host};proto=http"]
            yield [f"Host: {host}"]
            yield [f"Host: {host}", f"Host: 127.0.0.1:{port}"]
            yield [f"Host: 127.0.0.1:{port}", f"Host: {host}"]
        for proto in ("https", "http,https", "ws"):
            for name in ("X-Forwarded-Proto", "X-Forwarded-Scheme", "X-Scheme", "REQUEST_SCHEME"):
                yield [f"{name}: {proto}"]
        yield ["X-Forwarded-Proto: https", f"X-Forwarded-Host: 127.0.0.1:{port}"]
        yield ["Front-End-Https: on"]
        yield ["X-Forwarded-Ssl: on"]
        yield ["HTTPS: on"]

    def test_no_field_of_the_visitor_says_what_is_asked_for(self):
        self.start_front_end()
        visitor = self.visitor_of_others()
        cookies = "; ".join(f"{name}={value}" for name, value in visitor.cookies.items())
        for forgery in self.forgeries():
            for fields in (forgery, forgery * 2):
                for cookie in ([], [f"Cookie: {cookies}"]):
                    self.expect_nothing_of_the_wiki("/x", *fields, *cookie)

    def expect_nothing_of_the_wiki(self, target, *fields):
        received = ask(self.port, target, f"Host: 127.0.0.1:{self.port}", *fields) \
            if not any(field.startswith("Host:") for field in fields) \
            else ask(self.port, target, *fields)
        self.assertNotIn(WIKI, received, (target, fields))
        return received

    def spellings(self):
        """Ways to write addresses that somebody could take for others."""
        for way in ways_out("x"):
            yield "/other" + way
        for way in ("/other/..", "/other/../", "/other/./../x", "//other/../x", "/other//../x",
                    "/other/x/../../x", "/other%2f..%2fx", "/%6fther/../x", "/Other/x", "/OTHER/x",
                    "/x/../other/../x", "/./x", "//x", "///x", "/%2e/x", "/x%2f", "/x%00/other/",
                    "/other%00/../x", "/other;/../x", "/other;x/../x", "/other?/../x/../../x",
                    "/other/%2e%2e%2f%2e%2e%2fx", "/other\\..\\x", "/other/..%5c..%5cx",
                    "/x#/other/", "/x?/other/", "/x;/other/", "/x%3f/other/", "/x%23/other/",
                    "/x%0a/other/", "/other/%0a/../../x", "/sharing/../x", "/sharing-health/../x",
                    "/sharing-health%0a", "/sharing%0a", "/sharing-auth", "/sharing%2f..%2fx",
                    "/sharing/%2e%2e/x", "/sharing/..;/x", "/sharing//../x", "/sharing\\..\\x",
                    "/sharing-health/x", "/sharing-healthy", "/velksharing-auth", "/velk-files/x",
                    "*", "other/x", "", "x"):
            yield way
        for host in (f"127.0.0.1:{self.port}", f"other.example:{self.port}", "other.example"):
            for scheme in ("http", "https", "HTTP"):
                yield f"{scheme}://{host}/x"
                yield f"{scheme}://{host}/other/../x"
                yield f"{scheme}://{host}"

    def test_no_spelling_of_an_address_gets_a_visitor_in_elsewhere(self):
        self.start_front_end()
        visitor = self.visitor_of_others()
        cookies = "; ".join(f"{name}={value}" for name, value in visitor.cookies.items())
        for target in self.spellings():
            self.expect_nothing_of_the_wiki(target, f"Cookie: {cookies}")
        self.expect_in(visitor, "/other/x", OTHER)

    def test_no_spelling_of_an_address_gets_a_stranger_in(self):
        self.guard(f"{self.site}/other/")
        self.start_front_end()
        for target in self.spellings():
            ask(self.port, target, f"Host: 127.0.0.1:{self.port}")
        for way in ways_out("x"):
            ask(self.port, "/sharing" + way, f"Host: 127.0.0.1:{self.port}")
        self.assertEqual(self.application.requests, [])

    def test_nobody_reaches_the_check_from_outside(self):
        self.start_front_end()
        visitor = self.visitor(self.wiki)
        for path in ("/sharing-auth", "/velksharing-auth"):
            received = ask(self.port, path, f"X-Original-URL: {self.site}/x")
            self.assertNotIn(204, statuses(received))
            answer = visitor.get(path)  # a page of the application's, or nothing
            self.assertIn((answer.status, answer.body == WIKI), ((200, True), (404, False)))

    # Who the visitor is.

    def told(self):
        """What the application heard of the visitor in its last request."""
        fields = self.application.requests[-1][1]
        return {name.lower(): value for name, value in fields if "velk" in name.lower()}

    FORGED = {name: "31337" for name in (
        "X-Velk-Sharing-Hash", "X-Velk-Sharing-Uid", "X-Velk-Sharing-Remaining",
        "X-Velk-Sharing-Login", "x-velk-sharing-uid")}

    def test_the_application_is_told_who_the_visitor_is(self):
        self.start_front_end()
        visitor = self.visitor(self.wiki)
        self.expect_in(visitor)
        told = self.told()
        self.assertEqual(told["x-velk-sharing-hash"], self.wiki)
        self.assertEqual(told.get("x-velk-sharing-uid", ""), "")
        self.assertTrue(86000 < int(told["x-velk-sharing-remaining"]) <= 86400)
        in_database("UPDATE session SET uid = 4711")
        self.expect_in(visitor)
        self.assertEqual(self.told()["x-velk-sharing-uid"], "4711")

    def test_visitors_do_not_say_who_they_are(self):
        self.start_front_end()
        visitor = self.visitor(self.wiki)
        for name, value in self.FORGED.items():
            for spelling in self.names_like(name):
                visitor.get(PAGE, {spelling: value})
        self.expect_in(visitor)
        for _, fields in self.application.requests:
            self.assertNotIn("31337", [value for _, value in fields])

    def names_like(self, name):
        """Names that programs take for this one."""
        return name, name.replace("-", "_"), name.upper().replace("-", "_"), name[:-4] + \
            name[-4:].replace("-", "_")

    def command(self, *words):
        return subprocess.run([COMMAND_LINE, *words], check=True, text=True,
                              stdout=subprocess.PIPE).stdout


def is_stopped(pid):
    return pathlib.Path(f"/proc/{pid}/stat").read_text().rpartition(")")[2].split()[0] == "T"


class AnswersByPage:
    """The web server hands the answer to its question through, and its page leads to the login."""

    def login_address(self, answer):
        self.assertEqual(answer.status, 401)
        login = answer.headers["X-Velk-Sharing-Login"]
        addresses = Addresses(answer.body).found
        self.assertIn(login, addresses)
        refresh = re.search(rb'<meta http-equiv="refresh" content="0; ?url=([^"]*)"', answer.body)
        self.assertEqual(html.unescape(refresh[1].decode()), login)
        return login


class NginxGate:
    WEB_SERVER = NginxServer

    def pages(self):
        return adapted("nginx/velksharing.conf")

    def gate(self):
        return adapted(self.GATE, ("_timeout 10s", "_timeout 1s"))

    def start_web_server(self):
        application = self.web_server.write("application.conf",
                                            adapted("nginx/velksharing-auth-app.conf"))
        self.web_server.start(f"""
server_name 127.0.0.1;
{self.gate()}
{self.pages()}
location / {{ include {application}; proxy_pass http://127.0.0.1:{self.application.port}; }}
""", self.web_server.upstream(self.socket))


class Nginx(NginxGate, GateTests, FrontEndTest):
    GATE = "nginx/velksharing-auth.conf"
    AUTH_ADDRESS = "parameter"


class NginxByHttp(NginxGate, GateTests, FrontEndTest):
    GATE = "nginx/velksharing-auth-http.conf"
    AUTH_ADDRESS = "x-original-url"

    def pages(self):
        return ""  # are in the other

    def listen(self):
        return "--listen", str(self.socket), "--set", "socket_mode=666", "--set", "trusted_proxy=unix"


class Caddy(GateTests, FrontEndTest):
    WEB_SERVER = CaddyServer
    AUTH_ADDRESS = "x-forwarded"

    def start_web_server(self):
        # The site is there under every name.
        self.web_server.start(adapted(
            "caddy/velksharing-auth.caddyfile", ("wiki.example {", f"http://:{self.port} {{"),
            ("wiki.example", f"127.0.0.1:{self.port}"), (SOCKET, self.socket),
            ("127.0.0.1:3000", f"127.0.0.1:{self.application.port}"), ("timeout 10s", "timeout 1s")))

    def listen(self):
        return "--listen", str(self.socket), "--set", "socket_mode=666", "--set", "trusted_proxy=unix"


class Lighttpd(AnswersByPage, GateTests, FrontEndTest):
    WEB_SERVER = LighttpdServer
    AUTH_ADDRESS = "authorizer"

    def start_web_server(self):
        self.web_server.start(self.configuration())

    def configuration(self, *changes):
        gate = adapted(
            "lighttpd/velksharing-auth.conf", ("wiki.example", "127.0.0.1"), (SOCKET, self.socket),
            ("3000", self.application.port), ('"read-timeout" => 10', '"read-timeout" => 1'),
            *changes)
        return gate + adapted("lighttpd/velksharing.conf", (SOCKET, self.socket))

    def names_like(self, name):
        return [name]  # the others get through, and programs must not believe them

    def test_the_application_is_told_who_the_visitor_is(self):
        """By FastCGI it is; by HTTP lighttpd does not tell."""
        self.start_front_end()
        self.expect_in(self.visitor(self.wiki))
        self.assertEqual(self.told(), {})

    def test_a_program_by_cgi_is_told_who_the_visitor_is(self):
        folder = self.folder / "programs"
        folder.mkdir()
        (folder / "page.sh").write_text("echo; env")
        self.web_server = LighttpdServer(self, folder)
        self.port = self.web_server.port
        self.web_server.start(self.configuration(
            ('"mod_proxy"', '"mod_cgi"'), ("proxy.server", 'cgi.assign = ( ".sh" => "/bin/sh" ) #')))
        link = self.guard(f"http://127.0.0.1:{self.port}/")
        self.start_front_end()
        self.expect_out(self.stranger(), "/page.sh")
        answer = self.visitor(link).get("/page.sh", {"VELK-SHARING-UID": "31337"})
        self.assertIn(f"\nVELK_SHARING_HASH={link}\n".encode(), answer.body)
        self.assertIn(b"\nVELK_SHARING_UID=\n", answer.body)


class Apache(AnswersByPage, GateTests, FrontEndTest):
    WEB_SERVER = ApacheServer
    AUTH_ADDRESS = "authorizer"

    def setUp(self):
        self.front_end_port = free_port()
        super().setUp()

    def start_web_server(self):
        configuration = adapted(
            "apache/velksharing-auth.conf", ("127.0.0.1:9010", f"127.0.0.1:{self.front_end_port}"),
            ("*:80", f"127.0.0.1:{self.port}"), ("ServerName wiki.example", f"ServerName 127.0.0.1:{self.port}"),
            ("3000", self.application.port))
        self.web_server.start(
            configuration, ("authn_core", "authnz_fcgi", "authz_user", "headers", "proxy", "proxy_fcgi",
             "proxy_http", "setenvif"))

    def listen(self):
        return "--fastcgi", f"127.0.0.1:{self.front_end_port}"


if __name__ == "__main__":
    main()
