-- Version 2: indexes, and the tables whose changes need not wait for the disk.
--
-- May run twice, be killed anywhere, and run in several processes at once; see version 1.

BEGIN IMMEDIATE;

-- Every authorised request looks up the grant of one session on one link.
CREATE INDEX IF NOT EXISTS token_by_session_entry ON token (session_id, entry_id);
CREATE INDEX IF NOT EXISTS token_by_entry ON token (entry_id);

-- The purges of what has lapsed.
CREATE INDEX IF NOT EXISTS token_by_timeout ON token (timeout);
CREATE INDEX IF NOT EXISTS session_by_timeout ON session (timeout);

-- Listing, deleting and purging what one owner shares.
CREATE INDEX IF NOT EXISTS entry_by_owner ON entry (owner_uid, project_name);

-- The purge of expired links asks for auto_gc = 1 AND (past its time OR used up). SQLite answers
-- an OR from indexes only when each side has its own, and each must be led by a column compared
-- with a value, which for both is auto_gc. Both hold only the rows that can match: counting a use
-- touches neither for a link without an end, and the second one holds nothing but used-up links.
CREATE INDEX IF NOT EXISTS entry_by_expiry ON entry (auto_gc, expire_at)
  WHERE expire_at != 0;
CREATE INDEX IF NOT EXISTS entry_used_up ON entry (auto_gc)
  WHERE expire_times != 0 AND use_count >= expire_times;

-- The connection answers for an INSERT or UPDATE of these before the disk has it: every request of
-- a visitor makes two, and a power cut costs the visitor a login at most. All else is flushed.
CREATE TABLE IF NOT EXISTS velkdb_relaxed (name TEXT PRIMARY KEY);
INSERT OR IGNORE INTO velkdb_relaxed VALUES ('session'), ('token');

-- A page asks for many things in the same second, and each of these requests sets the same time-outs.
-- What would change nothing is not written: neither the row nor its place in five indexes.
CREATE TRIGGER IF NOT EXISTS session_unchanged BEFORE UPDATE ON session
  WHEN OLD.session_id IS NEW.session_id AND OLD.uid IS NEW.uid AND OLD.ip IS NEW.ip
    AND OLD.timeout IS NEW.timeout
BEGIN
  SELECT RAISE(IGNORE);
END;
CREATE TRIGGER IF NOT EXISTS token_unchanged BEFORE UPDATE ON token
  WHEN OLD.session_id IS NEW.session_id AND OLD.entry_id IS NEW.entry_id
    AND OLD.timeout IS NEW.timeout
BEGIN
  SELECT RAISE(IGNORE);
END;

PRAGMA user_version = 2;
COMMIT;
