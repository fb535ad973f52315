// The steps of ParseJob, one per kind of section, sharing the reader and the model.
#pragma once

#include <string>

#include "job/engine_binder.h"
#include "job/job_model.h"
#include "job/job_parser.h"
#include "job/job_section.h"

namespace vox::job_parser {

// Section counts of [JOB].
struct Counts {
  int32_t files = 0, points = 0, occups = 0, vectors = 0, fans = 0, antennas = 0, receivers = 0;
};

struct Context {
  JobSection& reader;
  const JobParseInput& input;
  EngineBinder& binder;
  JobModel& model;
  Counts counts;
  bool static_engine_loaded = false;
};

// "PREFIX" followed by the decimal number, e.g. "POINT:4".
std::string SectionName(const char* prefix, int32_t number);

// A path value of the current section, converted from the job's code page and completed
// against the job folder.
std::string JobPathValue(const Context& c, const char* key);

void ParseFiles(Context& c);
void ParsePoints(Context& c);
void ParseAntennas(Context& c);
void ParseReceivers(Context& c);
void ParseOccupations(Context& c);
void ParseVectors(Context& c);
void ParseFans(Context& c);

}  // namespace vox::job_parser
