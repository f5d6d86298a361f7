// The colour operations of every table over all colours, against the model's sums.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <numeric>
#include <vector>

#include "tests/differential/random.h"
#include "tests/exact/exact_support.h"
#include "tests/reference/colour.h"
#include "tests/rows/row_tables.h"

namespace rows_tests {
namespace {

using kestrel::test::Engine;
using kestrel::test::Param;
using reference::Triple;

constexpr uint32_t kStandards[] = {FORMAT_BT601_VIDEO, FORMAT_BT601_FULL, FORMAT_BT709_VIDEO,
                                   FORMAT_BT709_FULL};

// Three channels of a run of colours.
struct Colours {
  explicit Colours(size_t n = 0) { Resize(n); }
  void Resize(size_t n) {
    for (auto& channel : channels) {
      channel.resize(n);
    }
  }
  size_t size() const { return channels[0].size(); }
  Triple At(size_t i) const { return {channels[0][i], channels[1][i], channels[2][i]}; }
  void Set(size_t i, const Triple& triple) {
    for (size_t c = 0; c < 3; ++c) {
      channels[c][i] = uint8_t(triple[c]);
    }
  }
  const uint8_t* operator[](size_t c) const { return channels[c].data(); }
  std::array<uint8_t*, 3> Writable() {
    return {channels[0].data(), channels[1].data(), channels[2].data()};
  }
  bool operator==(const Colours& other) const { return channels == other.channels; }

