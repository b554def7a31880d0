#include "server/file_offload.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "support/temp_dir.h"

namespace {

using velk_test::TempDir;
using web::FileBody;
using web::FileDelivery;
using web::FileOffload;
using web::Response;
using web::Settings;

class WebFileOffload : public testing::Test {
 protected:
  void SetUp() override {
    chmod(folder_.path().c_str(), 0755);
    mkdir(folder_.File("in").c_str(), 0755);
    chmod(folder_.File("in").c_str(), 0755);
    MakeFile("in/a b.bin");
  }

  void MakeFile(const std::string &name, mode_t mode = 0644) {
    velk_test::WriteFile(folder_.File(name), "content");
    chmod(folder_.File(name).c_str(), mode);
  }

  Response Whole(const std::string &name) {
    FileBody body;
    body.file.Reset(open(folder_.File(name).c_str(), O_RDONLY | O_CLOEXEC));
    body.length = 7;
    Response response;
    response.body = std::move(body);
    return response;
  }

  /// The header field's value; "" when the body is to be copied.
  std::string ValueFor(const Response &response,
                       FileDelivery delivery = FileDelivery::X_ACCEL_REDIRECT) {
    Settings settings;
    settings.file_delivery = delivery;
    settings.file_folders = {folder_.File("in")};
    const auto field = FileOffload(settings).FieldFor(response);
    return field ? field->second : "";
  }

  TempDir folder_;
};

TEST_F(WebFileOffload, NamesAFileThatEverybodyMayRead) {
  const std::string encoded = folder_.File("in/a%20b.bin");
  EXPECT_EQ(ValueFor(Whole("in/a b.bin")), "/velk-files" + encoded);
  EXPECT_EQ(ValueFor(Whole("in/a b.bin"), FileDelivery::X_SENDFILE), encoded);
}

TEST_F(WebFileOffload, CopiesUnlessToldOtherwise) {
  EXPECT_EQ(ValueFor(Whole("in/a b.bin"), FileDelivery::COPY), "");
}

TEST_F(WebFileOffload, CopiesWhatIsNoFile) {
  Response response;
  response.body = "text";
  EXPECT_EQ(ValueFor(response), "");
}

TEST_F(WebFileOffload, CopiesAPart) {
  Response response = Whole("in/a b.bin");
  std::get<FileBody>(response.body).length = 6;
  EXPECT_EQ(ValueFor(response), "");
  response = Whole("in/a b.bin");
  std::get<FileBody>(response.body).offset = 1;
  EXPECT_EQ(ValueFor(response), "");
  response = Whole("in/a b.bin");
  response.status = 206;
  EXPECT_EQ(ValueFor(response), "");
}

TEST_F(WebFileOffload, CopiesWhatLiesElsewhere) {
  MakeFile("out.bin");
  EXPECT_EQ(ValueFor(Whole("out.bin")), "");
  mkdir(folder_.File("in2").c_str(), 0755);
  MakeFile("in2/x");
  EXPECT_EQ(ValueFor(Whole("in2/x")), "");
}

TEST_F(WebFileOffload, CopiesWhatALinkLeadsTo) {
  MakeFile("out.bin");
  ASSERT_EQ(symlink(folder_.File("out.bin").c_str(), folder_.File("in/link").c_str()), 0);
  EXPECT_EQ(ValueFor(Whole("in/link")), "");
}

TEST_F(WebFileOffload, CopiesWhatNotEverybodyMayRead) {
  MakeFile("in/private", 0640);
  EXPECT_EQ(ValueFor(Whole("in/private")), "");
  Response response = Whole("in/a b.bin");
  chmod(folder_.File("in").c_str(), 0750);
  EXPECT_EQ(ValueFor(response), "");
}

TEST_F(WebFileOffload, CopiesWhatIsNoLongerThere) {
  Response response = Whole("in/a b.bin");
  unlink(folder_.File("in/a b.bin").c_str());
  EXPECT_EQ(ValueFor(response), "");
  MakeFile("in/a b.bin (deleted)");
  EXPECT_EQ(ValueFor(response), "");
}

TEST_F(WebFileOffload, CopiesNamesThatWebServersReadDifferently) {
  MakeFile("in/a\nb");
  EXPECT_EQ(ValueFor(Whole("in/a\nb")), "");
  MakeFile("in/\xff");
  EXPECT_EQ(ValueFor(Whole("in/\xff"), FileDelivery::X_SENDFILE), "");
}

}  // namespace
