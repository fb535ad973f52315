#include "job/site_records.h"

#include <cmath>
#include <cstring>

#include "job/record_text.h"

namespace vox {

uint32_t SiteTypeOfPointType(int32_t type) {
  switch (type) {
    case 0:
      return VOX_SITE_KNOWN;
    case 1:
    case 2:
      return VOX_SITE_SOLVED;
    default:
      return VOX_SITE_NONE;
  }
}

bool GetSiteData(const JobModel& job, TLock& solution_lock, vox_SiteData& record) {
  const uint32_t id = record.id;
  std::memset(&record, 0, sizeof(record));
  record.id = id;
  const TPointItem* point = job.FindPoint(id);
  if (point == nullptr) return false;

  TLockGuard guard(solution_lock);
  record.occupation_count = static_cast<uint32_t>(point->occupations.Count());
  CopyRecordText(record.name, point->name);
  uint32_t site_type = VOX_SITE_NONE;
  if (point->type != -1) {
    record.x = point->x;
    record.y = point->y;
    record.z = point->z;
    record.rms = point->rms;
    site_type = SiteTypeOfPointType(point->type);
  }
  // Known coordinates at exactly the origin are taken for "not given".
  if (record.x == 0 && record.y == 0 && record.z == 0) {
    if (point->solved_set) {
      record.x = point->solved_x;
      record.y = point->solved_y;
      record.z = point->solved_z;
      record.rms = point->solved_rms;
      site_type = VOX_SITE_SOLVED;
    } else if (point->nav_mean_set) {
      const NavCoord& mean = point->nav_mean;
      record.x = mean.x;
      record.y = mean.y;
      record.z = mean.z;
      record.rms = std::sqrt(mean.sx * mean.sx + mean.sy * mean.sy + mean.sz * mean.sz);
      site_type = VOX_SITE_NAV_MEAN;
    } else {
      site_type = VOX_SITE_NONE;
    }
  }
  record.site_type = site_type;
  return site_type != VOX_SITE_NONE;
}

}  // namespace vox
