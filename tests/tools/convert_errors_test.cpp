// What goes wrong: one line on stderr, the right exit code, nothing left behind.
#include <algorithm>

#include "tool_runner.h"

namespace kestrel::test {
namespace {

constexpr int kUsage = 2, kUnsupported = 3, kBadInput = 4, kCannotWrite = 5;

class ConvertErrors : public ToolTest {
 protected:
  void SetUp() override {
    ToolTest::SetUp();
    ConvertWell({"pattern:64x48", "-o", "in.png"});
    ConvertWell({"pattern:64x48", "-o", "in.jpg"});
    ConvertWell({"pattern:64x48", "-o", "in.nv21"});
    ConvertWell({"pattern:64x48", "-o", "in.y4m"});
  }

  void ExpectError(int exitCode, const Arguments& arguments, int64_t fileSizeLimit = 0) const {
    SCOPED_TRACE(Joined(arguments));
    const std::vector<std::string> before = Files();
    const Outcome outcome = Convert(arguments, fileSizeLimit);
    EXPECT_EQ(outcome.exitCode, exitCode) << outcome.err;
    EXPECT_EQ(outcome.err.rfind("kestrel-convert: ", 0), 0u) << outcome.err;
    EXPECT_EQ(std::count(outcome.err.begin(), outcome.err.end(), '\n'), 1) << outcome.err;
    EXPECT_EQ(outcome.out, "");
    EXPECT_EQ(Files(), before);
  }
};

TEST_F(ConvertErrors, WrongCommandLines) {
  const std::vector<Arguments> wrong = {
      {},
      {"in.png"},
      {"-o", "out.png"},
      {"in.png", "-o", "out.png", "--no-such-option"},
      {"in.png", "-o", "out"},
      {"in.png", "-o", "out.txt"},
      {"in.png", "-o", "out.raw"},
      {"in.png", "-o", "out.nv21", "--format", "nv12"},
      {"in.png", "-o", "."},
      {"in", "-o", "out.png"},
      {"in.nv21", "-o", "out.png"},
      {"in.nv21", "--input-size", "64", "-o", "out.png"},
      {"in.nv21", "--input-size", "64x-48", "-o", "out.png"},
      {"in.nv21", "--input-size", "64x48", "--input-pitch", "63", "-o", "out.png"},
      {"in.nv21", "--input-size", "64x48", "--input-standard", "bt2020", "-o", "out.png"},
      {"in.png", "-o", "out.png", "--size", "0x10"},
      {"in.png", "-o", "out.png", "--size", "99999999999x10"},
      {"in.png", "-o", "out.png", "--rotate", "45"},
      {"in.png", "-o", "out.png", "--mirror", "z"},
      {"in.png", "-o", "out.png", "--filter", "bicubic"},
      {"in.png", "-o", "out.png", "--fit", "--crop"},
      {"in.png", "-o", "out.png", "--brightness", "129"},
      {"in.png", "-o", "out.png", "--alpha", "256"},
      {"in.png", "-o", "out.png", "--block-mode", "5"},
      {"in.png", "-o", "out.png", "--source-region", "0,0,65,48"},
      {"in.png", "-o", "out.png", "--source-region", "2147483647,0,2147483647,48"},
      {"in.png", "-o", "out.png", "--source-region", "0,0,64"},
      {"in.png", "-o", "out.png", "--dest-region", "0,0,8,8"},
      {"in.png", "-o", "out.png", "--canvas", "8x8", "--dest-region", "1,0,8,8"},
      {"in.png", "-o", "out.png", "--canvas", "8x8", "--size", "9x9"},
      {"in.png", "-o", "out.png", "--canvas", "8x8", "--onto", "in.png"},
      {"in.png", "-o", "out.png", "--onto", "in.nv21"},
      {"in.png", "-o", "out.png", "--background", "red"},
      {"in.jpg", "in.png", "-o", "out.png"},
      {"pattern:0x0", "-o", "out.png"},
  };
  for (const Arguments& arguments : wrong) ExpectError(kUsage, arguments);
}

TEST_F(ConvertErrors, UnsupportedJobs) {
  const std::vector<Arguments> unsupported = {
      {"in.png", "-o", "out.raw", "--format", "nv99"},
      {"in.png", "-o", "out.raw", "--format", "0x60000000"},
      {"in.png", "-o", "out.raw", "--format", "0x170007770"},
      {"in.png", "-o", "out.index8"},
      {"in.png", "-o", "out.y4m", "--format", "nv21"},
      {"in.png", "-o", "out.png", "--brightness", "1"},
      {"in.jpg", "-o", "out.png", "--saturation", "1"},
      {"in.png", "-o", "out.rgb565", "--dither"},
      {"in.y4m", "-o", "out.rgba", "--dither"},
      {"in.png", "-o", "out.png", "--alpha", "1"},
      {"in.png", "-o", "out.png", "--input-standard", "bt601-full"},
      {"in.png", "-o", "out.png", "--output-standard", "bt601-full"},
      {"in.png", "-o", "out.png", "--size", "16777217x1"},
      {"in.png", "-o", "out.png", "--size", "65536x65536"},
      {"in.png", "-o", "out.png", "--size", "16777216x1"},
  };
  for (const Arguments& arguments : unsupported) ExpectError(kUnsupported, arguments);
}

TEST_F(ConvertErrors, UnreadableInputs) {
  WriteText("text.png", "not a picture");
  WriteText("text.jpg", "not a picture");
  WriteText("empty.png", "");
  WriteText("empty.jpg", "");
  WriteText("empty.nv21", "");
  WriteFile("palette", Bytes(8));
  WriteFile("two.index8", {0, 0});
  for (const std::string name :
       {"missing.png", "text.png", "text.jpg", "empty.png", "empty.jpg", "missing.y4m"}) {
    ExpectError(kBadInput, {name, "-o", "out.png"});
  }
  ExpectError(kBadInput, {"empty.nv21", "--input-size", "4x4", "-o", "out.png"});
  ExpectError(kBadInput, {"in.nv21", "--input-size", "64x47", "-o", "out.png"});
  ExpectError(kBadInput, {"in.png", "--onto", "missing.png", "-o", "out.png"});
  ExpectError(kBadInput,
              {"two.index8", "--input-size", "2x1", "--palette", "palette", "-o", "out.png"});
  ExpectError(kUsage, {"two.index8", "--input-size", "2x1", "-o", "out.png"});
  ExpectError(kBadInput, {".", "--input-container", "png", "-o", "out.png"});
}

TEST_F(ConvertErrors, EveryTruncationOfAPicture) {
  for (const std::string name : {"in.png", "in.jpg", "in.y4m"}) {
    const Bytes whole = ReadFile(name);
    for (size_t part = 0; part < 20; ++part) {
      const size_t length = part < 10 ? part * 11 : whole.size() - 1 - (part - 10) * 97;
      WriteFile("cut-" + name, Bytes(whole.begin(), whole.begin() + std::ptrdiff_t(length)));
      // The last bytes of a PNG or JPEG only say that it ends.
      const bool mayBeWhole = name != "in.y4m" && length + 16 > whole.size();
      if (!mayBeWhole) ExpectError(kBadInput, {"cut-" + name, "-o", "out.png"});
    }
  }
}

TEST_F(ConvertErrors, SenselessFilms) {
  const std::string frame = "FRAME\n" + std::string(24, 'x');
  const std::vector<std::string> films = {
      "YUV4MPEG2 W4 H4\n",
      "YUV4MPEG2 W4 H4",
      "YUV4MPEG2 W4\n" + frame,
      "YUV4MPEG2 W0 H4\n" + frame,
      "YUV4MPEG2 W-4 H4\n" + frame,
      "YUV4MPEG2 W4x H4\n" + frame,
      "YUV4MPEG2 W99999999999999999999 H4\n" + frame,
      "YUV4MPEG2 W16384 H16384\n" + frame,
      "YUV4MPEG2 W4 H4\nFRAMES" + frame,
      "YUV4MPEG2 W4 H4\n" + frame + "FRAME\nx",
      "YUV4MPEG2 W4 H4\n" + frame + "FRAME" + std::string(4000, ' ') + "\n",
      "YUV4MPEG1 W4 H4\n" + frame,
      std::string(100000, 'Y'),
  };
  for (const std::string& film : films) {
    WriteText("film.y4m", film);
    ExpectError(kBadInput, {"film.y4m", "-o", "out.i420"});
  }
  for (const std::string header : {"W16777217 H4", "W16777216 H16777216", "W2147483647 H2147483647",
                                   "W4 H4 C420p10", "W4 H4 C444alpha", "W4 H4 C"}) {
    WriteText("film.y4m", "YUV4MPEG2 " + header + "\n" + frame);
    ExpectError(kUnsupported, {"film.y4m", "-o", "out.i420"});
  }
}

// A PNG that claims to be huge is refused before memory is taken for it.
TEST_F(ConvertErrors, PngOfGiantSize) {
  Bytes png = ReadFile("in.png");
  for (size_t at = 16; at < 24; ++at) png[at] = at % 4 == 1 ? 0x0F : 0;  // 983040 x 983040
  WriteFile("giant.png", png);
  ExpectError(kBadInput, {"giant.png", "-o", "out.png"});
}

TEST_F(ConvertErrors, OutputThatCannotBeWritten) {
  ExpectError(kCannotWrite, {"in.png", "-o", "missing/out.png"});
  ExpectError(kCannotWrite, {"in.png", "-o", "/dev/null", "--output-container", "png"});
  for (const std::string name : {"out.png", "out.jpg", "out.y4m", "out.nv21"}) {
    ExpectError(kCannotWrite, {"in.y4m", "-o", name}, 100);
  }
}

TEST_F(ConvertErrors, FailureKeepsAnExistingOutput) {
  WriteText("out.nv21", "precious");
  ExpectError(kCannotWrite, {"in.png", "-o", "out.nv21"}, 100);
  EXPECT_EQ(ReadText("out.nv21"), "precious");
  ExpectError(kBadInput, {"in.nv21", "--input-size", "5x5", "-o", "out.nv21"});
  EXPECT_EQ(ReadText("out.nv21"), "precious");
}

TEST_F(ConvertErrors, HelpAndVersionSucceed) {
  for (const std::string option : {"--help", "--version"}) {
    const Outcome outcome = Convert({option});
    EXPECT_EQ(outcome.exitCode, 0);
    EXPECT_EQ(outcome.err, "");
    EXPECT_NE(outcome.out, "");
  }
}

}  // namespace
}  // namespace kestrel::test
