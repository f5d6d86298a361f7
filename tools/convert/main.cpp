// kestrel-convert: the library's conversions from the command line.
#include <cstdio>

#include "tools/common/formats.h"
#include "tools/common/tool_error.h"
#include "tools/convert/job.h"
#include "tools/convert/options.h"
#include "tools/convert/output_names.h"
#include "tools/convert/progress.h"

namespace kestrel::tools {
namespace {

void ListFormats() {
  std::printf("%-13s %-10s  %s\n", "name", "code", "in memory");
  for (const FormatName& format : AllFormats()) {
    std::printf("%-13s 0x%08x  %s\n", format.name, format.code, format.memory);
  }
  std::printf(
      "\nA YUV format may be given as its code with the colour standard in it: add 0x1000 for "
      "BT.601\n"
      "full range, 0x2000 for BT.709 video range, 0x3000 for BT.709 full range.\n");
}

ExitCode Convert(int argc, const char* const* argv) {
  Options options;
  if (!ParseOptions(argc, argv, &options)) return ExitCode::kSuccess;
  if (options.listFormats) {
    ListFormats();
    return ExitCode::kSuccess;
  }
  const std::vector<Output> outputs = NameOutputs(options);
  const bool isSeries = options.inputs.size() > 1;
  Job job(options);
  Progress progress(isSeries ? "inputs" : "frames");
  for (size_t i = 0; i < outputs.size(); ++i) {
    const std::string summary =
        job.Run(options.inputs[i], outputs[i], isSeries ? nullptr : &progress);
    if (options.printTimes) {
      progress.Clear();
      std::printf("%s\n", summary.c_str());
    }
    if (isSeries) progress.Show(int64_t(i) + 1, int64_t(outputs.size()));
  }
  if (std::fflush(stdout) != 0) throw ToolError(ExitCode::kCannotWrite, "cannot write to stdout");
  return ExitCode::kSuccess;
}

}  // namespace
}  // namespace kestrel::tools

int main(int argc, char** argv) {
  return kestrel::tools::RunTool("kestrel-convert",
                                 [&] { return kestrel::tools::Convert(argc, argv); });
}
