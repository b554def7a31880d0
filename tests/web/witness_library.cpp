// To be loaded before velksharing-web: writes down, for each request that is handed to the
// platform, what its environment is and what the process's own is then. That is what an
// authenticator, or whatever else is run meanwhile, would see.

#include <dlfcn.h>
#include <fcntl.h>
#include <stdio.h>
#include <unistd.h>
#include <velk/velkcgi.h>

#include <cstdlib>
#include <memory>

namespace {

struct Close {
  void operator()(FILE *file) const { fclose(file); }
};

void Write(FILE *file, const char *whose, const char *const *variables) {
  for (; *variables != nullptr; ++variables) fprintf(file, "%s %s\n", whose, *variables);
}

/// Into the file that VELK_WITNESS names.
void WriteDown(const VelkCgiRequest &request) {
  const std::unique_ptr<FILE, Close> file(fopen(getenv("VELK_WITNESS"), "ae"));
  if (file == nullptr) abort();
  Write(file.get(), "request", request.environment);
  Write(file.get(), "process", environ);
}

}  // namespace

extern "C" __attribute__((visibility("default"))) void VelkCgiRequestBegin(
    const VelkCgiRequest *request) {
  if (request != nullptr) WriteDown(*request);
  reinterpret_cast<void (*)(const VelkCgiRequest *)>(dlsym(RTLD_NEXT, "VelkCgiRequestBegin"))(
      request);
}
