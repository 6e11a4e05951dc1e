// Writes the Turtle files of the LV2 bundle into the bundle folder: ulvetta-lv2-bundle FOLDER BINARY [UI-BINARY].
// Each file is written beside its name and renamed into place, so a failed build never leaves half a file.
#include <cstdio>
#include <fstream>
#include <string>

#include "Lv2Turtle.h"

namespace {

bool writeFile(const std::string& path, const std::string& text) {
  const std::string temporary = path + ".tmp";
  {
    std::ofstream out(temporary, std::ios::binary | std::ios::trunc);
    out << text;
    if (!out.flush()) return false;
  }
  return std::rename(temporary.c_str(), path.c_str()) == 0;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3 && argc != 4) {
    std::fprintf(stderr, "usage: ulvetta-lv2-bundle FOLDER BINARY [UI-BINARY]\n");
    return 2;
  }
  const std::string folder = argv[1];
  using namespace ulvetta::lv2;
  if (!writeFile(folder + "/manifest.ttl", manifestTtl(argv[2], argc == 4 ? argv[3] : "")) || !writeFile(folder + "/ulvetta.ttl", pluginTtl()) ||
      !writeFile(folder + "/presets.ttl", factoryPresetsTtl())) {
    std::fprintf(stderr, "ulvetta-lv2-bundle: cannot write the Turtle files into %s\n", folder.c_str());
    return 1;
  }
  return 0;
}
