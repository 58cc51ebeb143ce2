// The error box of the vector library: its caption from the program's name, and the
// fatal reports that end the process.
#include "analysis/vector/vectorErrors.h"

#include <gtest/gtest.h>

#include "analysis/vector/fft.h"
#include "analysis/vector/spectrum.h"
#include "platform/ui.h"

TEST(VectorErrorCaption, IsTheFileNameAfterTheLastSlashWithoutTrailingSpaceAndQuote) {
    clearUiCalls();
    setVectorErrorCaption("/usr/local/bin/melodrift");
    showVectorError("(12) V_free: Cannot free non-existent vector.\n");
    EXPECT_EQ(uiCalls().back().title, "melodrift");
    EXPECT_EQ(uiCalls().back().kind, MESSAGE_ERROR);
    setVectorErrorCaption("\"/opt/torvellan/melodrift-cli\" ");
    EXPECT_EQ(vectorErrorCaption(), "melodrift-cli");
    setVectorErrorCaption("/bin/abcdefghijklmnopqrstuvwxyz0123456789");
    EXPECT_EQ(vectorErrorCaption(), "abcdefghijklmnopqrstuvwxyz012345");
    setVectorErrorCaption("/usr/bin/");
    EXPECT_EQ(vectorErrorCaption(), "Error");
    setVectorErrorCaption("");
    EXPECT_EQ(vectorErrorCaption(), "Error");
}

// The fatal reports end the process, so each runs in a child process.
class VectorFatalErrorDeathTest : public ::testing::Test {
protected:
    void SetUp() override { GTEST_FLAG_SET(death_test_style, "threadsafe"); }
};

TEST_F(VectorFatalErrorDeathTest, ComplexTransformOfTwelvePointsEndsTheProcess) {
    fComplex x[12] = {};
    EXPECT_EXIT(VCF_FFT(x, x, 12, 1), ::testing::ExitedWithCode(1),
                "^\\(8\\) VCFb_FFT: Size must be an integer power of 2\\.\n");
    EXPECT_EXIT(VCF_FFT(x, x, 6, -1), ::testing::ExitedWithCode(1), "^\\(8\\) VCFs_FFT: ");
    dComplex d[3] = {};
    EXPECT_EXIT(VCD_FFT(d, d, 3, 1), ::testing::ExitedWithCode(1), "^\\(8\\) VCDs_FFT: ");
}

TEST_F(VectorFatalErrorDeathTest, TheBoxIsShownBeforeTheProcessEnds) {
    EXPECT_EXIT(
        {
            setUiEcho(true);
            setVectorErrorCaption("/opt/bin/melodrift");
            dComplex x[24] = {};
            VCD_FFT(x, x, 24, 1);
        },
        ::testing::ExitedWithCode(1), "melodrift .*\\(8\\) VCDb_FFT: Size must be");
}

TEST_F(VectorFatalErrorDeathTest, RealTransformNeedsHalfOfNAPowerOfTwo) {
    float x[12] = {};
    EXPECT_EXIT(VF_FFT(x, x, 12, 1, nullptr), ::testing::ExitedWithCode(1),
                "^\\(8\\) VFb_FFT: Size must be an integer power of 2\\.\n");
    EXPECT_EXIT(VF_FFT(x, x, 9, -1, nullptr), ::testing::ExitedWithCode(1), "^\\(8\\) VFb_FFT: ");
}

TEST_F(VectorFatalErrorDeathTest, SpectrumIntoItsOwnInputOrWindowEndsTheProcess) {
    float x[32] = {}, w[16] = {};
    EXPECT_EXIT(VFp_spectrum(x, 8, x, 32, w), ::testing::ExitedWithCode(1),
                "^\\(3\\) VFp_spectrum: Vectors/matrices must not be identical\\.\n");
    EXPECT_EXIT(VFp_spectrum(w, 8, x, 32, w), ::testing::ExitedWithCode(1), "^\\(3\\) VFp_spectrum: ");
}
