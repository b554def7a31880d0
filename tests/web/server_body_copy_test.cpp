#include "server/body_copy.h"

#include <fcntl.h>
#include <gtest/gtest.h>

#include <fstream>
#include <string>

#include "server/limits.h"
#include "support/temp_dir.h"

namespace {

using velk_test::TempDir;
using web::FileBody;
using web::Response;

class WebBodyCopy : public testing::Test {
 protected:
  Response OfFile(const std::string &bytes, off_t offset, off_t length) {
    std::ofstream(folder_.File("file"), std::ios::binary) << bytes;
    Response response;
    FileBody body;
    body.file.Reset(open(folder_.File("file").c_str(), O_RDONLY | O_CLOEXEC));
    body.offset = offset;
    body.length = length;
    response.body = std::move(body);
    return response;
  }

  TempDir folder_;
};

std::string *Text(Response &response) {
  return std::get_if<std::string>(&response.body);
}

TEST_F(WebBodyCopy, ASmallFilesBytesTakeItsPlace) {
  Response response = OfFile("Hello, visitor\n", 0, 15);
  web::TakeSmallFileIn(response);
  ASSERT_NE(nullptr, Text(response));
  EXPECT_EQ("Hello, visitor\n", *Text(response));
}

TEST_F(WebBodyCopy, OnlyThePartThatWasAskedForIsTaken) {
  Response response = OfFile("Hello, visitor\n", 7, 3);
  web::TakeSmallFileIn(response);
  ASSERT_NE(nullptr, Text(response));
  EXPECT_EQ("vis", *Text(response));
}

TEST_F(WebBodyCopy, AnEmptyFileIsAnEmptyText) {
  Response response = OfFile("", 0, 0);
  web::TakeSmallFileIn(response);
  ASSERT_NE(nullptr, Text(response));
  EXPECT_EQ("", *Text(response));
}

TEST_F(WebBodyCopy, ALargeFileStaysAFile) {
  const std::string bytes(web::kPiece + 1, 'x');
  Response whole = OfFile(bytes, 0, static_cast<off_t>(bytes.size()));
  web::TakeSmallFileIn(whole);
  EXPECT_EQ(nullptr, Text(whole));
  Response part = OfFile(bytes, 1, static_cast<off_t>(web::kPiece));
  web::TakeSmallFileIn(part);
  ASSERT_NE(nullptr, Text(part));
  EXPECT_EQ(bytes.substr(1), *Text(part));
}

TEST_F(WebBodyCopy, AFileThatHasBecomeShorterStaysAFile) {
  Response response = OfFile("short", 0, 15);
  web::TakeSmallFileIn(response);
  EXPECT_EQ(nullptr, Text(response));
}

TEST_F(WebBodyCopy, ATextStaysAsItIs) {
  Response response;
  response.body = "text";
  web::TakeSmallFileIn(response);
  EXPECT_EQ("text", *Text(response));
}

}  // namespace
