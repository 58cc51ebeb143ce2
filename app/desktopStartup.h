#pragma once
// The desktop program's steps of start-up and shut-down (Qt's start and end, the main frame,
// the splash window, the menus' first update) and its whole run from the command line:
// melodrift [--shared DIR] [--config DIR] [FILE...].

#include "shell/startup.h"

// The hooks start-up calls. Qt's start creates the application object unless one exists.
StartupHooks desktopStartupHooks(int* argc, char** argv);

// Parses the command line, starts up, opens the named files as the Open command would, runs
// the loop and shuts down; returns the exit code.
int runDesktopProgram(int argc, char** argv);
