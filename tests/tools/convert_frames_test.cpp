// Several frames and several inputs.
#include <algorithm>

#include "tool_runner.h"

namespace kestrel::test {
namespace {

constexpr size_t kFrameBytes = 4 * 2 + 2 + 2;

class ConvertFrames : public ToolTest {
 protected:
  // Frames of 4x2, each of one luma.
  void WriteFilm(const std::string& name, const Bytes& lumas,
                 const std::string& parameters = " F30000:1001 Ip C420jpeg") const {
    std::string film = "YUV4MPEG2 W4 H2" + parameters + "\n";
    for (const uint8_t luma : lumas) {
      film += "FRAME\n" + std::string(8, char(luma)) + std::string(4, char(128));
    }
    WriteText(name, film);
  }
};

TEST_F(ConvertFrames, EveryFrameOfAFilmInOrder) {
  WriteFilm("film.y4m", {50, 100, 150});
  const Bytes raw = Converted({"film.y4m", "--format", "nv12", "-o", "film.raw"});
  ASSERT_EQ(raw.size(), 3 * kFrameBytes);
  EXPECT_EQ(raw[0], 50);
  EXPECT_EQ(raw[kFrameBytes], 100);
  EXPECT_EQ(raw[2 * kFrameBytes + 7], 150);
}

TEST_F(ConvertFrames, FilmKeepsRateAndRange) {
  WriteFilm("film.y4m", {50, 100}, " F30000:1001 Ip C420mpeg2 XCOLORRANGE=FULL");
  ConvertWell({"film.y4m", "--size", "8x6", "-o", "larger.y4m"});
  const std::string film = ReadText("larger.y4m");
  EXPECT_EQ(film.substr(0, film.find('\n')),
            "YUV4MPEG2 W8 H6 F30000:1001 Ip A1:1 C420jpeg XCOLORRANGE=FULL");
  EXPECT_EQ(film.size(), film.find('\n') + 1 + size_t{2} * (6 + 48 + 12 + 12));
  ConvertWell({"film.y4m", "-o", "same.y4m"});
  const std::string same = ReadText("same.y4m");
  EXPECT_EQ(same.substr(same.find('\n')),
            ReadText("film.y4m").substr(ReadText("film.y4m").find('\n')));
}

TEST_F(ConvertFrames, EveryChromaOfY4m) {
  const std::vector<std::pair<std::string, size_t>> chromas = {
      {"420", 12}, {"420jpeg", 12}, {"420paldv", 12}, {"422", 16},
      {"440", 16}, {"444", 24},     {"411", 12},      {"mono", 8}};
  for (const auto& [chroma, bytes] : chromas) {
    WriteText("in.y4m", "YUV4MPEG2 W4 H2 C" + chroma + "\nFRAME\n" + std::string(bytes, char(128)));
    EXPECT_EQ(Converted({"in.y4m", "--format", "i444", "-o", "out.raw"}), Bytes(24, 128)) << chroma;
  }
}

TEST_F(ConvertFrames, RawInputMayHoldSeveralFrames) {
  Bytes frames(6, 10);
  std::fill(frames.begin() + 3, frames.end(), uint8_t(20));
  WriteFile("two.gray8", frames);
  ConvertWell({"two.gray8", "--input-size", "3x1", "-o", "two.y4m"});
  const std::string film = ReadText("two.y4m");
  EXPECT_NE(film.find("Cmono"), std::string::npos);
  EXPECT_EQ(film.substr(film.find('\n')), std::string("\nFRAME\n\n\n\nFRAME\n\x14\x14\x14"));
}

TEST_F(ConvertFrames, FramesToNumberedFiles) {
  WriteFilm("film.y4m", {50, 200});
  ConvertWell({"film.y4m", "-o", "frame-{frame}.png"});
  EXPECT_EQ(Files(), (std::vector<std::string>{"film.y4m", "frame-00000.png", "frame-00001.png"}));
  const Bytes first = Converted({"frame-00000.png", "-o", "first.gray8"});
  const Bytes second = Converted({"frame-00001.png", "-o", "second.gray8"});
  EXPECT_GT(second[0], first[0] + 100);
}

TEST_F(ConvertFrames, SeveralFramesDoNotFitOnePicture) {
  WriteFilm("film.y4m", {50, 200});
  const Outcome outcome = Convert({"film.y4m", "-o", "film.png"});
  EXPECT_EQ(outcome.exitCode, 2);
  EXPECT_NE(outcome.err.find("{frame}"), std::string::npos);
  EXPECT_EQ(Files(), std::vector<std::string>{"film.y4m"});
}

TEST_F(ConvertFrames, SeveralInputsToADirectoryOrPattern) {
  ConvertWell({"pattern:4x4", "-o", "a.png"});
  ConvertWell({"pattern:6x4", "-o", "b.png"});
  ConvertWell({"a.png", "b.png", "-o", ".", "--output-container", "raw", "--format", "nv21"});
  EXPECT_EQ(ReadFile("a.nv21").size(), 24u);
  EXPECT_EQ(ReadFile("b.nv21").size(), 36u);
  ConvertWell({"a.png", "b.png", "-o", "small-{name}.rgba", "--size", "2x2"});
  EXPECT_EQ(ReadFile("small-a.rgba").size(), 16u);
  EXPECT_EQ(ReadFile("small-b.rgba").size(), 16u);

  const Outcome outcome = Convert({"a.png", "b.png", "-o", "one.png"});
  EXPECT_EQ(outcome.exitCode, 2);
  EXPECT_NE(outcome.err.find("{name}"), std::string::npos);
}

TEST_F(ConvertFrames, TimesAreOneLineAnInput) {
  WriteFilm("film.y4m", {50, 100, 150});
  const Outcome outcome = Convert({"film.y4m", "--format", "nv21", "-o", "film.raw", "--time"});
  EXPECT_EQ(outcome.exitCode, 0);
  EXPECT_EQ(outcome.out.rfind("film.y4m -> film.raw: 4x2 i420 to 4x2 nv21, 3 frames, ", 0), 0u)
      << outcome.out;
  EXPECT_EQ(std::count(outcome.out.begin(), outcome.out.end(), '\n'), 1);
  EXPECT_EQ(outcome.err, "");  // no progress bar: stderr is a file
}

}  // namespace
}  // namespace kestrel::test
