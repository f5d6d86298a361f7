// Conversion of input files according to the options.
#ifndef KESTREL_TOOLS_CONVERT_JOB_H
#define KESTREL_TOOLS_CONVERT_JOB_H

#include <cstdint>
#include <optional>
#include <string>

#include "tools/common/converter.h"
#include "tools/common/image.h"
#include "tools/common/image_file.h"
#include "tools/convert/options.h"
#include "tools/convert/output_names.h"
#include "tools/convert/progress.h"

namespace kestrel::tools {

class Job {
 public:
  explicit Job(const Options& options);

  // Converts every frame of one input, counting them on progress, which may be null. Engines are
  // kept for the next input. Returns a line that says what was done and how long it took.
  std::string Run(const std::string& input, const Output& output, Progress* progress);

 private:
  struct Geometry {
    Region source;
    Size canvas;
    Region dest;
    bool isCovered = false;  // the picture leaves nothing of the canvas
  };

  Geometry PlanGeometry(const Image& source) const;
  Format ChooseFormat(const Image& source, const Output& output) const;
  MPPPARAM Parameters(const Image& source, uint32_t format) const;
  Image PrepareCanvas(const Geometry& geometry, Format format);
  void FillBackground(Image* canvas);
  const Image& Present(const Image& picture, Container container, Image* storage);

  const Options& options_;
  std::optional<Image> onto_;
  Converter converter_;
  Converter ontoConverter_;
  Converter background_;
  RgbaConverter toRgba_;
};

}  // namespace kestrel::tools

#endif
