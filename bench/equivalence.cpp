#include "equivalence.h"

#include <cstdlib>
#include <stdexcept>

#include "cases.h"
#include "sqlite.h"
#include "team.h"

namespace velk_bench {
namespace {

constexpr long kLinks = 1000;
constexpr int kCalls = 20;

// In what a call has added, keys and digests are random; of a renewed time-out, the second is open.
constexpr const char *kContents[] = {
    "SELECT CASE WHEN id <= 1000 THEN hash ELSE length(hash) END, project_name, enabled, owner_uid,"
    " start_at, expire_at, expire_times, use_count, auto_gc, CASE WHEN id <= 1000 THEN data ELSE"
    " json_replace(data, '$.protect_password', length(json_extract(data, '$.protect_password')),"
    " '$.protect_password_salt', length(json_extract(data, '$.protect_password_salt'))) END, id"
    " FROM entry ORDER BY id",
    "SELECT CASE WHEN id <= 1000 THEN session_id ELSE length(session_id) END, uid, ip,"
    " CASE WHEN timeout > strftime('%s', 'now') + 80000 THEN 'renewed' ELSE timeout END, id"
    " FROM session ORDER BY id",
    "SELECT entry_id, session_id,"
    " CASE WHEN timeout > strftime('%s', 'now') + 80000 THEN 'renewed' ELSE timeout END, id"
    " FROM token ORDER BY id"};

std::string Contents(const std::string &database) {
  Connection connection(database);
  std::string contents;
  for (const char *sql : kContents) {
    Statement rows(connection, sql);
    while (rows.NextRow()) {
      for (int column = 0; column < rows.ColumnCount(); ++column)
        contents.append(rows.Text(column)).append(1, '\t');
      contents += '\n';
    }
  }
  return contents;
}

void CallSome(const Operation &operation, Operations &side) {
  const int calls = operation.extent == Extent::kOnce ? 1 : kCalls;
  for (long id = 1, done = 0; done < calls; ++id) {
    if (!IsLive(id)) continue;
    if (!operation.call(side, id)) throw std::runtime_error("a call failed");
    ++done;
  }
}

std::string ContentsAfter(const Operation &operation, const Side &side,
                          const std::string &database) {
  return RunApart([&operation, &side, &database] {
    setenv("REMOTE_ADDR", kVisitorAddress, 1);
    CallSome(operation, *side.open());
    return Contents(database);
  });
}

std::string FirstDifference(const std::string &library, const std::string &baseline) {
  size_t place = 0;
  size_t line = 0;
  for (; place < library.size() && place < baseline.size(); ++place) {
    if (library[place] != baseline[place]) break;
    if (library[place] == '\n') line = place + 1;
  }
  const auto line_of = [line](const std::string &text) {
    return text.substr(line, text.find('\n', line) - line);
  };
  return "library:  " + line_of(library) + "\nbaseline: " + line_of(baseline);
}

}  // namespace

void RequireSameEffects(Stage &stage) {
  for (const Operation &operation : AllOperations()) {
    if (!operation.writes) continue;
    stage.Set(kLinks);
    stage.Spoil();
    const std::string library = ContentsAfter(operation, kLibrary, LibraryDatabase());
    const std::string baseline = ContentsAfter(operation, kBaseline, BaselineDatabase());
    if (library == baseline) continue;
    throw std::runtime_error(std::string("the sides do not do the same: ") + operation.name + "\n" +
                             FirstDifference(library, baseline));
  }
}

}  // namespace velk_bench
