#include "share/download.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <ctime>
#include <ostream>
#include <string>
#include <variant>

#include "share/byte_range.h"
#include "share/content_disposition.h"
#include "share/http_date.h"
#include "share_support.h"

namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;
using web::FileBody;
using web::Request;
using web::Response;
using web::share::ByteRange;
using web::share::ContentDisposition;
using web::share::Download;
using web::share::FormatHttpDate;
using web::share::ParseHttpDate;
using web::share::ParseRange;
using web::share::Purpose;
using web_test::SharedFolder;

constexpr char kContent[] = "0123456789";
constexpr time_t kChanged = 1'600'000'000;  // Sun, 13 Sep 2020 12:26:40 GMT

std::string BodyOf(const Response &response) {
  if (const auto *text = std::get_if<std::string>(&response.body)) return *text;
  const FileBody &body = std::get<FileBody>(response.body);
  std::string content(static_cast<size_t>(body.length), '\0');
  const ssize_t count = pread(body.file.get(), content.data(), content.size(), body.offset);
  EXPECT_EQ(count, body.length);
  return content;
}

void SetTime(const std::string &path, time_t seconds, long nanoseconds = 0) {
  const timespec times[2] = {{seconds, nanoseconds}, {seconds, nanoseconds}};
  ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), times, 0), 0);
}

/// A file of ten digits that was changed at kChanged, and requests for it.
class ShareDownload : public testing::Test {
 protected:
  ShareDownload() {
    folder_.AddFile("digits.txt", kContent);
    SetTime(folder_.File("digits.txt"), kChanged);
  }

  Response Get(const web::Fields &headers = {}, const std::string &method = "GET",
               Purpose purpose = Purpose::SAVE) const {
    Request request;
    request.method = method;
    request.headers = headers;
    return Download(folder_.Find({"digits.txt"}), request, purpose);
  }
  Response GetWith(const std::string &name, const std::string &value) const {
    web::Fields headers;
    headers.Add(name, value);
    return Get(headers);
  }
  Response GetRange(const std::string &range, const std::string &condition) const {
    web::Fields headers;
    headers.Add("Range", range);
    headers.Add("If-Range", condition);
    return Get(headers);
  }
  std::string Tag() const { return std::string(Get().headers.Get("ETag")); }

  SharedFolder folder_;
};

// --- The whole ----------------------------------------------------------------------------------

TEST_F(ShareDownload, SendsTheFile) {
  const Response response = Get();
  EXPECT_EQ(response.status, 200);
  EXPECT_EQ(BodyOf(response), kContent);
  EXPECT_EQ(response.headers.Get("Accept-Ranges"), "bytes");
  EXPECT_EQ(response.headers.Get("Last-Modified"), "Sun, 13 Sep 2020 12:26:40 GMT");
  EXPECT_EQ(response.headers.Get("Cache-Control"), "private, no-cache");
  EXPECT_EQ(response.headers.Get("Content-Disposition"), "attachment; filename=\"digits.txt\"");
}

TEST_F(ShareDownload, SendsTheFileFromWhereItLies) {
  EXPECT_TRUE(std::holds_alternative<FileBody>(Get().body));
}

TEST_F(ShareDownload, AnswersHeadLikeGet) {
  const Response head = Get({}, "HEAD");
  EXPECT_EQ(head.status, 200);
  EXPECT_EQ(std::get<FileBody>(head.body).length, 10);
  EXPECT_EQ(head.headers.Get("ETag"), Tag());
}

TEST_F(ShareDownload, SendsAnEmptyFile) {
  folder_.AddFile("empty", "");
  const Response response = Download(folder_.Find({"empty"}), Request(), Purpose::SAVE);
  EXPECT_EQ(response.status, 200);
  EXPECT_EQ(std::get<FileBody>(response.body).length, 0);
}

TEST_F(ShareDownload, BearsNoDateOfTheFuture) {
  SetTime(folder_.File("digits.txt"), time(nullptr) + 1000);
  EXPECT_EQ(Get().headers.Find("Last-Modified"), nullptr);
}

