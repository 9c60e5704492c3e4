#include "stutil/deflater.h"

#include <gtest/gtest.h>
#include <libdeflate.h>

#include <memory>
#include <random>
#include <string>
#include <vector>

namespace stutil {
namespace {

using Bytes = std::vector<uint8_t>;

Bytes Noise(size_t size) {
  std::mt19937 random(7);
  Bytes bytes(size);
  for (uint8_t& byte : bytes)
    byte = static_cast<uint8_t>(random());
  return bytes;
}

Bytes Text(size_t size) {
  std::mt19937 random(8);
  std::string text;
  while (text.size() < size)
    text += "line " + std::to_string(random() % 5000) + (random() % 3 ? " done\r\n" : " fails\r\n");
  text.resize(size);
  return Bytes(text.begin(), text.end());
}

// Long stretches of one kind, so that one stream has blocks of every type.
Bytes Mixture() {
  Bytes bytes = Text(400'000);
  const Bytes noise = Noise(200'000);
  bytes.insert(bytes.end(), noise.begin(), noise.end());
  bytes.insert(bytes.end(), 300'000, 0);
  bytes.insert(bytes.end(), noise.begin(), noise.begin() + 70'000);
  return bytes;
}

bool InflatesTo(const Bytes& stream, const Bytes& expected) {
  const std::unique_ptr<libdeflate_decompressor, decltype(&libdeflate_free_decompressor)> decompressor(
      libdeflate_alloc_decompressor(), &libdeflate_free_decompressor);
  Bytes inflated(expected.size() + 1);
  size_t read = 0;
  size_t written = 0;
  const libdeflate_result result = libdeflate_deflate_decompress_ex(decompressor.get(), stream.data(), stream.size(),
                                                                    inflated.data(), inflated.size(), &read, &written);
  inflated.resize(written);
  return result == LIBDEFLATE_SUCCESS && read == stream.size() && inflated == expected;
}

TEST(Deflater, PiecesStandBehindEachOtherAsOneStream) {
  const Bytes inputs[] = {
      {}, {1}, Bytes(40, 'a'), Text(300), Text(200'000), Noise(100), Noise(150'000), Bytes(500'000, 0), Mixture()};
  Deflater deflater;
  for (size_t first = 0; first < std::size(inputs); ++first) {
    for (size_t second = 0; second < std::size(inputs); ++second) {
      SCOPED_TRACE(testing::Message() << "inputs " << first << " and " << second);
      Bytes stream;
      ASSERT_TRUE(deflater.Append(inputs[first], StreamEnd::kContinuable, stream));
      ASSERT_TRUE(deflater.Append(inputs[second], StreamEnd::kFinal, stream));
      Bytes both = inputs[first];
      both.insert(both.end(), inputs[second].begin(), inputs[second].end());
      EXPECT_TRUE(InflatesTo(stream, both));
      EXPECT_EQ(JoinCrc32(Crc32(inputs[first]), Crc32(inputs[second]), inputs[second].size()), Crc32(both));
    }
  }
}

// Every length moves the end of the stream to another bit of its last byte.
TEST(Deflater, JoinsStreamsThatEndAtAnyBit) {
  const Bytes text = Text(2000);
  Deflater deflater;
  for (size_t length = 0; length < text.size(); length += 7) {
    const Bytes input(text.begin(), text.begin() + static_cast<std::ptrdiff_t>(length));
    Bytes stream;
    ASSERT_TRUE(deflater.Append(input, StreamEnd::kContinuable, stream));
    ASSERT_TRUE(deflater.Append({}, StreamEnd::kFinal, stream));
    EXPECT_TRUE(InflatesTo(stream, input)) << length;
  }
}

}  // namespace
}  // namespace stutil
