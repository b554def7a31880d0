#ifndef VELKDB_DURABILITY_H
#define VELKDB_DURABILITY_H

#include <string>
#include <vector>

struct sqlite3;

namespace velkdb {

/// What a statement, or a transaction as a whole, writes. Each value outweighs those before it.
enum class Effect {
  kNone,         ///< Nothing.
  kTransaction,  ///< Nothing itself, but begins a transaction that will.
  kRelaxedRows,  ///< INSERTs and UPDATEs of relaxed tables alone.
  kRows,         ///< Rows of other tables, or rows deleted.
  kStructure,    ///< Tables, settings, the list of relaxed tables itself.
};

/// Decides which commits of one connection wait for the disk, and makes them wait.
///
/// Runs on WAL with `synchronous=NORMAL`, where SQLite itself does not flush the log at a commit.
/// Watches what statements write while they are prepared, adds that up over a transaction, and
/// flushes the log at the commit of one that wrote more than rows of relaxed tables. A flush that
/// fails makes the committing statement fail.
///
/// For each statement: Watch(), prepare, Watched(); then Start(), step to the end, Finish().
class Durability {
 public:
  Durability() = default;
  Durability(const Durability &) = delete;
  Durability &operator=(const Durability &) = delete;

  /// Hooks into a connection, which must not outlive this object.
  void Attach(sqlite3 *connection);

  /// Brings `synchronous` and the list of relaxed tables up to date, when they are not. To be
  /// called outside of any statement. When the file cannot be read now, everything is flushed
  /// and the next call tries again.
  /// @return whether they were not: then the effects of statements prepared before may no longer
  ///         hold.
  bool Refresh();

  /// A statement is about to be prepared.
  void Watch();
  /// What was prepared since Watch(), or prepared anew since Start(), writes.
  Effect Watched() const { return seen_; }

  /// A statement with this effect is about to be stepped.
  void Start(Effect effect);
  /// It has been stepped to its end or has failed.
  void Finish();

  /// For the hooks: something that writes this is being prepared.
  void See(Effect effect);
  /// For the hooks: a transaction has been appended to the log of `database`.
  /// @return an SQLite result code.
  int Committed(const char *database, int frames);
  /// For the hooks: whether INSERT and UPDATE of this table need not wait for the disk.
  bool IsRelaxed(const char *database, const char *table) const;

 private:
  bool IsTimeToCheckpoint(int frames);

  sqlite3 *connection_ = nullptr;
  std::vector<std::string> relaxed_;
  int next_checkpoint_ = 0;             ///< Frames in the log at which another one is tried.
  bool current_ = false;                ///< Refresh() has nothing to do.
  Effect seen_ = Effect::kNone;         ///< Of the statement being prepared, or prepared anew.
  Effect transaction_ = Effect::kNone;  ///< Of the transaction so far.
};

}  // namespace velkdb

#endif
