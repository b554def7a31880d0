#!/usr/bin/env python3
"""The command line, the configuration, and the ways in which the program is handed its socket."""

import os
import socket
import struct
import subprocess
import unittest

from server_support import *


def run(*words, **how):
    return subprocess.run([PROGRAM, *words], text=True, capture_output=True, timeout=20, **how)


class Configuration(FrontEndTest):
    def check(self, text, *words):
        file = self.folder / "sharing-web.conf"
        file.write_text(text)
        return run("--config", str(file), "--check-config", *words)

    def test_the_example_is_right_as_it_is_and_with_every_line_in_force(self):
        example = (SOURCE / "packaging" / "sharing-web.conf").read_text()
        self.assertEqual(self.check(example).returncode, 0)
        lines = re.findall(r"(?m)^#(\w+ = .*)$", example)
        self.assertGreater(len(lines), 15)
        for line in lines:
            if line.startswith("site_folder"):
                continue  # which would have to be there
            # Which makes no sense by itself.
            company = "auth_address = parameter\n" if line.startswith("protect") else ""
            with self.subTest(line):
                outcome = self.check(company + line + "\n")
                self.assertEqual(outcome.returncode, 0, outcome.stderr)

    def test_the_manual_and_the_example_have_the_same_keys(self):
        example = (SOURCE / "packaging" / "sharing-web.conf").read_text()
        manual = (SOURCE / "docs" / "man" / "velksharing-web.8").read_text()
        self.assertEqual(sorted(re.findall(r"(?m)^#(\w+) = ", example)),
                         sorted(re.findall(r"(?m)^\.It Va (\w+)$", manual)))

    def test_an_unknown_key_is_refused_with_its_line(self):
        outcome = self.check("workers = 2\n\n# a comment\nlisten_adress = 127.0.0.1:80\n")
        self.assertEqual(outcome.returncode, 2)
        self.assertIn("sharing-web.conf:4: unknown key listen_adress", outcome.stderr)

    def test_a_mistake_is_refused_with_its_line_and_key(self):
        for line in ("workers = 0", "workers = many", "workers =", "socket_mode = 999",
                     "path = sharing", "path = /a b", "path = /a/../b", "path = //a",
                     "access_log = here", "runtime_folder = run", "retry_after = -1",
                     "trusted_proxy = somebody", "file_delivery = pigeon",
                     "auth_address = x-original-uri", "auth_address = on", "auth_address =",
                     "protect = /photos", "protect = /photos abc def", "protect = photos abc",
                     "protect = /a/../b abc", "protect = /a?b abc", "protect = /a a-b",
                     "protect = ftp://h/ abc", "fastcgi = 0.0.0.0:9000", "fastcgi = [::]:9000",
                     "fastcgi = 192.0.2.1:9000", "fastcgi = localhost:9000",
                     "fastcgi = 127.0.0.1:", "fastcgi = 127.0.0.1:65536", "fastcgi = 127.0.0.1:x",
                     "audit = maybe", "audit_retention = 0", "audit_retention = 3651",
                     "audit_address = some", "metrics_listen = 0.0.0.0:9180",
                     "socket_group = no such group", "fastcgi = socket",
                     "product_name = " + "x" * 201, "connections = 99999999999999999999"):
            with self.subTest(line):
                outcome = self.check("stop_timeout = 3\n" + line + "\n")
                self.assertEqual(outcome.returncode, 2)
                self.assertIn("sharing-web.conf:2: " + line.split(" ")[0] + ": ", outcome.stderr)

    def test_what_excludes_each_other_is_refused(self):
        self.assertEqual(self.check("listen = 127.0.0.1:80\nfastcgi = /run/x\n").returncode, 2)
        self.assertEqual(self.check("file_delivery = x-sendfile\n").returncode, 2)

    def test_how_web_servers_ask_is_one_of_the_known_ways(self):
        for way in ("off", "parameter", "authorizer"):
            self.assertEqual(self.check(f"auth_address = {way}\n").returncode, 0, way)
        for way in ("x-forwarded", "x-original-url"):
            outcome = self.check(f"auth_address = {way}\n")
            self.assertEqual(outcome.returncode, 2, way)
            self.assertIn("trusted_proxy", outcome.stderr)
            outcome = self.check(f"auth_address = {way}\ntrusted_proxy = 127.0.0.1\n")
            self.assertEqual(outcome.returncode, 0, outcome.stderr)

    def test_a_key_that_stands_twice_is_refused_unless_it_is_a_list(self):
        protect = "protect = /photos abc\nprotect = https://wiki.example/ def\n"
        self.assertEqual(self.check("auth_address = parameter\n" + protect).returncode, 0)
        outcome = self.check("auth_address = parameter\nauth_address = off\n")
        self.assertEqual(outcome.returncode, 2)
        self.assertIn("sharing-web.conf:2: key given twice", outcome.stderr)

    def test_what_links_guard_is_refused_where_nobody_may_ask(self):
        outcome = self.check("protect = /photos abc\n")
        self.assertEqual(outcome.returncode, 2)
        self.assertIn("auth_address", outcome.stderr)

    def test_fastcgi_takes_a_path_and_this_machines_addresses(self):
        for place in ("/run/velk/web.sock", "127.0.0.1:9000", "127.1.2.3:0", "[::1]:9000"):
            outcome = self.check(f"fastcgi = {place}\n")
            self.assertEqual(outcome.returncode, 0, outcome.stderr)

    def test_options_are_in_place_of_the_configuration(self):
        self.assertEqual(self.check("fastcgi = /run/x\n", "--listen", "[::1]:0").returncode, 0)
        self.assertEqual(self.check("", "--set", "workers=0").returncode, 2)
        self.assertEqual(self.check("workers = 2", "--workers", "0").returncode, 2)
        self.assertEqual(self.check("", "--set", "workers").returncode, 2)

    def test_texts_of_the_site_that_cannot_be_used_are_told(self):
        self.assertEqual(self.check(f"site_folder = {self.folder}/nowhere\n").returncode, 2)

    def test_bytes_from_the_file_cannot_drive_a_terminal(self):
        outcome = self.check("\x1b[31mred = 1\n")
        self.assertNotIn("\x1b", outcome.stderr)

    def test_an_address_that_cannot_be_listened_on_is_told(self):
        for address in ("127.0.0.1", "127.0.0.1:99999", "::1:80", "no host here:80",
                        f"{self.folder}/no/folder/socket", "/" + "x" * 200):
            with self.subTest(address):
                outcome = run("--listen", address)
                self.assertEqual(outcome.returncode, 3, outcome.stderr)
                self.assertIn(address, outcome.stderr)

    def test_a_port_that_is_taken_is_told(self):
        server = self.start()
        outcome = run("--listen", server.address)
        self.assertEqual(outcome.returncode, 3)
        self.assertIn(server.address, outcome.stderr)

    def test_questions_that_cannot_arrive_as_they_are_expected_are_told_at_the_start(self):
        by_fastcgi = ["--fastcgi", str(self.folder / "socket")]
        by_http = ["--listen", "127.0.0.1:0"]
        for words, way, is_told in (
                (by_http, "parameter", True), (by_fastcgi, "parameter", False),
                (by_http, "authorizer", True), (by_fastcgi, "authorizer", False),
                (by_http, "x-forwarded", False), (by_fastcgi, "x-forwarded", True),
                (by_http, "x-original-url", False), (by_fastcgi, "x-original-url", True),
                (by_http, "off", False), (by_fastcgi, "off", False)):
            with self.subTest(words=words, way=way):
                (self.folder / "messages").unlink(missing_ok=True)
                server = FrontEnd([*words, "--set", f"auth_address={way}",
                                   "--set", "trusted_proxy=127.0.0.1"], self.folder)
                self.addCleanup(server.kill)
                self.assertEqual("every question gets a no" in server.log.read_text(), is_told)
                server.stop()

    def test_a_folder_that_others_may_write_to_is_not_used_for_locks(self):
        runtime = self.folder / "runtime"
        runtime.mkdir()
        runtime.chmod(0o777)
        outcome = run("--listen", "127.0.0.1:0", "--set", f"runtime_folder={runtime}")
        self.assertEqual(outcome.returncode, 3)
        self.assertIn(str(runtime), outcome.stderr)

    def test_options_that_do_not_exist_are_refused(self):
        self.assertEqual(run("--frobnicate").returncode, 2)

    def test_help_and_version_are_no_mistakes(self):
        self.assertIn("--listen", run("--help").stdout)
        self.assertRegex(run("--version").stdout, r"^velksharing-web \d+\.\d+\.\d+\n$")


