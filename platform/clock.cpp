// The millisecond clock since the process started, with a manual mode for tests.
#include "platform/clock.h"

#include <atomic>
#include <chrono>

static const auto processStart = std::chrono::steady_clock::now();
static std::atomic<bool> manualClock{false};        // tests stop the clock
static std::atomic<uint32_t> manualMilliseconds{0};  // the stopped clock's reading

uint32_t clockMilliseconds() {
    if (manualClock) return manualMilliseconds;
    auto elapsed = std::chrono::steady_clock::now() - processStart;
    return uint32_t(std::chrono::duration_cast<std::chrono::milliseconds>(elapsed).count());
}

uint32_t timeCounter() { return clockMilliseconds() / 10; }

void setManualClock(bool on) {
    if (on) manualMilliseconds = clockMilliseconds();
    manualClock = on;
}

void advanceManualClock(uint32_t milliseconds) { manualMilliseconds += milliseconds; }
