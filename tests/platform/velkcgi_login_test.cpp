// The login of an account through saslauthd's socket, with a server that is told what to answer.
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <security/pam_appl.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/socket.h>
#include <sys/time.h>
#include <sys/un.h>
#include <syslog.h>
#include <unistd.h>

#include <chrono>
#include <cstring>
#include <filesystem>
#include <functional>
#include <string>
#include <thread>

#include "support/log_capture.h"
#include "support/velk_root.h"
#include "velk/velkcgi.h"
#include "velk_paths.h"

namespace fs = std::filesystem;

namespace {

int pam_asked = 0;

}  // namespace

/// In place of PAM's own, for the whole program: sees who is asked after saslauthd.
[[gnu::visibility("default")]] int pam_start(const char *, const char *, const pam_conv *,
                                             pam_handle_t **) {
  ++pam_asked;
  return PAM_SYSTEM_ERR;
}

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using velk_test::LogCapture;

const fs::path kSocket = VELK_SASLAUTHD_SOCKET;

std::string Field(const std::string &text) {
  return std::string{static_cast<char>(text.size() >> 8), static_cast<char>(text.size() & 0xff)} +
         text;
}

std::string ReadAll(int connection, size_t length) {
  std::string bytes(length, '\0');
  size_t have = 0;
  while (have < length) {
    const ssize_t count = recv(connection, bytes.data() + have, length - have, 0);
    if (count <= 0) break;
    have += static_cast<size_t>(count);
  }
  bytes.resize(have);
  return bytes;
}

std::string ReadField(int connection) {
  const std::string length = ReadAll(connection, 2);
  if (length.size() < 2) return "(cut short)";
  return ReadAll(connection, static_cast<size_t>(static_cast<unsigned char>(length[0])) << 8 |
                                 static_cast<unsigned char>(length[1]));
}

sockaddr_un SocketAddress() {
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  strncpy(address.sun_path, kSocket.c_str(), sizeof(address.sun_path) - 1);
  return address;
}

/// Listens where saslauthd would. Nobody takes a caller off the queue.
class Listener {
 public:
  explicit Listener(int backlog) : file_(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    fs::create_directories(kSocket.parent_path());
    fs::remove(kSocket);
    const sockaddr_un address = SocketAddress();
    EXPECT_EQ(0, bind(file_, reinterpret_cast<const sockaddr *>(&address), sizeof(address)));
    EXPECT_EQ(0, listen(file_, backlog));
  }
  Listener(const Listener &) = delete;
  Listener &operator=(const Listener &) = delete;
  ~Listener() {
    close(file_);
    fs::remove(kSocket);
  }

  int file() const { return file_; }

 private:
  const int file_;
};

/// Listens where saslauthd would, and lets `serve` answer each caller.
class Server {
 public:
  explicit Server(std::function<void(int)> serve) {
    thread_ = std::thread([this, serve] {
      int connection;
      while ((connection = accept4(listener_.file(), nullptr, nullptr, SOCK_CLOEXEC)) != -1) {
        serve(connection);
        close(connection);
      }
    });
  }
  ~Server() {
    shutdown(listener_.file(), SHUT_RDWR);
    thread_.join();
  }

 private:
  Listener listener_{8};
  std::thread thread_;
};

/// Reads the four fields of a request, then sends `bytes`.
std::function<void(int)> AnswerWith(const std::string &bytes) {
  return [bytes](int connection) {
    for (int i = 0; i < 4; ++i) ReadField(connection);
    send(connection, bytes.data(), bytes.size(), MSG_NOSIGNAL);
  };
}

/// A socket like saslauthd's whose queue is full.
class CrowdedServer {
 public:
  CrowdedServer() {
    const sockaddr_un address = SocketAddress();
    while (connect(Open(), reinterpret_cast<const sockaddr *>(&address), sizeof(address)) == 0) {
    }
    EXPECT_EQ(EAGAIN, errno);
  }
  ~CrowdedServer() {
    for (const int file : callers_) close(file);
  }

