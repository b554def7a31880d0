#ifndef VELKSHARING_INTERNAL_POPEN_H
#define VELKSHARING_INTERNAL_POPEN_H

#include <array>
#include <cerrno>
#include <cstdio>
#include <string>
#include <vector>

#include "internal/log.h"
#include "velk/velkcore.h"

namespace VELK::sharing::internal {

/// Runs a program, without a shell, and reads what it prints on standard output. At the end of the
/// scope the stream is closed and the program waited for; what it printed and nobody read is lost,
/// and its exit status counts for nothing.
///
///     PipeReader file(VELK_ROOT "/bin/program", {"program", "argument", ""});
///     std::string answer;
///     if (file.file == nullptr || !file.ReadToEnd(answer)) return false;
///
/// A signal that the caller handles meanwhile does not end the reading. The output ends when the
/// program and all that it left running with this output have closed it; only the program itself
/// is waited for. One thread at a time.
class PipeReader {
 public:
  /// Starts the program at `path`. A failure is logged; errno says why.
  /// @param arguments the program's own name first. Its strings end at a zero byte, so that an
  ///        argument which holds one would arrive as another: the program is not started then.
  PipeReader(const char *path, const std::vector<std::string> &arguments)
      : file(Start(path, arguments)) {
    if (file == nullptr) LogError("include/internal/popen", "%s:%d (%u) VLIBCPopenv failed.\n");
  }
  PipeReader(const PipeReader &) = delete;
  PipeReader &operator=(const PipeReader &) = delete;
  ~PipeReader() {
    if (file != nullptr) VLIBCPclose(file);
  }

  /// Reads a line with its newline; a longer one than `limit` bytes in pieces of that size. The
  /// last line may lack the newline.
  /// @return false at the end of the output and when it cannot be read.
  bool ReadLine(size_t limit, std::string &line) {
    line.clear();
    while (line.size() < limit) {
      const int byte = NextByte();
      if (byte == EOF) break;
      line.push_back(static_cast<char>(byte));
      if (byte == '\n') break;
    }
    return !line.empty() && ferror(file) == 0;
  }

  /// Appends all that is still to come to `text`.
  /// @return false when it cannot be read to its end.
  bool ReadToEnd(std::string &text) {
    std::array<char, 4096> chunk;
    bool more = true;
    while (more) {
      const size_t count = fread(chunk.data(), 1, chunk.size(), file);
      more = count == chunk.size() || ForgetInterruption();
      text.append(chunk.data(), count);
    }
    return ferror(file) == 0;
  }

  FILE *const file;  ///< Null when the program could not be started.

 private:
  static FILE *Start(const char *path, const std::vector<std::string> &arguments) {
    std::vector<const char *> argv;
    for (const std::string &argument : arguments) {
      if (argument.find('\0') != std::string::npos) {
        errno = EINVAL;
        return nullptr;
      }
      argv.push_back(argument.c_str());
    }
    argv.push_back(nullptr);
    return VLIBCPopenv(path, "r", argv.data());
  }

  int NextByte() {
    int byte;
    do {
      byte = getc(file);
    } while (byte == EOF && ForgetInterruption());
    return byte;
  }

  /// Whether the reading that just stopped did so for a signal, and can go on.
  bool ForgetInterruption() {
    if (ferror(file) == 0 || errno != EINTR) return false;
    clearerr(file);
    return true;
  }
};

}  // namespace VELK::sharing::internal

#endif
