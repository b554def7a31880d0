#ifndef AUDIT_WRITER_H
#define AUDIT_WRITER_H

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "audit/record.h"

namespace audit {

class Database;

/// Appends to an audit trail. The file is opened when it is needed, and opened anew after a
/// failure or when another one lies in its place. Each call throws DatabaseError when the file was
/// busy or did not work; nothing of the call is stored then. For one thread at a time.
///
///     Writer writer(kTrailPath, 10'000);
///     writer.Append(records);
class Writer {
 public:
  /// @param patience milliseconds that a call waits for others who hold the file.
  Writer(std::string path, int patience);
  Writer(const Writer &) = delete;
  Writer &operator=(const Writer &) = delete;
  ~Writer();

  /// Stores records, in this order, in one transaction.
  void Append(const std::vector<Record> &records);
  /// Removes what happened before a moment (microseconds since the Unix epoch). Makes no file.
  void RemoveBefore(int64_t time);

 private:
  template <typename Work>
  void InTransaction(const Work &work);
  void Open();

  const std::string path_;
  const int patience_;
  std::unique_ptr<Database> database_;
};

}  // namespace audit

#endif
