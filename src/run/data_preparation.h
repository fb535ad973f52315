// Data preparation: completes the parsed task before the engines run (vector fusing for
// multi-site jobs, the raw file scans, the listing in the engine log) and sets the work
// units that drive the progress. Job thread only, before any engine thread exists.
#pragma once

namespace vox {

struct TTask;

// True when every raw file scan gave a usable result. Always sets done units to 0 and total
// units to occupations + vectors + fans.
bool PrepareData(TTask& task);

}  // namespace vox
