// The transforms: hand-known spectra (a constant, a complex exponential, a sine, DC and
// Nyquist of the real transform), round trips, and agreement with a plain DFT.
#include "analysis/vector/fft.h"

#include <gtest/gtest.h>

#include <cmath>
#include <algorithm>
#include <complex>
#include <cstring>
#include <numbers>
#include <random>
#include <vector>

#include "analysis/vector/vectorTable.h"
#include "platform/ui.h"

using LongComplex = std::complex<long double>;

// The definition: Y[k] = sum_j x[j] exp(sign * 2 pi i j k / n), in long double.
static std::vector<LongComplex> plainDft(const std::vector<LongComplex>& x, int sign) {
    size_t n = x.size();
    std::vector<LongComplex> y(n);
    for (size_t k = 0; k < n; k++) {
        LongComplex sum = 0;
        for (size_t j = 0; j < n; j++) {
            long double angle = sign * 2 * std::numbers::pi_v<long double> * ((j * k) % n) / n;
            sum += x[j] * LongComplex(std::cos(angle), std::sin(angle));
        }
        y[k] = sum;
    }
    return y;
}

template <class C>
static std::vector<C> randomComplex(unsigned n, unsigned seed) {
    std::mt19937 generator(seed);
    std::uniform_real_distribution<double> value(-1, 1);
    std::vector<C> x(n);
    for (C& v : x) {
        v.Re = decltype(v.Re)(value(generator));
        v.Im = decltype(v.Im)(value(generator));
    }
    return x;
}

static std::vector<float> randomReal(unsigned n, unsigned seed) {
    std::mt19937 generator(seed);
    std::uniform_real_distribution<float> value(-1, 1);
    std::vector<float> x(n);
    for (float& v : x) v = value(generator);
    return x;
}

static const unsigned ROUND_TRIP_SIZES[] = {1, 2, 4, 8, 16, 32, 256, 1024, 4096, 65536};

// n values with GUARDS guard values on each side: a transform that writes outside its n values
// changes them.
constexpr size_t GUARDS = 4;
template <class T>
struct Guarded {
    Guarded(size_t n, T guard) : values(n + 2 * GUARDS, guard), guard(guard) {}
    Guarded(const std::vector<T>& inner, T guard) : Guarded(inner.size(), guard) {
        std::copy(inner.begin(), inner.end(), data());
    }
    T* data() { return values.data() + GUARDS; }
    T& operator[](size_t i) { return values[GUARDS + i]; }
    bool guardsIntact() const {
        for (size_t i = 0; i < GUARDS; i++)
            if (std::memcmp(&values[i], &guard, sizeof(T)) || std::memcmp(&values[values.size() - 1 - i], &guard, sizeof(T)))
                return false;
        return true;
    }
    std::vector<T> values;
    T guard;
};
const dComplex D_GUARD{-7.25, 7.5};
const fComplex F_GUARD{-7.25f, 7.5f};
const float GUARD = 12345.0f;

class ComplexTransform : public ::testing::Test {
protected:
    void SetUp() override { clearUiCalls(); }
    void TearDown() override {
        EXPECT_EQ(vectorTable.count, 0) << "the working vector was not freed";
        EXPECT_EQ(messageCount(), 0);
    }
};

TEST_F(ComplexTransform, ConstantGoesEntirelyToBinZero) {
    for (unsigned n : {1u, 2u, 4u, 8u, 64u, 1024u}) {
        std::vector<dComplex> x(n, dComplex{0.75, -0.5});
        VCD_FFT(x.data(), x.data(), n, 1);
        EXPECT_DOUBLE_EQ(x[0].Re, 0.75 * n) << "n " << n;
        EXPECT_DOUBLE_EQ(x[0].Im, -0.5 * n) << "n " << n;
        for (unsigned k = 1; k < n; k++) {
            ASSERT_NEAR(x[k].Re, 0, 1e-12 * n) << "n " << n << " k " << k;
            ASSERT_NEAR(x[k].Im, 0, 1e-12 * n) << "n " << n << " k " << k;
        }
    }
}