// --- Entity tags --------------------------------------------------------------------------------

TEST_F(ShareDownload, HasAStrongTag) {
  EXPECT_THAT(Tag(), AllOf(StartsWith("\""), Not("\"\"")));
}

TEST_F(ShareDownload, HasTheSameTagAsLongAsTheFileIsTheSame) {
  EXPECT_EQ(Tag(), Tag());
}

TEST_F(ShareDownload, HasAnotherTagAfterANanosecond) {
  const std::string before = Tag();
  SetTime(folder_.File("digits.txt"), kChanged, 1);
  EXPECT_NE(Tag(), before);
}

TEST_F(ShareDownload, HasAnotherTagWhenTheSizeDiffers) {
  const std::string before = Tag();
  folder_.AddFile("digits.txt", "01234567890");
  SetTime(folder_.File("digits.txt"), kChanged);
  EXPECT_NE(Tag(), before);
}

TEST_F(ShareDownload, HasAnotherTagWhenAnotherFileTookItsPlace) {
  const std::string before = Tag();
  folder_.AddFile("other.txt", "9876543210");
  SetTime(folder_.File("other.txt"), kChanged);
  rename(folder_.File("other.txt").c_str(), folder_.File("digits.txt").c_str());
  EXPECT_NE(Tag(), before);
}

// --- Conditions ---------------------------------------------------------------------------------

struct ConditionCase {
  std::string field;
  std::string value;  ///< "TAG" stands for the file's.
  int status;
};

void PrintTo(const ConditionCase &test_case, std::ostream *out) {
  *out << test_case.field << ": " << test_case.value;
}

class ShareDownloadCondition : public ShareDownload,
                               public testing::WithParamInterface<ConditionCase> {};

TEST_P(ShareDownloadCondition, IsWeighed) {
  std::string value = GetParam().value;
  if (const size_t at = value.find("TAG"); at != std::string::npos) value.replace(at, 3, Tag());
  const Response response = GetWith(GetParam().field, value);
  EXPECT_EQ(response.status, GetParam().status) << GetParam().field << ": " << value;
  EXPECT_EQ(BodyOf(response), GetParam().status == 200 ? kContent : "");
}

INSTANTIATE_TEST_SUITE_P(
    Table, ShareDownloadCondition,
    testing::Values(
        ConditionCase{"If-None-Match", "TAG", 304}, ConditionCase{"If-None-Match", "W/TAG", 304},
        ConditionCase{"If-None-Match", "*", 304},
        ConditionCase{"If-None-Match", "\"a\", TAG, \"b\"", 304},
        ConditionCase{"If-None-Match", "\"a\",TAG", 304},
        ConditionCase{"If-None-Match", "\"a\", \"b\"", 200},
        ConditionCase{"If-None-Match", "", 200}, ConditionCase{"If-None-Match", "TAG-not", 304},
        ConditionCase{"If-None-Match", "\"", 200}, ConditionCase{"If-None-Match", "a", 200},
        ConditionCase{"If-Match", "TAG", 200}, ConditionCase{"If-Match", "*", 200},
        ConditionCase{"If-Match", "W/TAG", 412}, ConditionCase{"If-Match", "\"a\"", 412},
        ConditionCase{"If-Match", "\"a\", TAG", 200}, ConditionCase{"If-Match", "", 412},
        ConditionCase{"If-Modified-Since", "Sun, 13 Sep 2020 12:26:40 GMT", 304},
        ConditionCase{"If-Modified-Since", "Sun, 13 Sep 2020 12:26:39 GMT", 200},
        ConditionCase{"If-Modified-Since", "Sun, 13 Sep 2020 12:26:41 GMT", 304},
        ConditionCase{"If-Modified-Since", "Sunday, 13-Sep-20 12:26:40 GMT", 304},
        ConditionCase{"If-Modified-Since", "Sun Sep 13 12:26:40 2020", 304},
        ConditionCase{"If-Modified-Since", "yesterday", 200},
        ConditionCase{"If-Modified-Since", "1600000000", 200},
        ConditionCase{"If-Unmodified-Since", "Sun, 13 Sep 2020 12:26:40 GMT", 200},
        ConditionCase{"If-Unmodified-Since", "Sun, 13 Sep 2020 12:26:39 GMT", 412},
        ConditionCase{"If-Unmodified-Since", "nonsense", 200}));

