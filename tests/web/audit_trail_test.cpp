// The audit trail's file: what is written is read, whatever happens to the file in between.
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <thread>

#include "audit/database.h"
#include "audit/reader.h"
#include "audit/writer.h"
#include "support/raw_database.h"
#include "support/temp_dir.h"
#include "watch_support.h"

namespace {

using audit::DatabaseError;
using audit::Event;
using audit::Query;
using audit::Reader;
using audit::Record;
using audit::Writer;
using testing::ElementsAre;
using testing::HasSubstr;
using velk_test::RawDatabase;
using velk_test::SampleRecord;

constexpr int kPatience = 100;  // milliseconds

class AuditTrail : public testing::Test {
 protected:
  std::string path() const { return folder_.File("trail.db"); }

  std::vector<Record> Read(const Query &query) const {
    std::vector<Record> records;
    Reader(path()).Read(query, [&](const Record &record) { records.push_back(record); });
    return records;
  }

  std::vector<int64_t> Seconds(Query query) const {
    query.entry_id = 7;
    std::vector<int64_t> seconds;
    for (const Record &record : Read(query)) seconds.push_back(record.time / 1'000'000);
    return seconds;
  }

  const velk_test::TempDir folder_;
};

/// What a call fails with; "" when it does not.
template <typename Call>
std::string ErrorOf(const Call &call) {
  try {
    call();
    return "";
  } catch (const DatabaseError &error) {
    return error.what();
  }
}

TEST_F(AuditTrail, GivesBackEveryPartOfARecord) {
  Record record = SampleRecord();
  record.event = Event::LOGOUT;
  record.uid = 4'000'000'000;
  record.address = "it's \"quoted\"; --";
  Writer(path(), kPatience).Append({record, SampleRecord()});
  const std::vector<Record> records = Read({7});
  ASSERT_EQ(2u, records.size());
  EXPECT_EQ(record.time, records[0].time);
  EXPECT_EQ(record.event, records[0].event);
  EXPECT_EQ(record.result, records[0].result);
  EXPECT_EQ(record.uid, records[0].uid);
  EXPECT_EQ(record.address, records[0].address);
  EXPECT_EQ(std::nullopt, records[1].uid);
}

TEST_F(AuditTrail, IsReadOldestFirstAndByLink) {
  Record other = SampleRecord(2);
  other.entry_id = 8;
  Writer(path(), kPatience).Append({SampleRecord(3), SampleRecord(1), other, SampleRecord(2)});
  EXPECT_THAT(Seconds({}), ElementsAre(1, 2, 3));
  EXPECT_EQ(1u, Read({8}).size());
}

TEST_F(AuditTrail, GivesTheLastOnesAndThoseSinceAMoment) {
  Writer(path(), kPatience).Append({SampleRecord(1), SampleRecord(2), SampleRecord(3)});
  Query last;
  last.limit = 2;
  EXPECT_THAT(Seconds(last), ElementsAre(2, 3));
  Query since;
  since.since = 2'000'000;
  EXPECT_THAT(Seconds(since), ElementsAre(2, 3));
}

TEST_F(AuditTrail, GivesWhatIsNewToWhoKnowsTheRest) {
  Writer writer(path(), kPatience);
  writer.Append({SampleRecord(5)});
  Query query;
  query.entry_id = 7;
  query.after_id = Reader(path()).Read(query, [](const Record &) {});
  writer.Append({SampleRecord(4)});  // its request began earlier
  EXPECT_THAT(Seconds(query), ElementsAre(4));
}

TEST_F(AuditTrail, RemovesWhatIsTooOld) {
  Writer writer(path(), kPatience);
  writer.Append({SampleRecord(1), SampleRecord(2), SampleRecord(3)});
  writer.RemoveBefore(2'000'000);
  EXPECT_THAT(Seconds({}), ElementsAre(2, 3));
}

TEST_F(AuditTrail, RemovingMakesNoFile) {
  Writer(path(), kPatience).RemoveBefore(2'000'000);
  EXPECT_NE(0, access(path().c_str(), F_OK));
}

TEST_F(AuditTrail, IsForItsOwnAccountAlone) {
  const mode_t mask = umask(0);
  Writer(path(), kPatience).Append({SampleRecord()});
  umask(mask);
  struct stat info = {};
  ASSERT_EQ(0, stat(path().c_str(), &info));
  EXPECT_EQ(0600u, info.st_mode & 0777);
}

TEST_F(AuditTrail, AMissingFileIsToldFromAnUnreadableOne) {
  try {
    Reader reader(path());
    FAIL();
  } catch (const DatabaseError &error) {
    EXPECT_TRUE(error.IsMissing());
  }
  mkdir(path().c_str(), 0700);
  try {
    Reader(path()).Read({7}, [](const Record &) {});
    FAIL();
  } catch (const DatabaseError &error) {
    EXPECT_FALSE(error.IsMissing());
  }
}

TEST_F(AuditTrail, AFolderThatIsNotThereIsTold) {
  Writer writer(folder_.File("no/trail.db"), kPatience);
  EXPECT_THAT(ErrorOf([&] { writer.Append({SampleRecord()}); }), HasSubstr("No such file"));
}

TEST_F(AuditTrail, AFolderThatMayNotBeWrittenToIsTold) {
  if (geteuid() == 0) GTEST_SKIP() << "root may write everywhere";
  chmod(folder_.path().c_str(), 0500);
  Writer writer(path(), kPatience);
  const std::string error = ErrorOf([&] { writer.Append({SampleRecord()}); });
  chmod(folder_.path().c_str(), 0700);
  EXPECT_THAT(error, HasSubstr("Permission denied"));
}

TEST_F(AuditTrail, ASymbolicLinkIsNotFollowed) {
  velk_test::WriteFile(folder_.File("precious"), "");
  ASSERT_EQ(0, symlink(folder_.File("precious").c_str(), path().c_str()));
  EXPECT_NE("", ErrorOf([&] { Writer(path(), kPatience).Append({SampleRecord()}); }));
  EXPECT_EQ("", velk_test::ReadFile(folder_.File("precious")));
}

TEST_F(AuditTrail, ABrokenFileIsLeftAsItIsAndReplacedWhenItIsGone) {
  const std::string content(10'000, 'x');
  velk_test::WriteFile(path(), content);
  Writer writer(path(), kPatience);
  EXPECT_THAT(ErrorOf([&] { writer.Append({SampleRecord()}); }), HasSubstr("not a database"));
  EXPECT_EQ(content, velk_test::ReadFile(path()));
  unlink(path().c_str());
  writer.Append({SampleRecord()});
  EXPECT_EQ(1u, Read({7}).size());
}

TEST_F(AuditTrail, AFileOfANewerProgramIsLeftAsItIs) {
  RawDatabase(path()).Run("PRAGMA user_version = 2");
  EXPECT_THAT(ErrorOf([&] { Writer(path(), kPatience).Append({SampleRecord()}); }),
              HasSubstr("newer program"));
  EXPECT_THAT(ErrorOf([&] { Read({7}); }), HasSubstr("newer program"));
  EXPECT_EQ("0", RawDatabase(path()).Value("SELECT count(*) FROM sqlite_schema"));
}

TEST_F(AuditTrail, AnEmptyFileHasNoRecords) {
  velk_test::WriteFile(path(), "");
  EXPECT_TRUE(Read({7}).empty());
}

TEST_F(AuditTrail, ABusyFileIsToldAndNothingIsStoredOfTheCall) {
  Writer writer(path(), kPatience);
  writer.Append({SampleRecord(1)});
  RawDatabase other(path());
  other.Run("BEGIN IMMEDIATE");
  try {
    writer.Append({SampleRecord(2), SampleRecord(3)});
    FAIL();
  } catch (const DatabaseError &error) {
    EXPECT_TRUE(error.IsBusy());
  }
  other.Run("ROLLBACK");
  writer.Append({SampleRecord(4)});
  EXPECT_THAT(Seconds({}), ElementsAre(1, 4));
}

TEST_F(AuditTrail, AFullDiskIsToldAndNothingIsStoredOfTheCall) {
  Writer writer(path(), kPatience);
  writer.Append({SampleRecord(1)});
  const std::vector<Record> many(20'000, SampleRecord(2));
  struct stat info = {};
  ASSERT_EQ(0, stat((path() + "-wal").c_str(), &info));
  // A file that may not grow fails like one on a full disk.
  rlimit old = {};
  getrlimit(RLIMIT_FSIZE, &old);
  rlimit small = old;
  small.rlim_cur = static_cast<rlim_t>(info.st_size) + 100'000;
  signal(SIGXFSZ, SIG_IGN);
  setrlimit(RLIMIT_FSIZE, &small);
  const std::string error = ErrorOf([&] { writer.Append(many); });
  setrlimit(RLIMIT_FSIZE, &old);
  signal(SIGXFSZ, SIG_DFL);
  EXPECT_NE("", error);
  writer.Append({SampleRecord(3)});
  EXPECT_THAT(Seconds({}), ElementsAre(1, 3));
}

TEST_F(AuditTrail, ANewFileInItsPlaceIsNoticed) {
  Writer writer(path(), kPatience);
  writer.Append({SampleRecord(1)});
  Reader reader(path());
  EXPECT_FALSE(reader.HasMoved());
  ASSERT_EQ(0, rename(path().c_str(), folder_.File("away").c_str()));
  EXPECT_TRUE(reader.HasMoved());
  writer.Append({SampleRecord(2)});
  EXPECT_THAT(Seconds({}), ElementsAre(2));
}

TEST_F(AuditTrail, TakesRecordsOfSeveralWritersAtOnce) {
  std::vector<std::thread> threads;
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([this] {
      Writer writer(path(), 20'000);
      for (int j = 0; j < 20; ++j) writer.Append({SampleRecord()});
    });
  }
  for (std::thread &thread : threads) thread.join();
  EXPECT_EQ(80u, Read({7}).size());
}

}  // namespace
