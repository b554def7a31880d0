#!/usr/bin/env python3
"""What is told about the running program: metrics, the audit trail, and the process that has both."""

import datetime
import json
import sqlite3
import struct

from server_support import *

# Debian's package, for whichever Python runs this.
sys.path.append("/usr/lib/python3/dist-packages")
from prometheus_client.parser import text_string_to_metric_families  # noqa: E402

TRAIL = ROOT / "etc/private/session/sharing-audit.db"
HEADINGS = "TIME EVENT RESULT ADDRESS ACCOUNT"


def remove_trail():
    for path in glob.glob(str(TRAIL) + "*"):
        os.remove(path)


def command_line(*words, **how):
    return subprocess.run([COMMAND_LINE, *words], text=True, capture_output=True, timeout=20, **how)


def ask_by_fastcgi(path, uri):
    """A GET by FastCGI.
    @return all that comes back."""
    parameters = {"REQUEST_METHOD": "GET", "REQUEST_URI": uri, "SERVER_PROTOCOL": "HTTP/1.1",
                  "REMOTE_ADDR": "192.0.2.7"}
    pairs = b"".join(bytes([len(name), len(value)]) + (name + value).encode()
                     for name, value in parameters.items())
    record = lambda kind, content: struct.pack("!BBHHBx", 1, kind, 1, len(content), 0) + content
    begin = struct.pack("!HB5x", 1, 0)
    with socket.socket(socket.AF_UNIX) as connection:
        connection.connect(str(path))
        connection.sendall(record(1, begin) + record(4, pairs) + record(4, b"") + record(5, b""))
        return connection.makefile("rb").read()


class WatchTest(FrontEndTest):
    def setUp(self):
        super().setUp()
        remove_trail()
        self.addCleanup(remove_trail)

    def watch(self, *options, metrics=True, audit=True, **how):
        settings = ["--set", "metrics_listen=127.0.0.1:0"] * metrics + ["--set", "audit=on"] * audit
        return self.start(*settings, *options, **how)

    def metrics_address(self, server):
        return re.search(r"metrics on (.*)", server.log.read_text()).group(1)

    def metrics_port(self, server):
        return int(self.metrics_address(server).rpartition(":")[2])

    def ask(self, server, method="GET", path="/metrics"):
        return Visitor(self.metrics_port(server)).request(method, path)

    def samples(self, server):
        """All metrics: {(name, (("label", "value"), …)): value}."""
        text = self.ask(server).body.decode()
        return {(sample.name, tuple(sorted(sample.labels.items()))): sample.value
                for family in text_string_to_metric_families(text) for sample in family.samples}

    def metric(self, server, name, **labels):
        """The sum of all samples that have these labels; None when there are none."""
        found = [value for (sample, sample_labels), value in self.samples(server).items()
                 if sample == name and set(labels.items()) <= set(sample_labels)]
        return sum(found) if found else None

    def observer(self, server):
        """The process, once there is one."""
        def find():
            for pid in server.workers():
                try:
                    if pathlib.Path(f"/proc/{pid}/comm").read_text() == "velk-observer\n":
                        return pid
                except FileNotFoundError:
                    pass
            return None
        return wait_until(find)

    def visitors_of(self, link, *options):
        """What `link log --json` prints."""
        outcome = command_line("link", "log", link, "--json", *options)
        self.assertEqual(outcome.returncode, 0, outcome.stderr)
        return [json.loads(line) for line in outcome.stdout.splitlines()]

    def wait_for_records(self, link, count, seconds=10):
        return wait_until(lambda: TRAIL.exists() and
                          len(found := self.visitors_of(link)) >= count and found, seconds)

    def shared_link(self, *options, **how):
        return self.share(self.make_file("photo.jpg", 1000), *options, **how)


