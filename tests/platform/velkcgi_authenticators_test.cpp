// The login of an account through real authenticators: PAM in the process, and saslauthd. Both get
// their PAM services and accounts from pam_wrapper, so nothing of the machine is touched.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <string>
#include <thread>

#include "support/process.h"
#include "support/temp_dir.h"
#include "support/velk_root.h"
#include "velk_paths.h"

namespace fs = std::filesystem;

namespace {

using velk_test::ReadFile;
using velk_test::RunProgram;
using velk_test::TempDir;
using velk_test::WriteFile;

const fs::path kSocket = VELK_SASLAUTHD_SOCKET;
const std::string kMatrix = PAM_WRAPPER_MODULES "/pam_matrix.so";

class Authenticators : public testing::Test {
 protected:
  void SetUp() override {
    if (!velk_test::OwnsSaslauthdSocket()) GTEST_SKIP() << kSocket << " may be in use";
    fs::create_directories(kSocket.parent_path());
    fs::remove(kSocket);
    // The last field is the service that account management lets the account use.
    WriteFile(folder.File("accounts"),
              "alice:s3cret:velk\nlocked:s3cret:nothing\nodd%:strange % pass:velk\n");
    fs::create_directory(folder.File("pam.d"));
    const std::string with_accounts = kMatrix + " passdb=" + folder.File("accounts");
    UseService("auth required " + with_accounts + "\naccount required " + with_accounts + "\n");
  }

  void UseService(const std::string &rules) { WriteFile(folder.File("pam.d/velk"), rules); }

  /// What pam_wrapper needs to know.
  std::vector<std::string> Wrapped() const {
    return {"LD_PRELOAD=libpam_wrapper.so", "PAM_WRAPPER=1",
            "PAM_WRAPPER_SERVICE_DIR=" + folder.File("pam.d"), "REMOTE_ADDR=192.0.2.7"};
  }

  std::string Login(const std::string &name, const std::string &password) const {
    return RunProgram({VELKCGI_LOGIN_PROGRAM, name}, password, Wrapped()).out;
  }

