// Pixel formats and containers: names, bytes, round trips, adjustments.
#include <sstream>

#include "tool_runner.h"

namespace kestrel::test {
namespace {

struct NamedFormat {
  const char* name;
  const char* code;
  size_t bytes5x3;  // of an image of 5x3 pixels
  int minPsnr;      // of smooth colours that went through this format and back
};

// Formats that do not bring colours back: their bytes are looked at instead.
constexpr int kNoColour = 0;

constexpr NamedFormat kFormats[] = {
    {"rgb565", "0x15000454", 30, 36},
    {"bgr565", "0x15001454", 30, 36},
    {"rgb666", "0x16000555", 45, 42},
    {"bgr666", "0x16001555", 45, 42},
    {"rgb888", "0x16000777", 45, 99},
    {"bgr888", "0x16001777", 45, 99},
    {"xrgb8888", "0x17000777", 60, 99},
    {"xbgr8888", "0x17001777", 60, 99},
    {"rgbx8888", "0x37000777", 60, 99},
    {"bgrx8888", "0x37001777", 60, 99},
    {"bgra", "0x17000777", 60, 99},
    {"rgba", "0x17001777", 60, 99},
    {"yuyv", "0x50000010", 36, 42},
    {"yvyu", "0x50000210", 36, 42},
    {"uyvy", "0x50000410", 36, 42},
    {"vyuy", "0x50000610", 36, 42},
    {"yuyv-swapped", "0x50000110", 36, 42},
    {"yvyu-swapped", "0x50000310", 36, 42},
    {"uyvy-swapped", "0x50000510", 36, 42},
    {"vyuy-swapped", "0x50000710", 36, 42},
    {"yuv444", "0x50000000", 45, 42},
    {"yvu444", "0x50000200", 45, 42},
    {"uvy444", "0x50000400", 45, 42},
    {"vuy444", "0x50000600", 45, 42},
    {"i420", "0x50000811", 27, 42},
    {"i422", "0x50000810", 33, 42},
    {"i440", "0x50000801", 35, 42},
    {"i444", "0x50000800", 45, 42},
    {"i411", "0x50000830", 27, 42},
    {"yv12", "0x50000a11", 27, 42},
    {"yv16", "0x50000a10", 33, 42},
    {"yv440", "0x50000a01", 35, 42},
    {"yv24", "0x50000a00", 45, 42},
    {"gray8", "0x64000000", 15, kNoColour},
    {"nv21", "0x70000002", 27, 42},
    {"nv12", "0x70000003", 27, 42},
    {"nv61", "0x70000004", 33, 42},
    {"nv16", "0x70000005", 33, 42},
    {"yuv-special8", "0x70000008", 36, kNoColour},
    {"yuv-special9", "0x70000009", 60, 42},
};
constexpr NamedFormat kInputOnly[] = {{"index1", "0x41000000", 3, 0},
                                      {"index4", "0x43000000", 9, 0},
                                      {"index8", "0x44000000", 15, 0}};

class ConvertFormats : public ToolTest {
 protected:
  double OverallPsnr(const Arguments& arguments) const {
    const Outcome outcome = Compare(arguments);
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    const size_t line = outcome.out.find("\nall");
    if (line == std::string::npos) return -1;
    return std::stod(outcome.out.substr(line + 4));
  }
};

TEST_F(ConvertFormats, ListNamesEveryFormatWithItsCode) {
  const Outcome outcome = Convert({"--list-formats"});
  EXPECT_EQ(outcome.exitCode, 0);
  std::istringstream lines(outcome.out);
  std::string line;
  std::getline(lines, line);  // heading
  std::vector<std::string> listed;
  while (std::getline(lines, line) && !line.empty()) {
    std::istringstream words(line);
    std::string name, code, memory;
    words >> name >> code >> memory;
    EXPECT_FALSE(memory.empty()) << name;
    listed.push_back(name + " " + code);
  }
  std::vector<std::string> expected;
  for (const NamedFormat& format : kFormats) {
    expected.push_back(std::string(format.name) + " " + format.code);
  }
  for (const NamedFormat& format : kInputOnly) {
    expected.push_back(std::string(format.name) + " " + format.code);
  }
  std::sort(listed.begin(), listed.end());
  std::sort(expected.begin(), expected.end());
  EXPECT_EQ(listed, expected);
}

TEST_F(ConvertFormats, EveryFormatGoesToRawAndBack) {
  // A part of the test picture that holds gradients only.
  const Arguments smooth = {"pattern:610x470", "--source-region", "100,449,61,21", "-o"};
  const auto convertSmooth = [&](const std::string& output) {
    Arguments arguments = smooth;
    arguments.push_back(output);
    ConvertWell(arguments);
  };
  convertSmooth("original.png");
  for (const NamedFormat& format : kFormats) {
    const std::string name = format.name, raw = "picture." + name;
    EXPECT_EQ(Converted({"pattern:5x3", "-o", raw}).size(), format.bytes5x3) << name;
    convertSmooth(raw);
    ConvertWell({raw, "--input-size", "61x21", "-o", "back.png"});
    EXPECT_GE(OverallPsnr({"original.png", "back.png"}), format.minPsnr) << name;
  }
}

TEST_F(ConvertFormats, NameAndCodeAreTheSameFormat) {
  for (const NamedFormat& format : kFormats) {
    const Bytes byName = Converted({"pattern:9x7", "--format", format.name, "-o", "name.raw"});
    const Bytes byCode = Converted({"pattern:9x7", "--format", format.code, "-o", "code.raw"});
    EXPECT_EQ(byName, byCode) << format.name;
  }
}

// Pure red: V is high, U low, and Y lower than V, so that the order of bytes can be told.
TEST_F(ConvertFormats, ChromaLiesWhereTheNameSays) {
  WriteFile("red.rgba", {255, 0, 0, 255, 255, 0, 0, 255, 255, 0, 0, 255, 255, 0, 0, 255});
  const Bytes yuv = Converted({"red.rgba", "--input-size", "2x2", "-o", "red.yuv444"});
  const uint8_t y = yuv[0], u = yuv[1], v = yuv[2];
  ASSERT_LT(u, 100);
  ASSERT_GT(v, 200);
  ASSERT_NE(y, u);
  const std::vector<std::pair<std::string, Bytes>> expected = {
      {"nv21", {y, y, y, y, v, u}},
      {"nv12", {y, y, y, y, u, v}},
      {"nv61", {y, y, y, y, v, u, v, u}},
      {"nv16", {y, y, y, y, u, v, u, v}},
      {"i420", {y, y, y, y, u, v}},
      {"yv12", {y, y, y, y, v, u}},
      {"i422", {y, y, y, y, u, u, v, v}},
      {"yv16", {y, y, y, y, v, v, u, u}},
      {"i440", {y, y, y, y, u, u, v, v}},
      {"yv440", {y, y, y, y, v, v, u, u}},
      {"i411", {y, y, y, y, u, u, v, v}},
      {"yuyv", {y, u, y, v, y, u, y, v}},
      {"yvyu-swapped", {y, v, y, u, y, v, y, u}},
      {"uyvy", {u, y, v, y, u, y, v, y}},
      {"vyuy-swapped", {v, y, u, y, v, y, u, y}},
      {"gray8", {y, y, y, y}},
      {"yuv-special8", {y, 0, u, v, y, 0, u, v}},
      {"yuv-special9", {y, u, v, 0, y, u, v, 0, y, u, v, 0, y, u, v, 0}},
      {"vuy444", {v, u, y, v, u, y, v, u, y, v, u, y}},
      {"rgb565", {0x00, 0xF8, 0x00, 0xF8, 0x00, 0xF8, 0x00, 0xF8}},
      {"bgr565", {0x1F, 0x00, 0x1F, 0x00, 0x1F, 0x00, 0x1F, 0x00}},
      {"rgb888", {0, 0, 255, 0, 0, 255, 0, 0, 255, 0, 0, 255}},
      {"bgra", {0, 0, 255, 255, 0, 0, 255, 255, 0, 0, 255, 255, 0, 0, 255, 255}},
  };
  for (const auto& [name, bytes] : expected) {
    EXPECT_EQ(Converted({"red.rgba", "--input-size", "2x2", "-o", "red." + name}), bytes) << name;
  }
}

TEST_F(ConvertFormats, IndexedInputsUseThePalette) {
  Bytes palette(1024);
  palette[0] = 10, palette[1] = 20, palette[2] = 30;  // colour 0, bytes B G R
  palette[4] = 40, palette[5] = 50, palette[6] = 60;  // colour 1
  WriteFile("palette", palette);
  const Bytes expected = {60, 50, 40, 30, 20, 10};
  const Arguments rest = {"--input-size", "2x1", "--palette", "palette", "-o", "out.bgr888"};
  const auto convert = [&](const std::string& input) {
    Arguments arguments = rest;
    arguments.insert(arguments.begin(), input);
    return Converted(arguments);
  };
  WriteFile("two.index8", {1, 0});
  EXPECT_EQ(convert("two.index8"), expected);
  WriteFile("two.index4", {0x10});
  EXPECT_EQ(convert("two.index4"), expected);
  WriteFile("two.index1", {0x80});
  EXPECT_EQ(convert("two.index1"), expected);
}

TEST_F(ConvertFormats, PitchSkipsPaddingOfLumaAndChroma) {
  WriteFile("tight.nv21", {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12});
  WriteFile("padded.nv21", {1, 2, 3, 4, 99, 99, 5, 6, 7, 8, 99, 99, 9, 10, 11, 12, 99, 99});
  EXPECT_EQ(Converted({"padded.nv21", "--input-size", "4x2", "--input-pitch", "6", "-o", "a.nv21"}),
            ReadFile("tight.nv21"));
  WriteFile("padded.i420", {1, 2, 3, 4, 99, 99, 5, 6, 7, 8, 99, 99, 9, 10, 99, 11, 12, 99});
  EXPECT_EQ(Converted({"padded.i420", "--input-size", "4x2", "--input-pitch", "6", "-o", "a.i420"}),
            (Bytes{1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12}));
}

TEST_F(ConvertFormats, ColourStandardChangesTheNumbers) {
  WriteFile("white.rgba", Bytes(16, 255));
  const auto luma = [this](const std::string& standard) {
    return Converted({"white.rgba", "--input-size", "2x2", "--output-standard", standard, "-o",
                      "white.gray8"})[0];
  };
  EXPECT_EQ(luma("bt601-full"), 255);
  EXPECT_EQ(luma("bt601-video"), 234);
  EXPECT_EQ(luma("bt709-full"), 255);

  WriteFile("green.rgba", {0, 255, 0, 255, 0, 255, 0, 255, 0, 255, 0, 255, 0, 255, 0, 255});
  const auto green = [this](const std::string& standard) {
    return Converted(
        {"green.rgba", "--input-size", "2x2", "--output-standard", standard, "-o", "green.i444"});
  };
  EXPECT_NE(green("bt601-full"), green("bt709-full"));

  WriteFile("grey.gray8", {128, 128, 128, 128});
  const auto grey = [this](const std::string& standard) {
    return Converted(
        {"grey.gray8", "--input-size", "2x2", "--input-standard", standard, "-o", "grey.rgba"})[0];
  };
  EXPECT_EQ(grey("bt601-full"), 128);
  EXPECT_NEAR(grey("bt601-video"), 130, 1);  // (128 - 16) * 255 / 219
}

TEST_F(ConvertFormats, AdjustmentsAndAlphaReachTheEngine) {
  WriteFile("grey.yv24", {100, 120, 140, 160, 128, 128, 128, 128, 128, 128, 128, 128});
  const auto with = [this](const Arguments& extra) {
    Arguments arguments = {"grey.yv24", "--input-size", "2x2", "-o", "out.i444"};
    arguments.insert(arguments.end(), extra.begin(), extra.end());
    return Converted(arguments);
  };
  EXPECT_EQ(with({"--brightness", "-20"})[0], 80);
  EXPECT_EQ(with({"--brightness", "20"})[0], 120);
  EXPECT_EQ(with({"--contrast", "-128"})[0], with({"--contrast", "-128"})[3]);
  EXPECT_GT(with({"--contrast", "32"})[3] - with({"--contrast", "32"})[0], 60);
  const Bytes rgba =
      Converted({"grey.yv24", "--input-size", "2x2", "--alpha", "7", "-o", "out.rgba"});
  EXPECT_EQ(rgba[3], 7);
  EXPECT_EQ(rgba[15], 7);
  EXPECT_EQ(Converted({"grey.yv24", "--input-size", "2x2", "-o", "opaque.rgba"})[3], 255);
}

TEST_F(ConvertFormats, SaturationMovesChroma) {
  WriteFile("one.yv24", {100, 100, 100, 100, 90, 90, 90, 90, 150, 150, 150, 150});
  const Bytes less =
      Converted({"one.yv24", "--input-size", "2x2", "--saturation", "-128", "-o", "less.i444"});
  EXPECT_EQ(less[4], 128);
  EXPECT_EQ(less[8], 128);
  EXPECT_EQ(less[0], 100);
}

// (Full-range NV21 is taken by a kernel that never dithers.)
TEST_F(ConvertFormats, DitherChangesRgb565MadeFromYuv) {
  ConvertWell({"pattern:64x48", "-o", "p.i420"});
  const Bytes plain = Converted({"p.i420", "--input-size", "64x48", "-o", "plain.rgb565"});
  const Bytes dithered =
      Converted({"p.i420", "--input-size", "64x48", "--dither", "-o", "dithered.rgb565"});
  EXPECT_EQ(plain.size(), dithered.size());
  EXPECT_NE(plain, dithered);
}

TEST_F(ConvertFormats, PngShowsThePictureInItsFormat) {
  ConvertWell({"pattern:64x48", "--format", "rgb565", "-o", "a.png"});
  ConvertWell({"pattern:64x48", "-o", "p.rgb565"});
  ConvertWell({"p.rgb565", "--input-size", "64x48", "-o", "b.png"});
  ConvertWell({"pattern:64x48", "-o", "exact.png"});
  EXPECT_EQ(ReadFile("a.png"), ReadFile("b.png"));
  EXPECT_NE(ReadFile("a.png"), ReadFile("exact.png"));
}

TEST_F(ConvertFormats, PngKeepsAlphaOnlyWhereThereIsOne) {
  WriteFile("in.rgba", {10, 20, 30, 40});
  ConvertWell({"in.rgba", "--input-size", "1x1", "-o", "alpha.png"});
  EXPECT_EQ(Converted({"alpha.png", "-o", "back.rgba"}), (Bytes{10, 20, 30, 40}));
  ConvertWell({"in.rgba", "--input-format", "xbgr8888", "--input-size", "1x1", "-o", "spare.png"});
  EXPECT_EQ(Converted({"spare.png", "-o", "back.rgba"}), (Bytes{10, 20, 30, 255}));
}

TEST_F(ConvertFormats, JpegIsCloseToTheOriginalAndGivesItsPlanes) {
  ConvertWell({"pattern:63x41", "-o", "original.png"});
  ConvertWell({"pattern:63x41", "-o", "picture.jpg"});
  EXPECT_GE(OverallPsnr({"original.png", "picture.jpg"}), 27);
  ConvertWell({"picture.jpg", "--jpeg-yuv", "-o", "planes.y4m"});
  EXPECT_EQ(ReadText("planes.y4m").substr(0, 58),
            "YUV4MPEG2 W63 H41 F25:1 Ip A1:1 C444 XCOLORRANGE=FULL\nFRAM");
  ConvertWell({"planes.y4m", "-o", "planes.png"});
  EXPECT_GE(OverallPsnr({"picture.jpg", "planes.png"}), 38);
  const Bytes low = Converted({"pattern:63x41", "--quality", "20", "-o", "low.jpg"});
  EXPECT_LT(low.size(), ReadFile("picture.jpg").size());
}

}  // namespace
}  // namespace kestrel::test
