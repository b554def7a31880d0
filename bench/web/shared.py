"""What is looked at: a small file in a folder, shared by a link among many others, and guarded by
another."""

import json
import os
import secrets
import shutil
from pathlib import Path

import program
from subject import Credentials

PAGE_NAME = 'page.txt'
PAGE_BYTES = 1024
OTHER_FILES = ('second page.txt', 'third page.txt')
GUARDED = '/guarded/'  # where nginx has the file for those alone whom a link lets in
OTHER_GUARDS = 20      # links that guard something else


class Shared:
    """Makes the database and the links; at the end of the block they are gone."""

    def __init__(self, build, folder, links):
        self._programs = build / 'bin'
        self._folder = folder
        self._database = None
        self._secret = folder / 'password'
        self.links = links
        self.credentials = Credentials('visitor', secrets.token_urlsafe(12))
        self.files = folder / 'shared'
        self.page = self.files / PAGE_NAME
        self.link = None  # the hash of that which shares the folder

    def __enter__(self):
        try:
            self._make()
        except BaseException:
            self.__exit__()
            raise
        return self

    def __exit__(self, *_):
        for suffix in ('', '-wal', '-shm'):
            if self._database is not None:
                Path(self._database + suffix).unlink(missing_ok=True)
        shutil.rmtree(self._folder, ignore_errors=True)

    def _make(self):
        shutil.rmtree(self._folder, ignore_errors=True)
        self.files.mkdir(parents=True)
        for name in (PAGE_NAME, *OTHER_FILES):
            (self.files / name).write_text(_text())
        self._database = program.run([self._programs / 'velksharing_bench_links', self.links])
        self._write_password()
        self.link = self._make_link('--path', self.files)
        self._make_guard(GUARDED)
        for number in range(OTHER_GUARDS):
            self._make_guard(f'https://site{number}.example/', f'/other/{number}/')

    def _write_password(self):
        with open(os.open(self._secret, os.O_WRONLY | os.O_CREAT, 0o600), 'w') as file:
            file.write(self.credentials.password + '\n')

    def _make_guard(self, *prefixes):
        self._make_link('--app', json.dumps({'protects': prefixes}))

    def _make_link(self, *content):
        """Returns its hash."""
        return program.run([
            self._programs / 'velksharing', 'link', 'create', '--project', 'files',
            '--owner', program.plain_user(), '--title', 'Pages',
            '--password-file', self._secret, *content])


def _text():
    line = 'The quick brown fox jumps over the lazy dog, and nobody knows why.\n'
    return (line * (PAGE_BYTES // len(line) + 1))[:PAGE_BYTES - 1] + '\n'
