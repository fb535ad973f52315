// An engine's parameter blocks: creating one through the engine and filling it from a section
// of the job text through the engine's enumeration of its parameter names.
//
// Job thread only (parsing). The engine keeps no pointer to the callback context after
// _eng_EnumParamName returns.
#pragma once

#include <memory>

#include "job/items.h"
#include "job/job_section.h"

namespace vox {

class TEngine;

// Frees the block in field, then, if the engine is loaded and asks for a block (a size from
// 1 to 65535 bytes), allocates a zero-filled one with its header set, stores it in field and
// lets the engine initialise it. True when a block was created.
bool CreateParamBlock(std::unique_ptr<ParamBlock>& field, TEngine* engine);

// Has the engine enumerate its parameter names and passes it, for each, the value of the key
// of that name in the section (EngineParameterValue); empty values are skipped. True when the
// engine is loaded (nothing is enumerated without a block).
bool FillParams(TEngine* engine, const JobSection& section, ParamBlock* block);

}  // namespace vox
