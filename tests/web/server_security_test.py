#!/usr/bin/env python3
"""What the front end does with visitors who mean harm, by itself and by FastCGI behind nginx."""

import json
import os
import subprocess

from hostile_spellings import ways_elsewhere, ways_out
from server_support import *
from web_servers import NginxServer

SECRET = b"outside of what is shared"
EVIL = "evil.example"


def head_of(received):
    return received.partition(b"\r\n\r\n")[0]


def as_browsers_read(address):
    """Without what they drop, and with the slashes that they see."""
    address = re.sub(r"[\t\r\n]", "", address).strip("".join(map(chr, range(33))))
    address = address.replace("\\", "/")
    return re.sub(r"(?i)^(https?:)?/{2,}", lambda begin: (begin[1] or "") + "//", address)


def hosts_led_to(received):
    """The hosts of all addresses in an answer, other than the one that was asked."""
    head, _, body = received.partition(b"\r\n\r\n")
    addresses = re.findall(
        rb"(?im)^(?:location|content-location|link|refresh):[ \t]*(?:\d+;\s*url=)?(.*?)\r?$", head)
    addresses = [address.decode("latin-1") for address in addresses]
    if re.search(rb"(?im)^content-type: text/html", head):
        addresses += Addresses(body).found
    base = "http://localhost/sharing/x"
    joined = (urllib.parse.urljoin(base, as_browsers_read(address)) for address in addresses)
    return {urllib.parse.urlsplit(address).netloc for address in joined} - {"localhost", ""}


class SecurityTest(FrontEndTest):
    def setUp(self):
        super().setUp()
        self.file = self.make_file("hello.txt", 100)
        self.shared = self.file.parent
        (self.shared / "sub").mkdir(mode=0o755)
        (self.shared / "out").symlink_to("/etc")
        outside = self.folder / "outside.txt"
        outside.write_bytes(SECRET)
        outside.chmod(0o644)
        self.link = self.share(self.shared)
        self.address = f"/sharing/{self.link}"

    def visitor(self, **cookies):
        visitor = Visitor(self.port)
        visitor.cookies.update(cookies)
        return visitor

    def visitor_inside(self):
        visitor = self.visitor()
        self.assertEqual(visitor.log_in(self.link).status, 303)
        return visitor

    def opens(self, session, link=None):
        """Whether a session, brought as cookie, opens a link."""
        page = self.visitor(sharing_sid=session).get(f"/sharing/{link or self.link}")
        self.assertEqual(page.status, 200)
        return b"hello.txt" in page.body

    def sessions(self):
        return in_database("SELECT COUNT(*) FROM session")[0][0]


class Embedded:
    """By its own HTTP server."""

    def serve(self, **environment):
        self.server = self.start(workers=2, env={**os.environ, **environment})
        self.port = self.server.port


class BehindNginx:
    """By FastCGI."""

    def serve(self, **environment):
        socket = self.folder / "socket"
        self.server = self.keep(FrontEnd(["--fastcgi", str(socket), "--set", "socket_mode=666"],
                                         self.folder, env={**os.environ, **environment}))
        nginx = NginxServer(self, self.folder)
        nginx.serve_links(socket)
        self.port = nginx.port


