// The twiddle tables: built under a lock the first time a level is asked for, then read
// without locking. They are never freed, so a reader never holds a stale address.
#include "analysis/vector/fftTwiddles.h"

#include <atomic>
#include <cmath>
#include <cstddef>
#include <mutex>
#include <new>
#include <numbers>

static std::atomic<const double*> twiddleLevels[31];
static std::mutex twiddleBuildLock;

static const double* buildTwiddles(int level) {
    size_t h = size_t(1) << level;
    double* table = new (std::align_val_t(64)) double[2 * h];
    for (size_t j = 0; j < h; j++) {
        double angle = std::numbers::pi * double(j) / double(h);
        table[j] = std::cos(angle);
        table[h + j] = std::sin(angle);
    }
    // Exact values where the angle is a multiple of pi/4, so symmetric inputs stay symmetric.
    if (h >= 2) {
        table[h / 2] = 0;
        table[h + h / 2] = 1;
    }
    if (h >= 4) {
        table[h / 4] = table[h + h / 4] = std::numbers::sqrt2 / 2;
        table[3 * h / 4] = -std::numbers::sqrt2 / 2;
        table[h + 3 * h / 4] = std::numbers::sqrt2 / 2;
    }
    return table;
}

const double* fftTwiddles(int level) {
    const double* table = twiddleLevels[level].load(std::memory_order_acquire);
    if (table) return table;
    std::lock_guard<std::mutex> guard(twiddleBuildLock);
    table = twiddleLevels[level].load(std::memory_order_relaxed);
    if (!table) {
        table = buildTwiddles(level);
        twiddleLevels[level].store(table, std::memory_order_release);
    }
    return table;
}