  TempDir folder;
};

TEST_F(Authenticators, PamAcceptsTheRightPassword) {
  EXPECT_EQ("1 alice", Login("alice", "s3cret").substr(0, 7));
}

TEST_F(Authenticators, PamRefusesAWrongPassword) {
  EXPECT_EQ("0 ", Login("alice", "wrong").substr(0, 2));
}

TEST_F(Authenticators, PamRefusesAnUnknownAccount) {
  EXPECT_EQ("0 ", Login("mallory", "s3cret").substr(0, 2));
}

TEST_F(Authenticators, PamRefusesAnAccountThatIsLocked) {
  EXPECT_EQ("0 ", Login("locked", "s3cret").substr(0, 2));
}

TEST_F(Authenticators, PamRefusesEverybodyWhenAccountManagementDoes) {
  UseService("auth required " + kMatrix + " passdb=" + folder.File("accounts") +
             "\naccount required pam_deny.so\n");
  EXPECT_EQ("0 ", Login("alice", "s3cret").substr(0, 2));
}

TEST_F(Authenticators, PamQuestionsThatAreShownAreNotAnsweredWithThePassword) {
  UseService("auth required " + kMatrix + " echo passdb=" + folder.File("accounts") +
             "\naccount required pam_permit.so\n");
  EXPECT_EQ("0 ", Login("alice", "s3cret").substr(0, 2));
}

TEST_F(Authenticators, PamMessagesAreIgnored) {
  UseService("auth optional " PAM_WRAPPER_MODULES
             "/pam_chatty.so info error num_lines=5\n"
             "auth required " +
             kMatrix + " passdb=" + folder.File("accounts") + "\naccount required pam_permit.so\n");
  EXPECT_EQ("1 alice", Login("alice", "s3cret").substr(0, 7));
}

TEST_F(Authenticators, PamMessagesMayComeWithoutRoomForAnAnswer) {
  UseService("auth required " + kMatrix + " verbose passdb=" + folder.File("accounts") +
             "\naccount required pam_permit.so\n");
  EXPECT_EQ("1 alice", Login("alice", "s3cret").substr(0, 7));
  EXPECT_EQ("0 ", Login("alice", "wrong").substr(0, 2));
}

TEST_F(Authenticators, PamIsToldTheVisitorsAddress) {
  UseService(
      "auth required pam_permit.so\n"
      "account [success=1 default=ignore] pam_succeed_if.so quiet rhost = 192.0.2.7\n"
      "account requisite pam_deny.so\n"
      "account required pam_permit.so\n");
  EXPECT_EQ("1 nobody", Login("nobody", "s3cret").substr(0, 8));
}

TEST_F(Authenticators, PamMayChangeTheNameOfTheAccount) {
  UseService("auth required " PAM_WRAPPER_MODULES
             "/pam_set_items.so\n"
             "auth required pam_permit.so\naccount required pam_permit.so\n");
  std::vector<std::string> environment = Wrapped();
  environment.push_back("PAM_USER=Alice.Real");
  EXPECT_EQ("1 Alice.Real",
            RunProgram({VELKCGI_LOGIN_PROGRAM, "alice"}, "s3cret", environment).out.substr(0, 12));
}

TEST_F(Authenticators, AMissingPamServiceRefusesEverybody) {
  fs::remove(folder.File("pam.d/velk"));
  WriteFile(folder.File("pam.d/other"),
            "auth required pam_deny.so\naccount required pam_deny.so\n");
  EXPECT_EQ("0 ", Login("alice", "s3cret").substr(0, 2));
}

/// A saslauthd of our own, on the socket that the library asks.
class Saslauthd {
 public:
  explicit Saslauthd(const std::vector<std::string> &environment) {
    pid_ = fork();
    if (pid_ == 0) {
      setsid();  // at its end it sends SIGTERM to its whole process group
      for (const std::string &variable : environment) putenv(const_cast<char *>(variable.c_str()));
      if (freopen("/dev/null", "w", stderr) == nullptr) _exit(126);
      execl("/usr/sbin/saslauthd", "saslauthd", "-d", "-n", "1", "-a", "pam", "-m",
            kSocket.parent_path().c_str(), nullptr);
      _exit(127);
    }
    for (int i = 0; i < 500 && !fs::exists(kSocket); ++i) {
      std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    EXPECT_TRUE(fs::exists(kSocket)) << "saslauthd did not start";
  }
  ~Saslauthd() {
    kill(pid_, SIGTERM);
    waitpid(pid_, nullptr, 0);
    RemoveWrapperFolder();
    for (const char *left : {"mux", "mux.accept", "saslauthd.pid", "saslauthd.pid.lock"}) {
      fs::remove(kSocket.parent_path() / left);
    }
  }

 private:
  /// A process that a signal ends leaves what pam_wrapper has copied for it, with its id inside.
  void RemoveWrapperFolder() const {
    for (const auto &entry : fs::directory_iterator("/tmp")) {
      const bool ours = entry.path().filename().string().starts_with("pam.") &&
                        ReadFile(entry.path() / "pid") == std::to_string(pid_);
      if (ours) fs::remove_all(entry.path());
    }
  }

  pid_t pid_;
};

TEST_F(Authenticators, SaslauthdAnswersForTheProcess) {
  const Saslauthd daemon(Wrapped());
  // The process itself has no PAM service that would accept anybody. Wrapped modules keep copies
  // of a password, so only here can be seen that the library keeps none.
  const auto login = [](const std::string &name, const std::string &password) {
    return RunProgram({VELKCGI_LOGIN_PROGRAM, name}, password).out;
  };
  EXPECT_EQ("1 alice", login("alice", "s3cret"));
  EXPECT_EQ("0 ", login("alice", "wrong"));
  EXPECT_EQ("0 ", login("locked", "s3cret"));
  EXPECT_EQ("0 ", login("mallory", "s3cret"));
  EXPECT_EQ("1 odd%", login("odd%", "strange % pass"));
}

TEST_F(Authenticators, SaslauthdsRefusalIsNotTriedAgainThroughPam) {
  const Saslauthd daemon(Wrapped());
  const TempDir generous;
  WriteFile(generous.File("velk"), "auth required pam_permit.so\naccount required pam_permit.so\n");
  std::vector<std::string> environment = Wrapped();
  environment.push_back("PAM_WRAPPER_SERVICE_DIR=" + generous.path());
  EXPECT_EQ("0 ", RunProgram({VELKCGI_LOGIN_PROGRAM, "alice"}, "wrong", environment).out);
  EXPECT_EQ("1 alice", RunProgram({VELKCGI_LOGIN_PROGRAM, "alice"}, "s3cret", environment).out);
}

}  // namespace
