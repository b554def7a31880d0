#!/usr/bin/env python3
"""The embedded server: workers, signals, downloads."""

import os
import pathlib
import signal
import socket
import threading
import time
import unittest

from server_support import *

LARGE = 40 * 1024 * 1024  # more than all buffers on the way hold


class Serving(FrontEndTest):
    def test_ipv6_is_served(self):
        try:
            socket.create_server(("::1", 0), family=socket.AF_INET6).close()
        except OSError:
            self.skipTest("no IPv6 here")
        server = self.keep(FrontEnd(["--listen", "[::1]:0"], self.folder))
        connection = http.client.HTTPConnection("::1", server.port, timeout=10)
        self.addCleanup(connection.close)
        connection.request("GET", "/sharing-health")
        self.assertEqual(connection.getresponse().status, 200)
        self.assertEqual(server.visits(1)[0][1], "::1")

    def test_a_visitor_logs_in_and_downloads_byte_for_byte(self):
        file = self.make_file("big.bin", 5_000_000)
        link = self.share(file.parent)
        visitor = Visitor(self.start(workers=2).port)
        self.assertEqual(visitor.log_in(link, "wrong").status, 401)
        self.assertEqual(visitor.log_in(link).status, 303)
        answer = visitor.get(f"/sharing/{link}/big.bin?download")
        self.assertEqual(answer.status, 200)
        self.assertEqual(answer.body, file.read_bytes())

    def test_a_range_is_a_part_of_the_file(self):
        file = self.make_file("big.bin", 5_000_000)
        link = self.share(file.parent)
        visitor = Visitor(self.start().port)
        visitor.log_in(link)
        answer = visitor.get(f"/sharing/{link}/big.bin?download",
                             {"Range": "bytes=1000000-2999999"})
        self.assertEqual(answer.status, 206)
        self.assertEqual(answer.headers["Content-Range"], "bytes 1000000-2999999/5000000")
        self.assertEqual(answer.body, file.read_bytes()[1_000_000:3_000_000])

    def test_what_the_visitor_has_already_is_not_sent_again(self):
        file = self.make_file("a.bin", 1000)
        link = self.share(file.parent)
        visitor = Visitor(self.start().port)
        visitor.log_in(link)
        path = f"/sharing/{link}/a.bin?download"
        answer = visitor.get(path, {"If-None-Match": visitor.get(path).headers["ETag"]})
        self.assertEqual(answer.status, 304)
        self.assertIsNone(answer.headers["Content-Length"])
        self.assertEqual(answer.body, b"")

    def test_nothing_follows_the_head_of_an_answer_without_a_body(self):
        file = self.make_file("a.bin", 1000)
        link = self.share(file.parent)
        visitor = Visitor(self.start().port)
        visitor.log_in(link)
        path = f"/sharing/{link}/a.bin?download"
        tag = visitor.get(path).headers["ETag"]
        archive = f"/sharing/{link}?zip"
        for method, target, status in (("GET", path, 304), ("HEAD", path, 304),
                                       ("HEAD", archive, 200)):
            raw = (f"{method} {target} HTTP/1.1\r\nHost: localhost\r\nIf-None-Match: {tag}\r\n"
                   f"Cookie: sharing_sid={visitor.cookies['sharing_sid']}\r\n\r\n")
            received = b"".join(self.pieces_within(0.5, visitor.port, raw.encode()))
            self.assertEqual(statuses(received), [status])
            # Whatever came would be taken for the next answer's beginning.
            self.assertEqual(received.partition(b"\r\n\r\n")[2], b"")

    def pieces_within(self, seconds, port, raw):
        """What comes on a connection that the visitor keeps."""
        with socket.create_connection(("127.0.0.1", port), timeout=seconds) as connection:
            connection.sendall(raw)
            try:
                while piece := connection.recv(65536):
                    yield piece
            except TimeoutError:
                pass

    def test_head_tells_the_length_and_sends_nothing(self):
        file = self.make_file("a.bin", 1000)
        link = self.share(file.parent)
        visitor = Visitor(self.start().port)
        visitor.log_in(link)
        answer = visitor.request("HEAD", f"/sharing/{link}/a.bin?download")
        self.assertEqual((answer.status, answer.headers["Content-Length"], answer.body),
                         (200, "1000", b""))

    def test_a_connection_serves_several_requests(self):
        connection = http.client.HTTPConnection("127.0.0.1", self.start().port, timeout=10)
        self.addCleanup(connection.close)
        ports = set()
        for _ in range(3):
            connection.request("GET", "/sharing-health")
            self.assertEqual(Answer(connection.getresponse()).status, 200)
            ports.add(connection.sock.getsockname()[1])
        self.assertEqual(len(ports), 1)

    def test_a_file_that_shrinks_on_the_way_is_cut_and_not_filled_up(self):
        file = self.make_file("big.bin", LARGE)
        link = self.share(file.parent)
        server = self.start()
        with Download(server.port, link, self) as download:
            os.truncate(file, 1_000_000)
            self.assertLess(len(download.rest()), LARGE)

    def test_200_visitors_at_once_on_a_link_with_5_uses(self):
        file = self.make_file("a.bin", 1000)
        link = self.share(file.parent, "--uses", "5")
        server = self.start(workers=4)
        ready = threading.Barrier(200)
        results = []

        def visit():
            visitor = Visitor(server.port)
            form = {"password": PASSWORD, "csrf": visitor.form_token(link)}
            ready.wait(60)
            answer = visitor.submit(f"/sharing/{link}", form, timeout=90)
            results.append(answer.status)
            if answer.status == 303:
                results.append(("in", visitor.get(f"/sharing/{link}").status))

        visitors = [threading.Thread(target=visit) for _ in range(200)]
        for visitor in visitors:
            visitor.start()
        for visitor in visitors:
            visitor.join()
        self.assertEqual(results.count(303), 5)
        self.assertEqual(results.count(("in", 200)), 5)
        self.assertEqual(results.count(404), 195)

    def test_a_download_holds_up_nobody(self):
        file = self.make_file("big.bin", LARGE)
        link = self.share(file.parent)
        server = self.start(workers=1)
        with Download(server.port, link, self):
            self.assertEqual(Visitor(server.port).get("/sharing-health", timeout=2).status, 200)

    def test_one_worker_takes_no_more_connections_than_it_may(self):
        server = self.start("--set", "connections=2", workers=1)
        held = [socket.create_connection(("127.0.0.1", server.port)) for _ in range(2)]
        time.sleep(0.5)
        with self.assertRaises(TimeoutError):
            Visitor(server.port).get("/sharing-health", timeout=1)
        held.pop().close()
        self.assertEqual(Visitor(server.port).get("/sharing-health").status, 200)
        held.pop().close()


