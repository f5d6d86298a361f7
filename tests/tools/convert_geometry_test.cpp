// Sizes, rotation, mirroring, regions, fit and crop.
#include <array>

#include "tool_runner.h"

namespace kestrel::test {
namespace {

// Pixels of one byte each, so that every one can be told.
struct Grey {
  int width = 0;
  int height = 0;
  Bytes pixels;
};

Grey Numbered(int width, int height) {
  Grey image = {width, height, {}};
  for (int i = 0; i < width * height; ++i) image.pixels.push_back(uint8_t(20 + i));
  return image;
}

Grey RotatedClockwise(const Grey& image) {
  Grey turned = {image.height, image.width, {}};
  for (int y = 0; y < turned.height; ++y) {
    for (int x = 0; x < turned.width; ++x) {
      turned.pixels.push_back(image.pixels[size_t(image.height - 1 - x) * image.width + y]);
    }
  }
  return turned;
}

Grey Mirrored(const Grey& image, bool leftRight, bool topBottom) {
  Grey mirrored = {image.width, image.height, {}};
  for (int y = 0; y < image.height; ++y) {
    for (int x = 0; x < image.width; ++x) {
      const int fromX = leftRight ? image.width - 1 - x : x;
      const int fromY = topBottom ? image.height - 1 - y : y;
      mirrored.pixels.push_back(image.pixels[size_t(fromY) * image.width + fromX]);
    }
  }
  return mirrored;
}

class ConvertGeometry : public ToolTest {
 protected:
  void WriteGrey(const std::string& name, const Grey& image) const {
    WriteFile(name, image.pixels);
  }
};

TEST_F(ConvertGeometry, RotatesClockwiseThenMirrors) {
  const Grey image = Numbered(7, 5);
  WriteGrey("in.gray8", image);
  Grey turned = image;
  for (const char* angle : {"0", "90", "180", "270"}) {
    const Arguments base = {"in.gray8", "--input-size", "7x5", "--rotate", angle, "-o", "o.gray8"};
    EXPECT_EQ(Converted(base), turned.pixels) << angle;
    for (const std::string mirror : {"x", "y", "xy"}) {
      Arguments arguments = base;
      arguments.insert(arguments.end(), {"--mirror", mirror});
      EXPECT_EQ(Converted(arguments), Mirrored(turned, mirror != "y", mirror != "x").pixels)
          << angle << " " << mirror;
    }
    turned = RotatedClockwise(turned);
  }
}

TEST_F(ConvertGeometry, SizeIsThatOfTheRotatedPicture) {
  const auto sizeOf = [this](const Arguments& extra) {
    Arguments arguments = {"pattern:60x40", "-o", "out.y4m"};
    arguments.insert(arguments.end(), extra.begin(), extra.end());
    ConvertWell(arguments);
    const std::string header = ReadText("out.y4m");
    return header.substr(10, header.find(" F") - 10);
  };
  EXPECT_EQ(sizeOf({}), "W60 H40");
  EXPECT_EQ(sizeOf({"--rotate", "90"}), "W40 H60");
  EXPECT_EQ(sizeOf({"--rotate", "180"}), "W60 H40");
  EXPECT_EQ(sizeOf({"--rotate", "90", "--size", "30x20"}), "W30 H20");
  EXPECT_EQ(sizeOf({"--source-region", "0,0,20,10"}), "W20 H10");
  EXPECT_EQ(sizeOf({"--canvas", "100x90", "--dest-region", "1,2,30,40"}), "W100 H90");
}

TEST_F(ConvertGeometry, NearestPicksPixelsBilinearMixesThem) {
  WriteFile("in.gray8", {0, 100});
  const auto row = [this](const std::string& filter) {
    return Converted({"in.gray8", "--input-size", "2x1", "--filter", filter, "--size", "4x1", "-o",
                      "out.gray8"});
  };
  EXPECT_EQ(row("nearest"), (Bytes{0, 0, 100, 100}));
  EXPECT_EQ(row("bilinear"), (Bytes{0, 25, 75, 100}));
}

TEST_F(ConvertGeometry, SourceAndDestinationRegions) {
  const Grey image = Numbered(6, 4);
  WriteGrey("in.gray8", image);
  EXPECT_EQ(Converted({"in.gray8", "--input-size", "6x4", "--source-region", "2,1,3,2", "-o",
                       "out.gray8"}),
            (Bytes{28, 29, 30, 34, 35, 36}));
  // A YUV black is 16.
  EXPECT_EQ(Converted({"in.gray8", "--input-size", "6x4", "--source-region", "2,1,2,2", "--canvas",
                       "4x3", "--dest-region", "1,1,2,2", "-o", "out.gray8"}),
            (Bytes{16, 16, 16, 16, 16, 28, 29, 16, 16, 34, 35, 16}));
}

TEST_F(ConvertGeometry, DrawsOntoAPictureInTheBackgroundColour) {
  WriteFile("dot.rgba", {1, 2, 3, 255});
  ConvertWell({"dot.rgba", "--input-size", "1x1", "--canvas", "3x1", "--dest-region", "0,0,1,1",
               "--background", "102030", "-o", "canvas.png"});
  ConvertWell({"dot.rgba", "--input-size", "1x1", "--onto", "canvas.png", "--dest-region",
               "2,0,1,1", "-o", "canvas.png"});
  EXPECT_EQ(Converted({"canvas.png", "-o", "out.bgr888"}),
            (Bytes{1, 2, 3, 0x10, 0x20, 0x30, 1, 2, 3}));
}

TEST_F(ConvertGeometry, FitLeavesMarginsAndCropCuts) {
  WriteFile("wide.gray8", Bytes(128, 200));
  const Bytes fitted = Converted(
      {"wide.gray8", "--input-size", "16x8", "--fit", "--size", "16x16", "-o", "fit.gray8"});
  for (int y = 0; y < 16; ++y) {
    EXPECT_EQ(fitted[size_t(y) * 16 + 5], y >= 4 && y < 12 ? 200 : 16) << y;
  }
  // Left third black, middle white, right third black: the crop keeps the middle.
  Bytes stripes;
  for (int i = 0; i < 12 * 4; ++i) stripes.push_back(i % 12 >= 4 && i % 12 < 8 ? 235 : 16);
  WriteFile("stripes.gray8", stripes);
  EXPECT_EQ(Converted({"stripes.gray8", "--input-size", "12x4", "--filter", "nearest", "--crop",
                       "--size", "4x4", "-o", "crop.gray8"}),
            Bytes(16, 235));
}

TEST_F(ConvertGeometry, EveryBlockModeGivesTheSamePlainPicture) {
  ConvertWell({"pattern:83x61", "-o", "p.nv21"});
  const auto mode = [this](const std::string& name) {
    return Converted({"p.nv21", "--input-size", "83x61", "--size", "50x70", "--block-mode", name,
                      "-o", "out.rgba"});
  };
  const Bytes tiled = mode("tiled");
  for (const char* name : {"1", "2", "3", "4"}) EXPECT_EQ(mode(name), tiled) << name;
}

}  // namespace
}  // namespace kestrel::test
