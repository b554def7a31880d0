// The current request: parameters, cookies and the client's address.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/time.h>
#include <unistd.h>

#include <cstdlib>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "support/process.h"
#include "support/temp_dir.h"
#include "velk/velkcgi.h"

namespace {

using velk_test::RunForked;

struct FreeView {
  void operator()(VelkCgi *view) const { VelkCgiFree(view); }
};
using View = std::unique_ptr<VelkCgi, FreeView>;

View NewView() {
  VelkCgi *view = nullptr;
  EXPECT_EQ(1, VelkCgiInit(&view, ""));
  return View(view);
}

/// A request handed over to the library while this lives.
class Handed {
 public:
  explicit Handed(std::vector<std::string> environment, std::string body = "")
      : environment_(std::move(environment)), body_(std::move(body)) {
    for (const std::string &variable : environment_) pointers_.push_back(variable.c_str());
    pointers_.push_back(nullptr);
    request_ = {pointers_.data(), body_.data(), body_.size()};
    VelkCgiRequestBegin(&request_);
  }
  ~Handed() { VelkCgiRequestEnd(); }

 private:
  std::vector<std::string> environment_;
  std::string body_;
  std::vector<const char *> pointers_;
  VelkCgiRequest request_;
};

const char kForm[] = "CONTENT_TYPE=application/x-www-form-urlencoded";

std::string Param(const std::string &name) {
  const View view = NewView();
  return VelkCgiGetRequestParam(view.get(), name.c_str(), "(absent)");
}

std::string QueryParam(const std::string &query, const std::string &name) {
  const Handed request({"QUERY_STRING=" + query});
  return Param(name);
}

std::string RemoteIp(const std::string &value) {
  const Handed request({"REMOTE_ADDR=" + value});
  char out[65] = "";
  return VelkCgiGetRemoteIP(out, sizeof(out)) == 0 ? out : "(failed)";
}

std::string CookieOf(const std::string &header, const std::string &name) {
  const Handed request({"HTTP_COOKIE=" + header});
  const View view = NewView();
  EXPECT_EQ(1, VelkCgiLoadInCookies(view.get()));
  const char *value = VelkCgiGetCookie(view.get(), name.c_str());
  return value == nullptr ? "(absent)" : value;
}

// ---- parameters of the query

TEST(VelkCgiQuery, GivesAParameter) {
  EXPECT_EQ("1", QueryParam("a=1&b=2", "a"));
  EXPECT_EQ("2", QueryParam("a=1&b=2", "b"));
  EXPECT_EQ("(absent)", QueryParam("a=1&b=2", "c"));
  EXPECT_EQ("(absent)", QueryParam("", "a"));
  EXPECT_EQ("(absent)", QueryParam("aa=1", "a"));
}

TEST(VelkCgiQuery, GivesAnEmptyValueAsEmpty) {
  EXPECT_EQ("", QueryParam("a=", "a"));
  EXPECT_EQ("", QueryParam("a", "a"));
  EXPECT_EQ("", QueryParam("x=1&a&y=2", "a"));
}

TEST(VelkCgiQuery, GivesTheFirstOfEqualNames) {
  EXPECT_EQ("1", QueryParam("a=1&a=2", "a"));
}

TEST(VelkCgiQuery, KeepsFurtherEqualSignsInTheValue) {
  EXPECT_EQ("b=c=", QueryParam("a=b=c=", "a"));
}

TEST(VelkCgiQuery, DecodesPlusAndEscapes) {
  EXPECT_EQ("a b+c&d", QueryParam("v=a+b%2Bc%26d", "v"));
  EXPECT_EQ("\xc3\xa4", QueryParam("v=%c3%A4", "v"));
  EXPECT_EQ("1", QueryParam("my%20name=1", "my name"));
}

TEST(VelkCgiQuery, KeepsBrokenEscapesAsTheyAre) {
  EXPECT_EQ("%", QueryParam("v=%", "v"));
  EXPECT_EQ("%4", QueryParam("v=%4", "v"));
  EXPECT_EQ("%zz%A", QueryParam("v=%zz%A", "v"));
  EXPECT_EQ("%A", QueryParam("v=%%41", "v"));
}

TEST(VelkCgiQuery, AValueWithAZeroByteIsAbsent) {
  EXPECT_EQ("(absent)", QueryParam("v=a%00b", "v"));
  EXPECT_EQ("(absent)", QueryParam("v%00=1", "v"));
}

TEST(VelkCgiQuery, SurvivesMegabytes) {
  const std::string large(10 << 20, 'x');
  EXPECT_EQ(large, QueryParam("v=" + large + "&w=1", "v"));
  EXPECT_EQ("1", QueryParam("v=" + large + "&w=1", "w"));
  EXPECT_EQ("1", QueryParam(std::string(1 << 20, '&') + "w=1", "w"));
}

TEST(VelkCgiQuery, AbsentParameterIsTheFallbackItself) {
  const Handed request({"QUERY_STRING=a=1"});
  const View view = NewView();
  const char fallback[] = "x";
  EXPECT_EQ(fallback, VelkCgiGetRequestParam(view.get(), "b", fallback));
  EXPECT_EQ(nullptr, VelkCgiGetRequestParam(view.get(), "b", nullptr));
  EXPECT_EQ(fallback, VelkCgiGetRequestParam(view.get(), nullptr, fallback));
  EXPECT_EQ(fallback, VelkCgiGetRequestParam(nullptr, "a", fallback));
}

TEST(VelkCgiQuery, GivenTextsStayValidUntilTheViewIsFreed) {
  const View view = NewView();
  const char *first = nullptr;
  {
    const Handed request({"QUERY_STRING=a=first-value-that-is-long-enough"});
    first = VelkCgiGetRequestParam(view.get(), "a", nullptr);
  }
  const Handed request({"QUERY_STRING=a=2"});
  EXPECT_STREQ("2", VelkCgiGetRequestParam(view.get(), "a", nullptr));
  EXPECT_STREQ("first-value-that-is-long-enough", first);
}

// ---- which request is the current one

TEST(VelkCgiRequest, IsTheProcessEnvironmentAsItStandsAtTheTimeOfTheCall) {
  const View view = NewView();
  setenv("QUERY_STRING", "a=1", 1);
  EXPECT_STREQ("1", VelkCgiGetRequestParam(view.get(), "a", nullptr));
  setenv("QUERY_STRING", "a=2", 1);
  EXPECT_STREQ("2", VelkCgiGetRequestParam(view.get(), "a", nullptr));
  unsetenv("QUERY_STRING");
  EXPECT_EQ(nullptr, VelkCgiGetRequestParam(view.get(), "a", nullptr));
}

TEST(VelkCgiRequest, HandedOverHidesTheProcessEnvironmentUntilItsEnd) {
  setenv("QUERY_STRING", "a=process", 1);
  {
    const Handed request({"REMOTE_ADDR=192.0.2.1"});
    EXPECT_EQ("(absent)", Param("a"));
  }
  EXPECT_EQ("process", Param("a"));
  unsetenv("QUERY_STRING");
}

TEST(VelkCgiRequest, BeginWithNullIsAnEnd) {
  const Handed request({"QUERY_STRING=a=1"});
  VelkCgiRequestBegin(nullptr);
  EXPECT_EQ("(absent)", Param("a"));
}

TEST(VelkCgiRequest, IsEachThreadsOwn) {
  const Handed request({"QUERY_STRING=a=here"});
  std::string before;
  std::string during;
  std::thread([&] {
    before = Param("a");
    const Handed other({"QUERY_STRING=a=there"});
    during = Param("a");
  }).join();
  EXPECT_EQ("(absent)", before);
  EXPECT_EQ("there", during);
  EXPECT_EQ("here", Param("a"));
}

TEST(VelkCgiRequest, ToleratesAMissingEnvironmentAndBody) {
  const VelkCgiRequest empty = {nullptr, nullptr, 0};
  VelkCgiRequestBegin(&empty);
  EXPECT_EQ("(absent)", Param("a"));
  char out[65];
  EXPECT_EQ(-1, VelkCgiGetRemoteIP(out, sizeof(out)));
  const char *const form[] = {kForm, nullptr};
  const VelkCgiRequest lying = {form, nullptr, 10};
  VelkCgiRequestBegin(&lying);
  EXPECT_EQ("(absent)", Param("a"));
  VelkCgiRequestEnd();
}

TEST(VelkCgiRequest, NeedsSomewhereToPutAView) {
  EXPECT_EQ(0, VelkCgiInit(nullptr, ""));
  VelkCgiFree(nullptr);
}

// ---- parameters of the body

TEST(VelkCgiBody, IsReadWhereTheQueryLacksAParameter) {
  const Handed request({"QUERY_STRING=a=query", kForm}, "a=body&b=a+body");
  EXPECT_EQ("query", Param("a"));
  EXPECT_EQ("a body", Param("b"));
}

TEST(VelkCgiBody, ItsTypeMayBeOfAnyCaseAndHaveParameters) {
  for (const char *type :
       {"application/x-www-form-urlencoded; charset=UTF-8", "Application/X-WWW-Form-URLencoded",
        "application/x-www-form-urlencoded ;x", "application/x-www-form-urlencoded"}) {
    const Handed request({std::string("CONTENT_TYPE=") + type}, "a=1");
    EXPECT_EQ("1", Param("a")) << type;
  }
}

TEST(VelkCgiBody, OfAnotherTypeIsNotLookedAt) {
  for (const char *type :
       {"multipart/form-data", "application/x-www-form-urlencodedx", "", "text"}) {
    const Handed request({std::string("CONTENT_TYPE=") + type}, "a=1");
    EXPECT_EQ("(absent)", Param("a")) << type;
  }
  const Handed request({"QUERY_STRING="}, "a=1");
  EXPECT_EQ("(absent)", Param("a"));
}

TEST(VelkCgiBody, OfOneMebibyteIsReadAndALargerOneIsNot) {
  const std::string filler(((1 << 20) - 4), 'x');
  {
    const Handed request({kForm}, filler + "&a=1");
    EXPECT_EQ("1", Param("a"));
  }
  const Handed request({kForm}, filler + "x&a=1");
  EXPECT_EQ("(absent)", Param("a"));
}

TEST(VelkCgiBody, MayHoldZeroBytes) {
  const Handed request({kForm}, std::string("z=\0&a=1", 7));
  EXPECT_EQ("1", Param("a"));
  EXPECT_EQ("(absent)", Param("z"));
}

// ---- the body of a plain CGI process

/// Runs `body` as a CGI process whose standard input is fed with `pieces`, a little apart.
int RunAsCgi(const std::vector<std::string> &variables, const std::vector<std::string> &pieces,
             const std::function<int()> &body) {
  return RunForked([&] {
    int ends[2];
    if (pipe(ends) != 0) return 100;
    for (const std::string &variable : variables) putenv(const_cast<char *>(variable.c_str()));
    dup2(ends[0], STDIN_FILENO);
    std::thread feeder([&] {
      for (const std::string &piece : pieces) {
        if (write(ends[1], piece.data(), piece.size()) < 0) return;
        usleep(20000);
      }
      close(ends[1]);
    });
    const int outcome = body();
    feeder.join();
    return outcome;
  });
}

std::vector<std::string> Post(const std::string &length) {
  return {"REQUEST_METHOD=POST", kForm, "CONTENT_LENGTH=" + length};
}

TEST(VelkCgiStandardInput, IsReadInAsManyPiecesAsItComes) {
  EXPECT_EQ(
      0, RunAsCgi(Post("9"), {"a=", "1&b", "=2%", "3"}, [] { return Param("a") == "1" ? 0 : 1; }));
}

TEST(VelkCgiStandardInput, ServesEveryViewOfTheRequest) {
  EXPECT_EQ(0, RunAsCgi(Post("7"), {"a=1&b=2"}, [] {
              return Param("a") == "1" && Param("b") == "2" && Param("c") == "(absent)" ? 0 : 1;
            }));
}

TEST(VelkCgiStandardInput, IsReadNoFurtherThanAnnounced) {
  EXPECT_EQ(0, RunAsCgi(Post("3"), {"a=12345"}, [] {
              if (Param("a") != "1") return 1;
              char rest[8] = "";
              return read(STDIN_FILENO, rest, sizeof(rest)) == 4 ? 0 : 2;
            }));
}

TEST(VelkCgiStandardInput, IsLeftAloneWhenTheQueryHasTheParameter) {
  std::vector<std::string> variables = Post("3");
  variables.push_back("QUERY_STRING=a=query");
  EXPECT_EQ(0, RunAsCgi(variables, {"a=1"}, [] {
              if (Param("a") != "query") return 1;
              char body[8] = "";
              return read(STDIN_FILENO, body, sizeof(body)) == 3 ? 0 : 2;
            }));
}

TEST(VelkCgiStandardInput, IsLeftAloneForAMethodOtherThanPost) {
  EXPECT_EQ(0, RunAsCgi({"REQUEST_METHOD=GET", kForm, "CONTENT_LENGTH=3"}, {"a=1"}, [] {
              if (Param("a") != "(absent)") return 1;
              char body[8] = "";
              return read(STDIN_FILENO, body, sizeof(body)) == 3 ? 0 : 2;
            }));
}

TEST(VelkCgiStandardInput, CutShortCountsAsAbsent) {
  EXPECT_EQ(0, RunAsCgi(Post("4"), {"a=1"}, [] { return Param("a") == "(absent)" ? 0 : 1; }));
}

TEST(VelkCgiStandardInput, OfAStrangeLengthCountsAsAbsent) {
  for (const char *length :
       {"", "-3", "+3", " 3", "3x", "0x3", "99999999999999999999", "1048577"}) {
    EXPECT_EQ(0, RunAsCgi(Post(length), {"a=1"}, [] { return Param("a") == "(absent)" ? 0 : 1; }))
        << length;
  }
}

TEST(VelkCgiStandardInput, SurvivesInterruptions) {
  EXPECT_EQ(0, RunAsCgi(Post("7"), {"a=1", "&b", "=2"}, [] {
              struct sigaction ignore {};
              ignore.sa_handler = [](int) {};  // without SA_RESTART
              sigaction(SIGALRM, &ignore, nullptr);
              const itimerval often{{0, 1000}, {0, 1000}};
              setitimer(ITIMER_REAL, &often, nullptr);
              const bool read = Param("b") == "2";
              const itimerval never{};
              setitimer(ITIMER_REAL, &never, nullptr);
              return read ? 0 : 1;
            }));
}

// ---- cookies

TEST(VelkCgiCookies, AreReadFromTheRequest) {
  EXPECT_EQ("1", CookieOf("a=1; b=2", "a"));
  EXPECT_EQ("2", CookieOf("a=1;b=2", "b"));
  EXPECT_EQ("2", CookieOf(" a=1 ;  b=2 ", "b"));
  EXPECT_EQ("(absent)", CookieOf("a=1", "A"));
  EXPECT_EQ("", CookieOf("a=", "a"));
  EXPECT_EQ("x=y", CookieOf("a=x=y", "a"));
}

TEST(VelkCgiCookies, LoseTheQuotesAroundAValue) {
  EXPECT_EQ("1", CookieOf("a=\"1\"", "a"));
  EXPECT_EQ("", CookieOf("a=\"\"", "a"));
}

TEST(VelkCgiCookies, FirstOfEqualNamesCounts) {
  EXPECT_EQ("1", CookieOf("a=1; a=2", "a"));
}

TEST(VelkCgiCookies, PassOverWhatIsNone) {
  EXPECT_EQ("1", CookieOf(";;=x; novalue; b@d=1; c=two words; d=\"; e=\x01; a=1;", "a"));
  EXPECT_EQ("(absent)", CookieOf("c=two words", "c"));
  EXPECT_EQ("(absent)", CookieOf("d=\"", "d"));
  EXPECT_EQ("(absent)", CookieOf("e=\x01", "e"));
  EXPECT_EQ("(absent)", CookieOf("novalue", "novalue"));
}

TEST(VelkCgiCookies, NeedNoHeader) {
  const Handed request({});
  const View view = NewView();
  EXPECT_EQ(1, VelkCgiLoadInCookies(view.get()));
  EXPECT_EQ(nullptr, VelkCgiGetCookie(view.get(), "a"));
}

TEST(VelkCgiCookies, AreStoredInPlaceOfOneWithTheSameName) {
  const Handed request({"HTTP_COOKIE=id=old"});
  const View view = NewView();
  VelkCgiLoadInCookies(view.get());
  EXPECT_EQ(1, VelkCgiSetCookies(view.get(), "id", "new", 0, "/", nullptr, 0));
  EXPECT_STREQ("new", VelkCgiGetCookie(view.get(), "id"));
  VelkCgiLoadInCookies(view.get());
  EXPECT_STREQ("new", VelkCgiGetCookie(view.get(), "id"));
}

TEST(VelkCgiCookies, MayBeStoredAnewWithTheirOwnText) {
  const View view = NewView();
  const std::string value(100, 'x');
  EXPECT_EQ(1, VelkCgiSetCookies(view.get(), "id", value.c_str(), 0, "/", nullptr, 0));
  const char *own = VelkCgiGetCookie(view.get(), "id");
  EXPECT_EQ(1, VelkCgiSetCookies(view.get(), "id", own, 0, "/", nullptr, 0));
  EXPECT_EQ(value, VelkCgiGetCookie(view.get(), "id"));
}

TEST(VelkCgiCookies, AreRefusedWithANameThatIsNoToken) {
  const View view = NewView();
  for (const char *name : {"", "a b", "a=b", "a;b", "a\r\n", "\xc3\xa4", "a\x7f", "(a)"}) {
    EXPECT_EQ(0, VelkCgiSetCookies(view.get(), name, "1", 0, "/", nullptr, 0)) << name;
    EXPECT_EQ(nullptr, VelkCgiGetCookie(view.get(), name)) << name;
  }
}

TEST(VelkCgiCookies, AreRefusedWithAValueThatNoCookieMayHold) {
  const View view = NewView();
  for (const char *value :
       {"a b", "a;b", "a,b", "a\"b", "a\\b", "a\r\nSet-Cookie: x=1", "\xc3\xa4"}) {
    EXPECT_EQ(0, VelkCgiSetCookies(view.get(), "id", value, 0, "/", nullptr, 0)) << value;
  }
  EXPECT_EQ(1, VelkCgiSetCookies(view.get(), "id", "!#$%&'()*+-./:<=>?@[]^_`{|}~", 0, "/", "", 1));
  EXPECT_EQ(1, VelkCgiSetCookies(view.get(), "id", "", 0, nullptr, nullptr, 0));
}

TEST(VelkCgiCookies, RefuseNull) {
  const View view = NewView();
  EXPECT_EQ(0, VelkCgiLoadInCookies(nullptr));
  EXPECT_EQ(0, VelkCgiSetCookies(nullptr, "id", "1", 0, "/", nullptr, 0));
  EXPECT_EQ(0, VelkCgiSetCookies(view.get(), nullptr, "1", 0, "/", nullptr, 0));
  EXPECT_EQ(0, VelkCgiSetCookies(view.get(), "id", nullptr, 0, "/", nullptr, 0));
  EXPECT_EQ(nullptr, VelkCgiGetCookie(nullptr, "id"));
  EXPECT_EQ(nullptr, VelkCgiGetCookie(view.get(), nullptr));
}

// ---- the client's address

TEST(VelkCgiRemoteIp, IsPrintedInItsOneForm) {
  EXPECT_EQ("192.0.2.1", RemoteIp("192.0.2.1"));
  EXPECT_EQ("2001:db8::1", RemoteIp("2001:DB8:0:0::0001"));
}

TEST(VelkCgiRemoteIp, FoldsIpv4WrittenAsIpv6AndDropsTheZone) {
  EXPECT_EQ("192.0.2.1", RemoteIp("::ffff:192.0.2.1"));
  EXPECT_EQ("fe80::1", RemoteIp("fe80::1%eth0"));
}

TEST(VelkCgiRemoteIp, FailsForWhatIsNoAddress) {
  for (const char *value : {"", "unix:", "localhost", "192.0.2.1 ", "192.0.2.1:443", "[::1]",
                            "2001:db8::/64", "1.2.3", "\xff", "192.0.2.1\n"}) {
    EXPECT_EQ("(failed)", RemoteIp(value)) << value;
  }
  EXPECT_EQ("(failed)", RemoteIp(std::string(1 << 20, ':')));
  const Handed request({"REMOTE_ADDRESS=192.0.2.1"});
  char out[65] = "before";
  EXPECT_EQ(-1, VelkCgiGetRemoteIP(out, sizeof(out)));
  EXPECT_STREQ("before", out);
}

TEST(VelkCgiRemoteIp, NeverReadsForwardingHeaders) {
  const Handed request({"HTTP_X_FORWARDED_FOR=198.51.100.1", "HTTP_X_REAL_IP=198.51.100.1",
                        "HTTP_FORWARDED=for=198.51.100.1", "REMOTE_ADDR=192.0.2.1"});
  char out[65] = "";
  ASSERT_EQ(0, VelkCgiGetRemoteIP(out, sizeof(out)));
  EXPECT_STREQ("192.0.2.1", out);
}

TEST(VelkCgiRemoteIp, NeedsRoomForItsTerminator) {
  const Handed request({"REMOTE_ADDR=192.0.2.1"});
  char out[10] = "before";
  EXPECT_EQ(-1, VelkCgiGetRemoteIP(out, 9));
  EXPECT_EQ(-1, VelkCgiGetRemoteIP(out, 0));
  EXPECT_EQ(-1, VelkCgiGetRemoteIP(nullptr, 65));
  EXPECT_STREQ("before", out);
  EXPECT_EQ(0, VelkCgiGetRemoteIP(out, 10));
  EXPECT_STREQ("192.0.2.1", out);
}

}  // namespace