class Fixation:
    """A session that somebody else has put into the visitor's browser."""

    def setUp(self):
        super().setUp()
        self.serve()

    def assert_login_gives_another(self, planted):
        visitor = self.visitor(sharing_sid=planted)
        self.assertEqual(visitor.log_in(self.link).status, 303)
        given = visitor.cookies["sharing_sid"]
        self.assertNotEqual(given, planted)
        self.assertTrue(self.opens(given))
        self.assertFalse(self.opens(planted))

    def test_a_made_up_session_is_not_taken_on(self):
        for planted in ("A" * 32, "0", "x" * 128, "-_-"):
            self.assert_login_gives_another(planted)
            self.assertEqual(in_database("SELECT * FROM session WHERE session_id = ?", planted), [])

    def test_a_session_of_another_link_is_not_taken_on(self):
        other = self.share(self.shared, password="of the attacker")
        attacker = self.visitor()
        self.assertEqual(attacker.log_in(other, "of the attacker").status, 303)
        planted = attacker.cookies["sharing_sid"]
        self.assert_login_gives_another(planted)
        self.assertTrue(self.opens(planted, other))

    def test_a_session_that_was_logged_out_is_not_taken_on(self):
        attacker = self.visitor_inside()
        page = attacker.get(self.address)
        token = re.search(rb'name="csrf" value="([^"]*)"', page.body)[1].decode()
        planted = attacker.cookies["sharing_sid"]
        attacker.submit(f"{self.address}/logout", {"csrf": token})
        self.assert_login_gives_another(planted)

    def test_two_visitors_with_one_planted_session_get_one_each(self):
        given = set()
        for _ in range(2):
            visitor = self.visitor(sharing_sid="A" * 32)
            visitor.log_in(self.link)
            given.add(visitor.cookies["sharing_sid"])
        self.assertEqual(len(given), 2)

    def test_a_session_in_the_field_of_programs_is_not_taken_on(self):
        planted = "A" * 32
        visitor = self.visitor()
        answer = visitor.submit(self.address, {"password": PASSWORD}, {
            "X-Velk-Sharing": planted, "Accept": "application/json"})
        self.assertEqual(answer.status, 200)
        self.assertNotEqual(visitor.cookies["sharing_sid"], planted)
        self.assertFalse(self.opens(planted))

    def test_a_session_in_the_address_or_in_the_form_counts_nowhere(self):
        session = self.visitor_inside().cookies["sharing_sid"]
        for name in ("sharing_sid", "sid", "session", "X-Velk-Sharing", "HTTP_X_VELK_SHARING"):
            page = self.visitor().get(f"{self.address}?{name}={session}")
            self.assertNotIn(b"hello.txt", page.body)
            visitor = self.visitor()
            form = {"csrf": visitor.form_token(self.link), "password": "wrong", name: session}
            self.assertEqual(visitor.submit(self.address, form).status, 401)

    def test_who_is_refused_gets_no_session(self):
        visitor = self.visitor(sharing_sid="A" * 32)
        self.assertEqual(visitor.log_in(self.link, "wrong").status, 401)
        self.assertEqual(visitor.cookies["sharing_sid"], "A" * 32)
        self.assertEqual(self.sessions(), 0)

    def test_a_session_never_gets_into_an_address(self):
        visitor = self.visitor()
        answer = visitor.log_in(self.link)
        session = visitor.cookies["sharing_sid"]
        self.assertEqual(answer.headers["Location"], self.address)
        self.assertNotIn(raw(session), visitor.get(self.address).body)