class Download:
    """A download that has begun, and whose visitor reads no further for now."""

    def __init__(self, port, link, test, name="big.bin"):
        self.visitor = Visitor(port)
        test.assertEqual(self.visitor.log_in(link).status, 303)
        self.connection = http.client.HTTPConnection("127.0.0.1", port, timeout=30)
        headers = {"Cookie": f"sharing_sid={self.visitor.cookies['sharing_sid']}"}
        self.connection.request("GET", f"/sharing/{link}/{name}?download", headers=headers)
        self.response = self.connection.getresponse()
        test.assertEqual(self.response.status, 200)
        self.begin = self.response.read(100_000)

    def __enter__(self):
        return self

    def __exit__(self, *_):
        self.connection.close()

    def rest(self):
        """All bytes, as far as they come."""
        try:
            return self.begin + self.response.read()
        except http.client.IncompleteRead as cut:
            return self.begin + cut.partial
        except ConnectionError:
            return self.begin


class Workers(FrontEndTest):
    def test_a_worker_that_crashes_is_replaced(self):
        server = self.start(workers=2)
        self.assertEqual(len(wait_until(lambda: len(server.workers()) == 2 and server.workers())), 2)
        victim = server.workers()[0]
        os.kill(victim, signal.SIGSEGV)
        wait_until(lambda: victim not in server.workers() and len(server.workers()) == 2)
        for _ in range(20):
            self.assertEqual(Visitor(server.port).get("/sharing-health").status, 200)
        self.assertIn(f"worker {victim} was ended by signal 11", server.log.read_text())

    def test_a_crash_loses_no_request_of_the_other_workers(self):
        server = self.start(workers=2)
        failed = []
        over = threading.Event()

        def visit():
            while not over.is_set():
                try:
                    if Visitor(server.port).get("/sharing-health").status != 200:
                        failed.append("status")
                except OSError as error:
                    failed.append(error)

        visitors = [threading.Thread(target=visit) for _ in range(2)]
        for visitor in visitors:
            visitor.start()
        time.sleep(0.3)
        os.kill(server.workers()[0], signal.SIGSEGV)
        time.sleep(1)
        over.set()
        for visitor in visitors:
            visitor.join()
        # What that worker was doing is lost, which is one request of each visitor at most.
        self.assertLessEqual(len(failed), 2, failed)

    def test_workers_that_crash_again_and_again_are_replaced_more_slowly(self):
        server = self.start(workers=1)
        for _ in range(4):
            os.kill(wait_until(server.workers)[0], signal.SIGKILL)
            wait_until(lambda: not server.workers(), 5)
        pauses = wait_until(lambda: len(found := re.findall(
            r"another one starts in (\d+) ms", server.log.read_text())) == 4 and found)
        self.assertEqual(pauses, ["100", "200", "400", "800"])

    def test_workers_end_with_their_supervisor(self):
        server = self.start(workers=2)
        workers = wait_until(lambda: len(server.workers()) == 2 and server.workers())
        server.process.kill()
        server.process.wait()
        for worker in workers:
            wait_until(lambda worker=worker: not is_alive(worker))

    def test_a_worker_without_a_database_says_so_and_is_replaced(self):
        database = ROOT / "etc/private/session/sharing.db"
        link = self.share(self.make_file("a.bin", 10).parent)
        kept = database.read_bytes()
        remove_database()
        database.mkdir()
        self.addCleanup(lambda: database.is_dir() and database.rmdir())
        server = self.start(workers=1)
        self.assertEqual(Visitor(server.port).get(f"/sharing/{link}").status, 503)
        database.rmdir()
        database.write_bytes(kept)
        wait_until(lambda: Visitor(server.port).get(f"/sharing/{link}").status == 200)

    @unittest.skipUnless(os.geteuid() == 0, "only root has privileges to drop")
    def test_a_worker_of_root_keeps_two_capabilities(self):
        server = self.start(workers=1)
        worker = wait_until(server.workers)[0]
        status = pathlib.Path(f"/proc/{worker}/status").read_text()
        for line in ("CapInh:\t0000000000000000", "CapPrm:\t00000000000000c0",
                     "CapEff:\t00000000000000c0", "CapBnd:\t00000000000000c0",
                     "CapAmb:\t0000000000000000", "NoNewPrivs:\t1"):
            self.assertIn(line, status)
        self.assertRegex(status, r"Groups:\s*\n")
        self.assertRegex(status, r"Umask:\s*0077")

    @unittest.skipUnless(os.geteuid() == 0, "a worker's memory is hidden from other accounts")
    def test_a_worker_stays_small(self):
        file = self.make_file("a.bin", 1000)
        link = self.share(file.parent)
        server = self.start(workers=1)
        for _ in range(5):
            visitor = Visitor(server.port)
            visitor.log_in(link)
            visitor.get(f"/sharing/{link}")
        status = pathlib.Path(f"/proc/{server.workers()[0]}/smaps_rollup").read_text()
        self.assertLess(int(re.search(r"Pss:\s+(\d+)", status).group(1)), 25 * 1024)


