// The way of a record from a worker to the file.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <thread>

#include "support/log_capture.h"
#include "support/raw_database.h"
#include "support/temp_dir.h"
#include "watch/audit_keeper.h"
#include "watch/shortened_address.h"
#include "watch/watch.h"
#include "watch_support.h"

namespace {

using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::HasSubstr;
using velk_test::RawDatabase;
using velk_test::SampleRecord;
using web::watch::AddressForm;
using web::watch::AuditChannel;
using web::watch::AuditKeeper;
using web::watch::ShortenedAddress;
using web::watch::Value;
using web::watch::Watch;

TEST(ShortenedAddress, NetworkKeepsTheFirst24BitsOfIpv4AndTheFirst48OfIpv6) {
  EXPECT_EQ("192.0.2.0/24", ShortenedAddress("192.0.2.255", AddressForm::NETWORK));
  EXPECT_EQ("2001:db8:1::/48", ShortenedAddress("2001:db8:1:2:3:4:5:6", AddressForm::NETWORK));
  EXPECT_EQ("::/48", ShortenedAddress("::1", AddressForm::NETWORK));
}

TEST(ShortenedAddress, AnIpv4AddressWrittenAsIpv6IsOneOfIpv4) {
  EXPECT_EQ("192.0.2.0/24", ShortenedAddress("::ffff:192.0.2.7", AddressForm::NETWORK));
}

TEST(ShortenedAddress, FullKeepsAllAndNoneNothing) {
  EXPECT_EQ("192.0.2.255", ShortenedAddress("192.0.2.255", AddressForm::FULL));
  EXPECT_EQ("2001:db8::1", ShortenedAddress("2001:DB8:0::1", AddressForm::FULL));
  EXPECT_EQ("", ShortenedAddress("192.0.2.255", AddressForm::NONE));
}

TEST(ShortenedAddress, WhatIsNoAddressIsNotKept) {
  for (const AddressForm form : {AddressForm::FULL, AddressForm::NETWORK})
    for (const char *text : {"", "somebody", "192.0.2", "192.0.2.1.1"})
      EXPECT_EQ("", ShortenedAddress(text, form)) << text;
}

TEST(AuditChannel, GivesBackEveryPartOfARecord) {
  AuditChannel channel;
  audit::Record record = SampleRecord();
  record.uid = 4'000'000'000;
  record.address = "ffff:ffff:ffff:ffff:ffff:ffff:ffff:ffff";
  ASSERT_TRUE(channel.Send(record));
  ASSERT_TRUE(channel.Send(SampleRecord()));
  const auto received = channel.Receive();
  ASSERT_TRUE(received);
  EXPECT_EQ(record.time, received->time);
  EXPECT_EQ(record.entry_id, received->entry_id);
  EXPECT_EQ(record.event, received->event);
  EXPECT_EQ(record.result, received->result);
  EXPECT_EQ(record.uid, received->uid);
  EXPECT_EQ(record.address, received->address);
  EXPECT_EQ(std::nullopt, channel.Receive()->uid);
  EXPECT_FALSE(channel.Receive());
  EXPECT_FALSE(channel.IsAtEnd());
}

TEST(AuditChannel, EndsWhenItsSendersAreGone) {
  AuditChannel channel;
  channel.Send(SampleRecord());
  channel.CloseSender();
  EXPECT_TRUE(channel.Receive());
  EXPECT_FALSE(channel.IsAtEnd());
  EXPECT_FALSE(channel.Receive());
  EXPECT_TRUE(channel.IsAtEnd());
}

TEST(AuditChannel, ARecordWithoutRoomIsCountedAndNobodyWaits) {
  Watch watch(true);
  constexpr int kRecords = 100'000;
  for (int i = 0; i < kRecords; ++i) watch.Keep(SampleRecord());
  int received = 0;
  while (watch.channel()->Receive()) ++received;
  EXPECT_GT(received, 100);
  EXPECT_EQ(static_cast<uint64_t>(kRecords - received),
            Value(watch.counters().table().records_without_room));
}

TEST(AuditChannel, WithoutATrailARecordIsNotMissed) {
  Watch watch(false);
  watch.Keep(SampleRecord());
  EXPECT_EQ(0u, Value(watch.counters().table().records_without_room));
}

class AuditKeeping : public testing::Test {
 protected:
  int64_t Now() const { return static_cast<int64_t>(time(nullptr)); }
  std::string path() const { return folder_.File("trail.db"); }
  std::unique_ptr<AuditKeeper> Keeper() {
    return std::make_unique<AuditKeeper>(*watch_.channel(), path(), 24h, table());
  }
  web::watch::CounterTable &table() { return watch_.counters().table(); }
  std::string CountStored() const {
    return RawDatabase(path()).Value("SELECT count(*) FROM visit");
  }

  const velk_test::TempDir folder_;
  velk_test::LogCapture log_;
  Watch watch_{true};
};

TEST_F(AuditKeeping, StoresWhatIsInTheChannelBeforeItEnds) {
  for (int i = 0; i < 100; ++i) watch_.Keep(SampleRecord(Now()));
  watch_.channel()->CloseSender();
  Keeper()->Finish(20s);
  EXPECT_EQ("100", CountStored());
  EXPECT_EQ(100u, Value(table().kept_records));
  EXPECT_EQ(0u, Value(table().records_not_stored));
}

TEST_F(AuditKeeping, RemovesWhatIsTooOldAtTheBeginning) {
  audit::Writer(path(), 100).Append({SampleRecord(Now() - 90'000), SampleRecord(Now())});
  watch_.channel()->CloseSender();
  Keeper()->Finish(20s);
  EXPECT_EQ("1", CountStored());
}

TEST_F(AuditKeeping, WaitsForAFileThatOthersHold) {
  audit::Writer(path(), 100).Append({SampleRecord(Now())});
  RawDatabase other(path());
  other.Run("BEGIN IMMEDIATE");
  watch_.Keep(SampleRecord(Now()));
  watch_.channel()->CloseSender();
  const auto keeper = Keeper();
  keeper->Finish(1s);
  EXPECT_EQ(0u, Value(table().kept_records));
  other.Run("ROLLBACK");
  keeper->Finish(20s);
  EXPECT_EQ("2", CountStored());
  EXPECT_EQ(0u, Value(table().records_not_stored));
}

TEST_F(AuditKeeping, CountsWhatABrokenFileCannotTakeAndComplainsOnce) {
  velk_test::WriteFile(path(), std::string(10'000, 'x'));
  const auto keeper = Keeper();
  for (int i = 0; i < 3; ++i) {
    watch_.Keep(SampleRecord(Now()));
    std::this_thread::sleep_for(50ms);
  }
  watch_.channel()->CloseSender();
  keeper->Finish(20s);
  EXPECT_EQ(3u, Value(table().records_not_stored));
  EXPECT_THAT(log_.Texts(), ElementsAre(HasSubstr("audit trail " + path() + ": ")));
}

TEST_F(AuditKeeping, CountsWhatIsLeftWhenItHasToEndAtOnce) {
  audit::Writer(path(), 100).Append({SampleRecord(Now())});
  RawDatabase other(path());
  other.Run("BEGIN IMMEDIATE");
  watch_.Keep(SampleRecord(Now()));
  watch_.channel()->CloseSender();
  Keeper()->Finish(1s);
  EXPECT_EQ(1u, Value(table().records_not_stored));
}

}  // namespace
