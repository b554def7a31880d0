// Prints what becomes of a name: for tests that need another libwbclient.so.0 in each process.

#include <cstdio>

#include "velk/velkwins.h"

int main(int argc, char *argv[]) {
  char out[493] = "";
  const int length = VELKWinsUserNameFqdn2Netbios(argc > 1 ? argv[1] : nullptr, out, sizeof(out));
  printf("%d %s\n", length, out);
  return 0;
}
