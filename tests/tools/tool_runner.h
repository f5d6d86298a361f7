// Runs the tools in a folder of their own and looks at what they leave.
#ifndef KESTREL_TESTS_TOOLS_TOOL_RUNNER_H
#define KESTREL_TESTS_TOOLS_TOOL_RUNNER_H

#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

namespace kestrel::test {

using Bytes = std::vector<uint8_t>;
using Arguments = std::vector<std::string>;

struct Outcome {
  int exitCode = -1;  // 128 + the signal's number for a process that a signal ended
  std::string out;
  std::string err;
};

// A fresh folder for each test, removed afterwards; tools run inside it.
class ToolTest : public testing::Test {
 protected:
  void SetUp() override;
  void TearDown() override;

  // fileSizeLimit > 0: no file may grow beyond, as on a full disk.
  Outcome Convert(const Arguments& arguments, int64_t fileSizeLimit = 0) const;
  Outcome Compare(const Arguments& arguments) const;

  // Fails the test unless the exit code is 0.
  void ConvertWell(const Arguments& arguments) const;
  // Converts and returns the bytes of the output, named by the argument after -o.
  Bytes Converted(const Arguments& arguments) const;

  void WriteFile(const std::string& name, const Bytes& bytes) const;
  void WriteText(const std::string& name, const std::string& text) const;
  Bytes ReadFile(const std::string& name) const;
  std::string ReadText(const std::string& name) const;
  // Names in the folder, sorted.
  std::vector<std::string> Files() const;

 private:
  Outcome Run(const std::string& program, const Arguments& arguments, int64_t fileSizeLimit) const;

  std::string folder_;
};

std::string Joined(const Arguments& arguments);

}  // namespace kestrel::test

#endif
