// docs/webapi.md says what velkwebapi does: its tables are those that drive the program, and its
// examples work.

#include <filesystem>
#include <regex>
#include <sstream>

#include "integration/webapi_support.h"
#include "support/build_folders.h"
#include "velk_paths.h"

namespace {

using velk_test::Outcome;
using velk_test::ReadFile;
using velk_test::RunProgram;

/// The page by its headings: "VELK.Sharing.Link list" and the lines below that.
class WebApiDocument : public velk_test::WebApi {
 protected:
  using Lines = std::vector<std::string>;

  void SetUp() override {
    WebApi::SetUp();
    std::istringstream page(ReadFile(VELK_SOURCE_DIR "/docs/webapi.md"));
    std::string api, section;
    for (std::string line; std::getline(page, line);) {
      std::smatch match;
      if (std::regex_match(line, match, std::regex("## `(.+)`, version 1")))
        api = section = match[1];
      else if (std::regex_match(line, match, std::regex("### `(.+)`")))
        section = api + " " + match[1].str();
      else if (line.starts_with("#"))
        section = line;
      else
        sections_[section].push_back(line);
    }
  }

  /// Rows of the section's table, without its heading.
  Lines Rows(const std::string &section) const {
    Lines rows;
    for (const std::string &line : sections_.at(section))
      if (line.starts_with("| ") && !line.starts_with("| parameter |") &&
          !line.starts_with("| code |"))
        rows.push_back(line);
    return rows;
  }

  Lines Examples(const std::string &section) const {
    Lines examples;
    for (const std::string &line : sections_.at(section))
      if (line.starts_with("    velkwebapi ")) examples.push_back(line.substr(4));
    return examples;
  }

  std::map<std::string, Lines> sections_;
};

std::string TypeText(const Json::Value &parameter) {
  const std::string type = parameter["type"].asString();
  if (type == "integer") {
    return type + ", " + parameter["lowest"].asString() + " to " + parameter["highest"].asString();
  }
  if (type != "choice") return type;
  std::string text = type + ":";
  for (const Json::Value &choice : parameter["choices"])
    text += std::string(text.ends_with(":") ? "" : ",") + " `" + choice.asString() + "`";
  return text;
}

std::string Row(const Json::Value &parameter) {
  return "| `" + parameter["name"].asString() + "` | " + TypeText(parameter) + " | " +
         (parameter["required"].asBool() ? "required" : "optional") + " | " +
         parameter["description"].asString() + " |";
}

TEST_F(WebApiDocument, TellsEveryMethodsParameters) {
  std::size_t methods = 0;
  const Json::Value info = Data("VELK.API.Info", "query");
  for (const Json::Value &api : info["apis"]) {
    EXPECT_EQ(1, api["version"].asInt());
    for (const Json::Value &method : api["methods"]) {
      const std::string section = api["api"].asString() + " " + method["method"].asString();
      ASSERT_TRUE(sections_.contains(section)) << section;
      Lines expected;
      for (const Json::Value &parameter : method["parameters"]) expected.push_back(Row(parameter));
      EXPECT_EQ(expected, Rows(section)) << section;
      EXPECT_THAT(sections_.at(section), testing::Contains(method["description"].asString()));
      EXPECT_THAT(Examples(section), testing::Not(testing::IsEmpty())) << section;
      ++methods;
    }
  }
  const auto is_method = [](const auto &section) {
    return section.first.starts_with("VELK.") && section.first.find(' ') != std::string::npos;
  };
  EXPECT_EQ(methods, std::count_if(sections_.begin(), sections_.end(), is_method));
}

TEST_F(WebApiDocument, TellsEveryError) {
  Lines expected;
  const Json::Value info = Data("VELK.API.Info", "query");
  for (const Json::Value &error : info["errors"]) {
    expected.push_back("| " + error["code"].asString() + " | `" + error["name"].asString() +
                       "` | " + error["meaning"].asString() + " |");
  }
  EXPECT_EQ(expected, Rows("### Errors"));
}

TEST_F(WebApiDocument, ItsExamplesWork) {
  const velk_test::TempDir folder;
  velk_test::WriteFile(folder.File("password"), "secret\n");
  for (const auto &[section, lines] : sections_) {
    if (!section.starts_with("VELK.")) continue;
    for (std::string example : Examples(section)) {
      const std::string hash = MakeLink();
      LogIn(hash, {"--ip", "203.0.113.7"});
      RunJson({"block", "add", "203.0.113.7"});
      example = std::regex_replace(example, std::regex("aB3xK9pQ2"), hash);
      const std::string last_session = RunJson({"session", "list"})["sessions"][0]["id"].asString();
      example = std::regex_replace(example, std::regex("method=delete id=1"),
                                   "method=delete id=" + last_session);
      const Outcome outcome =
          RunProgram({"/bin/sh", "-c",
                      "cd " + folder.path() + " && PATH=" VELK_ROOT "/bin:$PATH && " + example});
      EXPECT_EQ(0, outcome.status) << example << outcome.err;
      EXPECT_THAT(outcome.out, testing::HasSubstr("\"success\":true")) << example;
      Run({"block", "remove", "203.0.113.7"});
    }
  }
}

}  // namespace