 private:
  int Open() {
    callers_.push_back(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0));
    return callers_.back();
  }

  Listener listener_{0};
  std::vector<int> callers_;
};

/// The process may open no further file while this lives.
class NoDescriptors {
 public:
  NoDescriptors() {
    getrlimit(RLIMIT_NOFILE, &before_);
    const rlimit none{0, before_.rlim_max};
    EXPECT_EQ(0, setrlimit(RLIMIT_NOFILE, &none));
  }
  ~NoDescriptors() { setrlimit(RLIMIT_NOFILE, &before_); }

 private:
  rlimit before_;
};

int Login(const char *name, const char *password, char *out = nullptr, size_t capacity = 0) {
  VelkCgi *view = nullptr;
  VelkCgiInit(&view, "");
  VelkCgiLoginRecord record = {name, password, "webui", 15, 1};
  const int outcome = VelkCgiLogin(view, out, capacity, &record);
  VelkCgiFree(view);
  return outcome;
}

/// How long a login takes that is refused.
std::chrono::steady_clock::duration TimeToRefuse() {
  const auto start = std::chrono::steady_clock::now();
  EXPECT_EQ(0, Login("alice", "secret"));
  return std::chrono::steady_clock::now() - start;
}

std::string LogPrefix() {
  return "saslauthd at " + kSocket.string() + ": ";
}

class VelkCgiLogin : public testing::Test {
 protected:
  void SetUp() override {
    if (!velk_test::OwnsSaslauthdSocket()) GTEST_SKIP() << kSocket << " may be in use";
    pam_asked = 0;
  }
};

TEST_F(VelkCgiLogin, AsksForTheAccountInTheServiceVelk) {
  std::vector<std::string> request;
  {
    const Server server([&](int connection) {
      for (int i = 0; i < 4; ++i) request.push_back(ReadField(connection));
      const std::string yes = Field("OK");
      send(connection, yes.data(), yes.size(), MSG_NOSIGNAL);
    });
    EXPECT_EQ(1, Login("alice", "s3cret \xc3\xa4%"));
  }
  EXPECT_THAT(request, ElementsAre("alice", "s3cret \xc3\xa4%", "velk", ""));
}

TEST_F(VelkCgiLogin, GivesTheNameOnSuccess) {
  const Server server(AnswerWith(Field("OK success")));
  char out[101] = "";
  EXPECT_EQ(1, Login("alice", "secret", out, sizeof(out)));
  EXPECT_STREQ("alice", out);
}

TEST_F(VelkCgiLogin, FailsWhenTheNameDoesNotFit) {
  const Server server(AnswerWith(Field("OK")));
  char out[6] = "xxxxx";
  EXPECT_EQ(0, Login("alice", "secret", out, 5));
  EXPECT_EQ(0, Login("alice", "secret", out, 0));
  EXPECT_EQ(0, Login("alice", "secret", nullptr, 6));
  EXPECT_STREQ("xxxxx", out);
  EXPECT_EQ(1, Login("alice", "secret", out, 6));
  EXPECT_STREQ("alice", out);
}

TEST_F(VelkCgiLogin, ARefusalIsFinalAndNoErrorOfTheSystem) {
  LogCapture log;
  const Server server(AnswerWith(Field("NO authentication failed")));
  char out[101] = "before";
  EXPECT_EQ(0, Login("alice", "wrong", out, sizeof(out)));
  EXPECT_STREQ("before", out);
  EXPECT_THAT(log.lines(), IsEmpty());
}

TEST_F(VelkCgiLogin, RefusesAnAnswerThatIsNeitherYesNorNo) {
  for (const std::string &answer : {Field("ok"), Field("O"), Field(""), Field("\xff\xff\xff"),
                                    Field(" OK"), Field(std::string(65535, 'x'))}) {
    LogCapture log;
    const Server server(AnswerWith(answer));
    EXPECT_EQ(0, Login("alice", "secret"));
    EXPECT_THAT(log.Texts(), ElementsAre(LogPrefix() + "an answer that is neither yes nor no"));
  }
}