class Signals(FrontEndTest):
    def test_sigterm_finishes_a_download(self):
        file = self.make_file("big.bin", LARGE)
        link = self.share(file.parent)
        server = self.start(workers=2)
        with Download(server.port, link, self) as download:
            server.signal(signal.SIGTERM)
            wait_until(lambda: not accepts(server.port))
            self.assertIsNone(server.process.poll())
            self.assertEqual(download.rest(), file.read_bytes())
        self.assertEqual(server.process.wait(10), 0)

    def test_sigterm_waits_no_longer_than_the_configuration_allows(self):
        file = self.make_file("big.bin", LARGE)
        link = self.share(file.parent)
        server = self.start("--set", "stop_timeout=1")
        with Download(server.port, link, self) as download:
            began = time.monotonic()
            self.assertEqual(server.stop(), 0)
            self.assertLess(time.monotonic() - began, 6)
            self.assertLess(len(download.rest()), LARGE)

    def test_sigterm_does_not_wait_for_connections_without_a_request(self):
        server = self.start()
        connection = http.client.HTTPConnection("127.0.0.1", server.port, timeout=10)
        self.addCleanup(connection.close)
        connection.request("GET", "/sharing-health")
        connection.getresponse().read()
        began = time.monotonic()
        self.assertEqual(server.stop(), 0)
        self.assertLess(time.monotonic() - began, 3)

    def test_sighup_opens_the_access_log_anew(self):
        server = self.start(workers=2)
        Visitor(server.port).get("/sharing-health")
        server.visits(1)
        moved = self.folder / "access.log.1"
        os.rename(server.access_log, moved)
        server.signal(signal.SIGHUP)
        wait_until(server.access_log.exists)
        time.sleep(0.3)
        for _ in range(8):
            Visitor(server.port).get("/sharing-health")
        server.visits(8)
        self.assertEqual(len(moved.read_text().splitlines()), 1)

    def test_sighup_reads_the_site_s_texts_anew(self):
        site = self.folder / "site"
        site.mkdir()
        style = site / "style.css"
        style.write_text("body { color: black }")
        link = self.share(self.make_file("a.bin", 10).parent)
        server = self.start("--set", f"site_folder={site}")

        def sheet():
            page = Visitor(server.port).get(f"/sharing/{link}")
            return re.findall(rb'href="([^"]*\.css)"', page.body)

        before = sheet()
        style.write_text("body { color: navy }")
        self.assertEqual(sheet(), before)
        server.signal(signal.SIGHUP)
        wait_until(lambda: sheet() != before)