class Libraries(unittest.TestCase):
    @unittest.skipUnless(shutil.which("dpkg-query"), "not a Debian system")
    def test_the_fastcgi_library_has_its_hole_mended(self):
        version = subprocess.run(["dpkg-query", "-W", "-f", "${Version}", "libfcgi0ldbl"],
                                 text=True, stdout=subprocess.PIPE, check=True).stdout
        subprocess.run(["dpkg", "--compare-versions", version, "ge", "2.4.2-2+deb12u1"],
                       check=True)


class Units(FrontEndTest):
    @unittest.skipUnless(shutil.which("systemd-analyze"), "systemd is not there")
    def test_the_units_are_right(self):
        units = []
        for name in ("velksharing-web.service", "velksharing-web.socket"):
            text = (SOURCE / "packaging" / "systemd" / name).read_text()
            units.append(self.folder / name)
            units[-1].write_text(text.replace("/usr/local/sbin/velksharing-web", PROGRAM))
        outcome = subprocess.run(["systemd-analyze", "verify", "--man=no", *map(str, units)],
                                 text=True, capture_output=True, timeout=60)
        self.assertEqual((outcome.returncode, outcome.stderr), (0, ""))


class PathSockets(FrontEndTest):
    def test_an_abandoned_socket_is_replaced(self):
        path = self.folder / "socket"
        with socket.socket(socket.AF_UNIX) as abandoned:
            abandoned.bind(str(path))
        server = self.keep(FrontEnd(["--fastcgi", str(path)], self.folder))
        self.assertEqual(server.address, str(path))

    def test_a_socket_in_use_and_a_file_are_left_alone(self):
        path = self.folder / "socket"
        self.keep(FrontEnd(["--fastcgi", str(path)], self.folder))
        self.assertEqual(run("--fastcgi", str(path)).returncode, 3)
        file = self.folder / "file"
        file.write_text("precious")
        self.assertEqual(run("--fastcgi", str(file)).returncode, 3)
        self.assertEqual(file.read_text(), "precious")

    def test_mode_and_group_are_as_configured(self):
        path = self.folder / "socket"
        self.keep(FrontEnd(["--fastcgi", str(path), "--set", "socket_mode=0640"], self.folder))
        self.assertEqual(path.stat().st_mode & 0o777, 0o640)

    def test_http_on_a_path_needs_the_word_of_the_proxy(self):
        path = self.folder / "socket"
        self.keep(FrontEnd(["--listen", str(path), "--set", "trusted_proxy=unix"], self.folder))
        for field, status in (("X-Forwarded-For: 203.0.113.9\r\n", b" 200 "), ("", b" 400 ")):
            with socket.socket(socket.AF_UNIX) as connection:
                connection.connect(str(path))
                connection.sendall(f"GET /sharing-health HTTP/1.1\r\nHost: x\r\n{field}"
                                   "Connection: close\r\n\r\n".encode())
                self.assertIn(status, connection.recv(100))