TEST_F(ShareDownload, ATagCountsMoreThanADate) {
  web::Fields headers;
  headers.Add("If-None-Match", "\"other\"");
  headers.Add("If-Modified-Since", "Sun, 13 Sep 2020 12:26:40 GMT");
  EXPECT_EQ(Get(headers).status, 200);
}

TEST_F(ShareDownload, ATagMayStandInASecondField) {
  web::Fields headers;
  headers.Add("If-None-Match", "\"other\"");
  headers.Add("if-none-match", Tag());
  EXPECT_EQ(Get(headers).status, 304);
}

TEST_F(ShareDownload, NotModifiedStillTellsTheTag) {
  const Response response = GetWith("If-None-Match", "*");
  EXPECT_EQ(response.headers.Get("ETag"), Tag());
  EXPECT_EQ(response.headers.Find("Content-Type"), nullptr);
}

// --- Ranges -------------------------------------------------------------------------------------

struct RangeCase {
  std::string range;
  int status;
  std::string content_range;
  std::string body;
};

void PrintTo(const RangeCase &test_case, std::ostream *out) {
  *out << test_case.range;
}

class ShareDownloadRange : public ShareDownload, public testing::WithParamInterface<RangeCase> {};

TEST_P(ShareDownloadRange, GivesThatPart) {
  const Response response = GetWith("Range", GetParam().range);
  EXPECT_EQ(response.status, GetParam().status);
  EXPECT_EQ(response.headers.Get("Content-Range"), GetParam().content_range);
  EXPECT_EQ(BodyOf(response), GetParam().body);
}

INSTANTIATE_TEST_SUITE_P(
    Table, ShareDownloadRange,
    testing::Values(
        RangeCase{"bytes=0-0", 206, "bytes 0-0/10", "0"},
        RangeCase{"bytes=2-4", 206, "bytes 2-4/10", "234"},
        RangeCase{"bytes=0-9", 206, "bytes 0-9/10", "0123456789"},
        RangeCase{"bytes=7-", 206, "bytes 7-9/10", "789"},
        RangeCase{"bytes=0-", 206, "bytes 0-9/10", "0123456789"},
        RangeCase{"bytes=-3", 206, "bytes 7-9/10", "789"},
        RangeCase{"bytes=-10", 206, "bytes 0-9/10", "0123456789"},
        RangeCase{"bytes=-11", 206, "bytes 0-9/10", "0123456789"},
        RangeCase{"bytes=8-20", 206, "bytes 8-9/10", "89"},
        RangeCase{"bytes=8-99999999999999999999999", 206, "bytes 8-9/10", "89"},
        RangeCase{"BYTES=2-4", 206, "bytes 2-4/10", "234"},
        RangeCase{"bytes= 2-4 ", 206, "bytes 2-4/10", "234"},
        RangeCase{"bytes=,2-4,", 206, "bytes 2-4/10", "234"},
        RangeCase{"bytes=10-", 416, "bytes */10", ""},
        RangeCase{"bytes=10-20", 416, "bytes */10", ""},
        RangeCase{"bytes=99999999999999999999-", 416, "bytes */10", ""},
        RangeCase{"bytes=-0", 416, "bytes */10", ""},
        RangeCase{"bytes=10-, 20-", 416, "bytes */10", ""},
        RangeCase{"bytes=0-1,3-4", 200, "", kContent},
        RangeCase{"bytes=0-1,20-", 200, "", kContent}, RangeCase{"bytes=4-2", 200, "", kContent},
        RangeCase{"bytes=", 200, "", kContent}, RangeCase{"bytes=-", 200, "", kContent},
        RangeCase{"bytes=a-b", 200, "", kContent}, RangeCase{"bytes=1", 200, "", kContent},
        RangeCase{"bytes=--1", 200, "", kContent}, RangeCase{"bytes=+1-2", 200, "", kContent},
        RangeCase{"bytes=1-2-3", 200, "", kContent}, RangeCase{"bytes=0x1-2", 200, "", kContent},
        RangeCase{"bytes 1-2", 200, "", kContent}, RangeCase{"lines=1-2", 200, "", kContent},
        RangeCase{"", 200, "", kContent}));