class ForeignForms:
    """Requests that another site makes a visitor's browser send."""

    def setUp(self):
        super().setUp()
        self.serve()
        self.victim = self.visitor()
        self.token = self.victim.form_token(self.link)

    def assert_refused(self, visitor, fields, headers=None, path=None, allowed=(403,)):
        answer = visitor.submit(path or self.address, fields, headers)
        self.assertIn(answer.status, allowed, (fields, headers))
        self.assertNotIn("sharing_sid", str(answer.headers.get_all("Set-Cookie")))
        self.assertEqual(self.sessions(), 0)

    def form(self, token):
        return {"password": PASSWORD, "csrf": token}

    def tearDown(self):
        # The same form, sent by the page that it is from, is taken.
        origin = {"Origin": f"http://127.0.0.1:{self.port}", "Sec-Fetch-Site": "same-origin"}
        answer = self.victim.submit(self.address, self.form(self.token), origin)
        self.assertEqual(answer.status, 303)

    def test_without_the_right_token_are_refused(self):
        stranger = self.visitor()
        other = self.share(self.shared, password="another")
        wrong = ("", "0" * 64, self.token.upper(), self.token[:-1], self.token + "0",
                 self.victim.cookies["sharing_csrf"], stranger.form_token(self.link),
                 stranger.form_token(other))
        self.assert_refused(self.victim, {"password": PASSWORD})
        for token in wrong:
            self.assert_refused(self.victim, self.form(token))
        self.assert_refused(self.victim, [("csrf", wrong[1]), *self.form(self.token).items()])

    def test_with_a_token_for_another_link_are_refused(self):
        other = self.share(self.shared, password="another")
        visitor = self.visitor(sharing_csrf=self.victim.cookies["sharing_csrf"])
        self.assert_refused(visitor, self.form(visitor.form_token(other)))

    def test_with_a_token_but_without_the_cookie_are_refused(self):
        self.assert_refused(self.visitor(), self.form(self.token))
        for cookie in ("", "0" * 32, self.token, self.victim.cookies["sharing_csrf"].upper()):
            self.assert_refused(self.visitor(sharing_csrf=cookie), self.form(self.token))

    def test_with_a_token_in_the_address_are_refused(self):
        self.assert_refused(self.victim, {"password": PASSWORD},
                            path=f"{self.address}?csrf={self.token}")

    def test_from_other_sites_are_refused_with_a_right_token_too(self):
        host = f"127.0.0.1:{self.port}"
        for origin in (f"http://{EVIL}", f"https://{EVIL}", f"http://{host}.{EVIL}", EVIL,
                       f"http://{EVIL}/{host}", f"http://{EVIL}#{host}", f"http://{host}@{EVIL}",
                       "file://", "x"):
            self.assert_refused(self.victim, self.form(self.token), {"Origin": origin})
        for site in ("cross-site", "same-site", "Same-Origin", "same-origin, cross-site", "x"):
            for origin in (f"http://{host}", "null"):
                self.assert_refused(self.victim, self.form(self.token),
                                    {"Sec-Fetch-Site": site, "Origin": origin})

    def test_with_a_cookie_and_token_of_the_attacker_are_refused(self):
        attacker = self.visitor()
        token = attacker.form_token(self.link)
        victim = self.visitor(sharing_csrf=attacker.cookies["sharing_csrf"])
        self.assert_refused(victim, self.form(token), {"Origin": f"http://{EVIL}"})

    def test_of_another_type_are_refused(self):
        body = urllib.parse.urlencode(self.form(self.token))
        bodies = {
            "text/plain": body, "text/plain; application/x-www-form-urlencoded": body,
            "application/x-www-form-urlencoded2": body, "": body,
            "application/json": json.dumps(self.form(self.token)),
            "multipart/form-data; boundary=b": "".join(
                f'--b\r\nContent-Disposition: form-data; name="{name}"\r\n\r\n{value}\r\n'
                for name, value in self.form(self.token).items()) + "--b--\r\n"}
        for kind, text in bodies.items():
            answer = self.victim.request("POST", self.address, text, {"Content-Type": kind})
            self.assertIn(answer.status, (403, 415), kind)
        self.assertEqual(self.sessions(), 0)

    def test_by_another_method_are_no_login(self):
        query = urllib.parse.urlencode(self.form(self.token))
        for headers in ({}, {"X-HTTP-Method-Override": "POST"}, {"X-Method-Override": "POST"}):
            page = self.victim.get(f"{self.address}?{query}&_method=POST", headers)
            self.assertNotIn(b"hello.txt", page.body)
        form = {"Content-Type": "application/x-www-form-urlencoded"}
        self.victim.request("HEAD", f"{self.address}?{query}")
        self.victim.request("GET", self.address, query, form)
        for method in ("PUT", "PATCH", "DELETE", "OPTIONS", "TRACE", "post", "POSTX", "GETPOST"):
            answer = self.victim.request(method, self.address, query, form)
            self.assertIn(answer.status, (400, 405, 501), method)
        self.assertEqual(self.sessions(), 0)

    def test_with_a_field_that_looks_like_that_of_programs_are_refused(self):
        for name in ("X_Velk_Sharing", "X-Velk_Sharing", "Http-X-Velk-Sharing", "XVelkSharing"):
            self.assert_refused(self.victim, {"password": PASSWORD}, {name: "A" * 32})

    def test_other_sites_are_allowed_no_field_of_programs(self):
        answer = self.victim.request("OPTIONS", self.address, headers={
            "Origin": f"http://{EVIL}", "Access-Control-Request-Method": "POST",
            "Access-Control-Request-Headers": "x-velk-sharing"})
        self.assertNotIn("access-control", str(answer.headers).lower())

    def test_log_nobody_out(self):
        visitor = self.visitor_inside()
        leave = f"{self.address}/logout"
        self.assertEqual(visitor.submit(leave, {}).status, 403)
        self.assertEqual(visitor.submit(leave, {"csrf": self.token}).status, 403)
        visitor.get(leave)
        visitor.get(f"{self.address}?logged-out")
        self.assertTrue(self.opens(visitor.cookies["sharing_sid"]))


