#include "services/anti_phishing/heuristic/source/stream_wrappers.h"

#include <gtest/gtest.h>

#include <boost/numeric/conversion/converter_policies.hpp>

#include "tests/support/kb_test_support.h"

namespace {

using cf::services::anti_phishing::heuristic::ImageLoadStream;
using cf::services::anti_phishing::heuristic::ReadableFileStream;
using pelmix::testing::FaultStream;

template <class Exception, class Call>
std::string MessageOf(Call&& call) {
  try {
    call();
  } catch (const Exception& e) {
    return e.what();
  }
  return "no error";
}

constexpr char kOverflow[] = "bad numeric conversion: positive overflow";

TEST(ReadableFileStream, ReadsSeeksAndSizes) {
  const auto stream = FaultStream::Create("abcdefgh");
  ReadableFileStream file(stream.Get());
  EXPECT_EQ(file.file_size(), 8);
  EXPECT_EQ(file.file_seek(5), 5);
  char out[8] = {};
  EXPECT_EQ(file.file_read(out, 8), 3) << "the host's short read is passed on";
  EXPECT_EQ(std::string(out, 3), "fgh");
  const int reads = stream->reads;
  EXPECT_EQ(file.file_read(out, 0), 0);
  EXPECT_EQ(file.file_read(nullptr, 4), 0);
  EXPECT_EQ(stream->reads, reads) << "nothing to read asks nothing of the host";
}

TEST(ReadableFileStream, FailuresAndNarrowing) {
  EXPECT_EQ(MessageOf<std::invalid_argument>([] { ReadableFileStream file(nullptr); }),
            "ReadableFileStream::ReadableFileStream: null stream pointer");

  const auto stream = FaultStream::Create("abcdefgh");
  ReadableFileStream file(stream.Get());
  char out[4];
  EXPECT_EQ(MessageOf<boost::numeric::positive_overflow>(
                [&] { file.file_read(out, std::uint64_t{1} << 32); }),
            kOverflow);
  stream->seek_lands_at = std::uint64_t{1} << 31;
  EXPECT_EQ(MessageOf<boost::numeric::positive_overflow>([&] { file.file_seek(1); }), kOverflow);
  stream->seek_lands_at = (std::uint64_t{1} << 31) - 1;
  EXPECT_EQ(file.file_seek(1), (std::int64_t{1} << 31) - 1);
  stream->reported_size = std::uint64_t{1} << 32;
  EXPECT_EQ(MessageOf<boost::numeric::positive_overflow>([&] { file.file_size(); }), kOverflow);

  stream->fail_seek = uvo::kErrInvalidArgument;
  stream->fail_size = uvo::kErrUnexpected;
  stream->fail_read = uvo::kErrMedia;
  EXPECT_EQ(MessageOf<std::runtime_error>([&] { file.file_seek(0); }),
            "ReadableFileStream::file_seek: invalid seek");
  EXPECT_EQ(MessageOf<std::runtime_error>([&] { file.file_size(); }),
            "ReadableFileStream::file_size: failed to get stream size");
  EXPECT_EQ(MessageOf<std::runtime_error>([&] { file.file_read(out, 4); }),
            "ReadableFileStream::file_read: failed to read from stream");
}

TEST(ImageLoadStream, ReadSeekTell) {
  const auto stream = FaultStream::Create("abcdefgh");
  ImageLoadStream image(stream.Get());
  EXPECT_TRUE(image.seek(2));
  EXPECT_EQ(image.tell(), 2);
  char out[8] = {};
  EXPECT_EQ(image.read(out, 8), 6);
  EXPECT_EQ(std::string(out, 6), "cdefgh");
  EXPECT_EQ(image.read(out, 0), 0);
  EXPECT_EQ(image.read(nullptr, -1), 0) << "a null buffer answers before the count is judged";

  const int seeks = stream->seeks;
  EXPECT_FALSE(image.seek(-1));
  EXPECT_EQ(stream->seeks, seeks) << "a negative position must not reach the host";
  stream->fail_seek = uvo::kErrInvalidArgument;
  EXPECT_FALSE(image.seek(1));
}

TEST(ImageLoadStream, Failures) {
  EXPECT_EQ(MessageOf<std::invalid_argument>([] { ImageLoadStream image(nullptr); }),
            "ImageLoadStream::ImageLoadStream: null stream pointer");
  const auto stream = FaultStream::Create("abcdefgh");
  ImageLoadStream image(stream.Get());
  char out[4];
  EXPECT_EQ(MessageOf<std::runtime_error>([&] { image.read(out, -1); }),
            "ImageLoadStream::read: negative bytes to read value");
  stream->reported_tell = std::uint64_t{1} << 31;
  EXPECT_EQ(MessageOf<boost::numeric::positive_overflow>([&] { image.tell(); }), kOverflow);
  stream->fail_read = uvo::kErrMedia;
  stream->fail_tell = uvo::kErrUnexpected;
  EXPECT_EQ(MessageOf<std::runtime_error>([&] { image.read(out, 4); }),
            "ImageLoadStream::read: failed to read from stream");
  EXPECT_EQ(MessageOf<std::runtime_error>([&] { image.tell(); }),
            "ImageLoadStream::tell: failed to get stream position");
}

}  // namespace
