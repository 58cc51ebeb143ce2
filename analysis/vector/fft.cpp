// The transforms: radix-2 decimation in time on split real and imaginary arrays of doubles
// in the working vector. The input is read in bit-reversed order straight into the first
// two butterfly stages; the later stages go two at a time over the data, several
// butterflies per vector operation, with twiddles from fftTwiddles; the result is written
// back in the caller's element type. Only the forward kernel exists: the inverse conjugates
// on the way in and out.
#include "analysis/vector/fft.h"

#include <bit>

#include "analysis/vector/fftTwiddles.h"
#include "analysis/vector/vectorErrors.h"
#include "analysis/vector/vectorTable.h"

static const char* const SIZE_NOT_POWER_OF_2 = "(8) %s: Size must be an integer power of 2.\n";

struct Point {
    double re;
    double im;
};

// Two or four doubles; the compiler maps the arithmetic onto the vector registers there are.
// Loads and stores go through the unaligned, aliasing variants.
typedef double Vec2 __attribute__((vector_size(16)));
typedef double Vec4 __attribute__((vector_size(32)));

template <class V>
struct Unaligned;
template <>
struct Unaligned<Vec2> {
    typedef double Type __attribute__((vector_size(16), aligned(8), may_alias));
};
template <>
struct Unaligned<Vec4> {
    typedef double Type __attribute__((vector_size(32), aligned(8), may_alias));
};

#define loadV(V, p) (*reinterpret_cast<const typename Unaligned<V>::Type*>(p))
#define storeV(V, p, v) (*reinterpret_cast<typename Unaligned<V>::Type*>(p) = (v))
#define load4(p) loadV(Vec4, p)

// Spans 2 and 4 of the forward transform in one pass while reading the input in
// bit-reversed order: the four inputs of a span-4 group lie a quarter of the transform
// apart, and the span-4 twiddle is +i. n >= 4.
template <class Load>
static void firstStages(double* re, double* im, unsigned n, Load load) {
    unsigned quarter = n / 4;
    unsigned r = 0;   // q reversed over log2(quarter) bits
    for (unsigned q = 0; q < quarter; q++) {
        Point a0 = load(r), a1 = load(r + 2 * quarter), a2 = load(r + quarter), a3 = load(r + 3 * quarter);
        double b0r = a0.re + a1.re, b0i = a0.im + a1.im;
        double b1r = a0.re - a1.re, b1i = a0.im - a1.im;
        double b2r = a2.re + a3.re, b2i = a2.im + a3.im;
        double b3r = a2.re - a3.re, b3i = a2.im - a3.im;
        unsigned i = 4 * q;
        re[i] = b0r + b2r;
        im[i] = b0i + b2i;
        re[i + 1] = b1r - b3i;
        im[i + 1] = b1i + b3r;
        re[i + 2] = b0r - b2r;
        im[i + 2] = b0i - b2i;
        re[i + 3] = b1r + b3i;
        im[i + 3] = b1i - b3r;
        unsigned bit = quarter >> 1;
        while (bit && (r & bit)) {
            r ^= bit;
            bit >>= 1;
        }
        r |= bit;
    }
}