TEST_F(ComplexTransform, ForwardUsesThePlusSignSoExpMinusLandsInItsOwnBin) {
    // x[j] = exp(-2 pi i 3 j / n): forward with exp(+2 pi i j k / n) gives n at k = 3 only.
    const unsigned n = 64;
    std::vector<dComplex> x(n);
    for (unsigned j = 0; j < n; j++) {
        double angle = -2 * std::numbers::pi * 3 * j / n;
        x[j] = {std::cos(angle), std::sin(angle)};
    }
    std::vector<dComplex> y(n);
    VCD_FFT(y.data(), x.data(), n, 1);
    for (unsigned k = 0; k < n; k++) {
        EXPECT_NEAR(y[k].Re, k == 3 ? n : 0.0, 1e-12) << "k " << k;
        EXPECT_NEAR(y[k].Im, 0.0, 1e-12) << "k " << k;
    }
    // The inverse of a single bin is the exponential with the minus sign, scaled by 1/n.
    std::vector<fComplex> bin(n, fComplex{0, 0});
    bin[5] = {1, 0};
    VCF_FFT(bin.data(), bin.data(), n, -1);
    for (unsigned j = 0; j < n; j++) {
        double angle = -2 * std::numbers::pi * 5 * j / n;
        EXPECT_NEAR(bin[j].Re, std::cos(angle) / n, 1e-8) << "j " << j;
        EXPECT_NEAR(bin[j].Im, std::sin(angle) / n, 1e-8) << "j " << j;
    }
}

TEST_F(ComplexTransform, DoubleMatchesThePlainDft) {
    for (unsigned n : {2u, 4u, 8u, 16u, 128u, 512u}) {
        std::vector<dComplex> x = randomComplex<dComplex>(n, n);
        std::vector<LongComplex> model(n);
        for (unsigned j = 0; j < n; j++) model[j] = LongComplex(x[j].Re, x[j].Im);
        std::vector<LongComplex> forward = plainDft(model, +1), inverse = plainDft(model, -1);
        Guarded<dComplex> y(n, D_GUARD), z(n, D_GUARD);
        VCD_FFT(y.data(), x.data(), n, 1);
        VCD_FFT(z.data(), x.data(), n, -1);
        EXPECT_TRUE(y.guardsIntact() && z.guardsIntact()) << "n " << n;
        for (unsigned k = 0; k < n; k++) {
            ASSERT_NEAR(y[k].Re, double(forward[k].real()), 1e-13 * n) << "n " << n << " k " << k;
            ASSERT_NEAR(y[k].Im, double(forward[k].imag()), 1e-13 * n) << "n " << n << " k " << k;
            ASSERT_NEAR(z[k].Re, double(inverse[k].real() / n), 1e-15 * n) << "n " << n << " k " << k;
            ASSERT_NEAR(z[k].Im, double(inverse[k].imag() / n), 1e-15 * n) << "n " << n << " k " << k;
        }
    }
}

TEST_F(ComplexTransform, ForwardThenInverseReturnsTheInput) {
    for (unsigned n : ROUND_TRIP_SIZES) {
        std::vector<dComplex> x = randomComplex<dComplex>(n, 3);
        Guarded<dComplex> y(x, D_GUARD);
        VCD_FFT(y.data(), y.data(), n, 1);
        VCD_FFT(y.data(), y.data(), n, -1);
        EXPECT_TRUE(y.guardsIntact()) << "n " << n;
        for (unsigned j = 0; j < n; j++) {
            ASSERT_NEAR(y[j].Re, x[j].Re, 1e-14) << "n " << n << " j " << j;
            ASSERT_NEAR(y[j].Im, x[j].Im, 1e-14) << "n " << n << " j " << j;
        }
        std::vector<fComplex> xf = randomComplex<fComplex>(n, 4);
        Guarded<fComplex> spectrum(n, F_GUARD), back(n, F_GUARD);
        VCF_FFT(spectrum.data(), xf.data(), n, 1);
        VCF_FFT(back.data(), spectrum.data(), n, -1);
        EXPECT_TRUE(spectrum.guardsIntact() && back.guardsIntact()) << "n " << n;
        for (unsigned j = 0; j < n; j++) {
            ASSERT_NEAR(back[j].Re, xf[j].Re, 2e-6) << "n " << n << " j " << j;
            ASSERT_NEAR(back[j].Im, xf[j].Im, 2e-6) << "n " << n << " j " << j;
        }
    }
}