  std::array<std::vector<uint8_t>, 3> channels;
};

// The first difference of two runs, with the colour that it comes from.
std::string Difference(const Colours& colours, const Colours& got, const Colours& expected) {
  const auto text = [](const Triple& triple) {
    return "(" + std::to_string(triple[0]) + ", " + std::to_string(triple[1]) + ", " +
           std::to_string(triple[2]) + ")";
  };
  for (size_t i = 0; i < colours.size(); ++i) {
    if (got.At(i) != expected.At(i)) {
      return text(colours.At(i)) + " becomes " + text(got.At(i)) + " instead of " +
             text(expected.At(i));
    }
  }
  return "";
}

// Hands all 2^24 triples to `take`, 256 at a time: two channels constant, the third running.
// Slow machines skip most pairs of the constants, always others.
template <typename Take>
void ForAllColours(Take take) {
  Colours run(256);
  std::iota(run.channels[2].begin(), run.channels[2].end(), uint8_t{0});
  for (uint32_t pair = 0; pair < 65536; pair += KESTREL_COLOUR_STRIDE) {
    std::memset(run.channels[0].data(), int(pair >> 8), 256);
    std::memset(run.channels[1].data(), int(pair & 255), 256);
    if (!take(run)) {
      return;
    }
  }
}

// The ways from YUV to RGB: into channels, or into whole pixels.
enum class Form {
  kWide,
  kCarry,
  kPixelsByTable,
  kPixelsOfWholeLuma,
  kPixelsByWideSums,
};
constexpr Form kForms[] = {Form::kWide, Form::kCarry, Form::kPixelsByTable,
                           Form::kPixelsOfWholeLuma, Form::kPixelsByWideSums};

// Whether a form is exact for an engine.
bool Suits(Form form, const EngineContext& context) {
  const YuvToRgbSums& sums = context.rgbSums;
  switch (form) {
    case Form::kPixelsByTable:
      return sums.insideClampTable != 0;
    case Form::kPixelsOfWholeLuma:
      return sums.insideClampTable != 0 && sums.yGain == 65536;
    default:
      return true;
  }
}

// To the pixels of an engine with destinations of 16 bits, else to bytes R G B A, and the fields of
// these pixels.
void ConvertToPixels(const kestrel::RowOps& ops, kestrel::YuvToRgbForm form,
                     const EngineContext& context, const Colours& yuv, Colours* rgb) {
  constexpr kestrel::PixelFormat kRgba = {4, {8, 8, 8}, {0, 8, 16}, 3, true};
  kestrel::PixelFormat format = kRgba;
  if (context.dstFormat.colourStandard == 16) {
    format = {2, {}, {}, -1, false};
    std::copy_n(context.dstChannelSize, 3, format.size);
    std::copy_n(context.dstChannelPos, 3, format.position);
  }
  std::vector<uint8_t> pixels(size_t(format.bytes) * yuv.size());
  const kestrel::PixelRows rows = {pixels.data(), 0, yuv[0], 0, 1};
  const kestrel::ChromaRows chroma = {yuv[1], yuv[2], 0, 1, 0, 0, 0};
  ops.yuvToPixels(rows, chroma, {form, TableOf(context), WideOf(context)}, format, {0xFFFFFF, 0},
                  int(yuv.size()));
  for (size_t i = 0; i < yuv.size(); ++i) {
    uint32_t word = 0;
    std::memcpy(&word, &pixels[i * size_t(format.bytes)], size_t(format.bytes));
    for (size_t c = 0; c < 3; ++c) {
      rgb->channels[c][i] = uint8_t((word >> format.position[c]) & ((1u << format.size[c]) - 1));
    }
  }
}

void ConvertToRgb(const kestrel::RowOps& ops, Form form, const EngineContext& context,
                  kestrel::Carry* carry, const Colours& yuv, Colours* rgb) {
  const std::array<uint8_t*, 3> dst = rgb->Writable();
  const int n = int(yuv.size());
  switch (form) {
    case Form::kWide:
      return ops.yuvToRgbWide(dst.data(), yuv[0], yuv[1], yuv[2], WideOf(context), n);
    case Form::kCarry:
      return ops.yuvToRgbCarry(dst.data(), yuv[0], yuv[1], yuv[2], WideOf(context), carry, n);
    case Form::kPixelsByTable:
      return ConvertToPixels(ops, kestrel::YuvToRgbForm::kTable, context, yuv, rgb);
    case Form::kPixelsOfWholeLuma:
      return ConvertToPixels(ops, kestrel::YuvToRgbForm::kWholeLuma, context, yuv, rgb);
    case Form::kPixelsByWideSums:
      return ConvertToPixels(ops, kestrel::YuvToRgbForm::kWide, context, yuv, rgb);
  }
}

reference::YuvToRgb ModelOf(uint32_t dst, uint32_t src, const Param& params) {
  reference::Format dstFormat, srcFormat;
  reference::DecodeFormat({dst, 1, 1, nullptr}, &dstFormat);
  reference::DecodeFormat({src, 1, 1, nullptr}, &srcFormat);
  return {srcFormat, dstFormat, {params.brightness, params.contrast, params.saturation}};
}

class RowColours : public testing::TestWithParam<const kestrel::RowOps*> {
 protected:
  const kestrel::RowOps& ops() const { return *GetParam(); }
};

TEST_P(RowColours, AllOfYuvToRgb) {
  for (const uint32_t standard : kStandards) {
    for (const uint32_t dst : {FORMAT_BGR888, FORMAT_RGB565}) {
      const uint32_t src = FORMAT_I444 | standard;
      const Engine engine({dst, 1, 1}, {src, 1, 1});
      ASSERT_NE(engine.context().rgbSums.insideClampTable, 0u);
      const reference::YuvToRgb model = ModelOf(dst, src, Param());
      Colours got(256), expected(256);
      ForAllColours([&](const Colours& yuv) {
        reference::YuvToRgb::Carry none{};
        for (size_t i = 0; i < yuv.size(); ++i) {
          expected.Set(i, model.Convert(yuv.At(i), &none));
        }
        for (const Form form : kForms) {
          if (!Suits(form, engine.context())) {
            continue;
          }
          kestrel::Carry carry{};
          ConvertToRgb(ops(), form, engine.context(), &carry, yuv, &got);
          EXPECT_TRUE(got == expected)
              << std::hex << src << std::dec << " to " << std::hex << dst << std::dec << ", form "
              << int(form) << ": " << Difference(yuv, got, expected);
        }
        return !HasFailure();
      });
      if (HasFailure()) {
        return;
      }
    }
  }
}

// These values do not depend on the engine, but for the fields that they are truncated to.
TEST_P(RowColours, AllOfTheSixBitMatrix) {
  for (const uint32_t dst : {FORMAT_BGR888, FORMAT_RGB565}) {
    const Engine engine({dst, 1, 1}, {FORMAT_I444 | FORMAT_BT601_FULL, 1, 1});
    const uint32_t* const size = engine.context().dstChannelSize;
    Colours got(256), expected(256);
    ForAllColours([&](const Colours& yuv) {
      for (size_t i = 0; i < yuv.size(); ++i) {
        const Triple rgb = reference::SixBitYuvToRgb(yuv.At(i));
        expected.Set(i,
                     {rgb[0] >> (8 - size[0]), rgb[1] >> (8 - size[1]), rgb[2] >> (8 - size[2])});
      }
      ConvertToPixels(ops(), kestrel::YuvToRgbForm::kSixBits, engine.context(), yuv, &got);
      EXPECT_TRUE(got == expected) << Difference(yuv, got, expected);
      return !HasFailure();
    });
    if (HasFailure()) {
      return;
    }
  }
}

TEST_P(RowColours, AllOfRgbToYuv) {
  for (const uint32_t standard : kStandards) {
    const Engine engine({FORMAT_I444 | standard, 1, 1}, {FORMAT_BGR888, 1, 1});
    const kestrel::RgbToYuvTables tables = RgbToYuvTablesOf(engine.context());
    const uint32_t code = engine.context().dstFormat.colourStandard;
    Colours got(256), expected(256);
    ForAllColours([&](const Colours& rgb) {
      for (size_t i = 0; i < rgb.size(); ++i) {
        expected.Set(i, reference::RgbToYuv(rgb.At(i), code));
      }
      const uint8_t* const channels[3] = {rgb[0], rgb[1], rgb[2]};
      const std::array<uint8_t*, 3> yuv = got.Writable();
      ops().rgbToYuv(yuv[0], channels, tables, 256);
      ops().rgbToYuv(yuv[1], channels, tables + 3, 256);
      ops().rgbToYuv(yuv[2], channels, tables + 5, 256);
      EXPECT_TRUE(got == expected)
          << std::hex << code << std::dec << ": " << Difference(rgb, got, expected);
      return !HasFailure();
    });
    if (HasFailure()) {
      return;
    }
  }
}

// 512 settings, all combinations of extremes among them: corners and neighbours of the cube, the
// middle, and noise. The sums of many leave the clamp tables, whose reads are then not used.
TEST_P(RowColours, UnderAdjustments) {
  constexpr int32_t kSettings[] = {-128, -127, -63, -1, 0, 1, 77, 128};
  constexpr uint8_t kLevels[] = {0, 1, 15, 16, 17, 127, 128, 129, 235, 240, 254, 255};
  constexpr size_t kCorners = std::size(kLevels) * std::size(kLevels) * std::size(kLevels);
  Colours yuv(kCorners + 1000);
  size_t filled = 0;
  for (const uint8_t y : kLevels) {
    for (const uint8_t u : kLevels) {
      for (const uint8_t v : kLevels) {
        yuv.Set(filled++, {y, u, v});
      }
    }
  }
  differential::Random random(7);
  for (auto& channel : yuv.channels) {
    random.Fill(channel.data() + kCorners, 1000);
  }
  Colours got(yuv.size()), expected(yuv.size());
  int inside = 0;
  int setting = 0;
  for (const int32_t brightness : kSettings) {
    for (const int32_t contrast : kSettings) {
      for (const int32_t saturation : kSettings) {
        const Param params = Param().Adjust(brightness, contrast, saturation);
        const uint32_t src = FORMAT_I444 | kStandards[(setting / 3 + setting) % 4];
        const uint32_t dst = setting % 3 == 0 ? FORMAT_BGR565 : FORMAT_RGB888;
        if (++setting % KESTREL_ROW_STRIDE != 0) {
          continue;
        }
        const Engine engine({dst, 1, 1}, {src, 1, 1}, params);
        const reference::YuvToRgb model = ModelOf(dst, src, params);
        for (const bool dithers : {false, true}) {
          reference::YuvToRgb::Carry modelCarry = model.StartCarry(dithers);
          kestrel::Carry carry{};
          for (size_t c = 0; c < 3; ++c) {
            carry.mask[c] = int32_t(modelCarry.mask[c]);
            carry.remainder[c] = int32_t(modelCarry.accumulator[c]);
          }
          for (size_t i = 0; i < yuv.size(); ++i) {
            expected.Set(i, model.Convert(yuv.At(i), &modelCarry));
          }
          for (const Form form : kForms) {
            if ((dithers && form != Form::kCarry) || !Suits(form, engine.context())) {
              continue;
            }
            inside += form == Form::kPixelsByTable ? 1 : 0;
            ConvertToRgb(ops(), form, engine.context(), &carry, yuv, &got);
            ASSERT_TRUE(got == expected)
                << brightness << ", " << contrast << ", " << saturation << ", form " << int(form)
                << ", dithers " << dithers << ": " << Difference(yuv, got, expected);
          }
        }
      }
    }
  }
  EXPECT_GT(inside, 100 / KESTREL_ROW_STRIDE);
}

INSTANTIATE_TEST_SUITE_P(Rows, RowColours, testing::ValuesIn(AvailableRows()),
                         [](const auto& test) { return NameOf(test.param); });

}  // namespace
}  // namespace rows_tests