class Metrics(WatchTest):
    def test_without_the_setting_there_is_no_observer(self):
        server = self.start(workers=2)
        wait_until(lambda: len(server.workers()) == 2)
        time.sleep(0.2)
        self.assertEqual(len(server.workers()), 2)

    def test_requests_are_summed_over_the_workers(self):
        server = self.watch(workers=4)
        link = self.shared_link()
        for _ in range(40):
            self.assertEqual(Visitor(server.port).get(f"/sharing/{link}").status, 200)
        Visitor(server.port).get("/elsewhere")
        server.visits(41)
        wait_until(lambda: self.metric(server, "velksharing_requests_total", route="page",
                                       status="200", result="none") == 40)
        self.assertEqual(self.metric(server, "velksharing_requests_total", route="none",
                                     status="404"), 1)
        self.assertEqual(self.metric(server, "velksharing_request_duration_seconds_count",
                                     route="page"), 40)
        self.assertEqual(self.metric(server, "velksharing_request_duration_seconds_bucket",
                                     route="page", le="+Inf"), 40)
        self.assertGreater(self.metric(server, "velksharing_request_duration_seconds_sum",
                                       route="page"), 0)

    def test_counters_survive_a_killed_worker(self):
        server = self.watch(workers=1)
        link = self.shared_link()
        Visitor(server.port).get(f"/sharing/{link}")
        wait_until(lambda: self.metric(server, "velksharing_requests_total", route="page") == 1)
        self.assertEqual(self.metric(server, "velksharing_processes_replaced_total",
                                     process="worker"), 0)
        worker, = set(server.workers()) - {self.observer(server)}
        os.kill(worker, signal.SIGKILL)
        Visitor(server.port).get(f"/sharing/{link}")
        wait_until(lambda: self.metric(server, "velksharing_requests_total", route="page") == 2)
        self.assertEqual(self.metric(server, "velksharing_processes_replaced_total",
                                     process="worker"), 1)

    def test_a_killed_observer_is_replaced_and_nothing_counted_is_lost(self):
        server = self.watch()
        link = self.shared_link()
        Visitor(server.port).get(f"/sharing/{link}")
        wait_until(lambda: self.metric(server, "velksharing_requests_total", route="page") == 1)
        killed = self.observer(server)
        os.kill(killed, signal.SIGKILL)
        # Meanwhile visitors are served.
        Visitor(server.port).log_in(link)
        wait_until(lambda: self.observer(server) != killed)
        wait_until(lambda: self.metric(server, "velksharing_requests_total", route="page") == 2)
        self.assertEqual(self.metric(server, "velksharing_requests_total", route="login",
                                     result="OK"), 1)
        self.assertEqual(self.metric(server, "velksharing_processes_replaced_total",
                                     process="observer"), 1)
        self.assertEqual(len(self.wait_for_records(link, 1)), 1)

    def test_the_text_is_what_prometheus_reads(self):
        server = self.watch()
        link = self.shared_link()
        Visitor(server.port).log_in(link)
        answer = self.ask(server)
        self.assertEqual(answer.headers["Content-Type"],
                         "text/plain; version=0.0.4; charset=utf-8")
        families = list(text_string_to_metric_families(answer.body.decode()))
        self.assertGreater(len(families), 10)
        for family in families:
            with self.subTest(family.name):
                self.assertIn(family.type, ("counter", "gauge", "histogram"))
                self.assertTrue(family.documentation)
                self.assertTrue(family.name.startswith("velksharing_"))

    def test_everything_is_documented(self):
        server = self.watch()
        Visitor(server.port).get("/elsewhere")
        names = set(re.findall(r"(?m)^# TYPE (\w+) ", self.ask(server).body.decode()))
        page = (SOURCE / "docs" / "watching.md").read_text()
        manual = (SOURCE / "docs" / "man" / "velksharing-web.8").read_text()
        for text in (page, manual):
            told = re.findall(r"velksharing_\w+", text)
            self.assertEqual(names, {name.removesuffix("_bucket") for name in told})
        header = SOURCE / "apps" / "velksharing-web" / "site" / "route_names.h"
        routes = re.findall(r'"(\w+)"', header.read_text().partition("kRouteNames")[2])
        self.assertGreater(len(routes), 10)
        for route in routes:
            self.assertIn(f"`{route}`", page)

    def test_nothing_but_the_metrics_is_served_and_nothing_but_reading(self):
        server = self.watch()
        self.assertEqual(self.ask(server, path="/").status, 404)
        self.assertEqual(self.ask(server, path="/metrics/x").status, 404)
        for method in ("POST", "PUT", "DELETE"):
            answer = self.ask(server, method)
            self.assertEqual((answer.status, answer.headers["Allow"]), (405, "GET, HEAD"))
        head = self.ask(server, "HEAD")
        self.assertEqual((head.status, head.body), (200, b""))

    def test_logins_are_counted_by_what_refused_them(self):
        server = self.watch()
        link = self.shared_link()
        for _ in range(3):
            Visitor(server.port).log_in(link, "wrong")
        Visitor(server.port).log_in(link)
        wait_until(lambda: self.metric(server, "velksharing_requests_total", route="login") == 4)
        self.assertEqual(self.metric(server, "velksharing_logins_refused_total",
                                     reason="WRONG_PASSWORD"), 3)
        self.assertEqual(self.metric(server, "velksharing_logins_refused_total"), 3)
        self.assertEqual(self.metric(server, "velksharing_logins_refused_total",
                                     reason="BLOCKED"), 0)

    def test_live_sessions_and_grants_are_counted(self):
        server = self.watch()
        link = self.shared_link()
        for _ in range(3):
            Visitor(server.port).log_in(link)
        self.assertEqual(self.metric(server, "velksharing_sessions_live"), 3)
        self.assertEqual(self.metric(server, "velksharing_grants_live"), 3)
        self.assertEqual(self.metric(server, "velksharing_database_up"), 1)
        with sqlite3.connect(ROOT / "etc/private/session/sharing.db") as database:
            database.execute("UPDATE token SET timeout = 1000 WHERE id = 1")
            database.execute("UPDATE session SET timeout = 1000 WHERE id <= 2")
        database.close()
        self.assertEqual(self.metric(server, "velksharing_sessions_live"), 1)
        self.assertEqual(self.metric(server, "velksharing_grants_live"), 2)

    def test_blocked_addresses_are_counted(self):
        server = self.watch()
        self.assertEqual(self.metric(server, "velksharing_blocked_addresses"), 0)
        command_line("block", "add", "192.0.2.7", check=True)
        command_line("block", "add", "2001:db8::1", check=True)
        self.assertEqual(self.metric(server, "velksharing_blocked_addresses"), 2)

    def test_an_unusable_database_is_told_and_what_it_knows_is_left_out(self):
        server = self.watch()
        file = ROOT / "etc/private/session/sharing.db"
        file.write_bytes(b"no database" * 1000)
        self.assertEqual(self.metric(server, "velksharing_database_up"), 0)
        self.assertIsNone(self.metric(server, "velksharing_sessions_live"))
        self.assertIsNone(self.metric(server, "velksharing_grants_live"))
        remove_database()
        self.assertEqual(self.metric(server, "velksharing_database_up"), 1)
        self.assertEqual(self.metric(server, "velksharing_sessions_live"), 0)

    def test_a_path_is_served_too(self):
        path = self.folder / "metrics"
        self.watch("--set", f"metrics_listen={path}", metrics=False)
        self.assertEqual(path.stat().st_mode & 0o777, 0o660)
        with socket.socket(socket.AF_UNIX) as connection:
            connection.connect(str(path))
            connection.sendall(b"GET /metrics HTTP/1.0\r\n\r\n")
            self.assertIn(b"velksharing_build_info{version=", connection.makefile("rb").read())

    def test_addresses_that_others_reach_are_refused(self):
        for address in ("0.0.0.0:9180", "192.0.2.1:9180", "[::]:9180", "[2001:db8::1]:9180",
                        "localhost:9180", "127.0.0.1", "127.0.0.1:99999", "metrics", ":9180",
                        "128.0.0.1:9180", "[::ffff:192.0.2.1]:9180"):
            with self.subTest(address):
                outcome = subprocess.run(
                    [PROGRAM, "--check-config", "--config", "/dev/null", "--set",
                     f"metrics_listen={address}"], text=True, capture_output=True, timeout=20)
                self.assertEqual(outcome.returncode, 2)
                self.assertIn("metrics_listen: ", outcome.stderr)

    def test_fastcgi_is_watched_too(self):
        path = self.folder / "fastcgi"
        server = self.keep(FrontEnd(["--fastcgi", str(path), "--set", "audit=on",
                                     "--set", "metrics_listen=127.0.0.1:0"], self.folder))
        link = self.share(self.make_file("photo.jpg", 1000), password=None)
        answer = ask_by_fastcgi(path, f"/sharing/{link}")
        self.assertIn(b"photo.jpg", answer)
        wait_until(lambda: self.metric(server, "velksharing_request_duration_seconds_count",
                                       route="file") == 1)
        self.assertEqual(self.wait_for_records(link, 1)[0]["event"], "enter")

    def test_a_reload_changes_nothing(self):
        server = self.watch()
        observer = self.observer(server)
        server.signal(signal.SIGHUP)
        time.sleep(0.3)
        self.assertEqual(self.observer(server), observer)
        self.assertEqual(self.ask(server).status, 200)

    def test_it_stops_in_time(self):
        server = self.watch(workers=2)
        self.observer(server)
        began = time.monotonic()
        self.assertEqual(server.stop(), 0)
        self.assertLess(time.monotonic() - began, 3)