TEST_F(ShareDownload, HeadKnowsNoRange) {
  web::Fields headers;
  headers.Add("Range", "bytes=2-4");
  EXPECT_EQ(Get(headers, "HEAD").status, 200);
}

TEST_F(ShareDownload, TwoRangeFieldsGetTheWhole) {
  web::Fields headers;
  headers.Add("Range", "bytes=2-4");
  headers.Add("Range", "bytes=5-6");
  EXPECT_EQ(Get(headers).status, 200);
}

TEST_F(ShareDownload, NotModifiedCountsMoreThanARange) {
  web::Fields headers;
  headers.Add("Range", "bytes=2-4");
  headers.Add("If-None-Match", Tag());
  EXPECT_EQ(Get(headers).status, 304);
}

TEST_F(ShareDownload, ARangeHoldsForTheFileOfTheTag) {
  EXPECT_EQ(GetRange("bytes=2-4", Tag()).status, 206);
  EXPECT_EQ(GetRange("bytes=2-4", "\"other\"").status, 200);
  EXPECT_EQ(GetRange("bytes=2-4", "W/" + Tag()).status, 200);
}

TEST_F(ShareDownload, ARangeHoldsForTheFileOfTheDate) {
  EXPECT_EQ(GetRange("bytes=2-4", "Sun, 13 Sep 2020 12:26:40 GMT").status, 206);
  EXPECT_EQ(GetRange("bytes=2-4", "Sun, 13 Sep 2020 12:26:41 GMT").status, 200);
  EXPECT_EQ(GetRange("bytes=2-4", "nonsense").status, 200);
}

TEST_F(ShareDownload, ADateOfThisVerySecondHoldsNoRange) {
  const time_t now = time(nullptr);
  SetTime(folder_.File("digits.txt"), now);
  EXPECT_EQ(GetRange("bytes=2-4", FormatHttpDate(now)).status, 200);
}

TEST_F(ShareDownload, AConditionThatFailsGivesTheWholeForWhatCannotBeGiven) {
  EXPECT_EQ(GetRange("bytes=99-", "\"other\"").status, 200);
}

TEST(ShareRange, TheEndOfAnEmptyFileIsTheWhole) {
  EXPECT_EQ(ParseRange("bytes=-5", 0).kind, ByteRange::Kind::WHOLE);
  EXPECT_EQ(ParseRange("bytes=0-", 0).kind, ByteRange::Kind::UNSATISFIABLE);
}

TEST(ShareRange, TheEndOfAFileOfFiveGigabytesIsNotReadFromItsBeginning) {
  const SharedFolder folder;
  constexpr off_t kSize = 5'000'000'000;
  folder.AddFile("large", "");
  ASSERT_EQ(truncate(folder.File("large").c_str(), kSize), 0);
  const web::UniqueFd file(open(folder.File("large").c_str(), O_WRONLY | O_CLOEXEC));
  ASSERT_EQ(pwrite(file.get(), "end", 3, kSize - 3), 3);
  Request request;
  request.method = "GET";
  request.headers.Add("Range", "bytes=4999999997-4999999999");
  const Response response = Download(folder.Find({"large"}), request, Purpose::SAVE);
  EXPECT_EQ(response.status, 206);
  EXPECT_EQ(response.headers.Get("Content-Range"), "bytes 4999999997-4999999999/5000000000");
  EXPECT_EQ(std::get<FileBody>(response.body).offset, kSize - 3);
  EXPECT_EQ(BodyOf(response), "end");
}

// --- Types --------------------------------------------------------------------------------------

struct TypeCase {
  std::string name;
  std::string type;
  bool is_inline;
};

