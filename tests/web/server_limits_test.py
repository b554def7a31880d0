#!/usr/bin/env python3
"""What the embedded server does with visitors who send too much, too slowly, or nonsense."""

import socket
import threading
import time

from server_support import *

HOST = b"Host: localhost\r\n"


class LastingTest(FrontEndTest):
    """A server that whatever comes in must not harm."""

    def setUp(self):
        super().setUp()
        self.server = self.start(workers=2)

    def tearDown(self):
        # Whatever came in: the same workers are there, and serve.
        self.assertNotIn("was ended by", self.server.log.read_text())
        self.assertEqual(Visitor(self.server.port).get("/sharing-health").status, 200)

    def status_of(self, raw):
        """The one status that these bytes are answered with; None when the connection just
        closes."""
        found = statuses(exchange(self.server.port, raw))
        self.assertLessEqual(len(set(found)), 1, raw[:200])
        return found[0] if found else None


class Limits(LastingTest):
    def test_a_head_of_16_kib_is_all_right(self):
        answer = Visitor(self.server.port).get("/sharing-health", {"X-Long": "x" * 15_000})
        self.assertEqual(answer.status, 200)

    def test_a_larger_head_is_refused(self):
        for size in (16_500, 60_000):
            raw = b"GET / HTTP/1.1\r\n" + HOST + b"X-Long: " + b"x" * size + b"\r\n\r\n"
            self.assertEqual(self.status_of(raw), 431)

    def test_a_head_without_an_end_is_refused(self):
        raw = b"GET / HTTP/1.1\r\n" + HOST + b"X-Long: " + b"x" * 5_000_000
        self.assertIn(self.status_of(raw), (431, None))

    def test_many_small_fields_are_refused(self):
        raw = b"GET / HTTP/1.1\r\n" + HOST + b"A: b\r\n" * 10_000 + b"\r\n"
        self.assertIn(self.status_of(raw), (413, 431, None))

    def test_a_target_of_any_length_is_refused(self):
        for size in (17_000, 1_000_000):
            raw = b"GET /" + b"x" * size + b" HTTP/1.1\r\n" + HOST + b"\r\n"
            self.assertIn(self.status_of(raw), (414, 431, None))

    def test_a_form_of_64_kib_is_read(self):
        answer = Visitor(self.server.port).request("POST", "/sharing/x", b"a" * 64 * 1024)
        self.assertNotEqual(answer.status, 413)

    def test_a_larger_form_is_refused_also_to_who_goes_on_sending(self):
        for size in (64 * 1024 + 1, 1_000_000, 5_000_000):
            raw = (b"POST /sharing/x HTTP/1.1\r\n" + HOST +
                   b"Content-Length: %d\r\n\r\n" % size + b"a" * min(size, 1_000_000))
            self.assertEqual(self.status_of(raw), 413)

    def test_a_length_that_no_machine_can_hold_is_refused(self):
        for length in (b"18446744073709551616", b"9" * 400):
            self.assertIn(self.status_of(b"POST / HTTP/1.1\r\n" + HOST + b"Content-Length: " +
                                         length + b"\r\n\r\n"), (400, 413))

    def test_who_waits_for_a_word_before_sending_gets_it(self):
        with socket.create_connection(("127.0.0.1", self.server.port), timeout=5) as connection:
            connection.sendall(b"POST /sharing/x HTTP/1.1\r\n" + HOST +
                               b"Content-Length: 1\r\nExpect: 100-continue\r\n\r\n")
            self.assertIn(b" 100 ", connection.recv(1000))


