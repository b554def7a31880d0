#include "share/preview.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <ostream>
#include <string>

#include "share_support.h"

namespace {

using web::share::MayHaveThumbnail;
using web::share::PreviewByName;
using web::share::PreviewKind;
using web::share::PreviewOf;
using web::share::ReadText;
using web_test::SharedFolder;

PreviewKind PreviewWith(const std::string &name, const std::string &content) {
  const SharedFolder folder;
  folder.AddFile(name, content);
  return PreviewOf(folder.Find({name}));
}

struct NameCase {
  std::string name;
  PreviewKind kind;
};

void PrintTo(const NameCase &test_case, std::ostream *out) {
  *out << test_case.name;
}

class SharePreviewByName : public testing::TestWithParam<NameCase> {};

TEST_P(SharePreviewByName, KnowsTheKind) {
  EXPECT_EQ(PreviewByName(GetParam().name), GetParam().kind) << GetParam().name;
}

INSTANTIATE_TEST_SUITE_P(
    SharePreview, SharePreviewByName,
    testing::Values(NameCase{"a.txt", PreviewKind::TEXT}, NameCase{"a.TXT", PreviewKind::TEXT},
                    NameCase{"a.md", PreviewKind::TEXT}, NameCase{"a.json", PreviewKind::TEXT},
                    NameCase{"a.html", PreviewKind::TEXT}, NameCase{"a.svg", PreviewKind::TEXT},
                    NameCase{"a.js", PreviewKind::TEXT}, NameCase{"a.jpg", PreviewKind::IMAGE},
                    NameCase{"a.b.JPEG", PreviewKind::IMAGE}, NameCase{"a.png", PreviewKind::IMAGE},
                    NameCase{"a.gif", PreviewKind::IMAGE}, NameCase{"a.webp", PreviewKind::IMAGE},
                    NameCase{"a.avif", PreviewKind::IMAGE}, NameCase{"a.tiff", PreviewKind::OTHER},
                    NameCase{"a.mp3", PreviewKind::AUDIO}, NameCase{"a.mp4", PreviewKind::VIDEO},
                    NameCase{"a.pdf", PreviewKind::PDF}, NameCase{"a.zip", PreviewKind::OTHER},
                    NameCase{"jpg", PreviewKind::OTHER}, NameCase{"a.", PreviewKind::OTHER},
                    NameCase{"", PreviewKind::OTHER}, NameCase{"a.png ", PreviewKind::OTHER}));

TEST(SharePreview, AFileWithoutATypeIsTextIfItReadsLikeIt) {
  EXPECT_EQ(PreviewWith("README", "Grüße\n"), PreviewKind::TEXT);
  EXPECT_EQ(PreviewWith("program", std::string("\x7F"
                                               "ELF\0\0",
                                               6)),
            PreviewKind::OTHER);
}

TEST(SharePreview, ATextOfOtherBytesThanUtf8IsNotShown) {
  EXPECT_EQ(PreviewWith("a.txt", "Gr\xFC\xDF"), PreviewKind::OTHER);
}

TEST(SharePreview, ATextWithControlCharactersIsNotShown) {
  EXPECT_EQ(PreviewWith("a.txt", std::string("a\0b", 3)), PreviewKind::OTHER);
}

TEST(SharePreview, EveryControlCharacterIsKnownWhereverItStands) {
  const SharedFolder folder;
  for (int code = 0; code < 0x80; ++code) {
    const bool is_text =
        (code >= 0x20 && code != 0x7F) ||
        std::string_view("\t\n\r\f\b\x1B").find(static_cast<char>(code)) != std::string::npos;
    const auto before = static_cast<size_t>(code % 20);
    folder.AddFile("a.txt", std::string(before, 'a') + static_cast<char>(code) + "b");
    EXPECT_EQ(ReadText(folder.Find({"a.txt"}), 100).has_value(), is_text) << code;
  }
}

TEST(SharePreview, CharactersBeyondAsciiAreTextWhereverTheyStand) {
  const SharedFolder folder;
  for (size_t before = 0; before < 20; ++before) {
    folder.AddFile("a.txt", std::string(before, 'a') + "ä€\xF0\x9F\x98\x80" + "b");
    EXPECT_TRUE(ReadText(folder.Find({"a.txt"}), 100)) << before;
  }
}

TEST(SharePreview, AFolderHasNone) {
  const SharedFolder folder;
  folder.AddFolder("a.txt");
  EXPECT_EQ(PreviewOf(folder.Find({"a.txt"})), PreviewKind::OTHER);
}

TEST(SharePreview, ATextIsReadWhole) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "one\ntwo\n");
  const auto start = ReadText(folder.Find({"a.txt"}), 100);
  ASSERT_TRUE(start);
  EXPECT_EQ(start->text, "one\ntwo\n");
  EXPECT_FALSE(start->is_cut);
}