void PrintTo(const TypeCase &test_case, std::ostream *out) {
  *out << test_case.name;
}

class ShareDownloadType : public testing::TestWithParam<TypeCase> {
 protected:
  Response Get(Purpose purpose) const {
    folder_.AddFile(GetParam().name, "text");
    Request request;
    request.method = "GET";
    return Download(folder_.Find({GetParam().name}), request, purpose);
  }

  SharedFolder folder_;
};

TEST_P(ShareDownloadType, IsToldByTheName) {
  EXPECT_EQ(Get(Purpose::VIEW).headers.Get("Content-Type"), GetParam().type);
}

TEST_P(ShareDownloadType, IsShownOnlyIfNoBrowserExecutesIt) {
  EXPECT_THAT(std::string(Get(Purpose::VIEW).headers.Get("Content-Disposition")),
              StartsWith(GetParam().is_inline ? "inline; " : "attachment; "));
}

TEST_P(ShareDownloadType, IsSavedWhenThatIsWanted) {
  EXPECT_THAT(std::string(Get(Purpose::SAVE).headers.Get("Content-Disposition")),
              StartsWith("attachment; "));
}

TEST_P(ShareDownloadType, HasAPolicyThatForbidsScripts) {
  EXPECT_THAT(std::string(Get(Purpose::VIEW).headers.Get("Content-Security-Policy")),
              AllOf(StartsWith("default-src 'none'; "), Not(HasSubstr("script"))));
}

INSTANTIATE_TEST_SUITE_P(
    Table, ShareDownloadType,
    testing::Values(
        TypeCase{"a.txt", "text/plain; charset=utf-8", true}, TypeCase{"a.png", "image/png", true},
        TypeCase{"a.JPG", "image/jpeg", true}, TypeCase{"a.gif", "image/gif", true},
        TypeCase{"a.webp", "image/webp", true}, TypeCase{"a.avif", "image/avif", true},
        TypeCase{"a.mp3", "audio/mpeg", true}, TypeCase{"a.mp4", "video/mp4", true},
        TypeCase{"a.pdf", "application/pdf", true}, TypeCase{"a.html", "text/html", false},
        TypeCase{"a.htm", "text/html", false}, TypeCase{"a.HTML", "text/html", false},
        TypeCase{"a.txt.html", "text/html", false},
        TypeCase{"a.xhtml", "application/xhtml+xml", false},
        TypeCase{"a.svg", "image/svg+xml", false}, TypeCase{"a.xml", "application/xml", false},
        TypeCase{"a.js", "text/javascript", false}, TypeCase{"a.mjs", "text/javascript", false},
        TypeCase{"a.css", "text/css", false}, TypeCase{"a.csv", "text/csv", false},
        TypeCase{"a.docx",
                 "application/vnd.openxmlformats-officedocument.wordprocessingml."
                 "document",
                 false},
        TypeCase{"a.unheardof", "application/octet-stream", false},
        TypeCase{"README", "application/octet-stream", false}));

TEST(ShareDownloadPolicy, KeepsWhatIsShownInASandbox) {
  const SharedFolder folder;
  folder.AddFile("a.png");
  const Response response = Download(folder.Find({"a.png"}), Request(), Purpose::VIEW);
  EXPECT_THAT(std::string(response.headers.Get("Content-Security-Policy")), HasSubstr("; sandbox"));
}

TEST(ShareDownloadPolicy, LetsAViewerOfPdfStart) {
  const SharedFolder folder;
  folder.AddFile("a.pdf");
  const Response response = Download(folder.Find({"a.pdf"}), Request(), Purpose::VIEW);
  EXPECT_THAT(std::string(response.headers.Get("Content-Security-Policy")),
              AllOf(Not(HasSubstr("sandbox")), HasSubstr("frame-ancestors 'self'")));
}

TEST(ShareDownloadPolicy, ATextThatIsNotUtf8DoesNotSaySo) {
  const SharedFolder folder;
  folder.AddFile("a.txt", "Gr\xFC\xDF");
  const Response response = Download(folder.Find({"a.txt"}), Request(), Purpose::VIEW);
  EXPECT_EQ(response.headers.Get("Content-Type"), "text/plain");
}