class Audit(WatchTest):
    def test_by_default_there_is_none(self):
        server = self.watch(audit=False)
        link = self.shared_link()
        Visitor(server.port).log_in(link)
        server.visits(2)
        server.stop()
        self.assertFalse(TRAIL.exists())
        outcome = command_line("link", "log", link)
        self.assertEqual((outcome.returncode, outcome.stdout), (1, ""))
        self.assertIn("audit = on", outcome.stderr)

    def test_comings_and_goings_are_listed(self):
        server = self.watch()
        link = self.shared_link()
        other = self.share(self.folder / "shared" / "photo.jpg", password=None)
        visitor = Visitor(server.port)
        visitor.log_in(link, "wrong")
        visitor.log_in(link)
        page = visitor.get(f"/sharing/{link}")
        token = re.search(rb'name="csrf" value="([^"]*)"', page.body).group(1).decode()
        visitor.request("POST", f"/sharing/{link}/logout",
                        urllib.parse.urlencode({"csrf": token}),
                        {"Content-Type": "application/x-www-form-urlencoded"})
        Visitor(server.port).get(f"/sharing/{other}")
        records = self.wait_for_records(link, 3)
        self.assertEqual([(record["event"], record["code"], record["name"]) for record in records],
                         [("login", -9, "WRONG_PASSWORD"), ("login", 1, "OK"), ("logout", 1, "OK")])
        for record in records:
            self.assertEqual(record["address"], "127.0.0.0/24")
            self.assertIsNone(record["uid"])
            self.assertLess(abs(record["time"] - time.time()), 60)
            self.assertIn(record["microseconds"], range(1_000_000))
        self.assertEqual([record["event"] for record in self.wait_for_records(other, 1)], ["enter"])

        lines = command_line("link", "log", link).stdout.splitlines()
        self.assertEqual(lines[0].split(), HEADINGS.split())
        self.assertEqual(lines[1].split()[2:], ["login", "WRONG_PASSWORD", "127.0.0.0/24"])
        self.assertEqual(len(lines), 4)
        now = datetime.datetime.now()
        came = datetime.datetime.fromisoformat(lines[1][:19])
        self.assertLess(abs((came - now).total_seconds()), 60)

    def test_neither_hashes_nor_secrets_are_in_the_file(self):
        server = self.watch()
        link = self.shared_link()
        visitor = Visitor(server.port)
        visitor.log_in(link, "wr0ng-passw0rd")
        visitor.log_in(link)
        self.wait_for_records(link, 2)
        server.stop()
        content = TRAIL.read_bytes()
        for secret in (link, PASSWORD, "wr0ng-passw0rd", visitor.cookies["sharing_sid"]):
            self.assertNotIn(secret.encode(), content)
        self.assertEqual(TRAIL.stat().st_mode & 0o777, 0o600)

    def test_addresses_are_kept_as_configured(self):
        for form, kept in (("full", "127.0.0.1"), ("network", "127.0.0.0/24"), ("none", "")):
            with self.subTest(form):
                server = self.watch("--set", f"audit_address={form}")
                link = self.shared_link()
                Visitor(server.port).log_in(link)
                self.assertEqual(self.wait_for_records(link, 1)[0]["address"], kept)
                server.stop()
                server.log.unlink()
                remove_database()
                remove_trail()

    def test_the_last_ones_and_the_late_ones_can_be_chosen(self):
        server = self.watch()
        link = self.shared_link()
        for _ in range(2):
            Visitor(server.port).log_in(link, "wrong")
        Visitor(server.port).log_in(link)
        self.wait_for_records(link, 3)
        with sqlite3.connect(TRAIL) as database:
            database.execute("UPDATE visit SET time = time - 7200 * 1000000 WHERE id = 1")
        database.close()
        names = lambda *options: [record["name"] for record in self.visitors_of(link, *options)]
        self.assertEqual(names("--limit", "2"), ["WRONG_PASSWORD", "OK"])
        self.assertEqual(names("--since", "1h"), ["WRONG_PASSWORD", "OK"])
        self.assertEqual(len(names("--since", "3h")), 3)
        self.assertEqual(names("--since", "+1h"), [])

    def test_accounts_are_shown_by_name_or_else_by_number(self):
        server = self.watch()
        link = self.shared_link()
        for _ in range(2):
            Visitor(server.port).log_in(link)
        self.wait_for_records(link, 2)
        with sqlite3.connect(TRAIL) as database:
            database.execute("UPDATE visit SET uid = CASE id WHEN 1 THEN 0 ELSE 3999999999 END")
        database.close()
        records = self.visitors_of(link)
        self.assertEqual([(record["uid"], record["account"]) for record in records],
                         [(0, "root"), (3999999999, "3999999999")])
        lines = command_line("link", "log", link).stdout.splitlines()
        self.assertEqual([line.split()[-1] for line in lines[1:]], ["root", "3999999999"])

    def test_a_deleted_link_is_named_by_its_row(self):
        server = self.watch()
        link = self.shared_link()
        Visitor(server.port).log_in(link)
        number = self.wait_for_records(link, 1)[0]["entry_id"]
        command_line("link", "delete", link, check=True)
        self.assertEqual(command_line("link", "log", link).returncode, 1)
        outcome = command_line("link", "log", "--id", str(number), "--json")
        self.assertEqual(json.loads(outcome.stdout)["name"], "OK")

    def test_a_link_has_to_be_named_once(self):
        self.assertEqual(command_line("link", "log").returncode, 2)
        self.assertEqual(command_line("link", "log", "abc", "--id", "1").returncode, 2)

    def follow(self, link):
        follower = subprocess.Popen([COMMAND_LINE, "link", "log", link, "--json", "--follow"],
                                    stdout=subprocess.PIPE, text=True)
        self.addCleanup(follower.stdout.close)
        self.addCleanup(follower.wait)
        self.addCleanup(follower.kill)
        return follower

    def test_who_follows_sees_new_records_soon_also_when_the_file_is_new(self):
        server = self.watch()
        link = self.shared_link()
        follower = self.follow(link)
        time.sleep(0.3)
        for password, name in (("wrong", "WRONG_PASSWORD"), (PASSWORD, "OK")):
            Visitor(server.port).log_in(link, password)
            began = time.monotonic()
            self.assertEqual(json.loads(follower.stdout.readline())["name"], name)
            self.assertLess(time.monotonic() - began, 3)
        follower.send_signal(signal.SIGINT)
        self.assertEqual(follower.wait(5), -signal.SIGINT)

    def test_who_follows_goes_over_to_a_new_file(self):
        server = self.watch()
        link = self.shared_link()
        Visitor(server.port).log_in(link)
        self.wait_for_records(link, 1)
        follower = self.follow(link)
        self.assertEqual(json.loads(follower.stdout.readline())["name"], "OK")
        remove_trail()
        Visitor(server.port).log_in(link, "wrong")
        self.assertEqual(json.loads(follower.stdout.readline())["name"], "WRONG_PASSWORD")
        self.assertTrue(TRAIL.exists())

    def test_old_records_are_removed_when_it_starts(self):
        server = self.watch("--set", "audit_retention=2")
        link = self.shared_link()
        for password in ("wrong", PASSWORD):
            Visitor(server.port).log_in(link, password)
        self.wait_for_records(link, 2)
        server.stop()
        with sqlite3.connect(TRAIL) as database:
            database.execute("UPDATE visit SET time = time - 49 * 3600 * 1000000 WHERE id = 1")
        database.close()
        self.watch("--set", "audit_retention=2")
        self.assertEqual(len(self.visitors_of(link, "--since", "1h")), 1)
        wait_until(lambda: len(self.visitors_of(link)) == 1)

    def test_visitors_do_not_wait_while_somebody_holds_the_file(self):
        server = self.watch()
        link = self.shared_link()
        Visitor(server.port).log_in(link)
        self.wait_for_records(link, 1)
        database = sqlite3.connect(TRAIL, isolation_level=None)
        database.execute("BEGIN EXCLUSIVE")
        began = time.monotonic()
        for _ in range(20):
            Visitor(server.port).log_in(link)
        self.assertLess(time.monotonic() - began, 5)
        time.sleep(1.5)
        self.assertEqual(self.metric(server, "velksharing_audit_records_total"), 1)
        database.execute("ROLLBACK")
        database.close()
        self.assertEqual(len(self.wait_for_records(link, 21)), 21)
        self.assertEqual(self.metric(server, "velksharing_audit_records_total"), 21)
        self.assertEqual(self.metric(server, "velksharing_audit_records_dropped_total"), 0)

    def test_visitors_are_served_while_the_observer_stands_still(self):
        server = self.watch()
        link = self.shared_link()
        observer = self.observer(server)
        os.kill(observer, signal.SIGSTOP)
        began = time.monotonic()
        for _ in range(20):
            self.assertEqual(Visitor(server.port).log_in(link).status, 303)
        self.assertLess(time.monotonic() - began, 5)
        os.kill(observer, signal.SIGCONT)
        self.assertEqual(len(self.wait_for_records(link, 20)), 20)

    def test_a_file_that_is_broken_costs_records_and_no_visitor(self):
        TRAIL.write_bytes(b"no database at all" * 1000)
        server = self.watch()
        link = self.shared_link()
        for _ in range(3):
            self.assertEqual(Visitor(server.port).log_in(link).status, 303)
        wait_until(lambda: self.metric(server, "velksharing_audit_records_dropped_total",
                                       reason="file") == 3)
        self.assertEqual(server.log.read_text().count("audit trail " + str(TRAIL)), 1)
        outcome = command_line("link", "log", link)
        self.assertEqual(outcome.returncode, 3)
        # Taken away, it is made anew.
        remove_trail()
        Visitor(server.port).log_in(link)
        self.assertEqual(len(self.wait_for_records(link, 1)), 1)

    def test_the_last_records_are_stored_before_it_ends(self):
        server = self.watch(workers=2)
        link = self.shared_link()
        for _ in range(10):
            Visitor(server.port).log_in(link)
        self.assertEqual(server.stop(), 0)
        self.assertEqual(len(self.visitors_of(link)), 10)


