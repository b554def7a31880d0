#!/usr/bin/env python3
"""The configurations of packaging/ with the web servers that they are for. Each runs as an ordinary
child on a free port of loopback, with a folder of its own."""

import os
import signal
import time
import unittest

from server_support import *
from web_servers import *

SIZE = 5_000_000


class WebServerTests:
    """What all web servers are made to do; the classes below say which."""

    def setUp(self):
        super().setUp()
        self.file = self.make_file("big file.bin", SIZE)
        self.link = self.share(self.file.parent)
        self.socket = self.folder / "socket"
        self.server = None
        web_server = self.WEB_SERVER(self, self.folder)
        web_server.serve_links(self.socket, *self.changes())
        self.port = web_server.port

    def changes(self):
        """What else is different in the configuration of packaging/."""
        return []

    def start_front_end(self, *options):
        words = ["--fastcgi", str(self.socket), "--set", "socket_mode=666", *options]
        self.server = self.keep(FrontEnd(words, self.folder, workers=2))

    def log_in(self):
        visitor = Visitor(self.port)
        self.assertEqual(visitor.log_in(self.link, "wrong").status, 401)
        self.assertEqual(visitor.log_in(self.link).status, 303)
        return visitor

    def download(self):
        return f"/sharing/{self.link}/big%20file.bin?download"

    def test_a_visitor_logs_in_and_downloads_byte_for_byte(self):
        self.start_front_end()
        visitor = self.log_in()
        answer = visitor.get(self.download())
        self.assertEqual(answer.status, 200)
        self.assertIn("attachment", answer.headers["Content-Disposition"])
        self.assertEqual(answer.headers["X-Content-Type-Options"], "nosniff")
        self.assertEqual(answer.body, self.file.read_bytes())
        self.assertEqual(self.server.visits(3)[0][1], "127.0.0.1")

    def test_a_range_is_a_part_of_the_file(self):
        self.start_front_end()
        answer = self.log_in().get(self.download(), {"Range": "bytes=1000000-2999999"})
        self.assertEqual(answer.status, 206)
        self.assertEqual(answer.headers["Content-Range"], f"bytes 1000000-2999999/{SIZE}")
        self.assertEqual(answer.body, self.file.read_bytes()[1_000_000:3_000_000])

    def test_what_the_visitor_has_already_is_not_sent_again(self):
        self.start_front_end()
        visitor = self.log_in()
        tag = visitor.request("HEAD", self.download()).headers["ETag"]
        self.assertEqual(visitor.get(self.download(), {"If-None-Match": tag}).status, 304)

    def test_the_word_of_the_visitor_on_his_address_does_not_count(self):
        self.start_front_end()
        Visitor(self.port).get("/sharing-health", {"X-Forwarded-For": "203.0.113.9"})
        self.assertEqual(self.server.visits(1)[0][1], "127.0.0.1")

    def test_without_the_front_end_there_is_an_error_and_then_it_is_there_again(self):
        self.assertIn(Visitor(self.port).get("/sharing-health").status, (502, 503))
        self.start_front_end()
        wait_until(lambda: Visitor(self.port).get("/sharing-health").status == 200, 15)
        self.server.kill()
        self.assertIn(Visitor(self.port).get("/sharing-health").status, (502, 503))
        self.start_front_end()
        wait_until(lambda: Visitor(self.port).get("/sharing-health").status == 200, 15)

    def test_a_worker_that_is_killed_costs_one_answer(self):
        self.start_front_end()
        os.kill(wait_until(self.server.workers)[0], signal.SIGSEGV)
        wait_until(lambda: Visitor(self.port).get("/sharing-health").status == 200, 15)

    def test_an_answer_that_breaks_off_is_not_taken_for_the_whole(self):
        self.start_front_end()
        visitor = self.log_in()
        # An archive whose folders go too deep ends with an error.
        (self.file.parent / "/".join(["d"] * 200)).mkdir(parents=True)
        with self.assertRaises((http.client.IncompleteRead, ConnectionError)):
            visitor.get(f"/sharing/{self.link}?zip")


