-- Version 1: the three tables.
--
-- May run twice, be killed anywhere, and run in several processes at once: everything but the
-- journal's mode is one transaction, and what is already there is left alone.

-- Readers and one writer do not wait for each other. Cannot be changed inside a transaction.
PRAGMA journal_mode = WAL;

-- IMMEDIATE: whoever comes second waits here, and finds the tables made.
BEGIN IMMEDIATE;

-- AUTOINCREMENT: a grant may outlive its link and its session, so a new row must never get the id
-- of a deleted one; it would hand the old visitor somebody else's link. No foreign keys, for the
-- same reason: rows outlive each other on purpose, and each table is purged on its own.
--
-- Columns stand in the order in which the records list them, for INSERT gives values by position.
-- Values arrive as quoted text; INTEGER makes numbers of them, so that they compare as numbers.

-- Links.
CREATE TABLE IF NOT EXISTS entry (
  id           INTEGER PRIMARY KEY AUTOINCREMENT,
  hash         TEXT NOT NULL UNIQUE,  -- a second link under it must fail to be inserted
  project_name TEXT,
  enabled      INTEGER,  -- 1 or 0
  owner_uid    INTEGER,  -- unsigned; 4294967295 for no account
  start_at     INTEGER,  -- seconds since the epoch; 0 for at once
  expire_at    INTEGER,  -- seconds since the epoch; 0 for never
  expire_times INTEGER,  -- uses; 0 for any number
  use_count    INTEGER,
  auto_gc      INTEGER,  -- 1 when the purge by chance may remove it, else 0
  data         TEXT      -- JSON: everything that no statement searches for
);

-- Visitors.
CREATE TABLE IF NOT EXISTS session (
  id         INTEGER PRIMARY KEY AUTOINCREMENT,
  session_id TEXT NOT NULL UNIQUE,  -- the secret that the browser keeps
  uid        INTEGER,  -- unsigned; 4294967295 for no account
  ip         TEXT,
  timeout    INTEGER   -- seconds since the epoch
);

-- Grants: one session may use one link for a while.
CREATE TABLE IF NOT EXISTS token (
  id         INTEGER PRIMARY KEY AUTOINCREMENT,
  entry_id   INTEGER,  -- entry.id
  session_id INTEGER,  -- session.id, not its secret
  timeout    INTEGER   -- seconds since the epoch
);

PRAGMA user_version = 1;
COMMIT;
