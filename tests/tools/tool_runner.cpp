#include "tool_runner.h"

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>

namespace kestrel::test {
namespace {

namespace fs = std::filesystem;

std::string Contents(const fs::path& path) {
  std::ifstream file(path, std::ios::binary);
  EXPECT_TRUE(file) << path;
  return std::string(std::istreambuf_iterator<char>(file), {});
}

void OpenAs(int descriptor, const std::string& path) {
  const int file = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600);
  dup2(file, descriptor);
  close(file);
}

}  // namespace

void ToolTest::SetUp() {
  std::string pattern = (fs::temp_directory_path() / "kestrel-tools-XXXXXX").string();
  ASSERT_NE(mkdtemp(pattern.data()), nullptr);
  folder_ = pattern;
  fs::create_directory(folder_ + "/work");
}

void ToolTest::TearDown() {
  fs::remove_all(folder_);
}

Outcome ToolTest::Run(const std::string& program, const Arguments& arguments,
                      int64_t fileSizeLimit) const {
  const std::string outPath = folder_ + "/out", errPath = folder_ + "/err";
  std::vector<char*> argv = {const_cast<char*>(program.c_str())};
  for (const std::string& argument : arguments) argv.push_back(const_cast<char*>(argument.c_str()));
  argv.push_back(nullptr);
  const pid_t child = fork();
  if (child == 0) {
    OpenAs(STDOUT_FILENO, outPath);
    OpenAs(STDERR_FILENO, errPath);
    if (fileSizeLimit > 0) {
      const rlimit limit = {rlim_t(fileSizeLimit), rlim_t(fileSizeLimit)};
      setrlimit(RLIMIT_FSIZE, &limit);
      signal(SIGXFSZ, SIG_IGN);  // writing fails instead
    }
    if (chdir((folder_ + "/work").c_str()) == 0) execv(program.c_str(), argv.data());
    _exit(127);
  }
  int status = 0;
  waitpid(child, &status, 0);
  Outcome outcome;
  outcome.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
  outcome.out = Contents(outPath);
  outcome.err = Contents(errPath);
  return outcome;
}

Outcome ToolTest::Convert(const Arguments& arguments, int64_t fileSizeLimit) const {
  return Run(KESTREL_CONVERT, arguments, fileSizeLimit);
}

Outcome ToolTest::Compare(const Arguments& arguments) const {
  return Run(KESTREL_COMPARE, arguments, 0);
}

void ToolTest::ConvertWell(const Arguments& arguments) const {
  const Outcome outcome = Convert(arguments);
  EXPECT_EQ(outcome.exitCode, 0) << Joined(arguments) << "\n" << outcome.err;
  EXPECT_EQ(outcome.err, "") << Joined(arguments);
}

Bytes ToolTest::Converted(const Arguments& arguments) const {
  ConvertWell(arguments);
  const auto option = std::find(arguments.begin(), arguments.end(), "-o");
  return ReadFile(*(option + 1));
}

void ToolTest::WriteFile(const std::string& name, const Bytes& bytes) const {
  WriteText(name, std::string(bytes.begin(), bytes.end()));
}

void ToolTest::WriteText(const std::string& name, const std::string& text) const {
  std::ofstream(folder_ + "/work/" + name, std::ios::binary) << text;
}

Bytes ToolTest::ReadFile(const std::string& name) const {
  const std::string text = ReadText(name);
  return Bytes(text.begin(), text.end());
}

std::string ToolTest::ReadText(const std::string& name) const {
  return Contents(folder_ + "/work/" + name);
}

std::vector<std::string> ToolTest::Files() const {
  std::vector<std::string> names;
  for (const auto& entry : fs::directory_iterator(folder_ + "/work")) {
    names.push_back(entry.path().filename().string());
  }
  std::sort(names.begin(), names.end());
  return names;
}

std::string Joined(const Arguments& arguments) {
  std::string line;
  for (const std::string& argument : arguments) line += argument + " ";
  return line;
}

}  // namespace kestrel::test