# In what a visitor sends: lines that must not become lines of the answer.
LINE_ENDS = ("%0d%0a", "%0a", "%0d", "\r\n", "\n", "\r", "\0", "%00", "%250d%250a", "%u000d%u000a",
             "%e5%98%8d%e5%98%8a", "\xe5\x98\x8d\xe5\x98\x8a", "\\r\\n", "%c4%8d%c4%8a", "\x0b", "\x85",
             "%e2%80%a8", "\r\n\r\n", "%0d%0a%0d%0a", "\r\n ")
INJECTED = "X-Injected: yes", "Set-Cookie: injected=yes", f"Location: http://{EVIL}/injected"


class Injection:
    """Lines and attributes from outside in the head of an answer."""

    def setUp(self):
        super().setUp()
        self.serve()

    def assert_own_head(self, received, what):
        head = head_of(received)
        self.assertNotIn(b"injected", head.lower(), what)
        self.assertNotIn(raw(EVIL), head.lower(), what)
        cookies = re.findall(rb"(?im)^set-cookie:[ \t]*(.*?)\r?$", head)
        for cookie in cookies:
            self.assertRegex(cookie, rb"^sharing_(sid=[\w-]+|csrf=[0-9a-f]{32}); Path=" +
                             raw(self.address) + rb"; HttpOnly; SameSite=Lax$")
        return cookies

    def test_no_line_of_the_address_gets_into_the_answer(self):
        visitor = self.visitor_inside()
        cookie = f"Cookie: sharing_sid={visitor.cookies['sharing_sid']}"
        for end in LINE_ENDS:
            for line in INJECTED:
                bad = end + line
                for target in (f"{self.address}{bad}", f"{self.address}/{bad}", f"/sharing/{bad}",
                               f"/{bad}", f"/sharing/-/style{bad}.css", f"{self.address}?{bad}",
                               f"{self.address}?sort={bad}", f"{self.address}/hello.txt?download={bad}",
                               f"{self.address}?zip&name={bad}"):
                    self.assert_own_head(ask(self.port, target, cookie), target)

    def test_no_line_of_a_field_gets_into_the_answer(self):
        for end in LINE_ENDS:
            for line in INJECTED:
                for name in ("Host", "Cookie", "X-Forwarded-Host", "X-Forwarded-For",
                             "X-Forwarded-Proto", "Origin", "Referer", "Accept", "Accept-Language",
                             "Range", "If-None-Match", "If-Range", "User-Agent", "X-Velk-Sharing"):
                    field = f"{name}: x{end}{line}"
                    self.assert_own_head(ask(self.port, self.address, field), field)

    def test_no_line_of_a_form_gets_into_the_answer(self):
        visitor = self.visitor()
        token = visitor.form_token(self.link)
        for line in INJECTED:
            for end in ("\r\n", "\n", "\r", "\r\n\r\n", "\u560d\u560a", "%0d%0a"):
                bad = "x" + end + line
                for name, value in (("csrf", bad), (bad, "x"), ("next", bad), ("username", bad)):
                    body = urllib.parse.urlencode(
                        [(name, value), ("csrf", token), ("password", PASSWORD)]).encode()
                    received = ask(self.port, self.address,
                                   "Content-Type: application/x-www-form-urlencoded",
                                   f"Cookie: sharing_csrf={visitor.cookies['sharing_csrf']}",
                                   method="POST", body=body)
                    self.assertIn(statuses(received)[0], (303, 403))
                    self.assert_own_head(received, name)

    def test_no_line_of_a_file_s_name_gets_into_the_answer(self):
        visitor = self.visitor_inside()
        for name in ("a\r\nX-Injected: yes\r\n", "a\nX-Injected: yes", 'a"; filename="injected.exe',
                     "a\r\n\r\n<script>", "a\u560d\u560aX-Injected: yes"):
            file = self.shared / name
            file.write_bytes(b"content")
            file.chmod(0o644)
            for query in ("", "?download", "?view"):
                answer = visitor.get(f"{self.address}/{urllib.parse.quote(name)}{query}")
                self.assertEqual(answer.status, 200)
                self.assertIsNone(answer.headers["X-Injected"])
                self.assertNotRegex(answer.headers.get("Content-Disposition", ""),
                                    r'filename="injected|[\r\n]')

    def test_attributes_that_a_visitor_brings_are_not_given_back(self):
        session = self.visitor_inside().cookies["sharing_sid"]
        for brought in (f"sharing_csrf=x; Domain={EVIL}; Path=/; Secure",
                        f"sharing_csrf={'0' * 31}; Max-Age=injected",
                        f"sharing_csrf=\"{'0' * 32}; Domain={EVIL}\"",
                        f"sharing_sid={session}; Domain={EVIL}; Path=/",
                        f"sharing_sid={session}\t; SameSite=None; injected",
                        f"sharing_sid={session}%0d%0aSet-Cookie:%20injected=1",
                        f"sharing_sid={session}, sharing_csrf=injected"):
            self.assert_own_head(ask(self.port, self.address, f"Cookie: {brought}"), brought)

    def test_of_several_sessions_the_first_counts(self):
        session = self.visitor_inside().cookies["sharing_sid"]
        self.assertTrue(self.opens(f"{session}; sharing_sid={'A' * 32}"))
        self.assertFalse(self.opens(f"{'A' * 32}; sharing_sid={session}"))

    def test_names_that_look_alike_are_other_cookies(self):
        session = self.visitor_inside().cookies["sharing_sid"]
        for name in ("sharing_sid2", "xsharing_sid", "SHARING_SID", "Sharing_Sid", "sharing-sid",
                     "sharing%5fsid", "$sharing_sid", "__Host-sharing_sid", "sharing_sid.", "sharing_",
                     '"sharing_sid"', "sharing_sid[]", "sharing_sid\xa0", "x=sharing_sid"):
            received = ask(self.port, self.address, f"Cookie: {name}={session}")
            self.assertEqual(statuses(received), [200], name)
            self.assertNotIn(b"hello.txt", received, name)

    def test_what_is_no_session_is_none(self):
        session = self.visitor_inside().cookies["sharing_sid"]
        for value in ("", session * 10, "A" * 129, "A" * 10_000, session + "'--", session + "%00",
                      session + "\\", f"'{session}'", f"\"{session}", session.upper() + "x",
                      session[:-1], "' OR '1'='1", "%", "../../" + session):
            received = ask(self.port, self.address, f"Cookie: sharing_sid={value}")
            # nginx takes heads of 8 KiB only.
            self.assertIn(statuses(received), ([200], [400]), value)
            self.assertNotIn(b"hello.txt", received, value)
            self.assert_own_head(received, value)
        self.assertTrue(self.opens(f'"{session}"'))


