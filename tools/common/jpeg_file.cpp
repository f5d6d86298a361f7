// JPEG through libturbojpeg: to RGBA, or the planes that the file holds.
#include <turbojpeg.h>

#include "tools/common/atomic_file.h"
#include "tools/common/image_file.h"
#include "tools/common/input_file.h"
#include "tools/common/tool_error.h"

namespace kestrel::tools {
namespace {

struct HandleDestroyer {
  void operator()(void* handle) const { tjDestroy(handle); }
};
using Handle = std::unique_ptr<void, HandleDestroyer>;

Handle CheckedHandle(tjhandle handle) {
  if (handle == nullptr) throw std::bad_alloc();
  return Handle(handle);
}

std::optional<uint32_t> FormatOfSubsampling(int subsampling) {
  switch (subsampling) {
    case TJSAMP_444:
      return FORMAT_I444;
    case TJSAMP_422:
      return FORMAT_I422;
    case TJSAMP_420:
      return FORMAT_I420;
    case TJSAMP_GRAY:
      return FORMAT_GRAY8;
    case TJSAMP_440:
      return FORMAT_I440;
    case TJSAMP_411:
      return kFormatI411;
    default:
      return std::nullopt;
  }
}

class JpegReader : public ImageReader {
 public:
  JpegReader(const std::string& path, bool asYuv) : file_(path), asYuv_(asYuv) {}

  bool ReadFrame(Image* image) override {
    if (done_) return false;
    done_ = true;
    const std::vector<uint8_t> bytes = file_.ReadAll();
    const Handle handle = CheckedHandle(tjInitDecompress());
    Size size;
    int subsampling = 0, colourSpace = 0;
    if (tjDecompressHeader3(handle.get(), bytes.data(), bytes.size(), &size.width, &size.height,
                            &subsampling, &colourSpace) != 0) {
      file_.ThrowMalformed(tjGetErrorStr2(handle.get()));
    }
    if (size.width < 1 || size.height < 1) file_.ThrowMalformed("the file ends too early");
    if (colourSpace == TJCS_CMYK || colourSpace == TJCS_YCCK) {
      throw ToolError(ExitCode::kUnsupported, file_.path() + ": CMYK pictures are not supported");
    }
    int result = 0;
    if (asYuv_) {
      *image = MakePlanes(size, subsampling, colourSpace);
      uint8_t* planes[3] = {};
      int pitches[3] = {};
      for (size_t i = 0; i < image->planes.size(); ++i) {
        planes[i] = image->Row(i, 0);
        pitches[i] = int(image->planes[i].pitch);
      }
      result = tjDecompressToYUVPlanes(handle.get(), bytes.data(), bytes.size(), planes, 0, pitches,
                                       0, TJFLAG_STOPONWARNING);
    } else {
      *image = MakeImage(FORMAT_XBGR8888, size);
      result = tjDecompress2(handle.get(), bytes.data(), bytes.size(), image->Row(0, 0), 0,
                             int(image->planes[0].pitch), 0, TJPF_RGBA, TJFLAG_STOPONWARNING);
    }
    if (result != 0) file_.ThrowMalformed(tjGetErrorStr2(handle.get()));
    return true;
  }

 private:
  // The decoder writes whole chroma samples: planes are as large as the padded picture.
  Image MakePlanes(Size size, int subsampling, int colourSpace) const {
    const std::optional<uint32_t> format = FormatOfSubsampling(subsampling);
    if (!format || (colourSpace != TJCS_YCbCr && colourSpace != TJCS_GRAY)) {
      throw ToolError(ExitCode::kUnsupported,
                      file_.path() + ": --jpeg-yuv cannot take planes of this kind");
    }
    const Size padded = {tjPlaneWidth(0, size.width, subsampling),
                         tjPlaneHeight(0, size.height, subsampling)};
    Image image = MakeImage(*format | FORMAT_BT601_FULL, padded);
    TrimImage(&image, size);
    return image;
  }

  InputFile file_;
  bool asYuv_;
  bool done_ = false;
};

class JpegWriter : public ImageWriter {
 public:
  JpegWriter(const std::string& path, int quality) : file_(path), quality_(quality) {}

  void WriteFrame(const Image& image) override {
    const Handle handle = CheckedHandle(tjInitCompress());
    unsigned char* bytes = nullptr;
    unsigned long length = 0;  // NOLINT(google-runtime-int): as the library declares it
    const int result =
        tjCompress2(handle.get(), image.Row(0, 0), image.width, int(image.planes[0].pitch),
                    image.height, TJPF_RGBX, &bytes, &length, TJSAMP_444, quality_, 0);
    const std::unique_ptr<unsigned char, void (*)(unsigned char*)> owner(bytes, tjFree);
    if (result != 0) file_.ThrowCannotWrite(tjGetErrorStr2(handle.get()));
    file_.Write(bytes, int64_t(length));
  }
  void Commit() override { file_.Commit(); }

 private:
  AtomicFile file_;
  int quality_;
};

}  // namespace

std::unique_ptr<ImageReader> OpenJpeg(const std::string& path, bool asYuv) {
  return std::make_unique<JpegReader>(path, asYuv);
}

std::unique_ptr<ImageWriter> CreateJpeg(const std::string& path, int quality) {
  return std::make_unique<JpegWriter>(path, quality);
}

}  // namespace kestrel::tools
