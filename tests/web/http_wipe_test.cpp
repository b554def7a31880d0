#include <gtest/gtest.h>

#include <algorithm>

#include "http/wipe.h"

namespace {

TEST(Wipe, OverwritesTheMemoryOfAText) {
  std::string text(100, 'x');
  text.resize(50);
  const char *memory = text.data();
  web::Wipe(text);
  EXPECT_EQ("", text);
  ASSERT_EQ(memory, text.data());
  EXPECT_TRUE(std::all_of(memory, memory + 100, [](char byte) { return byte == '\0'; }));
}

}  // namespace