def record(kind, content, request=1):
    return struct.pack(">BBHHBx", 1, kind, request, len(content), 0) + content


def parameter(name, value):
    return struct.pack(">II", len(name) | 1 << 31, len(value) | 1 << 31) + name + value


def fastcgi(connection, role=1, keep=False, body=b"", **variables):
    """One request by FastCGI.
    @return what is answered, head and all."""
    variables = {"REQUEST_METHOD": "GET", "REMOTE_ADDR": "192.0.2.7", **variables}
    parameters = b"".join(parameter(name.encode(), value.encode())
                          for name, value in variables.items())
    connection.sendall(record(1, struct.pack(">HB5x", role, keep)) + record(4, parameters) +
                       record(4, b"") + (record(5, body) if body else b"") + record(5, b""))
    answer = b""
    while True:
        _, kind, _, length, padding = struct.unpack(">BBHHBx", read(connection, 8))
        content = read(connection, length + padding)[:length]
        if kind == 6:
            answer += content
        if kind == 3:
            return answer


def read(connection, size):
    data = b""
    while len(data) < size:
        piece = connection.recv(size - len(data))
        if not piece:
            raise ConnectionError("cut")
        data += piece
    return data


class HandedOver(FrontEndTest):
    def setUp(self):
        super().setUp()
        self.listening = socket.socket()
        self.addCleanup(self.listening.close)
        self.listening.bind(("127.0.0.1", 0))
        self.listening.listen()

    def ask(self, connection=None, **variables):
        if connection is not None:
            return fastcgi(connection, **variables)
        with socket.create_connection(self.listening.getsockname(), timeout=10) as own:
            return fastcgi(own, **variables)

    def serve_standard_input(self, *options):
        words = [PROGRAM, "--access-log", str(self.folder / "access.log"), *options]
        environment = {**os.environ, "GATEWAY_INTERFACE": "CGI/1.1"}
        process = subprocess.Popen(words, stdin=self.listening, env=environment,
                                   stderr=subprocess.DEVNULL)
        self.addCleanup(process.wait)
        self.addCleanup(process.terminate)

    def test_a_listening_standard_input_is_fastcgi(self):
        self.serve_standard_input()
        answer = self.ask(REQUEST_URI="/sharing-health")
        self.assertTrue(answer.startswith(b"Status: 200 OK\r\n"), answer)
        self.assertTrue(answer.endswith(b"\r\n\r\nok\n"), answer)

    def test_descriptor_3_is_served_by_socket_activation(self):
        script = ("import os, sys; os.dup2(int(sys.argv[1]), 3, inheritable=True); "
                  "os.environ.update(LISTEN_PID=str(os.getpid()), LISTEN_FDS='1'); "
                  "os.execv(sys.argv[2], sys.argv[2:])")
        number = self.listening.fileno()
        process = subprocess.Popen(["python3", "-c", script, str(number), PROGRAM, "--fastcgi"],
                                   pass_fds=[number], stdin=subprocess.DEVNULL,
                                   stderr=subprocess.DEVNULL)
        self.addCleanup(process.wait)
        self.addCleanup(process.terminate)
        self.assertIn(b" 200 ", self.ask(REQUEST_URI="/sharing-health"))

    def test_without_a_socket_there_is_nothing_to_serve(self):
        outcome = run("--fastcgi", stdin=subprocess.DEVNULL)
        self.assertEqual(outcome.returncode, 3)
        self.assertIn("no socket", outcome.stderr)

    def test_a_kept_connection_serves_again(self):
        self.serve_standard_input()
        with socket.create_connection(self.listening.getsockname(), timeout=10) as kept:
            for _ in range(3):
                answer = self.ask(kept, keep=True, REQUEST_URI="/sharing-health")
                self.assertIn(b" 200 ", answer)

    def test_a_body_that_comes_with_a_question_is_not_taken_for_the_next_request(self):
        self.serve_standard_input()
        inner = (record(1, struct.pack(">HB5x", 1, 1)) +
                 record(4, parameter(b"REQUEST_URI", b"/sharing-health")) + record(4, b"") +
                 record(5, b""))
        with socket.create_connection(self.listening.getsockname(), timeout=10) as kept:
            answer = self.ask(kept, keep=True, body=inner * 100, VELK_SHARING_AUTH="x",
                              REQUEST_URI="/sharing-health")
            self.assertIn(b"Status: 403 ", answer)
            answer = self.ask(kept, keep=True, VELK_SHARING_AUTH="x", REQUEST_URI="/sharing-health")
            self.assertNotIn(b"Status: 2", answer)
        self.assertIn(b" 200 ", self.ask(REQUEST_URI="/sharing-health"))

    def test_a_connection_that_is_kept_for_nothing_keeps_nobody_out(self):
        self.serve_standard_input("--workers", "1", "--set", "threads=1")
        with socket.create_connection(self.listening.getsockname(), timeout=10) as kept:
            self.ask(kept, keep=True, REQUEST_URI="/sharing-health")
            self.assertIn(b" 200 ", self.ask(REQUEST_URI="/sharing-health"))

    def test_connections_on_which_nothing_comes_keep_nobody_out(self):
        self.serve_standard_input("--workers", "1", "--set", "threads=3")
        silent = [socket.create_connection(self.listening.getsockname()) for _ in range(2)]
        self.assertIn(b" 200 ", self.ask(REQUEST_URI="/sharing-health"))
        for connection in silent:
            connection.close()

    def test_an_authorizer_lets_nobody_in(self):
        self.serve_standard_input()
        self.assertIn(b"Status: 403 ", self.ask(role=2, REQUEST_URI="/sharing-health"))

    def test_without_the_address_as_sent_the_decoded_one_is_encoded_again(self):
        self.serve_standard_input()
        answer = self.ask(SCRIPT_NAME="", PATH_INFO="/sharing-health")
        self.assertIn(b" 200 ", answer)

    def test_a_broken_request_costs_its_connection_only(self):
        self.serve_standard_input()
        for garbage in (b"GET / HTTP/1.1\r\n\r\n", os.urandom(100_000), record(4, b"\xff" * 8),
                        record(1, b""), record(1, struct.pack(">HB5x", 1, 0)) +
                        record(4, b"\xff\xff\xff\xff\xff\xff\xff\xff")):
            with socket.create_connection(self.listening.getsockname()) as connection:
                try:
                    connection.sendall(garbage)
                except ConnectionError:
                    pass
        self.assertIn(b" 200 ", self.ask(REQUEST_URI="/sharing-health"))


class PlainCgi(FrontEndTest):
    def answer(self, **variables):
        environment = {**os.environ, "GATEWAY_INTERFACE": "CGI/1.1", "REQUEST_METHOD": "GET",
                       "REMOTE_ADDR": "192.0.2.7", **variables}
        return run(env=environment, stdin=subprocess.DEVNULL).stdout

    def test_a_request_is_answered(self):
        self.assertTrue(self.answer(REQUEST_URI="/sharing-health").startswith("Status: 200 "))

    def test_a_question_is_never_taken_for_a_request(self):
        for address in ("", "https://wiki.example/"):
            answer = self.answer(REQUEST_URI="/sharing-health", VELK_SHARING_AUTH=address)
            self.assertTrue(answer.startswith("Status: 403 "), answer)


if __name__ == "__main__":
    main()