class Visits(FrontEndTest):
    def test_a_visit_is_one_line_without_secrets(self):
        link = self.share(self.make_file("a.bin", 1000).parent)
        server = self.start()
        visitor = Visitor(server.port)
        visitor.log_in(link)
        visitor.get(f"/sharing/{link}/a.bin?download")
        _, login, download = server.visits(3)
        self.assertEqual(login[1:6] + login[8:],
                         ["127.0.0.1", "POST", "login", link[:3] + "…", "303", "1", "done"])
        self.assertEqual(download[1:7], ["127.0.0.1", "GET", "download", link[:3] + "…", "200",
                                         "1000"])
        self.assertRegex(download[0], r"^\d{4}-\d\d-\d\dT\d\d:\d\d:\d\d\.\d{3}Z$")
        text = server.access_log.read_text() + server.log.read_text()
        for secret in (link, PASSWORD, visitor.cookies["sharing_sid"], "a.bin"):
            self.assertNotIn(secret, text)

    def test_bytes_from_outside_are_escaped(self):
        server = self.start()
        exchange(server.port, b"G\"E\\T\x1b[31m /sharing-health HTTP/1.1\r\nHost: x\r\n"
                              b"Connection: close\r\n\r\n")
        for line in server.access_log.read_text().splitlines():
            self.assertTrue(line.isprintable(), line)

    def test_the_word_of_a_stranger_on_his_address_does_not_count(self):
        server = self.start()
        Visitor(server.port).get("/sharing-health", {"X-Forwarded-For": "203.0.113.9"})
        self.assertEqual(server.visits(1)[0][1], "127.0.0.1")

    def test_the_word_of_a_trusted_proxy_on_the_visitor_s_address_counts(self):
        server = self.start("--set", "trusted_proxy=127.0.0.1")
        for chain in ("203.0.113.9", "198.51.100.1, 203.0.113.9", "203.0.113.9, 127.0.0.1"):
            Visitor(server.port).get("/sharing-health", {"X-Forwarded-For": chain})
        self.assertEqual([visit[1] for visit in server.visits(3)], ["203.0.113.9"] * 3)
        answer = Visitor(server.port).get("/sharing-health", {"X-Forwarded-For": "nobody knows"})
        self.assertEqual(answer.status, 400)

    def test_a_cookie_is_secure_where_the_trusted_proxy_was_asked_by_https(self):
        link = self.share(self.make_file("a.bin", 10).parent)
        server = self.start("--set", "trusted_proxy=127.0.0.1")
        page = Visitor(server.port).get(f"/sharing/{link}", {"X-Forwarded-Proto": "https"})
        self.assertIn("Secure", page.headers["Set-Cookie"])
        page = Visitor(server.port).get(f"/sharing/{link}")
        self.assertNotIn("Secure", page.headers["Set-Cookie"])


