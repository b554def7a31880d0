"""A browser without a screen: keeps cookies, and fills in the form of a page."""

import http.cookiejar
import urllib.error
import urllib.parse
import urllib.request
from dataclasses import dataclass
from html.parser import HTMLParser

PATIENCE = 20  # seconds


@dataclass(frozen=True)
class Page:
    status: int
    address: str
    body: bytes


class LoginForm(HTMLParser):
    """The form with a password field, of a page; there is none where `password` stays None."""

    def __init__(self, page):
        super().__init__()
        self.action = page.address
        self.account = None
        self.password = None
        self.fields = {}
        self._address = page.address
        self.feed(page.body.decode('utf-8', 'replace'))

    def handle_starttag(self, tag, attributes):
        named = dict(attributes)
        if tag == 'form':
            self.action = urllib.parse.urljoin(self._address, named.get('action', ''))
            self.fields = {}
        if tag != 'input' or self.password is not None:
            return
        name = named.get('name')
        kind = named.get('type', 'text')
        if kind == 'password':
            self.password = name
        elif kind == 'text':
            self.account = name
        elif kind == 'hidden':
            self.fields[name] = named.get('value', '')


class Visitor:
    def __init__(self):
        self._cookies = http.cookiejar.CookieJar()
        self._opener = urllib.request.build_opener(
            urllib.request.ProxyHandler({}),
            urllib.request.HTTPCookieProcessor(self._cookies))

    def get(self, address):
        return self._fetch(urllib.request.Request(address))

    def log_in(self, address, credentials):
        """Opens a page, which asks for a password, and gives it; throws when that is in vain."""
        form = LoginForm(self.get(address))
        if form.password is None:
            raise RuntimeError(f'{address} does not ask for a password')
        fields = dict(form.fields)
        fields[form.password] = credentials.password
        if form.account is not None:
            fields[form.account] = credentials.account
        data = urllib.parse.urlencode(fields).encode()
        answer = self._fetch(urllib.request.Request(form.action, data))
        if answer.status != 200 or LoginForm(answer).password is not None:
            raise RuntimeError(f'{form.action} does not let a visitor in: {answer.status}')

    def cookies_for(self, address):
        """What a browser would send in the header field Cookie."""
        request = urllib.request.Request(address)
        self._cookies.add_cookie_header(request)
        return request.get_header('Cookie', '')

    def _fetch(self, request):
        try:
            with self._opener.open(request, timeout=PATIENCE) as answer:
                return Page(answer.status, answer.url, answer.read())
        except urllib.error.HTTPError as answer:
            with answer:
                return Page(answer.code, answer.url, answer.read())
