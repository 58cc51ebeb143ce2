#pragma once
// The process's quit flag: set by a start-up step that fails fatally (settings that cannot
// be opened, memory that cannot be had) and by the quit message. The main loop runs only
// while it is 0; start-up skips the loop when it is set and goes straight to shut-down.

#include <cstdint>

extern volatile uint32_t quitFlag;   // 0 while the program runs; set by the steps above