class Traversal:
    """Files that are not shared."""

    def setUp(self):
        super().setUp()
        self.serve()
        visitor = self.visitor_inside()
        self.cookie = f"Cookie: sharing_sid={visitor.cookies['sharing_sid']}"
        found = ask(self.port, f"{self.address}/hello.txt?download", self.cookie)
        self.assertEqual(statuses(found), [200])
        self.assertIn(self.file.read_bytes(), found)

    def assert_hidden(self, target):
        received = ask(self.port, target, self.cookie)
        self.assertLessEqual(set(statuses(received)), {400, 404}, target)
        for bytes_ in (SECRET, b"root:", self.file.read_bytes()):
            self.assertNotIn(bytes_, received, target)

    def test_no_spelling_leads_out_of_what_is_shared(self):
        ways = set(ways_out("outside.txt"))
        self.assertGreaterEqual(len(ways), 300)
        for way in sorted(ways):
            self.assert_hidden(f"{self.address}{way}?download")

    def test_no_spelling_leads_out_from_beside_a_link(self):
        # Not by way of our own paths either: of a link that is not there, and of style sheets.
        for way in sorted(set(ways_out("outside.txt")))[::4]:
            self.assert_hidden(f"/sharing/-{way}")
            self.assert_hidden(f"/sharing{way}")

    def test_no_spelling_selects_for_an_archive(self):
        for way in sorted(set(ways_out("outside.txt")))[::2]:
            self.assert_hidden(f"{self.address}?zip&name={way[1:]}")


