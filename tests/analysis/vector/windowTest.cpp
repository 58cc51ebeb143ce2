// Hann windows: the known short windows and exact symmetry of long ones.
#include "analysis/vector/window.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <vector>

using ::testing::DoubleNear;
using ::testing::FloatNear;
using ::testing::Pointwise;

TEST(HannWindow, LengthsFiveAndFourHaveTheirKnownValues) {
    std::vector<float> w5(5), w4(4);
    VF_Hann(w5.data(), 5);
    VF_Hann(w4.data(), 4);
    EXPECT_THAT(w5, Pointwise(FloatNear(1e-7f), std::vector<float>{0, 0.5f, 1, 0.5f, 0}));
    EXPECT_THAT(w4, Pointwise(FloatNear(1e-7f), std::vector<float>{0, 0.75f, 0.75f, 0}));
    std::vector<double> d5(6, -7.0);   // one sentinel past the end
    VD_Hann(d5.data(), 5);
    EXPECT_THAT(d5, Pointwise(DoubleNear(1e-15), std::vector<double>{0, 0.5, 1, 0.5, 0, -7.0}));
}

TEST(HannWindow, LongWindowsAreExactlySymmetricAndRiseToTheMiddle) {
    for (unsigned n : {512u, 513u}) {
        std::vector<float> w(n);
        VF_Hann(w.data(), n);
        EXPECT_EQ(w[0], 0.0f);
        for (unsigned i = 0; i < n / 2; i++) ASSERT_EQ(w[i], w[n - 1 - i]) << "n " << n << " i " << i;
        for (unsigned i = 1; i <= (n - 1) / 2; i++) ASSERT_GT(w[i], w[i - 1]) << "n " << n << " i " << i;
    }
}
