#include "statement_generator.h"

namespace velk_test {

std::string StatementGenerator::Setup() {
  return "DROP TABLE IF EXISTS item;"
         "CREATE TABLE item (id INTEGER PRIMARY KEY AUTOINCREMENT, t TEXT, i INTEGER, r REAL,"
         " n NUMERIC, b, u TEXT UNIQUE);"
         "CREATE INDEX item_part ON item (i) WHERE t = 'abc';"
         "CREATE INDEX item_other_part ON item (t) WHERE i != 0 AND n = 42;"
         "INSERT OR IGNORE INTO velkdb_relaxed VALUES ('item'), ('entry')";
}

std::string StatementGenerator::Next() {
  const int kind = Below(100);
  if (kind < 40) return LibraryStatement();
  if (kind < 90) return Spoil(OddStatement());
  return Rare();
}

std::string StatementGenerator::SchemaChange() {
  return Pick({"CREATE INDEX IF NOT EXISTS item_by_t ON item (t)",
               "CREATE INDEX IF NOT EXISTS item_by_i ON item (i, t)",
               "CREATE INDEX IF NOT EXISTS item_some ON item (n) WHERE i > 2",
               "DROP INDEX IF EXISTS item_by_t", "DROP INDEX IF EXISTS item_by_i",
               "DROP INDEX IF EXISTS item_some", "DROP INDEX IF EXISTS entry_by_owner",
               "CREATE INDEX IF NOT EXISTS entry_by_owner ON entry (owner_uid, project_name)",
               "ALTER TABLE item ADD COLUMN more TEXT DEFAULT 'more'",
               "CREATE TRIGGER IF NOT EXISTS copying AFTER UPDATE ON session"
               " BEGIN UPDATE item SET i = i + 1 WHERE id = 3; END",
               "DROP TRIGGER IF EXISTS copying",
               "CREATE VIEW IF NOT EXISTS seen AS"
               " SELECT id, t AS 'text', i = 5 FROM item",
               "DROP VIEW IF EXISTS seen", "ANALYZE"});
}

std::string StatementGenerator::Pick(const Choices &choices) {
  return choices[static_cast<size_t>(Below(static_cast<int>(choices.size())))];
}

// ---- What the library sends

std::string StatementGenerator::LibraryStatement() {
  const std::string hash = "h" + Number(60);
  const std::string id = Number(80);
  switch (Below(14)) {
    case 0:
      return "SELECT * FROM entry WHERE hash = '" + hash + "'";
    case 1:
      return "SELECT * FROM session WHERE session_id = 's" + id + "'";
    case 2:
      return "SELECT * FROM token WHERE session_id = " + id + " AND entry_id = " + Number(60);
    case 3:
      return "SELECT * FROM " + Pick({"entry", "session", "token"}) + " WHERE id = " + id;
    case 4:
      return "INSERT INTO entry VALUES (NULL,'" + hash + "'," + LinkValues(",", false) + ")";
    case 5:
      return "INSERT INTO session VALUES (NULL,'s" + id + "','" + Pick({"4294967295", "1000"}) +
             "','" + Pick({"192.0.2.1", "::1"}) + "','" + Number(3000) + "')";
    case 6:
      return "INSERT INTO token VALUES (NULL,'" + Number(60) + "','" + id + "','" + Number(3000) +
             "')";
    case 7:
      return "UPDATE entry SET " + LinkValues(",", true) + " WHERE id=" + id;
    case 8:
      return "UPDATE session SET ip='::1',session_id='s" + id + "',timeout='" + Number(3000) +
             "',uid='1' WHERE id=" + id;
    case 9:
      return "UPDATE token SET entry_id='" + Number(60) + "',session_id='" + id + "',timeout='" +
             Number(3000) + "' WHERE id=" + id;
    case 10:
      return "DELETE FROM " + Pick({"entry", "session", "token"}) + " WHERE id=" + id;
    case 11:
      return Purge();
    default:
      return Listing();
  }
}

std::string StatementGenerator::LinkValues(const char *separator, bool with_names) {
  const std::string values[] = {
      Pick({"photo", "it''s", "", "wiki", "a -- b"}),
      Pick({"0", "1"}),
      Pick({"1000", "1001", "4294967295"}),
      Number(3000),
      Number(3000),
      Number(4),
      Number(4),
      Pick({"0", "1"}),
      Pick({"{}", R"({"app":{"path":"/a ''b''?"},"protect_title":":x @y $z"})", "WHERE a = 5"})};
  const char *const names[] = {"project_name", "enabled",   "owner_uid", "start_at", "expire_at",
                               "expire_times", "use_count", "auto_gc",   "data"};
  std::string list;
  for (size_t i = 0; i < std::size(values); ++i) {
    if (i > 0) list += separator;
    if (with_names) list.append(names[i]).append("=");
    list += "'" + values[i] + "'";
  }
  return list;
}

std::string StatementGenerator::Purge() {
  const std::string expired = " ((expire_at != 0 AND expire_at < " + Number(300) +
                              ") OR (expire_times != 0 AND use_count >= expire_times))";
  switch (Below(5)) {
    case 0:
      return "DELETE FROM entry WHERE auto_gc = 1 AND " + expired;
    case 1:
      return "DELETE FROM entry WHERE owner_uid = 1001 AND project_name = 'photo' AND" + expired;
    case 2:
      return "DELETE FROM session WHERE timeout < '" + Number(300) + "'";
    case 3:
      return "DELETE FROM token WHERE timeout < '" + Number(300) + "'";
    default:
      return "DELETE FROM " + Pick({"session WHERE session_id = 's5'", "token WHERE entry_id = 7",
                                    "entry WHERE owner_uid = 1000"});
  }
}

std::string StatementGenerator::Listing() {
  std::string sql = "SELECT " + Pick({"*", "*", "COUNT(*) AS c"}) + " FROM entry";
  const int terms = Below(4);
  for (int i = 0; i < terms; ++i) {
    sql += i == 0 ? " WHERE " : Pick({" AND ", " OR "});
    sql += Chance(50) ? "`" + Pick({"project_name", "hash", "owner_uid"}) + "` = '" +
                            Pick({"photo", "it''s", "h7", "1000", "01000"}) + "'"
                      : Pick({"enabled = 1", "enabled = 0", "expire_at > 1500", "start_at <= 900",
                              "use_count < expire_times", "(id >= 10 AND id != 14)"});
  }
  if (Chance(60)) sql += " ORDER BY " + Pick({"id", "project_name", "expire_at,hash"}) + " DESC";
  if (Chance(60)) sql += " LIMIT " + Number(30);
  if (Chance(40)) sql += " OFFSET " + Number(20);
  return sql;
}

// ---- Others of their kind, and odd ones

std::string StatementGenerator::OddStatement() {
  switch (Below(10)) {
    case 0:
    case 1:
      return Insert();
    case 2:
    case 3:
      return Update();
    case 4:
      return Delete();
    default:
      return Select();
  }
}

std::string StatementGenerator::Select() {
  static const Choices kColumns = {"*",
                                   "t, i",
                                   "id, i = 5",
                                   "'x'",
                                   "5, t",
                                   "t 'i'",
                                   "i AS 'x', t AS \"5\"",
                                   "count(*), i",
                                   "i + 5 AS c, 'it''s' || t",
                                   "DISTINCT t",
                                   "t AS t, n AS t",
                                   "typeof(b), \"nothing\"",
                                   "max(i), `t`",
                                   "CASE WHEN i = 5 THEN 'five' ELSE 'x' END",
                                   "(SELECT 'x' WHERE 5 = 5)",
                                   "'item'.t",
                                   "item.*",
                                   "quote(r), r",
                                   "b = 'x', n >= 2"};
  static const Choices kTables = {"item",
                                  "item",
                                  "item",
                                  "`item`",
                                  "'item'",
                                  "item AS x",
                                  "(SELECT *, i = 5 FROM item WHERE t = 'abc') AS item",
                                  "item JOIN entry ON entry.id = item.id AND hash != 'h5'",
                                  "seen",
                                  "item, (VALUES (5, 'x'))",
                                  "item LEFT JOIN token USING (id)"};
  std::string sql = Pick({"SELECT ", "SELECT ", "select "}) + Pick(kColumns) + " FROM " +
                    Pick(kTables) + (Chance(80) ? Where() : "");
  if (Chance(4)) sql += " UNION SELECT 'x' FROM item WHERE t = 'abc'";
  if (Chance(10)) sql += " GROUP BY " + Pick({"i", "1", "t = 'abc'", "t HAVING count(*) > 2"});
  return sql + Tail();
}

std::string StatementGenerator::Insert() {
  std::string sql = Pick({"INSERT INTO ", "INSERT INTO ", "INSERT OR REPLACE INTO ",
                          "insert or ignore into ", "REPLACE INTO ", "INSERT OR FAIL INTO "});
  sql += Pick({"item", "`item`", "'item'"}) + " (t, i, r, n, b" + Pick({"", "", ", u"}) + ")";
  if (Chance(10)) return sql + " SELECT t, 5, 'x', n, b FROM item WHERE i = 5 LIMIT 3";
  sql += Pick({" VALUES ", " VALUES", " values\n"});
  for (int row = Chance(15) ? 3 : 1; row > 0; --row) {
    sql += "(" + Value() + "," + Value() + ", " + Value() + "," + Value() + " ," + Value();
    if (Chance(30)) sql += ",'u" + Number(40) + "'";
    sql += row == 1 ? ")" : "), ";
  }
  if (Chance(10))
    sql += Pick({" ON CONFLICT (u) DO UPDATE SET t = 'x', i = 5", " ON CONFLICT DO NOTHING",
                 " RETURNING id, t = 'abc', 5"});
  return sql;
}

std::string StatementGenerator::Update() {
  std::string sql = Pick({"UPDATE item SET ", "update item set ", "UPDATE OR IGNORE item SET "});
  sql += Column() + " = " + Value();
  if (Chance(50)) sql += ", " + Column() + "=" + Value();
  if (Chance(20)) sql += ",'b' = 'x',u='u" + Number(40) + "'";
  if (Chance(5)) sql += " FROM entry";
  if (Chance(95)) sql += Where();
  if (Chance(4)) sql += " RETURNING t = 'abc'";
  return sql;
}

std::string StatementGenerator::Delete() {
  return "DELETE FROM item" + (Chance(97) ? Where() : "") +
         (Chance(20) ? " ORDER BY id LIMIT 5" : "") + (Chance(5) ? " OFFSET 2" : "");
}

std::string StatementGenerator::Where() {
  std::string sql = Pick({" WHERE ", " where ", "\n\tWHERE "}) + Term();
  for (int more = Below(3); more > 0; --more) sql += Pick({" AND ", " OR ", " and "}) + Term();
  return sql;
}

std::string StatementGenerator::Tail() {
  std::string sql;
  if (Chance(40)) sql += " ORDER BY " + Pick({"1", "2 DESC", "id", "t = 'abc', 1", "i, 'x'", "r"});
  if (Chance(30)) sql += " LIMIT " + Pick({"0", "1", "5", "-1", "'7'", "2, 5", "3+2", "'x'"});
  if (Chance(15))
    sql += Pick({" OFFSET 0", " OFFSET 3", " offset 2", " OFFSET '2'", " OFFSET 1+1"});
  return sql;
}

std::string StatementGenerator::Term() {
  const std::string column = Column();
  const std::string compare = Pick({" = ", "=", " == ", "<", " <= ", " > ", ">=", " != ", "<>"});
  switch (Below(16)) {
    case 0:
      return Value() + compare + column;
    case 1:
      return column + " IN (" + Value() + "," + Value() + ")";
    case 2:
      return column + " BETWEEN " + Value() + " AND " + Value();
    case 3:
      return column + Pick({" LIKE 'a%'", " GLOB 'it*'", " IS NULL", " IS 'abc'", " IS NOT 5"});
    case 4:
      return "(" + column + compare + Value() + " OR " + Column() + " = 'abc')";
    case 5:
      return Pick({"length(t) = 3",
                   "substr(t, 2, 5) = 'bc'",
                   "abs(i) > 7",
                   "t || 'x' = 'abcx'",
                   "i << 2 = 20",
                   "i -5 = 2",
                   "(i, t) = (5, 'abc')",
                   "EXISTS (SELECT 5)",
                   "t = (SELECT 'abc')",
                   "i = 5 COLLATE NOCASE",
                   "t = 'ABC' COLLATE NOCASE",
                   "t COLLATE NOCASE = 'ABC'",
                   "likelihood(i = 5, 0.5)",
                   "NOT t = 'abc'",
                   "b ->> 'x' = 'y'",
                   "CASE i WHEN 5 THEN 'x' END = 'x'",
                   "i = 5 = 1",
                   "5",
                   "t = 'abc' IS NOT NULL",
                   "i = +5",
                   "i = - 5",
                   "i =-5",
                   "'item'.i = 5",
                   "t = 'item'.u",
                   "typeof(b) = 'text'",
                   "quote(n) = quote(42)"});
    default:
      return column + compare + Value();
  }
}

std::string StatementGenerator::Value() {
  static const Choices kValues = {"'abc'",
                                  "'it''s'",
                                  "''''",
                                  "''",
                                  "'12'",
                                  "'-3'",
                                  "'1e3'",
                                  "' 12 '",
                                  "'SELECT 5'",
                                  "'?'",
                                  "'a -- b'",
                                  "'/* x'",
                                  "'\xc3\xa4'",
                                  "'\xff\xfe'",
                                  "'WHERE a = ''b'''",
                                  "'ABC'",
                                  "'3.0'",
                                  "'9223372036854775808'",
                                  "'0x10'",
                                  "0",
                                  "1",
                                  "2",
                                  "5",
                                  "42",
                                  "-1",
                                  "-7",
                                  "+5",
                                  "007",
                                  "1234567",
                                  "9223372036854775807",
                                  "9223372036854775808",
                                  "-9223372036854775808",
                                  "1.5",
                                  ".5",
                                  "5.",
                                  "1e3",
                                  "-2E-2",
                                  "-0.0",
                                  "0x1F",
                                  "x'00ff'",
                                  "X''",
                                  "x'616263'",
                                  "NULL",
                                  "\"abc\"",
                                  "`t`",
                                  "t",
                                  "'x' || 'y'",
                                  "5 + 3",
                                  "(3)",
                                  "length('abc')",
                                  "'item'.i",
                                  "TRUE",
                                  "i * 2",
                                  "- 5",
                                  "-(5)",
                                  "'a'/**/",
                                  "5--x\n",
                                  "\"a'b\"",
                                  "`a'b`",
                                  "[a'b]",
                                  "5x",
                                  "'un",
                                  "?",
                                  "?2",
                                  ":a",
                                  "5e",
                                  "1_000",
                                  "CAST('5' AS INTEGER)",
                                  "'abc' COLLATE NOCASE",
                                  "$a",
                                  "x'0'",
                                  "\xc3\xa4",
                                  "'a'b",
                                  "5 5"};
  static const Choices kPlain = {"'abc'", "'it''s'", "''", "'12'", "5", "7", "42", "'5'", "NULL"};
  if (Chance(10)) return "'" + Pick({"v", "", "1", "it''s "}) + Number(50) + "'";
  if (Chance(30)) return Number(60);
  return Chance(60) ? Pick(kPlain) : Pick(kValues);
}

std::string StatementGenerator::Column() {
  return Pick({"t", "i", "r", "n", "b", "u", "id", "`t`", "\"i\"", "[n]", "item.t", "T", "more"});
}

// ---- What is not cached, and what is wrong

std::string StatementGenerator::Rare() {
  switch (Below(9)) {
    case 0:
      return "BEGIN TRANSACTION";
    case 1:
    case 2:
      return Pick({"COMMIT", "ROLLBACK", "END"});
    case 3:
      return Pick({"PRAGMA user_version", "PRAGMA table_info('item')", "PRAGMA foreign_keys = ON",
                   "PRAGMA index_list(item)", "PRAGMA case_sensitive_like = OFF",
                   "EXPLAIN QUERY PLAN SELECT * FROM item WHERE t = 'abc'"});
    case 4:
      return Select() + "; " + Update() + ";" + Select();
    case 5:
      return Pick({"", " ", ";", "-- nothing", "/* nothing", "SELECT", "SELECT 5",
                   "VALUES ('x', 5)", "SELECT 'x';",
                   "WITH a AS (SELECT 'x' AS c) SELECT c FROM a WHERE c = 'x'",
                   "SELECT * FROM item WHERE t = 'abc' -- 'end", "INSERT INTO item DEFAULT VALUES",
                   "DELETE FROM item WHERE t = 'a' /* 'b' */ OR t = 'c'", "\xef\xbb\xbfSELECT 5"});
    case 6:
      return Pick({"SAVEPOINT a", "RELEASE a", "ROLLBACK TO a"});
    case 7:
      return "DELETE FROM item WHERE id > " + Number(60);
    default:
      return Spoil(Select()) + std::string(1, '\0') + "this is cut off";
  }
}

std::string StatementGenerator::Spoil(std::string sql) {
  if (!Chance(6)) return sql;
  const auto at = static_cast<size_t>(Below(static_cast<int>(sql.size())));
  switch (Below(4)) {
    case 0:
      return sql.erase(at, 1);
    case 1:
      return sql.insert(at, 1, "'\"`;()=,-5 x?"[Below(13)]);
    case 2:
      return sql.insert(at, Pick({" /* 'c' */ ", "-- c\n", " ", "\x0b", "\xef\xbb\xbf", "''"}));
    default:
      return sql.substr(0, at);
  }
}

}  // namespace velk_test
