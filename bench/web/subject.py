"""A page on a server, and those who may see it."""

import enum
from dataclasses import dataclass, field
from pathlib import Path

import program
from visitor import LoginForm, Visitor


class Role(enum.Enum):
    """What a subject is measured for, and the name of those that others are compared with."""

    CHECKED = 'ours, and what the targets are about'
    TOLD = 'ours, too, but does more than the others'
    GATE = 'of a server that asks us'
    HELLO = 'hello'
    APACHE = 'Apache'
    APACHE_RELAXED = 'Apache relaxed'
    STATIC = 'nginx static'


@dataclass(frozen=True)
class Credentials:
    account: str  # where the form asks for one
    password: str


@dataclass(eq=False)
class Subject:
    name: str
    role: Role
    address: str
    serving: program.Program      # whose processes' memory counts
    mark: bytes                   # is in the page, and in nothing that strangers get
    page: bytes | None = None     # all of it, where that is known
    entrance: str | None = None   # page that asks for a password; None: everybody is let in
    length: int = 0               # of the page in bytes, once visitors are there
    visitors: list[Visitor] = field(default_factory=list)

    def admit(self, count, credentials):
        """Turns a stranger away, then logs visitors in and gives them the page; or throws."""
        if self.entrance is not None:
            self._turn_stranger_away()
        for _ in range(count):
            visitor = Visitor()
            if self.entrance is not None:
                visitor.log_in(self.entrance, credentials)
            self.visitors.append(visitor)
        self.length = len(self._page_for(self.visitors[0]))
        self.check_visitors()

    def check_visitors(self):
        """Throws when a visitor does not get the page, or another one than the rest."""
        for visitor in self.visitors:
            if len(self._page_for(visitor)) != self.length:
                raise RuntimeError(f'{self.name}: not the same page for everybody')

    def write_cookies(self, file: Path):
        """One visitor's in each line."""
        file.write_text(''.join(
            visitor.cookies_for(self.address) + '\n' for visitor in self.visitors))

    def _page_for(self, visitor):
        answer = visitor.get(self.address)
        if answer.status != 200 or not self._is_page(answer.body):
            raise RuntimeError(f'{self.name}: not the page, but status {answer.status}')
        return answer.body

    def _is_page(self, body):
        return self.mark in body and self.page in (None, body)

    def _turn_stranger_away(self):
        answer = Visitor().get(self.address)
        if self.mark in answer.body or LoginForm(answer).password is None:
            raise RuntimeError(f'{self.name}: a stranger is not asked for a password')
