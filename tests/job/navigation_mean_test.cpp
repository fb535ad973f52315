#include "job/navigation_mean.h"

#include <gtest/gtest.h>

#include "stream_job.h"

namespace vox {
namespace {

NavCoord At(double x, double y, double z, float sigma = 1.0f) {
  NavCoord c;
  c.x = x;
  c.y = y;
  c.z = z;
  c.sx = c.sy = c.sz = sigma;
  return c;
}

TEST(InvertSymmetric3, InvertsAFullMatrixToSinglePrecision) {
  const SymMatrix3 m{4, 5, 6, 1, 2, 0.5};  // xx yy zz xy yz xz
  const auto inv = InvertSymmetric3(m);
  ASSERT_TRUE(inv.has_value());
  // m * inv must be the identity (to single precision).
  const double r00 = m.xx * inv->xx + m.xy * inv->xy + m.xz * inv->xz;
  const double r01 = m.xx * inv->xy + m.xy * inv->yy + m.xz * inv->yz;
  const double r12 = m.xy * inv->xz + m.yy * inv->yz + m.yz * inv->zz;
  const double r22 = m.xz * inv->xz + m.yz * inv->yz + m.zz * inv->zz;
  EXPECT_NEAR(r00, 1, 1e-6);
  EXPECT_NEAR(r01, 0, 1e-6);
  EXPECT_NEAR(r12, 0, 1e-6);
  EXPECT_NEAR(r22, 1, 1e-6);
  EXPECT_EQ(inv->xx, static_cast<double>(static_cast<float>(inv->xx)));
  EXPECT_EQ(inv->xy, static_cast<double>(static_cast<float>(inv->xy)));
}

TEST(InvertSymmetric3, FailsOnEachPivotBelowTheLimit) {
  EXPECT_FALSE(InvertSymmetric3({0, 1, 1, 0, 0, 0}).has_value());
  EXPECT_FALSE(InvertSymmetric3({1, 1, 1, 1, 0, 0}).has_value());  // second pivot 0
  EXPECT_FALSE(InvertSymmetric3({1, 1, 1, 0, 1, 0}).has_value());  // third pivot 0
  // Exactly at the limit is accepted; just below it is not.
  EXPECT_TRUE(InvertSymmetric3({kPivotLimit, 1, 1, 0, 0, 0}).has_value());
  EXPECT_FALSE(InvertSymmetric3({9.99e-13, 1, 1, 0, 0, 0}).has_value());
  EXPECT_EQ(kPivotLimit, 9.999999960041972e-13);
}

TEST(CovarianceOf, FormsProductsInSinglePrecision) {
  NavCoord c = At(0, 0, 0, 0.1f);
  c.rxy = 0.3f;
  const SymMatrix3 m = CovarianceOf(c);
  EXPECT_EQ(m.xx, static_cast<double>(0.1f * 0.1f));
  EXPECT_NE(m.xx, 0.1 * 0.1);
  EXPECT_EQ(m.xy, static_cast<double>(0.3f * 0.1f * 0.1f));
  EXPECT_EQ(m.yz, 0.0);
}

class NavCoordTest : public ::testing::Test {
 protected:
  void SetUp() override { testing::BuildStreamJob(job); }
  JobModel job;
  TLock lock{"solution"};
};

TEST_F(NavCoordTest, TwoOccupationsAverageWithTheirWeights) {
  EXPECT_TRUE(SetNavCoord(*job.FindOccup(1), At(0, 0, 0), lock));
  const TPointItem& point = *job.FindPoint(1);
  EXPECT_TRUE(point.nav_mean_set);
  EXPECT_NEAR(point.nav_mean.sx, 1.0f, 1e-6);

  EXPECT_TRUE(SetNavCoord(*job.FindOccup(2), At(1, 0, 0), lock));
  EXPECT_NEAR(point.nav_mean.x, 0.5, 1e-9);
  EXPECT_NEAR(point.nav_mean.y, 0.0, 1e-12);
  EXPECT_NEAR(point.nav_mean.z, 0.0, 1e-12);
  EXPECT_NEAR(point.nav_mean.sx, 0.70710677f, 1e-6);
  EXPECT_NEAR(point.nav_mean.sy, 0.70710677f, 1e-6);
  EXPECT_NEAR(point.nav_mean.sz, 0.70710677f, 1e-6);
  EXPECT_EQ(point.nav_mean.rxy, 0.0f);
  EXPECT_EQ(lock.owner(), 0u);
}

TEST_F(NavCoordTest, ALessAccurateOccupationWeighsLess) {
  SetNavCoord(*job.FindOccup(1), At(0, 0, 0, 1.0f), lock);
  SetNavCoord(*job.FindOccup(2), At(3, 0, 0, 2.0f), lock);  // weight 1/4
  EXPECT_NEAR(job.FindPoint(1)->nav_mean.x, 0.6, 1e-6);
}

TEST_F(NavCoordTest, SingularCoordinatesAreLeftOutOfTheMean) {
  SetNavCoord(*job.FindOccup(1), At(2, 0, 0), lock);
  SetNavCoord(*job.FindOccup(2), At(100, 0, 0, 0.0f), lock);  // zero sigma: cannot invert
  EXPECT_NEAR(job.FindPoint(1)->nav_mean.x, 2.0, 1e-9);
  EXPECT_TRUE(GetNavCoord(*job.FindOccup(2), lock).has_value());
}

TEST_F(NavCoordTest, OnlySingularCoordinatesLeaveThePointUnchanged) {
  SetNavCoord(*job.FindOccup(3), At(5, 5, 5, 0.0f), lock);
  EXPECT_FALSE(job.FindPoint(2)->nav_mean_set);
}

TEST_F(NavCoordTest, OccupationWithoutPointStoresButReportsFalse) {
  auto* o = job.occupations.Append(new TOccupItem(7));
  EXPECT_FALSE(GetNavCoord(*o, lock).has_value());
  EXPECT_FALSE(SetNavCoord(*o, At(1, 2, 3), lock));
  const auto stored = GetNavCoord(*o, lock);
  ASSERT_TRUE(stored.has_value());
  EXPECT_EQ(stored->y, 2.0);
}

}  // namespace
}  // namespace vox
