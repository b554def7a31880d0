"""The servers that are measured side by side, and the pages on them."""

import urllib.parse

import apache
from program import Program, configure, free_port, this_user
from shared import GUARDED, PAGE_NAME
from subject import Role, Subject

HELLO_WORKERS = 4  # as many as velksharing-web has by itself


def start_all(running, build, folder, shared):
    """Starts every server until `running` ends, and returns what is measured on them."""
    page = shared.page.read_bytes()
    web = _Fronts(running, build, folder)
    embedded, embedded_port = web.start_embedded()
    sockets = {name: folder / f'{name}.socket' for name in ('web', 'http', 'hello')}
    fastcgi = web.start_fastcgi(sockets['web'])
    asked_by_http = web.start_for_questions(sockets['http'])
    hello = running.enter_context(Program(
        [build / 'bin' / 'velksharing_bench_hello', sockets['hello'], HELLO_WORKERS, shared.page],
        folder / 'hello.output', path=sockets['hello']))
    nginx, nginx_port = _start_nginx(running, folder / 'nginx', shared, sockets)
    site = f'http://127.0.0.1:{nginx_port}'
    return [
        *_own_pages('embedded', embedded, f'http://127.0.0.1:{embedded_port}', shared.link, page),
        *_own_pages('nginx + FastCGI', fastcgi, site, shared.link, page),
        _guarded_page('nginx + auth_request', fastcgi, f'{site}{GUARDED}', page),
        _guarded_page('nginx + auth_request by HTTP', asked_by_http, f'{site}{GUARDED}http/', page),
        Subject('hello: nginx + FastCGI', Role.HELLO, f'{site}/hello', hello, page, page),
        Subject('nginx static', Role.STATIC, f'{site}/open/{PAGE_NAME}', nginx, page, page),
        apache.start(running, folder / 'apache', shared, Role.APACHE),
        apache.start(running, folder / 'apache-relaxed', shared, Role.APACHE_RELAXED),
    ]


class _Fronts:
    """Starts velksharing-web in several ways."""

    def __init__(self, running, build, folder):
        self._running = running
        self._program = build / 'bin' / 'velksharing-web'
        self._folder = folder

    def start_embedded(self):
        port = free_port()
        return self._start('embedded', '--listen', f'127.0.0.1:{port}', port=port), port

    def start_fastcgi(self, socket):
        """Serves pages, and answers questions."""
        return self._start('fastcgi', '--fastcgi', socket, '--set', 'auth_address=parameter',
                           path=socket)

    def start_for_questions(self, socket):
        """Serves HTTP to nginx alone, for its word on visitors counts."""
        return self._start('questions', '--listen', socket, '--set', 'auth_address=x-original-url',
                           '--set', 'trusted_proxy=unix', path=socket)

    def _start(self, name, *options, **place):
        words = [self._program, '--access-log', self._folder / f'{name}.log', *options]
        return self._running.enter_context(
            Program(words, self._folder / f'{name}.output', **place))


def _start_nginx(running, folder, shared, sockets):
    port = free_port()
    folder.mkdir()
    configuration = configure('nginx.conf', folder, {
        'folder': folder, 'port': port, 'user': this_user(), 'files': shared.files,
        'guarded': GUARDED, **{f'{name}_socket': path for name, path in sockets.items()}})
    serving = running.enter_context(Program(
        ['nginx', '-p', folder, '-c', configuration, '-e', folder / 'error.log'],
        folder / 'output', port=port))
    return serving, port


def _own_pages(how, serving, site, link, page):
    entrance = f'{site}/sharing/{link}'
    return [
        Subject(how, Role.CHECKED, f'{entrance}/{urllib.parse.quote(PAGE_NAME)}?view', serving,
                page, page, entrance=entrance),
        Subject(f'{how}: list of the folder', Role.TOLD, f'{entrance}/', serving,
                PAGE_NAME.encode(), entrance=entrance),
    ]


def _guarded_page(name, serving, folder, page):
    """Who is not let in is led to a login, and back."""
    address = f'{folder}{PAGE_NAME}'
    return Subject(name, Role.GATE, address, serving, page, page, entrance=address)
