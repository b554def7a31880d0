"""Spellings of what a visitor should not reach: files outside of what is shared, and other sites."""

import itertools

DOTS = (
    "..", "%2e%2e", "%2E%2E", ".%2e", "%2e.", "%252e%252e", "%25252e%25252e", "%c0%ae%c0%ae",
    "%e0%80%ae%e0%80%ae", "%c0%2e%c0%2e", "%ef%bc%8e%ef%bc%8e", "%e2%80%a5", "%u002e%u002e",
    "..%00", "%00..", "..%20", "..%09", "..;", "..;x=y", "...", "....", ".. ", "..%0d%0a", "..%01",
    "..%3f", "..%23", "..\t", "\x01..", "\xff..", "..\\")

SLASHES = (
    "/", "%2f", "%2F", "%252f", "%5c", "%255c", "\\", "//", "/./", "/%2e/", "%c0%af", "%e0%80%af",
    "%c1%9c", "%ef%bc%8f", "%u2215", "%00/", "/;/", "/\\")


def ways_out(name):
    """Below a shared folder with a folder "sub" and a file "hello.txt": ways to `name`, which lies
    beside it, and to files of the machine."""
    ways = []
    for dots, slash in itertools.product(DOTS, SLASHES):
        ways.append(f"/{dots}{slash}{name}")
        ways.append(f"/sub/{dots}{slash}{dots}{slash}{name}")
    for dots in DOTS:
        ways.append(f"/hello.txt/{dots}/{dots}/{name}")
        ways.append("/" + f"{dots}/" * 12 + "etc/passwd")
    for slash in SLASHES:
        ways.append(f"/{slash}etc{slash}passwd")
    ways += ["/file:///etc/passwd", "/~root/x", "/proc/self/environ", "/out", "/out/passwd",
             "/%2fproc%2fself%2froot%2fetc%2fpasswd", "/C:%5cWindows", "/hello.txt%00.png",
             "/hello.txt%2f..%2f..%2f" + name, "/hello.txt%", "/%2", "/%zz", "/.", "/..", "/%00"]
    return ways


SCHEMES = ("", "http:", "https:", "HTTPS:", "https%3a", "%68ttps:", " https:", "\thttps:", "ht\ttps:",
           "ht\ntps:", "\r\nhttps:", "javascript:", "data:text/html,")

MIDDLES = ("//", "/", "///", "////", "\\\\", "/\\", "\\/", "/%5c", "%2f%2f", "%5c%5c", "/%09/", "/\t/",
           "/\n/", "//\\", "//@", "//.", "//127.0.0.1@", "//127.0.0.1:80@", "//127.0.0.1\\@",
           "//127.0.0.1%00@", "//127.0.0.1\t@", "//127.0.0.1\r\n@", ".", "@", "?", "#", "//%0d%0a")


def ways_elsewhere(host):
    """Texts that browsers, or programs on the way, could take for an address at this host."""
    return [scheme + middle + host for scheme, middle in itertools.product(SCHEMES, MIDDLES)]