class Questions(FrontEndTest):
    """A web server asks, for a visitor who is in, and in every way that it should not."""

    ADDRESS = "X-Original-URL: https://wiki.example/page"

    def setUp(self):
        super().setUp()
        link = self.share(self.make_file("a.bin", 10).parent)
        self.server = self.start("--set", "auth_address=x-original-url",
                                 "--set", "trusted_proxy=127.0.0.1", "--set", f"protect=/ {link}")
        visitor = Visitor(self.server.port)
        visitor.log_in(link)
        self.cookie = f"Cookie: sharing_sid_{link}=" + visitor.cookies[f"sharing_sid_{link}"]

    def ask(self, *fields, line="GET /sharing-auth HTTP/1.1", body=""):
        """The statuses of all that is answered."""
        head = "\r\n".join([line, "Host: wiki.example", "Connection: close", *fields])
        return statuses(exchange(self.server.port, f"{head}\r\n\r\n{body}".encode()))

    def test_the_endpoint_answers_whatever_the_method_and_version(self):
        for line in ("GET /sharing-auth HTTP/1.1", "HEAD /sharing-auth HTTP/1.1",
                     "POST /sharing-auth HTTP/1.1", "OPTIONS /sharing-auth HTTP/1.1",
                     "GET /sharing-auth HTTP/1.0", "GET /sharing-auth?x HTTP/1.1",
                     "GET http://elsewhere.example/sharing-auth HTTP/1.1"):
            with self.subTest(line):
                self.assertEqual(self.ask(self.ADDRESS, self.cookie, line=line), [204])
                self.assertEqual(self.ask(self.ADDRESS, line=line), [401])
                self.assertEqual(self.ask(self.cookie, line=line), [403])

    def test_nothing_that_looks_like_the_endpoint_says_yes(self):
        for target in ("/sharing-auth/", "/sharing-auth//", "/sharing-auth/x", "/sharing-auth/.",
                       "/sharing-auth;x", "/sharing-auth%00", "/sharing-auth%20", "/sharing-auth%2f",
                       "/sharing%2dauth", "/sharing%2Dauth", "/%73haring-auth", "//sharing-auth",
                       "/./sharing-auth", "/x/../sharing-auth", "/sharing/../sharing-auth",
                       "/SHARING-AUTH", "/sharing-auth#x", "sharing-auth", "*", "/sharing/-auth",
                       "http://elsewhere.example", "https://wiki.example/page", "/page"):
            with self.subTest(target):
                answered = self.ask(self.ADDRESS, self.cookie, line=f"GET {target} HTTP/1.1")
                self.assertTrue(answered and min(answered) >= 400, answered)

    def test_an_address_that_comes_in_two_ways_or_in_another_one_is_none(self):
        for fields in ([self.ADDRESS, self.ADDRESS],
                       [self.ADDRESS, "x-original-url: https://wiki.example/other"],
                       [self.ADDRESS + ", https://wiki.example/"], ["X-Original-URL:"],
                       ["X-Original-URI: /page"], ["X_Original_URL: https://wiki.example/page"],
                       ["X-Forwarded-Proto: https", "X-Forwarded-Host: wiki.example",
                        "X-Forwarded-Uri: /page"],
                       ["X-Original-URL: /page"], ["X-Original-URL: https://wiki.example?/page"]):
            with self.subTest(fields):
                answered = self.ask(*fields, self.cookie)
                self.assertTrue(answered and min(answered) >= 400, answered)

    def test_a_body_that_comes_along_changes_nothing(self):
        for size, statuses_wanted in ((10, [204]), (100_000, [413])):
            answered = self.ask(self.ADDRESS, self.cookie, f"Content-Length: {size}",
                                line="POST /sharing-auth HTTP/1.1", body="x" * size)
            self.assertEqual(answered, statuses_wanted)
        inner = "GET /sharing-health HTTP/1.1\r\nHost: h\r\n\r\n"
        answered = self.ask(self.ADDRESS, f"Content-Length: {len(inner)}", body=inner)
        self.assertEqual(answered, [401])

    def test_cookies_that_are_no_sessions_of_the_visitors_say_no(self):
        name = self.cookie.partition("=")[0]
        for cookie in (name + "=", name + "=x", name + "=%", name + "=" + "A" * 200,
                       "Cookie: sharing_sid" + "=" + self.cookie.partition("=")[2],
                       self.cookie.lower(), self.cookie + "x"):
            with self.subTest(cookie):
                self.assertEqual(self.ask(self.ADDRESS, cookie), [401])


if __name__ == "__main__":
    main()
