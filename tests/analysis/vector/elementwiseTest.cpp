// Element-wise arithmetic: square roots with their domain report, magnitudes that must not
// overflow, and sums of squares that must not lose small terms.
#include "analysis/vector/elementwise.h"

#include <gtest/gtest.h>

#include <bit>
#include <cfloat>
#include <cmath>
#include <cstdint>
#include <vector>
#include <tuple>

#include "analysis/vector/vectorErrors.h"
#include "platform/ui.h"

class MathErrors : public ::testing::Test {
protected:
    void SetUp() override {
        resetVectorErrors();
        clearUiCalls();
    }
};

TEST_F(MathErrors, SquareRootOfTwoNegativesReportsOnceAndGivesNaN) {
    std::vector<float> x{4, -1, 9, -16, -0.0f};
    std::vector<float> y(5);
    EXPECT_EQ(VF_sqrt(y.data(), x.data(), 5), 1);
    EXPECT_EQ(std::pair(messageCount(), lastMessageText()), std::pair(1, std::string("VF_sqrt: DOMAIN error\n")));
    EXPECT_EQ(std::tuple(std::bit_cast<uint32_t>(y[1]), std::bit_cast<uint32_t>(y[3]), y[0], y[2]), std::tuple(0xFFC00000u, 0xFFC00000u, 2.0f, 3.0f));
    EXPECT_TRUE(y[4] == 0 && std::signbit(y[4]));
    EXPECT_EQ(VF_sqrt(y.data(), x.data(), 1), 0);
}

TEST_F(MathErrors, TheSameErrorIsNotShownAgainAndTheTwoFamiliesAreRememberedApart) {
    float x = -2, y = 0;
    VF_sqrt(&y, &x, 1);
    VF_sqrt(&y, &x, 1);
    EXPECT_EQ(messageCount(), 1);
    EXPECT_EQ(cd_abs(dComplex{DBL_MAX, -DBL_MAX}), DBL_MAX);
    EXPECT_EQ(lastMessageText(), "cd_abs: OVERFLOW error\n");
    VF_sqrt(&y, &x, 1);
    cd_abs(dComplex{DBL_MAX, DBL_MAX});
    EXPECT_EQ(messageCount(), 2);
    resetVectorErrors();
    VF_sqrt(&y, &x, 1);
    EXPECT_EQ(messageCount(), 3);
}

TEST_F(MathErrors, MagnitudesOfHugeAndTinyComponentsNeedNoReport) {
    EXPECT_DOUBLE_EQ(cd_abs(dComplex{3, -4}), 5.0);
    EXPECT_DOUBLE_EQ(cd_abs(dComplex{3e200, 4e200}), 5e200);
    EXPECT_DOUBLE_EQ(cd_abs(dComplex{3e-200, 4e-200}), 5e-200);
    std::vector<fComplex> x{{3, 4}, {-3e20f, 4e20f}};
    std::vector<float> y(2);
    VF_CtoAbs(y.data(), x.data(), 2);
    EXPECT_EQ(y[0], 5.0f);
    EXPECT_FLOAT_EQ(y[1], 5e20f);
    EXPECT_EQ(messageCount(), 0);
}

TEST(VectorArithmetic, SumOfSquaresKeepsTermsAFloatSumWouldDrop) {
    // 4096^2 = 2^24: added one at a time in float, each further 1 would vanish.
    std::vector<float> x{4096, 1, 1, 1, 1};
    EXPECT_EQ(VF_ssq(x.data(), 5), 16777220.0f);
}
