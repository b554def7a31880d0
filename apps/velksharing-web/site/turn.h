#ifndef VELKSHARING_WEB_SITE_TURN_H
#define VELKSHARING_WEB_SITE_TURN_H

namespace web {

/// Makes this process and those that it forks from now on take turns at writing to the database.
///
/// SQLite has one writer at a time by itself, but whoever finds another one at work sleeps for a
/// while and looks again. Here the next one is woken at the moment it may go on. To be called
/// once, before there are other threads; without it, and for all other processes, SQLite's own
/// way is the only one, which is as safe.
void ShareTurns();

/// The turn at writing, for a scope. Not two of one thread at a time.
class Turn {
 public:
  /// Waits for it, ten seconds at most: after that the scope goes on without, and SQLite decides.
  /// A process that ended during its turn has lost it.
  Turn();
  Turn(const Turn &) = delete;
  Turn &operator=(const Turn &) = delete;
  ~Turn();

 private:
  bool is_held_ = false;
};

}  // namespace web

#endif
