#include "internal/helpers/io_adapters/antiphishing_io_adapter.h"

#include <gtest/gtest.h>

#include "framework/uvo/exception.h"
#include "host/stream.h"
#include "tests/support/kb_test_support.h"

namespace {

using cf::adapters::AntiphishingIOAdapter;
using pelmix::testing::FaultStream;

constexpr char kTen[] = "0123456789";

TEST(IoAdapter, BoundsOnATenByteFile) {
  const auto file = pelmix::host::MemoryStream::Create(std::string(kTen));
  AntiphishingIOAdapter adapter(file.Get());
  EXPECT_EQ(adapter.file_size(), 10);
  EXPECT_EQ(adapter.file_seek(9), 9);
  EXPECT_THROW(adapter.file_seek(10), uvo::CheckFailedException);
  EXPECT_THROW(adapter.file_seek(-1), uvo::CheckFailedException);
  EXPECT_EQ(adapter.tell(), 9) << "a refused seek must not move";

  char out[4] = {};
  EXPECT_THROW(adapter.file_read(out, 2), uvo::CheckFailedException);
  EXPECT_EQ(adapter.file_read(out, 1), 1);
  EXPECT_EQ(out[0], '9');
  EXPECT_EQ(adapter.tell(), 10);
  EXPECT_EQ(adapter.file_read(out, 0), 0);
  EXPECT_THROW(adapter.file_read(out, 1), uvo::CheckFailedException);
  EXPECT_THROW(adapter.file_read(nullptr, 0), uvo::CheckFailedException);
}

TEST(IoAdapter, ClonesKeepTheirOwnPositionsOverOneHostFile) {
  const auto file = pelmix::host::MemoryStream::Create(std::string(kTen));
  AntiphishingIOAdapter first(file.Get());
  char out[3] = {};
  first.file_seek(5);
  const auto second = first.clone();
  EXPECT_EQ(second->tell(), 0);
  ASSERT_EQ(second->file_read(out, 3), 3);
  EXPECT_EQ(std::string(out, 3), "012");
  // The host file's own position moved with the clone; the first adapter seeks again.
  ASSERT_EQ(first.file_read(out, 3), 3);
  EXPECT_EQ(std::string(out, 3), "567");
  ASSERT_EQ(second->file_read(out, 3), 3);
  EXPECT_EQ(std::string(out, 3), "345");
}

TEST(IoAdapter, ConstructionChecksTheHostFile) {
  EXPECT_THROW(AntiphishingIOAdapter(nullptr), uvo::CheckFailedException);

  const auto lands_elsewhere = FaultStream::Create(kTen);
  lands_elsewhere->seek_lands_at = 3;
  EXPECT_THROW(AntiphishingIOAdapter(lands_elsewhere.Get()), uvo::CheckFailedException);

  const auto no_size = FaultStream::Create(kTen);
  no_size->fail_size = uvo::kErrAccessDenied;
  try {
    AntiphishingIOAdapter adapter(no_size.Get());
    FAIL() << "a failing size must fail the adapter";
  } catch (const uvo::CheckResultFailedException& e) {
    EXPECT_EQ(e.Code(), uvo::kErrAccessDenied);
  }

  const auto no_seek = FaultStream::Create(kTen);
  no_seek->fail_seek = uvo::kErrUnexpected;
  EXPECT_THROW(AntiphishingIOAdapter(no_seek.Get()), uvo::CheckResultFailedException);
}

TEST(IoAdapter, HostFailuresWhileReading) {
  const auto file = FaultStream::Create(kTen);
  AntiphishingIOAdapter adapter(file.Get());
  char out[4];
  file->fail_read = uvo::kErrMedia;
  try {
    adapter.file_read(out, 4);
    FAIL() << "a failing host read must raise";
  } catch (const uvo::CheckResultFailedException& e) {
    EXPECT_EQ(e.Code(), uvo::kErrMedia);
    EXPECT_STREQ(e.File(), "antiphishing_io_adapter.cpp");
  }
  file->fail_read = 0;
  file->fail_seek = uvo::kErrUnexpected;
  EXPECT_THROW(adapter.file_read(out, 4), uvo::CheckResultFailedException);
  EXPECT_THROW(adapter.file_seek(2), uvo::CheckResultFailedException);
}

TEST(IoAdapter, HoldsOneReferenceAndIsReadOnly) {
  const auto file = pelmix::host::MemoryStream::Create(std::string(kTen));
  const std::uint32_t before = file->RefCount();
  {
    AntiphishingIOAdapter adapter(file.Get());
    EXPECT_EQ(file->RefCount(), before + 1);
    const auto clone = adapter.clone();
    EXPECT_EQ(file->RefCount(), before + 2);

    auto message = [](auto&& call) {
      try {
        call();
      } catch (const std::runtime_error& e) {
        return std::string(e.what());
      }
      return std::string("no error");
    };
    EXPECT_EQ(message([&] { adapter.open_for_reading(); }),
              "AntiphishingIOAdapter::open_for_reading must not be called");
    EXPECT_EQ(message([&] { adapter.file_write(kTen, 1); }),
              "AntiphishingIOAdapter::file_write must not be called");
    EXPECT_EQ(message([&] { adapter.file_truncate(0); }),
              "AntiphishingIOAdapter::file_truncate must not be called");
  }
  EXPECT_EQ(file->RefCount(), before);
}

}  // namespace
