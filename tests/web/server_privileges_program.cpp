// Gives its privileges up as velksharing-web does, for a system account that is not root, and then
// becomes the program that its arguments name.

#include <unistd.h>

#include <cstdio>
#include <exception>

#include "server/privileges.h"

int main(int argc, char **argv) {
  try {
    web::LimitPrivileges();
  } catch (const std::exception &error) {
    fprintf(stderr, "%s\n", error.what());
    return 3;
  }
  if (argc > 1) {
    execv(argv[1], argv + 1);
    return 1;
  }
  FILE *status = fopen("/proc/self/status", "re");
  if (status == nullptr) return 1;
  for (int byte = fgetc(status); byte != EOF; byte = fgetc(status)) putchar(byte);
  fclose(status);
  return 0;
}
