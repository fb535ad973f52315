#include "results/occupation_record.h"

#include "results/record_builder.h"

namespace vox {

std::vector<uint8_t> BuildOccupationRecord(const TOccupItem& o) {
  const TPointItem* point = o.point;
  const TAntennItem* antenna = o.antenna;
  RecordBuilder r;
  r.U32(o.id & ~kOccupTag);
  r.U32(point ? point->id & ~kPointTag : 0);
  r.U32(antenna ? antenna->id & ~kAntennaTag : 0);
  r.Time(o.first_epoch).Time(o.last_epoch);
  r.U32(o.epoch_count);
  r.F32(static_cast<float>(o.l1_east))
      .F32(static_cast<float>(o.l1_north))
      .F32(static_cast<float>(o.l1_up));
  if (antenna) {
    r.F32(static_cast<float>(antenna->l2_east))
        .F32(static_cast<float>(antenna->l2_north))
        .F32(static_cast<float>(antenna->l2_up));
  } else {
    r.Zeros(12);
  }
  const NavCoord nav = o.nav_set ? o.nav : NavCoord{};
  r.F64(nav.x).F64(nav.y).F64(nav.z);
  r.F32(nav.sx).F32(nav.sy).F32(nav.sz).F32(nav.rxy).F32(nav.rxz).F32(nav.ryz);
  r.CountedString(point ? point->name : std::string(), kOccupationNameMax);
  r.CountedString(o.file ? o.file->receiver_text : std::string(), kOccupationNameMax);
  r.CountedString(antenna ? antenna->name : std::string(), kOccupationNameMax);
  return {r.data(), r.data() + r.size()};
}

bool WriteOccupationRecord(TResultFile& writer, const TOccupItem& occupation) {
  const std::vector<uint8_t> payload = BuildOccupationRecord(occupation);
  return writer.WriteRecord(kKindOccupation, payload.data(), payload.size());
}

}  // namespace vox
