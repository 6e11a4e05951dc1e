#include "editor/OctreeQuantiser.h"

#include <algorithm>

namespace ulvetta {

OctreeQuantiser::OctreeQuantiser(int maxColours) : maxColours_(std::max(1, maxColours)), reducible_(kDepth) {
  nodes_.emplace_back();
  reducible_[0].push_back(0);
}

int32_t OctreeQuantiser::newNode(int level) {
  int32_t index;
  if (!freeNodes_.empty()) {
    index = freeNodes_.back();
    freeNodes_.pop_back();
    nodes_[index] = Node{};
  } else {
    index = static_cast<int32_t>(nodes_.size());
    nodes_.emplace_back();
  }
  if (level < kDepth) {
    reducible_[level].push_back(index);
  } else {
    nodes_[index].leaf = true;
    ++leaves_;
  }
  return index;
}

void OctreeQuantiser::add(uint8_t r, uint8_t g, uint8_t b) {
  int32_t node = 0;
  for (int level = 0; !nodes_[node].leaf; ++level) {
    const int bit = 7 - level;
    const int branch = (((r >> bit) & 1) << 2) | (((g >> bit) & 1) << 1) | ((b >> bit) & 1);
    int32_t next = nodes_[node].child[branch];
    if (next < 0) {
      next = newNode(level + 1);
      nodes_[node].child[branch] = next;
    }
    node = next;
  }
  Node& leaf = nodes_[node];
  ++leaf.count;
  leaf.red += r;
  leaf.green += g;
  leaf.blue += b;
  while (leaves_ > maxColours_) reduce();
}

void OctreeQuantiser::addSurface(const DibSurface& surface) {
  for (int y = 0; y < surface.height(); ++y) {
    const uint8_t* p = surface.at(0, y);
    for (int x = 0; x < surface.width(); ++x, p += 4) add(p[2], p[1], p[0]);
  }
}

// Folds the most recently added inner node of the deepest level that has one into a leaf. Deeper levels hold
// no inner nodes, so its children are all leaves.
void OctreeQuantiser::reduce() {
  int level = kDepth - 1;
  while (level > 0 && reducible_[level].empty()) --level;
  if (reducible_[level].empty()) return;
  const int32_t index = reducible_[level].back();
  reducible_[level].pop_back();
  int children = 0;
  for (int32_t& c : nodes_[index].child) {
    if (c < 0) continue;
    Node& child = nodes_[c];
    nodes_[index].count += child.count;
    nodes_[index].red += child.red;
    nodes_[index].green += child.green;
    nodes_[index].blue += child.blue;
    freeNodes_.push_back(c);
    c = -1;
    ++children;
  }
  nodes_[index].leaf = true;
  leaves_ += 1 - children;
}

void OctreeQuantiser::collect(int32_t node, std::vector<SkinColour>& out) const {
  const Node& n = nodes_[node];
  if (n.leaf) {
    if (n.count == 0) return;
    const uint64_t half = n.count / 2;
    out.push_back(SkinColour{static_cast<uint8_t>((n.red + half) / n.count),
                             static_cast<uint8_t>((n.green + half) / n.count),
                             static_cast<uint8_t>((n.blue + half) / n.count), 255});
    return;
  }
  for (int32_t c : n.child)
    if (c >= 0) collect(c, out);
}

std::vector<SkinColour> OctreeQuantiser::palette() const {
  std::vector<SkinColour> out;
  collect(0, out);
  return out;
}

}  // namespace ulvetta
