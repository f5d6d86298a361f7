// Source and destination in the same memory: rows whose bytes overlap are processed in ascending
// order, so that pixels can be converted where they are.
#include <algorithm>
#include <cctype>
#include <vector>

#include "tests/exact/exact_support.h"
#include "tests/support/instruction_sets.h"

namespace kestrel::test {
namespace {

constexpr int32_t kWidths[] = {1, 2, 7, 15, 16, 17, 31, 33, 64, 65, 100, 130, 191, 300, 2100};
constexpr int32_t kHeight = 3;

Bytes Numbered(size_t size) {
  Bytes bytes(size);
  for (size_t i = 0; i < size; ++i) bytes[i] = uint8_t(i * 7 + i / 251);
  return bytes;
}

struct Rgb {
  uint32_t code;
  int32_t bytes;
};

class Overlap : public testing::TestWithParam<testing_support::InstructionSet> {};

// Expects of a conversion that begins where its source does what one from other memory gives.
void ExpectInPlace(const testing_support::InstructionSet& set, const Rgb& from, const Rgb& to,
                   int32_t width, int32_t fromPitch, int32_t toPitch) {
  SCOPED_TRACE(testing::Message() << std::hex << from.code << " to " << to.code << std::dec
                                  << ", width " << width);
  const Engine engine({to.code, width, kHeight}, {from.code, width, kHeight});
  testing_support::ForceRows(engine.handle(), set);
  const Bytes source = Numbered(size_t(fromPitch) * kHeight);
  Bytes apart = source;
  Bytes input = source;
  ASSERT_EQ(Process(engine, OnePlane(apart, toPitch), OnePlane(input, fromPitch)), KESTREL_OK);
  Bytes inPlace = source;
  ASSERT_EQ(Process(engine, OnePlane(inPlace, toPitch), OnePlane(inPlace, fromPitch)), KESTREL_OK);
  EXPECT_EQ(inPlace, apart);
}

TEST_P(Overlap, PixelsBecomeOthersOfTheirSizeInPlace) {
  const std::vector<std::vector<Rgb>> sizes = {
      {{FORMAT_RGB565, 2}, {FORMAT_BGR565, 2}},
      {{FORMAT_RGB888, 3}, {FORMAT_BGR888, 3}},
      {{FORMAT_XRGB8888, 4}, {FORMAT_XBGR8888, 4}, {FORMAT_RGBX8888, 4}, {FORMAT_BGRX8888, 4}}};
  for (const std::vector<Rgb>& formats : sizes) {
    for (const Rgb& from : formats) {
      for (const Rgb& to : formats) {
        for (const int32_t width : kWidths) {
          const int32_t pitch = width * from.bytes + 5;
          ExpectInPlace(GetParam(), from, to, width, pitch, pitch);
        }
      }
    }
  }
}

TEST_P(Overlap, PixelsShrinkInPlace) {
  for (const Rgb& from : {Rgb{FORMAT_XBGR8888, 4}, Rgb{FORMAT_RGB888, 3}, Rgb{FORMAT_RGB666, 3}}) {
    for (const Rgb& to : {Rgb{FORMAT_RGB888, 3}, Rgb{FORMAT_RGB666, 3}, Rgb{FORMAT_RGB565, 2}}) {
      if (to.bytes >= from.bytes) continue;
      for (const int32_t width : kWidths) {
        ExpectInPlace(GetParam(), from, to, width, width * from.bytes, width * to.bytes);
      }
    }
  }
}

// Each pixel is read after those before it have been written.
TEST_P(Overlap, PixelsConvertedFurtherOnReadWhatWasWritten) {
  constexpr int32_t kWidth = 70;
  const Engine engine({FORMAT_XRGB8888, kWidth, 1}, {FORMAT_XBGR8888, kWidth, 1});
  testing_support::ForceRows(engine.handle(), GetParam());
  for (const int shift : {1, 3, 4, 9, 64}) {
    SCOPED_TRACE(testing::Message() << "shift " << shift);
    Bytes bytes = Numbered(size_t{4} * kWidth + size_t(shift));
    Bytes expected = bytes;
    for (int x = 0; x < kWidth; ++x) {
      const uint8_t* const in = &expected[size_t{4} * size_t(x)];
      const uint8_t pixel[4] = {in[2], in[1], in[0], in[3]};
      std::copy(pixel, pixel + 4, expected.begin() + 4 * x + shift);
    }
    const Planes from = OnePlane(bytes, 4 * kWidth);
    const Planes to = {{bytes.data() + shift, nullptr, nullptr}, {4 * kWidth, 0, 0}};
    ASSERT_EQ(Process(engine, to, from), KESTREL_OK);
    EXPECT_EQ(bytes, expected);
  }
}

TEST_P(Overlap, RowsCopiedOntoThemselvesRepeatTheirBeginning) {
  const Engine engines[] = {{{FORMAT_GRAY8, 70, kHeight}, {FORMAT_GRAY8, 70, kHeight}},
                            {{FORMAT_I420, 70, kHeight}, {FORMAT_NV21, 70, kHeight}}};
  for (const Engine& engine : engines) {
    testing_support::ForceRows(engine.handle(), GetParam());
    for (const int32_t pitch : {70, 96}) {
      for (const int shift : {-96, -20, -8, -1, 0, 1, 8, 20, 96}) {
        SCOPED_TRACE(testing::Message() << "pitch " << pitch << ", shift " << shift);
        constexpr int kMargin = 100;
        Bytes bytes = Numbered(2 * kMargin + size_t(pitch) * kHeight);
        Bytes expected = bytes;
        for (int row = 0; row < kHeight; ++row) {
          for (int x = 0; x < 70; ++x) {
            const size_t at = size_t(kMargin + row * pitch + x);
            expected[at + size_t(shift)] = expected[at];
          }
        }
        Bytes chroma(2 * 35 * 2), u(35 * 2), v(35 * 2);
        uint8_t* const luma = bytes.data() + kMargin;
        const Planes from = {{luma, chroma.data() + 1, chroma.data()}, {pitch, 70, 70}};
        const Planes to = {{luma + shift, u.data(), v.data()}, {pitch, 35, 35}};
        ASSERT_EQ(Process(engine, to, from), KESTREL_OK);
        EXPECT_EQ(bytes, expected);
      }
    }
  }
}

INSTANTIATE_TEST_SUITE_P(Sets, Overlap, testing::ValuesIn(testing_support::InstructionSets()),
                         [](const auto& set) {
                           std::string name;
                           for (const char c : set.param.name) {
                             if (isalnum(c) != 0) name += c;
                           }
                           return name;
                         });

}  // namespace
}  // namespace kestrel::test
