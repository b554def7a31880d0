"""An application behind a link, as the tests of the gate have it, until standard input ends.

    guarded_site.py Nginx

prints the address of the site, and then what its pages say."""

import pathlib
import sys
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).resolve().parents[2] / "web"))

import server_gate_test


class Site(getattr(server_gate_test, sys.argv[1])):
    def runTest(self):
        self.start_front_end()
        print(self.site, server_gate_test.WIKI.decode(), sep="\n", flush=True)
        sys.stdin.read()


result = unittest.TestResult()
Site().run(result)
for _, problem in result.errors + result.failures:
    sys.exit(problem)
