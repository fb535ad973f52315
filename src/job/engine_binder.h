// What the job parser needs from the engine room: loading the processing engine (and the
// static engine of multi-site kinematic jobs), creating their job-level parameter blocks and
// filling a block from a section of the job text. The parser never touches an engine
// library itself; the run room hands it an implementation that keeps the loaded engines for
// the task.
//
// All calls happen on the job thread while the job is parsed.
#pragma once

#include <memory>
#include <string>
#include <string_view>

#include "job/items.h"
#include "job/job_section.h"

namespace vox {

enum class EngineRole {
  kProcessing,  // the job's engine (EnginePath of [JOB])
  kStatic,      // the static engine of a multi-site kinematic job ([STATIC])
};

class EngineBinder {
 public:
  virtual ~EngineBinder() = default;

  // Loads the library at path (already completed by ResolveModulePath) as the engine of
  // role, replacing the one loaded before for that role. True only when the engine is loaded
  // and passed its checks; the parser then fails the job otherwise.
  virtual bool LoadEngine(EngineRole role, const std::string& path) = 0;

  // A new job-level parameter block of the role's engine, initialised by the engine; null
  // when the engine is not loaded or wants no block (block size 0).
  virtual std::unique_ptr<ParamBlock> CreateJobBlock(EngineRole role) = 0;

  // Lets the role's engine enumerate its parameter names; for each name, the value is
  // EngineParameterValue(section, name) and an empty value is skipped, otherwise the engine
  // receives (block, name, value). The section is positioned on the section that holds the
  // values. False when the engine is not loaded.
  virtual bool FillParameters(EngineRole role, const JobSection& section, ParamBlock& block) = 0;
};

// The text an engine parameter receives: the key of that exact name in the current section,
// except that a "StartPoint" whose integer value n is not 0 becomes the decimal text of the
// point identifier (n | 0x01000000). Empty means "leave the engine's default".
std::string EngineParameterValue(const JobSection& section, std::string_view name);

}  // namespace vox
