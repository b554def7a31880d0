#ifndef TESTS_SUPPORT_SAMPLE_RECORDS_H
#define TESTS_SUPPORT_SAMPLE_RECORDS_H

#include <velksharing/database.h>
#include <velksharing/record.h>

#include <ctime>
#include <map>
#include <string>

#include "support/temp_dir.h"

namespace velk_test {

/// An open link that may be stored.
inline VELK::sharing::record::Entry SampleEntry(const std::string &hash) {
  VELK::sharing::record::Entry entry;
  entry.set_hash(hash).set_project_name("photo").set_owner_uid(1026);
  entry.set_app(Json::Value(Json::objectValue));
  return entry;
}

/// A session that lives for another hour.
inline VELK::sharing::record::Session SampleSession(const std::string &session_id) {
  VELK::sharing::record::Session session;
  session.set_session_id(session_id).set_ip("192.0.2.1").set_timeout(time(nullptr) + 3600);
  return session;
}

/// A grant that lives for another hour.
inline VELK::sharing::record::Token SampleToken(int session_id, int entry_id) {
  VELK::sharing::record::Token token;
  token.set_session_id(session_id).set_entry_id(entry_id).set_timeout(time(nullptr) + 3600);
  return token;
}

/// One row with the given columns, as a statement gives it.
class SampleRow {
 public:
  explicit SampleRow(const std::map<std::string, std::string> &columns)
      : database_(folder_.File("row.db"), 0600) {
    std::string sql = "SELECT 'x' AS unused_column";
    for (const auto &[name, text] : columns) sql += ",'" + database_.Escape(text) + "' AS " + name;
    good_ = database_.Execute(sql, result_) && result_.NextRow(row_);
  }

  bool good() const { return good_; }
  const VELK::sharing::db::Row &row() const { return row_; }

 private:
  TempDir folder_;
  VELK::sharing::db::BaseDB database_;
  VELK::sharing::db::Result result_;
  VELK::sharing::db::Row row_;
  bool good_ = false;
};

}  // namespace velk_test

#endif
