// The meteorological stream over tracks filled by the scan of real raw files.
#include <gtest/gtest.h>

#include "raw/meteo_stream.h"
#include "scan_test_util.h"

namespace vox::test {
namespace {

using voxtools::RawMeteoSample;
using voxtools::RawOrder;
using voxtools::RawWriter;

constexpr uint32_t kDay = 13204;

TimeMs At(uint32_t s, uint16_t ms = 0) {
  return TimeMs{kDay * 86400 + s, ms};
}

struct Sample {
  uint32_t second;
  uint16_t ms;
  float pressure;
  float temperature = 20.0f;
};

// Scans a file with the given meteorological records (and a position without height).
struct MeteoFile : ScanRun {
  MeteoFile(RawOrder order, const std::vector<Sample>& samples,
            std::optional<std::vector<double>> xyz = {}) {
    RawWriter w(order);
    w.Header().TimeRef("GPS", {0, kDay});
    if (xyz) w.MeteoPosition(1, xyz, {});
    for (const Sample& s : samples) {
      RawMeteoSample m;
      m.time = {s.second * 1000 + s.ms, kDay};
      m.pressure = s.pressure;
      m.temperature = s.temperature;
      w.MeteoSample(m);
    }
    w.EndOfData();
    Run(w);
  }
  std::unique_ptr<MeteoCursor> Open() { return OpenMeteoCursor(meteo, file->id); }
};

vox_MeteoData Query(MeteoCursor& c, const TimeMs& t) {
  vox_MeteoData d{};
  EXPECT_TRUE(QueryMeteo(c, t, d));
  return d;
}

class MeteoStreamTest : public ::testing::TestWithParam<RawOrder> {};

TEST_P(MeteoStreamTest, FileWithoutMeteoRecordsHasNoStream) {
  MeteoFile f(GetParam(), {});
  ASSERT_EQ(f.status, kScanComplete);
  EXPECT_TRUE(f.meteo.empty());
  EXPECT_FALSE(f.Open());
}

TEST_P(MeteoStreamTest, OutsideTheSamplesTheNearestComesWhole) {
  MeteoFile f(GetParam(), {{10, 0, 1000.0f}, {20, 500, 1002.0f, 25.0f}});
  auto c = f.Open();
  ASSERT_TRUE(c);
  vox_MeteoData d = Query(*c, At(5));
  EXPECT_EQ(d.seconds, At(10).seconds) << "the sample's own time";
  EXPECT_EQ(d.pressure, 1000.0f);
  d = Query(*c, At(30));
  EXPECT_EQ(d.seconds, At(20).seconds);
  EXPECT_EQ(d.ms, 500);
  EXPECT_EQ(d.pressure, 1002.0f);
  EXPECT_EQ(d.temperature, 25.0f);
  EXPECT_EQ(d.humidity, 50.0f) << "missing humidity takes its default";
}

// Halfway between two samples comes the mean at the asked time; milliseconds count.
TEST_P(MeteoStreamTest, HalfwayBetweenTwoSamplesIsTheMean) {
  const std::vector<Sample> pairs[] = {{{10, 0, 1000.0f, 10.0f}, {12, 0, 1002.0f, 11.0f}},
                                       {{10, 900, 1000.0f, 10.0f}, {11, 100, 1002.0f, 11.0f}}};
  for (const std::vector<Sample>& samples : pairs) {
    MeteoFile f(GetParam(), samples);
    auto c = f.Open();
    ASSERT_TRUE(c);
    const vox_MeteoData d = Query(*c, At(11));
    EXPECT_EQ(d.seconds, At(11).seconds);
    EXPECT_EQ(d.ms, 0);
    EXPECT_EQ(d.pressure, 1001.0f);
    EXPECT_EQ(d.temperature, 10.5f);
  }
}

TEST_P(MeteoStreamTest, FallingTimesStartOverAndStillInterpolate) {
  MeteoFile f(GetParam(), {{0, 0, 1000.0f}, {10, 0, 1010.0f}, {20, 0, 1030.0f}});
  auto c = f.Open();
  EXPECT_EQ(Query(*c, At(15)).pressure, 1020.0f);
  EXPECT_EQ(Query(*c, At(19)).pressure, 1028.0f);
  EXPECT_EQ(Query(*c, At(5)).pressure, 1005.0f);
  EXPECT_EQ(Query(*c, At(0, 500)).pressure, 1000.5f);
  EXPECT_EQ(Query(*c, At(20)).pressure, 1030.0f);
}

TEST_P(MeteoStreamTest, TwoSamplesWithOneTimeGiveTheEarlier) {
  MeteoFile f(GetParam(), {{5, 0, 990.0f}, {10, 0, 1000.0f}, {10, 0, 1005.0f}});
  auto c = f.Open();
  EXPECT_EQ(Query(*c, At(30)).pressure, 1005.0f) << "the last sample after the end";
  EXPECT_EQ(Query(*c, At(10)).pressure, 1000.0f) << "between the twins: the earlier, whole";
}

TEST_P(MeteoStreamTest, HeightComesFromAPositionWithoutHeight) {
  MeteoFile f(GetParam(), {{10, 0, 1000.0f}}, std::vector<double>{6378137.0 + 250.0, 0.0, 0.0});
  auto c = f.Open();
  EXPECT_FLOAT_EQ(Query(*c, At(10)).height, 250.0f);
  ASSERT_FALSE(f.meteo.empty());
  EXPECT_TRUE(f.meteo.head()->positions[0].flags & (1u << 7));
}

INSTANTIATE_TEST_SUITE_P(Orders, MeteoStreamTest,
                         ::testing::Values(RawOrder::kLittle, RawOrder::kBig),
                         [](const auto& info) {
                           return std::string(info.param == RawOrder::kBig ? "Big" : "Little");
                         });

TEST(MeteoInterpolation, DifferencesAreFormedInSinglePrecision) {
  // Engines compare against values computed this way; a double-precision difference would
  // move the last bit of results like this one.
  vox_MeteoData a{}, b{}, out{};
  a.seconds = 100, b.seconds = 103;
  a.pressure = 1013.246f, b.pressure = 1000.1f;
  a.humidity = 0.1f, b.humidity = 99.7f;
  InterpolateMeteo(a, b, TimeMs{101, 0}, out);
  const double q = 1.0 / 3.0;
  EXPECT_EQ(out.pressure,
            static_cast<float>(double{a.pressure} + double{b.pressure - a.pressure} * q));
  EXPECT_EQ(out.humidity,
            static_cast<float>(double{a.humidity} + double{b.humidity - a.humidity} * q));
  EXPECT_EQ(out.seconds, 101u);
}

TEST(MeteoInterpolation, TrackWithoutSamplesAnswersOnlyTheTime) {
  MeteoTrackList tracks;
  MeteoSensorRecord sensor;
  sensor.selector = 1;
  TrackForFile(tracks, 7)->SetSensor(sensor);
  auto c = OpenMeteoCursor(tracks, 7);
  ASSERT_TRUE(c);
  vox_MeteoData d{};
  d.pressure = 3.0f;
  EXPECT_FALSE(QueryMeteo(*c, TimeMs{55, 5}, d));
  EXPECT_EQ(d.seconds, 55u);
  EXPECT_EQ(d.ms, 5);
  EXPECT_EQ(d.pressure, 3.0f);
}

}  // namespace
}  // namespace vox::test
