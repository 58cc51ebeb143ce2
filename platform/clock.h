#pragma once
// The process's millisecond clock and the time counter in hundredths of a second.
// Tests can stop the clock and move it by hand.

#include <cstdint>

uint32_t clockMilliseconds();   // milliseconds since the process started
uint32_t timeCounter();         // clockMilliseconds() / 10

// Manual clock for tests: while on, the clock stands still except when advanced.
void setManualClock(bool on);
void advanceManualClock(uint32_t milliseconds);
