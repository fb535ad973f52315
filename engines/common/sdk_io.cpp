#include "sdk_io.h"

#include <cmath>
#include <cstdio>
#include <cstring>

#include "broadcast.h"
#include "epoch_pairing.h"

namespace voxeng::io {

namespace {

constexpr uint32_t kOccupationTag = 0x02000000u;
constexpr double kGpsValidity = 7200.0;  // s either side of toe
constexpr uint32_t kGridOriginSeconds = 608400;

bool Has(const vox_EpochSatData& s, int value) {
  return (s.presence & (1u << value)) != 0;
}

// The first slot of `slots` that carries value `part` (0 code, 1 phase), else 0.
double Pick(const vox_EpochSatData& s, std::initializer_list<int> slots, int part) {
  for (int slot : slots)
    if (Has(s, 2 * slot + part) && s.values[2 * slot + part] != 0) return s.values[2 * slot + part];
  return 0;
}

SatObs ToObs(const vox_EpochSatData& s) {
  SatObs o;
  o.prn = s.sat & 0xFF;
  // Codes arrive in seconds on the GPS time scale; the engines work in metres.
  o.p1 = Pick(s, {VOX_SLOT_L1C, VOX_SLOT_L1P}, 0) * VOX_SPEED_OF_LIGHT;
  o.p2 = Pick(s, {VOX_SLOT_L2P, VOX_SLOT_L2C}, 0) * VOX_SPEED_OF_LIGHT;
  o.l1 = Pick(s, {VOX_SLOT_L1C, VOX_SLOT_L1P}, 1);
  o.l2 = Pick(s, {VOX_SLOT_L2P, VOX_SLOT_L2C}, 1);
  o.slip = (s.b3 & (VOX_B3_L1_LOSS_OF_LOCK | VOX_B3_L2_LOSS_OF_LOCK)) != 0;
  return o;
}

}  // namespace

void Reporter::Message(uint32_t kind, const std::string& text) const {
  if (context_ && context_->message) context_->message(context_->writer, kind, text.c_str());
}

void Reporter::Progress(int percent) {
  if (percent == last_percent_ || !context_ || !context_->progress) return;
  last_percent_ = percent;
  context_->progress(context_->writer, percent);
}

std::vector<EpochObs> ReadEpochs(uint32_t occupation_id, uint32_t interval_ms, const TimeMs* from,
                                 const TimeMs* to, const StopRequest& stop) {
  std::vector<EpochObs> epochs;
  // All epochs are read and thinned here: vox's own thinning keeps only exact multiples.
  // The stream starts at `from` clamped to the occupation; finding `from` itself would fail
  // when it lies before the occupation's first epoch.
  void* stream = vox_OpenEpochStream(occupation_id, 0, from, to);
  if (stream == nullptr) return epochs;
  vox_EpochData e;
  vox_EpochSatData s;
  for (int ok = vox_FindEpoch(stream, nullptr, &e); ok && !stop.Requested();
       ok = vox_GetNextEpoch(stream, &e)) {
    EpochObs epoch;
    epoch.time = TimeMs{e.seconds, e.ms};
    epoch.t = Seconds(epoch.time);
    std::memset(&s, 0, sizeof s);
    while (vox_GetEpochDataEx(stream, &s)) {
      const unsigned system = (s.sat >> 8) & 7u;
      if (system == 0 && (s.sat & 0xFF) >= 1 && (s.sat & 0xFF) <= 32) {
        SatObs o = ToObs(s);
        if (o.p1 != 0) epoch.sats.push_back(o);
      }
      std::memset(&s, 0, sizeof s);  // unwritten values must not carry over
    }
    epochs.push_back(std::move(epoch));
  }
  vox_CloseEpochStream(stream);
  if (interval_ms == 0 || epochs.empty()) return epochs;
  // The grid vox thins on counts from a multiple of kGridOriginSeconds; so does this one, so
  // that exactly tagged data keeps the epochs it always kept.
  const uint32_t start = from ? from->seconds : epochs.front().time.seconds;
  return ThinEpochs(std::move(epochs), interval_ms, start - start % kGridOriginSeconds);
}

void Ephemerides::Load(uint32_t from, uint32_t to) {
  for (int prn = 1; prn <= 32; ++prn) {
    by_prn_[prn].clear();
    void* stream = vox_OpenEphemerisStreamEx(static_cast<SatId>(prn), &from, &to);
    if (stream == nullptr) continue;
    vox_EphemerisData rec;
    while (vox_GetNextEphemerisEx(stream, &rec)) {
      if (rec.head.seconds > to + static_cast<uint32_t>(kGpsValidity)) break;
      vox_GpsOrbitParams p;
      if (vox_GpsOrbitFromEphemeris(&rec, &p) && p.health == 0 && p.sqrt_a > 1000.0)
        by_prn_[prn].push_back(p);
    }
    vox_CloseEphemerisStream(stream);
  }
}

const vox_GpsOrbitParams* Ephemerides::Find(int prn, double t) const {
  if (prn < 1 || prn > 32) return nullptr;
  const vox_GpsOrbitParams* best = nullptr;
  double best_dt = kGpsValidity;
  for (const auto& p : by_prn_[prn]) {
    const double dt = std::fabs(ToeSeconds(p) - t);
    if (dt <= best_dt) {
      best = &p;
      best_dt = dt;
    }
  }
  return best;
}

bool Ephemerides::Empty() const {
  for (const auto& list : by_prn_)
    if (!list.empty()) return false;
  return true;
}

std::optional<Occupation> GetOccupation(uint32_t occupation_id) {
  vox_OccupationData d;
  std::memset(&d, 0, sizeof d);
  d.id = occupation_id | kOccupationTag;
  d.mask = VOX_OCC_EPOCHS | VOX_OCC_L1_OFFSETS | VOX_OCC_NAME;
  if (!vox_GetOccupationData(&d)) return std::nullopt;
  Occupation o;
  o.id = d.occupation_id;
  o.point_id = d.point_id;
  o.file_id = d.file_id;
  o.first = d.first_epoch;
  o.last = d.last_epoch;
  o.epochs = d.epoch_count;
  // The record holds up, east, north.
  o.offset_enu = {d.l1_offset[1], d.l1_offset[2], d.l1_offset[0]};
  d.name[sizeof d.name - 1] = 0;
  o.name = d.name;
  return o;
}

Vec3 AntennaOf(const Vec3& mark, const Occupation& o) {
  if (Norm(mark) < 1.0e6) return mark;  // no place on the Earth to take a vertical from
  return mark + EnuToEcef(o.offset_enu, EcefToGeodetic(mark));
}

Vec3 MarkOf(const Vec3& antenna, const Occupation& o) {
  if (Norm(antenna) < 1.0e6) return antenna;
  return antenna - EnuToEcef(o.offset_enu, EcefToGeodetic(antenna));
}

std::optional<KnownPosition> PointPosition(uint32_t point_id) {
  if (point_id == 0) return std::nullopt;
  vox_SiteData site;
  std::memset(&site, 0, sizeof site);
  site.id = point_id;
  if (!vox_GetSiteData(&site) || site.site_type == VOX_SITE_NONE) return std::nullopt;
  const Vec3 xyz{site.x, site.y, site.z};
  if (Norm(xyz) < 1.0e6) return std::nullopt;  // a declared but unknown point
  return KnownPosition{xyz, site.rms, site.site_type};
}

std::optional<Vec3> NavCoord(uint32_t occupation_id) {
  vox_NavCoordData nav;
  std::memset(&nav, 0, sizeof nav);
  if (!vox_GetNavCoord(occupation_id, &nav)) return std::nullopt;
  const Vec3 xyz{nav.x, nav.y, nav.z};
  if (Norm(xyz) < 1.0e6) return std::nullopt;
  return xyz;
}

double Seconds(const TimeMs& t) {
  return t.seconds + t.ms / 1000.0;
}

TimeMs ToTimeMs(double seconds) {
  const double ms = std::floor(seconds * 1000.0 + 0.5);
  const double whole = std::floor(ms / 1000.0);
  return TimeMs{static_cast<uint32_t>(whole), static_cast<uint16_t>(ms - whole * 1000.0)};
}

std::string SatName(int prn) {
  char text[8];
  std::snprintf(text, sizeof text, "G%02d", prn);
  return text;
}

}  // namespace voxeng::io
