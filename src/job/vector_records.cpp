#include "job/vector_records.h"

#include <cstring>

#include "job/record_text.h"

namespace vox {
namespace {

uint32_t IdOrZero(const auto* item) {
  return item != nullptr ? item->id : 0;
}

template <size_t N>
void NameOf(char (&out)[N], const auto* item) {
  CopyRecordText(out, item != nullptr ? std::string_view(item->name) : std::string_view());
}

}  // namespace

TVectorItem* NextVector(VectorCursor& cursor) {
  while (cursor.next != nullptr) {
    TVectorItem* vector = cursor.next;
    cursor.next = vector->next;
    if (!vector->occupations.empty()) return vector;
  }
  return nullptr;
}

void FillVectorData(const TVectorItem& vector, vox_VectorData& record) {
  std::memset(&record, 0, sizeof(record));
  record.id = vector.id;
  record.first_point_id = IdOrZero(vector.first_point);
  record.second_point_id = IdOrZero(vector.second_point);
  NameOf(record.first_point_name, vector.first_point);
  NameOf(record.second_point_name, vector.second_point);
}

void FillFanData(const TFanItem& fan, vox_FanData& record) {
  std::memset(&record, 0, sizeof(record));
  record.id = fan.id;
  record.base_point_id = IdOrZero(fan.base_point);
  record.rover_file_id = IdOrZero(fan.rover_file);
  NameOf(record.base_point_name, fan.base_point);
  CopyRecordText(record.rover_file_name, fan.rover_file != nullptr
                                             ? std::string_view(fan.rover_file->file_name)
                                             : std::string_view());
}

void FillSolutionData(const JobModel& job, vox_SolutionData& record) {
  record.reserved = 0;
  record.job_kind = job.job_kind;
  CopyRecordText(record.job_name, job.job_name);
}

void FillSolutionDataEx(const JobModel& job, vox_SolutionDataEx& record) {
  record.reserved = 0;
  record.job_kind = job.job_kind;
  CopyRecordText(record.job_name, job.job_name);
  record.max_extra_bases = static_cast<uint32_t>(job.max_extra_bases);
}

}  // namespace vox
