// The process's quit flag, shared by start-up, the settings loads and the main loop.
#include "shell/quitFlag.h"

volatile uint32_t quitFlag = 0;