TEST_F(VelkCgiLogin, RefusesAnAnswerThatIsCutShort) {
  for (const std::string &answer :
       {std::string(), std::string("\0", 1), std::string("\0\x02", 2), std::string("\0\x02O", 3),
        std::string("\0\x0aOK", 4), std::string("\xff\xffOK", 4)}) {
    LogCapture log;
    const Server server(AnswerWith(answer));
    EXPECT_EQ(0, Login("alice", "secret"));
    EXPECT_THAT(log.Texts(), ElementsAre(LogPrefix() + "Connection reset by peer"));
    EXPECT_EQ(LOG_ERR, log.lines().at(0).priority);
  }
}

TEST_F(VelkCgiLogin, AcceptsAnAnswerThatComesByteByByte) {
  const Server server([](int connection) {
    for (int i = 0; i < 4; ++i) ReadField(connection);
    for (const char byte : Field("OK success")) {
      send(connection, &byte, 1, MSG_NOSIGNAL);
      usleep(2000);
    }
  });
  EXPECT_EQ(1, Login("alice", "secret"));
}

TEST_F(VelkCgiLogin, SurvivesAServerThatHangsUp) {
  LogCapture log;
  const Server server([](int) {});
  for (int i = 0; i < 100; ++i) EXPECT_EQ(0, Login("alice", "secret"));
  EXPECT_EQ(100U, log.lines().size());
}

TEST_F(VelkCgiLogin, SurvivesInterruptions) {
  struct sigaction before {};
  struct sigaction ignore {};
  ignore.sa_handler = [](int) {};  // without SA_RESTART
  sigaction(SIGALRM, &ignore, &before);
  {
    const Server server([](int connection) {
      sigset_t all;
      sigfillset(&all);
      pthread_sigmask(SIG_BLOCK, &all, nullptr);
      usleep(50000);
      AnswerWith(Field("OK"))(connection);
    });
    const itimerval often{{0, 1000}, {0, 1000}};
    const itimerval never{};
    setitimer(ITIMER_REAL, &often, nullptr);
    EXPECT_EQ(1, Login("alice", "secret"));
    setitimer(ITIMER_REAL, &never, nullptr);
  }
  sigaction(SIGALRM, &before, nullptr);
}

TEST_F(VelkCgiLogin, DoesNotWaitForEverForAServerThatSaysNothing) {
  LogCapture log;
  const Server server([](int connection) {
    char rest[4096];
    while (recv(connection, rest, sizeof(rest), 0) > 0) {
    }
  });
  const auto waited = TimeToRefuse();
  EXPECT_GE(waited, std::chrono::seconds(9));
  EXPECT_LE(waited, std::chrono::seconds(15));
  EXPECT_THAT(log.Texts(), ElementsAre(LogPrefix() + "no answer in time"));
}

TEST_F(VelkCgiLogin, ABusyServersSilenceIsARefusal) {
  LogCapture log;
  const CrowdedServer server;
  const auto waited = TimeToRefuse();
  EXPECT_GE(waited, std::chrono::seconds(9));
  EXPECT_LE(waited, std::chrono::seconds(15));
  EXPECT_THAT(log.Texts(), ElementsAre(LogPrefix() + "no answer in time"));
  EXPECT_EQ(0, pam_asked);
}

TEST_F(VelkCgiLogin, LackOfDescriptorsIsARefusal) {
  LogCapture log;
  const Listener listener(8);  // no thread of ours: sanitizers check one's start through a pipe
  {
    const NoDescriptors limit;
    EXPECT_EQ(0, Login("alice", "secret"));
  }
  EXPECT_THAT(log.Texts(), ElementsAre(LogPrefix() + "Too many open files"));
  EXPECT_EQ(0, pam_asked);
}