// --- Names --------------------------------------------------------------------------------------

struct DispositionCase {
  std::string name;
  std::string value;
};

void PrintTo(const DispositionCase &test_case, std::ostream *out) {
  *out << test_case.value;
}

class ShareDisposition : public testing::TestWithParam<DispositionCase> {};

TEST_P(ShareDisposition, BearsTheName) {
  EXPECT_EQ(ContentDisposition("attachment", GetParam().name), "attachment; " + GetParam().value);
}

INSTANTIATE_TEST_SUITE_P(
    Table, ShareDisposition,
    testing::Values(
        DispositionCase{"a.txt", "filename=\"a.txt\""},
        DispositionCase{"two words; and=more.txt", "filename=\"two words; and=more.txt\""},
        DispositionCase{"Grüße.txt",
                        "filename=\"Gr__e.txt\"; filename*=UTF-8''Gr%C3%BC%C3%9Fe.txt"},
        DispositionCase{"€ 5.pdf", "filename=\"_ 5.pdf\"; filename*=UTF-8''%E2%82%AC%205.pdf"},
        DispositionCase{"\xF0\x9F\x98\x80", "filename=\"_\"; filename*=UTF-8''%F0%9F%98%80"},
        DispositionCase{"a\"b", "filename=\"a_b\"; filename*=UTF-8''a%22b"},
        DispositionCase{"a\\b", "filename=\"a_b\"; filename*=UTF-8''a%5Cb"},
        DispositionCase{"100%.txt", "filename=\"100_.txt\"; filename*=UTF-8''100%25.txt"},
        DispositionCase{"it's", "filename=\"it's\""},
        DispositionCase{"Gr\xFC\xDF"
                        "e.txt",
                        "filename=\"Gr__e.txt\"; filename*=UTF-8''Gr%C3%BC%C3%9Fe.txt"},
        DispositionCase{"", "filename=\"\""}));

TEST(ShareDisposition, NoNameBeginsAnotherField) {
  for (const std::string name : {"a\r\nSet-Cookie: b=c", "a\nb", "a\rb", "\r\n\r\n<script>",
                                 "a\x7F"
                                 "b",
                                 "a\xC2\x85"
                                 "b",
                                 "a\xE2\x80\xA8"
                                 "b"}) {
    for (const char character : ContentDisposition("inline", name)) {
      EXPECT_TRUE(character >= ' ' && character <= '~') << name;
    }
  }
}

TEST(ShareDisposition, NoNameEndsTheQuotedText) {
  for (const std::string name : {"a\"; filename=b", "a\\\"; x=\"", "\"\"\"", "\\"}) {
    const std::string value = ContentDisposition("inline", name);
    const std::string quoted = value.substr(0, value.find("; filename*="));
    EXPECT_EQ(std::count(quoted.begin(), quoted.end(), '"'), 2) << name;
    EXPECT_EQ(std::count(quoted.begin(), quoted.end(), '\\'), 0) << name;
    EXPECT_EQ(quoted.back(), '"') << name;
  }
}

// --- Dates --------------------------------------------------------------------------------------

TEST(ShareHttpDate, GoesThereAndBack) {
  for (const time_t moment : {time_t{0}, kChanged, time_t{4'102'444'800}, time_t{951'782'400}}) {
    EXPECT_EQ(ParseHttpDate(FormatHttpDate(moment)), moment);
  }
}

TEST(ShareHttpDate, IsNoneForAnythingElse) {
  for (const std::string text : {"", "now", "Sun, 13 Sep 2020", "Sun, 13 Sep 2020 12:26:40 CET",
                                 "Sun, 13 Sep 2020 12:26:40 GMT and more", "2020-09-13T12:26:40Z",
                                 "Sun, 13 Foo 2020 12:26:40 GMT"}) {
    EXPECT_FALSE(ParseHttpDate(text)) << text;
  }
}

}  // namespace
