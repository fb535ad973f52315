#include "raw/meteo_stream.h"

namespace vox {

namespace {

TimeMs TimeOf(const vox_MeteoData& d) {
  return TimeMs{d.seconds, d.ms};
}

float Between(float a, float b, double q) {
  const float difference = b - a;
  return static_cast<float>(static_cast<double>(a) + static_cast<double>(difference) * q);
}

// Seconds from a to b with each part taken as a signed 32-bit difference.
double SecondsBetween(const TimeMs& a, const TimeMs& b) {
  const int32_t ms = static_cast<int32_t>(b.ms) - static_cast<int32_t>(a.ms);
  const int32_t s = static_cast<int32_t>(b.seconds - a.seconds);
  return ms * 0.001 + s;
}

}  // namespace

std::unique_ptr<MeteoCursor> OpenMeteoCursor(const MeteoTrackList& tracks, uint32_t file_id) {
  for (const TMeteoTrack& track : tracks) {
    if (track.file_id != file_id) continue;
    auto cursor = std::make_unique<MeteoCursor>();
    cursor->track = &track;
    cursor->previous = cursor->current = track.first;
    cursor->file_id = file_id;
    return cursor;
  }
  return nullptr;
}

void InterpolateMeteo(const vox_MeteoData& a, const vox_MeteoData& b, const TimeMs& t,
                      vox_MeteoData& out) {
  const TimeMs ta = TimeOf(a), tb = TimeOf(b);
  if (ta == tb || t == ta) {
    out = a;
    return;
  }
  if (t == tb) {
    out = b;
    return;
  }
  const double q = SecondsBetween(ta, t) / SecondsBetween(ta, tb);
  out.seconds = t.seconds;
  out.ms = t.ms;
  out.pressure = Between(a.pressure, b.pressure, q);
  out.temperature = Between(a.temperature, b.temperature, q);
  out.humidity = Between(a.humidity, b.humidity, q);
  out.height = Between(a.height, b.height, q);
}

bool QueryMeteo(MeteoCursor& c, const TimeMs& t, vox_MeteoData& out) {
  out.seconds = t.seconds;
  out.ms = t.ms;
  if (c.current == nullptr) return false;
  if (t < TimeOf(c.previous->data)) {
    c.previous = c.current = c.track->first;
    if (t <= TimeOf(c.current->data)) {
      out = c.current->data;
      return true;
    }
  }
  if (t <= TimeOf(c.current->data)) {
    InterpolateMeteo(c.previous->data, c.current->data, t, out);
    return true;
  }
  while (c.current->next != nullptr) {
    c.previous = c.current;
    c.current = c.current->next;
    if (t <= TimeOf(c.current->data)) {
      InterpolateMeteo(c.previous->data, c.current->data, t, out);
      return true;
    }
  }
  out = c.current->data;
  return true;
}

}  // namespace vox
