#include "raw/meteo_track.h"

#include <gtest/gtest.h>

namespace vox {
namespace {

MeteoSampleRecord Sample(uint32_t ms, float pressure) {
  MeteoSampleRecord r;
  r.time = RawTime{ms, 100};
  r.pressure = pressure;
  r.temperature = kDefaultTemperature;
  r.humidity = kDefaultHumidity;
  return r;
}

TEST(MeteoTrack, PositionWithoutHeightGetsTheEllipsoidalHeight) {
  TMeteoTrack track(0x04000001);
  MeteoPositionRecord p;
  p.flags = MeteoPositionRecord::kXyzBit | 1;  // pressure sensor only
  p.x = 6378137.0 + 250.0;
  track.SetPosition(p);
  EXPECT_TRUE(track.positions[kPressureSensor].flags & MeteoPositionRecord::kHeightBit);
  EXPECT_NEAR(track.positions[kPressureSensor].height, 250.0, 1e-6);
  EXPECT_EQ(track.positions[kTemperatureSensor].flags, 0);

  ASSERT_TRUE(track.Append(Sample(1000, 1000.0f)));
  EXPECT_FLOAT_EQ(track.first->data.height, 250.0f);

  // A point on the polar axis at Z = 0 lies at the centre of the Earth.
  MeteoPositionRecord centre;
  centre.flags = MeteoPositionRecord::kXyzBit | 4;
  track.SetPosition(centre);
  EXPECT_DOUBLE_EQ(track.positions[kHumiditySensor].height, -6378137.0);
}

TEST(MeteoTrack, SamplesKeepFileOrderAndDefaultsWithoutAPressurePosition) {
  MeteoTrackList tracks;
  TMeteoTrack* t = TrackForFile(tracks, 7);
  ASSERT_NE(t, nullptr);
  EXPECT_EQ(TrackForFile(tracks, 7), t);
  EXPECT_NE(TrackForFile(tracks, 8), t);
  EXPECT_EQ(tracks.Count(), 2u);

  t->Append(Sample(2000, 1002.0f));
  t->Append(Sample(1000, DefaultPressure()));
  EXPECT_EQ(t->sample_count, 2u);
  EXPECT_EQ(t->first->data.seconds, 100u * 86400 + 2);
  EXPECT_EQ(t->first->data.height, 0.0f);
  EXPECT_EQ(t->last->data.seconds, 100u * 86400 + 1);
  EXPECT_FLOAT_EQ(t->last->data.pressure, 1013.246f);

  MeteoSensorRecord s;
  s.selector = 6;
  s.value = 3.0f;
  std::snprintf(s.name1, sizeof s.name1, "thermo");
  t->SetSensor(s);
  EXPECT_STREQ(t->sensors[kTemperatureSensor].name1, "thermo");
  EXPECT_STREQ(t->sensors[kHumiditySensor].name1, "thermo");
  EXPECT_EQ(t->sensors[kPressureSensor].name1[0], '\0');
}

}  // namespace
}  // namespace vox