class Nginx(WebServerTests, FrontEndTest):
    WEB_SERVER = NginxServer

    def let_nginx_read(self):
        self.start_front_end("--set", "file_delivery=x-accel-redirect",
                             "--set", f"file_folders={self.file.parent}")

    def test_nginx_sends_the_file_where_it_may(self):
        self.let_nginx_read()
        visitor = self.log_in()
        answer = visitor.get(self.download())
        self.assertEqual(answer.body, self.file.read_bytes())
        self.assertIn("attachment", answer.headers["Content-Disposition"])
        self.assertEqual(answer.headers["X-Content-Type-Options"], "nosniff")
        again = {"If-None-Match": answer.headers["ETag"]}
        self.assertEqual(visitor.get(self.download(), again).status, 304)
        part = {"Range": "bytes=7-1000006", "If-Range": answer.headers["ETag"]}
        answer = visitor.get(self.download(), part)
        self.assertEqual(answer.status, 206)
        self.assertEqual(answer.body, self.file.read_bytes()[7:1_000_007])

    def test_nobody_reaches_the_files_of_the_machine_by_their_address(self):
        self.let_nginx_read()
        self.assertEqual(Visitor(self.port).get("/velk-files/etc/passwd").status, 404)

    def test_what_nginx_may_not_read_is_copied(self):
        self.let_nginx_read()
        self.file.chmod(0o600)
        if os.geteuid() == 0:
            shutil.chown(self.file, OWNER)
        self.assertEqual(self.log_in().get(self.download()).body, self.file.read_bytes())


class Lighttpd(WebServerTests, FrontEndTest):
    WEB_SERVER = LighttpdServer


class LighttpdReads(Lighttpd):
    """lighttpd sends the files by itself."""

    def changes(self):
        return [('#"x-sendfile', '"x-sendfile'), ("/srv/shared", self.file.parent)]

    def start_front_end(self, *options):
        super().start_front_end("--set", "file_delivery=x-sendfile",
                                "--set", f"file_folders={self.file.parent}", *options)


class Apache(WebServerTests, FrontEndTest):
    WEB_SERVER = ApacheServer


class PlainCgiTests:
    """A process for each request."""

    def setUp(self):
        super().setUp()
        self.file = self.make_file("big file.bin", SIZE)
        self.link = self.share(self.file.parent)
        self.access_log = self.folder / "access.log"
        settings = ROOT / "etc" / "sharing-web.conf"
        settings.write_text(f"access_log = {self.access_log}\n")
        self.addCleanup(settings.unlink)
        web_server = self.WEB_SERVER(self, self.folder)
        web_server.start_cgi()
        self.port = web_server.port

    def test_a_visitor_logs_in_and_downloads_byte_for_byte(self):
        visitor = Visitor(self.port)
        self.assertEqual(visitor.log_in(self.link, "wrong").status, 401)
        self.assertEqual(visitor.log_in(self.link).status, 303)
        path = f"/sharing/{self.link}/big%20file.bin?download"
        answer = visitor.get(path)
        self.assertEqual(answer.body, self.file.read_bytes())
        answer = visitor.get(path, {"Range": "bytes=1000000-2999999"})
        self.assertEqual(answer.status, 206)
        self.assertEqual(answer.body, self.file.read_bytes()[1_000_000:3_000_000])
        self.assertEqual(len(self.access_log.read_text().splitlines()), 6)

    def test_words_of_the_address_are_no_options(self):
        for query in ("--help", "--version", "--check-config", "--listen=127.0.0.1:1"):
            answer = Visitor(self.port).get(f"/sharing-health?{query}")
            self.assertEqual((answer.status, answer.body), (200, b"ok\n"))


class LighttpdCgi(PlainCgiTests, FrontEndTest):
    WEB_SERVER = LighttpdServer


class ApacheCgi(PlainCgiTests, FrontEndTest):
    WEB_SERVER = ApacheServer


if __name__ == "__main__":
    main()
