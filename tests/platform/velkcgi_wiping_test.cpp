// What a view held is wiped: no memory that the library gives back, and no stack that it has used,
// still holds a parameter or a cookie.
#include <gtest/gtest.h>
#include <malloc.h>
#include <pthread.h>

#include <cstdlib>
#include <cstring>
#include <functional>
#include <new>
#include <string_view>
#include <vector>

#include "velk/velkcgi.h"

namespace {

/// Looks through memory that is given back while it lives. The test's own copies of the secret
/// must be literals: those are never given back.
class Watch {
 public:
  explicit Watch(std::string_view secret) : secret_(secret) { current_ = this; }
  ~Watch() { current_ = nullptr; }

  int blocks_with_secret() const { return blocks_with_secret_; }

  static void GivenBack(void *block) {
    if (current_ == nullptr || block == nullptr) return;
    const size_t size = malloc_usable_size(block);
    if (!current_->IsIn(block, size)) return;
    ++current_->blocks_with_secret_;
    explicit_bzero(block, size);  // so that its next owner is not blamed
  }

  /// With little stack, which is not to be overwritten before it is looked at.
  bool IsIn(const void *memory, size_t size) const {
    return std::string_view(static_cast<const char *>(memory), size).find(secret_) !=
           std::string_view::npos;
  }

 private:
  static inline thread_local Watch *current_ = nullptr;

  std::string_view secret_;
  int blocks_with_secret_ = 0;
};

}  // namespace

void *operator new(size_t size) {
  if (void *block = malloc(size)) return block;
  throw std::bad_alloc();
}

void operator delete(void *block) noexcept {
  Watch::GivenBack(block);
  free(block);
}

void operator delete(void *block, size_t) noexcept {
  Watch::GivenBack(block);
  free(block);
}

namespace {

/// Too long, and short enough, to be kept inside of a std::string.
constexpr char kLong[] = "a-secret-that-no-string-object-has-room-for";
constexpr char kShort[] = "Sh0rt-secret";
constexpr char kLongForm[] = "p=a-secret-that-no-string-object-has-room-for";
constexpr char kShortForm[] = "p=Sh0rt%2Dsecret";

/// A request of one variable, which is the current one while this lives.
class Handed {
 public:
  explicit Handed(const char *variable, std::string_view body = {})
      : environment_{variable, "CONTENT_TYPE=application/x-www-form-urlencoded", nullptr},
        request_{environment_, body.data(), body.size()} {
    VelkCgiRequestBegin(&request_);
  }
  ~Handed() { VelkCgiRequestEnd(); }

 private:
  const char *environment_[3];
  VelkCgiRequest request_;
};

void WithView(const std::function<void(VelkCgi *)> &use) {
  VelkCgi *view = nullptr;
  ASSERT_EQ(1, VelkCgiInit(&view, ""));
  use(view);
  VelkCgiFree(view);
}

/// Whether `body` leaves `secret` in memory that it gives back or on the stack that it has used.
/// What follows its first two bytes is looked for: a short text in its place hides no more than
/// those.
bool Leaves(std::string_view secret, const std::function<void()> &body) {
  secret.remove_prefix(2);
  struct Task {
    std::string_view secret;
    const std::function<void()> &body;
    int blocks = 0;
  } task{secret, body};
  std::vector<char> stack(1 << 20);
  pthread_attr_t attributes;
  pthread_attr_init(&attributes);
  pthread_attr_setstack(&attributes, stack.data(), stack.size());
  pthread_t thread;
  const auto run = [](void *data) -> void * {
    auto *own = static_cast<Task *>(data);
    const Watch watch(own->secret);
    own->body();
    own->blocks = watch.blocks_with_secret();
    return nullptr;
  };
  EXPECT_EQ(0, pthread_create(&thread, &attributes, run, &task));
  pthread_join(thread, nullptr);
  pthread_attr_destroy(&attributes);
  return task.blocks > 0 || memmem(stack.data(), stack.size(), secret.data(), secret.size());
}

TEST(VelkCgiWiping, IsLookedForWhereItCanBeSeen) {
  EXPECT_TRUE(Leaves(kLong, [] { const std::string heap(kLong); }));
  EXPECT_TRUE(Leaves(kShort, [] {
    [[maybe_unused]] volatile char stack[sizeof(kShort)];
    for (size_t i = 0; i < sizeof(kShort); ++i) stack[i] = kShort[i];
  }));
}

TEST(VelkCgiWiping, CoversParametersOfEveryLength) {
  for (const char *secret : {kLong, kShort}) {
    EXPECT_FALSE(Leaves(secret, [secret] {
      const Handed request("QUERY_STRING=", secret == kLong ? kLongForm : kShortForm);
      // Nothing else runs here that could use the stack anew.
      WithView([](VelkCgi *view) { VelkCgiGetRequestParam(view, "p", nullptr); });
    })) << secret;
  }
}

TEST(VelkCgiWiping, CoversAParameterThatIsAskedForTwice) {
  EXPECT_FALSE(Leaves(kLong, [] {
    const Handed request("QUERY_STRING=p=a-secret-that-no-string-object-has-room-for");
    WithView([](VelkCgi *view) {
      const char *first = VelkCgiGetRequestParam(view, "p", nullptr);
      EXPECT_STREQ(kLong, VelkCgiGetRequestParam(view, "p", nullptr));
      EXPECT_STREQ(kLong, first);
    });
  }));
}

TEST(VelkCgiWiping, CoversAParameterThatCountsAsAbsent) {
  EXPECT_FALSE(Leaves(kLong, [] {
    const Handed request("QUERY_STRING=p=a-secret-that-no-string-object-has-room-for%00");
    WithView([](VelkCgi *view) { EXPECT_EQ(nullptr, VelkCgiGetRequestParam(view, "p", nullptr)); });
  }));
}

TEST(VelkCgiWiping, CoversWhatStandsInANamesPlace) {
  EXPECT_FALSE(Leaves(kLong, [] {
    const Handed request("QUERY_STRING=a-secret-that-no-string-object-has-room-for&p=1");
    WithView([](VelkCgi *view) { EXPECT_STREQ("1", VelkCgiGetRequestParam(view, "p", nullptr)); });
  }));
}

TEST(VelkCgiWiping, CoversCookiesOfTheRequest) {
  const auto load = [] {
    const Handed request(
        "HTTP_COOKIE=long=a-secret-that-no-string-object-has-room-for; short=Sh0rt-secret");
    WithView([](VelkCgi *view) {
      VelkCgiLoadInCookies(view);
      EXPECT_STREQ(kLong, VelkCgiGetCookie(view, "long"));
      EXPECT_STREQ(kShort, VelkCgiGetCookie(view, "short"));
    });
  };
  EXPECT_FALSE(Leaves(kLong, load));
  EXPECT_FALSE(Leaves(kShort, load));
}

TEST(VelkCgiWiping, CoversCookiesThatAreReplaced) {
  for (const char *secret : {kLong, kShort}) {
    EXPECT_FALSE(Leaves(secret, [secret] {
      WithView([secret](VelkCgi *view) {
        EXPECT_EQ(1, VelkCgiSetCookies(view, "id", secret, 0, "/", nullptr, 0));
        EXPECT_EQ(1, VelkCgiSetCookies(view, "id", "x", 0, "/", nullptr, 0));
        EXPECT_STREQ("x", VelkCgiGetCookie(view, "id"));
      });
    })) << secret;
  }
}

}  // namespace
