// The program that prints a link's public URL, by its command line and its configuration.

#include <filesystem>

#include "integration/cli_support.h"
#include "support/build_folders.h"
#include "velk_paths.h"

namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::StartsWith;
using velk_test::Outcome;
using velk_test::RunProgram;
using velk_test::TempDir;
using velk_test::WriteFile;

const std::string kConfig = VELK_ROOT "/etc/sharing-url.conf";

class VelkSharingUrl : public testing::Test {
 protected:
  void SetUp() override {
    if (!velk_test::OwnsVelkRoot()) GTEST_SKIP() << VELK_ROOT " may be in use";
    std::filesystem::remove_all(kConfig);
  }
  void TearDown() override {
    if (velk_test::OwnsVelkRoot()) std::filesystem::remove_all(kConfig);
  }

  static Outcome Run(std::vector<std::string> arguments,
                     const std::vector<std::string> &environment = {}) {
    arguments.insert(arguments.begin(), VELK_ROOT "/bin/velksharingurl");
    return RunProgram(arguments, "", environment);
  }

  /// What it prints for arguments that are right.
  static std::string Printed(const std::vector<std::string> &arguments,
                             const std::vector<std::string> &environment = {}) {
    const Outcome outcome = Run(arguments, environment);
    EXPECT_EQ(0, outcome.status) << outcome.err;
    EXPECT_EQ("", outcome.err);
    return outcome.out;
  }

  /// The URL for a host of the caller's, where the rest is left to the program.
  static std::string UrlOf(const std::string &hash, const std::string &host,
                           const std::string &path = "") {
    const std::string out = Printed({hash, "0", "1", host, path});
    return out.substr(0, out.find('\n'));
  }

  /// The message for arguments or a configuration that are wrong.
  static std::string Refused(const std::vector<std::string> &arguments) {
    const Outcome outcome = Run(arguments);
    EXPECT_EQ(2, outcome.status) << outcome.out;
    EXPECT_EQ("", outcome.out);
    return outcome.err;
  }
};

/// A machine whose name the test chooses.
class VelkSharingUrlOnAMachine : public VelkSharingUrl {
 protected:
  std::vector<std::string> Named(const std::string &name, const std::string &hosts) const {
    WriteFile(folder_.File("hosts"), hosts);
    return {"LD_PRELOAD=libnss_wrapper.so", "NSS_WRAPPER_HOSTNAME=" + name,
            "NSS_WRAPPER_HOSTS=" + folder_.File("hosts")};
  }

 private:
  const TempDir folder_;
};

TEST_F(VelkSharingUrl, PrintsTheUrlAndItsKind) {
  EXPECT_EQ("https://example.org/sharing/aB3xK9pQ2\n1\n",
            Printed({"aB3xK9pQ2", "0", "1", "example.org", ""}));
  EXPECT_EQ("http://example.org:8080/s/aB3xK9pQ2\n1\n",
            Printed({"aB3xK9pQ2", "8080", "0", "example.org", "/s/"}));
}

TEST_F(VelkSharingUrl, LeavesTheSchemesOwnPortOut) {
  EXPECT_EQ("https://h/sharing/x\n1\n", Printed({"x", "443", "1", "h", ""}));
  EXPECT_EQ("http://h/sharing/x\n1\n", Printed({"x", "80", "0", "h", ""}));
  EXPECT_EQ("https://h:80/sharing/x\n1\n", Printed({"x", "80", "1", "h", ""}));
  EXPECT_EQ("http://h:443/sharing/x\n1\n", Printed({"x", "443", "0", "h", ""}));
  EXPECT_EQ("http://h:65535/sharing/x\n1\n", Printed({"x", "65535", "0", "h", ""}));
}

TEST_F(VelkSharingUrl, APathBeginsAndEndsWithASlash) {
  EXPECT_EQ("https://h/s/x", UrlOf("x", "h", "s"));
  EXPECT_EQ("https://h/s/x", UrlOf("x", "h", "/s"));
  EXPECT_EQ("https://h/s/t/x", UrlOf("x", "h", "s/t/"));
  EXPECT_EQ("https://h/x", UrlOf("x", "h", "/"));
}

