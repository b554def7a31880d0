#include "site/turn.h"

#include <pthread.h>
#include <sys/mman.h>

#include <cerrno>
#include <ctime>

namespace web {
namespace {

constexpr time_t kPatience = 10;  // in seconds

/// In memory that the processes share; null where they do not take turns.
pthread_mutex_t *turns = nullptr;

bool SetUp(pthread_mutex_t &mutex) {
  pthread_mutexattr_t kind;
  if (pthread_mutexattr_init(&kind) != 0) return false;
  const bool is_made = pthread_mutexattr_setpshared(&kind, PTHREAD_PROCESS_SHARED) == 0 &&
                       pthread_mutexattr_setrobust(&kind, PTHREAD_MUTEX_ROBUST) == 0 &&
                       pthread_mutex_init(&mutex, &kind) == 0;
  pthread_mutexattr_destroy(&kind);
  return is_made;
}

timespec InTenSeconds() {
  timespec time = {};
  clock_gettime(CLOCK_MONOTONIC, &time);
  time.tv_sec += kPatience;
  return time;
}

bool Take(pthread_mutex_t &mutex) {
  if (int outcome = pthread_mutex_trylock(&mutex); outcome != EBUSY)
    return outcome == 0 || (outcome == EOWNERDEAD && pthread_mutex_consistent(&mutex) == 0);
  const timespec end = InTenSeconds();
  const int outcome = pthread_mutex_clocklock(&mutex, CLOCK_MONOTONIC, &end);
  // What the one before had begun, SQLite undoes.
  return outcome == 0 || (outcome == EOWNERDEAD && pthread_mutex_consistent(&mutex) == 0);
}

}  // namespace

void ShareTurns() {
  void *memory = mmap(nullptr, sizeof(pthread_mutex_t), PROT_READ | PROT_WRITE,
                      MAP_SHARED | MAP_ANONYMOUS, -1, 0);
  if (memory == MAP_FAILED) return;
  auto *mutex = static_cast<pthread_mutex_t *>(memory);
  if (SetUp(*mutex)) turns = mutex;
}

Turn::Turn() : is_held_(turns != nullptr && Take(*turns)) {}

Turn::~Turn() {
  if (is_held_) pthread_mutex_unlock(turns);
}

}  // namespace web
