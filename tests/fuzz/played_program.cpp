#include "played_program.h"

#include <syslog.h>

#include <cstdio>

#include "velk/velkcore.h"

namespace {

std::string &Output() {
  static std::string output;
  return output;
}

}  // namespace

void velk_test::PlayProgram(const std::string &output) {
  Output() = output;
}

FILE *VLIBCPopenv(const char *, const char *mode, const char *const[]) {
  return fmemopen(Output().data(), Output().size(), mode);
}

int VLIBCPclose(FILE *file) {
  return fclose(file);
}

extern "C" __attribute__((visibility("default"))) void syslog(int, const char *, ...) {}