TEST_F(VelkSharingUrl, EncodesWhatHasAMeaningInUrls) {
  EXPECT_EQ("https://h/sharing/aZ09-._~", UrlOf("aZ09-._~", "h"));
  EXPECT_EQ("https://h/sharing/%2F%3F%23%25%20%0A%C3%BC%FF", UrlOf("/?#% \nü\xff", "h"));
  EXPECT_EQ("https://h/a%20b/%3F%23%2520%C3%BC/x", UrlOf("x", "h", "/a b/?#%20ü/"));
}

TEST_F(VelkSharingUrl, TakesHostNamesAndAddresses) {
  EXPECT_EQ("https://a-1.B.xn--bcher-kva.example/sharing/x",
            UrlOf("x", "a-1.B.xn--bcher-kva.example"));
  EXPECT_EQ("https://example.org/sharing/x", UrlOf("x", "example.org."));
  EXPECT_EQ("https://192.0.2.7/sharing/x", UrlOf("x", "192.0.2.7"));
  EXPECT_EQ("https://[2001:db8::1]/sharing/x", UrlOf("x", "2001:DB8:0::1"));
  EXPECT_EQ("https://[2001:db8::1]/sharing/x", UrlOf("x", "[2001:db8::1]"));
  EXPECT_EQ("https://[::ffff:192.0.2.7]/sharing/x", UrlOf("x", "::ffff:192.0.2.7"));
  const std::string label(63, 'a');
  const std::string longest = label + "." + label + "." + label + "." + std::string(61, 'a');
  EXPECT_EQ("https://" + longest + "/sharing/x", UrlOf("x", longest));
  EXPECT_EQ("https://" + longest + "/sharing/x", UrlOf("x", longest + "."));
}

TEST_F(VelkSharingUrl, RefusesWhatIsNoHost) {
  const std::string label(63, 'a');
  for (const std::string &host : {std::string("."),
                                  std::string(".."),
                                  std::string("a..b"),
                                  std::string(".a"),
                                  std::string(" "),
                                  std::string("a b"),
                                  std::string("a/b"),
                                  std::string("a@b"),
                                  std::string("a_b"),
                                  std::string("-a"),
                                  std::string("a-.b"),
                                  std::string("bücher.example"),
                                  std::string("a\xff"),
                                  std::string("a\nb"),
                                  std::string("h:80"),
                                  std::string("1.2.3"),
                                  std::string("1.2.3.4.5"),
                                  std::string("256.1.1.1"),
                                  std::string("example.7"),
                                  std::string("[]"),
                                  std::string("["),
                                  std::string("[::1"),
                                  std::string("::1]"),
                                  std::string("[::1]:80"),
                                  std::string("[1.2.3.4]"),
                                  std::string("1::2::3"),
                                  std::string("fe80::1%eth0"),
                                  std::string(64, 'a'),
                                  label + "." + label + "." + label + "." + std::string(62, 'a')}) {
    EXPECT_THAT(Refused({"x", "0", "1", host, ""}), StartsWith("velksharingurl: HOST ")) << host;
  }
}

TEST_F(VelkSharingUrl, NamesTheArgumentThatIsWrong) {
  EXPECT_THAT(Refused({"", "0", "1", "h", ""}), StartsWith("velksharingurl: HASH is empty"));
  for (const char *hash : {".", ".."})
    EXPECT_THAT(Refused({hash, "0", "1", "h", ""}), StartsWith("velksharingurl: HASH "));
  for (const char *port :
       {"", "-1", "-0", "+1", "65536", "99999999999", "80x", "8 0", "0x50", "1.5"})
    EXPECT_THAT(Refused({"x", port, "1", "h", ""}), StartsWith("velksharingurl: PORT ")) << port;
  for (const char *https : {"", "2", "yes", "01"})
    EXPECT_THAT(Refused({"x", "0", https, "h", ""}), StartsWith("velksharingurl: HTTPS "));
  for (const char *path : {".", "..", "/../", "a/./b", "a/.."})
    EXPECT_THAT(Refused({"x", "0", "1", "h", path}), StartsWith("velksharingurl: PATH ")) << path;
}

