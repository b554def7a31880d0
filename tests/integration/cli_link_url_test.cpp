// The URL of a link from the command line, and its QR code, read as a camera would.

#include <sys/stat.h>

#include <filesystem>

#include "integration/cli_support.h"
#include "support/build_folders.h"
#include "velk_paths.h"

namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using velk_test::Outcome;
using velk_test::RunOnTerminal;
using velk_test::RunProgram;
using velk_test::TempDir;
using velk_test::WriteFile;

const std::string kConfig = VELK_ROOT "/etc/sharing-url.conf";
const std::string kProgram = VELK_ROOT "/bin/velksharingurl";

class CliLinkUrl : public velk_test::CommandLine {
 protected:
  void SetUp() override {
    CommandLine::SetUp();
    if (IsSkipped()) return;
    WriteFile(kConfig, "external_host = share.example.org\nexternal_port = 8443\nhttps = yes\n");
  }
  void TearDown() override {
    CommandLine::TearDown();
    if (velk_test::OwnsVelkRoot()) std::filesystem::remove(kConfig);
  }

  static std::string UrlOf(const std::string &hash) {
    return "https://share.example.org:8443/sharing/" + hash;
  }

  /// What a camera reads.
  static std::string Read(const std::string &file) {
    const Outcome outcome =
        RunProgram({VELK_SOURCE_DIR "/tests/integration/read_qr_code.py", file});
    EXPECT_EQ(0, outcome.status) << outcome.err;
    return outcome.out.substr(0, outcome.out.find('\n'));
  }

  const TempDir folder_;
};

/// Puts the program aside while it lives.
class MissingProgram {
 public:
  MissingProgram() { std::filesystem::rename(kProgram, kProgram + ".aside"); }
  ~MissingProgram() { std::filesystem::rename(kProgram + ".aside", kProgram); }
};

TEST_F(CliLinkUrl, IsThatOfTheConfiguration) {
  const std::string hash = MakeLink();
  EXPECT_EQ(UrlOf(hash) + "\n", Run({"link", "url", hash}).out);
}

TEST_F(CliLinkUrl, HasAKindInJson) {
  const std::string hash = MakeLink();
  const Json::Value json = RunJson({"link", "url", hash});
  EXPECT_EQ(hash, json["hash"].asString());
  EXPECT_EQ(UrlOf(hash), json["url"].asString());
  EXPECT_EQ(2, json["type"].asInt());
}

TEST_F(CliLinkUrl, OfAnUnknownLinkIsRefused) {
  MakeLink();
  const Outcome outcome = Run({"link", "url", "unknown"});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("“unknown”"));
}

TEST_F(CliLinkUrl, AMistakeInTheConfigurationIsTold) {
  const std::string hash = MakeLink();
  WriteFile(kConfig, "external_port = none\n");
  const Outcome outcome = Run({"link", "url", hash});
  EXPECT_EQ(3, outcome.status);
  EXPECT_EQ("", outcome.out);
  EXPECT_THAT(outcome.err, AllOf(HasSubstr(kConfig + ":1: external_port"),
                                 HasSubstr("velksharing: the URL cannot be had")));
}

TEST_F(CliLinkUrl, AMissingProgramIsNamed) {
  const std::string hash = MakeLink();
  const MissingProgram missing;
  const Outcome outcome = Run({"link", "url", hash});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr(kProgram + ": No such file"));
}

TEST_F(CliLinkUrl, AQrCodeSaysTheUrl) {
  const std::string hash = MakeLink();
  const std::string out = Run({"link", "url", hash, "--qr"}).out;
  const std::string first_line = UrlOf(hash) + "\n";
  ASSERT_EQ(first_line, out.substr(0, first_line.size()));
  EXPECT_THAT(out, Not(HasSubstr("\x1b"))) << "a file has no colours";
  WriteFile(folder_.File("code"), out.substr(first_line.size()));
  EXPECT_EQ(UrlOf(hash), Read(folder_.File("code")));
}

TEST_F(CliLinkUrl, ATerminalShowsTheQrCodeInBlackOnWhite) {
  const std::string hash = MakeLink();
  const Outcome outcome = RunOnTerminal({"link", "url", hash, "--qr"}, {});
  EXPECT_EQ(0, outcome.status);
  EXPECT_THAT(outcome.out, HasSubstr("\x1b[38;5;16;48;5;231m"));
  EXPECT_TRUE(outcome.out.ends_with("\x1b[0m\r\n")) << "the terminal keeps its colours";
}

TEST_F(CliLinkUrl, APictureSaysTheUrl) {
  const std::string hash = MakeLink();
  const std::string file = folder_.File("code.svg");
  EXPECT_EQ(UrlOf(hash) + "\n", Run({"link", "url", hash, "--qr-svg", file}).out);
  EXPECT_EQ(UrlOf(hash), Read(file));
  struct stat info = {};
  ASSERT_EQ(0, stat(file.c_str(), &info));
  EXPECT_EQ(0600u, info.st_mode & 07777u);
}

TEST_F(CliLinkUrl, APictureGoesTogetherWithJson) {
  const std::string hash = MakeLink();
  EXPECT_EQ(UrlOf(hash),
            RunJson({"link", "url", hash, "--qr-svg", folder_.File("code.svg")})["url"].asString());
  EXPECT_EQ(UrlOf(hash), Read(folder_.File("code.svg")));
}

TEST_F(CliLinkUrl, APictureReplacesNothing) {
  const std::string hash = MakeLink();
  WriteFile(folder_.File("code.svg"), "mine");
  const Outcome outcome = Run({"link", "url", hash, "--qr-svg", folder_.File("code.svg")});
  EXPECT_EQ(1, outcome.status);
  EXPECT_EQ("", outcome.out);
  EXPECT_THAT(outcome.err, HasSubstr("code.svg exists"));
  EXPECT_EQ("mine", velk_test::ReadFile(folder_.File("code.svg")));
}

TEST_F(CliLinkUrl, APictureThatCannotBeMadeLeavesNothing) {
  const std::string hash = MakeLink();
  EXPECT_EQ(2, Run({"link", "url", hash, "--qr-svg", ""}).status);
  EXPECT_EQ(3, Run({"link", "url", hash, "--qr-svg", folder_.File("no/code.svg")}).status);
  // A picture that is larger than what the database needs beside itself.
  WriteFile(kConfig, "external_host = h\npath = /" + std::string(2000, 'a') + "/\n");
  const Outcome outcome = RunProgram({"/bin/sh", "-c",
                                      "trap '' XFSZ; ulimit -f 128; exec " VELK_BINARY_DIR
                                      "/bin/velksharing link url " +
                                          hash + " --qr-svg " + folder_.File("code.svg")});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("code.svg could not be written"));
  EXPECT_TRUE(std::filesystem::is_empty(folder_.path()));
}

TEST_F(CliLinkUrl, ALongUrlIsRefusedAsAQrCodeOnly) {
  const std::string hash = MakeLink();
  WriteFile(kConfig, "external_host = h\npath = /" + std::string(2400, 'a') + "/\n");
  EXPECT_EQ(0, Run({"link", "url", hash}).status);
  const Outcome outcome = Run({"link", "url", hash, "--qr"});
  EXPECT_EQ(1, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("too long for a QR code"));
}

TEST_F(CliLinkUrl, JsonAndAQrCodeOnTheScreenExcludeEachOther) {
  EXPECT_EQ(2, Run({"link", "url", MakeLink(), "--qr", "--json"}).status);
}

}  // namespace
