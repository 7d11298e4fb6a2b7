#include "framework/uvo/result.h"

#include <gtest/gtest.h>

#include "framework/uvo/text.h"

namespace {

std::string Message(uvo::result_t code) { return uvo::ToUtf8(uvo::ResultMessage(code)); }

TEST(ResultMessage, GeneralTable) {
  EXPECT_EQ(Message(0), "No error");
  EXPECT_EQ(Message(1), "False");
  EXPECT_EQ(Message(uvo::kErrNoInterface), "Interface not supported");
}
}  // namespace
