#include "editor/headless/PngPresenter.h"

#include <png.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <vector>

namespace ulvetta {

bool PngPresenter::present(const DibSurface& surface, int x, int y, int w, int h) {
  error_.clear();
  const int left = std::max(x, 0), top = std::max(y, 0);
  const int right = static_cast<int>(std::min<long long>(static_cast<long long>(x) + w, surface.width()));
  const int bottom = static_cast<int>(std::min<long long>(static_cast<long long>(y) + h, surface.height()));
  if (surface.empty() || right <= left || bottom <= top) {
    error_ = "the rectangle to write holds no pixels of the picture";
    return false;
  }
  const int outW = right - left, outH = bottom - top;
  std::vector<uint8_t> rgb(static_cast<size_t>(outW) * outH * 3);
  for (int j = 0; j < outH; ++j) {
    const uint8_t* p = surface.at(left, top + j);
    uint8_t* o = rgb.data() + static_cast<size_t>(j) * outW * 3;
    for (int i = 0; i < outW; ++i, p += 4, o += 3) {
      o[0] = p[2];
      o[1] = p[1];
      o[2] = p[0];
    }
  }

  std::string temp = path_ + ".XXXXXX";
  const int fd = mkstemp(temp.data());
  if (fd < 0) {
    error_ = "cannot create a file beside " + path_ + ": " + std::strerror(errno);
    return false;
  }
  FILE* file = fdopen(fd, "wb");
  if (!file) {
    error_ = "cannot write " + temp + ": " + std::strerror(errno);
    close(fd);
    unlink(temp.c_str());
    return false;
  }
  png_image image;
  std::memset(&image, 0, sizeof image);
  image.version = PNG_IMAGE_VERSION;
  image.width = static_cast<png_uint_32>(outW);
  image.height = static_cast<png_uint_32>(outH);
  image.format = PNG_FORMAT_RGB;
  const bool written = png_image_write_to_stdio(&image, file, 0, rgb.data(), outW * 3, nullptr) != 0;
  const std::string pngMessage = image.message;
  png_image_free(&image);
  const bool flushed = std::fflush(file) == 0 && fsync(fileno(file)) == 0;
  const bool closed = std::fclose(file) == 0;
  if (!written || !flushed || !closed) {
    error_ = "cannot write " + path_ + ": " + (written ? std::strerror(errno) : pngMessage);
    unlink(temp.c_str());
    return false;
  }
  // mkstemp makes the file private; a picture is for everyone to read.
  chmod(temp.c_str(), 0644);
  if (std::rename(temp.c_str(), path_.c_str()) != 0) {
    error_ = "cannot write " + path_ + ": " + std::strerror(errno);
    unlink(temp.c_str());
    return false;
  }
  return true;
}

}  // namespace ulvetta