TEST_F(VelkSharingUrl, NeedsExactlyFiveArguments) {
  const std::vector<std::string> arguments = {"x", "0", "1", "h", "/", "more"};
  for (const std::size_t count : {0, 1, 4, 6}) {
    EXPECT_THAT(Refused({arguments.begin(), arguments.begin() + count}),
                HasSubstr("usage: velksharingurl HASH PORT HTTPS HOST PATH"));
  }
}

TEST_F(VelkSharingUrl, RefusesAUrlThatNobodyReadsWhole) {
  const std::string before = "https://h/sharing/";
  const std::string longest(4094 - before.size(), 'a');
  EXPECT_EQ(before + longest, UrlOf(longest, "h"));
  EXPECT_THAT(Refused({longest + "a", "0", "1", "h", ""}), HasSubstr("4095 bytes"));
}

TEST_F(VelkSharingUrl, AFullOutputIsAnError) {
  const Outcome outcome =
      RunProgram({"/bin/sh", "-c", "exec " VELK_ROOT "/bin/velksharingurl x 0 1 h '' >/dev/full"});
  EXPECT_EQ(3, outcome.status);
  EXPECT_THAT(outcome.err, HasSubstr("could not be written"));
}

TEST_F(VelkSharingUrl, TellsHowItIsUsedAndItsVersion) {
  EXPECT_THAT(Printed({"--help"}), AllOf(StartsWith("usage: "), HasSubstr("Example:\n")));
  EXPECT_THAT(Printed({"--version"}), StartsWith("velksharingurl 6."));
  EXPECT_EQ("https://h/sharing/--help\n1\n", Printed({"--help", "0", "1", "h", ""}));
}

TEST_F(VelkSharingUrl, AHostThatIsNotGivenIsTheConfiguredOne) {
  WriteFile(kConfig, "external_host = share.example.org\n");
  EXPECT_EQ("http://share.example.org/sharing/x\n2\n", Printed({"x", "0", "0", "", ""}));
  EXPECT_EQ("https://share.example.org:8443/s/x\n2\n", Printed({"x", "8443", "1", "", "s"}));
}

TEST_F(VelkSharingUrl, TheConfigurationTellsPortSchemeAndPath) {
  WriteFile(
      kConfig,
      "# as seen from outside\n\n\texternal_host=[2001:db8::7]\r\nexternal_port = 8443 # one\n"
      "https = yes\npath = a b\n");
  EXPECT_EQ("https://[2001:db8::7]:8443/a%20b/x\n2\n", Printed({"x", "0", "0", "", ""}));
}

TEST_F(VelkSharingUrl, ArgumentsWinOverTheConfiguration) {
  WriteFile(kConfig, "external_host = h\nexternal_port = 8080\nhttps = no\npath = /a/\n");
  EXPECT_EQ("https://h:9/b/x\n2\n", Printed({"x", "9", "1", "", "/b/"}));
}

TEST_F(VelkSharingUrl, AnotherHostHasNothingOfTheConfigurationButThePath) {
  WriteFile(kConfig, "external_host = h\nexternal_port = 8443\nhttps = yes\npath = /a/\n");
  EXPECT_EQ("http://lan/a/x\n1\n", Printed({"x", "0", "0", "lan", ""}));
}

TEST_F(VelkSharingUrl, ADefaultPortMayBeConfigured) {
  WriteFile(kConfig, "external_host = h\nexternal_port = 443\nhttps = 1\n");
  EXPECT_EQ("https://h/sharing/x\n2\n", Printed({"x", "0", "0", "", ""}));
}

