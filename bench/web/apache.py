"""What one would use without us: a page behind Apache's own login form, sessions in SQLite."""

import base64
import grp
import hashlib
import os
import pwd
import shutil
import sqlite3
import time
import uuid

import program
from shared import PAGE_NAME
from subject import Role, Subject

MODULES = '/usr/lib/apache2/modules'
PROCESSES = 1
THREADS = 96  # more than there are connections
SESSION_SECONDS = 3600
# By itself, each UPDATE is on the disk before the answer goes out, and a busy database is tried
# again after 100 ms.
RELAXED = ('PRAGMA synchronous = NORMAL', 'PRAGMA busy_timeout = 10000')


def start(running, folder, shared, role):
    """Starts it until `running` ends. Its database has as many sessions of other people as there
    are links. Returns what is measured on it."""
    port = program.free_port()
    documents, private = folder / 'documents', folder / 'private'
    for made in (folder, documents, private):
        made.mkdir()
    shutil.copy(shared.page, documents / PAGE_NAME)
    shutil.copy(program.HERE / 'login.html', documents / 'login.html')
    _write_account(folder / 'passwords', shared.credentials)
    _make_sessions(private / 'sessions.db', shared.links)
    user, group = _identity(private)
    settings = RELAXED if role is Role.APACHE_RELAXED else ()
    configuration = program.configure('apache.conf', folder, {
        'folder': folder, 'port': port, 'user': user, 'group': group, 'modules': MODULES,
        'processes': PROCESSES, 'threads': THREADS, 'all_threads': PROCESSES * THREADS,
        'seconds': SESSION_SECONDS,
        'database_settings': '\n'.join(f'DBDInitSQL "{setting}"' for setting in settings)})
    serving = running.enter_context(program.Program(
        ['apache2', '-D', 'FOREGROUND', '-f', configuration], folder / 'output', port=port))
    page = shared.page.read_bytes()
    address = f'http://127.0.0.1:{port}/{PAGE_NAME}'
    return Subject(role.value, role, address, serving, page, page, entrance=address)


def _identity(private):
    """The account and the group it serves as, who own the folder of the database."""
    user = program.plain_user()
    group = grp.getgrgid(pwd.getpwnam(user).pw_gid).gr_name
    if os.geteuid() == 0:
        for owned in (private, *private.iterdir()):
            shutil.chown(owned, user, group)
    return user, group


def _write_account(file, credentials):
    """With the cheapest digest there is: Apache checks the password at each request."""
    digest = base64.b64encode(hashlib.sha1(credentials.password.encode()).digest()).decode()
    file.write_text(f'{credentials.account}:{{SHA}}{digest}\n')


def _make_sessions(file, count):
    expiry = int((time.time() + SESSION_SECONDS) * 1_000_000)
    value = 'visitors-user=somebody&visitors-pw=something'
    connection = sqlite3.connect(file)
    connection.execute('PRAGMA journal_mode = WAL')
    connection.execute('CREATE TABLE session (key TEXT PRIMARY KEY, value TEXT, expiry INTEGER)')
    with connection:
        connection.executemany('INSERT INTO session VALUES (?, ?, ?)',
                               ((str(uuid.uuid4()), value, expiry) for _ in range(count)))
    connection.close()