NAMES = ("next", "return", "return_to", "returnTo", "url", "uri", "redirect", "redirect_uri",
         "redirect_url", "target", "dest", "destination", "continue", "goto", "back", "rurl", "u", "r",
         "ref", "path", "host", "callback", "forward", "logout", "logged-out", "action", "page", "view")

PLAIN_ADDRESS = re.compile(rf"(?i)https?://{re.escape(EVIL)}")


class OpenRedirects:
    """Other sites, to which an address of ours could lead."""

    def setUp(self):
        super().setUp()
        self.serve()
        self.spellings = sorted(set(ways_elsewhere(EVIL)))
        self.assertGreaterEqual(len(self.spellings), 300)

    def assert_stays(self, received, what):
        self.assertNotEqual(received, b"", what)
        self.assertEqual(hosts_led_to(received), set(), what)

    def test_no_parameter_leads_elsewhere(self):
        for spelling in self.spellings:
            for value in {spelling, urllib.parse.quote(spelling, safe="")}:
                query = "&".join(f"{name}={value}" for name in NAMES)
                self.assert_stays(ask(self.port, f"{self.address}?{query}"), value)

    def test_no_field_of_a_form_leads_elsewhere(self):
        visitor = self.visitor()
        form = [("csrf", visitor.form_token(self.link)), ("password", PASSWORD)]
        cookie = f"Cookie: sharing_csrf={visitor.cookies['sharing_csrf']}"
        for spelling in self.spellings[::3]:
            body = urllib.parse.urlencode(form + [(name, spelling) for name in NAMES]).encode()
            query = f"next={urllib.parse.quote(spelling, safe='')}"
            received = ask(self.port, f"{self.address}?{query}", cookie, f"Host: {EVIL}",
                           "Content-Type: application/x-www-form-urlencoded", method="POST", body=body)
            self.assertEqual(statuses(received), [303])
            self.assert_stays(received, spelling)

    def test_no_path_leads_elsewhere(self):
        for spelling in self.spellings:
            path = spelling if spelling.startswith(("/", "http")) else "/" + spelling
            self.assert_stays(ask(self.port, path), path)
        for spelling in self.spellings[::4]:
            self.assert_stays(ask(self.port, f"{self.address}/{spelling}"), spelling)
        for path in (f"//{EVIL}", f"//{EVIL}/sharing", f"/sharing//{EVIL}", f"/sharing/{self.link}//",
                     f"//{EVIL}/%2e%2e", f"//{EVIL}/..", f"/\\{EVIL}", f"/sharing/../..//{EVIL}",
                     f"/{self.address}", f"//{EVIL}/..{self.address}", "/sharing", "/sharing/",
                     f"http://{EVIL}{self.address}", f"https://{EVIL}{self.address}?next=x"):
            self.assert_stays(ask(self.port, path), path)

    def test_no_name_of_the_host_leads_elsewhere(self):
        others = ("X-Forwarded-Host", "X-Forwarded-Server", "X-Original-URL", "X-Rewrite-URL",
                  "X-Forwarded-Prefix", "X-Host", "Referer")
        for spelling in self.spellings[::4]:
            fields = [f"{name}: {spelling}" for name in others] + [f"Forwarded: host={spelling}"]
            self.assert_stays(ask(self.port, self.address, *fields), spelling)
            self.assert_stays(ask(self.port, self.address, f"Host: {spelling}"), spelling)
        for host in (EVIL, f"{EVIL}:80", f"localhost@{EVIL}", f"localhost, {EVIL}"):
            visitor = self.visitor()
            visitor.get(self.address)
            answer = visitor.submit(self.address, {
                "csrf": visitor.form_token(self.link), "password": PASSWORD}, {"Host": host})
            self.assertIn(answer.status, (303, 400), host)
            self.assertIn(answer.headers["Location"], (self.address, None))

    def test_an_owner_s_target_is_taken_as_it_is_or_not_at_all(self):
        link = self.share(self.shared, "--redirect", "always", "--redirect-uri", "https://a.example/",
                          password=None)
        data = json.loads(in_database("SELECT data FROM entry WHERE hash = ?", link)[0][0])
        followed = 0
        for kind, spellings in (("always", self.spellings), ("url_param", self.spellings[::3])):
            for spelling in spellings:
                data.update(redirect_type=kind, redirect_uri=spelling)
                in_database("UPDATE entry SET data = ? WHERE hash = ?", json.dumps(data), link)
                received = ask(self.port, f"/sharing/{link}")
                if PLAIN_ADDRESS.fullmatch(spelling):
                    self.assertEqual(hosts_led_to(received), {EVIL})
                    followed += 1
                else:
                    self.assert_stays(received, spelling)
        self.assertGreaterEqual(followed, 3)


