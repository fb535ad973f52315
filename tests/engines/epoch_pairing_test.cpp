// Joining two receivers' epochs whose time tags lie milliseconds apart, and thinning one
// receiver's epochs to an interval, as the differential engines do before any arithmetic.
#include <gtest/gtest.h>

#include <initializer_list>

#include "epoch_pairing.h"

namespace {

using voxeng::io::EpochObs;
using voxeng::io::SatObs;

constexpr uint32_t kStart = 1'000'000'000;  // a whole second, also a multiple of 1000 s

// Epochs at kStart + seconds[k] plus offset_ms[k] milliseconds, each with satellites 1 to 4
// (code on all, phase on all but satellite 4).
std::vector<EpochObs> Epochs(std::initializer_list<double> seconds,
                             std::initializer_list<int> offset_ms) {
  std::vector<EpochObs> out;
  auto off = offset_ms.begin();
  for (double s : seconds) {
    const int64_t ms = static_cast<int64_t>(s * 1000) + (off != offset_ms.end() ? *off++ : 0);
    EpochObs e;
    e.time = voxeng::io::ShiftMs(TimeMs{kStart, 0}, ms);
    e.t = e.time.seconds + e.time.ms / 1000.0;
    for (int prn = 1; prn <= 4; ++prn)
      e.sats.push_back({prn, 2.0e7 + prn, 0, prn == 4 ? 0.0 : 1.0e8 + prn, 0, false});
    out.push_back(e);
  }
  return out;
}

// Orbits for every satellite but 3.
vox_GpsOrbitParams g_orbit{};
const voxeng::io::OrbitLookup kOrbits = [](int prn, double) {
  return prn == 3 ? nullptr : &g_orbit;
};

TEST(EpochPairing, ToleranceIsATenthOfTheSmallerIntervalAtMostATenthOfASecond) {
  using voxeng::io::PairingToleranceMs;
  const auto thirty = Epochs({0, 30, 60, 90, 120}, {1, 2, 3, 4, 5});
  const auto one = Epochs({0, 1, 2, 3}, {});
  const auto twentieth = Epochs({0, 0.05, 0.1, 0.15}, {});
  // Gaps and a stray epoch do not change the usual spacing.
  const auto gappy = Epochs({0, 30, 60, 61, 300, 330, 360}, {});
  EXPECT_EQ(voxeng::io::NominalIntervalMs(thirty), 30'001);  // the tags drift by 1 ms an epoch
  EXPECT_EQ(voxeng::io::NominalIntervalMs(gappy), 30'000);
  EXPECT_EQ(PairingToleranceMs(thirty, thirty), 100);
  EXPECT_EQ(PairingToleranceMs(thirty, one), 100);
  EXPECT_EQ(PairingToleranceMs(thirty, twentieth), 5);
  // Single epochs have no interval: the largest tolerance applies.
  EXPECT_EQ(PairingToleranceMs(Epochs({0}, {}), Epochs({0}, {})), 100);
  EXPECT_EQ(PairingToleranceMs(Epochs({0}, {}), twentieth), 5);
}

TEST(EpochPairing, TagsMillisecondsApartPairEachWithItsOwnTime) {
  // Like the real stations: one receiver a few ms late, the other drifting early.
  const auto base = Epochs({0, 30, 60, 90, 120}, {1, 2, 3, 4, 5});
  const auto rover = Epochs({0, 30, 60, 90, 120}, {0, -1, -2, -3, -4});
  const auto dd = voxeng::io::PairEpochs(base, rover, kOrbits, 100);
  ASSERT_EQ(dd.size(), 5u);
  for (size_t k = 0; k < dd.size(); ++k) {
    EXPECT_DOUBLE_EQ(dd[k].t_base, base[k].t);
    EXPECT_DOUBLE_EQ(dd[k].t_rover, rover[k].t);
    // Satellite 3 has no orbit; satellite 4 has code but no phase.
    ASSERT_EQ(dd[k].sats.size(), 3u);
    EXPECT_EQ(dd[k].sats[2].sat, 4);
    EXPECT_EQ(dd[k].sats[2].base_phase, 0);
    EXPECT_NE(dd[k].sats[0].rover_phase, 0);
  }
}

TEST(EpochPairing, EpochsBeyondTheToleranceOrAlreadyTakenStayAlone) {
  // Base epoch 30 has no rover within 100 ms (rover at +150 ms); base 60 and the stray rover
  // epoch at 60.08 s compete with the rover at 60.01 s: the nearest wins and nothing pairs
  // twice; the rover's last epoch has no base.
  const auto base = Epochs({0, 30, 60, 90}, {0, 0, 0, 0});
  const auto rover = Epochs({0, 30, 60, 60, 90, 150}, {-100, 150, 10, 80, 101, 0});
  const auto dd = voxeng::io::PairEpochs(base, rover, kOrbits, 100);
  ASSERT_EQ(dd.size(), 2u);
  EXPECT_DOUBLE_EQ(dd[0].t_rover, rover[0].t);  // exactly at the tolerance still pairs
  EXPECT_DOUBLE_EQ(dd[1].t_base, base[2].t);
  EXPECT_DOUBLE_EQ(dd[1].t_rover, rover[2].t);
  // A zero tolerance is the exact pairing.
  EXPECT_EQ(voxeng::io::PairEpochs(base, Epochs({0, 30, 60}, {0, 1, 0}), kOrbits, 0).size(), 2u);
  EXPECT_TRUE(voxeng::io::PairEpochs(base, {}, kOrbits, 100).empty());
}

TEST(EpochPairing, ABaseEpochNearerTheRoverEpochTakesIt) {
  // Irregular base data: 30.000 and 30.060 both lie within 100 ms of the rover's 30.050.
  const auto base = Epochs({0, 30, 30}, {0, 0, 60});
  const auto rover = Epochs({0, 30}, {0, 50});
  const auto dd = voxeng::io::PairEpochs(base, rover, kOrbits, 100);
  ASSERT_EQ(dd.size(), 2u);
  EXPECT_DOUBLE_EQ(dd[1].t_base, base[2].t);
}

TEST(EpochThinning, KeepsTheEpochNearestEachMultipleOfTheInterval) {
  using voxeng::io::ThinEpochs;
  // 30 s data tagged a few ms off, thinned to a minute: the epochs near whole minutes stay.
  const auto data = Epochs({0, 30, 60, 90, 120, 150, 180}, {3, 4, -2, 1, 5, 0, 200});
  const auto kept = ThinEpochs(data, 60'000, kStart);
  ASSERT_EQ(kept.size(), 3u);
  EXPECT_DOUBLE_EQ(kept[0].t, data[0].t);
  EXPECT_DOUBLE_EQ(kept[1].t, data[2].t);
  EXPECT_DOUBLE_EQ(kept[2].t, data[4].t);  // 180.2 s is too far off its minute
  // Two candidates for one multiple: the nearer stays.
  const auto twice = ThinEpochs(Epochs({0, 0, 10, 20}, {-3, 2, 0, 0}), 20'000, kStart);
  ASSERT_EQ(twice.size(), 2u);
  EXPECT_EQ(twice[0].time.ms, 2);
  // Nothing to thin at the data's own interval or a finer one, nor without an interval.
  EXPECT_EQ(ThinEpochs(data, 30'000, kStart).size(), data.size());
  EXPECT_EQ(ThinEpochs(data, 10'000, kStart).size(), data.size());
  EXPECT_EQ(ThinEpochs(data, 0, kStart).size(), data.size());
}

}  // namespace