// Spans 8 .. n of the forward transform on data already through firstStages. Each
// butterfly forms t = w*b, b = a - t, a = a + t; two spans go in one pass over the data,
// so that each point is loaded and stored half as often.
template <class V>
[[gnu::always_inline]] static inline void laterStagesBody(double* re, double* im, unsigned n) {
    unsigned h = 4;   // half-span of the first of the two spans
    int level = 2;
    for (; 4 * h <= n; h *= 4, level += 2) {
        const double* w1c = fftTwiddles(level);
        const double* w1s = w1c + h;
        const double* w2c = fftTwiddles(level + 1);
        const double* w2s = w2c + 2 * h;
        for (unsigned k = 0; k < n; k += 4 * h) {
            for (unsigned j = k; j < k + h; j += sizeof(V) / sizeof(double)) {
                V c1 = loadV(V, w1c + j - k), s1 = loadV(V, w1s + j - k);
                V c2 = loadV(V, w2c + j - k), s2 = loadV(V, w2s + j - k);
                V ar = loadV(V, re + j), ai = loadV(V, im + j);
                V br = loadV(V, re + j + h), bi = loadV(V, im + j + h);
                V cr = loadV(V, re + j + 2 * h), ci = loadV(V, im + j + 2 * h);
                V dr = loadV(V, re + j + 3 * h), di = loadV(V, im + j + 3 * h);
                // span 2h: (a, b) and (c, d) with w1
                V tr = c1 * br - s1 * bi, ti = c1 * bi + s1 * br;
                V ur = c1 * dr - s1 * di, ui = c1 * di + s1 * dr;
                br = ar - tr;
                bi = ai - ti;
                ar = ar + tr;
                ai = ai + ti;
                dr = cr - ur;
                di = ci - ui;
                cr = cr + ur;
                ci = ci + ui;
                // span 4h: (a, c) with w2 and (b, d) with w2 * i
                tr = c2 * cr - s2 * ci;
                ti = c2 * ci + s2 * cr;
                ur = -(c2 * di + s2 * dr);
                ui = c2 * dr - s2 * di;
                storeV(V, re + j, ar + tr);
                storeV(V, im + j, ai + ti);
                storeV(V, re + j + 2 * h, ar - tr);
                storeV(V, im + j + 2 * h, ai - ti);
                storeV(V, re + j + h, br + ur);
                storeV(V, im + j + h, bi + ui);
                storeV(V, re + j + 3 * h, br - ur);
                storeV(V, im + j + 3 * h, bi - ui);
            }
        }
    }
    if (h < n) {   // one span left over
        const double* wc = fftTwiddles(level);
        const double* ws = wc + h;
        for (unsigned j = 0; j < h; j += sizeof(V) / sizeof(double)) {
            V c = loadV(V, wc + j), s = loadV(V, ws + j);
            V xr = loadV(V, re + j + h), xi = loadV(V, im + j + h);
            V tr = c * xr - s * xi, ti = c * xi + s * xr;
            V ur = loadV(V, re + j), ui = loadV(V, im + j);
            storeV(V, re + j, ur + tr);
            storeV(V, im + j, ui + ti);
            storeV(V, re + j + h, ur - tr);
            storeV(V, im + j + h, ui - ti);
        }
    }
}

#if defined(__x86_64__) && defined(__GNUC__)
// The vector loops again for processors with AVX2, chosen at run time. Without fused
// multiply-add both give the same results to the bit.
#define AVX2_CLONE 1
__attribute__((target("avx2"))) static void laterStagesAvx2(double* re, double* im, unsigned n) {
    laterStagesBody<Vec4>(re, im, n);
}

static bool hasAvx2() {
    static const bool avx2 = __builtin_cpu_supports("avx2");
    return avx2;
}
#endif

static void laterStages(double* re, double* im, unsigned n) {
#ifdef AVX2_CLONE
    if (hasAvx2()) return laterStagesAvx2(re, im, n);
#endif
    laterStagesBody<Vec2>(re, im, n);
}

// The forward transform of the n points given by load(m) into re and im, natural order.
// The inverse is the forward transform of the conjugated input, conjugated again: the
// callers conjugate on reading and writing, which is exact.
template <class Load>
static void transformSplit(double* re, double* im, unsigned n, Load load) {
    if (n == 1) {
        Point a = load(0);
        re[0] = a.re;
        im[0] = a.im;
        return;
    }
    if (n == 2) {
        Point a = load(0), b = load(1);
        re[0] = a.re + b.re;
        im[0] = a.im + b.im;
        re[1] = a.re - b.re;
        im[1] = a.im - b.im;
        return;
    }
    firstStages(re, im, n, load);
    laterStages(re, im, n);
}

static bool isInverse(int dir) {
    return dir < 0 && dir % 2 != 0;
}

