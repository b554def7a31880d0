#ifndef TESTS_SUPPORT_VELKDB_CONNECTION_H
#define TESTS_SUPPORT_VELKDB_CONNECTION_H

#include <string>

#include "velk/velkdb.h"

namespace velk_test {

/// A connection of the platform, closed at the end of the scope. For programs that link velkdb.
class VelkDbConnection {
 public:
  explicit VelkDbConnection(const std::string &path)
      : handle_(VELKDBConnect("", "", "", path.c_str())) {}
  VelkDbConnection(const VelkDbConnection &) = delete;
  VelkDbConnection &operator=(const VelkDbConnection &) = delete;
  ~VelkDbConnection() { VELKDBClose(handle_); }

  bool IsOpen() const { return handle_ != nullptr; }
  /// Runs all statements of `sql`.
  /// @return what VELKDBExecute() returns.
  int Run(const std::string &sql) { return VELKDBExecute(handle_, sql.c_str(), nullptr); }
  /// The column `column` of the first row of `sql`; "(failed)" or "(no row)" when there is none.
  std::string Value(const std::string &sql, const char *column) {
    DBResult *result = nullptr;
    if (VELKDBExecute(handle_, sql.c_str(), &result) != 0) return "(failed)";
    unsigned int row = 0;
    const bool found = VELKDBFetchRow(result, &row) == 0;
    std::string value = found ? VELKDBFetchField(result, row, column) : "(no row)";
    VELKDBFreeResult(result);
    return value;
  }
  std::string Error() { return VELKDBErrorGet(handle_); }
  VELKDBHandle *handle() { return handle_; }

 private:
  VELKDBHandle *handle_;
};

}  // namespace velk_test

#endif