MARKER = f"http://{EVIL}:3128"


class Httpoxy:
    """A field Proxy, which CGI would hand over under the name that tells programs their proxy."""

    def setUp(self):
        super().setUp()
        self.seen = self.folder / "seen"
        self.witness = {"LD_PRELOAD": preloaded("witness"), "VELK_WITNESS": str(self.seen)}

    def assert_nobody_sees_the_proxy(self):
        lines = self.seen.read_text().splitlines()
        self.assertIn("request HTTP_X_MARKER=seen", lines)
        self.assertEqual([line for line in lines if MARKER in line], [])


class HttpoxyOverNetwork(Httpoxy):
    def test_nobody_sees_the_proxy_that_a_visitor_sends(self):
        self.serve(**self.witness)
        for name in ("Proxy", "proxy", "PROXY", "pRoXy", "Proxy_", "HTTP_PROXY", "http_proxy"):
            ask(self.port, self.address, f"{name}: {MARKER}", "X-Marker: seen")
        self.assert_nobody_sees_the_proxy()


class HttpoxyByCgi(Httpoxy, SecurityTest):
    def test_nobody_sees_the_proxy_that_a_visitor_sends(self):
        environment = {**os.environ, **self.witness, "GATEWAY_INTERFACE": "CGI/1.1",
                       "REQUEST_METHOD": "GET", "REQUEST_URI": self.address,
                       "REMOTE_ADDR": "127.0.0.1", "HTTP_X_MARKER": "seen", "HTTP_PROXY": MARKER}
        outcome = subprocess.run([PROGRAM], env=environment, stdin=subprocess.DEVNULL,
                                 capture_output=True, timeout=20)
        self.assertIn(b"Status: 200", outcome.stdout)
        self.assert_nobody_sees_the_proxy()


class FixationEmbedded(Fixation, Embedded, SecurityTest):
    pass


class FixationBehindNginx(Fixation, BehindNginx, SecurityTest):
    pass


class ForeignFormsEmbedded(ForeignForms, Embedded, SecurityTest):
    # Debian's nginx does not tell FastCGI programs the port that the visitor named.
    def test_from_another_port_are_refused(self):
        for origin in ("http://127.0.0.1", "http://127.0.0.1:1", "https://127.0.0.1"):
            self.assert_refused(self.victim, self.form(self.token), {"Origin": origin})


class ForeignFormsBehindNginx(ForeignForms, BehindNginx, SecurityTest):
    pass


class InjectionEmbedded(Injection, Embedded, SecurityTest):
    pass


class InjectionBehindNginx(Injection, BehindNginx, SecurityTest):
    pass


class TraversalEmbedded(Traversal, Embedded, SecurityTest):
    pass


class TraversalBehindNginx(Traversal, BehindNginx, SecurityTest):
    pass


class OpenRedirectsEmbedded(OpenRedirects, Embedded, SecurityTest):
    pass


class OpenRedirectsBehindNginx(OpenRedirects, BehindNginx, SecurityTest):
    pass


class HttpoxyOverNetworkEmbedded(HttpoxyOverNetwork, Embedded, SecurityTest):
    pass


class HttpoxyOverNetworkBehindNginx(HttpoxyOverNetwork, BehindNginx, SecurityTest):
    pass


if __name__ == "__main__":
    main()