template <class C>
static void complexFFT(C* Y, const C* X, unsigned n, int dir, const char* bigName, const char* smallName) {
    if (!std::has_single_bit(n)) fatalVectorError(SIZE_NOT_POWER_OF_2, n >= 8 ? bigName : smallName);
    bool inverse = isInverse(dir);
    double scale = inverse ? 1.0 / n : 1.0;
    dComplex* work = VCD_vector(n);   // n real parts, then n imaginary parts
    double* re = &work[0].Re;
    double* im = re + n;
    double imScale = inverse ? -scale : scale;
    transformSplit(re, im, n, [&](unsigned m) { return Point{X[m].Re * scale, X[m].Im * imScale}; });
    using Element = decltype(Y[0].Re);
    double imSign = inverse ? -1.0 : 1.0;
    for (unsigned i = 0; i < n; i++) {
        Y[i].Re = Element(re[i]);
        Y[i].Im = Element(im[i] * imSign);
    }
    V_free(work);
}

void VCF_FFT(fComplex* Y, const fComplex* X, unsigned n, int dir) {
    complexFFT(Y, X, n, dir, "VCFb_FFT", "VCFs_FFT");
}

void VCD_FFT(dComplex* Y, const dComplex* X, unsigned n, int dir) {
    complexFFT(Y, X, n, dir, "VCDb_FFT", "VCDs_FFT");
}

typedef float Vec4Float __attribute__((vector_size(16)));
typedef float Vec8Float __attribute__((vector_size(32)));
typedef float Vec8FloatUnaligned __attribute__((vector_size(32), aligned(4), may_alias));

// Separates the spectra of the even and the odd samples of a real transform from Z, the
// transform of z[m] = x[2m] + i*x[2m+1], N = half points in re and im: with
// h1 = (Z[k] + conj Z[N-k]) / 2 and h2 = -i (Z[k] - conj Z[N-k]) / 2, X[k] = h1 + w*h2 and
// X[N-k] = conj(h1 - w*h2), w = exp(i*pi*k/N), written as pairs into Y for k = first .. N/2.
static void untangleForwardPlain(float* Y, const double* re, const double* im, const double* wc, unsigned half,
                                 unsigned first) {
    const double* ws = wc + half;
    for (unsigned k = first; k <= half / 2; k++) {
        unsigned mirror = half - k;
        double h1r = 0.5 * (re[k] + re[mirror]), h1i = 0.5 * (im[k] - im[mirror]);
        double h2r = 0.5 * (im[k] + im[mirror]), h2i = -0.5 * (re[k] - re[mirror]);
        double tr = wc[k] * h2r - ws[k] * h2i, ti = wc[k] * h2i + ws[k] * h2r;
        Y[2 * k] = float(h1r + tr);
        Y[2 * k + 1] = float(h1i + ti);
        Y[2 * mirror] = float(h1r - tr);
        Y[2 * mirror + 1] = float(ti - h1i);
    }
}

#ifdef AVX2_CLONE
typedef float Vec4Float __attribute__((vector_size(16)));
typedef float Vec8FloatUnaligned __attribute__((vector_size(32), aligned(4), may_alias));

