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
    embedded, embedded_port = _start_embedded(running, build, folder)
    web_socket, hello_socket = folder / 'web.socket', folder / 'hello.socket'
    fastcgi = _start_fastcgi(running, build, folder, web_socket)
    http_socket = folder / 'http.socket'
    asked_by_http = _start_for_questions(running, build, folder, http_socket)
    hello = running.enter_context(Program(
        [build / 'bin' / 'velksharing_bench_hello', hello_socket, HELLO_WORKERS, shared.page],
        folder / 'hello.output', path=hello_socket))
    nginx, nginx_port = _start_nginx(running, folder / 'nginx', {
        'web_socket': web_socket, 'http_socket': http_socket, 'hello_socket': hello_socket,
        'files': shared.files, 'guarded': GUARDED})
    return [
        *_own_pages('embedded', embedded, embedded_port, shared.link, page),
        *_own_pages('nginx + FastCGI', fastcgi, nginx_port, shared.link, page),
        _guarded_page('nginx + auth_request', fastcgi, nginx_port, GUARDED, page),
        _guarded_page('nginx + auth_request by HTTP', asked_by_http, nginx_port, GUARDED + 'http/',
                      page),
        Subject('hello: nginx + FastCGI', Role.HELLO, f'http://127.0.0.1:{nginx_port}/hello',
                hello, page, page),
        Subject('nginx static', Role.STATIC, f'http://127.0.0.1:{nginx_port}/open/{PAGE_NAME}',
                nginx, page, page),
        apache.start(running, folder / 'apache', shared, Role.APACHE),
        apache.start(running, folder / 'apache-relaxed', shared, Role.APACHE_RELAXED),
    ]


def _start_embedded(running, build, folder):
    port = free_port()
    words = [build / 'bin' / 'velksharing-web', '--listen', f'127.0.0.1:{port}',
             '--access-log', folder / 'embedded.log']
    return running.enter_context(Program(words, folder / 'embedded.output', port=port)), port


def _start_fastcgi(running, build, folder, socket):
    words = [build / 'bin' / 'velksharing-web', '--fastcgi', socket,
             '--access-log', folder / 'fastcgi.log', '--set', 'auth_address=parameter']
    return running.enter_context(Program(words, folder / 'fastcgi.output', path=socket))


def _start_for_questions(running, build, folder, socket):
    """Serves HTTP to nginx alone, for its word on visitors counts."""
    words = [build / 'bin' / 'velksharing-web', '--listen', socket,
             '--access-log', folder / 'questions.log',
             '--set', 'auth_address=x-original-url', '--set', 'trusted_proxy=unix']
    return running.enter_context(Program(words, folder / 'questions.output', path=socket))


def _start_nginx(running, folder, values):
    port = free_port()
    folder.mkdir()
    configuration = configure('nginx.conf', folder, {
        'folder': folder, 'port': port, 'user': this_user(), **values})
    serving = running.enter_context(Program(
        ['nginx', '-p', folder, '-c', configuration, '-e', folder / 'error.log'],
        folder / 'output', port=port))
    return serving, port


def _own_pages(how, serving, port, link, page):
    entrance = f'http://127.0.0.1:{port}/sharing/{link}'
    return [
        Subject(how, Role.CHECKED, f'{entrance}/{urllib.parse.quote(PAGE_NAME)}?view', serving,
                page, page, entrance=entrance),
        Subject(f'{how}: list of the folder', Role.TOLD, f'{entrance}/', serving,
                PAGE_NAME.encode(), entrance=entrance),
    ]


def _guarded_page(name, serving, port, folder, page):
    """Who is not let in is led to a login, and back."""
    address = f'http://127.0.0.1:{port}{folder}{PAGE_NAME}'
    return Subject(name, Role.GATE, address, serving, page, page, entrance=address)