TEST_F(VelkCgiLogin, GoesOnWithPamWhereNobodyAnswers) {
  LogCapture log;
  fs::create_directories(kSocket.parent_path());
  fs::remove(kSocket);
  EXPECT_EQ(0, Login("alice", "secret"));
  EXPECT_EQ(1, pam_asked);
  EXPECT_THAT(log.lines(), IsEmpty());
}

TEST_F(VelkCgiLogin, GoesOnWithPamWhereTheServerHasLeftItsSocket) {
  LogCapture log;
  fs::create_directories(kSocket.parent_path());
  fs::remove(kSocket);
  const sockaddr_un address = SocketAddress();
  const int file = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
  EXPECT_EQ(0, bind(file, reinterpret_cast<const sockaddr *>(&address), sizeof(address)));
  close(file);
  EXPECT_EQ(0, Login("alice", "secret"));
  EXPECT_EQ(1, pam_asked);
  EXPECT_THAT(log.lines(), IsEmpty());
  fs::remove(kSocket);
}

TEST_F(VelkCgiLogin, KeepsItsSocketFromOtherPrograms) {
  int sockets = 0;
  {
    const Server server([&](int connection) {
      for (int file = 3; file < 256; ++file) {
        int type;
        socklen_t size = sizeof(type);
        if (getsockopt(file, SOL_SOCKET, SO_TYPE, &type, &size) != 0) continue;
        ++sockets;
        EXPECT_TRUE(fcntl(file, F_GETFD) & FD_CLOEXEC) << file;
      }
      AnswerWith(Field("OK"))(connection);
    });
    EXPECT_EQ(1, Login("alice", "secret"));
  }
  EXPECT_GE(sockets, 3) << "listener, both ends";
}

TEST_F(VelkCgiLogin, LeavesNoDescriptorBehind) {
  const Server server(AnswerWith(Field("NO")));
  const auto count = [] {
    const auto files = fs::directory_iterator("/proc/self/fd");
    return std::distance(begin(files), end(files));
  };
  const auto before = count();
  for (int i = 0; i < 20; ++i) Login("alice", "secret");
  // The server's end of the last connection closes a little later.
  for (int i = 0; i < 1000 && count() != before; ++i) usleep(10000);
  EXPECT_EQ(before, count());
}

TEST_F(VelkCgiLogin, AsksNobodyAboutNamesAndPasswordsThatCannotBe) {
  int asked = 0;
  const std::string long_one(257, 'x');
  {
    const Server server([&](int connection) {
      ++asked;
      AnswerWith(Field("OK"))(connection);
    });
    for (const char *bad : {static_cast<const char *>(nullptr), "", "a\nb", "a\tb", "a\x7f", "\x1b",
                            long_one.c_str()}) {
      EXPECT_EQ(0, Login(bad, "secret"));
      EXPECT_EQ(0, Login("alice", bad));
    }
    EXPECT_EQ(0, asked);
    EXPECT_EQ(1, Login(long_one.c_str() + 1, long_one.c_str() + 1)) << "256 bytes are allowed";
  }
  EXPECT_EQ(1, asked);
}

TEST_F(VelkCgiLogin, RefusesANullViewAndANullRecord) {
  const Server server(AnswerWith(Field("OK")));
  VelkCgiLoginRecord record = {"alice", "secret", "webui", 15, 1};
  EXPECT_EQ(0, ::VelkCgiLogin(nullptr, nullptr, 0, &record));
  VelkCgi *view = nullptr;
  VelkCgiInit(&view, "");
  EXPECT_EQ(0, ::VelkCgiLogin(view, nullptr, 0, nullptr));
  EXPECT_EQ(1, ::VelkCgiLogin(view, nullptr, 0, &record));
  VelkCgiFree(view);
}

}  // namespace