// The same, four k at a time from the front meeting four N-k at a time from the back; the
// shuffles this needs are only cheap with AVX2. Returns the first k left for the plain loop.
__attribute__((target("avx2"))) static unsigned untangleForwardAvx2(float* Y, const double* re, const double* im,
                                                                    const double* wc, unsigned half) {
    const double* ws = wc + half;
    unsigned k = 1;
    for (; half >= 8 && k + 3 <= half / 2; k += 4) {
        unsigned mirror = half - k - 3;   // lowest of the four mirrored points
        Vec4 zr = load4(re + k), zi = load4(im + k);
        Vec4 mr = load4(re + mirror), mi = load4(im + mirror);
        mr = __builtin_shufflevector(mr, mr, 3, 2, 1, 0);
        mi = __builtin_shufflevector(mi, mi, 3, 2, 1, 0);
        Vec4 c = load4(wc + k), sn = load4(ws + k);
        Vec4 h1r = 0.5 * (zr + mr), h1i = 0.5 * (zi - mi);
        Vec4 h2r = 0.5 * (zi + mi), h2i = -0.5 * (zr - mr);
        Vec4 tr = c * h2r - sn * h2i, ti = c * h2i + sn * h2r;
        Vec4Float fr = __builtin_convertvector(h1r + tr, Vec4Float);
        Vec4Float fi = __builtin_convertvector(h1i + ti, Vec4Float);
        *reinterpret_cast<Vec8FloatUnaligned*>(Y + 2 * k) = __builtin_shufflevector(fr, fi, 0, 4, 1, 5, 2, 6, 3, 7);
        Vec4Float gr = __builtin_convertvector(h1r - tr, Vec4Float);
        Vec4Float gi = __builtin_convertvector(ti - h1i, Vec4Float);
        *reinterpret_cast<Vec8FloatUnaligned*>(Y + 2 * mirror) = __builtin_shufflevector(gr, gi, 3, 7, 2, 6, 1, 5, 0, 4);
    }
    return k;
}
#endif

static void untangleForward(float* Y, const double* re, const double* im, const double* wc, unsigned half) {
    unsigned first = 1;
#ifdef AVX2_CLONE
    if (hasAvx2()) first = untangleForwardAvx2(Y, re, im, wc, half);
#endif
    untangleForwardPlain(Y, re, im, wc, half, first);
}

// The n reals are transformed as n/2 complex values z[m] = x[2m] + i*x[2m+1]; the spectra of
// the even and odd samples are then untangled with w = exp(i*pi*k/(n/2)).
void VF_FFT(float* Y, const float* X, unsigned n, int dir, fComplex*) {
    unsigned half = n / 2;
    if (n % 2 != 0 || !std::has_single_bit(half)) fatalVectorError(SIZE_NOT_POWER_OF_2, "VFb_FFT");
    dComplex* work = VCD_vector(half);
    double* re = &work[0].Re;
    double* im = re + half;
    const double* wc = fftTwiddles(std::countr_zero(half));
    if (dir >= 0) {
        transformSplit(re, im, half, [&](unsigned m) { return Point{X[2 * m], X[2 * m + 1]}; });
        double dc = re[0] + im[0], nyquist = re[0] - im[0];
        untangleForward(Y, re, im, wc, half);
        Y[0] = float(dc);
        Y[1] = float(nyquist);
    } else {
        bool inverse = isInverse(dir);
        double scale = inverse ? 1.0 / half : 1.0;
        double imScale = inverse ? -scale : scale;
        // The forward untangling run backwards, one point at a time as the bit-reversed
        // reading asks for it: Z[m] = h1 + conj(w^m)*h2 with h1 = (X[m] + conj X[N-m]) / 2
        // and h2 = i (X[m] - conj X[N-m]) / 2.
        auto load = [&](unsigned m) {
            if (m == 0) return Point{0.5 * (X[0] + X[1]) * scale, 0.5 * (X[0] - X[1]) * imScale};
            unsigned mirror = half - m;
            double ar = X[2 * m], ai = X[2 * m + 1], br = X[2 * mirror], bi = X[2 * mirror + 1];
            double h1r = 0.5 * (ar + br), h1i = 0.5 * (ai - bi);
            double h2r = -0.5 * (ai + bi), h2i = 0.5 * (ar - br);
            double c = wc[m], s = -wc[half + m];
            return Point{(h1r + c * h2r - s * h2i) * scale, (h1i + c * h2i + s * h2r) * imScale};
        };
        transformSplit(re, im, half, load);
        double imSign = inverse ? -1.0 : 1.0;
        for (unsigned j = 0; j < half; j++) {
            Y[2 * j] = float(re[j]);
            Y[2 * j + 1] = float(im[j] * imSign);
        }
    }
    V_free(work);
}
