#include "framework/uvo/result.h"

#include <gtest/gtest.h>

#include <set>

#include "framework/uvo/exception.h"
#include "framework/uvo/text.h"

namespace {

std::string Message(std::uint32_t code) {
  return uvo::ToUtf8(uvo::ResultMessage(static_cast<uvo::result_t>(code)));
}

TEST(ResultMessage, GeneralCodes) {
  EXPECT_EQ(Message(0), "No error");
  EXPECT_EQ(Message(1), "False");
  EXPECT_EQ(Message(0x80000001), "Interface not supported");
  EXPECT_EQ(Message(0x80000040), "Unexpected");
  EXPECT_EQ(Message(0x80000046), "Invalid argument");
  EXPECT_EQ(Message(0x8000004B), "Unspecified error");
  EXPECT_EQ(Message(0x80000069), "Bases corrupted");
  EXPECT_EQ(Message(0x80000076), "Meta information not found");
  EXPECT_EQ(Message(0x80000180), "Property not found");
  EXPECT_EQ(Message(0x80000221), "Operation timeout");
}

TEST(ResultMessage, CodesWithoutMessageAreUnknown) {
  EXPECT_EQ(Message(2), "Unknown result code");
  EXPECT_EQ(Message(0x80000047), "Unknown result code");  // a hole in the table
  EXPECT_EQ(Message(0x8000004E), "Unknown result code");
  EXPECT_EQ(Message(0xFFFFFFFF), "Unknown result code");
}

TEST(ResultMessage, TableHasUniqueCodesAndAnswersForEach) {
  std::size_t count = 0;
  const uvo::ResultCodeEntry* table = uvo::ResultCodeTable(&count);
  EXPECT_EQ(count, 41u);
  std::set<uvo::result_t> seen;
  for (std::size_t i = 0; i < count; ++i) {
    EXPECT_TRUE(seen.insert(table[i].code).second) << std::hex << table[i].code;
    EXPECT_FALSE(table[i].message.empty());
    EXPECT_EQ(uvo::ResultMessage(table[i].code), table[i].message);
    EXPECT_FALSE(uvo::IsPlatformCode(table[i].code));
  }
}

TEST(ResultMessage, PlatformTable) {
  EXPECT_EQ(Message(0x80010100), "Unspecified platform error");
  EXPECT_EQ(Message(0x80010101), "Invalid handle");
  EXPECT_EQ(Message(0x80010102), "File not found");
  EXPECT_EQ(Message(0x80010109), "Invalid path name");
  EXPECT_EQ(Message(0x80010110), "Cannot open an anonymous level security token");
  EXPECT_EQ(Message(0x80010111), "Password is invalid");
  EXPECT_EQ(Message(0x80010112), "Module not found");
  EXPECT_EQ(Message(0x80010113), "System image bad signature");
  // Indices 10..15 and past 19 have no message; neither has a platform code below the base.
  EXPECT_EQ(Message(0x8001010A), "Unknown platform result code");
  EXPECT_EQ(Message(0x8001010F), "Unknown platform result code");
  EXPECT_EQ(Message(0x80010114), "Unknown platform result code");
  EXPECT_EQ(Message(0x800100FF), "Unknown platform result code");
  EXPECT_EQ(Message(0x00010000), "Unknown platform result code");
}

TEST(FrameworkException, ResultCodeDescription) {
  uvo::ResultCodeException plain("a.cpp", 1, "f", uvo::kErrInvalidArgument);
  EXPECT_EQ(uvo::ToUtf8(plain.Description()), "0x80000046 (Invalid argument)");
  uvo::ResultCodeException based("a.cpp", 1, "f", uvo::kErrNotFound, u"no entry");
  EXPECT_EQ(uvo::ToUtf8(based.Description()), "no entry: 0x8000004c (Not found)");
  uvo::ResultCodeException platform("a.cpp", 1, "f", static_cast<uvo::result_t>(0x80010102));
  EXPECT_EQ(uvo::ToUtf8(platform.Description()), "0x80010102 (File not found)");
}

TEST(FrameworkException, ClassNamesAndDescriptions) {
  EXPECT_STREQ(uvo::ResultCodeException("f", 1, "", 0).what(), "ResultCodeException");
  EXPECT_STREQ(uvo::SystemException("f", 1, "", 0).what(), "SystemException");
  EXPECT_STREQ(uvo::CheckResultFailedException("f", 1, 0).what(), "CheckResultFailedException");
  EXPECT_STREQ(uvo::CheckFailedException("f", 1).what(), "CheckFailedException");
  uvo::GetInterfaceException getInterface("f", 1, "", 0x6EF3329B, uvo::kErrNotFound);
  EXPECT_STREQ(getInterface.what(), "GetInterfaceException");
  EXPECT_EQ(uvo::ToUtf8(getInterface.Description()), "iid = 0x6ef3329b: 0x8000004c (Not found)");
  EXPECT_EQ(getInterface.Code(), uvo::kErrNotFound);
  uvo::CheckFailedException check("service.cpp", 42);
  EXPECT_TRUE(check.Description().empty());
  EXPECT_EQ(check.Line(), 42);
}

TEST(FrameworkException, ChecksNameTheSourceBaseName) {
  try {
    UVO_CHECK(1 + 1 == 3);
    FAIL() << "the check passed";
  } catch (const uvo::CheckFailedException& e) {
    EXPECT_STREQ(e.File(), "result_test.cpp");
  }
  try {
    UVO_CHECK_RESULT(uvo::kErrAccessDenied);
    FAIL() << "the check passed";
  } catch (const uvo::CheckResultFailedException& e) {
    EXPECT_EQ(e.Code(), uvo::kErrAccessDenied);
    EXPECT_EQ(uvo::ToUtf8(e.Description()), "0x80000045 (Access denied)");
  }
  EXPECT_NO_THROW(UVO_CHECK_RESULT(uvo::kFalse));
}

TEST(FrameworkText, Utf16ToUtf8) {
  EXPECT_EQ(uvo::ToUtf8(u"a\u00e9\u20ac"), "a\xC3\xA9\xE2\x82\xAC");
  EXPECT_EQ(uvo::ToUtf8(u"\U0001F600"), "\xF0\x9F\x98\x80");
  const char16_t lone[] = {0xD800, u'x', 0};
  EXPECT_EQ(uvo::ToUtf8(lone), "\xEF\xBF\xBDx");
}

}  // namespace
