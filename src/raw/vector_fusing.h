// Fusing duplicate vectors of multi-site jobs: every vector that joins the same two points
// (in either direction) as an earlier vector with occupations hands its occupations over to
// that one, in order, and keeps an empty occupation list, so each pair of points is computed
// once with all its data.
//
// Runs on the job thread during data preparation, before any engine exists.
#pragma once

#include "job/items.h"

namespace vox {

// Always true.
bool FuseVectors(ItemList<TVectorItem>& vectors);

}  // namespace vox
