#pragma once
// Chooses a palette of at most a given number of colours (236 for the window system's palette displays) for
// the pixels of a back buffer, by octree colour quantisation at 8 bits per channel.
#include <cstdint>
#include <vector>

#include "editor/DibSurface.h"
#include "editor/SkinColour.h"

namespace ulvetta {

class OctreeQuantiser {
 public:
  static constexpr int kPaletteColours = 236;

  explicit OctreeQuantiser(int maxColours = kPaletteColours);

  void add(uint8_t r, uint8_t g, uint8_t b);
  void addSurface(const DibSurface& surface);
  int leafCount() const { return leaves_; }
  // One opaque colour per leaf: the rounded average of its pixels.
  std::vector<SkinColour> palette() const;

 private:
  static constexpr int kDepth = 8;  // leaves sit below the last of the 8 bit levels
  struct Node {
    uint64_t count = 0, red = 0, green = 0, blue = 0;
    int32_t child[8] = {-1, -1, -1, -1, -1, -1, -1, -1};
    bool leaf = false;
  };
  int32_t newNode(int level);
  void reduce();
  void collect(int32_t node, std::vector<SkinColour>& out) const;

  int maxColours_;
  int leaves_ = 0;
  std::vector<Node> nodes_;                     // node 0 is the root
  std::vector<int32_t> freeNodes_;              // indices of deleted nodes, reused first
  std::vector<std::vector<int32_t>> reducible_;  // per level, inner nodes in the order they were added
};

}  // namespace ulvetta
