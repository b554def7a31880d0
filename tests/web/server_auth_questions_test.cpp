#include "server/auth_questions.h"

#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

namespace {

using web::AuthAddress;
using web::AuthQuestions;
using web::Request;
using web::Settings;

using Headers = std::vector<std::pair<std::string, std::string>>;
using Variables = std::vector<const char *>;

const Headers kForwarded = {{"X-Forwarded-Proto", "https"},
                            {"X-Forwarded-Host", "wiki.example"},
                            {"X-Forwarded-Uri", "/page?x"}};
const Headers kOriginal = {{"X-Original-URL", "https://wiki.example/page?x"}};
const Variables kParameter = {"REQUEST_METHOD=GET", "REQUEST_URI=/sharing/abc",
                              "VELK_SHARING_AUTH=https://wiki.example/page?x"};
const Variables kAuthorizer = {"REQUEST_METHOD=GET", "REQUEST_SCHEME=https",
                               "SERVER_NAME=wiki.example", "SERVER_PORT=443",
                               "REQUEST_URI=/page?x"};
const char *const kAddress = "https://wiki.example/page?x";

AuthQuestions Questions(AuthAddress source, const std::string &path = "/sharing") {
  Settings settings;
  settings.auth_address = source;
  settings.path = path;
  return AuthQuestions(settings);
}

Request Recognised(AuthAddress source, const Headers &headers, bool is_trusted = true,
                   const std::string &path = "/sharing-auth") {
  Request request;
  request.method = "GET";
  request.path = path;
  for (const auto &[name, value] : headers) request.headers.Add(name, value);
  Questions(source).Recognise(request, is_trusted);
  return request;
}

/// What an HTTP question is about; "" also when nothing is asked.
std::string Asked(AuthAddress source, const Headers &headers, bool is_trusted = true) {
  const Request request = Recognised(source, headers, is_trusted);
  EXPECT_TRUE(request.question);
  return request.question ? request.question->address : "no question";
}

Headers With(Headers headers, const std::string &name, const std::string &value) {
  for (auto &[known, text] : headers)
    if (known == name) text = value;
  return headers;
}

Headers Without(Headers headers, const std::string &name) {
  std::erase_if(headers, [&](const auto &header) { return header.first == name; });
  return headers;
}

/// What a question by FastCGI is about.
std::string Asked(AuthAddress source, Variables variables, bool is_authorizer) {
  variables.push_back(nullptr);
  const Request request = Questions(source).Read(variables.data(), is_authorizer);
  EXPECT_TRUE(request.question);
  EXPECT_EQ(is_authorizer, request.question->is_authorizer);
  return request.question->address;
}

bool IsQuestion(Variables variables, bool is_authorizer = false) {
  variables.push_back(nullptr);
  return AuthQuestions::Is(variables.data(), is_authorizer);
}

std::string AskedAsAuthorizer(const std::string &changed) {
  Variables variables = kAuthorizer;
  const std::string name = changed.substr(0, changed.find('=') + 1);
  for (const char *&variable : variables)
    if (std::string(variable).starts_with(name)) variable = changed.c_str();
  return Asked(AuthAddress::AUTHORIZER, variables, true);
}

TEST(WebAuthQuestions, OnlyTheEndpointIsAQuestionByHttp) {
  EXPECT_TRUE(Recognised(AuthAddress::X_FORWARDED, kForwarded).question);
  for (const char *path : {"/sharing-auth/", "/sharing-auth/x", "/sharing-authx", "/sharing",
                           "/sharing/", "/sharing%2dauth", "/sharing%2Dauth", "//sharing-auth",
                           "/./sharing-auth", "/x/../sharing-auth", "/Sharing-auth",
                           "/sharing-auth;x", "/sharing-health", "/sharing/abc", "/", ""})
    EXPECT_FALSE(Recognised(AuthAddress::X_FORWARDED, kForwarded, true, path).question) << path;
}

TEST(WebAuthQuestions, LinksAtTheRootHaveTheirEndpointThere) {
  Request request;
  request.path = "/-auth";
  Questions(AuthAddress::OFF, "").Recognise(request, true);
  EXPECT_TRUE(request.question);
}

TEST(WebAuthQuestions, TheEndpointIsAQuestionWhateverTheSetting) {
  for (const auto source : {AuthAddress::OFF, AuthAddress::PARAMETER, AuthAddress::AUTHORIZER,
                            AuthAddress::X_FORWARDED, AuthAddress::X_ORIGINAL_URL})
    EXPECT_EQ("", Asked(source, {}));
}

TEST(WebAuthQuestions, TheAddressIsTakenFromTheFieldsOfTheSettingAlone) {
  EXPECT_EQ(kAddress, Asked(AuthAddress::X_FORWARDED, kForwarded));
  EXPECT_EQ(kAddress, Asked(AuthAddress::X_ORIGINAL_URL, kOriginal));
  EXPECT_EQ("", Asked(AuthAddress::X_FORWARDED, kOriginal));
  EXPECT_EQ("", Asked(AuthAddress::X_ORIGINAL_URL, kForwarded));
  for (const auto source : {AuthAddress::OFF, AuthAddress::PARAMETER, AuthAddress::AUTHORIZER}) {
    EXPECT_EQ("", Asked(source, kForwarded));
    EXPECT_EQ("", Asked(source, kOriginal));
  }
}

TEST(WebAuthQuestions, AStrangersWordCountsForNothing) {
  EXPECT_EQ("", Asked(AuthAddress::X_FORWARDED, kForwarded, false));
  EXPECT_EQ("", Asked(AuthAddress::X_ORIGINAL_URL, kOriginal, false));
}

TEST(WebAuthQuestions, AFieldThatIsMissingLeavesTheAddressOpen) {
  for (const auto &[name, value] : kForwarded)
    EXPECT_EQ("", Asked(AuthAddress::X_FORWARDED, Without(kForwarded, name))) << name;
}

TEST(WebAuthQuestions, AFieldThatComesTwiceLeavesTheAddressOpen) {
  for (Headers headers : {kForwarded, kOriginal}) {
    const auto source =
        headers.size() == 1 ? AuthAddress::X_ORIGINAL_URL : AuthAddress::X_FORWARDED;
    for (const auto &[name, value] : Headers(headers)) {
      Headers twice = headers;
      twice.emplace_back(name, value);
      EXPECT_EQ("", Asked(source, twice)) << name;
    }
  }
  EXPECT_EQ("", Asked(AuthAddress::X_ORIGINAL_URL,
                      {kOriginal[0], {"x-original-url", "https://wiki.example/"}}));
}

TEST(WebAuthQuestions, AWebSocketIsItsSchemesPage) {
  EXPECT_EQ(kAddress,
            Asked(AuthAddress::X_FORWARDED, With(kForwarded, "X-Forwarded-Proto", "wss")));
  EXPECT_EQ("http://wiki.example/page?x",
            Asked(AuthAddress::X_FORWARDED, With(kForwarded, "X-Forwarded-Proto", "ws")));
}

TEST(WebAuthQuestions, ATargetIsAPath) {
  for (const char *target : {"", "page", "*", "http://wiki.example/page", "wiki.example:443"})
    EXPECT_EQ("", Asked(AuthAddress::X_FORWARDED, With(kForwarded, "X-Forwarded-Uri", target)))
        << target;
}

TEST(WebAuthQuestions, AHostHoldsNoPartOfThePath) {
  for (const char *host : {"wiki.example/photos", "wiki.example?", "wiki.example/?",
                           "wiki.example#", "wiki.example\\"})
    EXPECT_EQ("", Asked(AuthAddress::X_FORWARDED, With(kForwarded, "X-Forwarded-Host", host)))
        << host;
}

TEST(WebAuthQuestions, OnlyTheParameterAndTheRoleMakeAQuestionByFastCgi) {
  EXPECT_TRUE(IsQuestion(kParameter));
  EXPECT_TRUE(IsQuestion({"VELK_SHARING_AUTH="}));
  EXPECT_TRUE(IsQuestion(kAuthorizer, true));
  EXPECT_FALSE(IsQuestion(kAuthorizer));
  EXPECT_FALSE(IsQuestion({"HTTP_VELK_SHARING_AUTH=https://wiki.example/",
                           "VELK_SHARING_AUTHORITY=x", "VELK_SHARING_AUTH",
                           "REQUEST_URI=/sharing-auth", "QUERY_STRING=VELK_SHARING_AUTH=x"}));
}

TEST(WebAuthQuestions, TheParameterCountsWhereItIsTheSetting) {
  EXPECT_EQ(kAddress, Asked(AuthAddress::PARAMETER, kParameter, false));
  for (const auto source : {AuthAddress::OFF, AuthAddress::AUTHORIZER, AuthAddress::X_FORWARDED,
                            AuthAddress::X_ORIGINAL_URL})
    EXPECT_EQ("", Asked(source, kParameter, false));
}

TEST(WebAuthQuestions, AParameterThatComesTwiceLeavesTheAddressOpen) {
  Variables twice = kParameter;
  twice.push_back(kParameter.back());
  EXPECT_EQ("", Asked(AuthAddress::PARAMETER, twice, false));
}

TEST(WebAuthQuestions, HeaderFieldsAreNoParameter) {
  const Variables fields = {"VELK_SHARING_AUTH=", "HTTP_X_FORWARDED_PROTO=https",
                            "HTTP_X_FORWARDED_HOST=wiki.example", "HTTP_X_FORWARDED_URI=/page",
                            "HTTP_X_ORIGINAL_URL=https://wiki.example/page"};
  for (const auto source :
       {AuthAddress::PARAMETER, AuthAddress::X_FORWARDED, AuthAddress::X_ORIGINAL_URL})
    EXPECT_EQ("", Asked(source, fields, false));
}

TEST(WebAuthQuestions, AnAuthorizerIsAskedAboutWhatTheWebServerServes) {
  EXPECT_EQ("https://wiki.example:443/page?x", Asked(AuthAddress::AUTHORIZER, kAuthorizer, true));
  for (const auto source : {AuthAddress::OFF, AuthAddress::PARAMETER, AuthAddress::X_FORWARDED,
                            AuthAddress::X_ORIGINAL_URL})
    EXPECT_EQ("", Asked(source, kAuthorizer, true));
}

TEST(WebAuthQuestions, AnAuthorizersParameterPlaysNoPart) {
  Variables both = kAuthorizer;
  both.push_back("VELK_SHARING_AUTH=https://wiki.example/public");
  EXPECT_EQ("https://wiki.example:443/page?x", Asked(AuthAddress::AUTHORIZER, both, true));
  EXPECT_EQ("", Asked(AuthAddress::PARAMETER, both, true));
}

TEST(WebAuthQuestions, AnAuthorizersVariablesComeOnce) {
  for (size_t at = 1; at < kAuthorizer.size(); ++at) {
    const std::string name = kAuthorizer[at];
    if (name.starts_with("SERVER_PORT")) continue;
    Variables twice = kAuthorizer;
    twice.push_back(kAuthorizer[at]);
    EXPECT_EQ("", Asked(AuthAddress::AUTHORIZER, twice, true)) << name;
    Variables without = kAuthorizer;
    without.erase(without.begin() + static_cast<std::ptrdiff_t>(at));
    EXPECT_EQ("", Asked(AuthAddress::AUTHORIZER, without, true)) << name;
  }
}

TEST(WebAuthQuestions, AnAuthorizersPortIsKnownOrTheAddressOpen) {
  Variables twice = kAuthorizer;
  twice.push_back("SERVER_PORT=8443");
  EXPECT_EQ("", Asked(AuthAddress::AUTHORIZER, twice, true));
  Variables without = kAuthorizer;
  std::erase(without, kAuthorizer[3]);
  EXPECT_EQ("", Asked(AuthAddress::AUTHORIZER, without, true));
}

TEST(WebAuthQuestions, AServersNameMayBeAnIPv6Address) {
  EXPECT_EQ("https://[2001:db8::1]:443/page?x", AskedAsAuthorizer("SERVER_NAME=[2001:db8::1]"));
}

TEST(WebAuthQuestions, AnAuthorizersTargetIsAPath) {
  EXPECT_EQ("", AskedAsAuthorizer("REQUEST_URI=https://wiki.example/page"));
  EXPECT_EQ("", AskedAsAuthorizer("REQUEST_URI=*"));
  EXPECT_EQ("", AskedAsAuthorizer("REQUEST_URI="));
}

TEST(WebAuthQuestions, AQuestionHasTheVisitorsFieldsAndAddress) {
  Variables variables = kParameter;
  variables.insert(variables.end(),
                   {"HTTP_COOKIE=sharing_sid_abc=x", "REMOTE_ADDR=192.0.2.7", nullptr});
  const Request request = Questions(AuthAddress::PARAMETER).Read(variables.data(), false);
  EXPECT_EQ("sharing_sid_abc=x", request.headers.Get("Cookie"));
  EXPECT_EQ("192.0.2.7", request.remote_address);
  EXPECT_EQ("", request.path);
}

}  // namespace