class RealTransform : public ComplexTransform {};

TEST_F(RealTransform, ElementZeroHoldsTheSumAndTheAlternatingSum) {
    std::vector<float> x{1, 2, 3, 4, 5, 6, 7, 9};
    std::vector<float> y(8);
    VF_FFT(y.data(), x.data(), 8, 1, nullptr);
    EXPECT_EQ(y[0], 37.0f);                       // 1+2+3+4+5+6+7+9
    EXPECT_EQ(y[1], -5.0f);                       // 1-2+3-4+5-6+7-9
    std::vector<float> pair{3, 5};
    VF_FFT(pair.data(), pair.data(), 2, 1, nullptr);
    EXPECT_EQ(pair, (std::vector<float>{8, -2}));
}

TEST_F(RealTransform, SineOfPeriodNOverFiveIsPositiveImaginaryInBinFive) {
    // sin = (e^{+ia} - e^{-ia}) / 2i: with the plus-sign forward transform bin 5 is +i n/2.
    const unsigned n = 128;
    std::vector<float> x(n);
    for (unsigned j = 0; j < n; j++) x[j] = float(std::sin(2 * std::numbers::pi * 5 * j / n));
    std::vector<float> y(n);
    std::vector<fComplex> scratch(n / 2);
    VF_FFT(y.data(), x.data(), n, 1, scratch.data());
    for (unsigned k = 0; k < n / 2; k++) {
        EXPECT_NEAR(y[2 * k], 0.0, 1e-4) << "k " << k;
        EXPECT_NEAR(y[2 * k + 1], k == 5 ? n / 2.0 : 0.0, 1e-4) << "k " << k;
    }
}

TEST_F(RealTransform, MatchesThePlainDftOfTheRealInput) {
    for (unsigned n : {2u, 4u, 8u, 16u, 32u, 64u, 1024u}) {
        std::vector<float> x = randomReal(n, n);
        std::vector<LongComplex> model(x.begin(), x.end());
        std::vector<LongComplex> forward = plainDft(model, +1);
        Guarded<float> y(n, GUARD);
        VF_FFT(y.data(), x.data(), n, 1, nullptr);
        EXPECT_TRUE(y.guardsIntact()) << "n " << n;
        double tolerance = 2e-6 * std::sqrt(double(n));
        ASSERT_NEAR(y[0], double(forward[0].real()), tolerance) << "n " << n;
        ASSERT_NEAR(y[1], double(forward[n / 2].real()), tolerance) << "n " << n;
        for (unsigned k = 1; k < n / 2; k++) {
            ASSERT_NEAR(y[2 * k], double(forward[k].real()), tolerance) << "n " << n << " k " << k;
            ASSERT_NEAR(y[2 * k + 1], double(forward[k].imag()), tolerance) << "n " << n << " k " << k;
        }
    }
}

TEST_F(RealTransform, InverseOfThePackedSpectrumReturnsTheSamples) {
    for (unsigned n : ROUND_TRIP_SIZES) {
        if (n < 2) continue;
        std::vector<float> x = randomReal(n, 9);
        Guarded<float> y(x, GUARD);
        Guarded<fComplex> scratch(n / 2, F_GUARD);
        VF_FFT(y.data(), y.data(), n, 1, scratch.data());
        VF_FFT(y.data(), y.data(), n, -1, scratch.data());
        EXPECT_TRUE(y.guardsIntact() && scratch.guardsIntact()) << "n " << n;
        for (unsigned j = 0; j < n; j++) ASSERT_NEAR(y[j], x[j], 1e-6) << "n " << n << " j " << j;
    }
}
