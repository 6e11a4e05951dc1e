// The headless presenter: the written PNG read back with libpng, and no file at all when writing fails.
#include <gtest/gtest.h>
#include <png.h>

#include <cstring>
#include <filesystem>
#include <vector>

#include "editor/SkinDraw.h"
#include "editor/headless/PngPresenter.h"

namespace ulvetta {
namespace {

namespace fs = std::filesystem;

TEST(PngPresenterTest, WritesTheRectangleAndNothingOnFailure) {
  DibSurface surface;
  ASSERT_TRUE(surface.create(0, 0, 7, 5));
  for (int y = 0; y < 5; ++y)
    for (int x = 0; x < 7; ++x) fillRect(&surface, x, y, 1, 1, {99, uint8_t(y * 40), uint8_t(x * 30), 255});
  const std::string path = testing::TempDir() + "editor_present.png";
  PngPresenter presenter(path);
  ASSERT_TRUE(presenter.present(surface, 2, 1, 10, 3)) << presenter.error();  // clipped to 5 x 3

  png_image image;
  std::memset(&image, 0, sizeof image);
  image.version = PNG_IMAGE_VERSION;
  ASSERT_TRUE(png_image_begin_read_from_file(&image, path.c_str()));
  image.format = PNG_FORMAT_RGB;
  std::vector<uint8_t> rgb(PNG_IMAGE_SIZE(image));
  ASSERT_TRUE(png_image_finish_read(&image, nullptr, rgb.data(), 0, nullptr));
  ASSERT_TRUE(image.width == 5 && image.height == 3);
  for (int y = 0; y < 3; ++y)
    for (int x = 0; x < 5; ++x) {
      const uint8_t* p = &rgb[(y * 5 + x) * 3];
      EXPECT_TRUE(p[0] == 99 && p[1] == (y + 1) * 40 && p[2] == (x + 2) * 30) << x << "," << y;
    }
  fs::remove(path);

  // A directory in the way of the final name: false, a reason, and no temporary file left beside it.
  const std::string dir = testing::TempDir() + "editor_present_dir";
  fs::create_directories(dir);
  PngPresenter blocked(dir);
  EXPECT_FALSE(blocked.present(surface, 0, 0, 7, 5) || blocked.error().empty());
  for (const auto& entry : fs::directory_iterator(testing::TempDir()))
    EXPECT_NE(entry.path().filename().string().rfind("editor_present_dir.", 0), 0u);
  EXPECT_FALSE(PngPresenter(path).present(surface, 7, 0, 3, 3) || fs::exists(path));
  fs::remove(dir);
}

}  // namespace
}  // namespace ulvetta