class Nonsense(LastingTest):
    REFUSED = {
        "no host": b"GET /sharing-health HTTP/1.1\r\n\r\n",
        "two hosts": b"GET /sharing-health HTTP/1.1\r\n" + HOST + HOST + b"\r\n",
        "no HTTP": b"\x16\x03\x01\x02\x00\x01\x00\x01\xfc\x03\x03\r\n\r\n",
        "no version": b"GET /sharing-health\r\n\r\n",
        "a version to come": b"GET /sharing-health HTTP/2.0\r\n" + HOST + b"\r\n",
        "HTTP/2 by itself": b"PRI * HTTP/2.0\r\n\r\nSM\r\n\r\n",
        "no target": b"OPTIONS * HTTP/1.1\r\n" + HOST + b"\r\n",
        "a target for a tunnel": b"CONNECT localhost:80 HTTP/1.1\r\n" + HOST + b"\r\n",
        "a field with a control character":
            b"GET /sharing-health HTTP/1.1\r\n" + HOST + b"X: a\x01b\r\n\r\n",
        "a field without a name": b"GET /sharing-health HTTP/1.1\r\n" + HOST + b": x\r\n\r\n",
        "a field without a colon": b"GET /sharing-health HTTP/1.1\r\n" + HOST + b"nothing\r\n\r\n",
        "a length with a sign":
            b"POST / HTTP/1.1\r\n" + HOST + b"Content-Length: +1\r\n\r\na",
        "a length below zero":
            b"POST / HTTP/1.1\r\n" + HOST + b"Content-Length: -1\r\n\r\na",
        "a length with another base":
            b"POST / HTTP/1.1\r\n" + HOST + b"Content-Length: 0x1\r\n\r\na",
        "two lengths": b"POST / HTTP/1.1\r\n" + HOST +
                       b"Content-Length: 1\r\nContent-Length: 1\r\n\r\na",
        "a list of lengths": b"POST / HTTP/1.1\r\n" + HOST + b"Content-Length: 1, 1\r\n\r\na",
    }

    def test_nonsense_is_refused(self):
        for name, raw in self.REFUSED.items():
            with self.subTest(name):
                self.assertIn(self.status_of(raw), (400, 413, 505, None))

    def test_blanks_around_a_value_and_empty_values_are_all_right(self):
        for field in (b"X-A:b\r\n", b"X-A:  b\r\n", b"X-A:\tb\r\n", b"X-A: b  \r\n", b"X-A:\r\n",
                      b"X-A: \r\n", b"X-A: b c\r\n", b"Cookie: a=b; c=d\r\nX-A: b\r\n"):
            with self.subTest(field):
                raw = (b"GET /sharing-health HTTP/1.1\r\n" + HOST + field +
                       b"Connection: close\r\n\r\n")
                self.assertEqual(self.status_of(raw), 200)

    def test_a_request_without_an_end_is_no_request(self):
        with socket.create_connection(("127.0.0.1", self.server.port), timeout=5) as connection:
            connection.sendall(b"GET /sharing-health HTTP/1.1\r\n" + HOST)
            connection.shutdown(socket.SHUT_WR)
            self.assertEqual(statuses(connection.recv(1000)), [])

    def test_an_address_with_scheme_and_host_is_served(self):
        raw = (b"GET http://localhost/sharing-health HTTP/1.1\r\n" + HOST +
               b"Connection: close\r\n\r\n")
        self.assertEqual(self.status_of(raw), 200)


SMUGGLED = b"GET /sharing-health?smuggled HTTP/1.1\r\n" + HOST + b"\r\n"
CHUNKS = b"0\r\n\r\n"