TEST_F(VelkSharingUrl, AMistakeInTheConfigurationIsNamedByFileLineAndKey) {
  const auto mistake = [](const std::string &text) {
    WriteFile(kConfig, "# first\n" + text + "\n");
    const std::string message = Refused({"x", "0", "1", "h", ""});
    const std::string where = "velksharingurl: " + kConfig + ":2: ";
    EXPECT_THAT(message, StartsWith(where));
    return message.substr(where.size());
  };
  EXPECT_EQ("unknown key “host”\n", mistake("host = a"));
  EXPECT_EQ("unknown key “?[31mred”\n", mistake("\x1b[31mred = a"));
  EXPECT_EQ("not of the form \"key = value\"\n", mistake("external_host"));
  EXPECT_THAT(mistake("external_host = a_b"), StartsWith("external_host: is no host name"));
  EXPECT_THAT(mistake("external_host ="), StartsWith("external_host: no value"));
  EXPECT_EQ("external_port: not from 1 to 65535\n", mistake("external_port = 0"));
  EXPECT_EQ("external_port: not from 1 to 65535\n", mistake("external_port = 65536"));
  EXPECT_EQ("external_port: not a whole number\n", mistake("external_port = http"));
  EXPECT_EQ("https: not yes or no\n", mistake("https = maybe"));
  EXPECT_THAT(mistake("path = /a/../b"), StartsWith("path: holds a part"));
}

TEST_F(VelkSharingUrl, AKeyThatIsGivenTwiceIsAMistake) {
  WriteFile(kConfig, "https = yes\nhttps = yes\n");
  EXPECT_THAT(Refused({"x", "0", "1", "h", ""}), HasSubstr(kConfig + ":2: key given twice"));
}

TEST_F(VelkSharingUrl, AConfigurationThatCannotBeReadIsAMistake) {
  std::filesystem::create_directory(kConfig);
  EXPECT_THAT(Refused({"x", "0", "1", "h", ""}), HasSubstr("cannot read " + kConfig + ": "));
}

TEST_F(VelkSharingUrl, TheExampleOfAConfigurationIsOne) {
  WriteFile(kConfig, velk_test::ReadFile(VELK_SOURCE_DIR "/packaging/sharing-url.conf"));
  EXPECT_EQ("https://h/sharing/x", UrlOf("x", "h"));
}

TEST_F(VelkSharingUrl, TheSettingsOfTheExampleAreOnes) {
  std::string text = velk_test::ReadFile(VELK_SOURCE_DIR "/packaging/sharing-url.conf");
  for (const char *key : {"external_host", "external_port", "https", "path"}) {
    const std::size_t place = text.find("\n#" + std::string(key) + " = ");
    ASSERT_NE(std::string::npos, place) << key;
    text.erase(place + 1, 1);
  }
  WriteFile(kConfig, text);
  EXPECT_EQ("https://sharing.example.org:8443/sharing/x\n2\n", Printed({"x", "0", "0", "", ""}));
}

TEST_F(VelkSharingUrlOnAMachine, TheLastResortIsItsFullName) {
  const auto machine = Named("server", "192.0.2.1 server.example.org server\n");
  EXPECT_EQ("http://server.example.org/sharing/x\n3\n", Printed({"x", "0", "0", "", ""}, machine));
}

TEST_F(VelkSharingUrlOnAMachine, ANameWithoutADotIsNoBetterThanTheHostName) {
  const auto machine = Named("server", "127.0.0.1 localhost server\n");
  EXPECT_EQ("http://server/sharing/x\n3\n", Printed({"x", "0", "0", "", ""}, machine));
}

TEST_F(VelkSharingUrlOnAMachine, TheConfigurationMayTellThePortOnly) {
  WriteFile(kConfig, "external_port = 8443\nhttps = true\n");
  const auto machine = Named("server", "192.0.2.1 server.example.org server\n");
  EXPECT_EQ("https://server.example.org:8443/sharing/x\n3\n",
            Printed({"x", "0", "0", "", ""}, machine));
}

TEST_F(VelkSharingUrlOnAMachine, AnUnfitNameIsAMistakeThatTellsWhatToDo) {
  const Outcome outcome = Run({"x", "0", "0", "", ""},
                              Named("my_server", "192.0.2.1 my_server.example.org my_server\n"));
  EXPECT_EQ(2, outcome.status);
  EXPECT_EQ("", outcome.out);
  EXPECT_THAT(outcome.err, AllOf(HasSubstr("the machine's own name"), HasSubstr(kConfig)));
}

}  // namespace
