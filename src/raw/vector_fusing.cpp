#include "raw/vector_fusing.h"

namespace vox {

namespace {

bool SameEnds(const TVectorItem& a, const TVectorItem& b) {
  return (a.first_point == b.first_point && a.second_point == b.second_point) ||
         (a.first_point == b.second_point && a.second_point == b.first_point);
}

}  // namespace

bool FuseVectors(ItemList<TVectorItem>& vectors) {
  for (TVectorItem& a : vectors) {
    if (a.occupations.empty()) continue;
    for (TVectorItem& b : vectors) {
      if (&b == &a || b.occupations.empty() || !SameEnds(a, b)) continue;
      for (const TROccupItem& r : b.occupations)
        a.occupations.Append(new TROccupItem(r.occupation));
      b.occupations.Clear();
    }
  }
  return true;
}

}  // namespace vox
