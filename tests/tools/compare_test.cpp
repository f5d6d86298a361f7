// kestrel-compare: its numbers, its difference picture, its exit codes.
#include <cmath>
#include <map>
#include <sstream>

#include "tool_runner.h"

namespace kestrel::test {
namespace {

struct Line {
  double psnr = 0;
  double ssim = 0;
  int maximum = 0;
};

class CompareTool : public ToolTest {
 protected:
  std::map<std::string, Line> Compared(const Arguments& arguments) const {
    const Outcome outcome = Compare(arguments);
    EXPECT_EQ(outcome.exitCode, 0) << outcome.err;
    std::istringstream lines(outcome.out);
    std::string text;
    std::getline(lines, text);  // heading
    std::map<std::string, Line> table;
    while (std::getline(lines, text)) {
      std::istringstream words(text);
      std::string name, psnr;
      Line line;
      words >> name >> psnr >> line.ssim >> line.maximum;
      line.psnr = std::stod(psnr);
      table[name] = line;
    }
    return table;
  }
};

TEST_F(CompareTool, EqualImages) {
  ConvertWell({"pattern:33x21", "-o", "a.png"});
  const auto table = Compared({"a.png", "a.png", "--min-psnr", "1000"});
  ASSERT_EQ(table.size(), 4u);
  for (const char* channel : {"R", "G", "B", "all"}) {
    EXPECT_TRUE(std::isinf(table.at(channel).psnr));
    EXPECT_DOUBLE_EQ(table.at(channel).ssim, 1);
    EXPECT_EQ(table.at(channel).maximum, 0);
  }
}

TEST_F(CompareTool, KnownDifferenceOfFlatImages) {
  WriteFile("a.gray8", Bytes(192, 100));
  WriteFile("b.gray8", Bytes(192, 110));
  const auto table = Compared({"a.gray8", "b.gray8", "--input-size", "16x12"});
  ASSERT_EQ(table.size(), 2u);
  const double c1 = 0.01 * 255 * 0.01 * 255;
  const Line luma = table.at("Y");
  EXPECT_NEAR(luma.psnr, 20 * std::log10(25.5), 0.001);
  EXPECT_NEAR(luma.ssim, (2 * 100 * 110 + c1) / (100 * 100 + 110 * 110 + c1), 1e-5);
  EXPECT_EQ(luma.maximum, 10);
}

// A checkerboard and its negative: equal means and variances, covariance the opposite.
TEST_F(CompareTool, SsimOfANegative) {
  Bytes board, negative;
  for (int y = 0; y < 16; ++y) {
    for (int x = 0; x < 16; ++x) {
      board.push_back((x + y) % 2 == 0 ? 100 : 150);
      negative.push_back((x + y) % 2 == 0 ? 150 : 100);
    }
  }
  WriteFile("a.gray8", board);
  WriteFile("b.gray8", negative);
  const double variance = 625, c2 = 0.03 * 255 * 0.03 * 255;
  EXPECT_NEAR(Compared({"a.gray8", "b.gray8", "--input-size", "16x16"}).at("Y").ssim,
              (-2 * variance + c2) / (2 * variance + c2), 1e-5);
}

TEST_F(CompareTool, PlanarChannelsAreComparedApart) {
  Bytes a(12, 100), b(12, 100);
  b[8] = 104;  // U
  b[11] = 92;  // V
  WriteFile("a.i420", a);
  WriteFile("b.i420", b);
  const auto table = Compared({"a.i420", "b.i420", "--input-size", "4x2"});
  EXPECT_TRUE(std::isinf(table.at("Y").psnr));
  EXPECT_NEAR(table.at("U").psnr, 10 * std::log10(65025.0 * 2 / 16), 0.001);
  EXPECT_NEAR(table.at("V").psnr, 10 * std::log10(65025.0 * 2 / 64), 0.001);
  EXPECT_NEAR(table.at("all").psnr, 10 * std::log10(65025.0 * 12 / 80), 0.001);
  EXPECT_EQ(table.at("all").maximum, 8);
}

TEST_F(CompareTool, SamePlanesInOtherOrdersAreEqual) {
  ConvertWell({"pattern:22x14", "-o", "p.i420"});
  ConvertWell({"p.i420", "--input-size", "22x14", "-o", "p.y4m"});
  for (const std::string format : {"nv21", "nv12", "yv12", "i420"}) {
    ConvertWell({"p.i420", "--input-size", "22x14", "-o", "other." + format});
    const auto table = Compared({"p.y4m", "other." + format, "--input-size", "22x14"});
    EXPECT_EQ(table.count("U"), 1u) << format;
    EXPECT_TRUE(std::isinf(table.at("all").psnr)) << format;
  }
}

TEST_F(CompareTool, FramesAreSummedUp) {
  const std::string head = "YUV4MPEG2 W2 H2 Cmono\n", frame = "FRAME\n";
  WriteText("a.y4m", head + frame + "AAAA" + frame + "AAAA");
  WriteText("b.y4m", head + frame + "AAAA" + frame + "AAAE");
  const auto table = Compared({"a.y4m", "b.y4m"});
  EXPECT_NEAR(table.at("Y").psnr, 10 * std::log10(65025.0 * 8 / 16), 0.001);
  WriteText("c.y4m", head + frame + "AAAA");
  EXPECT_EQ(Compare({"a.y4m", "c.y4m"}).exitCode, 3);
}

TEST_F(CompareTool, ThresholdDecidesTheExitCode) {
  WriteFile("a.gray8", Bytes(64, 100));
  WriteFile("b.gray8", Bytes(64, 110));  // 28.131 dB
  const auto exitCode = [this](const std::string& threshold) {
    return Compare({"a.gray8", "b.gray8", "--input-size", "8x8", "--min-psnr", threshold}).exitCode;
  };
  EXPECT_EQ(exitCode("28.1"), 0);
  EXPECT_EQ(exitCode("28.2"), 1);
}

TEST_F(CompareTool, DifferencePicture) {
  WriteFile("a.rgba", {10, 20, 30, 255, 0, 0, 0, 255});
  WriteFile("b.rgba", {11, 18, 30, 255, 100, 0, 0, 255});
  ConvertWell({"a.rgba", "--input-size", "2x1", "-o", "a.png"});
  ConvertWell({"b.rgba", "--input-size", "2x1", "-o", "b.png"});
  EXPECT_EQ(Compare({"a.png", "b.png", "--difference", "d.png"}).exitCode, 0);
  EXPECT_EQ(Converted({"d.png", "-o", "d.bgr888"}), (Bytes{8, 16, 0, 255, 0, 0}));
  EXPECT_EQ(Compare({"a.png", "b.png", "--difference", "e.png", "--amplify", "1"}).exitCode, 0);
  EXPECT_EQ(Converted({"e.png", "-o", "e.bgr888"}), (Bytes{1, 2, 0, 100, 0, 0}));
}

TEST_F(CompareTool, ErrorsAreOneLine) {
  ConvertWell({"pattern:8x8", "-o", "a.png"});
  ConvertWell({"pattern:8x9", "-o", "b.png"});
  const std::vector<std::pair<int, Arguments>> wrong = {
      {2, {"a.png"}},
      {2, {"a.png", "a.png", "--difference", "d.y4m"}},
      {2, {"a.png", "a.png", "--min-psnr", "loud"}},
      {3, {"a.png", "b.png"}},
      {4, {"a.png", "missing.png"}},
      {5, {"a.png", "a.png", "--difference", "missing/d.png"}},
  };
  for (const auto& [exitCode, arguments] : wrong) {
    const Outcome outcome = Compare(arguments);
    EXPECT_EQ(outcome.exitCode, exitCode) << Joined(arguments);
    EXPECT_EQ(outcome.err.rfind("kestrel-compare: ", 0), 0u) << outcome.err;
    EXPECT_EQ(outcome.err.find('\n'), outcome.err.size() - 1) << outcome.err;
  }
}

}  // namespace
}  // namespace kestrel::test