TEST(SharePreview, ATextOfExactlyTheLimitIsNotCut) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "1234");
  EXPECT_FALSE(ReadText(folder.Find({"a.txt"}), 4)->is_cut);
}

TEST(SharePreview, ALongTextIsCut) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "12345");
  const auto start = ReadText(folder.Find({"a.txt"}), 4);
  ASSERT_TRUE(start);
  EXPECT_EQ(start->text, "1234");
  EXPECT_TRUE(start->is_cut);
}

TEST(SharePreview, OfATextThatHasBecomeShorterWhatIsLeftIsRead) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "one\ntwo\n");
  const auto file = folder.Find({"a.txt"});
  std::filesystem::resize_file(folder.File("a.txt"), 4);
  const auto start = ReadText(file, 100);
  ASSERT_TRUE(start);
  EXPECT_EQ(start->text, "one\n");
}

TEST(SharePreview, NoCharacterIsCutInTwo) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "ab\xF0\x9F\x98\x80 and more");
  for (const size_t limit : {3u, 4u, 5u}) {
    const auto start = ReadText(folder.Find({"a.txt"}), limit);
    ASSERT_TRUE(start) << limit;
    EXPECT_EQ(start->text, "ab");
  }
  EXPECT_EQ(ReadText(folder.Find({"a.txt"}), 6)->text, "ab\xF0\x9F\x98\x80");
}

TEST(SharePreview, ATextThatEndsInTheMiddleOfACharacterIsNone) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "ab\xF0\x9F\x98");
  EXPECT_FALSE(ReadText(folder.Find({"a.txt"}), 100));
}

TEST(SharePreview, AnEmptyFileIsAText) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "");
  const auto start = ReadText(folder.Find({"a.txt"}), 100);
  ASSERT_TRUE(start);
  EXPECT_EQ(start->text, "");
}

class ShareBrokenUtf8 : public testing::TestWithParam<std::string> {};

TEST_P(ShareBrokenUtf8, IsNoText) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "a" + GetParam() + "b");
  EXPECT_FALSE(ReadText(folder.Find({"a.txt"}), 100));
}

TEST_P(ShareBrokenUtf8, IsFoundWhereverItStands) {
  const SharedFolder folder;
  for (size_t before = 0; before < 20; ++before) {
    folder.AddFile("a.txt", std::string(before, 'a') + GetParam() + std::string(20, 'b'));
    EXPECT_FALSE(ReadText(folder.Find({"a.txt"}), 100)) << before;
  }
}

INSTANTIATE_TEST_SUITE_P(SharePreview, ShareBrokenUtf8,
                         testing::Values("\x80", "\xC0\x80", "\xC1\xBF", "\xE0\x9F\xBF",
                                         "\xED\xA0\x80", "\xF0\x8F\xBF\xBF", "\xF4\x90\x80\x80",
                                         "\xF5\x80\x80\x80", "\xFF", "\xE2\x82", "\xC3"));

TEST(SharePreview, OnlyImagesOfReasonableSizeHaveThumbnails) {
  EXPECT_TRUE(MayHaveThumbnail("a.jpg", 1000));
  EXPECT_TRUE(MayHaveThumbnail("a.png", 32 * 1024 * 1024));
  EXPECT_FALSE(MayHaveThumbnail("a.png", 32 * 1024 * 1024 + 1));
  EXPECT_FALSE(MayHaveThumbnail("a.png", 0));
  EXPECT_FALSE(MayHaveThumbnail("a.svg", 1000));
  EXPECT_FALSE(MayHaveThumbnail("a.txt", 1000));
}

}  // namespace