class PlainCgi(WatchTest):
    """Each request has a process of its own, and nobody observes."""

    def setUp(self):
        super().setUp()
        self.settings = ROOT / "etc" / "sharing-web.conf"
        self.addCleanup(self.settings.unlink)
        self.settings.write_text(
            f"audit = on\nruntime_folder = {self.folder}/runtime\naccess_log = off\n")

    def log_in(self, link):
        form = urllib.parse.urlencode({"password": PASSWORD})
        process = subprocess.Popen(
            [PROGRAM], stdin=subprocess.PIPE, stdout=subprocess.PIPE, stderr=subprocess.PIPE,
            text=True, env={
                "GATEWAY_INTERFACE": "CGI/1.1", "REQUEST_METHOD": "POST",
                "REQUEST_URI": f"/sharing/{link}", "SERVER_PROTOCOL": "HTTP/1.1",
                "REMOTE_ADDR": "2001:db8:1:2::3", "CONTENT_LENGTH": str(len(form)),
                "CONTENT_TYPE": "application/x-www-form-urlencoded", "HTTP_X_VELK_SHARING": ""})
        self.addCleanup(process.stderr.close)
        self.addCleanup(process.stdout.close)
        self.addCleanup(process.wait)
        self.addCleanup(process.kill)
        process.stdin.write(form)
        process.stdin.close()
        return process

    def test_a_login_is_kept(self):
        link = self.shared_link()
        process = self.log_in(link)
        self.assertIn("Status: 303", process.stdout.read())
        self.assertEqual(process.wait(10), 0, process.stderr.read())
        record, = self.visitors_of(link)
        self.assertEqual((record["event"], record["name"], record["address"]),
                         ("login", "OK", "2001:db8:1::/48"))
        self.assertEqual(TRAIL.stat().st_mode & 0o777, 0o600)

    def test_the_visitor_has_the_answer_before_the_file_is_waited_for(self):
        link = self.shared_link()
        self.log_in(link).wait(10)
        database = sqlite3.connect(TRAIL, isolation_level=None)
        database.execute("BEGIN EXCLUSIVE")
        began = time.monotonic()
        process = self.log_in(link)
        self.assertIn("Status: 303", process.stdout.read())
        self.assertLess(time.monotonic() - began, 3)
        self.assertIsNone(process.poll())
        database.execute("ROLLBACK")
        database.close()
        self.assertEqual(process.wait(10), 0)
        self.assertEqual(len(self.visitors_of(link)), 2)


if __name__ == "__main__":
    main()
