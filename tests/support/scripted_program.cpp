#include "support/scripted_program.h"

#include <dlfcn.h>
#include <sys/stat.h>

#include "velk/velkcore.h"

namespace velk_test {
namespace {

ScriptedProgram *current = nullptr;

std::vector<std::string> TextsOf(const char *const argv[]) {
  std::vector<std::string> texts;
  for (; *argv != nullptr; ++argv) texts.push_back(*argv);
  return texts;
}

}  // namespace

ScriptedProgram::ScriptedProgram(const std::string &script) {
  WriteFile(path(), "#!/bin/sh\nFOLDER='" + folder_.path() + "'\n" + script + "\n");
  chmod(path().c_str(), 0755);
  current = this;
}

ScriptedProgram::~ScriptedProgram() {
  current = nullptr;
}

}  // namespace velk_test

FILE *VLIBCPopenv(const char *path, const char *mode, const char *const argv[]) {
  static const auto real =
      reinterpret_cast<decltype(&VLIBCPopenv)>(dlsym(RTLD_NEXT, "VLIBCPopenv"));
  if (velk_test::current == nullptr) return real(path, mode, argv);
  velk_test::current->Add({path, mode, velk_test::TextsOf(argv)});
  return real(velk_test::current->path().c_str(), mode, argv);
}
