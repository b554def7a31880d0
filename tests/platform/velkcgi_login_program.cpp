// Logs one account in and says what came of it, in a process of its own so that the wrappers can
// be loaded in front of it. Arguments: name. Standard input: password, without a line's end.
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <string>

#include "velk/velkcgi.h"

namespace {

/// Whether the heap of this process holds `secret`.
bool HeapHolds(const char *secret, size_t length) {
  std::ifstream maps("/proc/self/maps");
  std::string line;
  while (std::getline(maps, line)) {
    if (line.find("[heap]") == std::string::npos) continue;
    unsigned long begin = 0;
    unsigned long end = 0;
    if (sscanf(line.c_str(), "%lx-%lx", &begin, &end) != 2) continue;
    return memmem(reinterpret_cast<const void *>(begin), end - begin, secret, length) != nullptr;
  }
  return false;
}

/// Proof that HeapHolds() is not blind.
bool HeapHoldsACopy(const char *secret, size_t length) {
  char *copy = static_cast<char *>(malloc(length));
  memcpy(copy, secret, length);
  const bool seen = HeapHolds(secret, length);
  explicit_bzero(copy, length);
  free(copy);
  return seen;
}

}  // namespace

int main(int argc, char **argv) {
  char password[512] = "";
  const ssize_t length = read(STDIN_FILENO, password, sizeof(password) - 1);
  if (argc != 2 || length < 0) return 2;
  if (!HeapHoldsACopy(password, static_cast<size_t>(length))) return 3;

  VelkCgi *view = nullptr;
  VelkCgiInit(&view, "");
  VelkCgiLoginRecord record = {argv[1], password, "webui", 15, 1};
  char name[101] = "";
  const int outcome = VelkCgiLogin(view, name, sizeof(name), &record);
  VelkCgiFree(view);

  const bool kept = HeapHolds(password, static_cast<size_t>(length));
  printf("%d %s%s", outcome, name, kept ? " (password still in memory)" : "");
  return 0;
}