class Smuggling(LastingTest):
    HEADS = {
        "length and chunks": b"Content-Length: 5\r\nTransfer-Encoding: chunked\r\n",
        "chunks and length": b"Transfer-Encoding: chunked\r\nContent-Length: 5\r\n",
        "chunks": b"Transfer-Encoding: chunked\r\n",
        "chunks twice": b"Transfer-Encoding: chunked\r\nTransfer-Encoding: identity\r\n",
        "chunks that are none": b"Transfer-Encoding: xchunked\r\nContent-Length: 5\r\n",
        "chunks among others": b"Transfer-Encoding: identity, chunked\r\nContent-Length: 5\r\n",
        "a blank before the colon": b"Transfer-Encoding : chunked\r\nContent-Length: 5\r\n",
        "a tab before the value": b"Transfer-Encoding:\tchunked\r\nContent-Length: 5\r\n",
        "a folded line": b"Transfer-Encoding:\r\n chunked\r\nContent-Length: 5\r\n",
        "a vertical tab": b"Transfer-Encoding: \x0bchunked\r\nContent-Length: 5\r\n",
        "lengths that differ": b"Content-Length: 5\r\nContent-Length: 90\r\n",
        "another case": b"tRANSFER-eNCODING: ChUnKeD\r\nContent-Length: 5\r\n",
        "a folded value": b"X-A: b\r\n c\r\nContent-Length: 5\r\n",
        "an empty name": b"Content-Length: 5\r\n: x\r\nX-A: b\r\n",
        "a line of a zero byte": b"Content-Length: 5\r\n\0X-A: b\r\n",
        "a bare line feed": b"X-A: b\nContent-Length: 5\r\n",
        "a zero byte in another field": b"X-A: b\0c\r\nContent-Length: 5\r\n",
        "a line without a colon": b"Content-Length: 5\r\nX-A\r\n",
        "a zero byte": b"Transfer-Encoding: chunked\0\r\nContent-Length: 5\r\n",
    }

    def test_no_second_request_slips_past_the_first(self):
        for name, head in self.HEADS.items():
            with self.subTest(name):
                raw = b"POST /sharing/x HTTP/1.1\r\n" + HOST + head + b"\r\n" + CHUNKS + SMUGGLED
                received = exchange(self.server.port, raw)
                self.assertLessEqual(set(statuses(received)), {400, 411, 413, 501})

    def test_a_length_under_another_name_is_no_length(self):
        raw = (b"POST /sharing-health HTTP/1.1\r\n" + HOST +
               b"Content_Length: 5\r\nConnection: close\r\n\r\n")
        self.assertEqual(len(statuses(exchange(self.server.port, raw))), 1)


class SlowVisitors(FrontEndTest):
    """All at the same time: each takes as long as the server's patience."""

    BEGINNINGS = {
        "nothing": (b"", b""),
        "a head, byte by byte": (b"GET /sharing-health HTTP/1.1\r\nX: ", b"x"),
        "fields, one by one": (b"GET /sharing-health HTTP/1.1\r\n", b"X: y\r\n"),
        "a form, byte by byte": (
            b"POST /sharing/x HTTP/1.1\r\n" + HOST + b"Content-Length: 60000\r\n\r\n", b"x"),
        "a form that is too large": (
            b"POST /sharing/x HTTP/1.1\r\n" + HOST + b"Content-Length: 600000\r\n\r\n", b"x"),
    }

    def dribble(self, beginning, piece, lasted, name):
        began = time.monotonic()
        with socket.create_connection(("127.0.0.1", self.server.port)) as connection:
            connection.settimeout(0.5)
            try:
                connection.sendall(beginning)
                while time.monotonic() - began < 40:
                    connection.sendall(piece)
                    try:
                        if connection.recv(1000) == b"":
                            break
                    except TimeoutError:
                        pass
            except ConnectionError:
                pass
        lasted[name] = time.monotonic() - began

    def test_slow_visitors_are_cut_after_15_seconds(self):
        self.server = self.start(workers=1)
        lasted = {}
        visitors = [threading.Thread(target=self.dribble, args=(*bytes_, lasted, name))
                    for name, bytes_ in self.BEGINNINGS.items()]
        for visitor in visitors:
            visitor.start()
        self.assertEqual(Visitor(self.server.port).get("/sharing-health").status, 200)
        for visitor in visitors:
            visitor.join()
        for name, seconds in lasted.items():
            with self.subTest(name):
                self.assertGreater(seconds, 13)
                self.assertLess(seconds, 19)


if __name__ == "__main__":
    main()
