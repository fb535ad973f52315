#include "job/job_parser.h"

#include <algorithm>

#include "base/engine_log.h"
#include "job/job_parser_steps.h"
#include "job/job_paths.h"
#include "job/leap_seconds.h"
#include "job/omit_sv.h"
#include "platform/platform.h"

namespace vox {

namespace job_parser {

std::string SectionName(const char* prefix, int32_t number) {
  return std::string(prefix) + std::to_string(number);
}

std::string JobPathValue(const Context& c, const char* key) {
  return ResolveJobPath(platform::PathFromAnsi(c.reader.GetString(key)), c.input.job_folder);
}

namespace {

std::string ModulePathValue(const Context& c, const std::string& value) {
  return ResolveModulePath(platform::PathFromAnsi(value), c.input.module_path);
}

// The processing type of the job file: 1 static, 2 and 3 the kinematic kinds (swapped in
// the model's numbering); anything else runs the raw filter alone.
uint32_t JobKindOfType(int32_t type) {
  switch (type) {
    case 1:
      return 1;
    case 2:
      return 3;
    case 3:
      return 2;
    default:
      return 0;
  }
}

const char* DefaultEngineName(bool multi_site, uint32_t job_kind) {
  if (job_kind == 1) return multi_site ? "kra_mstatic.eng" : "kra_static.eng";
  return multi_site ? "kra_mkinematic.eng" : "kra_kinematic.eng";
}

bool IsKinematic(uint32_t job_kind) {
  return job_kind == 2 || job_kind == 3;
}

void ReadJobHead(Context& c) {
  JobSection& r = c.reader;
  JobModel& m = c.model;
  m.job_name = r.GetString("Name");
  std::string raw_filter = r.GetString("RawfiltPath");
  if (raw_filter.empty()) raw_filter = "kra_rawfilter.dll";
  m.raw_filter_path = ModulePathValue(c, raw_filter);
  m.result_version = r.GetInt("ResultVersion", 100);
  m.result_path = JobPathValue(c, "ResultPath");
  if (r.GetInt("AutoIncrementResultPath", 0) != 0)
    AutoIncrementResultPath(m.result_path, m.job_name);
  Trace("ResultPath=%s\n", m.result_path.c_str());

  m.raw_filter_only = r.GetInt("RunRawFilterOnly", 0) != 0;
  m.job_kind = JobKindOfType(r.GetInt("Type", 0));
  if (m.job_kind == 0) m.raw_filter_only = true;
  m.multi_site = r.GetInt("Multisite", 0) != 0;
  m.max_extra_bases = r.GetInt("MaxExtraBases", 2);
  if (!m.raw_filter_only) {
    std::string engine = r.GetString("EnginePath");
    if (engine.empty()) engine = DefaultEngineName(m.multi_site, m.job_kind);
    m.engine_path = ModulePathValue(c, engine);
  }
}

// The most items of one kind a job may name. Item numbers share their identifier with a type
// tag in the top byte, and each number costs a search of the whole job text, so an absurd
// count (a typo or a damaged file) would otherwise stall the job thread or exhaust memory;
// real surveys stay far below it.
constexpr int32_t kMaxItemsPerKind = 65535;

int32_t ReadCount(JobSection& r, const char* key) {
  const int32_t count = r.GetInt(key, 0);
  if (count <= kMaxItemsPerKind) return count;
  Trace("%s=%d limited to %d\n", key, count, kMaxItemsPerKind);
  return kMaxItemsPerKind;
}

void ReadJobCounts(Context& c) {
  JobSection& r = c.reader;
  c.counts.files = ReadCount(r, "NumFiles");
  c.counts.points = ReadCount(r, "NumPoints");
  c.counts.occups = ReadCount(r, "NumOccups");
  c.counts.vectors = ReadCount(r, "NumVectors");
  c.counts.fans = ReadCount(r, "NumFans");
  c.counts.antennas = ReadCount(r, "NumAntennas");
  c.counts.receivers = ReadCount(r, "NumReceivers");
}

void ReadJobControl(Context& c) {
  JobSection& r = c.reader;
  JobModel& m = c.model;
  const int32_t control = r.GetInt("ProcessControlFlags", 1);
  m.engine_flags = ((control & 1) != 0 ? 4u : 0u) | ((control & 2) != 0 ? 2u : 0u);
  const int32_t cpus = r.GetInt("NumCPUs", static_cast<int32_t>(c.input.cpu_count));
  m.thread_count = static_cast<uint32_t>(std::clamp(cpus, 1, 32));
  ParseTimeMs(r.GetString("Start"), m.window.start);
  ParseTimeMs(r.GetString("End"), m.window.end);
  m.enable_reoccupations = r.GetInt("EnableReoccupations", 0) != 0;
}

// Loads one engine and gives it its job-level block, filled from the current section when
// fill is set. False (traced) when the engine cannot be loaded.
bool LoadEngine(Context& c, EngineRole role, const std::string& path, bool fill,
                std::unique_ptr<ParamBlock>& block) {
  if (!c.binder.LoadEngine(role, path)) {
    Trace("Engine '%s' not found\n", path.c_str());
    return false;
  }
  block = c.binder.CreateJobBlock(role);
  if (block != nullptr && fill) c.binder.FillParameters(role, c.reader, *block);
  return true;
}

bool LoadEngines(Context& c) {
  JobModel& m = c.model;
  if (!LoadEngine(c, EngineRole::kProcessing, m.engine_path, true, m.engine_params)) return false;
  if (!m.multi_site || !IsKinematic(m.job_kind)) return true;

  // The static part of a multi-site kinematic job: [STATIC] names the engine (an empty
  // name there loads nothing) and holds its parameters.
  const bool has_static = c.reader.FindSection("STATIC");
  const std::string name = has_static ? c.reader.GetString("EnginePath") : "kra_mstatic.eng";
  m.static_engine_path = ModulePathValue(c, name);
  if (!LoadEngine(c, EngineRole::kStatic, m.static_engine_path, has_static, m.static_params))
    return false;
  c.static_engine_loaded = true;
  c.reader.FindSection("JOB");
  return true;
}

}  // namespace
}  // namespace job_parser

bool ParseJob(std::string_view text, const JobParseInput& input, EngineBinder& binder,
              JobModel& model) {
  JobSection reader(text);
  if (!reader.FindSection("JOB")) return false;
  job_parser::Context c{reader, input, binder, model, {}, false};

  job_parser::ReadJobHead(c);
  job_parser::ReadJobCounts(c);
  job_parser::ReadJobControl(c);
  if (!model.raw_filter_only && !job_parser::LoadEngines(c)) return false;
  model.omit_count = ParseOmitList(reader.GetString("OmitSV"), "JOB", model.omit_list);

  job_parser::ParseFiles(c);
  job_parser::ParsePoints(c);
  job_parser::ParseAntennas(c);
  job_parser::ParseReceivers(c);
  job_parser::ParseOccupations(c);
  job_parser::ParseVectors(c);
  job_parser::ParseFans(c);

  ReadLeapSection(reader);
  return true;
}

}  // namespace vox
